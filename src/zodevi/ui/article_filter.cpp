// The article filter's entries, levels and lines. Entries are found through indexes (by
// article, by project, by level path) so that a rebuild stays linear in what it adds.
#include "ui/article_filter.hpp"

#include <algorithm>

#include "text/text.hpp"

namespace {

bool IsDroppedLevel(std::string_view level)
{
    for (const char* nature : {"Linéaire", "Ponctuel", "Non Graphique"})
        if (EqualsNoCase(level, nature))
            return true;
    return false;
}

std::string PathKey(const std::vector<std::string>& path, std::size_t length)
{
    std::string key;
    for (std::size_t i = 0; i < length; ++i) {
        key += FoldCase(path[i]);
        key += '\0';
    }
    return key;
}

std::string ProjectKey(int kind, const std::string& name)
{
    return FormatInt(kind) + "\t" + name;
}

const std::vector<std::string> kNoLevels;
const std::vector<const CZodEVIFilterEntry*> kNoEntries;

} // namespace

CZodEVIFilterEntry* CZodEVIFilterEntryArray::FindByArticle(const CZodEVIArticle* article) const
{
    const auto found = byArticle_.find(article);
    return found == byArticle_.end() ? nullptr : found->second;
}

void CZodEVIFilterEntryArray::IndexLevels() const
{
    levels_.clear();
    for (const auto& entry : entries_) {
        std::string key;
        for (std::size_t depth = 0;; ++depth) {
            LevelNode& node = levels_[key];
            if (depth == entry->levels.size()) {
                node.entries.push_back(entry.get());
                break;
            }
            std::string folded = FoldCase(entry->levels[depth]);
            if (std::find(node.foldedSubLevels.begin(), node.foldedSubLevels.end(), folded) ==
                node.foldedSubLevels.end()) {
                node.subLevels.push_back(entry->levels[depth]);
                node.foldedSubLevels.push_back(folded);
            }
            key += folded;
            key += '\0';
        }
    }
    indexed_ = true;
}

const CZodEVIFilterEntryArray::LevelNode* CZodEVIFilterEntryArray::NodeOf(const std::vector<std::string>& path) const
{
    if (!indexed_)
        IndexLevels();
    const auto found = levels_.find(PathKey(path, path.size()));
    return found == levels_.end() ? nullptr : &found->second;
}

const std::vector<std::string>& CZodEVIFilterEntryArray::SubLevels(const std::vector<std::string>& path) const
{
    const LevelNode* node = NodeOf(path);
    return node ? node->subLevels : kNoLevels;
}

const std::vector<const CZodEVIFilterEntry*>& CZodEVIFilterEntryArray::EntriesAt(
    const std::vector<std::string>& path) const
{
    const LevelNode* node = NodeOf(path);
    return node ? node->entries : kNoEntries;
}

void CZodEVIArticleKeyIndex::Build(const CZodEVIArticleList& articles)
{
    byKey_.clear();
    for (CZodEVIArticle* article : articles)
        byKey_[FoldCase(article->quantityKey)].push_back(article);
}

const CZodEVIArticleList* CZodEVIArticleKeyIndex::Find(const std::string& quantityKey) const
{
    const auto found = byKey_.find(FoldCase(quantityKey));
    return found == byKey_.end() ? nullptr : &found->second;
}

std::vector<std::string> FilterLevels(const std::string& treePath)
{
    std::vector<std::string> levels;
    std::size_t start = 0;
    for (;;) {
        const std::size_t separator = treePath.find(kTreeSeparator, start);
        if (separator == std::string::npos || separator == start)
            return levels;
        std::string level = treePath.substr(start, separator - start);
        if (!IsDroppedLevel(level))
            levels.push_back(std::move(level));
        start = separator + kTreeSeparator.size();
    }
}

