// Stripping, vegetation and planing updates: keys written with the pattern's own
// decimals, texts with two, classes from 0, and purges that spare the other families
// of the road group.
#include "generation/earthwork_update.hpp"

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

Names RoadKeys(CZodEVIBdr& bdr)
{
    Names keys;
    for (const CZodEVIArticle* article : *bdr.GroupOf(MakeRoadGroupKey(), true))
        keys.push_back(article->quantityKey.substr(1, article->quantityKey.size() - 2));
    return keys;
}

TEST(UpdateStripping, OneVolumeAndOneSurfacePerThickness)
{
    CZodEVIBdr bdr;
    EXPECT_TRUE(UpdateStripping(bdr, {0.20, 0.30}));
    EXPECT_EQ(RoadKeys(bdr), (Names{"PRJ_VOL_TOT_DEC_0.200", "PRJ_VOL_TOT_DEC_0.300", "PRJ_SFC_DEC_3D_0.200",
                                    "PRJ_SFC_DEC_3D_0.300"}));
    const CZodEVIGroup& group = *bdr.GroupOf(MakeRoadGroupKey(), false);
    EXPECT_EQ(group[0]->unit, "m³");
    EXPECT_EQ(group[2]->unit, "m²");
    EXPECT_EQ(group[0]->designation, "Volume de décapage sur une épaisseur de 0.20 m");
    EXPECT_EQ(group[0]->treePath,
              R"(Voirie\\Terrassements\\Terre végétale\\Décapage\\Volumique\\GC-001 - )" + group[0]->designation);
    EXPECT_FALSE(UpdateStripping(bdr, {0.20, 0.30}));
}

TEST(UpdatePlaning, ClassesStartAtZeroAndRepeatingChangesNothing)
{
    CZodEVIBdr bdr;
    EXPECT_TRUE(UpdatePlaning(bdr, {0.05, 0.10}));
    EXPECT_EQ(RoadKeys(bdr), (Names{"PRJ_SFC_RAB_0.00_0.05_3D", "PRJ_SFC_RAB_0.05_0.10_3D", "PRJ_SFC_RAB_0.10_3D"}));
    const CZodEVIGroup& group = *bdr.GroupOf(MakeRoadGroupKey(), false);
    EXPECT_EQ(group[0]->designation, "Surface 3D de rabotage d'épaisseur entre 0.00 m et 0.05 m");
    EXPECT_EQ(group[2]->designation, "Surface 3D de rabotage d'épaisseur > à 0.10 m");
    PurgeFlag flag(true);
    EXPECT_FALSE(UpdatePlaning(bdr, {0.05, 0.10}));
    EXPECT_EQ(RoadKeys(bdr).size(), 3u);
    EXPECT_TRUE(UpdatePlaning(bdr, {0.10}));
    EXPECT_EQ(RoadKeys(bdr), (Names{"PRJ_SFC_RAB_0.10_3D", "PRJ_SFC_RAB_0.00_0.10_3D"}));
}

TEST(EarthworkPurge, SparesTheOtherFamiliesOfTheRoadGroup)
{
    CZodEVIBdr bdr;
    UpdateMaterials(bdr, {"Grave"}, {}, {});
    UpdateStripping(bdr, {12.5, 0.25});
    // Vegetation and stripping of one thickness are distinct articles.
    EXPECT_TRUE(UpdateVegetation(bdr, {0.25}));
    PurgeFlag flag(true);
    // An empty list removes the family's articles that the length test admits:
    // PRJ_VOL_TOT_DEC_12.500 is longer than the sample PRJ_VOL_TOT_DEC_0.000.
    EXPECT_TRUE(UpdateStripping(bdr, {}));
    EXPECT_EQ(RoadKeys(bdr),
              (Names{"PRJ_VOL_MAT_Grave", "PRJ_TON_MAT_Grave", "PRJ_VOL_RPF_Grave", "PRJ_VOL_TOT_DEC_12.500",
                     "PRJ_SFC_DEC_3D_12.500", "PRJ_VOL_TOT_VEG_0.250", "PRJ_SFC_TOT_VEG_0.250"}));
    EXPECT_FALSE(UpdatePlaning(bdr, {}));
}

} // namespace
