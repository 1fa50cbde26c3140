// The network update and the depth-class update: fixed articles of a new network, one
// article per name and depth class, user edits kept, purges exact, names with
// parentheses and format characters.
#include "generation/network_update.hpp"

#include "text/text.hpp"

#include <gtest/gtest.h>

#include <set>
#include <string>
#include <vector>

using namespace zodevi;

namespace {

using Names = std::vector<std::string>;
using Bounds = CZodEVIValueArray<double>;

// Sets the module-wide purge flag for one test and clears it afterwards.
struct PurgeFlag {
    explicit PurgeFlag(bool on) { SetPurgeFlag(on); }
    ~PurgeFlag() { SetPurgeFlag(false); }
};

bool Update(CZodEVIBdr& bdr, int index, const std::string& name, const Names& models = {}, const Names& materials = {},
            const Bounds& bounds = {}, const Names& fittings = {})
{
    return UpdateNetwork(bdr, index, name, models, {}, fittings, {}, {}, materials, bounds);
}

const CZodEVIGroup& GroupOf(CZodEVIBdr& bdr, const std::string& networkName)
{
    return *bdr.GroupOf(MakeNetworkGroupKey(networkName), true);
}

// The group's quantity keys without their double quotes.
Names Keys(const CZodEVIGroup& group)
{
    Names keys;
    for (const CZodEVIArticle* article : group)
        keys.push_back(article->quantityKey.substr(1, article->quantityKey.size() - 2));
    return keys;
}

const CZodEVIArticle* ByKey(CZodEVIBdr& bdr, const std::string& networkName, const std::string& name)
{
    return bdr.FindInGroupByQuantityKey(MakeQuantityKey(name), &GroupOf(bdr, networkName)).article;
}

TEST(UpdateNetwork, FirstUpdateMakesTheFixedArticlesInOrder)
{
    struct Expected {
        const char* code;
        const char* key;
        const char* unit;
        const char* treePath;
    };
    // Under "EU 1\\", the GC articles under "Travaux de génie civil\\".
    const Expected expected[] = {
        {"TP-001", "", "", R"(Travaux préparatoires\\Non Graphique\\TP-001 - Installation du chantier)"},
        {"TP-002", "", "", R"(Travaux préparatoires\\Non Graphique\\TP-002 - Piquetage, implantation, sondage)"},
        {"EU-001", "RSX_LIN_TOT_3D", "ml", R"(Canalisation EU\\Linéaire\\EU-001 - Longueur 3D des canalisations)"},
        {"EU-002", "RSX_BRA_LIN_3D", "ml", R"(Canalisation EU\\Linéaire\\EU-002 - Longueur 3D des branchements)"},
        {"EU-003", "RSX_BRA_BX_NB", "", R"(Branchements\\Ponctuel\\EU-003 - Boîtes clients)"},
        {"GC-001", "RSX_LIN_FDT_2D", "ml", R"(Traitement du sol de fondation\\Linéaire\\GC-001 - Longueur 2D)"},
        {"GC-002", "RSX_LIN_FDT_3D", "ml", R"(Traitement du sol de fondation\\Linéaire\\GC-002 - Longueur 3D)"},
        {"GC-003", "RSX_LIN_DEC_2D", "ml", R"(Démolition de chausée\\Linéaire\\GC-003 - Longueur 2D de découpage)"},
        {"GC-004", "RSX_LIN_DEC_3D", "ml", R"(Démolition de chausée\\Linéaire\\GC-004 - Longueur 3D de découpage)"},
        {"GC-005", "RSX_LIN_BLI_2D", "ml",
         R"(Terrassements\\Protection contre les éboulements\\Linéaire\\GC-005 - Longueur 2D blindée)"},
        {"GC-006", "RSX_SFC_DEC", "m²", R"(Démolition de chausée\\Surfacique\\GC-006 - Surface 2D de démolition)"},
        {"GC-007", "RSX_SFC_BLI", "m²",
         R"(Terrassements\\Protection contre les éboulements\\Surfacique\\GC-007 - Surface de blindage)"},
        {"GC-008", "RSX_VOL_FOU", "m³", R"(Terrassements\\Tranchées\\Volumique\\GC-008 - Volume de fouille)"},
        {"GC-009", "RSX_BRA_VOL_FO", "m³",
         R"(Terrassements\\Tranchées des branchements\\Volumique\\GC-009 - Volume de fouille)"},
        {"GC-010", "RSX_VOL_FDT", "m³", R"(Traitement du sol de fondation\\Volumique\\GC-010 - Volume)"},
        {"GC-011", "RSX_VOL_LPO", "m³",
         R"(Terrassements\\Enrobage et lit de pose\\Volumique\\GC-011 - Volume de lit de pose)"},
        {"GC-012", "RSX_VOL_EBG", "m³",
         R"(Terrassements\\Enrobage et lit de pose\\Volumique\\GC-012 - Volume d'enrobage)"},
        {"GC-013", "RSX_VOL_RBL", "m³", R"(Terrassements\\Remblais et apports\\Volumique\\GC-013 - Volume de remblai)"},
        {"GC-014", "RSX_VOL_DEC", "m³", R"(Démolition de chausée\\Volumique\\GC-014 - Volume de démolition)"},
        {"GC-015", "RSX_VOL_BLI", "m³",
         R"(Terrassements\\Protection contre les éboulements\\Volumique\\GC-015 - Volume de blindage)"},
    };
    CZodEVIBdr bdr;
    EXPECT_TRUE(Update(bdr, 1, "EU 1"));
    const CZodEVIGroup& group = GroupOf(bdr, "EU 1");
    ASSERT_EQ(group.size(), std::size(expected));
    ASSERT_EQ(bdr.Articles().size(), std::size(expected));
    for (std::size_t i = 0; i < group.size(); ++i) {
        const CZodEVIArticle& a = *group[i];
        SCOPED_TRACE(expected[i].code);
        EXPECT_EQ(bdr.Articles()[i].get(), &a);
        EXPECT_EQ(a.number, static_cast<int>(i) + 1);
        EXPECT_EQ(a.code, expected[i].code);
        EXPECT_EQ(a.quantityKey, MakeQuantityKey(expected[i].key));
        EXPECT_EQ(a.unit, expected[i].unit);
        const bool civil = std::string_view(expected[i].code).starts_with("GC");
        EXPECT_EQ(a.treePath,
                  std::string("EU 1\\\\") + (civil ? "Travaux de génie civil\\\\" : "") + expected[i].treePath);
        EXPECT_EQ(a.groupKey, "PRJ_RES(EU 1)");
        EXPECT_EQ(a.unitPrice, 0);
        EXPECT_EQ(a.taxRate, 19.6);
        EXPECT_TRUE(a.description.starts_with("Article associé aux réseaux EU.\r\n")) << a.description;
    }
    EXPECT_EQ(group[0]->nature, kNatureNonGraphic);
    EXPECT_EQ(group[0]->description, "Article associé aux réseaux EU.\r\nForfait");
    EXPECT_EQ(group[2]->description, "Article associé aux réseaux EU.\r\nLongueur 3D totale des canalisations ; "
                                     "les branchements ne sont pas pris en compte !");
    EXPECT_EQ(*bdr.NetworkIndexOf("PRJ_RES(EU 1)"), 1);
}

TEST(UpdateNetwork, SecondIdenticalUpdateChangesNothingAndKeepsUserEdits)
{
    for (bool purge : {false, true}) {
        SCOPED_TRACE(purge ? "purge" : "no purge");
        PurgeFlag flag(purge);
        CZodEVIBdr bdr;
        const auto update = [&] {
            return UpdateNetwork(bdr, 1, "EU 1", {"PVC 200"}, {"Joint"}, {"Regard"}, {"Tampon"}, {"TPC 90"}, {"Grave"},
                                 {1.30, 2.00, 3.50});
        };
        ASSERT_TRUE(update());
        for (const auto& article : bdr.Articles()) {
            article->unitPrice = 12.5;
            article->designation += " (négocié)";
        }
        const std::size_t count = bdr.Articles().size();
        EXPECT_FALSE(update());
        ASSERT_EQ(bdr.Articles().size(), count);
        for (const auto& article : bdr.Articles()) {
            EXPECT_EQ(article->unitPrice, 12.5);
            EXPECT_TRUE(article->designation.ends_with(" (négocié)"));
        }
    }
}

TEST(UpdateNetwork, EmptyPrefixTakesTheFirstTwoCharactersOfTheName)
{
    CZodEVIBdr bdr;
    ASSERT_TRUE(Update(bdr, 12, "Réseau X", {"C 3x2"}));
    EXPECT_EQ(ByKey(bdr, "Réseau X", "RSX_LIN_TOT_3D")->treePath,
              R"(Réseau X\\Câble\\Linéaire\\Ré-001 - Longueur 3D totale)");
    EXPECT_EQ(ByKey(bdr, "Réseau X", "RSX_TUY_LIN_3D_C 3x2")->code, "Ré-002");
    EXPECT_EQ(ByKey(bdr, "Réseau X", "RSX_BRA_LIN_3D"), nullptr); // EP and EU only
}

TEST(UpdateNetwork, DepthBoundsMakeOneArticlePerClass)
{
    struct Case {
        const char* name;
        Bounds bounds;
        Names keys;
    };
    const Case cases[] = {
        {"three bounds",
         {1.30, 2.00, 3.50},
         {"RSX_VOL_1.30_2.00", "RSX_VOL_2.00_3.50", "RSX_VOL_3.50", "RSX_LIN_1.30_2.00_2D", "RSX_LIN_2.00_3.50_2D",
          "RSX_LIN_3.50_2D", "RSX_BRA_VOL_1.30_2.00", "RSX_BRA_VOL_2.00_3.50", "RSX_BRA_VOL_3.50"}},
        {"one bound", {1.5}, {"RSX_VOL_1.50", "RSX_LIN_1.50_2D", "RSX_BRA_VOL_1.50"}},
        {"no bound", {}, {}},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        CZodEVIBdr bdr;
        Update(bdr, 0, "EP", {}, {}, c.bounds);
        const Names keys = Keys(GroupOf(bdr, "EP"));
        ASSERT_EQ(keys.size(), 20 + c.keys.size());
        EXPECT_EQ(Names(keys.begin() + 20, keys.end()), c.keys);
    }
    // The branch-trench class of the last bound has two placeholders for one value: the
    // bound fills both.
    CZodEVIBdr bdr;
    Update(bdr, 1, "EU 1", {}, {}, {1.30, 2.00, 3.50});
    const CZodEVIArticle* branch = ByKey(bdr, "EU 1", "RSX_BRA_VOL_3.50");
    ASSERT_NE(branch, nullptr);
    EXPECT_EQ(branch->designation, "Longueur 2D 3.50 m <= H <= 3.50 m");
    EXPECT_TRUE(branch->description.ends_with("volume de fouille pour 3.50 m <= H <= 3.50 m.")) << branch->description;
}

TEST(UpdateNetwork, PurgeRemovesOnlyTheModelsNoLongerListed)
{
    PurgeFlag flag(true);
    CZodEVIBdr bdr;
    Update(bdr, 1, "EU 1", {"PVC 200", "PVC 300"}, {}, {}, {"Regard 1000"});
    Update(bdr, 1, "EU 2", {"PVC 200"});
    Names expected = Keys(GroupOf(bdr, "EU 1"));
    std::erase(expected, "RSX_TUY_LIN_3D_PVC 200");
    std::erase(expected, "RSX_TUY_NB_PVC 200");
    const std::size_t total = bdr.Articles().size();
    EXPECT_TRUE(Update(bdr, 1, "EU 1", {"PVC 300"}, {}, {}, {"Regard 1000"}));
    EXPECT_EQ(Keys(GroupOf(bdr, "EU 1")), expected);
    EXPECT_EQ(bdr.Articles().size(), total - 2);
    EXPECT_NE(ByKey(bdr, "EU 2", "RSX_TUY_LIN_3D_PVC 200"), nullptr);
}

TEST(UpdateNetwork, DepthPurgeKeepsMaterialsThatLookLikeClasses)
{
    PurgeFlag flag(true);
    CZodEVIBdr bdr;
    // RSX_VOL_DEC_Grave is as long as the class sample RSX_VOL_0.00_0.00, and
    // RSX_VOL_DEC_ as RSX_VOL_0.00; neither is a depth class.
    const Names materials = {"Grave", ""};
    Update(bdr, 1, "EU 1", {}, materials, {1.30, 2.00});
    CZodEVIArticle* grave = const_cast<CZodEVIArticle*>(ByKey(bdr, "EU 1", "RSX_VOL_DEC_Grave"));
    ASSERT_NE(grave, nullptr);
    grave->unitPrice = 31;
    EXPECT_FALSE(Update(bdr, 1, "EU 1", {}, materials, {1.30, 2.00}));
    EXPECT_EQ(ByKey(bdr, "EU 1", "RSX_VOL_DEC_Grave"), grave);
    EXPECT_EQ(grave->unitPrice, 31);

    // New bounds remove the obsolete classes and only them; RSX_VOL_12.50 is longer than
    // the sample and stays, and every listed bound is kept, not only the last.
    Update(bdr, 1, "EU 1", {}, materials, {12.50});
    EXPECT_TRUE(Update(bdr, 1, "EU 1", {}, materials, {1.50, 2.50}));
    const Names keys = Keys(GroupOf(bdr, "EU 1"));
    EXPECT_EQ(Names(keys.begin() + 20, keys.end()),
              (Names{"RSX_VOL_DEC_Grave", "RSX_VOL_DEC_", "RSX_VOL_12.50", "RSX_LIN_12.50_2D", "RSX_BRA_VOL_12.50",
                     "RSX_VOL_1.50_2.50", "RSX_VOL_2.50", "RSX_LIN_1.50_2.50_2D", "RSX_LIN_2.50_2D",
                     "RSX_BRA_VOL_1.50_2.50", "RSX_BRA_VOL_2.50"}));
    Update(bdr, 1, "EU 1", {}, materials, {1.50, 2.50, 3.00});
    EXPECT_NE(ByKey(bdr, "EU 1", "RSX_VOL_2.50"), nullptr);
    EXPECT_NE(ByKey(bdr, "EU 1", "RSX_VOL_3.00"), nullptr);
}

// Updates, purges and an article edited by hand in between, on the indexes the updates
// leave behind: after each step the indexes agree with a scan, and a key the user gave
// an article is found by the next update instead of being made twice.
TEST(UpdateNetwork, IndexesStayExactThroughUpdatesPurgesAndEdits)
{
    PurgeFlag flag(true);
    CZodEVIBdr bdr;
    const auto step = [&](const char* what, const auto& run) {
        SCOPED_TRACE(what);
        run();
        EXPECT_EQ(bdr.CheckIndexes(), "");
    };
    step("new network", [&] { Update(bdr, 1, "EU 1", {"PVC 200", "PVC 300"}, {"Grave"}, {1.30, 2.00}); });
    step("purge a model and a class", [&] { Update(bdr, 1, "EU 1", {"PVC 300"}, {"Grave"}, {1.30}); });
    step("edited by hand", [&] {
        CZodEVIArticle* pipe = const_cast<CZodEVIArticle*>(ByKey(bdr, "EU 1", "RSX_TUY_LIN_3D_PVC 300"));
        ASSERT_NE(pipe, nullptr);
        CZodEVIArticle edited = *pipe;
        edited.quantityKey = MakeQuantityKey("RSX_TUY_LIN_3D_pvc 400");
        edited.code = "eu-999";
        bdr.ReplaceArticle(*pipe, edited);
    });
    step("the edited key is met", [&] { Update(bdr, 1, "EU 1", {"PVC 400"}, {"Grave"}, {1.30}); });
    step("depth classes", [&] { UpdateDepthClasses(bdr, {1.30, 2.50}); });
    step("codes up to the edited one", [&] {
        Names models = {"PVC 400"};
        for (int i = 0; i < 500; ++i)
            models.push_back("M" + std::to_string(i));
        Update(bdr, 1, "EU 1", models);
    });
    // Neither a key nor a code was given twice.
    std::set<std::string> keys, codes;
    for (const CZodEVIArticle* article : GroupOf(bdr, "EU 1")) {
        EXPECT_TRUE(keys.insert(FoldCase(article->quantityKey)).second || article->quantityKey == "\"\"")
            << article->quantityKey;
        EXPECT_TRUE(codes.insert(FoldCase(article->code)).second) << article->code;
    }
    const CZodEVIArticle* edited = ByKey(bdr, "EU 1", "RSX_TUY_LIN_3D_PVC 400");
    ASSERT_NE(edited, nullptr);
    EXPECT_EQ(edited->code, "eu-999");
}

TEST(UpdateNetwork, NamesAreNeverFormats)
{
    const std::string name = R"(PVC %s %d 100% "DN" \\ a\b %n)";
    CZodEVIBdr bdr;
    Update(bdr, 1, "EU %s 1", {name});
    EXPECT_TRUE(ByKey(bdr, "EU %s 1", "RSX_LIN_TOT_3D")->treePath.starts_with(R"(EU %s 1\\Canalisation EU\\)"));
    const CZodEVIArticle* model = ByKey(bdr, "EU %s 1", "RSX_TUY_LIN_3D_" + name);
    ASSERT_NE(model, nullptr);
    EXPECT_EQ(model->designation, "Fourniture et pose des canalisations " + name);

    // A sibling whose name holds backslashes still gives its true category.
    auto* moved = const_cast<CZodEVIArticle*>(model);
    moved->treePath = R"(Mes prix\\Tuyaux\\Linéaire\\)" + moved->code + " - " + moved->designation;
    Update(bdr, 1, "EU %s 1", {name, "PVC 400"});
    const CZodEVIArticle* added = ByKey(bdr, "EU %s 1", "RSX_TUY_LIN_3D_PVC 400");
    ASSERT_NE(added, nullptr);
    EXPECT_EQ(added->treePath, R"(Mes prix\\Tuyaux\\Linéaire\\)" + added->code + " - " + added->designation);
}

TEST(UpdateNetwork, NewArticlesJoinTheCategoryWhereTheUserKeepsTheirFamily)
{
    CZodEVIBdr bdr;
    Update(bdr, 1, "EU 1", {"PVC 200"}, {}, {1.30, 2.00});
    for (const char* key : {"RSX_TUY_LIN_3D_PVC 200", "RSX_VOL_1.30_2.00"}) {
        auto* article = const_cast<CZodEVIArticle*>(ByKey(bdr, "EU 1", key));
        ASSERT_NE(article, nullptr);
        article->treePath = R"(Mes prix\\Lot 2\\Linéaire\\)" + article->code + " - " + article->designation;
    }
    Update(bdr, 1, "EU 1", {"PVC 200", "PVC 300"}, {}, {1.30, 2.00, 2.50});
    struct Case {
        const char* key;
        const char* category;
    };
    const Case cases[] = {
        {"RSX_TUY_LIN_3D_PVC 300", R"(Mes prix\\Lot 2\\Linéaire)"},
        {"RSX_VOL_2.00_2.50", R"(Mes prix\\Lot 2\\Linéaire)"},
        // Families the user left in place stay in the catalogue's category.
        {"RSX_TUY_NB_PVC 300", R"(EU 1\\Canalisation EU\\Linéaire)"},
        {"RSX_LIN_2.00_2.50_2D", R"(EU 1\\Travaux de génie civil\\Terrassements\\Tranchées\\Linéaire)"},
        {"RSX_VOL_2.50", R"(EU 1\\Travaux de génie civil\\Terrassements\\Tranchées\\Volumique)"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.key);
        const CZodEVIArticle* article = ByKey(bdr, "EU 1", c.key);
        ASSERT_NE(article, nullptr);
        EXPECT_EQ(article->treePath, std::string(c.category) + R"(\\)" + article->code + " - " + article->designation);
    }
}

TEST(UpdateDepthClasses, AppliesBoundsToEveryNetworkByItsOwnName)
{
    CZodEVIBdr bdr;
    Update(bdr, 1, "EU (tranche 2)");
    Update(bdr, 2, "AEP");
    bdr.GroupOf("PRJ_RES(non mis à jour)", true);
    const std::size_t before = bdr.Articles().size();

    EXPECT_FALSE(UpdateDepthClasses(bdr, {}));
    EXPECT_EQ(bdr.Articles().size(), before);
    EXPECT_TRUE(UpdateDepthClasses(bdr, {1.0, 2.0}));
    EXPECT_FALSE(UpdateDepthClasses(bdr, {1.0, 2.0}));

    const CZodEVIArticle* eu = ByKey(bdr, "EU (tranche 2)", "RSX_VOL_1.00_2.00");
    ASSERT_NE(eu, nullptr);
    EXPECT_TRUE(
        eu->treePath.starts_with(R"(EU (tranche 2)\\Travaux de génie civil\\Terrassements\\Tranchées\\Volumique\\)"))
        << eu->treePath;
    EXPECT_NE(ByKey(bdr, "EU (tranche 2)", "RSX_BRA_VOL_2.00"), nullptr);
    EXPECT_NE(ByKey(bdr, "AEP", "RSX_LIN_2.00_2D"), nullptr);
    EXPECT_EQ(ByKey(bdr, "AEP", "RSX_BRA_VOL_2.00"), nullptr);
    EXPECT_TRUE(GroupOf(bdr, "non mis à jour").empty());
    // Six depth kinds for an EU network, four for an AEP one.
    EXPECT_EQ(bdr.Articles().size(), before + 6 + 4);

    PurgeFlag flag(true);
    EXPECT_TRUE(UpdateDepthClasses(bdr, {1.0, 1.5}));
    EXPECT_EQ(ByKey(bdr, "EU (tranche 2)", "RSX_VOL_1.00_2.00"), nullptr);
    EXPECT_NE(ByKey(bdr, "EU (tranche 2)", "RSX_VOL_1.00_1.50"), nullptr);
    EXPECT_NE(ByKey(bdr, "EU (tranche 2)", "RSX_VOL_1.50"), nullptr);
    EXPECT_EQ(bdr.Articles().size(), before + 6 + 4);
}

} // namespace
