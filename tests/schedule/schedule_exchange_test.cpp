// The exchange with the metre module, against a stand-in whose answers each
// test sets: reading with the road articles, prices by selector, the editor's changes
// and the file written after them, partial reads and a missing module.
#include "schedule/schedule_exchange.hpp"

#include "schedule/metre_link.hpp"
#include "text/text.hpp"
#include "velhost/files.h"
#include "velhost/rx.h"
#include "velhost/ui.h"

#include <gtest/gtest.h>

#include "support/session.hpp"
#include "support/temp_dir.hpp"

#include <algorithm>
#include <deque>
#include <functional>
#include <sstream>

using namespace zodevi;

namespace {

// An article of the metre module's file, filed under its group key.
CZodEVIArticle Filed(const std::string& code, double unitPrice, const std::string& quantityKey,
                     const std::string& groupKey, const std::string& treePath)
{
    return {
        .code = code, .unitPrice = unitPrice, .quantityKey = quantityKey, .groupKey = groupKey, .treePath = treePath};
}

// A metre module whose file and answers each test sets.
struct FakeMetre final : CZodEVIBdrMetre {
    std::int32_t FillTable(const std::string& path, std::vector<CZodEVIArticle*>& table) override
    {
        if (duringFill)
            duringFill(path);
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
    std::function<void(const std::string&)> duringFill; // what else happens while the file is read
};

class ScheduleExchange : public ::testing::Test {
protected:
    void SetUp() override { SetBdrMetre(&fake); }
    void TearDown() override { SetBdrMetre(nullptr); }
    std::size_t GroupSize(const std::string& key)
    {
        const CZodEVIGroup* group = bdr.Groups().Find(key);
        return group == nullptr ? 0 : group->size();
    }

