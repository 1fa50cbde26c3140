// Binary DXF conversion. The value type of each group code follows the DXF reference:
// text, 8-byte real, 16/32/64-bit integer, 1-byte flag or length-prefixed binary chunk.
#include "host/dxf/binary.hpp"

#include <charconv>
#include <cmath>
#include <cstring>

#include "host/dxf/tags.hpp"
#include "text/text.hpp"

namespace vel::dxf {
namespace {

constexpr std::string_view kSentinel("AutoCAD Binary DXF\r\n\x1a\0", 22);

enum class Kind { Text, Real, Int16, Int32, Int64, Byte, Chunk };

Kind KindOf(int c)
{
    if ((c >= 310 && c <= 319) || c == 1004)
        return Kind::Chunk;
    if (c >= 290 && c <= 299)
        return Kind::Byte;
    if ((c >= 60 && c <= 79) || (c >= 170 && c <= 179) || (c >= 270 && c <= 289) || (c >= 370 && c <= 389) ||
        (c >= 400 && c <= 409) || (c >= 1060 && c <= 1070))
        return Kind::Int16;
    if ((c >= 90 && c <= 99) || (c >= 420 && c <= 459) || c == 1071)
        return Kind::Int32;
    if (c >= 160 && c <= 169)
        return Kind::Int64;
    if ((c >= 10 && c <= 59) || (c >= 110 && c <= 149) || (c >= 210 && c <= 239) || (c >= 460 && c <= 469) ||
        (c >= 1010 && c <= 1059))
        return Kind::Real;
    return Kind::Text;
}

template <class T>
T Load(const char* p)
{
    T v;
    std::memcpy(&v, p, sizeof v); // files are little-endian, as this host
    return v;
}

template <class T>
void Store(std::string& out, T v)
{
    char bytes[sizeof v];
    std::memcpy(bytes, &v, sizeof v);
    out.append(bytes, sizeof v);
}

void AppendNumber(std::string& out, long long v)
{
    char buffer[32];
    const auto r = std::to_chars(buffer, buffer + sizeof buffer, v);
    out.append(buffer, r.ptr);
}

} // namespace

bool IsBinaryDxf(std::string_view bytes)
{
    return bytes.substr(0, kSentinel.size()) == kSentinel;
}

bool BinaryToText(std::string_view binary, std::string& text, bool& wideCodes, std::uint64_t& group,
                  std::string& expected)
{
    static const char kHex[] = "0123456789ABCDEF";
    const char* p = binary.data() + kSentinel.size();
    const char* end = binary.data() + binary.size();
    // The first group is 0 SECTION: its code takes one byte in R12, two later.
    wideCodes = end - p >= 2 && p[0] == 0 && p[1] == 0;
    text.clear();
    text.reserve(binary.size() * 3 / 2);
    group = 0;
    auto need = [&](std::ptrdiff_t n) { return end - p >= n; };
    while (p < end) {
        ++group;
        int code;
        if (wideCodes) {
            if (!need(2)) {
                expected = "un code de groupe complet (fichier tronqué)";
                return false;
            }
            code = Load<std::int16_t>(p);
            p += 2;
        } else {
            code = static_cast<unsigned char>(*p++);
            if (code == 255) {
                if (!need(2)) {
                    expected = "un code de groupe complet (fichier tronqué)";
                    return false;
                }
                code = Load<std::int16_t>(p);
                p += 2;
                // Written back the same way only when the short form could not hold it.
                if (code < 255) {
                    expected = "un code de groupe de 255 ou plus après l'octet 255";
                    return false;
                }
            }
        }
        if (code < 0) {
            expected = "un code de groupe de 0 à 32767";
            return false;
        }
        std::string value;
        switch (KindOf(code)) {
        case Kind::Chunk: {
            if (!need(1) || !need(1 + static_cast<unsigned char>(*p))) {
                expected = "des octets complets (fichier tronqué)";
                return false;
            }
            const auto n = static_cast<unsigned char>(*p++);
            for (unsigned k = 0; k < n; ++k) {
                value.push_back(kHex[static_cast<unsigned char>(p[k]) >> 4]);
                value.push_back(kHex[static_cast<unsigned char>(p[k]) & 0xF]);
            }
            p += n;
            break;
        }
        case Kind::Byte:
            if (!need(1)) {
                expected = "une valeur complète (fichier tronqué)";
                return false;
            }
            AppendNumber(value, static_cast<unsigned char>(*p++));
            break;
        case Kind::Int16:
        case Kind::Int32:
        case Kind::Int64:
        case Kind::Real: {
            const Kind kind = KindOf(code);
            const std::ptrdiff_t size = kind == Kind::Int16 ? 2 : kind == Kind::Int32 ? 4 : 8;
            if (!need(size)) {
                expected = "une valeur complète (fichier tronqué)";
                return false;
            }
            if (kind == Kind::Int16)
                AppendNumber(value, Load<std::int16_t>(p));
            else if (kind == Kind::Int32)
                AppendNumber(value, Load<std::int32_t>(p));
            else if (kind == Kind::Int64)
                AppendNumber(value, Load<std::int64_t>(p));
            else {
                // The shortest digits that read back to the same bits.
                const double real = Load<double>(p);
                if (!std::isfinite(real)) {
                    expected = "un nombre réel fini";
                    return false;
                }
                char buffer[64];
                const auto r = std::to_chars(buffer, buffer + sizeof buffer, real);
                value.assign(buffer, r.ptr);
            }
            p += size;
            break;
        }
        case Kind::Text: {
            const void* nul = std::memchr(p, 0, static_cast<std::size_t>(end - p));
            if (nul == nullptr) {
                expected = "un texte terminé par un octet nul (fichier tronqué)";
                return false;
            }
            value.assign(p, static_cast<const char*>(nul));
            if (value.find_first_of("\r\n") != std::string::npos) {
                expected = "un texte sans saut de ligne";
                return false;
            }
            p = static_cast<const char*>(nul) + 1;
            break;
        }
        }
        AppendTag(text, code, value, "\n");
    }
    return true;
}

bool TextToBinary(std::string_view text, bool wideCodes, std::string& binary, std::string& error)
{
    binary.assign(kSentinel);
    binary.reserve(text.size());
    TagReader reader(text);
    Tag t;
    auto fail = [&](const char* expected) {
        error = FormatString("ligne %u : il fallait %s", t.line + 1, expected);
        return false;
    };
    while (reader.next(t)) {
        if (t.code < 0 || t.code > 32767)
            return fail("un code de groupe de 0 à 32767");
        if (wideCodes) {
            Store(binary, static_cast<std::int16_t>(t.code));
        } else if (t.code < 255) {
            binary.push_back(static_cast<char>(t.code));
        } else {
            binary.push_back(static_cast<char>(255));
            Store(binary, static_cast<std::int16_t>(t.code));
        }
        const Kind kind = KindOf(t.code);
        if (kind == Kind::Text) {
            if (t.value.find('\0') != std::string_view::npos)
                return fail("un texte sans octet nul");
            binary.append(t.value);
            binary.push_back('\0');
            continue;
        }
        if (kind == Kind::Chunk) {
            const std::string_view hex = TrimRight(t.value);
            if (hex.size() % 2 != 0 || hex.size() > 2 * 255)
                return fail("au plus 255 octets en hexadécimal");
            binary.push_back(static_cast<char>(hex.size() / 2));
            for (std::size_t i = 0; i < hex.size(); i += 2) {
                const auto high = ParseHandle(hex.substr(i, 1));
                const auto low = ParseHandle(hex.substr(i + 1, 1));
                if (!high || !low)
                    return fail("des octets en hexadécimal");
                binary.push_back(static_cast<char>(*high * 16 + *low));
            }
            continue;
        }
        if (kind == Kind::Real) {
            const auto v = ParseReal(t.value);
            if (!v)
                return fail("un nombre réel");
            Store(binary, *v);
            continue;
        }
        const auto v = ParseInt(t.value);
        if (kind == Kind::Byte) {
            if (!v || *v < 0 || *v > 255)
                return fail("un octet");
            binary.push_back(static_cast<char>(*v));
        } else if (kind == Kind::Int16) {
            if (!v || *v < -32768 || *v > 65535)
                return fail("un entier de 16 bits");
            Store(binary, static_cast<std::int16_t>(static_cast<std::uint16_t>(*v)));
        } else if (kind == Kind::Int32) {
            if (!v || *v < -2147483648LL || *v > 4294967295LL)
                return fail("un entier de 32 bits");
            Store(binary, static_cast<std::int32_t>(static_cast<std::uint32_t>(*v)));
        } else {
            if (!v)
                return fail("un entier de 64 bits");
            Store(binary, static_cast<std::int64_t>(*v));
        }
    }
    if (reader.failed()) {
        error = FormatString("ligne %u : il fallait %s", reader.errorLine(), reader.expected());
        return false;
    }
    return true;
}

} // namespace vel::dxf
