// Reading and writing the price-schedule XML file: every field by name, reals in their
// shortest exact form, all-or-nothing reads and atomic writes with a backup.
#include "schedule_file.hpp"

#include "text/text.hpp"
#include "velhost/editor.h"
#include "velhost/files.h"

#include <pugixml.hpp>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include <algorithm>
#include <bit>
#include <cerrno>
#include <charconv>
#include <climits>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <unordered_map>

namespace metre {

namespace {

int LineOfOffset(std::string_view text, std::ptrdiff_t offset)
{
    if (offset < 0)
        return 1;
    const std::size_t end = std::min<std::size_t>(static_cast<std::size_t>(offset), text.size());
    int line = 1;
    for (std::size_t i = 0; i < end; ++i)
        if (text[i] == '\n')
            ++line;
    return line;
}

std::string ParseProblem(const pugi::xml_parse_result& result)
{
    switch (result.status) {
    case pugi::status_no_document_element:
        return "aucun élément XML";
    case pugi::status_bad_start_element:
    case pugi::status_bad_end_element:
        return "balise mal formée";
    case pugi::status_end_element_mismatch:
        return "balise de fin qui ne ferme pas l'élément ouvert";
    case pugi::status_unrecognized_tag:
        return "balise inconnue";
    case pugi::status_bad_attribute:
        return "attribut mal formé";
    case pugi::status_bad_pcdata:
    case pugi::status_bad_cdata:
    case pugi::status_bad_comment:
    case pugi::status_bad_pi:
    case pugi::status_bad_doctype:
        return "texte ou commentaire mal formé";
    case pugi::status_append_invalid_root:
        return "plusieurs éléments racine";
    default:
        return FormatString("XML illisible (%s)", result.description());
    }
}

const std::unordered_map<std::string_view, std::size_t>& FieldIndex()
{
    static const std::unordered_map<std::string_view, std::size_t> index = [] {
        std::unordered_map<std::string_view, std::size_t> map;
        const auto& fields = ArticleFields();
        for (std::size_t i = 0; i < fields.size(); ++i)
            map.emplace(fields[i].name, i);
        return map;
    }();
    return index;
}

// A field name as two words, zero after its NUL, and the masks of its bytes with the
// NUL: a name read as two words matches when its masked words are these.
struct PackedName {
    std::uint64_t word[2] = {};
    std::uint64_t mask[2] = {};
    bool fits = false; // the name and its NUL take at most 16 bytes
};

const std::array<PackedName, 48>& PackedNames()
{
    static const std::array<PackedName, 48> packed = [] {
        std::array<PackedName, 48> all{};
        for (std::size_t i = 0; i < all.size(); ++i) {
            const char* name = ArticleFields()[i].name;
            unsigned char bytes[16] = {};
            unsigned char mask[16] = {};
            const std::size_t length = std::min<std::size_t>(std::strlen(name), 15);
            all[i].fits = std::strlen(name) <= 15;
            std::memcpy(bytes, name, length);
            std::memset(mask, 0xFF, length + 1);
            std::memcpy(all[i].word, bytes, 16);
            std::memcpy(all[i].mask, mask, 16);
        }
        return all;
    }();
    return packed;
}

// The field of an attribute name: the next field in file order is tried first, since
// files come with the fields in their order, comparing two words at once where the
// parsed text lets them be read; any other name goes through the table.
inline std::size_t FieldOf(const char* name, std::size_t expected, std::string_view parsed,
                           const std::array<CZodEVIArticleField, 48>& fields, const std::array<PackedName, 48>& names)
{
    if (expected < fields.size()) {
        const PackedName& packed = names[expected];
        const auto at = reinterpret_cast<std::uintptr_t>(name);
        const auto begin = reinterpret_cast<std::uintptr_t>(parsed.data());
        if (packed.fits && at >= begin && at - begin + 16 <= parsed.size()) {
            std::uint64_t word[2];
            std::memcpy(word, name, 16);
            if ((word[0] & packed.mask[0]) == packed.word[0] && (word[1] & packed.mask[1]) == packed.word[1])
                return expected;
        } else if (std::strcmp(name, fields[expected].name) == 0) {
            return expected;
        }
    }
    const auto& index = FieldIndex();
    const auto found = index.find(name);
    return found == index.end() ? fields.size() : found->second;
}

// Digits only, with an optional minus: the form of nearly every number in a file, read
// without from_chars. Anything else answers false and takes the general path.
bool ReadPlainInteger(std::string_view text, bool& negative, std::uint64_t& value, std::size_t maxDigits)
{
    negative = !text.empty() && text.front() == '-';
    if (negative)
        text.remove_prefix(1);
    if (text.empty() || text.size() > maxDigits)
        return false;
    value = 0;
    for (const char c : text) {
        if (c < '0' || c > '9')
            return false;
        value = value * 10 + static_cast<unsigned>(c - '0');
    }
    return true;
}

// "digits.digits" with at most 15 digits in all, optionally negative: the digits as a
// whole number divided by a power of ten. Both are exact as doubles and a division is
// rounded correctly, so this is the double from_chars reads. Anything else answers false.
bool ReadPlainDecimal(std::string_view text, double& out)
{
    static constexpr double kPowers[] = {1e0, 1e1, 1e2,  1e3,  1e4,  1e5,  1e6,  1e7,
                                         1e8, 1e9, 1e10, 1e11, 1e12, 1e13, 1e14, 1e15};
    const std::size_t point = text.find('.');
    if (point == std::string_view::npos || point + 1 == text.size())
        return false;
    bool negative = false;
    std::uint64_t whole = 0;
    std::uint64_t fraction = 0;
    const std::string_view wholeText = text.substr(0, point);
    const std::string_view fractionText = text.substr(point + 1);
    if (fractionText.front() == '-' || !ReadPlainInteger(fractionText, negative, fraction, 15))
        return false;
    if (wholeText.empty() || wholeText == "-")
        return false;
    if (!ReadPlainInteger(wholeText, negative, whole, 15) ||
        wholeText.size() - (negative ? 1 : 0) + fractionText.size() > 15)
        return false;
    const double magnitude =
        static_cast<double>(whole * static_cast<std::uint64_t>(kPowers[fractionText.size()]) + fraction) /
        kPowers[fractionText.size()];
    out = negative ? -magnitude : magnitude;
    return true;
}

// A real that is not a whole number of at most 15 digits: the decimal fast path, then
// from_chars, then SetFieldText. Kept out of line so that the common cases stay light.
[[gnu::noinline]] bool SetRealValue(CZodEVIArticle& article, const CZodEVIArticleField& field, std::string_view value)
{
    if (ReadPlainDecimal(value, article.*field.real))
        return true;
    // Whatever from_chars reads whole, ParseReal reads the same.
    if (!value.empty()) {
        double real = 0;
        const char* end = value.data() + value.size();
        const auto result = std::from_chars(value.data(), end, real);
        if (result.ec == std::errc() && result.ptr == end) {
            article.*field.real = real;
            return true;
        }
    }
    return SetFieldText(article, field, value);
}

[[gnu::noinline]] bool SetOtherValue(CZodEVIArticle& article, const CZodEVIArticleField& field, std::string_view value)
{
    return SetFieldText(article, field, value);
}

// SetFieldText for a value of the file, with the common forms read directly; the rules
// stay those of SetFieldText, which takes every other case.
inline bool SetFieldValue(CZodEVIArticle& article, const CZodEVIArticleField& field, std::string_view value)
{
    bool negative = false;
    std::uint64_t n = 0;
    switch (field.type) {
    case CZodEVIArticleField::Type::Text:
        // Most texts of a file are empty, and a field is read once, still empty.
        if (!value.empty())
            (article.*field.text).assign(value.data(), value.size());
        return true;
    case CZodEVIArticleField::Type::Real:
        // Up to 15 digits a whole number is exact as a double; "-0" stays negative.
        if (ReadPlainInteger(value, negative, n, 15)) {
            article.*field.real = negative ? -static_cast<double>(n) : static_cast<double>(n);
            return true;
        }
        return SetRealValue(article, field, value);
    case CZodEVIArticleField::Type::Int:
        if (ReadPlainInteger(value, negative, n, 9)) {
            article.*field.integer = negative ? -static_cast<int>(n) : static_cast<int>(n);
            return true;
        }
        break;
    }
    return SetOtherValue(article, field, value);
}

// Longest text a real or an integer field takes.
constexpr std::size_t kNumberRoom = 40;

// FormatRealShortest's text without printf or the locale. Its "%g", taken when exact
// and without exponent, only occurs between 1e-4 and 1e6, where a double holds at most
// one decimal of six digits: it is then the shortest exact text too. So the shortest
// form alone gives the same bytes (fixed for ordinary magnitudes).
char* WriteReal(char* out, double value)
{
    const double magnitude = std::fabs(value);
    const bool fixed = magnitude >= 1e-5 && magnitude < 1e17;
    return (fixed ? std::to_chars(out, out + kNumberRoom, value, std::chars_format::fixed)
                  : std::to_chars(out, out + kNumberRoom, value))
        .ptr;
}

// The schedule's text as pugixml would save the document of its articles (indented by
// two spaces, self-closed elements, the attribute escapes below), written straight into
// one buffer instead of a document that is then serialised.
class ScheduleWriter {
public:
    explicit ScheduleWriter(std::size_t expected)
        : text_(std::make_unique_for_overwrite<char[]>(expected)), capacity_(expected)
    {}

