// Reading the project records of the drawing through the host's database, read only.
#include "ui/project_discovery.hpp"

#include <utility>

namespace zodevi {

CZodEVIProjectMap* CZodEVIProjectMaps::OfKind(int kind) const
{
    switch (kind) {
    case velproj::kKindNetwork:
        return networks;
    case velproj::kKindRoad:
        return roadProjects;
    case velproj::kKindKorvane:
        return korvaneProjects;
    case velproj::kKindPlatform:
        return platforms;
    default:
        return nullptr;
    }
}

void DiscoverProjectsIn(AcDbDatabase* database, const CZodEVIProjectMaps& maps)
{
    velproj::ForEachProjectRecord(database, [&](int kind, const std::string& name, velproj::QuantityTable quantities) {
        if (CZodEVIProjectMap* map = maps.OfKind(kind))
            map->Get(name) = std::move(quantities);
    });
}

} // namespace zodevi
