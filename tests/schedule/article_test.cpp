// The article record's field table, and the text rules built on it.
#include "schedule/art_template.hpp"
#include "schedule/article.hpp"

#include <gtest/gtest.h>

using namespace zodevi;

namespace {

// The readers and writers walk the record through its field table: it must name each of
// the 48 members once, in the record's order.
TEST(CZodEVIArticle, FieldTableWalksTheRecordInOrder)
{
    const CZodEVIArticle article;
    const auto* base = reinterpret_cast<const char*>(&article);
    std::ptrdiff_t previous = -1;
    for (const CZodEVIArticleField& field : ArticleFields()) {
        SCOPED_TRACE(field.name);
        const void* member =
            field.type == CZodEVIArticleField::Type::Text   ? static_cast<const void*>(&(article.*field.text))
            : field.type == CZodEVIArticleField::Type::Real ? static_cast<const void*>(&(article.*field.real))
                                                            : &(article.*field.integer);
        const std::ptrdiff_t offset = static_cast<const char*>(member) - base;
        EXPECT_GT(offset, previous);
        previous = offset;
    }
    EXPECT_EQ(ArticleFields().size(), 48u);
    EXPECT_EQ(previous, reinterpret_cast<const char*>(&article.treePath) - base);
}

TEST(ArticleText, NatureLevels)
{
    const char* expected[] = {
        "", R"(\\Ponctuel)", R"(\\Linéaire)", R"(\\Surfacique)", R"(\\Volumique)", R"(\\Textuel)", R"(\\Non Graphique)",
        ""};
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
    struct Case {
        const char* key;
        const char* name;
    };
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
    struct Case {
        const char* treePath;
        int nature;
        const char* category;
    };
    const Case cases[] = {
        {R"(EU 1\\Canalisation EU\\Linéaire\\EU-001 - PVC 200)", 2, R"(EU 1\\Canalisation EU)"},
        // A level after the nature level goes as well.
        {R"(A\\Ponctuel\\Détail\\X-001 - d)", 1, "A"},
        // Volumes and texts are cut at their own level, like the other natures.
        {R"(Voirie\\Terrassements\\Déblais\\Volumique\\GC-001 - Volume des déblais)", 4,
         R"(Voirie\\Terrassements\\Déblais)"},
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
