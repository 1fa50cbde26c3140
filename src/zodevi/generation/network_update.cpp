// Network update and depth-class update: which kinds are made from which list, in
// which order, and when each family is purged.
#include "generation/network_update.hpp"

#include "generation/instantiate.hpp"

#include <initializer_list>

namespace zodevi {

namespace {

// Fixed articles of a new network group, in the order they are numbered (kind 10 has
// no template).
constexpr int kFixedKinds[] = {0, 2, 32, 33, 3, 4, 5, 6, 7, 10, 11, 12, 13, 34, 14, 15, 16, 17, 18, 20};

// Depth-class kinds: those of a bound pair, then those of the last bound.
bool IsPairKind(int kind)
{
    return kind == 21 || kind == 8 || kind == 35;
}

// Every template of each kind, one article per name, then that template's purge.
bool ApplyNames(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName, std::initializer_list<int> kinds,
                const std::vector<std::string>& names, const std::string& groupKey, CZodEVIGroup& group, bool newGroup)
{
    bool changed = false;
    for (int kind : kinds) {
        for (const CZodEVIArtTemplate* tmpl : TemplatesOfKind(bdr, kind)) {
            for (const std::string& name : names)
                changed |= InstantiateByName(bdr, networkIndex, networkName, *tmpl, name, groupKey, group, newGroup);
            if (GetPurgeFlag())
                changed |= PurgeByNames(bdr, names, *tmpl, group);
        }
    }
    return changed;
}

bool ApplyDepthBounds(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName, const std::vector<int>& kinds,
                      const CZodEVIValueArray<double>& bounds, const std::string& groupKey, CZodEVIGroup& group,
                      bool newGroup)
{
    if (bounds.IsEmpty())
        return false;
    const auto pairs = ConsecutivePairs(bounds);
    const double last = bounds[bounds.GetSize() - 1];
    bool changed = false;
    for (int kind : kinds) {
        for (const CZodEVIArtTemplate* tmpl : TemplatesOfKind(bdr, kind)) {
            if (IsPairKind(kind)) {
                for (const auto& [lower, upper] : pairs)
                    changed |= InstantiateByValues(bdr, networkIndex, networkName, *tmpl, lower, upper, groupKey, group,
                                                   newGroup);
                if (GetPurgeFlag())
                    changed |= PurgeByValuePairs(bdr, pairs, *tmpl, group);
            } else {
                changed |= InstantiateByValue(bdr, networkIndex, networkName, *tmpl, last, groupKey, group, newGroup);
                if (GetPurgeFlag())
                    changed |= PurgeByValues(bdr, bounds, *tmpl, group);
            }
        }
    }
    return changed;
}

} // namespace

bool UpdateNetwork(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName,
                   const std::vector<std::string>& models, const std::vector<std::string>& pipeSupplies,
                   const std::vector<std::string>& fittings, const std::vector<std::string>& fittingSupplies,
                   const std::vector<std::string>& ducts, const std::vector<std::string>& materials,
                   const CZodEVIValueArray<double>& depthBounds)
{
    const std::string groupKey = MakeNetworkGroupKey(networkName);
    CZodEVIGroup& group = *bdr.GroupOf(groupKey, true);
    bdr.SetNetworkIndex(groupKey, networkIndex);
    const bool newGroup = group.empty();

    bool changed = false;
    if (newGroup) {
        for (int kind : kFixedKinds) {
            for (const CZodEVIArtTemplate* tmpl : TemplatesOfKind(bdr, kind)) {
                if (!InstantiateFixed(bdr, networkIndex, networkName, *tmpl, groupKey, group))
                    break;
                changed = true;
            }
        }
    }
    const auto names = [&](std::initializer_list<int> kinds, const std::vector<std::string>& list) {
        changed |= ApplyNames(bdr, networkIndex, networkName, kinds, list, groupKey, group, newGroup);
    };
    names({23, 24}, models);
    names({19}, materials);
    changed |= ApplyDepthBounds(bdr, networkIndex, networkName, {21, 22, 8, 9, 35, 36}, depthBounds, groupKey, group,
                                newGroup);
    names({26}, fittings);
    names({25}, pipeSupplies);
    names({27}, fittingSupplies);
    names({28, 29}, ducts);
    return changed;
}

bool UpdateDepthClasses(CZodEVIBdr& bdr, const CZodEVIValueArray<double>& depthBounds)
{
    if (depthBounds.IsEmpty())
        return false;
    bool changed = false;
    // Group order stands for the order in which networks were first met; it is the same
    // on every run.
    for (const auto& [groupKey, group] : bdr.Groups()) {
        const int* networkIndex = bdr.NetworkIndexOf(groupKey);
        if (networkIndex == nullptr)
            continue;
        const auto networkName = NetworkNameOfKey(groupKey);
        if (!networkName)
            continue;
        // Branch trenches exist for EP and EU networks only.
        const bool branches = *networkIndex == 0 || *networkIndex == 1;
        const std::vector<int> kinds =
            branches ? std::vector<int>{21, 22, 8, 9, 35, 36} : std::vector<int>{21, 22, 8, 9};
        changed |= ApplyDepthBounds(bdr, *networkIndex, *networkName, kinds, depthBounds, groupKey, *group, false);
    }
    return changed;
}

} // namespace zodevi