    void Article(const CZodEVIArticle& article)
    {
        std::size_t room = kArticleOverhead;
        for (const CZodEVIArticleField& field : ArticleFields())
            if (field.type == CZodEVIArticleField::Type::Text)
                room += (article.*field.text).size() * kWorstEscape;
        char* p = Room(room);
        p = Put(p, "  <article");
        const auto& fields = ArticleFields();
        for (std::size_t i = 0; i < fields.size(); ++i) {
            const CZodEVIArticleField& field = fields[i];
            p = Put(p, kOpenings[i]);
            switch (field.type) {
            case CZodEVIArticleField::Type::Text:
                p = PutEscaped(p, article.*field.text);
                break;
            case CZodEVIArticleField::Type::Real:
                p = WriteReal(p, article.*field.real);
                break;
            case CZodEVIArticleField::Type::Int:
                p = std::to_chars(p, p + kNumberRoom, article.*field.integer).ptr;
                break;
            }
            *p++ = '"';
        }
        p = Put(p, " />\n");
        Commit(p);
    }

    void Raw(std::string_view text) { Commit(Put(Room(text.size()), text)); }

    std::string_view Text() const { return {text_.get(), used_}; }

private:
    // Every escape below is at most six bytes for one.
    static constexpr std::size_t kWorstEscape = 6;
    static std::size_t Overhead()
    {
        std::size_t room = 16;
        for (const CZodEVIArticleField& field : ArticleFields())
            room += std::strlen(field.name) + 4 + kNumberRoom;
        return room;
    }
    inline static const std::size_t kArticleOverhead = Overhead();
    // ' name="' of each field.
    inline static const std::array<std::string, 48> kOpenings = [] {
        std::array<std::string, 48> openings;
        for (std::size_t i = 0; i < openings.size(); ++i)
            openings[i] = std::string(" ") + ArticleFields()[i].name + "=\"";
        return openings;
    }();

