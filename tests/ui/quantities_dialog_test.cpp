// The quantities dialog driven as its views drive it: script lines through the line
// view, and mouse presses and keys through the dialog base; the estimate's name.
#include "ui/quantities_dialog.hpp"

#include <gtest/gtest.h>

#include "support/drawing.hpp"
#include "support/schedule.hpp"
#include "support/session.hpp"
#include "module/module_object.hpp"
#include "velhost/commands.h"
#include "velhost/documents.h"

using namespace zodevi;

namespace {

// The network sizing module standing in: the EU network's projects.
CZodEVIDialogLinks Links()
{
    CZodEVIDialogLinks links;
    links.projectsOfNetwork = [](std::string& network, std::vector<std::string>& projects) {
        if (network != "EU")
            return 1;
        // Unsorted, with a project the drawing does not hold.
        projects = {"EU 2", "Fantôme", "EU 1"};
        return 0;
    };
    return links;
}

void FileRecord(AcDbDatabase& db, const char* first, const char* second, const std::string& name,
                const std::vector<std::pair<std::string, double>>& quantities)
{
    std::vector<resbuf*> items{velRbString(kXdAsciiString, velproj::kNameMarker), velRbString(kXdAsciiString, name)};
    for (const auto& [key, quantity] : quantities) {
        items.push_back(velRbString(kXdAsciiString, key));
        items.push_back(velRbReal(kXdReal, quantity));
    }
    FileProjectRecord(db, first, second, name, items);
}

// A drawing with two road projects and two EU projects, a schedule whose two road
// articles "Bordure" land side by side, and the network sizing module standing in.
class QuantitiesDialog : public ::testing::Test {
protected:
    void SetUp() override
    {
        const std::string road = MakeRoadGroupKey();
        AddFiled(bdr, road, "Voirie\\\\Terrassements\\\\Volumique\\\\GC-001 - Déblais", 4, "Déblais", "m³", "\"K1\"",
                 9.5);
        AddFiled(bdr, road, "Voirie\\\\Bordures\\\\Linéaire\\\\A-001 - Bordure", 2, "Bordure", "ml", "\"BT2\"", 32);
        AddFiled(bdr, road, "Voirie\\\\Bordures\\\\Ponctuel\\\\A-002 - Bordure", 1, "Bordure", "u", "\"BTN\"", 150);
        AddFiled(bdr, "PRJ_RES(EU)", "EU\\\\Canalisation\\\\Linéaire\\\\EU-001 - PVC 200", 2, "PVC 200", "ml",
                 "\"RSX_TUY\"", 48);
        AddFiled(bdr, "PRJ_RES(EU)", "EU\\\\Travaux\\\\Non Graphique\\\\TP-001 - Piquetage", 6, "Piquetage", "", "\"\"",
                 1200);
        AddFiled(bdr, "0", "Divers\\\\Non Graphique\\\\F-001 - Assurance", 6, "Assurance", "", "", 800);

        auto db = std::make_unique<AcDbDatabase>();
        FileRecord(*db, "VELANTO_ROUT2_DICT", "VELANTO_ROUT2_PROJ", "R1", {{"\"K1\"", 3}, {"\"BT2\"", 10}});
        FileRecord(*db, "VELANTO_ROUT2_DICT", "VELANTO_ROUT2_PROJ", "R2", {{"\"K1\"", 4.5}, {"\"BTN\"", 2}});
        FileRecord(*db, "VELANTO_RSX_VRD", "PROJECTS", "EU 1", {{"\"RSX_TUY\"", 20}});
        FileRecord(*db, "VELANTO_RSX_VRD", "PROJECTS", "EU 2", {{"\"RSX_TUY\"", 5}});
        document = acDocManagerPtr()->createDocument(std::move(db), "");
    }

    void TearDown() override { acDocManagerPtr()->closeDocument(document); }

    // Runs the dialog on script lines; answers how it ended.
    int Run(const std::string& script, DlgMetExpArt& dialog)
    {
        ScriptedSession session(script);
        const int result = dialog.DoModal();
        output = session.Output();
        return result;
    }

    std::vector<std::string> Keys(const DlgMetExpArt& dialog) const
    {
        std::vector<std::unique_ptr<CZodEVIAssocLine>> lines;
        dialog.CopySelectedLines(lines);
        std::vector<std::string> keys;
        for (const auto& line : lines)
            keys.push_back(line->quantityKey + " " + line->projects);
        return keys;
    }

