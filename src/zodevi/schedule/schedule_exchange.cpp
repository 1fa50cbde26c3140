// Reading, writing and editing the schedule through the metre module, and the price
// queries by quantity selector.
#include "schedule/schedule_exchange.hpp"

#include "module/parameters.hpp"
#include "module/siblings.hpp"
#include "text/text.hpp"
#include "velhost/ui.h"

#include <algorithm>
#include <memory>

namespace {

constexpr const char* kNoArticleMessage = "ERREUR : aucun article ne se réfère à l'élément !";

const char* const kSelectorPatterns[] = {
    "RSX_TUY_LIN_3D_%s", "RSX_TUY_NB_%s",      "RSX_FRX_LIN_3D_%s",      "RSX_FRX_NB_%s",     "RSX_PGN_LIN_3D_%s",
    "RSX_PGN_NB_%s",     "RSX_SBL_NB_%s",      "RSX_TUY_FRNT_LIN_3D_%s", "RSX_SBL_FRNT_NB_%s", "PRJ_VOL_MAT_%s",
    "PRJ_SFC_MAT_%s",    "PRJ_LIN_MAT_%s",     "PRJ_TON_MAT_%s",
};

std::string QuantityKeyOf(int selector, const std::string& item)
{
    return MakeQuantityKey(FormatPattern(QuantityPatternOfSelector(selector), {item}));
}

std::string NetworkKeyOrGeneral(const std::string& networkName)
{
    return MakeNetworkGroupKey(networkName.empty() ? std::string(kGeneralNetworkName) : networkName);
}

std::string GroupKeyOf(int selector, const std::string& networkName)
{
    if (selector >= 0 && selector <= 8)
        return NetworkKeyOrGeneral(networkName);
    if (selector >= 9 && selector <= 12)
        return MakeRoadGroupKey();
    return {};
}

CZodEVIArticle* FindQuantityArticle(const CZodEVIBdr& bdr, int selector, const std::string& item,
                                    const std::string& networkName)
{
    const CZodEVIGroup* group = bdr.Groups().Find(GroupKeyOf(selector, networkName));
    return group == nullptr ? nullptr : bdr.FindInGroupByQuantityKey(QuantityKeyOf(selector, item), group).article;
}

// Owns what the metre module returned, whatever happens to it.
struct ReturnedArticles {
    std::vector<CZodEVIArticle*> list;
    ~ReturnedArticles()
    {
        for (CZodEVIArticle* article : list)
            delete article;
    }
};

// A modified article whose group key changed leaves its old group for the new key's,
// so that every article stays in the group of its own key.
void ApplyModification(CZodEVIBdr& bdr, const CZodEVIArticle& returned)
{
    if (CZodEVIArticle* stored = bdr.FindByTreePath(returned.treePath).article)
        bdr.ReplaceArticle(*stored, returned);
}

// Applies the editor's changes; true when an added article took a neighbour's group key.
bool ApplyChanges(CZodEVIBdr& bdr, const std::vector<CZodEVIArticle*>& records,
                  const std::vector<std::uint32_t>& actions)
{
    bool regrouped = false;
    const std::size_t count = std::min(records.size(), actions.size());
    for (std::size_t i = 0; i < count; ++i) {
        const CZodEVIArticle* article = records[i];
        if (article == nullptr)
            continue;
        switch (actions[i]) {
        case kEditDeleted:
            bdr.RemoveByTreePath(article->treePath);
            break;
        case kEditModified:
            ApplyModification(bdr, *article);
            break;
        case kEditAdded:
            regrouped = bdr.AddEditedArticle(*article) || regrouped;
            break;
        default:
            break;
        }
    }
    return regrouped;
}

std::int32_t CallEditor(const CZodEVIBdr& bdr, const std::string& treePath, ReturnedArticles& records,
                        std::vector<std::uint32_t>& actions)
{
    return CallMetre<VtMetre_EditerBordereauFn>("VtMetre_EditerBordereau", std::string(bdr.path), &records.list,
                                                &actions, std::string(treePath));
}

bool Export(CZodEVIBdr& bdr)
{
    std::vector<CZodEVIArticle*> list;
    list.reserve(bdr.Articles().size());
    for (const auto& article : bdr.Articles())
        list.push_back(article.get());
    return CallMetre<VtMetre_ExporterXmlFn>("VtMetre_ExporterXml", std::string(bdr.path), &list, 1) == 0;
}

void AddProjectWideArticles(CZodEVIBdr& bdr)
{
    const std::string roadKey = MakeRoadGroupKey();
    CZodEVIGroup* road = bdr.GroupOf(roadKey, true);
    const bool roadWasEmpty = road->empty();
    for (int kind : {1, 41, 42, 50}) {
        CZodEVIArtTemplateArray selection;
        selection.SetOwning(false);
        bdr.Catalogue().SelectKind(kind, selection);
        for (int i = 0; i < selection.GetSize(); ++i) {
            const CZodEVIArtTemplate* tmpl = selection[i];
            if (tmpl == nullptr)
                continue;
            const std::string quantityKey = MakeQuantityKey(tmpl->codePattern);
            if (kind == 1 ? !roadWasEmpty : static_cast<bool>(bdr.FindInGroupByQuantityKey(quantityKey, road)))
                continue;
            const CZodEVIArtParam* texts = tmpl->FirstTexts();
            if (texts == nullptr)
                continue;
            auto article = std::make_unique<CZodEVIArticle>();
            article->code = bdr.NewCode(texts->numberingPrefix, road);
            article->number = bdr.TakeNextNumber();
            article->nature = tmpl->nature;
            article->designation = texts->designation;
            article->description = texts->description;
            article->unit = tmpl->unit;
            article->quantityKey = quantityKey;
            article->groupKey = roadKey;
            article->metreInt4 = 0;
            article->treePath = MakeTreePath(MakeCategory(*texts, tmpl->nature), article->code, article->designation);
            road->push_back(bdr.AddArticle(std::move(article)));
        }
    }
}

} // namespace