    // At least `room` writable bytes at the end of the text; the buffer is not zeroed.
    char* Room(std::size_t room)
    {
        if (capacity_ - used_ < room) {
            capacity_ = std::max(capacity_ * 2, used_ + room);
            auto larger = std::make_unique_for_overwrite<char[]>(capacity_);
            std::memcpy(larger.get(), text_.get(), used_);
            text_ = std::move(larger);
        }
        return text_.get() + used_;
    }
    void Commit(const char* end) { used_ = static_cast<std::size_t>(end - text_.get()); }

    static char* Put(char* p, std::string_view text)
    {
        std::memcpy(p, text.data(), text.size());
        return p + text.size();
    }

    // pugixml's escapes in a double-quoted attribute: & < " and the control characters,
    // these as two-digit references; > and ' stay. The value ends at a NUL, as the
    // document's copy of c_str() did.
    static char* PutEscaped(char* p, const std::string& text)
    {
        const char* s = text.c_str();
        for (;;) {
            const char* plain = s;
            while (!IsSpecial(*s))
                ++s;
            p = Put(p, std::string_view(plain, static_cast<std::size_t>(s - plain)));
            const auto c = static_cast<unsigned char>(*s++);
            switch (c) {
            case '\0':
                return p;
            case '&':
                p = Put(p, "&amp;");
                break;
            case '<':
                p = Put(p, "&lt;");
                break;
            case '"':
                p = Put(p, "&quot;");
                break;
            default:
                p = Put(p, "&#");
                *p++ = static_cast<char>('0' + c / 10);
                *p++ = static_cast<char>('0' + c % 10);
                *p++ = ';';
                break;
            }
        }
    }
    static bool IsSpecial(char c)
    {
        const auto u = static_cast<unsigned char>(c);
        return u < 32 || u == '&' || u == '<' || u == '"';
    }

