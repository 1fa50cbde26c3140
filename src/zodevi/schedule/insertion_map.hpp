// A map from text keys that iterates in the order of first insertion, used wherever
// the schedule walks its groups or network indexes, so every run sees the same order.
#pragma once

#include <memory>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

namespace zodevi {

template <typename V>
class InsertionMap {
public:
    using Entry = std::pair<std::string, std::unique_ptr<V>>;

    V* Find(const std::string& key) const
    {
        const auto found = index_.find(key);
        return found == index_.end() ? nullptr : entries_[found->second].second.get();
    }

    // The value under key, made with V() when missing.
    V& Get(const std::string& key)
    {
        if (V* existing = Find(key))
            return *existing;
        index_.emplace(key, entries_.size());
        entries_.emplace_back(key, std::make_unique<V>());
        return *entries_.back().second;
    }

    void Clear()
    {
        index_.clear();
        entries_.clear();
    }

    std::size_t Size() const { return entries_.size(); }
    bool Empty() const { return entries_.empty(); }
    typename std::vector<Entry>::const_iterator begin() const { return entries_.begin(); }
    typename std::vector<Entry>::const_iterator end() const { return entries_.end(); }

private:
    std::unordered_map<std::string, std::size_t> index_;
    std::vector<Entry> entries_;
};

} // namespace zodevi
