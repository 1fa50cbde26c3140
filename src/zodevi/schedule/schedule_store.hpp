// The price schedule in memory (`CZodEVIBdr`): articles, their groups by group key,
// numbering and codes, queries and edits, the catalogue of templates, and the purge flag.
#pragma once

#include "schedule/art_template.hpp"
#include "schedule/article.hpp"
#include "schedule/article_group.hpp"
#include "schedule/insertion_map.hpp"
#include "schedule/schedule_file_state.hpp"

#include <memory>
#include <set>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

namespace zodevi {

using CZodEVIArticleList = std::vector<CZodEVIArticle*>;

// What the schedule needs from outside to find its default file: the main services
// module (parameter file, data files and folders) and the parameter reader. The module
// plugs the real services in; without them the schedule still builds, with the bare
// default file name.
class CZodEVIBdrEnvironment {
public:
    virtual ~CZodEVIBdrEnvironment() = default;
    // Path of the user's parameter file; empty when unknown.
    virtual std::string ParameterFile() = 0;
    // Value of a key of the parameter file, or the default.
    virtual std::string ReadParameter(const std::string& file, const std::string& section, const std::string& key,
                                      const std::string& defaultValue) = 0;
    // Full path of a data file found for a location code; empty when not found.
    virtual std::string FindDataFile(const std::string& name, int locationCode) = 0;
    // A data folder for a folder code, ending with its separator; may be empty.
    virtual std::string DataFolder(int folderCode) = 0;
};

// The environment used by every schedule built afterwards; null for none. Not owned.
void SetBdrEnvironment(CZodEVIBdrEnvironment* environment);
CZodEVIBdrEnvironment* GetBdrEnvironment();

// The module-wide purge flag: false at load, set by the purge command, read by updates.
bool GetPurgeFlag();
void SetPurgeFlag(bool purge);

class CZodEVIBdr {
public:
    // Empty schedule, default file resolved, catalogue filled.
    CZodEVIBdr();
    ~CZodEVIBdr();
    CZodEVIBdr(const CZodEVIBdr&) = delete;
    CZodEVIBdr& operator=(const CZodEVIBdr&) = delete;

    // Destroys every article, group and network index; nextNumber back to 1. The path
    // and the catalogue stay.
    void Clear();

    // Queries.
    int NextFreeNumber() const;
    std::string NewCode(const std::string& prefix, const CZodEVIGroup* group) const;
    CZodEVIFound FindInGroupByQuantityKey(const std::string& quantityKey, const CZodEVIGroup* group) const;
    CZodEVIFound FindByTreePath(const std::string& treePath) const;
    bool FindCategoryByQuantityKeyPart(const std::string& text, const CZodEVIGroup* group, std::string& category) const;
    int ArticlesInCategory(const std::string& category, CZodEVIArticleList& out) const;
    int SubCategories(const std::string& category, std::vector<std::string>& out) const;
    // Network name -> group, in group order.
    bool NetworkGroups(std::vector<std::pair<std::string, CZodEVIGroup*>>& out) const;
    bool RoadProjectArticles(CZodEVIArticleList& out) const;
    bool NonGraphicArticles(CZodEVIArticleList& out, bool excludeAssociated) const;
    std::size_t ArticleIndexMap(std::unordered_map<const CZodEVIArticle*, std::size_t>& out) const;

    // Edits.
    // Appends an article that the caller numbered; answers it.
    CZodEVIArticle* AddArticle(std::unique_ptr<CZodEVIArticle> article);
    // The group of a key; with create, an empty one is made when missing.
    CZodEVIGroup* GroupOf(const std::string& groupKey, bool create);
    // Removes the first article of that tree path from the schedule and from every group
    // that lists it.
    bool RemoveByTreePath(const std::string& treePath);
    // Removes these articles from every group that lists them and from the schedule,
    // and destroys them; pointers that are not in the schedule are ignored. Answers how
    // many articles went. Removing by identity, not by tree path, is what lets a purge
    // take exactly its own articles when two of them look alike.
    std::size_t RemoveArticles(const std::vector<const CZodEVIArticle*>& victims);
    // Keeps a copy of an article the user added in the editor and gives it the group of
    // a neighbouring associated article; true when its group key changed.
    bool AddEditedArticle(const CZodEVIArticle& article);
    // Searches the category, its subcategories and its parent's for an associated
    // article; `exclude` (the article being placed) is never its own model.
    bool FindModel(const std::string& category, CZodEVIArticle& model, std::set<std::string>& visited,
                   const CZodEVIArticle* exclude = nullptr) const;
    // Gives an article of the schedule the fields of `fields`; when its group key changes
    // it leaves the old key's group for the new key's. This is how an edited article is
    // put back: a key, code or number changed in place would escape the indexes.
    void ReplaceArticle(CZodEVIArticle& stored, const CZodEVIArticle& fields);
    // For a caller that changed an article's quantity key, code or number in place: the
    // indexes are built again when next used.
    void ArticleChanged();
    // Compares every index with a scan of the schedule; empty when they agree, else what
    // differs. For tests.
    std::string CheckIndexes() const;

    // The network index a network update was given for a network group.
    void SetNetworkIndex(const std::string& groupKey, int networkIndex);
    const int* NetworkIndexOf(const std::string& groupKey) const;

    // Numbering: the free number from nextNumber on, which then moves past it.
    int TakeNextNumber();

    const std::vector<std::unique_ptr<CZodEVIArticle>>& Articles() const { return articles; }
    const InsertionMap<CZodEVIGroup>& Groups() const { return groups; }
    const CZodEVIArtTemplateArray& Catalogue() const { return catalogue; }

    std::string path;
    int nextNumber = 1;
    // Kept by the exchange with the metre module; Clear leaves it alone.
    CZodEVIBdrFileState fileState;

private:
    void ForgetHighestNumber() { highestNumberKnown = false; }

    std::vector<std::unique_ptr<CZodEVIArticle>> articles;
    InsertionMap<CZodEVIGroup> groups;
    InsertionMap<int> networkIndexes;
    CZodEVIArtTemplateArray catalogue;
    // The highest article number, so that numbering need not scan the schedule.
    mutable bool highestNumberKnown = false;
    mutable int highestNumber = 0;
};

// Default schedule file name and where its path is stored in the parameter file.
inline constexpr const char* kBdrFileName = "VelaBordereau.xml";
inline constexpr const char* kBdrParameterSection = "VuzazORE";
inline constexpr const char* kBdrParameterKey = "Bordereau";

// The default schedule path, resolved through the environment.
std::string ResolveDefaultBdrPath(CZodEVIBdrEnvironment* environment);

} // namespace zodevi