    std::unique_ptr<char[]> text_;
    std::size_t capacity_ = 0;
    std::size_t used_ = 0;
};

// The whole text of the file for these articles.
ScheduleWriter WriteSchedule(const std::vector<const CZodEVIArticle*>& articles)
{
    // Without escapes the text is about the sum of the fields: enough room, known ahead.
    std::size_t expected = 64;
    for (const CZodEVIArticle* article : articles) {
        if (article == nullptr)
            continue;
        expected += 1024;
        for (const CZodEVIArticleField& field : ArticleFields())
            if (field.type == CZodEVIArticleField::Type::Text)
                expected += (article->*field.text).size();
    }
    ScheduleWriter writer(expected);
    writer.Raw("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n");
    if (std::none_of(articles.begin(), articles.end(), [](const CZodEVIArticle* a) { return a != nullptr; })) {
        writer.Raw(FormatString("<%s />\n", kScheduleRoot));
        return writer;
    }
    writer.Raw(FormatString("<%s>\n", kScheduleRoot));
    for (const CZodEVIArticle* article : articles)
        if (article != nullptr)
            writer.Article(*article);
    writer.Raw(FormatString("</%s>\n", kScheduleRoot));
    return writer;
}

std::string ErrnoText(int error)
{
    return std::strerror(error);
}

} // namespace

bool SetFieldText(CZodEVIArticle& article, const CZodEVIArticleField& field, std::string_view text)
{
    switch (field.type) {
    case CZodEVIArticleField::Type::Text:
        article.*field.text = std::string(text);
        return true;
    case CZodEVIArticleField::Type::Real: {
        const auto value = ParseReal(text);
        if (!value)
            return false;
        article.*field.real = *value;
        return true;
    }
    case CZodEVIArticleField::Type::Int: {
        const auto value = ParseInt(text);
        if (!value || *value < INT_MIN || *value > INT_MAX)
            return false;
        article.*field.integer = static_cast<int>(*value);
        return true;
    }
    }
    return false;
}

std::string FieldText(const CZodEVIArticle& article, const CZodEVIArticleField& field)
{
    switch (field.type) {
    case CZodEVIArticleField::Type::Text:
        return article.*field.text;
    case CZodEVIArticleField::Type::Real:
        return FormatRealShortest(article.*field.real);
    case CZodEVIArticleField::Type::Int:
        return FormatInt(article.*field.integer);
    }
    return {};
}

namespace {

// The schedule as this module writes it, read straight from the text without a document
// in between: the declaration, the root, self-closed <article> elements whose attributes
// are known fields in double quotes, the escapes the writer makes, whitespace between.
// Whatever else a file holds (comments, other escapes or quotes, any fault) makes it
// answer false with `out` untouched, and the document reader takes the file, with its
// messages. Where it answers true, the articles are those the document reader makes.
class DirectReader {
public:
    explicit DirectReader(std::string_view text)
        : p_(text.data()), end_(text.data() + text.size()), openings_(Openings())
    {}

    bool Read(ArticleVector& out)
    {
        if (!Take(kDeclaration))
            return false;
        SkipSpace();
        if (!Take("<bordereau"))
            return false;
        ArticleVector read;
        if (Take(">")) {
            for (;;) {
                SkipSpace();
                if (Take("</bordereau>"))
                    break;
                if (!Take("<article") || p_ == end_ || !IsSpace(*p_))
                    return false;
                read.push_back(std::make_unique<CZodEVIArticle>());
                if (!Attributes(*read.back()))
                    return false;
            }
        } else {
            SkipSpace();
            if (!Take("/>"))
                return false;
        }
        SkipSpace();
        if (p_ != end_)
            return false;
        out.reserve(out.size() + read.size());
        out.insert(out.end(), std::make_move_iterator(read.begin()), std::make_move_iterator(read.end()));
        return true;
    }

private:
    static constexpr char kDeclaration[] = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>";

