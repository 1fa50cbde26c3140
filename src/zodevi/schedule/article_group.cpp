// The group's list and its indexes: folded quantity keys, code numbers in use by
// prefix, and family members, each built on first use and kept through appends.
#include "schedule/article_group.hpp"

#include "text/text.hpp"

#include <algorithm>
#include <charconv>
#include <cstdint>
#include <unordered_map>
#include <unordered_set>

namespace zodevi {

namespace {

// Code numbers in use under one folded prefix. Between two rebuilds numbers are only
// added, so every number below lowestFree stays taken and the search starts there.
struct CodeNumbers {
    std::unordered_set<int> used;
    int lowestFree = 1;
};

// The folded prefix and number of a folded code written "<prefix>-<n as %03d>" with
// n >= 1; false for any other code. Folding changes neither '-' nor digits, so a code
// splits the same way before and after it.
bool SplitCode(std::string_view foldedCode, std::string_view& prefix, int& number)
{
    const std::size_t dash = foldedCode.rfind('-');
    if (dash == std::string_view::npos)
        return false;
    const std::string_view digits = foldedCode.substr(dash + 1);
    if (digits.size() < 3 || (digits.size() > 3 && digits.front() == '0'))
        return false;
    if (!std::all_of(digits.begin(), digits.end(), [](char c) { return c >= '0' && c <= '9'; }))
        return false;
    const auto result = std::from_chars(digits.data(), digits.data() + digits.size(), number);
    if (result.ec != std::errc() || number < 1)
        return false;
    prefix = foldedCode.substr(0, dash);
    return true;
}

// Folded quantity key -> position of the first article holding it. The keys lie end to
// end in one string and the slots in one array: in a network of thousands of articles a
// lookup then costs two cache misses, not a walk through scattered nodes.
class KeyIndex {
public:
    static constexpr std::size_t npos = static_cast<std::size_t>(-1);

    void Reserve(std::size_t count)
    {
        while (slots_.size() < 2 * count)
            Grow();
    }

    // Records the key at `position` unless an earlier article holds it.
    void Add(std::string_view key, std::size_t position)
    {
        if (2 * (count_ + 1) > slots_.size())
            Grow();
        const std::uint32_t hash = Hash(key);
        Slot& slot = slots_[SlotOf(key, hash)];
        if (slot.position != 0)
            return;
        slot = {position + 1, keys_.size(), hash, static_cast<std::uint32_t>(key.size())};
        keys_.append(key);
        ++count_;
    }

    std::size_t Find(std::string_view key) const
    {
        if (slots_.empty())
            return npos;
        const Slot& slot = slots_[SlotOf(key, Hash(key))];
        return slot.position == 0 ? npos : slot.position - 1;
    }

    // Same keys at the same positions.
    bool operator==(const KeyIndex& other) const
    {
        if (count_ != other.count_)
            return false;
        for (const Slot& slot : slots_)
            if (slot.position != 0 && other.Find(KeyOf(slot)) != slot.position - 1)
                return false;
        return true;
    }

private:
    struct Slot {
        std::size_t position = 0; // position + 1; 0 for an empty slot
        std::size_t offset = 0;
        std::uint32_t hash = 0;
        std::uint32_t length = 0;
    };

    static std::uint32_t Hash(std::string_view key)
    {
        return static_cast<std::uint32_t>(std::hash<std::string_view>{}(key));
    }
    std::string_view KeyOf(const Slot& slot) const { return std::string_view(keys_).substr(slot.offset, slot.length); }

    // The slot holding the key, or the empty slot where it would go.
    std::size_t SlotOf(std::string_view key, std::uint32_t hash) const
    {
        const std::size_t mask = slots_.size() - 1;
        for (std::size_t i = hash & mask;; i = (i + 1) & mask) {
            const Slot& slot = slots_[i];
            if (slot.position == 0 || (slot.hash == hash && slot.length == key.size() && KeyOf(slot) == key))
                return i;
        }
    }

    void Grow()
    {
        std::vector<Slot> old(std::max<std::size_t>(16, 2 * slots_.size()));
        old.swap(slots_);
        const std::size_t mask = slots_.size() - 1;
        for (const Slot& slot : old) {
            if (slot.position == 0)
                continue;
            std::size_t i = slot.hash & mask;
            while (slots_[i].position != 0)
                i = (i + 1) & mask;
            slots_[i] = slot;
        }
    }

