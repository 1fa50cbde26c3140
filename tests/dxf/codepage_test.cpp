// Tests of DXF text conversion: code pages, UTF-8 files and \U+XXXX escapes.
#include "host/dxf/codepage.hpp"

#include <gtest/gtest.h>

namespace vel::dxf {
namespace {

TEST(TextEncoding, FollowsTheVersionAndTheCodePage)
{
    EXPECT_FALSE(TextEncoding::For("AC1018", "ANSI_1252").utf8);
    EXPECT_TRUE(TextEncoding::For("AC1021", "ANSI_1252").utf8);
    EXPECT_TRUE(TextEncoding::For("AC1032", "").utf8);
    EXPECT_FALSE(TextEncoding::For("AC1009", "").utf8);
    EXPECT_EQ(TextEncoding::For("AC1015", "").codepage, "ANSI_1252");
    EXPECT_EQ(TextEncoding::For("AC1015", "ANSI_1251").codepage, "ANSI_1251");
    EXPECT_EQ(TextEncoding::For("AC1015", "ansi_1250").codepage, "ANSI_1250");
    EXPECT_EQ(TextEncoding::For("AC1015", "NO_SUCH_PAGE").codepage, "ANSI_1252");
}

TEST(DecodeText, ConvertsCodePageBytesAndEscapes)
{
    const TextEncoding cp1252 = TextEncoding::For("AC1018", "ANSI_1252");
    const TextEncoding utf8 = TextEncoding::For("AC1032", "ANSI_1252");
    const TextEncoding cp1251 = TextEncoding::For("AC1015", "ANSI_1251");
    const struct {
        const char* name;
        std::string_view raw;
        const TextEncoding& encoding;
        std::string_view text;
    } cases[] = {
        {"1252 letters",
         "D\xE9"
         "blai \x80 \x96",
         cp1252, "Déblai € –"},
        {"1252 undefined byte",
         "a\x81"
         "b",
         cp1252,
         "a\xEF\xBF\xBD"
         "b"},
        {"upper-case escape", "\\U+03A9", cp1252, "Ω"},
        {"lower-case escape", "x\\u+03a9y", cp1252, "xΩy"},
        {"escape in UTF-8 file", "\\U+00E9 é", utf8, "é é"},
        {"surrogate pair", "\\U+D83D\\U+DE00", utf8, "😀"},
        {"lone surrogate", "\\U+D83D!", utf8, "\xEF\xBF\xBD!"},
        {"not an escape", "\\U+12G4 \\U+", utf8, "\\U+12G4 \\U+"},
        {"other code page", "\xC4\xE0", cp1251, "Да"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(DecodeText(c.raw, c.encoding), c.text);
    }
}

TEST(EncodeText, EscapesWhatTheCodePageCannotHold)
{
    const TextEncoding cp1252 = TextEncoding::For("AC1018", "ANSI_1252");
    const TextEncoding cp1251 = TextEncoding::For("AC1015", "ANSI_1251");
    EXPECT_EQ(EncodeText("Déblai € ΩΣ 😀", cp1252), "D\xE9"
                                                   "blai \x80 \\U+03A9\\U+03A3 \\U+D83D\\U+DE00");
    EXPECT_EQ(EncodeText("Да é", cp1251), "\xC4\xE0 \\U+00E9");
    EXPECT_EQ(EncodeText("Déblai ΩΣ", TextEncoding::For("AC1032", "")), "Déblai ΩΣ");
    const std::string text = "Réseau Été — 5 €, Ω";
    EXPECT_EQ(DecodeText(EncodeText(text, cp1252), cp1252), text);
}

} // namespace
} // namespace vel::dxf