std::string QuantityPatternOfSelector(int selector)
{
    if (selector < 0 || selector >= static_cast<int>(std::size(kSelectorPatterns)))
        return {};
    return kSelectorPatterns[selector];
}

bool Read(CZodEVIBdr& bdr)
{
    bdr.Clear();
    ReturnedArticles delivered;
    if (CallMetre<VtMetre_RemplitTableauFn>("VtMetre_RemplitTableau", std::string(bdr.path), &delivered.list, 1) != 0)
        return false;
    CZodEVIGroup* group = nullptr;
    const std::string* groupKey = nullptr;
    for (CZodEVIArticle*& raw : delivered.list) {
        if (raw == nullptr)
            continue;
        CZodEVIArticle* article = bdr.AddArticle(std::unique_ptr<CZodEVIArticle>(raw));
        raw = nullptr;
        // Files keep a group's articles together: the previous article's group is usually
        // the one.
        if (groupKey == nullptr || *groupKey != article->groupKey)
            group = bdr.GroupOf(article->groupKey, true);
        groupKey = &article->groupKey;
        group->push_back(article);
    }
    AddProjectWideArticles(bdr);
    return true;
}

bool Write(CZodEVIBdr& bdr)
{
    return Export(bdr);
}

bool Edit(CZodEVIBdr& bdr, const std::string& treePath)
{
    ReturnedArticles records;
    std::vector<std::uint32_t> actions;
    if (CallEditor(bdr, treePath, records, actions) != 0)
        return false;
    if (ApplyChanges(bdr, records.list, actions))
        return Write(bdr);
    return true;
}

bool GetPrice(const CZodEVIBdr& bdr, int selector, const std::string& item, double& price,
              const std::string& networkName)
{
    price = 0;
    const CZodEVIArticle* article = FindQuantityArticle(bdr, selector, item, networkName);
    if (article == nullptr)
        return false;
    price = article->unitPrice;
    return true;
}

bool GetPricesPerNetwork(const CZodEVIBdr& bdr, int selector, const std::string& item,
                         std::map<std::string, std::string>& prices)
{
    prices.clear();
    const std::string quantityKey = QuantityKeyOf(selector, item);
    const std::string generalKey = MakeNetworkGroupKey(kGeneralNetworkName);
    for (const auto& [key, group] : bdr.Groups()) {
        std::string name;
        if (EqualsNoCase(key, generalKey)) {
            name.assign(1, '*');
        } else {
            if (bdr.NetworkIndexOf(key) == nullptr)
                continue;
            const std::optional<std::string> network = NetworkNameOfKey(key);
            if (!network)
                continue;
            name = *network;
        }
        if (const CZodEVIArticle* article = bdr.FindInGroupByQuantityKey(quantityKey, group.get()).article)
            prices[name] = FormatRealShortest(article->unitPrice);
    }
    return !prices.empty();
}

bool SetPrice(CZodEVIBdr& bdr, int selector, const std::string& item, double price, const std::string& networkName)
{
    CZodEVIArticle* article = FindQuantityArticle(bdr, selector, item, networkName);
    if (article == nullptr)
        return false;
    article->unitPrice = price;
    return true;
}

bool ShowPrice(CZodEVIBdr& bdr, int selector, const std::string& item, const std::string& networkName)
{
    const std::string quantityKey = QuantityKeyOf(selector, item);
    std::vector<const CZodEVIGroup*> searched;
    if (selector == 0 || selector == 1 || selector == 6) {
        searched.push_back(bdr.Groups().Find(NetworkKeyOrGeneral(networkName)));
    } else if (selector >= 2 && selector <= 8) {
        if (!networkName.empty())
            searched.push_back(bdr.Groups().Find(MakeNetworkGroupKey(networkName)));
        else
            for (const auto& entry : bdr.Groups())
                searched.push_back(entry.second.get());
    } else if (selector >= 9 && selector <= 12) {
        searched.push_back(bdr.Groups().Find(MakeRoadGroupKey()));
    }
    const CZodEVIArticle* found = nullptr;
    for (const CZodEVIGroup* group : searched)
        if (group != nullptr && (found = bdr.FindInGroupByQuantityKey(quantityKey, group).article) != nullptr)
            break;
    ReturnedArticles records;
    std::vector<std::uint32_t> actions;
    bool shown = false;
    if (found != nullptr) {
        const std::string treePath = found->treePath;
        shown = CallEditor(bdr, treePath, records, actions) == 0;
    } else {
        MessageBoxFlags(nullptr, MB_OK | MB_ICONWARNING, "%s", kNoArticleMessage);
    }
    if (ApplyChanges(bdr, records.list, actions))
        Export(bdr);
    return shown;
}
