// Locale-free formatting, case folding, sorting and joining.
#include "text/text.hpp"

#include <clocale>
#include <cmath>
#include <gtest/gtest.h>
#include <limits>

namespace {

TEST(FormatReal, DecimalsAndGeneralForm)
{
    struct Case {
        double value;
        int decimals;
        const char* expected;
    };
    const Case cases[] = {
        {2.71828, 2, "2.72"},     {0.5, -1, "0.5"}, {1.3, 2, "1.30"},   {0.0125, 3, "0.013"},
        {1500000, -1, "1.5e+06"}, {-3.0, 0, "-3"},  {12.5, 2, "12.50"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.expected);
        EXPECT_EQ(FormatReal(c.value, c.decimals), c.expected);
    }
}

TEST(FormatString, GrowsBeyondAnyFixedBuffer)
{
    const std::string big(10000, 'x');
    const std::string out = FormatString("[%s]-%03d", big.c_str(), 7);
    EXPECT_EQ(out.size(), big.size() + 6);
    EXPECT_EQ(out.substr(out.size() - 5), "]-007");
    EXPECT_EQ(FormatString("%s", "50 % de remise"), "50 % de remise");
}

TEST(FormatString, NeverFollowsTheProcessLocale)
{
    const char* names[] = {"fr_FR.UTF-8", "fr_FR.utf8", "de_DE.UTF-8"};
    const char* set = nullptr;
    for (const char* n : names)
        if ((set = std::setlocale(LC_ALL, n)) != nullptr)
            break;
    if (set == nullptr)
        GTEST_SKIP() << "no locale with a decimal comma on this machine";
    EXPECT_EQ(FormatString("RSX_VOL_%.2f_%.2f", 1.3, 2.0), "RSX_VOL_1.30_2.00");
    EXPECT_EQ(FormatReal(0.5, -1), "0.5");
    EXPECT_EQ(ParseReal("12.5"), 12.5);
    EXPECT_FALSE(ParseReal("12,5").has_value());
    std::setlocale(LC_ALL, "C");
}

TEST(FormatRealShortest, ReadsBackEqual)
{
    const double values[] = {12345.67, 1500000, 0.1, 19.6, 1e-300, 123456789.125, std::numeric_limits<double>::max(),
                             -0.0};
    for (double v : values) {
        const std::string t = FormatRealShortest(v);
        SCOPED_TRACE(t);
        ASSERT_TRUE(ParseReal(t).has_value());
        EXPECT_EQ(*ParseReal(t), v);
    }
    EXPECT_EQ(FormatRealShortest(19.6), "19.6");
    EXPECT_EQ(FormatRealShortest(12345.67), "12345.67");
    EXPECT_EQ(FormatRealShortest(1500000), "1500000");
}

TEST(ParseNumbers, RejectsPartialAndAcceptsBlanks)
{
    EXPECT_EQ(ParseReal(" 1.25 "), 1.25);
    EXPECT_EQ(ParseReal("+3"), 3.0);
    EXPECT_FALSE(ParseReal("1.2.3"));
    EXPECT_FALSE(ParseReal(""));
    EXPECT_FALSE(ParseReal("abc"));
    EXPECT_EQ(ParseInt("-42"), -42);
    EXPECT_FALSE(ParseInt("4x"));
    EXPECT_FALSE(ParseInt("99999999999999999999999"));
}

TEST(CompareNoCase, FoldsLatinLettersOfTheWesternCodePage)
{
    struct Case {
        const char* a;
        const char* b;
        int sign;
    };
    const Case cases[] = {
        {"gc-001", "GC-001", 0}, {"Réseau", "RÉSEAU", 0},
        {"cœur", "CŒUR", 0},     {"Ÿvon", "ÿVON", 0},
        {"Šárka", "ŠÁRKA", 0},   {"ça", "ÇA", 0},
        {"a", "B", -1},          {"B", "a", 1},
        {"abc", "ab", 1},        {"", "", 0},
        {"é", "f", 1},       // accented letters sort after ASCII
        {"\xff", "z", 1},    // an invalid byte is itself, after every character
        {"\xc3", "\xc3", 0}, // truncated sequence still equals itself
        {"×", "÷", -1},      // the multiplication sign has no case
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.a) + " / " + c.b);
        const int r = CompareNoCase(c.a, c.b);
        EXPECT_EQ((r > 0) - (r < 0), c.sign);
        EXPECT_EQ(FoldCase(c.a) == FoldCase(c.b), c.sign == 0);
    }
}

