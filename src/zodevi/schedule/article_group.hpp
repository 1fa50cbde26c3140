// A group of the schedule (`CZodEVIGroup`): the articles filed under one group key, in
// order and without owning them, with the indexes that turn the group queries of large
// networks into lookups.
#pragma once

#include "zodevi/article.h"

#include <cstddef>
#include <functional>
#include <initializer_list>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace zodevi {

// Result of a search by quantity key or tree path: the position in the searched list
// and the article, or -1 and null.
struct CZodEVIFound {
    long index = -1;
    CZodEVIArticle* article = nullptr;
    explicit operator bool() const { return article != nullptr; }
};

// The list reads like a vector; its slots change only through push_back and the
// removals, which keep the indexes. An index is built on its first use and follows
// every append; a removal drops them all, to be built again when next asked.
// Fields an index reads (quantity key, code) must not change in place while the article
// is listed, unless Invalidate() follows: the store's ReplaceArticle and ArticleChanged
// do that.
class CZodEVIGroup {
public:
    using value_type = CZodEVIArticle*;
    using const_iterator = std::vector<CZodEVIArticle*>::const_iterator;
    using iterator = const_iterator;

    CZodEVIGroup();
    CZodEVIGroup(std::initializer_list<CZodEVIArticle*> articles);
    // Copies the list; the copy builds its own indexes.
    CZodEVIGroup(const CZodEVIGroup& other);
    CZodEVIGroup& operator=(const CZodEVIGroup& other);
    ~CZodEVIGroup();

    const_iterator begin() const { return articles_.begin(); }
    const_iterator end() const { return articles_.end(); }
    std::size_t size() const { return articles_.size(); }
    bool empty() const { return articles_.empty(); }
    CZodEVIArticle* operator[](std::size_t i) const { return articles_[i]; }
    CZodEVIArticle* front() const { return articles_.front(); }
    CZodEVIArticle* back() const { return articles_.back(); }
    bool operator==(const CZodEVIGroup& other) const { return articles_ == other.articles_; }

    void push_back(CZodEVIArticle* article);
    const_iterator erase(const_iterator at);
    // Removes every article the test accepts; answers how many went.
    std::size_t RemoveIf(const std::function<bool(const CZodEVIArticle*)>& doomed);
    void clear();

    // The first article in group order whose quantity key equals `quantityKey` without
    // regard to case.
    CZodEVIFound FindByQuantityKey(std::string_view quantityKey) const;
    // The lowest n from 1 for which no code of the group is "<prefix>-<n as %03d>",
    // compared without regard to case.
    int FreeCodeNumber(std::string_view prefix) const;
    // The articles, in group order, whose quantity key `member` accepts. `member` must
    // answer from the key alone and the same for every call with this name. The list
    // lasts until the group changes.
    const std::vector<CZodEVIArticle*>& Family(const std::string& name,
                                               const std::function<bool(std::string_view)>& member) const;

    // Forgets every index; for a caller that changed a key or a code in place.
    void Invalidate() const;
    // Compares each index built so far with a scan of the list; empty when they agree,
    // else what differs. For tests.
    std::string CheckIndexes() const;

private:
    struct Indexes;
    Indexes& Built() const;

    std::vector<CZodEVIArticle*> articles_;
    mutable std::unique_ptr<Indexes> indexes_;
};

} // namespace zodevi
