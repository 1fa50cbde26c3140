// The comb-duct update (group PRJ_RES(RSX_GENERAL)) and the structure-material update
// (the road group shared by road and platform projects).
#pragma once

#include "schedule/schedule_store.hpp"

#include <string>
#include <vector>

namespace zodevi {

// One length and one coil-count article per comb-duct model; true when an article was
// created or removed.
bool UpdateCombDucts(CZodEVIBdr& bdr, const std::vector<std::string>& models);

// Volume, mass and reprofiling articles for each material of the volume list, one
// surface article per material of the surface list, one length article per material of
// the length list; true when an article was created or removed.
bool UpdateMaterials(CZodEVIBdr& bdr, const std::vector<std::string>& volumeMaterials,
                     const std::vector<std::string>& surfaceMaterials, const std::vector<std::string>& lengthMaterials);

} // namespace zodevi
