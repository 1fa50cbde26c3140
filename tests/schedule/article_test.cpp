// The article record's defaults and copies, and the text rules built on it.
#include "schedule/art_template.hpp"
#include "schedule/article.hpp"

#include <gtest/gtest.h>

namespace {

using Type = CZodEVIArticleField::Type;

// Field types in record order: S text, R real, I int.
constexpr std::string_view kTypes = "SRRRRSIISISSSSSIISISIIISIRRISISISSRISSRRRISIRRRS";

TEST(CZodEVIArticle, DefaultsOfAllFields)
{
    ASSERT_EQ(kTypes.size(), 48u);
    const CZodEVIArticle article;
    const auto& fields = ArticleFields();
    for (std::size_t i = 0; i < fields.size(); ++i) {
        const int position = static_cast<int>(i) + 1;
        SCOPED_TRACE(fields[i].name);
        const char expectedType = kTypes[i];
        switch (fields[i].type) {
        case Type::Text:
            EXPECT_EQ(expectedType, 'S');
            EXPECT_EQ(article.*fields[i].text, "");
            break;
        case Type::Real: {
            EXPECT_EQ(expectedType, 'R');
            const double expected = position == 4 ? 19.6
                                  : (position == 5 || position == 39 || position == 41 || position == 45 || position == 46) ? 1.0
                                                                                                                           : 0.0;
            EXPECT_EQ(article.*fields[i].real, expected);
            break;
        }
        case Type::Int: {
            EXPECT_EQ(expectedType, 'I');
            const int expected = position == 7 ? -1 : position == 10 ? 2
                               : (position == 22 || position == 32 || position == 36) ? 7 : 0;
            EXPECT_EQ(article.*fields[i].integer, expected);
            break;
        }
        }
    }
    EXPECT_STREQ(fields[0].name, "code");
    EXPECT_STREQ(fields[47].name, "treePath");
}

TEST(CZodEVIArticle, CopyTakesEveryFieldAndSharesNothing)
{
    CZodEVIArticle source;
    const auto& fields = ArticleFields();
    for (std::size_t i = 0; i < fields.size(); ++i) {
        switch (fields[i].type) {
        case Type::Text: source.*fields[i].text = "texte " + std::to_string(i) + std::string(40, 'x'); break;
        case Type::Real: source.*fields[i].real = 0.5 + static_cast<double>(i); break;
        case Type::Int: source.*fields[i].integer = 100 + static_cast<int>(i); break;
        }
    }
    CZodEVIArticle copy;
    copy = source;
    for (std::size_t i = 0; i < fields.size(); ++i) {
        switch (fields[i].type) {
        case Type::Text: (source.*fields[i].text)[0] = 'T'; break;
        case Type::Real: source.*fields[i].real = -1; break;
        case Type::Int: source.*fields[i].integer = -1; break;
        }
    }
    for (std::size_t i = 0; i < fields.size(); ++i) {
        SCOPED_TRACE(fields[i].name);
        switch (fields[i].type) {
        case Type::Text: EXPECT_EQ(copy.*fields[i].text, "texte " + std::to_string(i) + std::string(40, 'x')); break;
        case Type::Real: EXPECT_EQ(copy.*fields[i].real, 0.5 + static_cast<double>(i)); break;
        case Type::Int: EXPECT_EQ(copy.*fields[i].integer, 100 + static_cast<int>(i)); break;
        }
    }
}

TEST(ArticleText, NatureLevels)
{
    const char* expected[] = {"", R"(\\Ponctuel)", R"(\\Linéaire)", R"(\\Surfacique)", R"(\\Volumique)",
                              R"(\\Textuel)", R"(\\Non Graphique)", ""};
    for (int nature = 0; nature <= 7; ++nature) {
        SCOPED_TRACE(nature);
        EXPECT_EQ(MakeNatureLevel(nature), expected[nature]);
    }
    EXPECT_EQ(MakeNatureLevel(-1), "");
}

TEST(ArticleText, TreePathCategoryAndKeys)
{
    CZodEVIArtParam texts;
    texts.categoryPattern = R"(%s\\Canalisation EU)";
    EXPECT_EQ(MakeCategory(texts, 2, "EU 1"), R"(EU 1\\Canalisation EU\\Linéaire)");
    // A network name is data: its percent signs and quotes are kept as they are.
    EXPECT_EQ(MakeCategory(texts, 1, "R%s \"x\" \\"), R"(R%s "x" \\\Canalisation EU\\Ponctuel)");
    texts.categoryPattern = R"(Voirie\\Terrassements\\Déblais)";
    EXPECT_EQ(MakeCategory(texts, 4), R"(Voirie\\Terrassements\\Déblais\\Volumique)");
    EXPECT_EQ(MakeCategory(texts, 9), R"(Voirie\\Terrassements\\Déblais)");
    EXPECT_EQ(MakeTreePath(R"(Voirie\\Terrassements\\Déblais\\Volumique)", "GC-001", "Volume des déblais"),
              R"(Voirie\\Terrassements\\Déblais\\Volumique\\GC-001 - Volume des déblais)");
    EXPECT_EQ(MakeQuantityKey("PRJ_VOL_TOT_DBL"), "\"PRJ_VOL_TOT_DBL\"");
    EXPECT_EQ(MakeNetworkGroupKey("RSX_GENERAL"), "PRJ_RES(RSX_GENERAL)");
    EXPECT_EQ(MakeRoadGroupKey(), "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()");
}

TEST(ArticleText, NetworkNameOfKey)
{
    struct Case { const char* key; const char* name; };
    const Case cases[] = {
        {"PRJ_RES(EU 1)", "EU 1"},
        {"PRJ_RES(EU (tranche 2))", "EU (tranche 2)"},
        {"PRJ_RES(RSX_GENERAL)", "RSX_GENERAL"},
        {"PRJ_RES()", ""},
        {"0", nullptr},
        {"PRJ_PFM(),PRJ_RTE(),PRJ_PCV()", nullptr},
        {"PRJ_RES(sans fin", nullptr},
        {")PRJ_RES(", nullptr},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.key);
        const auto name = NetworkNameOfKey(c.key);
        ASSERT_EQ(name.has_value(), c.name != nullptr);
        if (name) {
            EXPECT_EQ(*name, c.name);
        }
    }
}

