// The exchange with the metre module, against a stand-in whose answers each
// test sets: reading with the project-wide articles, prices by selector, the editor's
// changes and the faults of partial reads and regrouped modifications.
#include "schedule/schedule_exchange.hpp"

#include "schedule/metre_link.hpp"
#include "text/text.hpp"
#include "velhost/rx.h"
#include "velhost/ui.h"

#include <gtest/gtest.h>

#include <deque>
#include <sstream>

namespace {

// A metre module whose file and answers each test sets.
struct FakeMetre final : CZodEVIBdrMetre {
    std::int32_t FillTable(const std::string&, std::vector<CZodEVIArticle*>& table) override
    {
        for (const CZodEVIArticle& article : file) {
            table.push_back(new CZodEVIArticle(article));
            if (failAfterPartialRead && table.size() == 2)
                return 1;
        }
        return 0;
    }
    std::int32_t ExportTable(const std::string&, std::vector<CZodEVIArticle*>& table) override
    {
        ++writes;
        file.clear();
        for (const CZodEVIArticle* article : table)
            file.push_back(*article);
        return 0;
    }
    std::int32_t EditSchedule(const std::string&, const std::string& treePath, std::vector<CZodEVIArticle*>& records,
                              std::vector<std::uint32_t>& actions) override
    {
        editorLabel = treePath;
        for (const auto& [article, kind] : editorChanges) {
            records.push_back(new CZodEVIArticle(article));
            actions.push_back(kind);
        }
        return editorAnswer;
    }
    std::int32_t CurrencySymbol(std::string&) override { return 1; }

    std::vector<CZodEVIArticle> file;
    bool failAfterPartialRead = false;
    int writes = 0;
    std::int32_t editorAnswer = 0;
    std::vector<std::pair<CZodEVIArticle, std::uint32_t>> editorChanges;
    std::string editorLabel;
};

CZodEVIArticle Article(const std::string& code, const std::string& key, const std::string& group,
                       const std::string& treePath, double price = 0, int nature = 2)
{
    CZodEVIArticle a;
    a.code = code;
    a.quantityKey = key;
    a.groupKey = group;
    a.treePath = treePath;
    a.unitPrice = price;
    a.nature = nature;
    a.designation = code;
    return a;
}

class ScheduleExchange : public ::testing::Test {
protected:
    void SetUp() override
    {
        SetBdrMetre(&fake);
        previousUI = velSetUI(&ui);
    }
    void TearDown() override
    {
        velSetUI(previousUI);
        SetBdrMetre(nullptr);
    }
    std::size_t TemplatesOfKind(int kind)
    {
        CZodEVIArtTemplateArray selection;
        selection.SetOwning(false);
        return static_cast<std::size_t>(bdr.Catalogue().SelectKind(kind, selection));
    }
    std::size_t GroupSize(const std::string& key)
    {
        const CZodEVIGroup* group = bdr.Groups().Find(key);
        return group == nullptr ? 0 : group->size();
    }

