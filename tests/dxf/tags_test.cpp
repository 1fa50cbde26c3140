// Tests of the tag layer: splitting lines into pairs, handles, UTF-8 checks.
#include "host/dxf/tags.hpp"

#include <gtest/gtest.h>

#include <vector>

namespace vel::dxf {
namespace {

struct TagCase {
    const char* name;
    std::string_view input;
    std::vector<std::pair<int, std::string_view>> tags;
    const char* expected; // null when the input reads to the end
    std::uint32_t errorLine;
};

TEST(TagReader, ReadsPairsAndRefusesMalformedOnes)
{
    const TagCase cases[] = {
        {"plain", "0\nSECTION\n2\nHEADER\n", {{0, "SECTION"}, {2, "HEADER"}}, nullptr, 0},
        {"leading and trailing blanks in codes", "  0\nLINE\n 10 \n1.5\n", {{0, "LINE"}, {10, "1.5"}}, nullptr, 0},
        {"CRLF", "  0\r\nLINE\r\n  8\r\n0\r\n", {{0, "LINE"}, {8, "0"}}, nullptr, 0},
        {"spaces inside values are data", "1\n  a  b  \n", {{1, "  a  b  "}}, nullptr, 0},
        {"empty value", "3\n\n1\nx\n", {{3, ""}, {1, "x"}}, nullptr, 0},
        {"last value without newline", "0\nEOF", {{0, "EOF"}}, nullptr, 0},
        {"negative code", "-1\nx\n", {{-1, "x"}}, nullptr, 0},
        {"non-numeric code", "0\nLINE\nabc\nx\n", {{0, "LINE"}}, "un code de groupe (nombre entier)", 3},
        {"code with trailing text", "8x\n0\n", {}, "un code de groupe (nombre entier)", 1},
        {"odd pair at the end",
         "0\nLINE\n8\n",
         {{0, "LINE"}},
         "une valeur après le code de groupe (fichier tronqué)",
         4},
        {"code without line end",
         "0\nLINE\n8",
         {{0, "LINE"}},
         "une valeur après le code de groupe (fichier tronqué)",
         3},
        {"overlong code", "1234567890\nx\n", {}, "un code de groupe (nombre entier)", 1},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        TagReader reader(c.input);
        Tag t;
        std::vector<std::pair<int, std::string_view>> got;
        while (reader.next(t))
            got.push_back({t.code, t.value});
        EXPECT_EQ(got, c.tags);
        EXPECT_EQ(reader.failed(), c.expected != nullptr);
        if (c.expected) {
            EXPECT_STREQ(reader.expected(), c.expected);
            EXPECT_EQ(reader.errorLine(), c.errorLine);
        }
    }
}

TEST(TagReader, CountsLinesOfEachTag)
{
    TagReader reader("0\nA\n  5\nFF\n");
    Tag t;
    ASSERT_TRUE(reader.next(t));
    EXPECT_EQ(t.line, 1u);
    ASSERT_TRUE(reader.next(t));
    EXPECT_EQ(t.line, 3u);
    EXPECT_EQ(reader.offset(), 11u);
}

TEST(Handles, ParseUpTo64BitsInEitherCase)
{
    const struct {
        std::string_view text;
        std::optional<std::uint64_t> value;
    } cases[] = {
        {"1F", 0x1F},
        {"1f", 0x1F},
        {"FFFFFFFFFFFFFFFF", 0xFFFFFFFFFFFFFFFFULL},
        {" A0 ", 0xA0},
        {"10000000000000000", std::nullopt},
        {"", std::nullopt},
        {"G1", std::nullopt},
        {"-1", std::nullopt},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.text));
        EXPECT_EQ(ParseHandle(c.text), c.value);
    }
    EXPECT_EQ(FormatHandle(0xABCDEF0123456789ULL), "ABCDEF0123456789");
    EXPECT_EQ(FormatHandle(0), "0");
}

TEST(AppendTag, RightAlignsCodesLikeOtherWriters)
{
    std::string out;
    AppendTag(out, 0, "LINE", "\n");
    AppendTag(out, 1001, "APP", "\r\n");
    EXPECT_EQ(out, "  0\nLINE\n1001\r\nAPP\r\n");
}

TEST(Utf8, FindsTheFirstInvalidByte)
{
    const struct {
        std::string_view text;
        std::size_t at;
    } cases[] = {
        {"plain ascii text, long enough for words", std::string_view::npos},
        {"é € 日本 😀", std::string_view::npos},
        {"abcdefgh\xE9t\xE9", 8},
        {"\xC3", 0},
        {"ok\xED\xA0\x80", 2},           // a surrogate
        {"ok\xC0\xAF", 2},               // overlong
        {"12345678\xF4\x90\x80\x80", 8}, // above U+10FFFF
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.text));
        EXPECT_EQ(FindInvalidUtf8(c.text), c.at);
    }
    EXPECT_EQ(LineOfOffset("a\nb\nc", 4), 3u);
}

} // namespace
} // namespace vel::dxf