void AddArticleQuantity(CZodEVIFilterEntryArray& entries, CZodEVIArticle* article, const std::string& project,
                        double quantity, int kind)
{
    if (article == nullptr)
        return;
    CZodEVIFilterEntry* entry = entries.FindByArticle(article);
    if (entry == nullptr) {
        auto added = std::make_unique<CZodEVIFilterEntry>();
        added->levels = FilterLevels(article->treePath);
        added->article = article;
        entry = added.get();
        entries.byArticle_.emplace(article, entry);
        entries.entries_.push_back(std::move(added));
        entries.indexed_ = false;
    }
    const auto id = entries.projectIds_.try_emplace(ProjectKey(kind, project), entries.projectIds_.size()).first;
    const auto [slot, isNew] = entries.slots_.try_emplace({entry, id->second}, entry->projects.size());
    // A project's quantity is replaced, not added, when a second key of its table
    // matches the same article.
    if (isNew)
        entry->projects.push_back({project, kind, quantity});
    else
        entry->projects[slot->second].quantity = quantity;
}

void SortEntries(CZodEVIFilterEntryArray& entries, const std::unordered_map<const CZodEVIArticle*, std::size_t>& positions)
{
    // Full-width positions, and entries the schedule does not hold first: the order a
    // pass of adjacent swaps would give, in O(n log n).
    const auto key = [&](const std::unique_ptr<CZodEVIFilterEntry>& entry) -> long long {
        const auto found = positions.find(entry->article);
        return found == positions.end() ? -1 : static_cast<long long>(found->second);
    };
    std::stable_sort(entries.entries_.begin(), entries.entries_.end(),
                     [&](const auto& a, const auto& b) { return key(a) < key(b); });
    entries.indexed_ = false;
}

int ListSubLevels(const CZodEVIFilterEntryArray& entries, const std::vector<std::string>& path,
                  std::vector<std::string>& out, bool sort)
{
    out = entries.SubLevels(path);
    if (sort)
        SortStrings(out, false);
    return static_cast<int>(out.size());
}

int ListArticlesAt(const CZodEVIFilterEntryArray& entries, const std::vector<std::string>& path,
                   std::vector<std::string>& out, bool sort)
{
    out.clear();
    for (const CZodEVIFilterEntry* entry : entries.EntriesAt(path))
        if (entry->article != nullptr)
            out.push_back(entry->article->designation);
    if (sort)
        SortStrings(out, false);
    return static_cast<int>(out.size());
}

bool BuildLines(const CZodEVIFilterEntry& entry, std::vector<std::unique_ptr<CZodEVIAssocLine>>& lines,
                double& total, const CZodEVIArticle*& article, bool perProject)
{
    lines.clear();
    total = 0;
    article = nullptr;
    const CZodEVIArticle* source = entry.article;
    if (source == nullptr || entry.projects.empty())
        return false;
    const auto makeLine = [&](const std::vector<CZodEVILineProject>& projects) {
        auto line = std::make_unique<CZodEVIAssocLine>();
        line->lineKind = source->nature == kNatureNonGraphic ? kLineKindLumpSum : kLineKindQuantity;
        line->quantityKey = source->quantityKey;
        line->articleNature = source->nature;
        line->description = source->description;
        line->treePath = source->treePath;
        line->metreText3 = source->metreText3;
        line->unit = source->unit;
        line->unitPrice = source->unitPrice;
        std::vector<std::string> names;
        bool plain = true;
        for (const CZodEVILineProject& project : projects) {
            names.push_back(project.name);
            plain = plain && project.name.find('\n') == std::string::npos;
        }
        line->projects = JoinStrings(names, ",");
        line->projectKind = projects.empty() ? 0 : projects.back().kind;
        // A name holding a line break cannot be carried one per line: such a line goes
        // without, and the metre module falls back on `projects` and `projectKind`.
        if (plain)
            line->assocText1 = EncodeLineProjects(projects);
        return line;
    };
    if (perProject) {
        for (const CZodEVIEntryProject& project : entry.projects) {
            auto line = makeLine({{project.name, project.kind}});
            line->label = FormatString("%s (%s)", source->designation.c_str(), project.name.c_str());
            total += project.quantity;
            lines.push_back(std::move(line));
        }
    } else {
        std::vector<CZodEVILineProject> projects;
        for (const CZodEVIEntryProject& project : entry.projects) {
            projects.push_back({project.name, project.kind});
            total += project.quantity;
        }
        auto line = makeLine(projects);
        line->label = source->designation;
        lines.push_back(std::move(line));
    }
    article = source;
    return !lines.empty();
}