    // ' name="' of a field as two words and the masks of its bytes, so that the field
    // expected next is recognised by two comparisons.
    struct Opening {
        std::uint64_t word[2] = {};
        std::uint64_t mask[2] = {};
        std::size_t length = 0;
    };
    static const std::array<Opening, 48>& Openings()
    {
        static const std::array<Opening, 48> openings = [] {
            std::array<Opening, 48> all{};
            for (std::size_t i = 0; i < all.size(); ++i) {
                const std::string text = std::string(ArticleFields()[i].name) + "=\"";
                unsigned char bytes[16] = {};
                unsigned char mask[16] = {};
                all[i].length = std::min<std::size_t>(text.size(), 16);
                std::memcpy(bytes, text.data(), all[i].length);
                std::memset(mask, 0xFF, all[i].length);
                std::memcpy(all[i].word, bytes, 16);
                std::memcpy(all[i].mask, mask, 16);
                // A longer name is never taken on the quick path.
                if (text.size() > 16)
                    all[i].length = 0;
            }
            return all;
        }();
        return openings;
    }

    static bool IsSpace(char c) { return c == ' ' || c == '\n' || c == '\r' || c == '\t'; }
    // The characters of a name as the document reader scans it.
    static bool IsNameStart(char c)
    {
        const auto u = static_cast<unsigned char>(c);
        return (u >= 'a' && u <= 'z') || (u >= 'A' && u <= 'Z') || u == '_' || u == ':' || u >= 128;
    }
    static bool IsNameChar(char c) { return IsNameStart(c) || (c >= '0' && c <= '9') || c == '-' || c == '.'; }

    void SkipSpace()
    {
        const char* p = p_;
        while (p != end_ && IsSpace(*p))
            ++p;
        p_ = p;
    }
    // A literal: its length is known here, so that the comparison is a few instructions.
    template <std::size_t N>
    bool Take(const char (&text)[N])
    {
        constexpr std::size_t length = N - 1;
        if (static_cast<std::size_t>(end_ - p_) < length || std::memcmp(p_, text, length) != 0)
            return false;
        p_ += length;
        return true;
    }

    // The field whose ' name="' starts here, past it; fields.size() for any other text.
    std::size_t Field(std::size_t expected)
    {
        if (expected < openings_.size() && end_ - p_ >= 16) {
            const Opening& opening = openings_[expected];
            std::uint64_t word[2];
            std::memcpy(word, p_, 16);
            if (opening.length != 0 && (word[0] & opening.mask[0]) == opening.word[0] &&
                (word[1] & opening.mask[1]) == opening.word[1]) {
                p_ += opening.length;
                return expected;
            }
        }
        const char* start = p_;
        if (p_ == end_ || !IsNameStart(*p_))
            return openings_.size();
        while (p_ != end_ && IsNameChar(*p_))
            ++p_;
        const std::string_view name(start, static_cast<std::size_t>(p_ - start));
        if (!Take("=\""))
            return openings_.size();
        const auto found = FieldIndex().find(name);
        return found == FieldIndex().end() ? openings_.size() : found->second;
    }

    // The first '"', '&' or NUL from p on, or end: sixteen bytes at a time where the
    // processor compares vectors, then eight at a time, the bytes equal to one of them
    // found as the zero bytes of a word.
    static const char* Special(const char* p, const char* end)
    {
#if defined(__SSE2__)
        const __m128i quote = _mm_set1_epi8('"');
        const __m128i ampersand = _mm_set1_epi8('&');
        const __m128i nul = _mm_setzero_si128();
        for (; end - p >= 16; p += 16) {
            const __m128i bytes = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p));
            const __m128i found =
                _mm_or_si128(_mm_or_si128(_mm_cmpeq_epi8(bytes, quote), _mm_cmpeq_epi8(bytes, ampersand)),
                             _mm_cmpeq_epi8(bytes, nul));
            if (const auto mask = static_cast<unsigned>(_mm_movemask_epi8(found)))
                return p + std::countr_zero(mask);
        }
#endif
        constexpr std::uint64_t kOnes = 0x0101010101010101ULL;
        constexpr std::uint64_t kHighs = 0x8080808080808080ULL;
        const auto zeroes = [](std::uint64_t w) { return (w - kOnes) & ~w & kHighs; };
        for (; end - p >= 8; p += 8) {
            std::uint64_t w;
            std::memcpy(&w, p, 8);
            // The lowest flagged byte is always a true one: the order of a little-endian word.
            if (const std::uint64_t found = zeroes(w) | zeroes(w ^ (kOnes * '"')) | zeroes(w ^ (kOnes * '&')))
                return p + std::countr_zero(found) / 8;
        }
        while (p != end && *p != '"' && *p != '&' && *p != '\0')
            ++p;
        return p;
    }

