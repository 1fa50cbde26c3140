// Stripping, vegetation and planing updates: single templates instantiated by one
// thickness or by a pair of class limits in the road group.
#include "generation/earthwork_update.hpp"

#include "generation/instantiate.hpp"

#include <string>
#include <utility>
#include <vector>

namespace zodevi {

namespace {

bool ApplyThicknesses(CZodEVIBdr& bdr, std::initializer_list<int> kinds, const CZodEVIValueArray<double>& thicknesses)
{
    const std::string groupKey = MakeRoadGroupKey();
    CZodEVIGroup& group = *bdr.GroupOf(groupKey, true);
    bool changed = false;
    for (int kind : kinds) {
        for (const CZodEVIArtTemplate* tmpl : TemplatesOfKind(bdr, kind)) {
            for (double thickness : thicknesses)
                changed |= InstantiateSingleByValue(bdr, *tmpl, thickness, groupKey, group, false);
            if (GetPurgeFlag())
                changed |= PurgeByValues(bdr, thicknesses, *tmpl, group);
        }
    }
    return changed;
}

} // namespace

bool UpdateStripping(CZodEVIBdr& bdr, const CZodEVIValueArray<double>& thicknesses)
{
    return ApplyThicknesses(bdr, {37, 38}, thicknesses);
}

bool UpdateVegetation(CZodEVIBdr& bdr, const CZodEVIValueArray<double>& thicknesses)
{
    return ApplyThicknesses(bdr, {39, 40}, thicknesses);
}

bool UpdatePlaning(CZodEVIBdr& bdr, const CZodEVIValueArray<double>& classLimits)
{
    const std::string groupKey = MakeRoadGroupKey();
    CZodEVIGroup& group = *bdr.GroupOf(groupKey, true);
    std::vector<std::pair<double, double>> classes;
    double lower = 0;
    for (double upper : classLimits) {
        classes.emplace_back(lower, upper);
        lower = upper;
    }
    bool changed = false;
    for (const CZodEVIArtTemplate* tmpl : TemplatesOfKind(bdr, 47)) {
        for (const auto& [from, to] : classes)
            changed |= InstantiateSingleByValues(bdr, *tmpl, from, to, groupKey, group, false);
        if (GetPurgeFlag())
            changed |= PurgeByValuePairs(bdr, classes, *tmpl, group);
    }
    for (const CZodEVIArtTemplate* tmpl : TemplatesOfKind(bdr, 48)) {
        if (!classLimits.IsEmpty())
            changed |=
                InstantiateSingleByValue(bdr, *tmpl, classLimits[classLimits.GetSize() - 1], groupKey, group, false);
        if (GetPurgeFlag())
            changed |= PurgeByValues(bdr, classLimits, *tmpl, group);
    }
    return changed;
}

} // namespace zodevi
