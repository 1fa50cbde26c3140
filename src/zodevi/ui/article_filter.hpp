// The article filter: from the checked projects and their quantity tables, the articles
// an estimate can hold with their quantities (filter entries), their levels in the
// article tree, and the estimate lines of each article.
#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

#include "schedule/schedule_store.hpp"
#include "ui/project_discovery.hpp"
#include "zodevi/assoc_line.h"

namespace zodevi {

// Pseudo-projects: the lump sums of no project group, and the non-graphic road articles
// that any checked road, Korvane project or platform brings.
inline constexpr const char* kLumpSumProject = "**Forfait";
inline constexpr const char* kRoadLumpSumProject = "**Voirie";

// One project counted by an entry, with the entry's quantity in it.
struct CZodEVIEntryProject {
    std::string name;
    int kind = 0;
    double quantity = 0;
    std::size_t id = 0; // the project's number in its entry array
};

// One article present in the filter. A project is known by its kind and its name
// together: a road and a platform both named "Parking" are two projects.
class CZodEVIFilterEntry {
public:
    // Category levels under which the article is shown.
    std::vector<std::string> levels;
    // The schedule's article, not owned.
    CZodEVIArticle* article = nullptr;
    // The projects in the order they were first added.
    std::vector<CZodEVIEntryProject> projects;
};

// The entries of one rebuild, owned, with what finds them fast: by article and project
// when adding, by level path when filling the tree.
class CZodEVIFilterEntryArray {
public:
    // One place of the article tree: its sublevels in the order of first appearance (each
    // once, ignoring case) with the node under each, and the entries whose levels are
    // exactly its path, in order.
    struct LevelNode {
        std::vector<std::string> subLevels;
        std::vector<std::size_t> children;
        std::vector<CZodEVIFilterEntry*> entries;
    };

    std::size_t GetSize() const { return entries_.size(); }
    const CZodEVIFilterEntry& operator[](std::size_t i) const { return *entries_[i]; }
    CZodEVIFilterEntry* FindByArticle(const CZodEVIArticle* article) const;

    // The node of a level path (levels compared ignoring case), the root for an empty
    // one; null when nothing lies there.
    const LevelNode* NodeOf(const std::vector<std::string>& path) const;
    const LevelNode& Node(std::size_t index) const;
    const std::vector<std::string>& SubLevels(const std::vector<std::string>& path) const;
    const std::vector<CZodEVIFilterEntry*>& EntriesAt(const std::vector<std::string>& path) const;

    // A project's number in this array, for adding many quantities of one project.
    std::size_t ProjectId(int kind, const std::string& name);
    // AddArticleQuantity for a project already numbered.
    void Add(CZodEVIArticle* article, std::size_t projectId, const std::string& name, double quantity, int kind);

private:
    friend void SortEntries(CZodEVIFilterEntryArray&, const std::unordered_map<const CZodEVIArticle*, std::size_t>&);
    void IndexLevels() const;

    std::vector<std::unique_ptr<CZodEVIFilterEntry>> entries_;
    std::unordered_map<const CZodEVIArticle*, CZodEVIFilterEntry*> byArticle_;
    // Projects by "<kind>\t<name>".
    std::unordered_map<std::string, std::size_t> projectIds_;
    // The level tree (node 0 is the root) and each node's child by parent and folded
    // level; built on the first query after a change.
    mutable std::vector<LevelNode> nodes_;
    mutable std::unordered_map<std::string, std::size_t> childOf_;
    mutable bool indexed_ = false;
};

// Articles of a list by quantity key compared without regard to case, each key's
// articles in list order.
class CZodEVIArticleKeyIndex {
public:
    void Build(const CZodEVIArticleList& articles);
    void Build(const CZodEVIGroup& group) { Build(CZodEVIArticleList(group.begin(), group.end())); }
    const CZodEVIArticleList* Find(const std::string& quantityKey) const;

private:
    std::unordered_map<std::string, CZodEVIArticleList> byKey_;
    // A key as some article spells it, to its articles: most keys are found without
    // folding them.
    std::unordered_map<std::string, const CZodEVIArticleList*> bySpelling_;
};

// The category levels of a tree path: the levels before the code and designation,
// without the nature levels "Linéaire", "Ponctuel" and "Non Graphique"; none when the
// path starts with the separator.
std::vector<std::string> FilterLevels(const std::string& treePath);

// Adds (or replaces) the quantity of an article in a project.
void AddArticleQuantity(CZodEVIFilterEntryArray& entries, CZodEVIArticle* article, const std::string& project,
                        double quantity, int kind);

// Orders the entries as the schedule orders their articles (articles it does not hold
// first), keeping the order of equals.
void SortEntries(CZodEVIFilterEntryArray& entries,
                 const std::unordered_map<const CZodEVIArticle*, std::size_t>& positions);

int ListSubLevels(const CZodEVIFilterEntryArray& entries, const std::vector<std::string>& path,
                  std::vector<std::string>& out, bool sort);
int ListArticlesAt(const CZodEVIFilterEntryArray& entries, const std::vector<std::string>& path,
                   std::vector<std::string>& out, bool sort);

// The total of an entry's quantities, added in the order of its projects.
double EntryTotal(const CZodEVIFilterEntry& entry);

// The estimate lines of one entry: one line with the sum of its quantities, or one line
// per project. Each line also carries its projects with their kinds (assocText1).
bool BuildLines(const CZodEVIFilterEntry& entry, std::vector<std::unique_ptr<CZodEVIAssocLine>>& lines, double& total,
                const CZodEVIArticle*& article, bool perProject);

// Which names of a project group are checked: name -> the project's own name, or for a
// network project the network's name.
using CZodEVINameMap = std::unordered_map<std::string, std::string>;

// What the filter reads: the schedule's lists, the drawing's projects and the checks.
struct CZodEVIFilterInputs {
    const std::vector<std::pair<std::string, CZodEVIGroup*>>* networkGroups = nullptr;
    const std::vector<std::pair<std::string, CZodEVIArticleKeyIndex>>* networkKeys = nullptr;
    const CZodEVIArticleList* roadArticles = nullptr;
    const CZodEVIArticleKeyIndex* roadKeys = nullptr;
    const CZodEVIArticleList* lumpSumArticles = nullptr;
    CZodEVIProjectMaps projects;
    const CZodEVINameMap* checkedNetworks = nullptr;
    const CZodEVINameMap* checkedRoadProjects = nullptr;
    const CZodEVINameMap* checkedKorvaneProjects = nullptr;
    const CZodEVINameMap* checkedPlatforms = nullptr;
};

// The entries of the checked projects, lump sums last, not yet sorted.
void CollectEntries(const CZodEVIFilterInputs& inputs, CZodEVIFilterEntryArray& entries);

// "12.50 €/m³" (or "12.50 €" without a unit), and "7.50 m³" (or "7.50").
std::string PriceColumnText(const CZodEVIArticle& article, const std::string& currency);
std::string QuantityColumnText(double total, const std::string& unit);

} // namespace zodevi