TEST(ArticleText, KeyKinds)
{
    EXPECT_TRUE(IsRoadGroupKey("PRJ_PFM(),PRJ_RTE(),PRJ_PCV()"));
    EXPECT_TRUE(IsRoadGroupKey("PRJ_RTE()"));
    EXPECT_FALSE(IsRoadGroupKey("PRJ_RTE(A)"));
    EXPECT_TRUE(IsAssociatedKey("PRJ_RTE(A)"));
    EXPECT_TRUE(IsAssociatedKey("PRJ_RES(EU)"));
    EXPECT_FALSE(IsAssociatedKey("0"));
    EXPECT_FALSE(IsAssociatedKey("prj_res(EU)"));
}

TEST(ArticleText, DeriveCategory)
{
    struct Case { const char* treePath; int nature; const char* category; };
    const Case cases[] = {
        {R"(EU 1\\Canalisation EU\\Linéaire\\EU-001 - PVC 200)", 2, R"(EU 1\\Canalisation EU)"},
        // A level after the nature level goes as well.
        {R"(A\\Ponctuel\\Détail\\X-001 - d)", 1, "A"},
        // Volumes and texts are cut at their own level, like the other natures.
        {R"(Voirie\\Terrassements\\Déblais\\Volumique\\GC-001 - Volume des déblais)", 4, R"(Voirie\\Terrassements\\Déblais)"},
        {R"(Notes\\Textuel\\TX-001 - Remarque)", 5, "Notes"},
        {R"(Divers\\Non Graphique\\TP-001 - Forfait)", 6, "Divers"},
        // An unknown nature keeps the text before the separator.
        {R"(Divers\\Autre\\X-001 - d)", 9, R"(Divers\\Autre)"},
        // The nature level is not in the path: nothing is cut.
        {R"(Divers\\X-001 - d)", 3, "Divers"},
        {"X-001 - sans catégorie", 2, nullptr},
        {R"(\\Linéaire\\X-001 - d)", 2, nullptr},
        {"", 2, nullptr},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.treePath);
        CZodEVIArticle article;
        article.treePath = c.treePath;
        article.nature = c.nature;
        const auto category = DeriveCategory(article);
        ASSERT_EQ(category.has_value(), c.category != nullptr);
        if (category) {
            EXPECT_EQ(*category, c.category);
        }
    }
}

} // namespace
