// The network update (one network's fixed articles, models, materials, depth classes,
// fittings, supplies and ducts, each with its purge) and the depth-class update that
// re-applies new trench depth bounds to every network of the schedule.
#pragma once

#include "schedule/schedule_store.hpp"
#include "zodevi/value_array.h"

#include <string>
#include <vector>

namespace zodevi {

// Brings the group PRJ_RES(<networkName>) up to date: the fixed articles when the group
// is new, then one article per name and depth class that has none yet, the obsolete
// ones removed while the purge flag is on. Lists: pipe and cable models, supplies along
// pipes, fitting models, supplies on fittings, duct models, excavation materials. True
// when an article was created or removed.
bool UpdateNetwork(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName,
                   const std::vector<std::string>& models, const std::vector<std::string>& pipeSupplies,
                   const std::vector<std::string>& fittings, const std::vector<std::string>& fittingSupplies,
                   const std::vector<std::string>& ducts, const std::vector<std::string>& materials,
                   const CZodEVIValueArray<double>& depthBounds);

// Applies the depth bounds to every network group that a network update has seen, in
// group order; nothing happens for an empty list. True when an article was created or
// removed.
bool UpdateDepthClasses(CZodEVIBdr& bdr, const CZodEVIValueArray<double>& depthBounds);

} // namespace zodevi
