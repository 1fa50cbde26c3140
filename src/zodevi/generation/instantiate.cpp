// Article creation from catalogue templates and the purge of template families, shared
// by every update. Names and numbers are only ever arguments of the stored patterns.
#include "generation/instantiate.hpp"

#include "text/text.hpp"

#include <optional>
#include <unordered_set>

namespace zodevi {

namespace {

// One piece of a code pattern: literal text, or a placeholder as the matcher reads it.
struct Piece {
    enum class Kind { Literal, Text, Number };
    Kind kind = Kind::Literal;
    std::string literal;
    int decimals = 0; // Number: digits after the point; 0 writes no point
};

// Splits a pattern the way FormatPattern fills it; nullopt when it holds a placeholder
// whose written form the matcher does not model (flags, widths, %g...), so that such a
// pattern never defines a family and a purge never guesses.
std::optional<std::vector<Piece>> SplitPattern(std::string_view pattern)
{
    std::vector<Piece> pieces;
    auto literal = [&](char c) {
        if (pieces.empty() || pieces.back().kind != Piece::Kind::Literal)
            pieces.push_back({});
        pieces.back().literal += c;
    };
    std::size_t i = 0;
    while (i < pattern.size()) {
        if (pattern[i] != '%') {
            literal(pattern[i++]);
            continue;
        }
        if (i + 1 < pattern.size() && pattern[i + 1] == '%') {
            literal('%');
            i += 2;
            continue;
        }
        std::size_t j = i + 1;
        const std::size_t flagsAt = j;
        while (j < pattern.size() && std::string_view("-+ #0").find(pattern[j]) != std::string_view::npos)
            ++j;
        std::size_t digits = 0;
        while (j < pattern.size() && pattern[j] >= '0' && pattern[j] <= '9' && digits < 3) {
            ++j;
            ++digits;
        }
        const bool plain = j == flagsAt;
        int precision = -1;
        if (j < pattern.size() && pattern[j] == '.') {
            ++j;
            precision = 0;
            digits = 0;
            while (j < pattern.size() && pattern[j] >= '0' && pattern[j] <= '9' && digits < 2) {
                precision = precision * 10 + (pattern[j] - '0');
                ++j;
                ++digits;
            }
        }
        const char conv = j < pattern.size() ? pattern[j] : '\0';
        if (conv == '\0' || std::string_view("sdifgex").find(conv) == std::string_view::npos) {
            literal(pattern[i++]); // FormatPattern copies such a '%' as it stands
            continue;
        }
        if (!plain)
            return std::nullopt;
        if (conv == 's' && precision < 0)
            pieces.push_back({Piece::Kind::Text, {}, 0});
        else if (conv == 'f')
            pieces.push_back({Piece::Kind::Number, {}, precision < 0 ? 6 : precision});
        else if ((conv == 'd' || conv == 'i') && precision < 0)
            pieces.push_back({Piece::Kind::Number, {}, 0});
        else
            return std::nullopt;
        i = j + 1;
    }
    return pieces;
}

bool IsDigit(char c)
{
    return c >= '0' && c <= '9';
}

// Length of the number written at the start of text with that many decimals, or 0.
std::size_t NumberLength(std::string_view text, int decimals)
{
    std::size_t i = 0;
    if (i < text.size() && text[i] == '-')
        ++i;
    const std::size_t integerAt = i;
    while (i < text.size() && IsDigit(text[i]))
        ++i;
    if (i == integerAt)
        return 0;
    if (decimals == 0)
        return i;
    if (i >= text.size() || text[i] != '.')
        return 0;
    ++i;
    for (int d = 0; d < decimals; ++d, ++i)
        if (i >= text.size() || !IsDigit(text[i]))
            return 0;
    return i;
}

bool Matches(const std::vector<Piece>& pieces, std::size_t p, std::string_view text)
{
    if (p == pieces.size())
        return text.empty();
    const Piece& piece = pieces[p];
    switch (piece.kind) {
    case Piece::Kind::Literal:
        return text.starts_with(piece.literal) && Matches(pieces, p + 1, text.substr(piece.literal.size()));
    case Piece::Kind::Number: {
        const std::size_t length = NumberLength(text, piece.decimals);
        return length != 0 && Matches(pieces, p + 1, text.substr(length));
    }
    case Piece::Kind::Text:
        for (std::size_t take = 0; take <= text.size(); ++take)
            if (Matches(pieces, p + 1, text.substr(take)))
                return true;
        return false;
    }
    return false;
}

// True when the key is the pattern between double quotes, placeholders filled.
bool Fits(const std::vector<Piece>& pieces, std::string_view key)
{
    return key.size() >= 2 && key.front() == '"' && key.back() == '"' &&
           Matches(pieces, 0, key.substr(1, key.size() - 2));
}

bool HasPlaceholder(const std::vector<Piece>& pieces)
{
    for (const Piece& piece : pieces)
        if (piece.kind != Piece::Kind::Literal)
            return true;
    return false;
}

// The articles of the group whose key fits the pattern, in group order; the group keeps
// the list, so a large network is not scanned again for each article made or purged.
const std::vector<CZodEVIArticle*>& FamilyMembers(const CZodEVIGroup& group, const std::string& codePattern,
                                                  const std::vector<Piece>& pieces)
{
    return group.Family(codePattern, [pieces](std::string_view key) { return Fits(pieces, key); });
}

// What one instance fills: the code pattern, and the designation and description.
struct Fill {
    std::vector<PatternArg> key;
    std::vector<PatternArg> texts;
};

Fill NameFill(const std::string& name)
{
    return {{name}, {name}};
}

// A one-value template whose texts hold two placeholders (the branch trench class of the
// last bound) shows that bound in both: the key names no other number, and a bound
// repeated reads far better than an invented upper limit of 0.00 m.
Fill ValueFill(double value)
{
    return {{value}, {value, value}};
}

Fill PairFill(double lower, double upper)
{
    return {{lower, upper}, {lower, upper}};
}

// The category with its nature level of an article made from a template: its tree path
// less "\\<code> - <designation>" when it still ends so (a name may hold backslashes),
// else the path up to its last separator.
std::optional<std::string> CategoryOfSibling(const CZodEVIArticle& article)
{
    const std::string tail = MakeTreePath("", article.code, article.designation);
    const std::string& path = article.treePath;
    if (path.size() > tail.size() && path.ends_with(tail))
        return path.substr(0, path.size() - tail.size());
    return CategoryWithNatureLevel(path);
}

// The category where the user keeps the family of the template: that of its first
// article in the group that has one.
std::optional<std::string> FamilyCategory(const std::string& codePattern, const CZodEVIGroup& group)
{
    const auto pieces = SplitPattern(codePattern);
    if (!pieces || !HasPlaceholder(*pieces))
        return std::nullopt;
    for (const CZodEVIArticle* article : FamilyMembers(group, codePattern, *pieces)) {
        auto category = CategoryOfSibling(*article);
        if (category && !category->empty())
            return category;
    }
    return std::nullopt;
}

// Where a new article is filed and how its code is prefixed: the texts of a network
// index and the network's name, or (single) the template's one text.
struct Target {
    bool single = true;
    int networkIndex = 0;
    const std::string* networkName = nullptr;

