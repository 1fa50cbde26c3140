// Tests of the object layer: dictionary entries, XData checks and conversions, XRECORDs.
#include "host/dxf/objects.hpp"

#include <gtest/gtest.h>

namespace vel::dxf {
namespace {

const TextEncoding kUtf8 = TextEncoding::For("AC1032", "");

ObjectBody Parse(std::string_view text)
{
    ObjectBody body;
    ParseError error;
    EXPECT_TRUE(ParseObject(text, 1, kUtf8, body, error)) << error.line << ": " << error.expected;
    return body;
}

std::string Write(const ObjectBody& body)
{
    std::string out;
    WriteObject(body, out, "\n");
    return out;
}

TEST(ParseObject, PicksOutHandleOwnerAndEntries)
{
    const std::string_view text =
        "  0\nDICTIONARY\n  5\n1A\n102\n{ACAD_REACTORS\n330\nC\n102\n}\n330\nC\n100\nAcDbDictionary\n280\n1\n281\n1\n"
        "  3\nB\n350\n2F\n  3\nA\n360\n30\n1001\nAPP\n1000\nx\n";
    const ObjectBody body = Parse(text);
    EXPECT_EQ(body.type, "DICTIONARY");
    EXPECT_EQ(body.handle, 0x1Au);
    EXPECT_EQ(body.owner, 0xCu);
    EXPECT_TRUE(body.hardOwner);
    ASSERT_EQ(body.entries.size(), 2u);
    EXPECT_EQ(body.entries[0].key, "B");
    EXPECT_EQ(body.entries[0].code, 350);
    EXPECT_EQ(body.entries[1].handle, 0x30u);
    EXPECT_EQ(body.entries[1].code, 360);
    EXPECT_EQ(body.xdata.size(), 2u);
    EXPECT_EQ(Write(body), text);
}

TEST(ParseObject, KeepsTagsAfterTheXData)
{
    const std::string_view text = "  0\nTHING\n  5\n2\n1001\nAPP\n1070\n1\n 90\n5\n";
    const ObjectBody body = Parse(text);
    EXPECT_EQ(body.xdata.size(), 2u);
    EXPECT_EQ(body.tail.size(), 1u);
    EXPECT_EQ(Write(body), text);
}

TEST(ParseObject, RefusesMalformedObjects)
{
    const struct {
        const char* name;
        std::string_view text;
        std::uint32_t line;
        const char* expected;
    } cases[] = {
        {"entry without object", "0\nDICTIONARY\n5\n1\n3\nK\n1\nx\n", 7,
         "le code 350 ou 360 de l'entrée de dictionnaire"},
        {"entry with a bad handle", "0\nDICTIONARY\n5\n1\n3\nK\n350\nXY\n", 7, "un identifiant hexadécimal"},
        {"handle zero", "0\nLINE\n5\n0\n", 3, "un identifiant hexadécimal non nul"},
        {"XData before its application", "0\nLINE\n5\n1\n1000\nx\n", 5,
         "le code 1001 (nom d'application) avant les données étendues"},
        {"unbalanced brace", "0\nLINE\n1001\nA\n1002\n{\n", 5, "« } » fermant le groupe (code 1002)"},
        {"closing brace first", "0\nLINE\n1001\nA\n1002\n}\n", 5, "« { » avant « } » (code 1002)"},
        {"bad brace text", "0\nLINE\n1001\nA\n1002\n(\n", 5, "« { » ou « } » (code 1002)"},
        {"point without Y", "0\nLINE\n1001\nA\n1010\n1\n1040\n2\n", 7, "le code 1020 (coordonnée Y du point)"},
        {"16-bit overflow", "0\nLINE\n1001\nA\n1070\n40000\n", 5, "un entier de 16 bits"},
        {"32-bit overflow", "0\nLINE\n1001\nA\n1071\n9999999999\n", 5, "un entier de 32 bits"},
        {"real that is not", "0\nLINE\n1001\nA\n1040\nabc\n", 5, "un nombre réel"},
        {"unknown XData code", "0\nLINE\n1001\nA\n1099\nx\n", 5, "un code de données étendues (1000 à 1071)"},
        {"odd binary", "0\nLINE\n1001\nA\n1004\nABC\n", 5, "des octets en hexadécimal"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        ObjectBody body;
        ParseError error;
        EXPECT_FALSE(ParseObject(c.text, 1, kUtf8, body, error));
        EXPECT_EQ(error.line, c.line);
        EXPECT_EQ(error.expected, c.expected);
    }
}

TEST(XData, ReadsEveryItemType)
{
    const ObjectBody body =
        Parse("0\nLINE\n5\n1\n1001\nOTHER\n1000\nno\n1001\nAPP\n1000\n a b \n1002\n{\n1003\n0\n1004\n00FF\n1002\n}\n"
              "1005\n1F\n1010\n1\n1020\n2\n1030\n3\n1011\n4\n1021\n5\n1040\n1.5\n1041\n2\n1042\n3\n1070\n-7\n"
              "1071\n2147483647\n");
    VelRbPtr list(XDataToRb(body.xdata, "app", kUtf8));
    ASSERT_TRUE(list);
    std::vector<short> codes;
    for (const resbuf* rb = list.get(); rb; rb = rb->rbnext)
        codes.push_back(rb->restype);
    EXPECT_EQ(codes,
              (std::vector<short>{1001, 1000, 1002, 1003, 1004, 1002, 1005, 1010, 1011, 1040, 1041, 1042, 1070, 1071}));
    const resbuf* rb = list.get();
    EXPECT_EQ(velRbText(rb), "APP");
    EXPECT_EQ(velRbText(rb->rbnext), " a b ");
    const resbuf* binary = rb->rbnext->rbnext->rbnext->rbnext;
    ASSERT_EQ(binary->resval.rbinary.clen, 2);
    EXPECT_EQ(static_cast<unsigned char>(binary->resval.rbinary.buf[1]), 0xFF);
    const resbuf* point = binary->rbnext->rbnext->rbnext;
    EXPECT_EQ(point->resval.rpoint[2], 3.0);
    const resbuf* point2 = point->rbnext;
    EXPECT_EQ(point2->resval.rpoint[1], 5.0);
    EXPECT_EQ(point2->resval.rpoint[2], 0.0); // Z left out
    const resbuf* last = point2->rbnext->rbnext->rbnext->rbnext->rbnext;
    EXPECT_EQ(last->resval.rlong, 2147483647);
    EXPECT_EQ(XDataApps(body.xdata, kUtf8), (std::vector<std::string>{"OTHER", "APP"}));
    EXPECT_EQ(XDataToRb(body.xdata, "NONE", kUtf8), nullptr);
}

TEST(XData, MergeReplacesRemovesAndAppendsGroups)
{
    ObjectBody body = Parse("0\nLINE\n5\n1\n1001\nA\n1000\nold\n1001\nB\n1070\n1\n1001\nC\n1000\nc\n");
    VelRbBuilder list;
    list.add(velRbString(1001, "B")).add(velRbReal(1040, 0.1)).add(velRbString(1001, "a"));
    list.add(velRbString(1001, "D")).add(velRbPoint(1010, 1, 2, 3)).add(velRbLong(1071, -5));
    std::vector<std::string> apps;
    std::string error;
    ASSERT_TRUE(MergeXData(body, list.head(), kUtf8, apps, error)) << error;
    EXPECT_EQ(apps, (std::vector<std::string>{"B", "a", "D"}));
    EXPECT_EQ(Write(body), "  0\nLINE\n  5\n1\n1001\nB\n1040\n0.1\n1001\nC\n1000\nc\n"
                           "1001\nD\n1010\n1\n1020\n2\n1030\n3\n1071\n-5\n");
    EXPECT_TRUE(body.dirty);
}

TEST(XData, MergeRefusesMalformedListsWithoutChange)
{
    const struct {
        const char* name;
        VelRbPtr list;
        const char* error;
    } cases[] = {
        {"no application first", VelRbPtr(velRbString(1000, "x")),
         "la liste doit commencer par le nom d'application (code 1001)"},
        {"unbalanced", VelRbPtr(VelRbBuilder().add(velRbString(1001, "A")).add(velRbString(1002, "{")).release()),
         "données étendues incorrectes : il fallait « } » fermant le groupe (code 1002)"},
        {"not an XData code", VelRbPtr(VelRbBuilder().add(velRbString(1001, "A")).add(velRbShort(70, 1)).release()),
         "code de données étendues 70 inattendu"},
        {"line break in text",
         VelRbPtr(VelRbBuilder().add(velRbString(1001, "A")).add(velRbString(1000, "a\nb")).release()),
         "le texte du code 1000 contient un saut de ligne"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        ObjectBody body = Parse("0\nLINE\n5\n1\n1001\nA\n1000\nold\n");
        std::vector<std::string> apps;
        std::string error;
        EXPECT_FALSE(MergeXData(body, c.list.get(), kUtf8, apps, error));
        EXPECT_EQ(error, c.error);
        EXPECT_EQ(body.xdata.size(), 2u);
        EXPECT_FALSE(body.dirty);
    }
}

TEST(XData, TextIsEncodedForOldFiles)
{
    const TextEncoding cp1252 = TextEncoding::For("AC1018", "ANSI_1252");
    ObjectBody body = Parse("0\nLINE\n5\n1\n");
    VelRbBuilder list;
    list.add(velRbString(1001, "APP")).add(velRbString(1000, "Été Ω"));
    std::vector<std::string> apps;
    std::string error;
    ASSERT_TRUE(MergeXData(body, list.head(), cp1252, apps, error));
    EXPECT_EQ(body.xdata[1].value, "\xC9t\xE9 \\U+03A9");
    VelRbPtr back(XDataToRb(body.xdata, "APP", cp1252));
    EXPECT_EQ(velRbText(back->rbnext), "Été Ω");
}

TEST(Xrecord, DataWithAndWithoutCloningFlag)
{
    for (const char* flag : {"280\n1\n", ""}) {
        SCOPED_TRACE(flag);
        // The body refers to the text it was read from, which must outlive it.
        const std::string text = std::string("0\nXRECORD\n5\n1\n330\n2\n100\nAcDbXrecord\n") + flag +
                                 "1\ntexte\n10\n1\n20\n2\n30\n3\n40\n2.5\n70\n4\n90\n70000\n";
        ObjectBody body = Parse(text);
        VelRbPtr data(XrecordToRb(body, kUtf8));
        ASSERT_TRUE(data);
        EXPECT_EQ(velRbText(data.get()), "texte");
        EXPECT_EQ(data->rbnext->resval.rpoint[1], 2.0);
        EXPECT_EQ(data->rbnext->rbnext->resval.rreal, 2.5);
        EXPECT_EQ(data->rbnext->rbnext->rbnext->resval.rint, 4);
        EXPECT_EQ(data->rbnext->rbnext->rbnext->rbnext->resval.rlong, 70000);
        VelRbBuilder list;
        list.add(velRbString(1, "neuf"));
        std::string error;
        ASSERT_TRUE(SetXrecordData(body, list.head(), kUtf8, error));
        EXPECT_EQ(Write(body), std::string("  0\nXRECORD\n  5\n1\n330\n2\n100\nAcDbXrecord\n") +
                                   (*flag ? "280\n1\n" : "") + "  1\nneuf\n");
    }
}

} // namespace
} // namespace vel::dxf