    // The value up to its closing quote, past it, its escapes replaced; false for a value
    // the writer does not make.
    bool Value(std::string_view& value)
    {
        const char* start = p_;
        p_ = Special(p_, end_);
        if (p_ != end_ && *p_ == '"') {
            value = std::string_view(start, static_cast<std::size_t>(p_++ - start));
            return true;
        }
        scratch_.assign(start, p_);
        for (;;) {
            if (p_ == end_ || *p_ == '\0')
                return false;
            if (*p_ == '"') {
                ++p_;
                value = scratch_;
                return true;
            }
            if (!Escape())
                return false;
            start = p_;
            p_ = Special(p_, end_);
            scratch_.append(start, p_);
        }
    }

    // One escape at '&' onto the scratch text: the named ones, and a character reference
    // of one to three decimal digits for an ASCII character other than NUL (the control
    // characters the writer escapes).
    bool Escape()
    {
        if (Take("&#")) {
            unsigned code = 0;
            int digits = 0;
            for (; p_ != end_ && *p_ >= '0' && *p_ <= '9' && digits < 3; ++p_, ++digits)
                code = code * 10 + static_cast<unsigned>(*p_ - '0');
            if (digits == 0 || !Take(";") || code == 0 || code > 127)
                return false;
            scratch_ += static_cast<char>(code);
            return true;
        }
        const char c = Take("&quot;")   ? '"'
                       : Take("&amp;")  ? '&'
                       : Take("&lt;")   ? '<'
                       : Take("&gt;")   ? '>'
                       : Take("&apos;") ? '\''
                                        : '\0';
        if (c == '\0')
            return false;
        scratch_ += c;
        return true;
    }

    // From the whitespace after "<article" to past its "/>".
    bool Attributes(CZodEVIArticle& article)
    {
        const auto& fields = ArticleFields();
        std::uint64_t seen = 0;
        std::size_t expected = 0;
        for (;;) {
            SkipSpace();
            if (p_ != end_ && *p_ == '/')
                return Take("/>");
            const std::size_t position = Field(expected);
            if (position == fields.size() || (seen & (std::uint64_t{1} << position)) != 0)
                return false;
            seen |= std::uint64_t{1} << position;
            std::string_view value;
            if (!Value(value) || !SetFieldValue(article, fields[position], value))
                return false;
            expected = position + 1;
            // The next attribute or the end, never glued to the quote.
            if (p_ == end_ || (!IsSpace(*p_) && *p_ != '/'))
                return false;
        }
    }

    const char* p_;
    const char* const end_;
    const std::array<Opening, 48>& openings_;
    std::string scratch_;
};