    FakeMetre fake;
    CZodEVIBdr bdr;
    std::istringstream script;
    std::ostringstream output;
    VelScriptedUI ui{script, output, "test.scr"};
    VelUserInterface* previousUI = nullptr;
};

const std::string kRoad = "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()";

TEST_F(ScheduleExchange, ReadAddsProjectWideArticlesOnce)
{
    fake.file = {Article("EU-001", "\"RSX_TUY_LIN_3D_PVC 200\"", "PRJ_RES(EU1)", "Réseaux\\\\EU1\\\\EU-001 - Tuyau")};
    ASSERT_TRUE(Read(bdr));
    const std::size_t added = TemplatesOfKind(1) + TemplatesOfKind(41) + TemplatesOfKind(42) + TemplatesOfKind(50);
    ASSERT_GT(added, 3u);
    EXPECT_EQ(bdr.Articles().size(), 1 + added);
    EXPECT_EQ(GroupSize(kRoad), added);
    for (const auto& article : bdr.Articles())
        if (article->groupKey == kRoad) {
            EXPECT_EQ(article->metreInt4, 0);
            EXPECT_NE(article->number, -1);
            EXPECT_NE(article->treePath.find(article->code + " - " + article->designation), std::string::npos);
        }
    ASSERT_TRUE(Write(bdr));
    ASSERT_TRUE(Read(bdr));
    EXPECT_EQ(bdr.Articles().size(), 1 + added) << "a second read must add nothing";
}

TEST_F(ScheduleExchange, ReadWithCutVolumeAddsOnlyFillAndSawing)
{
    fake.file = {Article("GC-001", "\"PRJ_VOL_TOT_DBL\"", kRoad, "Voirie\\\\Volumique\\\\GC-001 - Déblais")};
    ASSERT_TRUE(Read(bdr));
    EXPECT_EQ(GroupSize(kRoad), 1 + TemplatesOfKind(42) + TemplatesOfKind(50));
    int cutVolumes = 0;
    for (const auto& article : bdr.Articles())
        cutVolumes += article->quantityKey == "\"PRJ_VOL_TOT_DBL\"";
    EXPECT_EQ(cutVolumes, 1);
}

TEST_F(ScheduleExchange, FailedPartialReadLeavesStoreEmpty)
{
    fake.file = {Article("A-001", "\"A\"", "PRJ_RES(EU1)", "X\\\\A-001 - A"),
                 Article("A-002", "\"B\"", "PRJ_RES(EU1)", "X\\\\A-002 - B"),
                 Article("A-003", "\"C\"", "0", "X\\\\A-003 - C")};
    fake.failAfterPartialRead = true;
    EXPECT_FALSE(Read(bdr));
    EXPECT_TRUE(bdr.Articles().empty());
    EXPECT_TRUE(bdr.Groups().Empty());
}

TEST_F(ScheduleExchange, MissingMetreModuleFailsEveryCall)
{
    SetBdrMetre(nullptr);
    EXPECT_FALSE(Read(bdr));
    EXPECT_TRUE(bdr.Articles().empty());
    EXPECT_FALSE(Write(bdr));
    EXPECT_FALSE(Edit(bdr, ""));
}

TEST_F(ScheduleExchange, PricesBySelector)
{
    const char* const patterns[] = {"RSX_TUY_LIN_3D_", "RSX_TUY_NB_",      "RSX_FRX_LIN_3D_",      "RSX_FRX_NB_",
                                    "RSX_PGN_LIN_3D_", "RSX_PGN_NB_",      "RSX_SBL_NB_",          "RSX_TUY_FRNT_LIN_3D_",
                                    "RSX_SBL_FRNT_NB_", "PRJ_VOL_MAT_",    "PRJ_SFC_MAT_",         "PRJ_LIN_MAT_",
                                    "PRJ_TON_MAT_"};
    for (int s = 0; s <= 12; ++s)
        fake.file.push_back(Article(FormatString("P-%03d", s), FormatString("\"%sPVC 200\"", patterns[s]),
                                    s <= 8 ? "PRJ_RES(EU1)" : kRoad, FormatString("Cat\\\\P-%03d - x", s), 10 + s));
    ASSERT_TRUE(Read(bdr));
    for (int s = 0; s <= 12; ++s) {
        SCOPED_TRACE(s);
        double price = -1;
        EXPECT_TRUE(GetPrice(bdr, s, "pvc 200", price, "EU1")) << "keys compare without regard to case";
        EXPECT_EQ(price, 10 + s);
        EXPECT_TRUE(SetPrice(bdr, s, "PVC 200", 100 + s, "EU1"));
        EXPECT_TRUE(GetPrice(bdr, s, "PVC 200", price, "EU1"));
        EXPECT_EQ(price, 100 + s);
    }
    struct Case {
        int selector;
        const char* network;
    } misses[] = {{-1, "EU1"}, {13, "EU1"}, {0, "EP1"}, {0, ""}};
    for (const Case& c : misses) {
        SCOPED_TRACE(c.selector);
        double price = -1;
        EXPECT_FALSE(GetPrice(bdr, c.selector, "PVC 200", price, c.network));
        EXPECT_EQ(price, 0);
        EXPECT_FALSE(SetPrice(bdr, c.selector, "PVC 200", 5, c.network));
    }
}

TEST_F(ScheduleExchange, EmptyNetworkMeansGeneralForGetPriceButEveryGroupForShowPrice)
{
    fake.file = {Article("EU-001", "\"RSX_FRX_NB_Té\"", "PRJ_RES(EU1)", "R\\\\EU1\\\\EU-001 - Té EU"),
                 Article("GE-001", "\"RSX_FRX_NB_Té\"", "PRJ_RES(RSX_GENERAL)", "R\\\\GE-001 - Té général", 7)};
    ASSERT_TRUE(Read(bdr));
    double price = 0;
    EXPECT_TRUE(GetPrice(bdr, 3, "Té", price, ""));
    EXPECT_EQ(price, 7);
    EXPECT_TRUE(ShowPrice(bdr, 3, "Té", ""));
    EXPECT_EQ(fake.editorLabel, "R\\\\EU1\\\\EU-001 - Té EU") << "the first group holding the key is shown";
    EXPECT_TRUE(ShowPrice(bdr, 1, "Té", "") == false);
    EXPECT_NE(output.str().find("ERREUR : aucun article ne se réfère à l'élément !"), std::string::npos);
}

TEST_F(ScheduleExchange, PricesPerNetworkKeepEveryDigit)
{
    fake.file = {Article("GE-001", "\"RSX_TUY_LIN_3D_PVC\"", "PRJ_RES(RSX_GENERAL)", "R\\\\GE-001 - a", 12345.67),
                 Article("EU-001", "\"RSX_TUY_LIN_3D_PVC\"", "PRJ_RES(EU (tranche 2))", "R\\\\EU-001 - b", 1500000),
                 Article("EP-001", "\"RSX_TUY_LIN_3D_PVC\"", "PRJ_RES(EP1)", "R\\\\EP-001 - c", 0.1)};
    ASSERT_TRUE(Read(bdr));
    std::map<std::string, std::string> prices;
    ASSERT_TRUE(GetPricesPerNetwork(bdr, 0, "PVC", prices));
    EXPECT_EQ(prices, (std::map<std::string, std::string>{{"*", "12345.67"}})) << "right after a read only \"*\"";
    bdr.SetNetworkIndex("PRJ_RES(EU (tranche 2))", 1);
    bdr.SetNetworkIndex("PRJ_RES(EP1)", 0);
    ASSERT_TRUE(GetPricesPerNetwork(bdr, 0, "PVC", prices));
    EXPECT_EQ(prices, (std::map<std::string, std::string>{
                          {"*", "12345.67"}, {"EU (tranche 2)", "1500000"}, {"EP1", "0.1"}}));
    EXPECT_FALSE(GetPricesPerNetwork(bdr, 1, "PVC", prices));
    EXPECT_TRUE(prices.empty());
}

TEST_F(ScheduleExchange, EditDeletesAndAddsBesideAnAssociatedArticle)
{
    fake.file = {Article("EU-001", "\"RSX_TUY_LIN_3D_PVC\"", "PRJ_RES(EU1)", "Réseaux\\\\EU1\\\\Linéaire\\\\EU-001 - Tuyau"),
                 Article("EU-002", "\"RSX_TUY_NB_PVC\"", "PRJ_RES(EU1)", "Réseaux\\\\EU1\\\\Linéaire\\\\EU-002 - Nombre")};
    ASSERT_TRUE(Read(bdr));
    const std::size_t before = bdr.Articles().size();
    fake.writes = 0;
    CZodEVIArticle added = Article("EU-009", "", "0", "Réseaux\\\\EU1\\\\Linéaire\\\\EU-009 - Regard");
    fake.editorChanges = {{fake.file[1], kEditDeleted}, {added, kEditAdded}};
    ASSERT_TRUE(Edit(bdr, ""));
    EXPECT_EQ(bdr.Articles().size(), before);
    EXPECT_FALSE(bdr.FindByTreePath(fake.file.empty() ? "" : "Réseaux\\\\EU1\\\\Linéaire\\\\EU-002 - Nombre"));
    const CZodEVIArticle* stored = bdr.FindByTreePath(added.treePath).article;
    ASSERT_NE(stored, nullptr);
    EXPECT_EQ(stored->groupKey, "PRJ_RES(EU1)");
    EXPECT_EQ(GroupSize("PRJ_RES(EU1)"), 2u);
    EXPECT_EQ(fake.writes, 1) << "the new group key must reach the file";
}

TEST_F(ScheduleExchange, ModificationWithNewGroupKeyMovesToThatGroup)
{
    fake.file = {Article("EU-001", "\"K\"", "PRJ_RES(EU1)", "R\\\\EU-001 - a", 5)};
    ASSERT_TRUE(Read(bdr));
    CZodEVIArticle moved = fake.file[0];
    moved.groupKey = "PRJ_RES(EU2)";
    moved.unitPrice = 8;
    fake.editorChanges = {{moved, kEditModified}, {Article("X", "", "0", "nowhere"), kEditModified}};
    ASSERT_TRUE(Edit(bdr, "R\\\\EU-001 - a"));
    EXPECT_EQ(fake.editorLabel, "R\\\\EU-001 - a");
    EXPECT_EQ(GroupSize("PRJ_RES(EU1)"), 0u);
    ASSERT_EQ(GroupSize("PRJ_RES(EU2)"), 1u);
    EXPECT_EQ(bdr.Groups().Find("PRJ_RES(EU2)")->front()->unitPrice, 8);
    double price = 0;
    EXPECT_TRUE(GetPrice(bdr, 9, "x", price, "") == false);
}

TEST_F(ScheduleExchange, EditorThatFailsChangesNothing)
{
    fake.file = {Article("EU-001", "\"K\"", "PRJ_RES(EU1)", "R\\\\EU-001 - a")};
    ASSERT_TRUE(Read(bdr));
    const std::size_t before = bdr.Articles().size();
    fake.editorAnswer = 1;
    fake.editorChanges = {{fake.file[0], kEditDeleted}};
    EXPECT_FALSE(Edit(bdr, ""));
    EXPECT_EQ(bdr.Articles().size(), before);
}

} // namespace
