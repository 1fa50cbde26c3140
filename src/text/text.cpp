// Locale-free formatting and parsing, UTF-8 case folding, sorting and joining.
#include "text/text.hpp"

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <clocale>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <locale.h>

namespace {

// The "C" locale, made once; formatting switches to it for the calling thread only.
locale_t CLocale()
{
    static locale_t c = newlocale(LC_ALL_MASK, "C", static_cast<locale_t>(nullptr));
    return c;
}

class CLocaleScope {
public:
    CLocaleScope() : previous_(uselocale(CLocale())) {}
    ~CLocaleScope() { uselocale(previous_); }
    CLocaleScope(const CLocaleScope&) = delete;
    CLocaleScope& operator=(const CLocaleScope&) = delete;

private:
    locale_t previous_;
};

// Decodes one code point at text[i]; advances i. Invalid bytes come back as
// 0x110000 + byte so that they sort after every character and never equal one.
char32_t NextCodePoint(std::string_view text, std::size_t& i)
{
    const auto b0 = static_cast<unsigned char>(text[i]);
    if (b0 < 0x80) {
        ++i;
        return b0;
    }
    int len = 0;
    char32_t cp = 0;
    char32_t min = 0;
    if ((b0 & 0xE0) == 0xC0) {
        len = 2;
        cp = b0 & 0x1F;
        min = 0x80;
    } else if ((b0 & 0xF0) == 0xE0) {
        len = 3;
        cp = b0 & 0x0F;
        min = 0x800;
    } else if ((b0 & 0xF8) == 0xF0) {
        len = 4;
        cp = b0 & 0x07;
        min = 0x10000;
    }
    if (len == 0 || i + len > text.size()) {
        ++i;
        return 0x110000 + b0;
    }
    for (int k = 1; k < len; ++k) {
        const auto b = static_cast<unsigned char>(text[i + k]);
        if ((b & 0xC0) != 0x80) {
            ++i;
            return 0x110000 + b0;
        }
        cp = (cp << 6) | (b & 0x3F);
    }
    if (cp < min || cp > 0x10FFFF || (cp >= 0xD800 && cp <= 0xDFFF)) {
        ++i;
        return 0x110000 + b0;
    }
    i += len;
    return cp;
}

char32_t FoldCodePoint(char32_t c)
{
    if (c >= 'A' && c <= 'Z')
        return c + 0x20;
    if (c >= 0xC0 && c <= 0xDE && c != 0xD7)
        return c + 0x20;
    switch (c) {
    case 0x0152:
        return 0x0153; // Œ
    case 0x0160:
        return 0x0161; // Š
    case 0x017D:
        return 0x017E; // Ž
    case 0x0178:
        return 0x00FF; // Ÿ
    default:
        return c;
    }
}

void AppendUtf8(std::string& out, char32_t c)
{
    if (c < 0x80) {
        out += static_cast<char>(c);
    } else if (c < 0x800) {
        out += static_cast<char>(0xC0 | (c >> 6));
        out += static_cast<char>(0x80 | (c & 0x3F));
    } else if (c < 0x10000) {
        out += static_cast<char>(0xE0 | (c >> 12));
        out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
        out += static_cast<char>(0x80 | (c & 0x3F));
    } else {
        out += static_cast<char>(0xF0 | (c >> 18));
        out += static_cast<char>(0x80 | ((c >> 12) & 0x3F));
        out += static_cast<char>(0x80 | ((c >> 6) & 0x3F));
        out += static_cast<char>(0x80 | (c & 0x3F));
    }
}

std::string_view Trim(std::string_view t)
{
    while (!t.empty() && (t.front() == ' ' || t.front() == '\t' || t.front() == '\r' || t.front() == '\n'))
        t.remove_prefix(1);
    while (!t.empty() && (t.back() == ' ' || t.back() == '\t' || t.back() == '\r' || t.back() == '\n'))
        t.remove_suffix(1);
    return t;
}

} // namespace

std::string FormatStringV(const char* format, va_list args)
{
    if (format == nullptr)
        return {};
    CLocaleScope cLocale;
    va_list sizing;
    va_copy(sizing, args);
    const int needed = std::vsnprintf(nullptr, 0, format, sizing);
    va_end(sizing);
    if (needed <= 0)
        return {};
    std::string out(static_cast<std::size_t>(needed) + 1, '\0');
    std::vsnprintf(out.data(), out.size(), format, args);
    out.resize(static_cast<std::size_t>(needed));
    return out;
}

