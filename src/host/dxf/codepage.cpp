// Code-page conversion of DXF text: Windows-1252 by table (the common case), the other
// ANSI and DOS code pages through iconv; \U+XXXX escapes in both directions.
#include "host/dxf/codepage.hpp"

#include <iconv.h>

#include <cstdint>
#include <string>

#include "text/text.hpp"

namespace vel::dxf {
namespace {

// Windows-1252 bytes 0x80-0x9F; 0 where the code page defines nothing.
constexpr char16_t kCp1252High[32] = {0x20AC, 0,      0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021,
                                      0x02C6, 0x2030, 0x0160, 0x2039, 0x0152, 0,      0x017D, 0,
                                      0,      0x2018, 0x2019, 0x201C, 0x201D, 0x2022, 0x2013, 0x2014,
                                      0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, 0,      0x017E, 0x0178};

bool Is1252(std::string_view codepage)
{
    return codepage == "ANSI_1252" || codepage.empty();
}

// iconv name of a code page ("ANSI_1250" -> "CP1250", "DOS850" -> "CP850").
std::string IconvName(std::string_view codepage)
{
    if (codepage.substr(0, 5) == "ANSI_")
        return "CP" + std::string(codepage.substr(5));
    if (codepage.substr(0, 3) == "DOS")
        return "CP" + std::string(codepage.substr(3));
    if (codepage.substr(0, 8) == "ISO8859_")
        return "ISO-8859-" + std::string(codepage.substr(8));
    return std::string(codepage);
}

void AppendUtf8(std::string& out, char32_t cp)
{
    if (cp < 0x80) {
        out.push_back(static_cast<char>(cp));
    } else if (cp < 0x800) {
        out.push_back(static_cast<char>(0xC0 | (cp >> 6)));
        out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
    } else if (cp < 0x10000) {
        out.push_back(static_cast<char>(0xE0 | (cp >> 12)));
        out.push_back(static_cast<char>(0x80 | ((cp >> 6) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
    } else {
        out.push_back(static_cast<char>(0xF0 | (cp >> 18)));
        out.push_back(static_cast<char>(0x80 | ((cp >> 12) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | ((cp >> 6) & 0x3F)));
        out.push_back(static_cast<char>(0x80 | (cp & 0x3F)));
    }
}

// Next code point of valid UTF-8 text (invalid bytes give U+FFFD).
char32_t NextUtf8(std::string_view s, std::size_t& i)
{
    const auto b0 = static_cast<unsigned char>(s[i]);
    if (b0 < 0x80) {
        ++i;
        return b0;
    }
    std::size_t len = (b0 & 0xE0) == 0xC0 ? 2 : (b0 & 0xF0) == 0xE0 ? 3 : (b0 & 0xF8) == 0xF0 ? 4 : 0;
    if (len == 0 || i + len > s.size()) {
        ++i;
        return 0xFFFD;
    }
    char32_t cp = b0 & (len == 2 ? 0x1F : len == 3 ? 0x0F : 0x07);
    for (std::size_t k = 1; k < len; ++k) {
        const auto b = static_cast<unsigned char>(s[i + k]);
        if ((b & 0xC0) != 0x80) {
            ++i;
            return 0xFFFD;
        }
        cp = (cp << 6) | (b & 0x3F);
    }
    i += len;
    return cp;
}

int HexDigit(char c)
{
    if (c >= '0' && c <= '9')
        return c - '0';
    if (c >= 'a' && c <= 'f')
        return c - 'a' + 10;
    if (c >= 'A' && c <= 'F')
        return c - 'A' + 10;
    return -1;
}

// Replaces \U+XXXX escapes of UTF-8 text; a surrogate pair of escapes makes one character.
std::string ResolveEscapes(std::string_view s)
{
    if (s.find("\\U+") == std::string_view::npos && s.find("\\u+") == std::string_view::npos)
        return std::string(s);
    std::string out;
    out.reserve(s.size());
    std::size_t i = 0;
    auto escapeAt = [&](std::size_t at, char32_t& cp) {
        if (at + 7 > s.size() || s[at] != '\\' || (s[at + 1] != 'U' && s[at + 1] != 'u') || s[at + 2] != '+')
            return false;
        char32_t v = 0;
        for (std::size_t k = 0; k < 4; ++k) {
            int d = HexDigit(s[at + 3 + k]);
            if (d < 0)
                return false;
            v = (v << 4) | static_cast<char32_t>(d);
        }
        cp = v;
        return true;
    };
    while (i < s.size()) {
        char32_t cp;
        if (escapeAt(i, cp)) {
            i += 7;
            char32_t low;
            if (cp >= 0xD800 && cp <= 0xDBFF && escapeAt(i, low) && low >= 0xDC00 && low <= 0xDFFF) {
                cp = 0x10000 + ((cp - 0xD800) << 10) + (low - 0xDC00);
                i += 7;
            } else if (cp >= 0xD800 && cp <= 0xDFFF) {
                cp = 0xFFFD;
            }
            AppendUtf8(out, cp);
        } else {
            out.push_back(s[i++]);
        }
    }
    return out;
}

void AppendEscape(std::string& out, char32_t cp)
{
    auto one = [&](char32_t v) { out += FormatString("\\U+%04X", static_cast<unsigned>(v)); };
    if (cp >= 0x10000) {
        cp -= 0x10000;
        one(0xD800 + (cp >> 10));
        one(0xDC00 + (cp & 0x3FF));
    } else {
        one(cp);
    }
}

// Converts with iconv; false when the conversion is not available or fails.
bool Iconv(const std::string& to, const std::string& from, std::string_view in, std::string& out)
{
    iconv_t cd = iconv_open(to.c_str(), from.c_str());
    if (cd == reinterpret_cast<iconv_t>(-1))
        return false;
    std::string input(in);
    char* inPtr = input.data();
    std::size_t inLeft = input.size();
    out.assign(input.size() * 4 + 16, '\0');
    char* outPtr = out.data();
    std::size_t outLeft = out.size();
    const std::size_t rc = iconv(cd, &inPtr, &inLeft, &outPtr, &outLeft);
    iconv_close(cd);
    if (rc == static_cast<std::size_t>(-1))
        return false;
    out.resize(out.size() - outLeft);
    return true;
}

} // namespace

TextEncoding TextEncoding::For(std::string_view acadver, std::string_view dwgcodepage)
{
    TextEncoding e;
    e.codepage.clear();
    // AC1021 (2007) and later always store UTF-8.
    e.utf8 = acadver.size() == 6 && acadver.substr(0, 2) == "AC" && acadver >= "AC1021";
    // Some writers spell the code page in lower case ("ansi_1252").
    for (char c : dwgcodepage)
        e.codepage.push_back(c >= 'a' && c <= 'z' ? static_cast<char>(c - 'a' + 'A') : c);
    if (dwgcodepage.empty())
        e.codepage = "ANSI_1252";
    if (!IsKnownCodepage(e.codepage))
        e.codepage = "ANSI_1252";
    return e;
}

bool IsKnownCodepage(std::string_view codepage)
{
    if (Is1252(codepage))
        return true;
    iconv_t cd = iconv_open("UTF-8", IconvName(codepage).c_str());
    if (cd == reinterpret_cast<iconv_t>(-1))
        return false;
    iconv_close(cd);
    return true;
}

std::string DecodeText(std::string_view raw, const TextEncoding& encoding)
{
    bool ascii = true;
    for (char c : raw)
        if (static_cast<unsigned char>(c) >= 0x80) {
            ascii = false;
            break;
        }
    if (ascii || encoding.utf8)
        return ResolveEscapes(raw);
    std::string utf8;
    if (Is1252(encoding.codepage)) {
        utf8.reserve(raw.size() + 8);
        for (char c : raw) {
            const auto b = static_cast<unsigned char>(c);
            if (b < 0x80)
                utf8.push_back(c);
            else if (b < 0xA0)
                AppendUtf8(utf8, kCp1252High[b - 0x80] ? kCp1252High[b - 0x80] : 0xFFFD);
            else
                AppendUtf8(utf8, b);
        }
    } else if (!Iconv("UTF-8", IconvName(encoding.codepage), raw, utf8)) {
        // Bytes the code page does not define: keep the ASCII, mark the rest.
        utf8.clear();
        for (char c : raw)
            if (static_cast<unsigned char>(c) < 0x80)
                utf8.push_back(c);
            else
                AppendUtf8(utf8, 0xFFFD);
    }
    return ResolveEscapes(utf8);
}

std::string EncodeText(std::string_view utf8, const TextEncoding& encoding)
{
    if (encoding.utf8)
        return std::string(utf8);
    std::string out;
    out.reserve(utf8.size());
    const bool is1252 = Is1252(encoding.codepage);
    const std::string iconvName = is1252 ? std::string() : IconvName(encoding.codepage);
    std::size_t i = 0;
    while (i < utf8.size()) {
        const std::size_t start = i;
        const char32_t cp = NextUtf8(utf8, i);
        if (cp < 0x80) {
            out.push_back(static_cast<char>(cp));
            continue;
        }
        if (is1252) {
            if (cp >= 0xA0 && cp <= 0xFF) {
                out.push_back(static_cast<char>(cp));
                continue;
            }
            bool found = false;
            for (int k = 0; k < 32; ++k)
                if (kCp1252High[k] != 0 && kCp1252High[k] == cp) {
                    out.push_back(static_cast<char>(0x80 + k));
                    found = true;
                    break;
                }
            if (!found)
                AppendEscape(out, cp);
            continue;
        }
        std::string bytes;
        if (cp != 0xFFFD && Iconv(iconvName, "UTF-8", utf8.substr(start, i - start), bytes))
            out += bytes;
        else
            AppendEscape(out, cp);
    }
    return out;
}

} // namespace vel::dxf
