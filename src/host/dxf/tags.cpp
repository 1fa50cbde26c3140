// Value conversions shared by the DXF layers: handles, tag lines, UTF-8 validation.
#include "host/dxf/tags.hpp"

#include <algorithm>
#include <cstring>

namespace vel::dxf {

std::string_view TrimRight(std::string_view value)
{
    while (!value.empty() && (value.back() == ' ' || value.back() == '\t'))
        value.remove_suffix(1);
    return value;
}

std::optional<std::uint64_t> ParseHandle(std::string_view value)
{
    while (!value.empty() && value.front() == ' ')
        value.remove_prefix(1);
    value = TrimRight(value);
    if (value.empty() || value.size() > 16)
        return std::nullopt;
    std::uint64_t handle = 0;
    for (char c : value) {
        unsigned digit;
        if (c >= '0' && c <= '9')
            digit = static_cast<unsigned>(c - '0');
        else if (c >= 'A' && c <= 'F')
            digit = static_cast<unsigned>(c - 'A' + 10);
        else if (c >= 'a' && c <= 'f')
            digit = static_cast<unsigned>(c - 'a' + 10);
        else
            return std::nullopt;
        handle = (handle << 4) | digit;
    }
    return handle;
}

std::string FormatHandle(std::uint64_t handle)
{
    static const char kDigits[] = "0123456789ABCDEF";
    char buffer[16];
    int n = 0;
    do {
        buffer[15 - n] = kDigits[handle & 0xF];
        handle >>= 4;
        ++n;
    } while (handle != 0);
    return std::string(buffer + 16 - n, static_cast<std::size_t>(n));
}

void AppendTag(std::string& out, int code, std::string_view value, std::string_view eol)
{
    char buffer[16];
    int n = 0;
    bool negative = code < 0;
    unsigned u = negative ? static_cast<unsigned>(-code) : static_cast<unsigned>(code);
    do {
        buffer[15 - n++] = static_cast<char>('0' + u % 10);
        u /= 10;
    } while (u != 0);
    if (negative)
        buffer[15 - n++] = '-';
    for (int pad = n; pad < 3; ++pad)
        out.push_back(' ');
    out.append(buffer + 16 - n, static_cast<std::size_t>(n));
    out.append(eol);
    out.append(value);
    out.append(eol);
}

std::uint32_t LineOfOffset(std::string_view buffer, std::size_t offset)
{
    std::uint32_t line = 1;
    const char* p = buffer.data();
    const char* end = buffer.data() + std::min(offset, buffer.size());
    while (p < end) {
        const void* nl = std::memchr(p, '\n', static_cast<std::size_t>(end - p));
        if (!nl)
            break;
        ++line;
        p = static_cast<const char*>(nl) + 1;
    }
    return line;
}

std::size_t FindInvalidUtf8(std::string_view buffer)
{
    const auto* s = reinterpret_cast<const unsigned char*>(buffer.data());
    const std::size_t n = buffer.size();
    std::size_t i = 0;
    while (i < n) {
        // Most drawings are plain ASCII: skip eight bytes at a time.
        while (i + 8 <= n) {
            std::uint64_t word;
            std::memcpy(&word, s + i, 8);
            if (word & 0x8080808080808080ULL)
                break;
            i += 8;
        }
        if (i >= n)
            break;
        const unsigned char b0 = s[i];
        if (b0 < 0x80) {
            ++i;
            continue;
        }
        std::size_t len;
        std::uint32_t cp;
        std::uint32_t min;
        if ((b0 & 0xE0) == 0xC0) {
            len = 2;
            cp = b0 & 0x1Fu;
            min = 0x80;
        } else if ((b0 & 0xF0) == 0xE0) {
            len = 3;
            cp = b0 & 0x0Fu;
            min = 0x800;
        } else if ((b0 & 0xF8) == 0xF0) {
            len = 4;
            cp = b0 & 0x07u;
            min = 0x10000;
        } else {
            return i;
        }
        if (i + len > n)
            return i;
        for (std::size_t k = 1; k < len; ++k) {
            if ((s[i + k] & 0xC0) != 0x80)
                return i;
            cp = (cp << 6) | (s[i + k] & 0x3Fu);
        }
        if (cp < min || cp > 0x10FFFF || (cp >= 0xD800 && cp <= 0xDFFF))
            return i;
        i += len;
    }
    return std::string_view::npos;
}

} // namespace vel::dxf