std::string FormatString(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    std::string out = FormatStringV(format, args);
    va_end(args);
    return out;
}

std::string FormatPattern(std::string_view pattern, const std::vector<PatternArg>& args)
{
    std::string out;
    out.reserve(pattern.size() + 16);
    std::size_t next = 0;
    std::size_t i = 0;
    while (i < pattern.size()) {
        const char c = pattern[i];
        if (c != '%') {
            out += c;
            ++i;
            continue;
        }
        if (i + 1 < pattern.size() && pattern[i + 1] == '%') {
            out += '%';
            i += 2;
            continue;
        }
        // %[flags][width][.precision]conversion, with small bounded numbers only; a "*"
        // width or precision takes the next argument, bounded as well.
        std::size_t j = i + 1;
        std::size_t argIndex = next;
        std::string conversion = "%";
        auto takeStar = [&](int limit) {
            long long v = 0;
            if (argIndex < args.size()) {
                const PatternArg& a = args[argIndex];
                v = a.kind == PatternArg::Kind::Int    ? a.integer
                    : a.kind == PatternArg::Kind::Real ? static_cast<long long>(a.real)
                                                       : ParseInt(a.text).value_or(0);
            }
            ++argIndex;
            conversion += std::to_string(std::clamp<long long>(v, 0, limit));
            ++j;
        };
        while (j < pattern.size() && std::string_view("-+ #0").find(pattern[j]) != std::string_view::npos)
            conversion += pattern[j++];
        if (j < pattern.size() && pattern[j] == '*') {
            takeStar(999);
        } else {
            std::size_t digits = 0;
            while (j < pattern.size() && pattern[j] >= '0' && pattern[j] <= '9' && digits < 3) {
                conversion += pattern[j++];
                ++digits;
            }
        }
        if (j < pattern.size() && pattern[j] == '.') {
            conversion += pattern[j++];
            if (j < pattern.size() && pattern[j] == '*') {
                takeStar(99);
            } else {
                std::size_t digits = 0;
                while (j < pattern.size() && pattern[j] >= '0' && pattern[j] <= '9' && digits < 2) {
                    conversion += pattern[j++];
                    ++digits;
                }
            }
        }
        const char conv = j < pattern.size() ? pattern[j] : '\0';
        if (std::string_view("sdifgex").find(conv) == std::string_view::npos || conv == '\0') {
            out += c; // not a conversion we fill: keep the text as written
            ++i;
            continue;
        }
        conversion += conv;
        next = argIndex;
        const PatternArg* arg = next < args.size() ? &args[next] : nullptr;
        ++next;
        if (conv == 's') {
            std::string text;
            if (arg != nullptr)
                text = arg->kind == PatternArg::Kind::Text   ? arg->text
                       : arg->kind == PatternArg::Kind::Real ? FormatRealShortest(arg->real)
                                                             : std::to_string(arg->integer);
            out += FormatString(conversion.c_str(), text.c_str());
        } else if (conv == 'd' || conv == 'i' || conv == 'x') {
            long long v = 0;
            if (arg != nullptr)
                v = arg->kind == PatternArg::Kind::Int    ? arg->integer
                    : arg->kind == PatternArg::Kind::Real ? static_cast<long long>(arg->real)
                                                          : ParseInt(arg->text).value_or(0);
            std::string llspec = conversion;
            llspec.insert(llspec.size() - 1, "ll");
            out += FormatString(llspec.c_str(), v);
        } else {
            double v = 0;
            if (arg != nullptr)
                v = arg->kind == PatternArg::Kind::Real  ? arg->real
                    : arg->kind == PatternArg::Kind::Int ? static_cast<double>(arg->integer)
                                                         : ParseReal(arg->text).value_or(0.0);
            out += FormatString(conversion.c_str(), v);
        }
        i = j + 1;
    }
    return out;
}

std::string FormatInt(int value)
{
    return FormatString("%d", value);
}

std::string FormatReal(double value, int decimals)
{
    if (decimals < 0)
        return FormatString("%g", value);
    const std::string format = FormatString("%%.%df", decimals);
    return FormatString(format.c_str(), value);
}

