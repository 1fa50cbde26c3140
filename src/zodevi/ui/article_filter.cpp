// The article filter's entries, levels and lines. Entries are found through indexes (by
// article, by project, by level path) so that a rebuild stays linear in what it adds.
#include "ui/article_filter.hpp"

#include <algorithm>
#include <charconv>

#include "text/text.hpp"

namespace zodevi {

namespace {

bool IsDroppedLevel(std::string_view level)
{
    // Case folding keeps a letter's UTF-8 length, so a level of another length is
    // none of them: most levels are told apart without folding.
    for (std::string_view nature :
         {std::string_view("Linéaire"), std::string_view("Ponctuel"), std::string_view("Non Graphique")})
        if (level.size() == nature.size() && EqualsNoCase(level, nature))
            return true;
    return false;
}

// The key of a node's child: the parent's number, then the folded level.
std::string ChildKey(std::size_t parent, std::string_view folded)
{
    std::string key(reinterpret_cast<const char*>(&parent), sizeof parent);
    key += folded;
    return key;
}

const std::vector<std::string> kNoLevels;
const std::vector<CZodEVIFilterEntry*> kNoEntries;

} // namespace

CZodEVIFilterEntry* CZodEVIFilterEntryArray::FindByArticle(const CZodEVIArticle* article) const
{
    const auto found = byArticle_.find(article);
    return found == byArticle_.end() ? nullptr : found->second;
}

void CZodEVIFilterEntryArray::IndexLevels() const
{
    nodes_.assign(1, LevelNode());
    childOf_.clear();
    // Entries come in schedule order, so neighbours mostly share their first levels:
    // those are taken from the previous entry's walk without folding them again.
    const CZodEVIFilterEntry* previous = nullptr;
    std::vector<std::size_t> previousWalk, walk;
    for (const auto& entry : entries_) {
        walk.assign(1, 0);
        bool same = previous != nullptr;
        for (std::size_t depth = 0; depth < entry->levels.size(); ++depth) {
            const std::string& level = entry->levels[depth];
            same = same && depth < previous->levels.size() && previous->levels[depth] == level;
            if (same) {
                walk.push_back(previousWalk[depth + 1]);
                continue;
            }
            const std::size_t parent = walk.back();
            const auto [child, added] = childOf_.try_emplace(ChildKey(parent, FoldCase(level)), nodes_.size());
            if (added) {
                nodes_[parent].subLevels.push_back(level);
                nodes_[parent].children.push_back(child->second);
                nodes_.emplace_back();
            }
            walk.push_back(child->second);
        }
        nodes_[walk.back()].entries.push_back(entry.get());
        previous = entry.get();
        previousWalk.swap(walk);
    }
    indexed_ = true;
}

const CZodEVIFilterEntryArray::LevelNode* CZodEVIFilterEntryArray::NodeOf(const std::vector<std::string>& path) const
{
    if (!indexed_)
        IndexLevels();
    std::size_t node = 0;
    for (const std::string& level : path) {
        const auto child = childOf_.find(ChildKey(node, FoldCase(level)));
        if (child == childOf_.end())
            return nullptr;
        node = child->second;
    }
    return &nodes_[node];
}

const CZodEVIFilterEntryArray::LevelNode& CZodEVIFilterEntryArray::Node(std::size_t index) const
{
    if (!indexed_)
        IndexLevels();
    return nodes_.at(index);
}

const std::vector<std::string>& CZodEVIFilterEntryArray::SubLevels(const std::vector<std::string>& path) const
{
    const LevelNode* node = NodeOf(path);
    return node ? node->subLevels : kNoLevels;
}

const std::vector<CZodEVIFilterEntry*>& CZodEVIFilterEntryArray::EntriesAt(const std::vector<std::string>& path) const
{
    const LevelNode* node = NodeOf(path);
    return node ? node->entries : kNoEntries;
}

std::size_t CZodEVIFilterEntryArray::ProjectId(int kind, const std::string& name)
{
    std::string key = FormatInt(kind);
    key += '\t';
    key += name;
    return projectIds_.try_emplace(std::move(key), projectIds_.size()).first->second;
}

void CZodEVIFilterEntryArray::Add(CZodEVIArticle* article, std::size_t projectId, const std::string& name,
                                  double quantity, int kind)
{
    if (article == nullptr)
        return;
    CZodEVIFilterEntry* entry = FindByArticle(article);
    if (entry == nullptr) {
        auto added = std::make_unique<CZodEVIFilterEntry>();
        added->levels = FilterLevels(article->treePath);
        added->article = article;
        entry = added.get();
        byArticle_.emplace(article, entry);
        entries_.push_back(std::move(added));
        indexed_ = false;
    }
    // A project's quantity is replaced, not added, when a second key of its table
    // matches the same article. Quantities come project by project, so the project is
    // almost always the entry's last one or a new one.
    for (auto project = entry->projects.rbegin(); project != entry->projects.rend(); ++project)
        if (project->id == projectId) {
            project->quantity = quantity;
            return;
        }
    entry->projects.push_back({name, kind, quantity, projectId});
}

void CZodEVIArticleKeyIndex::Build(const CZodEVIArticleList& articles)
{
    byKey_.clear();
    bySpelling_.clear();
    for (CZodEVIArticle* article : articles)
        byKey_[FoldCase(article->quantityKey)].push_back(article);
    // Values of an unordered map stay where they are as it grows.
    for (CZodEVIArticle* article : articles)
        bySpelling_.emplace(article->quantityKey, &byKey_[FoldCase(article->quantityKey)]);
}

const CZodEVIArticleList* CZodEVIArticleKeyIndex::Find(const std::string& quantityKey) const
{
    if (const auto spelled = bySpelling_.find(quantityKey); spelled != bySpelling_.end())
        return spelled->second;
    const auto found = byKey_.find(FoldCase(quantityKey));
    return found == byKey_.end() ? nullptr : &found->second;
}

std::vector<std::string> FilterLevels(const std::string& treePath)
{
    std::vector<std::string> levels;
    levels.reserve(6);
    std::size_t start = 0;
    for (;;) {
        const std::size_t separator = treePath.find(kTreeSeparator, start);
        if (separator == std::string::npos || separator == start)
            return levels;
        const std::string_view level = std::string_view(treePath).substr(start, separator - start);
        if (!IsDroppedLevel(level))
            levels.emplace_back(level);
        start = separator + kTreeSeparator.size();
    }
}

void AddArticleQuantity(CZodEVIFilterEntryArray& entries, CZodEVIArticle* article, const std::string& project,
                        double quantity, int kind)
{
    if (article != nullptr)
        entries.Add(article, entries.ProjectId(kind, project), project, quantity, kind);
}

void SortEntries(CZodEVIFilterEntryArray& entries,
                 const std::unordered_map<const CZodEVIArticle*, std::size_t>& positions)
{
    // Full-width positions, and entries the schedule does not hold first: the order a
    // pass of adjacent swaps would give, in O(n log n).
    std::vector<std::pair<long long, std::unique_ptr<CZodEVIFilterEntry>>> keyed;
    keyed.reserve(entries.entries_.size());
    for (auto& entry : entries.entries_) {
        const auto found = positions.find(entry->article);
        keyed.emplace_back(found == positions.end() ? -1 : static_cast<long long>(found->second), std::move(entry));
    }
    std::stable_sort(keyed.begin(), keyed.end(), [](const auto& a, const auto& b) { return a.first < b.first; });
    for (std::size_t i = 0; i < keyed.size(); ++i)
        entries.entries_[i] = std::move(keyed[i].second);
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

double EntryTotal(const CZodEVIFilterEntry& entry)
{
    double total = 0;
    for (const CZodEVIEntryProject& project : entry.projects)
        total += project.quantity;
    return total;
}

bool BuildLines(const CZodEVIFilterEntry& entry, std::vector<std::unique_ptr<CZodEVIAssocLine>>& lines, double& total,
                const CZodEVIArticle*& article, bool perProject)
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
        bool plain = true;
        for (const CZodEVILineProject& project : projects) {
            if (&project != &projects.front())
                line->projects += ',';
            line->projects += project.name;
            plain = plain && project.name.find('\n') == std::string::npos;
        }
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
            lines.push_back(std::move(line));
        }
    } else {
        std::vector<CZodEVILineProject> projects;
        for (const CZodEVIEntryProject& project : entry.projects)
            projects.push_back({project.name, project.kind});
        auto line = makeLine(projects);
        line->label = source->designation;
        lines.push_back(std::move(line));
    }
    total = EntryTotal(entry);
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
        const std::size_t id = entries.ProjectId(kind, name);
        for (const auto& [key, quantity] : table->Entries())
            if (const CZodEVIArticleList* matching = keys->Find(key))
                for (CZodEVIArticle* article : *matching)
                    entries.Add(article, id, name, quantity, kind);
    }
    return any;
}

} // namespace

