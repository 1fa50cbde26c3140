// Comb-duct and structure-material updates: single templates instantiated by name in
// the general network group and in the road group.
#include "generation/road_update.hpp"

#include "generation/instantiate.hpp"

namespace zodevi {

namespace {

bool ApplyNames(CZodEVIBdr& bdr, int kind, const std::vector<std::string>& names, const std::string& groupKey,
                CZodEVIGroup& group)
{
    bool changed = false;
    for (const CZodEVIArtTemplate* tmpl : TemplatesOfKind(bdr, kind)) {
        for (const std::string& name : names)
            changed |= InstantiateSingleByName(bdr, *tmpl, name, groupKey, group, false);
        if (GetPurgeFlag())
            changed |= PurgeByNames(bdr, names, *tmpl, group);
    }
    return changed;
}

} // namespace

bool UpdateCombDucts(CZodEVIBdr& bdr, const std::vector<std::string>& models)
{
    const std::string groupKey = MakeNetworkGroupKey(kGeneralNetworkName);
    CZodEVIGroup& group = *bdr.GroupOf(groupKey, true);
    bool changed = false;
    for (int kind : {30, 31})
        changed |= ApplyNames(bdr, kind, models, groupKey, group);
    return changed;
}

bool UpdateMaterials(CZodEVIBdr& bdr, const std::vector<std::string>& volumeMaterials,
                     const std::vector<std::string>& surfaceMaterials, const std::vector<std::string>& lengthMaterials)
{
    const std::string groupKey = MakeRoadGroupKey();
    CZodEVIGroup& group = *bdr.GroupOf(groupKey, true);
    const struct {
        int kind;
        const std::vector<std::string>& names;
    } families[] = {
        {43, volumeMaterials},  // volume
        {44, volumeMaterials},  // mass in tonnes
        {45, surfaceMaterials}, // surface
        {46, lengthMaterials},  // length
        {49, volumeMaterials},  // reprofiling volume
    };
    bool changed = false;
    for (const auto& family : families)
        changed |= ApplyNames(bdr, family.kind, family.names, groupKey, group);
    return changed;
}

} // namespace zodevi
