// The price schedule store: numbering, codes, searches, groups and the model search for
// articles added by hand.
#include "schedule/schedule_store.hpp"

#include "schedule/catalogue.hpp"
#include "text/text.hpp"

#include <algorithm>
#include <climits>
#include <cstdint>
#include <filesystem>
#include <unordered_set>

namespace zodevi {

namespace {

CZodEVIBdrEnvironment* g_environment = nullptr;
bool g_purge = false;

bool IsExistingFile(const std::string& path)
{
    std::error_code error;
    return !path.empty() && std::filesystem::is_regular_file(path, error);
}

} // namespace

void SetBdrEnvironment(CZodEVIBdrEnvironment* environment)
{
    g_environment = environment;
}

CZodEVIBdrEnvironment* GetBdrEnvironment()
{
    return g_environment;
}

bool GetPurgeFlag()
{
    return g_purge;
}

void SetPurgeFlag(bool purge)
{
    g_purge = purge;
}

std::string ResolveDefaultBdrPath(CZodEVIBdrEnvironment* environment)
{
    if (environment == nullptr)
        return kBdrFileName;
    const std::string stored =
        environment->ReadParameter(environment->ParameterFile(), kBdrParameterSection, kBdrParameterKey, "");
    if (IsExistingFile(stored))
        return stored;
    for (int code : {4, 7, 0x27, 0x37}) {
        std::string found = environment->FindDataFile(kBdrFileName, code);
        if (!found.empty())
            return found;
    }
    return environment->DataFolder(1) + kBdrFileName;
}

CZodEVIBdr::CZodEVIBdr()
{
    path = ResolveDefaultBdrPath(g_environment);
    nextNumber = 1;
    FillStandardCatalogue(catalogue);
}

CZodEVIBdr::~CZodEVIBdr()
{
    Clear();
}

void CZodEVIBdr::Clear()
{
    nextNumber = 1;
    groups.Clear();
    articles.clear();
    networkIndexes.Clear();
    ForgetHighestNumber();
}

int CZodEVIBdr::NextFreeNumber() const
{
    if (!highestNumberKnown) {
        highestNumber = INT_MIN;
        for (const auto& article : articles)
            highestNumber = std::max(highestNumber, article->number);
        highestNumberKnown = true;
    }
    // Usually every number is below the counter.
    if (highestNumber < nextNumber)
        return nextNumber;
    // With k articles, one of nextNumber .. nextNumber + k is free: only those are marked.
    std::vector<bool> taken(articles.size() + 1);
    for (const auto& article : articles) {
        const std::int64_t offset = std::int64_t{article->number} - nextNumber;
        if (offset >= 0 && offset < static_cast<std::int64_t>(taken.size()))
            taken[static_cast<std::size_t>(offset)] = true;
    }
    std::size_t free = 0;
    while (taken[free])
        ++free;
    return nextNumber + static_cast<int>(free);
}

int CZodEVIBdr::TakeNextNumber()
{
    nextNumber = NextFreeNumber();
    return nextNumber++;
}

std::string CZodEVIBdr::NewCode(const std::string& prefix, const CZodEVIGroup* group) const
{
    // The code is written through c_str(), so a prefix ends at its first NUL.
    const int n = group == nullptr ? 1 : group->FreeCodeNumber(prefix.c_str());
    return FormatString("%s-%03d", prefix.c_str(), n);
}

CZodEVIFound CZodEVIBdr::FindInGroupByQuantityKey(const std::string& quantityKey, const CZodEVIGroup* group) const
{
    if (group == nullptr)
        return {};
    return group->FindByQuantityKey(quantityKey);
}

CZodEVIFound CZodEVIBdr::FindByTreePath(const std::string& treePath) const
{
    for (std::size_t i = 0; i < articles.size(); ++i)
        if (EqualsNoCase(articles[i]->treePath, treePath))
            return {static_cast<long>(i), articles[i].get()};
    return {};
}

bool CZodEVIBdr::FindCategoryByQuantityKeyPart(const std::string& text, const CZodEVIGroup* group,
                                               std::string& category) const
{
    if (group == nullptr)
        return false;
    for (const CZodEVIArticle* article : *group) {
        if (article->quantityKey.find(text) == std::string::npos)
            continue;
        if (auto found = CategoryWithNatureLevel(article->treePath)) {
            category = std::move(*found);
            return true;
        }
    }
    return false;
}

int CZodEVIBdr::ArticlesInCategory(const std::string& category, CZodEVIArticleList& out) const
{
    out.clear();
    for (const auto& article : articles) {
        const auto derived = DeriveCategory(*article);
        if (derived && EqualsNoCase(*derived, category))
            out.push_back(article.get());
    }
    return static_cast<int>(out.size());
}

int CZodEVIBdr::SubCategories(const std::string& category, std::vector<std::string>& out) const
{
    out.clear();
    for (const auto& article : articles) {
        auto derived = DeriveCategory(*article);
        if (derived && !EqualsNoCase(*derived, category) && derived->starts_with(category))
            out.push_back(std::move(*derived));
    }
    return static_cast<int>(out.size());
}

bool CZodEVIBdr::NetworkGroups(std::vector<std::pair<std::string, CZodEVIGroup*>>& out) const
{
    out.clear();
    for (const auto& [key, group] : groups) {
        auto name = NetworkNameOfKey(key);
        if (!name)
            continue;
        const bool known = std::any_of(out.begin(), out.end(), [&](const auto& e) { return e.first == *name; });
        if (!known)
            out.emplace_back(std::move(*name), group.get());
    }
    return !out.empty();
}

bool CZodEVIBdr::RoadProjectArticles(CZodEVIArticleList& out) const
{
    out.clear();
    for (const auto& [key, group] : groups)
        if (IsRoadGroupKey(key))
            out.insert(out.end(), group->begin(), group->end());
    return !out.empty();
}

bool CZodEVIBdr::NonGraphicArticles(CZodEVIArticleList& out, bool excludeAssociated) const
{
    out.clear();
    for (const auto& article : articles) {
        if (article->nature != kNatureNonGraphic)
            continue;
        if (excludeAssociated) {
            const std::string& key = article->groupKey;
            bool associated = false;
            for (const char* marker : {"PRJ_RES", "PRJ_PFM", "PRJ_RTE", "PRJ_PCV"})
                associated = associated || key.find(marker) != std::string::npos;
            if (associated)
                continue;
        }
        out.push_back(article.get());
    }
    return !out.empty();
}

std::size_t CZodEVIBdr::ArticleIndexMap(std::unordered_map<const CZodEVIArticle*, std::size_t>& out) const
{
    out.clear();
    out.reserve(articles.size());
    for (std::size_t i = 0; i < articles.size(); ++i)
        out.emplace(articles[i].get(), i);
    return out.size();
}

CZodEVIArticle* CZodEVIBdr::AddArticle(std::unique_ptr<CZodEVIArticle> article)
{
    if (!article)
        return nullptr;
    if (highestNumberKnown)
        highestNumber = std::max(highestNumber, article->number);
    articles.push_back(std::move(article));
    return articles.back().get();
}

CZodEVIGroup* CZodEVIBdr::GroupOf(const std::string& groupKey, bool create)
{
    if (create)
        return &groups.Get(groupKey);
    return groups.Find(groupKey);
}

bool CZodEVIBdr::RemoveByTreePath(const std::string& treePath)
{
    const CZodEVIFound found = FindByTreePath(treePath);
    if (!found)
        return false;
    // Every group forgets it, not only that of its key, so that none keeps a pointer to
    // a destroyed article.
    for (const auto& entry : groups)
        entry.second->RemoveIf([&](const CZodEVIArticle* a) { return a == found.article; });
    articles.erase(articles.begin() + found.index);
    ForgetHighestNumber();
    return true;
}

std::size_t CZodEVIBdr::RemoveArticles(const std::vector<const CZodEVIArticle*>& victims)
{
    const std::unordered_set<const CZodEVIArticle*> doomed(victims.begin(), victims.end());
    if (doomed.empty())
        return 0;
    for (const auto& entry : groups)
        entry.second->RemoveIf([&](const CZodEVIArticle* a) { return doomed.count(a) != 0; });
    ForgetHighestNumber();
    return std::erase_if(articles,
                         [&](const std::unique_ptr<CZodEVIArticle>& a) { return doomed.count(a.get()) != 0; });
}

bool CZodEVIBdr::AddEditedArticle(const CZodEVIArticle& article)
{
    CZodEVIArticle* copy = AddArticle(std::make_unique<CZodEVIArticle>(article));
    if (!EqualsNoCase(copy->groupKey, kNoGroupKey)) {
        if (CZodEVIGroup* group = groups.Find(copy->groupKey)) {
            group->push_back(copy);
            return false;
        }
    }
    const auto category = DeriveCategory(article);
    if (!category)
        return false;
    CZodEVIArticle model;
    std::set<std::string> visited;
    // The copy is already in the schedule; an unknown key of its own must not make it
    // its own model, or it would keep that key and hide a real neighbour.
    if (!FindModel(*category, model, visited, copy))
        return false;
    copy->groupKey = model.groupKey;
    if (CZodEVIGroup* group = groups.Find(copy->groupKey))
        group->push_back(copy);
    return true;
}

bool CZodEVIBdr::FindModel(const std::string& category, CZodEVIArticle& model, std::set<std::string>& visited,
                           const CZodEVIArticle* exclude) const
{
    if (!visited.insert(category).second)
        return false;

    CZodEVIArticleList inCategory;
    ArticlesInCategory(category, inCategory);
    for (const CZodEVIArticle* candidate : inCategory) {
        if (candidate != exclude && !candidate->groupKey.empty() && IsAssociatedKey(candidate->groupKey)) {
            model = *candidate;
            return true;
        }
    }

    std::vector<std::string> subCategories;
    SubCategories(category, subCategories);
    for (const std::string& sub : subCategories)
        if (FindModel(sub, model, visited, exclude))
            return true;

    const auto last = category.rfind('\\');
    if (last != std::string::npos) {
        const std::string parent = category.substr(0, last == 0 ? 0 : last - 1);
        std::vector<std::string> siblings;
        SubCategories(parent, siblings);
        for (const std::string& sibling : siblings)
            if (FindModel(sibling, model, visited, exclude))
                return true;
    }
    return false;
}

void CZodEVIBdr::ReplaceArticle(CZodEVIArticle& stored, const CZodEVIArticle& fields)
{
    const std::string oldKey = stored.groupKey;
    stored = fields;
    ArticleChanged();
    if (oldKey == stored.groupKey)
        return;
    if (CZodEVIGroup* old = groups.Find(oldKey)) {
        const auto at = std::find(old->begin(), old->end(), &stored);
        if (at != old->end())
            old->erase(at);
    }
    groups.Get(stored.groupKey).push_back(&stored);
}

void CZodEVIBdr::ArticleChanged()
{
    // Which groups list the article is not recorded; dropping every index costs one
    // rebuild per group later used, and edits by hand are rare.
    for (const auto& entry : groups)
        entry.second->Invalidate();
    ForgetHighestNumber();
}

std::string CZodEVIBdr::CheckIndexes() const
{
    std::string problems;
    for (const auto& [key, group] : groups) {
        const std::string groupProblems = group->CheckIndexes();
        if (!groupProblems.empty())
            problems += "group " + key + ": " + groupProblems;
    }
    if (highestNumberKnown) {
        int highest = INT_MIN;
        for (const auto& article : articles)
            highest = std::max(highest, article->number);
        if (highest != highestNumber)
            problems += FormatString("highest number %d, %d kept; ", highest, highestNumber);
    }
    return problems;
}

void CZodEVIBdr::SetNetworkIndex(const std::string& groupKey, int networkIndex)
{
    networkIndexes.Get(groupKey) = networkIndex;
}

const int* CZodEVIBdr::NetworkIndexOf(const std::string& groupKey) const
{
    return networkIndexes.Find(groupKey);
}

} // namespace zodevi