// Parses `buffer` in place (pugixml writes into it) and appends its articles to `out`
// when all of it reads. Messages count lines in `text`, the buffer as it was.
VelReadResult ParseArticles(char* buffer, std::size_t size, std::string_view text, const std::string& name,
                            ArticleVector& out)
{
    pugi::xml_document document;
    const pugi::xml_parse_result parsed =
        document.load_buffer_inplace(buffer, size, pugi::parse_minimal | pugi::parse_escapes);
    if (!parsed) {
        const int line = LineOfOffset(text, parsed.offset);
        return VelReadResult::Malformed(
            name, line, "du XML bien formé",
            FormatString("Bordereau « %s », ligne %d : %s.", name.c_str(), line, ParseProblem(parsed).c_str()));
    }
    const pugi::xml_node root = document.document_element();
    if (std::strcmp(root.name(), kScheduleRoot) != 0) {
        const int line = LineOfOffset(text, root.offset_debug());
        return VelReadResult::Malformed(
            name, line, FormatString("l'élément racine <%s>", kScheduleRoot),
            FormatString("Bordereau « %s », ligne %d : élément racine <%s> attendu, <%s> trouvé ; "
                         "ce fichier n'est pas un bordereau.",
                         name.c_str(), line, kScheduleRoot, root.name()));
    }
    // Articles past the end of the root would be lost at the next write.
    if (const pugi::xml_node other = root.next_sibling()) {
        const int line = LineOfOffset(text, other.offset_debug());
        return VelReadResult::Malformed(name, line, FormatString("la fin du fichier après </%s>", kScheduleRoot),
                                        FormatString("Bordereau « %s », ligne %d : élément <%s> après la fin de <%s> ; "
                                                     "un bordereau n'a qu'un élément racine.",
                                                     name.c_str(), line, other.name(), kScheduleRoot));
    }
    const auto& fields = ArticleFields();
    const auto& packedNames = PackedNames();
    const std::string_view parsedText(buffer, size);
    ArticleVector read;
    for (pugi::xml_node node = root.first_child(); node; node = node.next_sibling()) {
        // Counting lines is only worth it for a message: it would make reading quadratic.
        const auto lineOf = [&] { return LineOfOffset(text, node.offset_debug()); };
        if (node.type() != pugi::node_element || std::strcmp(node.name(), kScheduleArticle) != 0) {
            const int line = lineOf();
            return VelReadResult::Malformed(
                name, line, FormatString("un élément <%s>", kScheduleArticle),
                FormatString("Bordereau « %s », ligne %d : élément <%s> attendu, %s trouvé.", name.c_str(), line,
                             kScheduleArticle,
                             node.type() == pugi::node_element ? FormatString("<%s>", node.name()).c_str()
                                                               : "du texte"));
        }
        auto article = std::make_unique<CZodEVIArticle>();
        std::uint64_t seen = 0;
        std::size_t expected = 0;
        // An attribute's name is never empty, so the empty name that pugixml gives past the
        // last one ends the walk without one more call per attribute.
        for (pugi::xml_attribute attribute = node.first_attribute();; attribute = attribute.next_attribute()) {
            const char* attributeName = attribute.name();
            if (*attributeName == '\0')
                break;
            const std::size_t position = FieldOf(attributeName, expected, parsedText, fields, packedNames);
            if (position == fields.size()) {
                const int line = lineOf();
                return VelReadResult::Malformed(
                    name, line, "un champ d'article connu",
                    FormatString("Bordereau « %s », ligne %d : article %zu, champ inconnu « %s ».", name.c_str(), line,
                                 read.size() + 1, attributeName));
            }
            if (seen & (std::uint64_t{1} << position)) {
                const int line = lineOf();
                return VelReadResult::Malformed(
                    name, line, "chaque champ une seule fois",
                    FormatString("Bordereau « %s », ligne %d : article %zu, champ « %s » en double.", name.c_str(),
                                 line, read.size() + 1, attribute.name()));
            }
            seen |= std::uint64_t{1} << position;
            if (!SetFieldValue(*article, fields[position], attribute.value())) {
                const int line = lineOf();
                const char* kind = fields[position].type == CZodEVIArticleField::Type::Int ? "nombre entier" : "nombre";
                return VelReadResult::Malformed(
                    name, line, std::string("un ") + kind,
                    FormatString("Bordereau « %s », ligne %d : article %zu, champ « %s » : %s attendu, « %s » trouvé.",
                                 name.c_str(), line, read.size() + 1, attribute.name(), kind, attribute.value()));
            }
            expected = position + 1;
        }
        if (node.first_child()) {
            const int line = LineOfOffset(text, node.first_child().offset_debug());
            return VelReadResult::Malformed(
                name, line, FormatString("un élément <%s> vide", kScheduleArticle),
                FormatString("Bordereau « %s », ligne %d : article %zu, contenu inattendu dans <%s>.", name.c_str(),
                             line, read.size() + 1, kScheduleArticle));
        }
        read.push_back(std::move(article));
    }
    out.reserve(out.size() + read.size());
    out.insert(out.end(), std::make_move_iterator(read.begin()), std::make_move_iterator(read.end()));
    return {};
}

