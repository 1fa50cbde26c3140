// Comb-duct and structure-material updates: keys, groups, categories, codes, and the
// purge of one family without touching the others of the shared group.
#include "generation/road_update.hpp"

#include <gtest/gtest.h>

#include <string>
#include <vector>

using namespace zodevi;

namespace {

using Names = std::vector<std::string>;

struct PurgeFlag {
    explicit PurgeFlag(bool on) { SetPurgeFlag(on); }
    ~PurgeFlag() { SetPurgeFlag(false); }
};

Names Keys(const CZodEVIGroup& group)
{
    Names keys;
    for (const CZodEVIArticle* article : group)
        keys.push_back(article->quantityKey.substr(1, article->quantityKey.size() - 2));
    return keys;
}

TEST(UpdateCombDucts, FilesModelsInTheGeneralGroup)
{
    CZodEVIBdr bdr;
    EXPECT_TRUE(UpdateCombDucts(bdr, {"P4"}));
    const CZodEVIGroup* group = bdr.GroupOf("PRJ_RES(RSX_GENERAL)", false);
    ASSERT_NE(group, nullptr);
    ASSERT_EQ(Keys(*group), (Names{"RSX_PGN_LIN_3D_P4", "RSX_PGN_NB_P4"}));
    EXPECT_EQ((*group)[0]->treePath, R"(Fourreau (peigne)\\Linéaire\\GC-001 - Fourniture et pose du peigne P4)");
    EXPECT_EQ((*group)[1]->treePath, R"(Fourreau (peigne)\\Linéaire\\GC-002 - Nombre de couronnes P4)");
    EXPECT_FALSE(UpdateCombDucts(bdr, {"P4"}));
    EXPECT_TRUE(UpdateCombDucts(bdr, {"P4", "P6"}));
    EXPECT_EQ(group->size(), 4u);
    EXPECT_FALSE(UpdateCombDucts(bdr, {"P6"}));

    PurgeFlag flag(true);
    EXPECT_TRUE(UpdateCombDucts(bdr, {"P6"}));
    EXPECT_EQ(Keys(*group), (Names{"RSX_PGN_LIN_3D_P6", "RSX_PGN_NB_P6"}));
    EXPECT_EQ(bdr.Articles().size(), 2u);
}

TEST(UpdateMaterials, MakesTheArticlesOfEachList)
{
    CZodEVIBdr bdr;
    EXPECT_TRUE(UpdateMaterials(bdr, {"Grave"}, {"Enduit"}, {"Bordure T2"}));
    const CZodEVIGroup* group = bdr.GroupOf("PRJ_PFM(),PRJ_RTE(),PRJ_PCV()", false);
    ASSERT_NE(group, nullptr);
    struct Expected {
        const char* key;
        const char* unit;
        const char* treePath;
    };
    const Expected expected[] = {
        {"PRJ_VOL_MAT_Grave", "m³",
         R"(Voirie\\Matériaux de structure\\Volumique\\GC-001 - Fourniture et mise en oeuvre de Grave)"},
        {"PRJ_TON_MAT_Grave", "tonne", R"(Voirie\\Matériaux de structure\\Volumique\\GC-002 - Grave en tonnes)"},
        {"PRJ_SFC_MAT_Enduit", "m²",
         R"(Voirie\\Surface de matériaux (enduits, pavés...)\\Surfacique\\GC-003 - Fourniture et mise en oeuvre de Enduit)"},
        {"PRJ_LIN_MAT_Bordure T2", "ml",
         R"(Voirie\\Bordures, caniveaux...\\Linéaire\\GC-004 - Fourniture et mise en oeuvre de Bordure T2)"},
        {"PRJ_VOL_RPF_Grave", "m³",
         R"(Voirie\\Travaux sur chaussées existantes\\Volumique\\GC-005 - Volume de reprofilage de Grave)"},
    };
    ASSERT_EQ(group->size(), std::size(expected));
    for (std::size_t i = 0; i < group->size(); ++i) {
        SCOPED_TRACE(expected[i].key);
        EXPECT_EQ((*group)[i]->quantityKey, MakeQuantityKey(expected[i].key));
        EXPECT_EQ((*group)[i]->unit, expected[i].unit);
        EXPECT_EQ((*group)[i]->treePath, expected[i].treePath);
    }
    EXPECT_FALSE(UpdateMaterials(bdr, {"Grave"}, {"Enduit"}, {"Bordure T2"}));
}

TEST(UpdateMaterials, PurgeOfAnEmptyVolumeListKeepsTheOtherFamilies)
{
    CZodEVIBdr bdr;
    UpdateMaterials(bdr, {"Grave", "GNT"}, {"Enduit"}, {"Bordure T2"});
    PurgeFlag flag(true);
    EXPECT_TRUE(UpdateMaterials(bdr, {}, {"Enduit"}, {"Bordure T2"}));
    const CZodEVIGroup* group = bdr.GroupOf("PRJ_PFM(),PRJ_RTE(),PRJ_PCV()", false);
    EXPECT_EQ(Keys(*group), (Names{"PRJ_SFC_MAT_Enduit", "PRJ_LIN_MAT_Bordure T2"}));
    EXPECT_EQ(bdr.Articles().size(), 2u);
    EXPECT_FALSE(UpdateMaterials(bdr, {}, {"Enduit"}, {"Bordure T2"}));
}

} // namespace
