// The metre module loaded into a host: the schedule read, written and edited through the
// module's exchange, the currency, and an estimate listed afterwards.
#include "schedule/schedule_exchange.hpp"

#include "support/schedule.hpp"
#include "support/temp_dir.hpp"
#include "module/service_api.hpp"
#include "module/siblings.hpp"
#include "module/config_page.hpp"
#include "velhost/documents.h"
#include "velhost/profile.h"
#include "velhost/rx.h"
#include "velhost/ui.h"
#include "zodevi/assoc_line.h"

#include <gtest/gtest.h>

#include "support/session.hpp"

#include <sstream>

using namespace zodevi;

namespace {

class MetreModule : public ::testing::Test {
protected:
    void SetUp() override
    {
        saved = velHostSettings();
        velHostSettings().profileDir = dir.path.string();
        ASSERT_TRUE(acrxLoadModule(VEL_MODULE_DIR "/VelMetre15.arx", false));
        ASSERT_TRUE(acrxServiceIsRegistered(kVelMetreServicesName));
        SetBdrMetre(&zodevi::MetreModule());
        bdr.path = dir.File("VelaBordereau.xml");
    }
    void TearDown() override
    {
        SetBdrMetre(nullptr);
        acDocManager->closeAll();
        velUnloadAllModules();
        velHostSettings() = saved;
    }
    TempDir dir;
    VelHostSettings saved;
    ScriptedSession session{"", "metre.scr"};
    std::istringstream& script = session.input;
    std::ostringstream& output = session.output;
    CZodEVIBdr bdr;
};

TEST_F(MetreModule, ScheduleGoesThroughTheModuleFile)
{
    EXPECT_FALSE(Read(bdr));
    EXPECT_NE(output.str().find("Bordereau « " + bdr.path + " » : fichier introuvable."), std::string::npos)
        << output.str();
    bdr.AddArticle(std::make_unique<CZodEVIArticle>(
        CZodEVIArticle{.code = "EU-001",
                       .unitPrice = 12345.67,
                       .designation = "Tuyau « PVC »",
                       .quantityKey = "\"RSX_TUY_LIN_3D_PVC 200\"",
                       .description = "Ligne 1\r\nLigne 2",
                       .groupKey = "PRJ_RES(EU1)",
                       .metreText7 = "champ du métré",
                       .treePath = "Réseaux\\\\EU1\\\\Linéaire\\\\EU-001 - Tuyau « PVC »"}));
    ASSERT_TRUE(Write(bdr));

    ASSERT_TRUE(Read(bdr));
    const std::size_t withProjectWide = bdr.Articles().size();
    EXPECT_GT(withProjectWide, 1u);
    const CZodEVIArticle* back = bdr.FindByTreePath("réseaux\\\\eu1\\\\linéaire\\\\EU-001 - tuyau « pvc »").article;
    ASSERT_NE(back, nullptr);
    EXPECT_EQ(back->description, "Ligne 1\r\nLigne 2");
    EXPECT_EQ(back->metreText7, "champ du métré");
    double price = 0;
    EXPECT_TRUE(GetPrice(bdr, 0, "PVC 200", price, "EU1"));
    EXPECT_EQ(price, 12345.67);

    ASSERT_TRUE(Write(bdr));
    ASSERT_TRUE(Read(bdr));
    EXPECT_EQ(bdr.Articles().size(), withProjectWide);
}

TEST_F(MetreModule, ScriptedEditorIsMirroredInTheStore)
{
    AddFiled(bdr, {.code = "EU-001",
                   .designation = "Tuyau",
                   .groupKey = "PRJ_RES(EU1)",
                   .treePath = "Réseaux\\\\EU1\\\\Linéaire\\\\EU-001 - Tuyau"});
    ASSERT_TRUE(Write(bdr));
    script.str("ajouter Réseaux\\\\EU1\\\\Linéaire\\\\EU-002 - Tuyau fonte\n"
               "champ unitPrice Réseaux\\\\EU1\\\\Linéaire\\\\EU-002 - Tuyau fonte\n"
               "88\n"
               "fin\n");
    ASSERT_TRUE(Edit(bdr, ""));
    const CZodEVIArticle* added = bdr.FindByTreePath("Réseaux\\\\EU1\\\\Linéaire\\\\EU-002 - Tuyau fonte").article;
    ASSERT_NE(added, nullptr) << output.str();
    EXPECT_EQ(added->unitPrice, 88);
    EXPECT_EQ(added->groupKey, "PRJ_RES(EU1)") << "the neighbour's group key";
    CZodEVIBdr reread;
    reread.path = bdr.path;
    ASSERT_TRUE(Read(reread));
    EXPECT_EQ(reread.FindByTreePath(added->treePath).article->groupKey, "PRJ_RES(EU1)") << "written again";
}

TEST_F(MetreModule, ConfigPageKeepsTheScheduleWhenTheChosenFileNoLongerReads)
{
    AddFiled(bdr, {.code = "EU-001", .treePath = "Réseaux\\\\EU1\\\\Linéaire\\\\EU-001 - Tuyau"});
    ASSERT_TRUE(Write(bdr));
    ASSERT_TRUE(Read(bdr));
    const std::size_t articles = bdr.Articles().size();
    SetCurrentBdr(&bdr);
    DlgChildCfgUser page;
    // Picked while it read, cut short before the dialog confirmed.
    page.m_strPath = dir.Write("Autre.xml", "<bordereau>\n<article code=\"A\"");
    page.OnApply();
    SetCurrentBdr(nullptr);
    EXPECT_NE(output.str().find(kCfgUnreadableSchedule), std::string::npos) << output.str();
    EXPECT_EQ(bdr.path, dir.File("VelaBordereau.xml"));
    EXPECT_EQ(bdr.Articles().size(), articles);
    EXPECT_EQ(page.m_strPath, bdr.path) << "the page shows the file in use";
    EXPECT_TRUE(Write(bdr)) << output.str();
}

TEST_F(MetreModule, CurrencyAndEstimates)
{
    std::string currency;
    ASSERT_EQ(sibling::VtMetre_SymbMonetaire(&currency), 0);
    EXPECT_EQ(currency, "€");
    ASSERT_TRUE(velWritePrivateProfileString("Metre", "Monnaie", "CHF", dir.File("VelMetre.ini")));
    ASSERT_EQ(sibling::VtMetre_SymbMonetaire(&currency), 0);
    EXPECT_EQ(currency, "CHF");

    // No schedule remembered by the module: the estimate looks for one itself.
    acDocManager->createDocument(nullptr, dir.File("plan.dxf"));
    CZodEVIAssocLine line{.label = "Essais",
                          .lineKind = 5,
                          .projects = "**Forfait",
                          .treePath = "Divers\\\\DV-001 - Essais",
                          .unitPrice = 250};
    std::vector<CZodEVIAssocLine*> lines{&line};
    EXPECT_EQ(CallMetre<VtMetre_AfficherAssocFn>("VtMetre_AfficherAssoc", std::string("Devis"), &lines, 1, 0), 0)
        << output.str();
    std::vector<std::string> names;
    std::int32_t ignored = 0;
    ASSERT_EQ(sibling::VtMetre_ListeDesMetres(&names, &ignored), 0);
    EXPECT_EQ(names, std::vector<std::string>{"Devis"});
    EXPECT_TRUE(std::filesystem::exists(dir.File("Devis.xlsx")));
    EXPECT_NE(dir.Read("Devis.csv").find(";Total HT;;;;250,00;"), std::string::npos);
}

} // namespace