TEST(FirstChars, CountsCodePoints)
{
    EXPECT_EQ(FirstChars("Réseau X", 2), "Ré");
    EXPECT_EQ(FirstChars("É", 2), "É");
    EXPECT_EQ(FirstChars("", 2), "");
    EXPECT_EQ(CharCount("Réseau"), 6u);
    EXPECT_EQ(CharCount("\xff\xfe"), 2u);
}

TEST(Utf8, InvalidBytesBecomeReplacementCharacters)
{
    struct Case {
        const char* text;
        std::u32string points;
    };
    const Case cases[] = {
        {"Décharger €", U"Décharger €"},
        {"\xe9t\xe9", U"\uFFFDt\uFFFD"},         // Latin-1
        {"a\xc3", U"a\uFFFD"},                   // cut in the middle of a character
        {"\xed\xa0\x80", U"\uFFFD\uFFFD\uFFFD"}, // a surrogate
        {"\xc0\xaf", U"\uFFFD\uFFFD"},           // an overlong "/"
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.text);
        EXPECT_EQ(DecodeUtf8(c.text), c.points);
    }
    EXPECT_EQ(EncodeUtf8(U"Métré \U0001F600"), "Métré \xf0\x9f\x98\x80");
    EXPECT_EQ(EncodeUtf8(std::u32string{0xD800, 0x110000}), "\xef\xbf\xbd\xef\xbf\xbd");
}

TEST(SortStrings, StableWithOrWithoutCase)
{
    std::vector<std::string> v{"a", "B", "é", "A", "b"};
    SortStrings(v, false);
    EXPECT_EQ(v, (std::vector<std::string>{"A", "B", "a", "b", "é"}));
    v = {"a", "B", "É", "A", "b", "é"};
    SortStrings(v, true);
    EXPECT_EQ(v, (std::vector<std::string>{"a", "A", "B", "b", "É", "é"}));
}

TEST(JoinStrings, Separators)
{
    EXPECT_EQ(JoinStrings({}, ", "), "");
    EXPECT_EQ(JoinStrings({"seul"}, ", "), "seul");
    EXPECT_EQ(JoinStrings({"a", "b", "c"}, ", "), "a, b, c");
}

TEST(FormatPattern, FillsOnlyWhatItIsGiven)
{
    struct Case {
        const char* pattern;
        std::vector<PatternArg> args;
        const char* expected;
    };
    const Case cases[] = {
        {"RSX_VOL_%.2f_%.2f", {1.3, 2.0}, "RSX_VOL_1.30_2.00"},
        {"Longueur 2D %.2f m <= H <= %.2f m", {1.3}, "Longueur 2D 1.30 m <= H <= 0.00 m"},
        {"RSX_TUY_LIN_3D_%s", {"PVC 200 %n %s"}, "RSX_TUY_LIN_3D_PVC 200 %n %s"},
        {"%s\\\\Canalisation EP", {"EU \"1\""}, "EU \"1\"\\\\Canalisation EP"},
        {"Fourreau (peigne)", {"ignored"}, "Fourreau (peigne)"},
        {"%s-%03d", {"GC", 7}, "GC-007"},
        {"100%% %n %p %ls %", {}, "100% %n %p %ls %"},
        {"%s : %-*.*s  %s", {"M", 6, 6, "Glob", "loc"}, "M : Glob    loc"},
        {"[%*d]", {100000, 7}, nullptr},
        {"%.3f m", {std::string("0.125")}, "0.125 m"},
        {"%d", {2.9}, "2"},
        {"%s", {0.1}, "0.1"},
        {"%s et %s", {}, " et "},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.pattern);
        if (c.expected == nullptr) // a width from the data is bounded
            EXPECT_EQ(FormatPattern(c.pattern, c.args).size(), 1001u);
        else
            EXPECT_EQ(FormatPattern(c.pattern, c.args), c.expected);
    }
}

} // namespace