// The articles of the text in `buffer`: read directly when it is as the writer makes it,
// otherwise parsed in place by pugixml (see ParseArticles).
VelReadResult ReadArticles(char* buffer, std::size_t size, std::string_view text, const std::string& name,
                           ArticleVector& out)
{
    if (DirectReader(std::string_view(buffer, size)).Read(out))
        return {};
    return ParseArticles(buffer, size, text, name, out);
}

// The whole file in one piece, through the host, which keeps the identity of the bytes
// read for the caller of this module.
VelReadResult ReadWholeFile(const std::string& path, VelFileContent& content)
{
    std::error_code error;
    if (!std::filesystem::exists(path, error))
        return VelReadResult::Failed(VelReadStatus::kNotFound, path, ENOENT,
                                     FormatString("Bordereau « %s » : fichier introuvable.", path.c_str()));
    if (std::filesystem::is_directory(path, error))
        return VelReadResult::Failed(
            VelReadStatus::kNotAFile, path, 0,
            FormatString("Bordereau « %s » : c'est un dossier, pas un fichier.", path.c_str()));
    content = velReadFile(path);
    if (!content.opened)
        return VelReadResult::Failed(VelReadStatus::kCannotOpen, path, content.error,
                                     FormatString("Bordereau « %s » : ouverture impossible (%s).", path.c_str(),
                                                  ErrnoText(content.error).c_str()));
    // Only a regular file has a size to read.
    if (!content.identity.readable)
        return VelReadResult::Failed(VelReadStatus::kCannotRead, path, 0,
                                     FormatString("Bordereau « %s » : lecture impossible.", path.c_str()));
    return {};
}

} // namespace

bool ReadScheduleDirectly(std::string_view text, ArticleVector& out)
{
    return DirectReader(text).Read(out);
}

VelReadResult ReadScheduleDocument(std::string_view text, const std::string& name, ArticleVector& out)
{
    auto copy = std::make_unique_for_overwrite<char[]>(text.size() + 1);
    std::memcpy(copy.get(), text.data(), text.size());
    return ParseArticles(copy.get(), text.size(), text, name, out);
}

VelReadResult ReadScheduleText(std::string_view text, const std::string& name, ArticleVector& out)
{
    auto copy = std::make_unique_for_overwrite<char[]>(text.size() + 1);
    std::memcpy(copy.get(), text.data(), text.size());
    return ReadArticles(copy.get(), text.size(), text, name, out);
}

VelReadResult ReadScheduleFile(const std::string& path, ArticleVector& out)
{
    VelFileContent content;
    if (VelReadResult read = ReadWholeFile(path, content); !read)
        return read;
    if (ReadArticles(content.data.get(), content.size, std::string_view(content.data.get(), content.size), path, out))
        return {};
    // Parsing in place rewrote the text its lines were to be counted in: the message
    // comes from a second reading of the file, which errors alone pay for.
    if (VelReadResult read = ReadWholeFile(path, content); !read)
        return read;
    return ReadScheduleText(std::string_view(content.data.get(), content.size), path, out);
}

std::string ScheduleToXml(const std::vector<const CZodEVIArticle*>& articles)
{
    return std::string(WriteSchedule(articles).Text());
}

VelReadResult WriteFileAtomically(const std::string& path, std::string_view content, bool keepBackup)
{
    VelWriteOptions options;
    options.keepBackup = keepBackup;
    VelReadResult written = velWriteFileAtomically(path, content, options);
    if (!written)
        return written;
    if (!written.message.empty())
        acutPrintf("%s\n", written.message.c_str());
    return {};
}

VelReadResult WriteScheduleFile(const std::string& path, const std::vector<const CZodEVIArticle*>& articles)
{
    if (path.empty())
        return VelReadResult::Failed(VelReadStatus::kCannotWrite, path, 0,
                                     "Bordereau sans nom de fichier : rien n'est écrit.");
    // Another program holding the schedule's lock is checking or writing it.
    const VelFileLock lock(path);
    if (!lock.locked())
        return VelReadResult::Failed(VelReadStatus::kCannotWrite, path, lock.result().error,
                                     "Bordereau : " + lock.result().message);
    const ScheduleWriter text = WriteSchedule(articles);
    VelReadResult result = WriteFileAtomically(path, text.Text(), true);
    if (!result)
        result.message = "Bordereau : " + result.message;
    return result;
}

} // namespace metre