    std::vector<Slot> slots_;
    std::string keys_;
    std::size_t count_ = 0;
};

using CodeIndex = std::unordered_map<std::string, CodeNumbers>;

void AddKey(KeyIndex& keys, const CZodEVIArticle& article, std::size_t position)
{
    keys.Add(FoldCase(article.quantityKey), position);
}

void AddCode(CodeIndex& codes, const CZodEVIArticle& article)
{
    const std::string folded = FoldCase(article.code);
    std::string_view prefix;
    int number = 0;
    if (SplitCode(folded, prefix, number))
        codes[std::string(prefix)].used.insert(number);
}

} // namespace

struct CZodEVIGroup::Indexes {
    struct Family {
        std::function<bool(std::string_view)> member;
        std::vector<CZodEVIArticle*> members;
    };
    bool keysBuilt = false;
    KeyIndex keys;
    bool codesBuilt = false;
    CodeIndex codes;
    std::unordered_map<std::string, Family> families;
};

CZodEVIGroup::CZodEVIGroup() = default;

CZodEVIGroup::CZodEVIGroup(std::initializer_list<CZodEVIArticle*> articles) : articles_(articles) {}

CZodEVIGroup::CZodEVIGroup(const CZodEVIGroup& other) : articles_(other.articles_) {}

CZodEVIGroup& CZodEVIGroup::operator=(const CZodEVIGroup& other)
{
    if (this != &other) {
        articles_ = other.articles_;
        Invalidate();
    }
    return *this;
}

CZodEVIGroup::~CZodEVIGroup() = default;

CZodEVIGroup::Indexes& CZodEVIGroup::Built() const
{
    if (!indexes_)
        indexes_ = std::make_unique<Indexes>();
    return *indexes_;
}

void CZodEVIGroup::push_back(CZodEVIArticle* article)
{
    articles_.push_back(article);
    if (!indexes_ || article == nullptr)
        return;
    if (indexes_->keysBuilt)
        AddKey(indexes_->keys, *article, articles_.size() - 1);
    if (indexes_->codesBuilt)
        AddCode(indexes_->codes, *article);
    for (auto& [name, family] : indexes_->families)
        if (family.member(article->quantityKey))
            family.members.push_back(article);
}

CZodEVIGroup::const_iterator CZodEVIGroup::erase(const_iterator at)
{
    Invalidate();
    return articles_.erase(at);
}

std::size_t CZodEVIGroup::RemoveIf(const std::function<bool(const CZodEVIArticle*)>& doomed)
{
    const std::size_t removed = std::erase_if(articles_, doomed);
    if (removed != 0)
        Invalidate();
    return removed;
}

void CZodEVIGroup::clear()
{
    articles_.clear();
    Invalidate();
}

void CZodEVIGroup::Invalidate() const
{
    indexes_.reset();
}

CZodEVIFound CZodEVIGroup::FindByQuantityKey(std::string_view quantityKey) const
{
    Indexes& built = Built();
    if (!built.keysBuilt) {
        built.keys.Reserve(articles_.size());
        for (std::size_t i = 0; i < articles_.size(); ++i)
            if (articles_[i] != nullptr)
                AddKey(built.keys, *articles_[i], i);
        built.keysBuilt = true;
    }
    const std::size_t position = built.keys.Find(FoldCase(quantityKey));
    if (position == KeyIndex::npos)
        return {};
    return {static_cast<long>(position), articles_[position]};
}

int CZodEVIGroup::FreeCodeNumber(std::string_view prefix) const
{
    Indexes& built = Built();
    if (!built.codesBuilt) {
        for (const CZodEVIArticle* article : articles_)
            if (article != nullptr)
                AddCode(built.codes, *article);
        built.codesBuilt = true;
    }
    const auto found = built.codes.find(FoldCase(prefix));
    if (found == built.codes.end())
        return 1;
    CodeNumbers& numbers = found->second;
    while (numbers.used.count(numbers.lowestFree) != 0)
        ++numbers.lowestFree;
    return numbers.lowestFree;
}

const std::vector<CZodEVIArticle*>& CZodEVIGroup::Family(const std::string& name,
                                                         const std::function<bool(std::string_view)>& member) const
{
    Indexes& built = Built();
    const auto [at, added] = built.families.try_emplace(name);
    if (added) {
        at->second.member = member;
        for (CZodEVIArticle* article : articles_)
            if (article != nullptr && member(article->quantityKey))
                at->second.members.push_back(article);
    }
    return at->second.members;
}

std::string CZodEVIGroup::CheckIndexes() const
{
    if (!indexes_)
        return {};
    std::string problems;
    if (indexes_->keysBuilt) {
        KeyIndex scanned;
        for (std::size_t i = 0; i < articles_.size(); ++i)
            if (articles_[i] != nullptr)
                AddKey(scanned, *articles_[i], i);
        if (scanned != indexes_->keys)
            problems += "quantity keys differ from the list; ";
    }
    if (indexes_->codesBuilt) {
        CodeIndex scanned;
        for (const CZodEVIArticle* article : articles_)
            if (article != nullptr)
                AddCode(scanned, *article);
        bool same = scanned.size() == indexes_->codes.size();
        for (const auto& [prefix, numbers] : indexes_->codes) {
            const auto other = scanned.find(prefix);
            same = same && other != scanned.end() && other->second.used == numbers.used;
            for (int n = 1; same && n < numbers.lowestFree; ++n)
                same = numbers.used.count(n) != 0;
        }
        if (!same)
            problems += "code numbers differ from the list; ";
    }
    for (const auto& [name, family] : indexes_->families) {
        std::vector<CZodEVIArticle*> scanned;
        for (CZodEVIArticle* article : articles_)
            if (article != nullptr && family.member(article->quantityKey))
                scanned.push_back(article);
        if (scanned != family.members)
            problems += "members of family " + name + " differ from the list; ";
    }
    return problems;
}

} // namespace zodevi