namespace {

// The quantities of the checked projects of one road-like group.
bool AddCheckedProjects(const CZodEVIProjectMap* projects, const CZodEVINameMap* checked,
                        const CZodEVIArticleKeyIndex* keys, int kind, CZodEVIFilterEntryArray& entries)
{
    bool any = false;
    if (projects == nullptr || checked == nullptr)
        return false;
    for (const auto& [name, table] : *projects) {
        if (checked->find(name) == checked->end())
            continue;
        any = true;
        if (keys == nullptr)
            continue;
        for (const auto& [key, quantity] : table->Entries())
            if (const CZodEVIArticleList* matching = keys->Find(key))
                for (CZodEVIArticle* article : *matching)
                    AddArticleQuantity(entries, article, name, quantity, kind);
    }
    return any;
}

} // namespace

void CollectEntries(const CZodEVIFilterInputs& in, CZodEVIFilterEntryArray& entries)
{
    // Every hash map walked here (project maps, tables) iterates in the order of first
    // insertion, so a rebuild always gives the same order.
    bool roadChecked = AddCheckedProjects(in.projects.roadProjects, in.checkedRoadProjects, in.roadKeys,
                                          velproj::kKindRoad, entries);
    roadChecked = AddCheckedProjects(in.projects.korvaneProjects, in.checkedKorvaneProjects, in.roadKeys,
                                     velproj::kKindKorvane, entries) || roadChecked;
    roadChecked = AddCheckedProjects(in.projects.platforms, in.checkedPlatforms, in.roadKeys,
                                     velproj::kKindPlatform, entries) || roadChecked;
    if (roadChecked && in.roadArticles != nullptr)
        for (CZodEVIArticle* article : *in.roadArticles)
            if (article->nature == kNatureNonGraphic)
                AddArticleQuantity(entries, article, kRoadLumpSumProject, 1.0, kProjectPlatform);

    if (in.projects.networks != nullptr && in.networkGroups != nullptr) {
        for (const auto& [project, table] : *in.projects.networks) {
            std::string network;
            if (EqualsNoCase(project, kGeneralNetworkName)) {
                network = kGeneralNetworkName;
            } else {
                if (in.checkedNetworks == nullptr)
                    continue;
                const auto checked = in.checkedNetworks->find(project);
                if (checked == in.checkedNetworks->end())
                    continue;
                network = checked->second;
            }
            std::size_t group = 0;
            while (group < in.networkGroups->size() && (*in.networkGroups)[group].first != network)
                ++group;
            if (group == in.networkGroups->size())
                continue;
            const CZodEVIArticleKeyIndex* keys =
                in.networkKeys != nullptr && group < in.networkKeys->size() ? &(*in.networkKeys)[group].second : nullptr;
            if (keys != nullptr)
                for (const auto& [key, quantity] : table->Entries())
                    if (const CZodEVIArticleList* matching = keys->Find(key))
                        for (CZodEVIArticle* article : *matching)
                            AddArticleQuantity(entries, article, project, quantity, kProjectNetwork);
            for (CZodEVIArticle* article : *(*in.networkGroups)[group].second)
                if (article->nature == kNatureNonGraphic)
                    AddArticleQuantity(entries, article, network, 1.0, kProjectNetwork);
        }
    }

    if (in.lumpSumArticles != nullptr)
        for (CZodEVIArticle* article : *in.lumpSumArticles)
            AddArticleQuantity(entries, article, kLumpSumProject, 1.0, kProjectLumpSum);
}

std::string PriceColumnText(const CZodEVIArticle& article, const std::string& currency)
{
    if (article.unit.empty())
        return FormatString("%.2f %s", article.unitPrice, currency.c_str());
    return FormatString("%.2f %s/%s", article.unitPrice, currency.c_str(), article.unit.c_str());
}

std::string QuantityColumnText(double total, const std::string& unit)
{
    if (unit.empty())
        return FormatString("%.2f", total);
    return FormatString("%.2f %s", total, unit.c_str());
}