    const CZodEVIArtParam* Texts(const CZodEVIArtTemplate& tmpl) const
    {
        return single ? tmpl.FirstTexts() : tmpl.TextsOf(networkIndex & 0xFFFF);
    }
    // Used for a new group, or a family the user has not placed yet.
    std::string DefaultCategory(const CZodEVIArtParam& texts, int nature) const
    {
        return single ? MakeCategory(texts, nature) : MakeCategory(texts, nature, *networkName);
    }
    std::string CodePrefix(const CZodEVIArtParam& texts) const
    {
        if (single || !texts.numberingPrefix.empty())
            return texts.numberingPrefix;
        return FirstChars(*networkName, 2);
    }
};

Target NetworkTarget(int networkIndex, const std::string& networkName)
{
    return {false, networkIndex, &networkName};
}

Target SingleTarget()
{
    return {};
}

CZodEVIArticle* MakeArticle(CZodEVIBdr& bdr, const CZodEVIArtTemplate& tmpl, const Target& target,
                            const CZodEVIArtParam& texts, std::string quantityKey, std::string designation,
                            std::string description, const std::optional<std::string>& category,
                            const std::string& groupKey, CZodEVIGroup& group)
{
    auto article = std::make_unique<CZodEVIArticle>();
    article->number = bdr.TakeNextNumber();
    article->code = bdr.NewCode(target.CodePrefix(texts), &group);
    article->nature = tmpl.nature;
    article->designation = std::move(designation);
    article->unit = tmpl.unit;
    article->quantityKey = std::move(quantityKey);
    article->description = std::move(description);
    article->groupKey = groupKey;
    article->treePath = MakeTreePath(category ? *category : target.DefaultCategory(texts, tmpl.nature), article->code,
                                     article->designation);
    article->metreInt4 = 0;
    CZodEVIArticle* added = bdr.AddArticle(std::move(article));
    group.push_back(added);
    return added;
}

bool Instantiate(CZodEVIBdr& bdr, const CZodEVIArtTemplate& tmpl, const Target& target, const Fill& fill,
                 const std::string& groupKey, CZodEVIGroup& group, bool newGroup)
{
    std::string key = MakeQuantityKey(FormatPattern(tmpl.codePattern, fill.key));
    if (bdr.FindInGroupByQuantityKey(key, &group))
        return false;
    const CZodEVIArtParam* texts = target.Texts(tmpl);
    if (texts == nullptr)
        return false;
    std::optional<std::string> category;
    if (!newGroup)
        category = FamilyCategory(tmpl.codePattern, group);
    MakeArticle(bdr, tmpl, target, *texts, std::move(key), FormatPattern(texts->designation, fill.texts),
                FormatPattern(texts->description, fill.texts), category, groupKey, group);
    return true;
}

// Removes the family members of the group whose key no kept entry forms. sampleLength,
// when given, is the length a member's key must have.
bool Purge(CZodEVIBdr& bdr, const CZodEVIArtTemplate& tmpl, CZodEVIGroup& group,
           const std::vector<std::vector<PatternArg>>& keptEntries, std::optional<std::size_t> sampleLength)
{
    const auto pieces = SplitPattern(tmpl.codePattern);
    if (!pieces || !HasPlaceholder(*pieces))
        return false; // a pattern without placeholder has no family to purge
    std::unordered_set<std::string> kept;
    for (const auto& entry : keptEntries)
        kept.insert(FoldCase(MakeQuantityKey(FormatPattern(tmpl.codePattern, entry))));

    std::vector<const CZodEVIArticle*> victims;
    for (const CZodEVIArticle* article : FamilyMembers(group, tmpl.codePattern, *pieces)) {
        const std::string_view key = article->quantityKey;
        if (sampleLength && key.size() != *sampleLength)
            continue;
        if (kept.count(FoldCase(key)) == 0)
            victims.push_back(article);
    }
    return bdr.RemoveArticles(victims) != 0;
}

std::size_t SampleLength(const CZodEVIArtTemplate& tmpl, const std::vector<PatternArg>& zeros)
{
    return MakeQuantityKey(FormatPattern(tmpl.codePattern, zeros)).size();
}

} // namespace

bool KeyFitsPattern(std::string_view codePattern, std::string_view quantityKey)
{
    const auto pieces = SplitPattern(codePattern);
    return pieces && Fits(*pieces, quantityKey);
}

bool InstantiateByName(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName,
                       const CZodEVIArtTemplate& tmpl, const std::string& name, const std::string& groupKey,
                       CZodEVIGroup& group, bool newGroup)
{
    return Instantiate(bdr, tmpl, NetworkTarget(networkIndex, networkName), NameFill(name), groupKey, group, newGroup);
}

bool InstantiateByValue(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName,
                        const CZodEVIArtTemplate& tmpl, double value, const std::string& groupKey, CZodEVIGroup& group,
                        bool newGroup)
{
    return Instantiate(bdr, tmpl, NetworkTarget(networkIndex, networkName), ValueFill(value), groupKey, group,
                       newGroup);
}

bool InstantiateByValues(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName,
                         const CZodEVIArtTemplate& tmpl, double lower, double upper, const std::string& groupKey,
                         CZodEVIGroup& group, bool newGroup)
{
    return Instantiate(bdr, tmpl, NetworkTarget(networkIndex, networkName), PairFill(lower, upper), groupKey, group,
                       newGroup);
}

bool InstantiateSingleByName(CZodEVIBdr& bdr, const CZodEVIArtTemplate& tmpl, const std::string& name,
                             const std::string& groupKey, CZodEVIGroup& group, bool newGroup)
{
    return Instantiate(bdr, tmpl, SingleTarget(), NameFill(name), groupKey, group, newGroup);
}

bool InstantiateSingleByValue(CZodEVIBdr& bdr, const CZodEVIArtTemplate& tmpl, double value,
                              const std::string& groupKey, CZodEVIGroup& group, bool newGroup)
{
    return Instantiate(bdr, tmpl, SingleTarget(), ValueFill(value), groupKey, group, newGroup);
}

bool InstantiateSingleByValues(CZodEVIBdr& bdr, const CZodEVIArtTemplate& tmpl, double lower, double upper,
                               const std::string& groupKey, CZodEVIGroup& group, bool newGroup)
{
    return Instantiate(bdr, tmpl, SingleTarget(), PairFill(lower, upper), groupKey, group, newGroup);
}

bool PurgeByNames(CZodEVIBdr& bdr, const std::vector<std::string>& names, const CZodEVIArtTemplate& tmpl,
                  CZodEVIGroup& group)
{
    std::vector<std::vector<PatternArg>> kept;
    for (const std::string& name : names)
        kept.push_back({name});
    return Purge(bdr, tmpl, group, kept, std::nullopt);
}

bool PurgeByValues(CZodEVIBdr& bdr, const CZodEVIValueArray<double>& values, const CZodEVIArtTemplate& tmpl,
                   CZodEVIGroup& group)
{
    std::vector<std::vector<PatternArg>> kept;
    for (double value : values)
        kept.push_back({value});
    return Purge(bdr, tmpl, group, kept, SampleLength(tmpl, {0.0}));
}

bool PurgeByValuePairs(CZodEVIBdr& bdr, const std::vector<std::pair<double, double>>& pairs,
                       const CZodEVIArtTemplate& tmpl, CZodEVIGroup& group)
{
    std::vector<std::vector<PatternArg>> kept;
    for (const auto& [lower, upper] : pairs)
        kept.push_back({lower, upper});
    return Purge(bdr, tmpl, group, kept, SampleLength(tmpl, {0.0, 0.0}));
}

std::vector<std::pair<double, double>> ConsecutivePairs(const CZodEVIValueArray<double>& bounds)
{
    std::vector<std::pair<double, double>> pairs;
    for (int i = 1; i < bounds.GetSize(); ++i)
        pairs.emplace_back(bounds[i - 1], bounds[i]);
    return pairs;
}

std::vector<const CZodEVIArtTemplate*> TemplatesOfKind(const CZodEVIBdr& bdr, int kind)
{
    CZodEVIArtTemplateArray selection;
    selection.SetOwning(false);
    bdr.Catalogue().SelectKind(kind, selection);
    std::vector<const CZodEVIArtTemplate*> templates;
    for (int i = 0; i < selection.GetSize(); ++i)
        templates.push_back(selection[i]);
    return templates;
}

bool InstantiateFixed(CZodEVIBdr& bdr, int networkIndex, const std::string& networkName, const CZodEVIArtTemplate& tmpl,
                      const std::string& groupKey, CZodEVIGroup& group)
{
    const Target target = NetworkTarget(networkIndex, networkName);
    const CZodEVIArtParam* texts = target.Texts(tmpl);
    if (texts == nullptr)
        return false;
    MakeArticle(bdr, tmpl, target, *texts, MakeQuantityKey(tmpl.codePattern), texts->designation, texts->description,
                std::nullopt, groupKey, group);
    return true;
}

} // namespace zodevi