    FakeMetre fake;
    CZodEVIBdr bdr;
    ScriptedSession session{"", "test.scr"};
    std::ostringstream& output = session.output;
};

const std::string kRoad = "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()";

// A schedule without road articles gets the three lump sums, the cut and fill volumes and
// the road sawing, numbered and coded after the file's articles; a second read adds nothing.
TEST_F(ScheduleExchange, ReadAddsTheSixRoadArticlesOnce)
{
    struct Expected {
        const char* code;
        const char* key;
        int nature;
        const char* unit;
        const char* treePath;
    };
    const Expected expected[] = {
        {"TP-001", "\"\"", 6, "",
         "Voirie\\\\Travaux préparatoires\\\\Non Graphique\\\\TP-001 - Installation du chantier"},
        {"TP-002", "\"\"", 6, "",
         "Voirie\\\\Travaux préparatoires\\\\Non Graphique\\\\TP-002 - Signalisation provisoire du chantier"},
        {"TP-003", "\"\"", 6, "",
         "Voirie\\\\Travaux préparatoires\\\\Non Graphique\\\\TP-003 - Implantation, plan de phasage et contrôle"},
        {"GC-001", "\"PRJ_VOL_TOT_DBL\"", 4, "m³",
         "Voirie\\\\Terrassements\\\\Déblais\\\\Volumique\\\\GC-001 - Volume des déblais"},
        {"GC-002", "\"PRJ_VOL_TOT_RBL\"", 4, "m³",
         "Voirie\\\\Terrassements\\\\Remblais\\\\Volumique\\\\GC-002 - Volume des remblais"},
        {"GC-003", "\"PRJ_SCI_LIN_3D\"", 2, "ml",
         "Voirie\\\\Travaux sur chaussées existantes\\\\Linéaire\\\\GC-003 - Sciage de chaussée"},
    };
    fake.file = {{.code = "EU-001",
                  .number = 1,
                  .quantityKey = "\"RSX_TUY_LIN_3D_PVC 200\"",
                  .groupKey = "PRJ_RES(EU1)",
                  .treePath = "Réseaux\\\\EU1\\\\EU-001 - Tuyau"}};
    for (int pass = 1; pass <= 2; ++pass) {
        SCOPED_TRACE("read " + std::to_string(pass));
        ASSERT_TRUE(Read(bdr));
        ASSERT_EQ(bdr.Articles().size(), 1 + std::size(expected));
        ASSERT_EQ(GroupSize(kRoad), std::size(expected));
        const CZodEVIGroup& road = *bdr.Groups().Find(kRoad);
        for (std::size_t i = 0; i < std::size(expected); ++i) {
            const Expected& e = expected[i];
            SCOPED_TRACE(e.code);
            const CZodEVIArticle& a = *road[i];
            EXPECT_EQ(a.code, e.code);
            EXPECT_EQ(a.quantityKey, e.key);
            EXPECT_EQ(a.nature, e.nature);
            EXPECT_EQ(a.unit, e.unit);
            EXPECT_EQ(a.treePath, e.treePath);
            EXPECT_EQ(a.groupKey, kRoad);
            EXPECT_EQ(a.number, static_cast<int>(i) + 2);
            EXPECT_EQ(a.metreInt4, 0);
        }
        ASSERT_TRUE(Write(bdr));
    }
}

TEST_F(ScheduleExchange, ReadWithCutVolumeAddsOnlyFillAndSawing)
{
    fake.file = {{.code = "GC-001",
                  .quantityKey = "\"PRJ_VOL_TOT_DBL\"",
                  .groupKey = kRoad,
                  .treePath = "Voirie\\\\Volumique\\\\GC-001 - Déblais"}};
    ASSERT_TRUE(Read(bdr));
    std::vector<std::string> keys;
    for (const CZodEVIArticle* a : *bdr.Groups().Find(kRoad))
        keys.push_back(a->quantityKey);
    EXPECT_EQ(keys, (std::vector<std::string>{"\"PRJ_VOL_TOT_DBL\"", "\"PRJ_VOL_TOT_RBL\"", "\"PRJ_SCI_LIN_3D\""}));
}

TEST_F(ScheduleExchange, FailedPartialReadLeavesStoreEmpty)
{
    fake.file = {Filed("A-001", 0, "\"A\"", "PRJ_RES(EU1)", "X\\\\A-001 - A"),
                 Filed("A-002", 0, "\"B\"", "PRJ_RES(EU1)", "X\\\\A-002 - B"),
                 Filed("A-003", 0, "\"C\"", "0", "X\\\\A-003 - C")};
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

// The version a write compares the file with is the one the metre module read, whether
// the module reads through the host (which tells which bytes it read) or not: another
// program's version written meanwhile is never taken for it and overwritten.
TEST_F(ScheduleExchange, VersionReadIsTheOneTheWriteComparesWith)
{
    struct Case {
        const char* name;
        bool throughHost;
        bool changedMeanwhile;
    } cases[] = {
        {"read through the host", true, false},
        {"through the host, another version written just after its reading", true, true},
        {"read by the module itself", false, false},
        {"by the module itself, another version written meanwhile", false, true},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        TempDir dir;
        const std::string theirs = "version écrite par un autre poste, plus longue";
        bdr.path = dir.Write("VelaBordereau.xml", "version lue");
        fake.writes = 0;
        fake.duringFill = [&](const std::string& path) {
            if (c.throughHost) {
                EXPECT_TRUE(velReadFile(path).opened);
            }
            if (c.changedMeanwhile)
                dir.Write("VelaBordereau.xml", theirs);
        };
        ASSERT_TRUE(Read(bdr));
        fake.duringFill = nullptr;
        output.str("");
        EXPECT_EQ(Write(bdr), !c.changedMeanwhile) << output.str();
        EXPECT_EQ(fake.writes, c.changedMeanwhile ? 0 : 1);
        if (c.changedMeanwhile) {
            EXPECT_NE(output.str().find("a été modifié par un autre utilisateur ou programme depuis sa lecture"),
                      std::string::npos)
                << output.str();
            EXPECT_EQ(dir.Read("VelaBordereau.xml"), theirs);
        }
    }
}

TEST_F(ScheduleExchange, PricesBySelector)
{
    const char* const patterns[] = {"RSX_TUY_LIN_3D_",  "RSX_TUY_NB_",  "RSX_FRX_LIN_3D_", "RSX_FRX_NB_",
                                    "RSX_PGN_LIN_3D_",  "RSX_PGN_NB_",  "RSX_SBL_NB_",     "RSX_TUY_FRNT_LIN_3D_",
                                    "RSX_SBL_FRNT_NB_", "PRJ_VOL_MAT_", "PRJ_SFC_MAT_",    "PRJ_LIN_MAT_",
                                    "PRJ_TON_MAT_"};
    for (int s = 0; s <= 12; ++s)
        fake.file.push_back({.code = FormatString("P-%03d", s),
                             .unitPrice = 10.0 + s,
                             .quantityKey = FormatString("\"%sPVC 200\"", patterns[s]),
                             .groupKey = s <= 8 ? "PRJ_RES(EU1)" : kRoad,
                             .treePath = FormatString("Cat\\\\P-%03d - x", s)});
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
    fake.file = {Filed("EU-001", 0, "\"RSX_FRX_NB_Té\"", "PRJ_RES(EU1)", "R\\\\EU1\\\\EU-001 - Té EU"),
                 Filed("GE-001", 7, "\"RSX_FRX_NB_Té\"", "PRJ_RES(RSX_GENERAL)", "R\\\\GE-001 - Té général")};
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
    const std::string pvc = "\"RSX_TUY_LIN_3D_PVC\"";
    fake.file = {Filed("GE-001", 12345.67, pvc, "PRJ_RES(RSX_GENERAL)", "R\\\\GE-001 - a"),
                 Filed("EU-001", 1500000, pvc, "PRJ_RES(EU (tranche 2))", "R\\\\EU-001 - b"),
                 Filed("EP-001", 0.1, pvc, "PRJ_RES(EP1)", "R\\\\EP-001 - c")};
    ASSERT_TRUE(Read(bdr));
    std::map<std::string, std::string> prices;
    ASSERT_TRUE(GetPricesPerNetwork(bdr, 0, "PVC", prices));
    EXPECT_EQ(prices, (std::map<std::string, std::string>{{"*", "12345.67"}})) << "right after a read only \"*\"";
    bdr.SetNetworkIndex("PRJ_RES(EU (tranche 2))", 1);
    bdr.SetNetworkIndex("PRJ_RES(EP1)", 0);
    ASSERT_TRUE(GetPricesPerNetwork(bdr, 0, "PVC", prices));
    EXPECT_EQ(prices,
              (std::map<std::string, std::string>{{"*", "12345.67"}, {"EU (tranche 2)", "1500000"}, {"EP1", "0.1"}}));
    EXPECT_FALSE(GetPricesPerNetwork(bdr, 1, "PVC", prices));
    EXPECT_TRUE(prices.empty());
}

// The editor's changes, through Edit and through the display of a price: Edit applies
// them only when the editor succeeds, the display whatever it answers. The file is
// written again only when an added article took its group key from a neighbour; an
// article the editor moved to another group is already so in the file.
TEST_F(ScheduleExchange, EditorChangesAndTheFileWrittenAfterThem)
{
    const std::string pipe = "Réseaux\\\\EU1\\\\Linéaire\\\\EU-001 - Tuyau";
    const std::string count = "Réseaux\\\\EU1\\\\Linéaire\\\\EU-002 - Nombre";
    const std::string added = "Réseaux\\\\EU1\\\\Linéaire\\\\EU-009 - Regard";
    enum Changes { AddBesideAssociated, MoveToAnotherGroup };
    struct Case {
        const char* name;
        bool show; // through ShowPrice, else Edit
        std::int32_t editorAnswer;
        Changes changes;
        bool answer;
        bool applied;
        int writes;
    };
    const Case cases[] = {
        {"edit adds beside an associated article", false, 0, AddBesideAssociated, true, true, 1},
        {"edit whose editor fails", false, 1, AddBesideAssociated, false, false, 0},
        {"edit moves an article", false, 0, MoveToAnotherGroup, true, true, 0},
        {"price shown, article added", true, 0, AddBesideAssociated, true, true, 1},
        {"price display that fails, article added", true, 1, AddBesideAssociated, false, true, 1},
        {"price display that fails, article moved", true, 1, MoveToAnotherGroup, false, true, 0},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        fake = {};
        fake.file = {
            {.code = "EU-001",
             .unitPrice = 5,
             .quantityKey = "\"RSX_TUY_LIN_3D_PVC\"",
             .groupKey = "PRJ_RES(EU1)",
             .treePath = pipe},
            {.code = "EU-002", .quantityKey = "\"RSX_TUY_NB_PVC\"", .groupKey = "PRJ_RES(EU1)", .treePath = count}};
        ASSERT_TRUE(Read(bdr));
        fake.editorAnswer = c.editorAnswer;
        if (c.changes == AddBesideAssociated) {
            fake.editorChanges = {{fake.file[1], kEditDeleted},
                                  {{.code = "EU-009", .groupKey = "0", .treePath = added}, kEditAdded}};
        } else {
            CZodEVIArticle moved = fake.file[0];
            moved.groupKey = "PRJ_RES(EU2)";
            moved.unitPrice = 8;
            // A modification of an article the schedule does not hold is dropped.
            fake.editorChanges = {{moved, kEditModified},
                                  {{.code = "X", .groupKey = "0", .treePath = "nulle part"}, kEditModified}};
        }
        const std::size_t before = bdr.Articles().size();
        EXPECT_EQ(c.show ? ShowPrice(bdr, 0, "PVC", "EU1") : Edit(bdr, pipe), c.answer);
        EXPECT_EQ(fake.editorLabel, pipe);
        EXPECT_EQ(fake.writes, c.writes);
        EXPECT_EQ(bdr.Articles().size(), before);
        if (c.changes == AddBesideAssociated) {
            EXPECT_EQ(!bdr.FindByTreePath(count), c.applied);
            const CZodEVIArticle* stored = bdr.FindByTreePath(added).article;
            ASSERT_EQ(stored != nullptr, c.applied);
            if (stored != nullptr) {
                EXPECT_EQ(stored->groupKey, "PRJ_RES(EU1)");
            }
            const auto inFile = std::find_if(fake.file.begin(), fake.file.end(),
                                             [&](const CZodEVIArticle& a) { return a.treePath == added; });
            EXPECT_EQ(inFile != fake.file.end() && inFile->groupKey == "PRJ_RES(EU1)", c.writes > 0);
        } else {
            EXPECT_EQ(GroupSize("PRJ_RES(EU1)"), c.applied ? 1u : 2u);
            ASSERT_EQ(GroupSize("PRJ_RES(EU2)"), c.applied ? 1u : 0u);
            if (c.applied) {
                EXPECT_EQ(bdr.Groups().Find("PRJ_RES(EU2)")->front()->unitPrice, 8);
            }
        }
    }
}

} // namespace