std::string FormatRealShortest(double value)
{
    // Prices and quantities read better without an exponent: 1500000, not 1.5e+06.
    const std::string g = FormatString("%g", value);
    if (g.find('e') == std::string::npos && ParseReal(g) == value)
        return g;
    char buffer[512];
    const double magnitude = std::fabs(value);
    const bool fixed = magnitude >= 1e-5 && magnitude < 1e17;
    const auto result = fixed ? std::to_chars(buffer, buffer + sizeof buffer, value, std::chars_format::fixed)
                              : std::to_chars(buffer, buffer + sizeof buffer, value);
    return std::string(buffer, result.ptr);
}

std::string TrimBlanks(std::string_view text)
{
    const std::size_t first = text.find_first_not_of(" \t");
    if (first == std::string_view::npos)
        return {};
    const std::size_t last = text.find_last_not_of(" \t");
    return std::string(text.substr(first, last - first + 1));
}

std::optional<double> ParseReal(std::string_view text)
{
    text = Trim(text);
    if (!text.empty() && text.front() == '+')
        text.remove_prefix(1);
    if (text.empty())
        return std::nullopt;
    double value = 0;
    const auto result = std::from_chars(text.data(), text.data() + text.size(), value);
    if (result.ec != std::errc() || result.ptr != text.data() + text.size())
        return std::nullopt;
    return value;
}

std::optional<long long> ParseInt(std::string_view text)
{
    text = Trim(text);
    if (!text.empty() && text.front() == '+')
        text.remove_prefix(1);
    if (text.empty())
        return std::nullopt;
    long long value = 0;
    const auto result = std::from_chars(text.data(), text.data() + text.size(), value);
    if (result.ec != std::errc() || result.ptr != text.data() + text.size())
        return std::nullopt;
    return value;
}

void SortStrings(std::vector<std::string>& strings, bool ignoreCase)
{
    if (ignoreCase)
        std::stable_sort(strings.begin(), strings.end(),
                         [](const std::string& a, const std::string& b) { return CompareNoCase(a, b) < 0; });
    else
        std::stable_sort(strings.begin(), strings.end());
}

std::string JoinStrings(const std::vector<std::string>& strings, std::string_view separator)
{
    std::string out;
    for (std::size_t i = 0; i < strings.size(); ++i) {
        if (i > 0)
            out += separator;
        out += strings[i];
    }
    return out;
}

int CompareNoCase(std::string_view a, std::string_view b)
{
    std::size_t i = 0;
    std::size_t j = 0;
    while (i < a.size() && j < b.size()) {
        const char32_t ca = FoldCodePoint(NextCodePoint(a, i));
        const char32_t cb = FoldCodePoint(NextCodePoint(b, j));
        if (ca != cb)
            return ca < cb ? -1 : 1;
    }
    if (i < a.size())
        return 1;
    if (j < b.size())
        return -1;
    return 0;
}

bool EqualsNoCase(std::string_view a, std::string_view b)
{
    return CompareNoCase(a, b) == 0;
}

std::string FoldCase(std::string_view text)
{
    std::string out;
    out.reserve(text.size());
    std::size_t i = 0;
    while (i < text.size()) {
        const std::size_t start = i;
        const char32_t c = NextCodePoint(text, i);
        if (c >= 0x110000)
            out += text[start];
        else
            AppendUtf8(out, FoldCodePoint(c));
    }
    return out;
}

std::size_t CharCount(std::string_view text)
{
    std::size_t count = 0;
    for (std::size_t i = 0; i < text.size(); ++count)
        NextCodePoint(text, i);
    return count;
}

std::string FirstChars(std::string_view text, std::size_t n)
{
    std::size_t i = 0;
    for (std::size_t k = 0; k < n && i < text.size(); ++k)
        NextCodePoint(text, i);
    return std::string(text.substr(0, i));
}

std::u32string DecodeUtf8(std::string_view text)
{
    std::u32string out;
    out.reserve(text.size());
    for (std::size_t i = 0; i < text.size();) {
        const char32_t c = NextCodePoint(text, i);
        out += c >= 0x110000 ? U'\uFFFD' : c;
    }
    return out;
}

std::string EncodeUtf8(std::u32string_view text)
{
    std::string out;
    out.reserve(text.size());
    for (char32_t c : text)
        AppendUtf8(out, c > 0x10FFFF || (c >= 0xD800 && c <= 0xDFFF) ? U'\uFFFD' : c);
    return out;
}
