// The bottom layer of the DXF reader: splits an ASCII DXF buffer into (group code,
// value) pairs without copying, and the small value conversions every layer needs.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>

namespace vel::dxf {

// One group code and its value, a view into the buffer it was read from (or into an
// object's own storage once changed). `line` is the line of the group code (1-based).
struct Tag {
    std::int32_t code = 0;
    std::uint32_t line = 0;
    std::string_view value;
};

// Reads tags one after another. Group codes may carry leading and trailing blanks;
// values keep every byte of their line except the final CR of a CRLF ending.
class TagReader {
public:
    explicit TagReader(std::string_view buffer, std::size_t offset = 0, std::uint32_t line = 1)
        : begin_(buffer.data()), cur_(buffer.data() + offset), end_(buffer.data() + buffer.size()), line_(line)
    {}

    // Reads the next tag; false at the end of the buffer or on a malformed pair (then
    // failed() is true and expected() says what was expected on errorLine()).
    bool next(Tag& tag)
    {
        if (cur_ >= end_)
            return false;
        const char* p = cur_;
        while (p < end_ && *p == ' ')
            ++p;
        bool negative = false;
        if (p < end_ && *p == '-') {
            negative = true;
            ++p;
        }
        const char* digits = p;
        std::int32_t code = 0;
        while (p < end_ && static_cast<unsigned char>(*p - '0') < 10 && p - digits < 9) {
            code = code * 10 + (*p - '0');
            ++p;
        }
        if (p == digits)
            return fail(line_, "un code de groupe (nombre entier)");
        while (p < end_ && (*p == ' ' || *p == '\t'))
            ++p;
        if (p < end_ && *p == '\r')
            ++p;
        if (p >= end_)
            return fail(line_, "une valeur après le code de groupe (fichier tronqué)");
        if (*p != '\n')
            return fail(line_, "un code de groupe (nombre entier)");
        ++p;
        if (p >= end_)
            return fail(line_ + 1, "une valeur après le code de groupe (fichier tronqué)");
        const char* nl = static_cast<const char*>(std::memchr(p, '\n', static_cast<std::size_t>(end_ - p)));
        const char* valueEnd = nl ? nl : end_;
        const char* next = nl ? nl + 1 : end_;
        if (valueEnd > p && valueEnd[-1] == '\r')
            --valueEnd;
        tag.code = negative ? -code : code;
        tag.line = line_;
        tag.value = std::string_view(p, static_cast<std::size_t>(valueEnd - p));
        line_ += 2;
        cur_ = next;
        return true;
    }

    bool failed() const { return failed_; }
    const char* expected() const { return expected_; }
    std::uint32_t errorLine() const { return errorLine_; }
    // Byte offset and line of the next tag.
    std::size_t offset() const { return static_cast<std::size_t>(cur_ - begin_); }
    std::uint32_t line() const { return line_; }

private:
    bool fail(std::uint32_t line, const char* expected)
    {
        failed_ = true;
        expected_ = expected;
        errorLine_ = line;
        cur_ = end_;
        return false;
    }

    const char* begin_;
    const char* cur_;
    const char* end_;
    std::uint32_t line_;
    bool failed_ = false;
    const char* expected_ = "";
    std::uint32_t errorLine_ = 0;
};

// A structural value (section and object names, keys of the header) without the
// trailing blanks some writers leave.
std::string_view TrimRight(std::string_view value);

// Hexadecimal handle of up to 64 bits; nullopt when the text is not one.
std::optional<std::uint64_t> ParseHandle(std::string_view value);
// Upper-case hexadecimal, as DXF writes handles.
std::string FormatHandle(std::uint64_t handle);

// Width-3 group code line and value line, with the given line ending.
void AppendTag(std::string& out, int code, std::string_view value, std::string_view eol);

// Line number of a byte offset (counts the line feeds before it); used for messages only.
std::uint32_t LineOfOffset(std::string_view buffer, std::size_t offset);

// First byte offset where the buffer is not valid UTF-8, or npos.
std::size_t FindInvalidUtf8(std::string_view buffer);

} // namespace vel::dxf
