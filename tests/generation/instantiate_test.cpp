// Instantiation and purge building blocks: which keys belong to a template's family,
// texts for networks without them, and purges that take exactly their own articles.
#include "generation/instantiate.hpp"

#include "generation/network_update.hpp"

#include <gtest/gtest.h>

#include <string>
#include <vector>

using namespace zodevi;

namespace {

struct PurgeFlag {
    explicit PurgeFlag(bool on) { SetPurgeFlag(on); }
    ~PurgeFlag() { SetPurgeFlag(false); }
};

const CZodEVIArtTemplate& TemplateOfKind(const CZodEVIBdr& bdr, int kind)
{
    return *TemplatesOfKind(bdr, kind).at(0);
}

TEST(KeyFitsPattern, NumbersMustBeWrittenInThePatternsFormat)
{
    struct Case {
        const char* pattern;
        const char* key;
        bool fits;
    };
    const Case cases[] = {
        {"RSX_VOL_%.2f_%.2f", R"("RSX_VOL_1.30_2.00")", true},
        {"RSX_VOL_%.2f_%.2f", R"("RSX_VOL_DEC_Grave")", false},
        {"RSX_VOL_%.2f_%.2f", R"("RSX_VOL_1.3_2.00")", false},
        {"RSX_VOL_%.2f_%.2f", R"("RSX_VOL_1.30_2.00_2D")", false},
        {"RSX_VOL_%.2f", R"("RSX_VOL_DEC_")", false},
        {"RSX_VOL_%.2f", R"("RSX_VOL_-1.50")", true},
        {"RSX_VOL_%.2f", "RSX_VOL_1.30", false},
        {"RSX_LIN_%.2f_2D", R"("RSX_LIN_1.30_2.00_2D")", false},
        {"PRJ_VOL_TOT_DEC_%.3f", R"("PRJ_VOL_TOT_DEC_0.25")", false},
        {"RSX_TUY_LIN_3D_%s", R"("RSX_TUY_LIN_3D_PVC 200")", true},
        {"RSX_TUY_LIN_3D_%s", R"("RSX_TUY_FRNT_LIN_3D_X")", false},
        {"RSX_TUY_LIN_3D_%s", R"("rsx_tuy_lin_3d_X")", false},
        {"RSX_%5.2f", R"("RSX_ 1.00")", false},
        {"100%%_%s", R"("100%_a")", true},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.pattern) + " " + c.key);
        EXPECT_EQ(KeyFitsPattern(c.pattern, c.key), c.fits);
    }
}

TEST(Instantiate, TemplateWithoutTextsForTheNetworkMakesNothing)
{
    CZodEVIBdr bdr;
    CZodEVIGroup& group = *bdr.GroupOf("PRJ_RES(EU)", true);
    // Simple ducts are for networks 2 to 12.
    EXPECT_FALSE(InstantiateByName(bdr, 1, "EU", TemplateOfKind(bdr, 28), "TPC", "PRJ_RES(EU)", group, false));
    // Only the low 16 bits of the index choose the texts.
    EXPECT_TRUE(InstantiateByName(bdr, 0x10002, "EU", TemplateOfKind(bdr, 28), "TPC", "PRJ_RES(EU)", group, false));
    ASSERT_EQ(group.size(), 1u);
    EXPECT_TRUE(group[0]->description.starts_with("Article associé aux réseaux AEP.\r\n"));
}

TEST(Purge, TemplateWithoutPlaceholderHasNoFamily)
{
    CZodEVIBdr bdr;
    UpdateNetwork(bdr, 1, "EU", {}, {}, {}, {}, {}, {}, {});
    CZodEVIGroup& group = *bdr.GroupOf("PRJ_RES(EU)", false);
    EXPECT_FALSE(PurgeByNames(bdr, {}, TemplateOfKind(bdr, 0), group));
    EXPECT_FALSE(PurgeByValues(bdr, {}, TemplateOfKind(bdr, 13), group));
    EXPECT_EQ(group.size(), 20u);
}

TEST(Purge, TakesItsOwnArticleWhenAnotherLooksTheSame)
{
    PurgeFlag flag(true);
    CZodEVIBdr bdr;
    // Two networks whose names differ only by case give articles with tree paths that
    // are equal without regard to case.
    UpdateNetwork(bdr, 1, "EU 1", {"PVC 200"}, {}, {}, {}, {}, {}, {});
    UpdateNetwork(bdr, 1, "eu 1", {"PVC 200"}, {}, {}, {}, {}, {}, {});
    const CZodEVIGroup& upper = *bdr.GroupOf("PRJ_RES(EU 1)", false);
    const CZodEVIGroup& lower = *bdr.GroupOf("PRJ_RES(eu 1)", false);
    ASSERT_EQ(upper.size(), 22u);
    EXPECT_TRUE(UpdateNetwork(bdr, 1, "eu 1", {}, {}, {}, {}, {}, {}, {}));
    EXPECT_EQ(upper.size(), 22u);
    EXPECT_EQ(lower.size(), 20u);
    EXPECT_EQ(bdr.Articles().size(), 42u);
    EXPECT_TRUE(bdr.FindInGroupByQuantityKey("\"RSX_TUY_LIN_3D_PVC 200\"", &upper));
    EXPECT_FALSE(bdr.FindInGroupByQuantityKey("\"RSX_TUY_LIN_3D_PVC 200\"", &lower));
}

} // namespace
