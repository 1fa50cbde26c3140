// Earthwork updates of the road group: topsoil stripping and slope vegetation by
// thickness, and planing of existing pavements by thickness class.
#pragma once

#include "schedule/schedule_store.hpp"
#include "zodevi/value_array.h"

namespace zodevi {

// One volume and one surface article per stripping thickness (metres); true when an
// article was created or removed.
bool UpdateStripping(CZodEVIBdr& bdr, const CZodEVIValueArray<double>& thicknesses);

// The same for the vegetation of slopes.
bool UpdateVegetation(CZodEVIBdr& bdr, const CZodEVIValueArray<double>& thicknesses);

// One surface article per class between consecutive limits, the first class starting
// at 0, and one for thicknesses above the last limit; true when an article was created
// or removed.
bool UpdatePlaning(CZodEVIBdr& bdr, const CZodEVIValueArray<double>& classLimits);

} // namespace zodevi