    CZodEVIBdr bdr;
    AcApDocument* document = nullptr;
    std::string output;
};

TEST_F(QuantitiesDialog, ShowsTheProjectsAndTheirArticles)
{
    DlgMetExpArt dialog(nullptr, &bdr, Links());
    EXPECT_EQ(Run("afficher\nquitter\n", dialog), IDCANCEL);
    const std::string expected = "Projets\n"
                                 "[x] Projets routiers\n"
                                 "    [x] R1\n"
                                 "    [x] R2\n"
                                 "[x] EU\n"
                                 "    [x] EU 1\n"
                                 "    [x] EU 2\n"
                                 "Articles (somme)\n"
                                 "[ ] Voirie\n"
                                 "    [ ] Terrassements\n"
                                 "        [ ] Volumique\n"
                                 "            [ ] Déblais | 9.50 €/m³ | 7.50 m³\n"
                                 "    [ ] Bordures\n"
                                 "        [ ] Bordure | 32.00 €/ml | 10.00 ml\n"
                                 "        [ ] Bordure | 150.00 €/u | 2.00 u\n"
                                 "[ ] EU\n"
                                 "    [ ] Canalisation\n"
                                 "        [ ] PVC 200 | 48.00 €/ml | 25.00 ml\n"
                                 "    [ ] Travaux\n"
                                 "        [ ] Piquetage | 1200.00 € | 1.00\n"
                                 "[ ] Divers\n"
                                 "    [ ] Assurance | 800.00 € | 1.00\n";
    EXPECT_NE(output.find(expected), std::string::npos) << output;
    EXPECT_TRUE(dialog.m_selectedLines.empty());
}

TEST_F(QuantitiesDialog, EachLeafCarriesItsOwnArticle)
{
    // Both "Bordure" leaves checked through their category: each brings its own line.
    DlgMetExpArt dialog(nullptr, &bdr, Links());
    EXPECT_EQ(Run("article Voirie\\Bordures\nmode détail\nvalider\n", dialog), IDOK);
    EXPECT_EQ(Keys(dialog), (std::vector<std::string>{"\"BT2\" R1", "\"BTN\" R2"}));
}

TEST_F(QuantitiesDialog, ChecksFollowTheProjectsAcrossRebuilds)
{
    DlgMetExpArt dialog(nullptr, &bdr, Links());
    const std::string script = "article Voirie\\Terrassements\\Volumique\\Déblais\n"
                               "article EU\\Canalisation\\PVC 200\n"
                               // R1 off: Déblais stays (R2 has it), still checked.
                               "projet Projets routiers\\R1\n"
                               "afficher\n"
                               // R2 off too: Déblais leaves; back on: it comes back unchecked.
                               "projet Projets routiers\\R2\n"
                               "projet Projets routiers\\R2\n"
                               "mode détail\n"
                               "afficher\n"
                               "valider\n";
    EXPECT_EQ(Run(script, dialog), IDOK);
    const std::size_t first = output.find("Articles (somme)");
    const std::size_t second = output.find("Articles (détail)");
    ASSERT_NE(first, std::string::npos);
    ASSERT_NE(second, std::string::npos);
    EXPECT_NE(output.find("[~] Projets routiers\n    [ ] R1\n    [x] R2", first - 60), std::string::npos) << output;
    EXPECT_NE(output.find("[x] Déblais | 9.50 €/m³ | 4.50 m³", first), std::string::npos) << output;
    EXPECT_NE(output.find("[ ] Déblais | 9.50 €/m³ | 4.50 m³", second), std::string::npos) << output;
    EXPECT_NE(output.find("[x] PVC 200 | 48.00 €/ml | 25.00 ml", second), std::string::npos) << output;
    EXPECT_EQ(Keys(dialog), (std::vector<std::string>{"\"RSX_TUY\" EU 1", "\"RSX_TUY\" EU 2"}));
}

TEST_F(QuantitiesDialog, ClicksCountOnlyOnTheCheckBox)
{
    DlgMetExpArt dialog(nullptr, &bdr, Links());
    ScriptedSession session;
    ASSERT_TRUE(dialog.StartModal());
    SECTreeCtrl& tree = dialog.m_treeProjects;
    HTREEITEM group = tree.GetRootItem();
    HTREEITEM r1 = tree.GetChildItem(group);
    CRect image, label;
    ASSERT_TRUE(tree.GetItemRect(r1, image, VelTreePart::kImage));
    ASSERT_TRUE(tree.GetItemRect(r1, label, VelTreePart::kLabel));

    // On the text: selected, nothing else.
    dialog.Click(IDC_TREE_PROJECTS, {label.x + 1, label.y});
    EXPECT_EQ(tree.GetSelectedItem(), r1);
    EXPECT_EQ(tree.GetItemData(r1), 1u);
    // On the box: R1 off, its group partly checked, a partial group checks all again.
    dialog.Click(IDC_TREE_PROJECTS, {image.x + 1, image.y});
    EXPECT_EQ(tree.GetItemData(r1), 0u);
    EXPECT_EQ(tree.GetItemData(group), 2u);
    EXPECT_EQ(dialog.m_roadSelection.checkedNames.count("R1"), 0u);
    ASSERT_TRUE(tree.GetItemRect(group, image, VelTreePart::kImage));
    dialog.Click(IDC_TREE_PROJECTS, {image.x, image.y});
    EXPECT_EQ(tree.GetItemData(r1), 1u);
    EXPECT_EQ(tree.GetItemData(group), 1u);
    EXPECT_EQ(dialog.m_roadSelection.checkedNames.count("R1"), 1u);
    dialog.Click(IDC_TREE_PROJECTS, {image.x, image.y});
    EXPECT_EQ(tree.GetItemData(r1), 0u);
    EXPECT_TRUE(dialog.m_roadSelection.checkedNames.empty());
    EXPECT_EQ(tree.GetCount(), 6u);

    // Enter moves the focus and never validates; Escape is "Quitter".
    const int focus = dialog.GetFocusId();
    dialog.KeyDown(VK_RETURN);
    EXPECT_FALSE(dialog.IsEnded());
    EXPECT_NE(dialog.GetFocusId(), focus);
    dialog.KeyDown(VK_ESCAPE);
    EXPECT_TRUE(dialog.IsEnded());
    EXPECT_EQ(dialog.GetResult(), IDCANCEL);
}

TEST_F(QuantitiesDialog, ARebuildKeepsWhereThePersonStood)
{
    DlgMetExpArt dialog(nullptr, &bdr, Links());
    ScriptedSession session;
    ASSERT_TRUE(dialog.StartModal());
    SECTreeCtrl& articles = dialog.m_treeArticles;
    articles.SetVisibleCount(3);
    const auto path = [&](HTREEITEM item) {
        std::string text;
        for (; item != nullptr; item = articles.GetParentItem(item))
            text = articles.GetItemText(item) + (text.empty() ? "" : "\\" + text);
        return text;
    };
    const auto click = [&](const char* project) {
        SECTreeCtrl& projects = dialog.m_treeProjects;
        for (HTREEITEM group = projects.GetRootItem(); group != nullptr; group = projects.GetNextSiblingItem(group))
            for (HTREEITEM item = projects.GetChildItem(group); item != nullptr;
                 item = projects.GetNextSiblingItem(item))
                if (projects.GetItemText(item) == project) {
                    CRect box;
                    ASSERT_TRUE(projects.GetItemRect(item, box, VelTreePart::kImage));
                    dialog.Click(IDC_TREE_PROJECTS, {box.x, box.y});
                }
    };
    // Voirie closed, "PVC 200" chosen at the bottom of three rows; R1 off rebuilds.
    articles.Expand(articles.GetRootItem(), TVE_COLLAPSE);
    HTREEITEM pvc = articles.GetChildItem(articles.GetChildItem(articles.GetNextSiblingItem(articles.GetRootItem())));
    articles.SelectItem(pvc);
    articles.EnsureVisible(pvc);
    ASSERT_EQ(path(pvc), "EU\\Canalisation\\PVC 200");
    click("R1");
    HTREEITEM selected = articles.GetSelectedItem();
    EXPECT_EQ(path(selected), "EU\\Canalisation\\PVC 200");
    EXPECT_FALSE(articles.IsExpanded(articles.GetRootItem()));
    EXPECT_EQ(articles.GetVisibleItems().back(), selected);

    // Nothing is left chosen where the whole path has gone.
    click("EU 1");
    click("EU 2");
    EXPECT_EQ(articles.GetSelectedItem(), nullptr);
}

TEST_F(QuantitiesDialog, EmptyScheduleClosesAtOnce)
{
    CZodEVIBdr empty;
    DlgMetExpArt dialog(nullptr, &empty);
    EXPECT_EQ(Run("afficher\n", dialog), IDCANCEL);
    EXPECT_EQ(output, "");
    EXPECT_TRUE(dialog.m_roadProjects.Empty());
}

CZodEVIBdr* g_bdr = nullptr;

void RunDialogCommand()
{
    DlgMetExpArt dialog(nullptr, g_bdr, Links());
    dialog.DoModal();
}

TEST_F(QuantitiesDialog, AMisnamedItemStopsTheScript)
{
    g_bdr = &bdr;
    acedRegCmds()->addCommand("ESSAI_DIALOGUE", "ESSAIDLG", "ESSAIDLG", 0, &RunDialogCommand);
    const struct {
        const char* script;
        const char* message;
    } cases[] = {
        {"projet EU\\EU 3\nvalider\n", "ligne 1 du script : aucun élément « EU\\EU 3 » dans l'arbre « Projets »"},
        {"mode somme\ncocher tout\nvalider\n", "ligne 2 du script : « cocher tout » n'est pas une action"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.script);
        ScriptedSession session(c.script);
        std::string error;
        EXPECT_EQ(velRunCommand("ESSAIDLG", error), VelCommandResult::kFailed);
        EXPECT_NE(error.find(c.message), std::string::npos) << error;
        EXPECT_NE(error.find("comme par « Quitter »"), std::string::npos);
        // The rest of the script is left to the host, which stops there.
        EXPECT_NE(session.input.peek(), EOF);
    }
    acedRegCmds()->removeGroup("ESSAI_DIALOGUE");
}

TEST(CreateEstimate, ChoosesAFreeName)
{
    const struct {
        std::vector<std::string> existing;
        const char* name;
    } cases[] = {
        {{}, "Devis"},
        {{"Devis", "DEVIS 2"}, "Devis 3"},
        {{"Devis 3", "Devis", "Devis 2"}, "Devis 4"},
        {{"Devis 2"}, "Devis"},
        {{"devis", "Devis 3", "Devis 2"}, "Devis 4"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(ChooseEstimateName(c.existing), c.name);
    }
}

} // namespace
