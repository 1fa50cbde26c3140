// Project discovery: the projects of the four groups and their quantity tables, read
// from the project records filed in the drawing's named-object dictionary.
#pragma once

#include <string>

#include "schedule/insertion_map.hpp"
#include "velsiblings/project_records.h"

class AcDbDatabase;

namespace zodevi {

// Projects of one group by name (compared exactly), in the order of first insertion.
using CZodEVIProjectMap = InsertionMap<velproj::QuantityTable>;

// The four groups' maps.
struct CZodEVIProjectMaps {
    CZodEVIProjectMap* networks = nullptr;
    CZodEVIProjectMap* roadProjects = nullptr;
    CZodEVIProjectMap* korvaneProjects = nullptr;
    CZodEVIProjectMap* platforms = nullptr;

    // The map of a project kind (velproj::kKind...); null for another kind.
    CZodEVIProjectMap* OfKind(int kind) const;
};

// Adds to the maps the projects of the drawing: each group's second-level dictionary is
// walked in ascending byte order of its entry keys, and a name met again replaces its
// table (the entry met last wins). Reads only; every failure is silent and only gives
// fewer projects.
void DiscoverProjectsIn(AcDbDatabase* database, const CZodEVIProjectMaps& maps);

} // namespace zodevi