void CollectEntries(const CZodEVIFilterInputs& in, CZodEVIFilterEntryArray& entries)
{
    // Every hash map walked here (project maps, tables) iterates in the order of first
    // insertion, so a rebuild always gives the same order.
    bool roadChecked =
        AddCheckedProjects(in.projects.roadProjects, in.checkedRoadProjects, in.roadKeys, velproj::kKindRoad, entries);
    roadChecked = AddCheckedProjects(in.projects.korvaneProjects, in.checkedKorvaneProjects, in.roadKeys,
                                     velproj::kKindKorvane, entries) ||
                  roadChecked;
    roadChecked =
        AddCheckedProjects(in.projects.platforms, in.checkedPlatforms, in.roadKeys, velproj::kKindPlatform, entries) ||
        roadChecked;
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
            const CZodEVIArticleKeyIndex* keys = in.networkKeys != nullptr && group < in.networkKeys->size()
                                                     ? &(*in.networkKeys)[group].second
                                                     : nullptr;
            const std::size_t id = entries.ProjectId(kProjectNetwork, project);
            if (keys != nullptr)
                for (const auto& [key, quantity] : table->Entries())
                    if (const CZodEVIArticleList* matching = keys->Find(key))
                        for (CZodEVIArticle* article : *matching)
                            entries.Add(article, id, project, quantity, kProjectNetwork);
            for (CZodEVIArticle* article : *(*in.networkGroups)[group].second)
                if (article->nature == kNatureNonGraphic)
                    AddArticleQuantity(entries, article, network, 1.0, kProjectNetwork);
        }
    }

    if (in.lumpSumArticles != nullptr)
        for (CZodEVIArticle* article : *in.lumpSumArticles)
            AddArticleQuantity(entries, article, kLumpSumProject, 1.0, kProjectLumpSum);
}

namespace {

// "%.2f" without printf: every leaf of a rebuild formats two of them. The same digits
// (both round the exact binary value), never a decimal comma.
std::string TwoDecimals(double value)
{
    char text[400];
    const auto written = std::to_chars(text, text + sizeof text, value, std::chars_format::fixed, 2);
    return written.ec == std::errc() ? std::string(text, written.ptr) : FormatString("%.2f", value);
}

} // namespace

std::string PriceColumnText(const CZodEVIArticle& article, const std::string& currency)
{
    std::string text = TwoDecimals(article.unitPrice) + " " + currency;
    if (!article.unit.empty())
        text += "/" + article.unit;
    return text;
}

std::string QuantityColumnText(double total, const std::string& unit)
{
    return unit.empty() ? TwoDecimals(total) : TwoDecimals(total) + " " + unit;
}

} // namespace zodevi
