// The price-schedule store: numbering, codes, searches, removal, the model search for
// articles added by hand, and the default file.
#include "schedule/schedule_store.hpp"

#include <filesystem>
#include <fstream>
#include "text/text.hpp"

#include <gtest/gtest.h>
#include <map>

namespace {

// Adds an article filed in its group, as the updates do.
CZodEVIArticle* Add(CZodEVIBdr& bdr, const std::string& groupKey, const std::string& treePath, int nature = 2,
                    const std::string& code = "", int number = -1)
{
    auto article = std::make_unique<CZodEVIArticle>();
    article->groupKey = groupKey;
    article->treePath = treePath;
    article->nature = nature;
    article->code = code;
    article->number = number < 0 ? bdr.TakeNextNumber() : number;
    CZodEVIArticle* added = bdr.AddArticle(std::move(article));
    if (!groupKey.empty())
        bdr.GroupOf(groupKey, true)->push_back(added);
    return added;
}

TEST(CZodEVIBdr, NextFreeNumberSkipsTaken)
{
    CZodEVIBdr bdr;
    EXPECT_EQ(bdr.NextFreeNumber(), 1);
    for (int n : {1, 2, 4})
        Add(bdr, "g", "", 2, "", n);
    EXPECT_EQ(bdr.NextFreeNumber(), 3);
    EXPECT_EQ(bdr.TakeNextNumber(), 3);
    EXPECT_EQ(bdr.TakeNextNumber(), 5);
    EXPECT_EQ(bdr.nextNumber, 6);
    bdr.Clear();
    EXPECT_EQ(bdr.nextNumber, 1);
    EXPECT_EQ(bdr.NextFreeNumber(), 1);
}

TEST(CZodEVIBdr, NumberingAfterRemovalsDoesNotReuseBehindTheCounter)
{
    CZodEVIBdr bdr;
    Add(bdr, "g", "A\\\\X-001 - a");
    Add(bdr, "g", "A\\\\X-002 - b");
    Add(bdr, "g", "A\\\\X-003 - c");
    ASSERT_TRUE(bdr.RemoveByTreePath("A\\\\X-002 - b"));
    // Number 2 is free again but the counter has moved past it.
    EXPECT_EQ(bdr.TakeNextNumber(), 4);
}

TEST(CZodEVIBdr, NewCodeFillsGapsWithoutRegardToCase)
{
    struct Case { std::vector<std::string> codes; const char* prefix; const char* expected; };
    const Case cases[] = {
        {{}, "GC", "GC-001"},
        {{"gc-001", "GC-003"}, "GC", "GC-002"},
        {{"GC-001", "GC-002"}, "GC", "GC-003"},
        {{"TP-001"}, "GC", "GC-001"},
        {{"Ré-001"}, "RÉ", "RÉ-002"},
        {{"EU-001"}, "", "-001"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.expected);
        CZodEVIBdr bdr;
        for (const auto& code : c.codes)
            Add(bdr, "PRJ_RES(EU 1)", "", 2, code);
        // Codes of another group never count.
        Add(bdr, "PRJ_RES(EU 2)", "", 2, std::string(c.prefix) + "-001");
        EXPECT_EQ(bdr.NewCode(c.prefix, bdr.GroupOf("PRJ_RES(EU 1)", true)), c.expected);
    }
    CZodEVIBdr bdr;
    CZodEVIGroup* group = bdr.GroupOf("g", true);
    for (int n = 1; n <= 999; ++n)
        Add(bdr, "g", "", 2, FormatString("GC-%03d", n));
    EXPECT_EQ(bdr.NewCode("GC", group), "GC-1000");
}

TEST(CZodEVIBdr, FindersCompareWithoutRegardToCase)
{
    CZodEVIBdr bdr;
    CZodEVIArticle* a = Add(bdr, "PRJ_RES(EU 1)", "EU 1\\\\Canalisation EU\\\\Linéaire\\\\EU-001 - Pvc");
    a->quantityKey = "\"RSX_TUY_LIN_3D_Pvc 200\"";
    CZodEVIArticle* b = Add(bdr, "PRJ_RES(EU 1)", "EU 1\\\\Regard EU\\\\Ponctuel\\\\EU-002 - Regard");
    b->quantityKey = "\"RSX_SBL_NB_Regard\"";
    const CZodEVIGroup* group = bdr.GroupOf("PRJ_RES(EU 1)", false);

    const CZodEVIFound byKey = bdr.FindInGroupByQuantityKey("\"rsx_sbl_nb_REGARD\"", group);
    EXPECT_EQ(byKey.index, 1);
    EXPECT_EQ(byKey.article, b);
    EXPECT_FALSE(bdr.FindInGroupByQuantityKey("\"RSX_SBL_NB\"", group));
    EXPECT_FALSE(bdr.FindInGroupByQuantityKey("\"RSX_SBL_NB_Regard\"", nullptr));

    const CZodEVIFound byPath = bdr.FindByTreePath("eu 1\\\\CANALISATION EU\\\\LINÉAIRE\\\\eu-001 - PVC");
    EXPECT_EQ(byPath.index, 0);
    EXPECT_EQ(byPath.article, a);
    EXPECT_EQ(bdr.FindByTreePath("absent").index, -1);

    std::string category;
    EXPECT_TRUE(bdr.FindCategoryByQuantityKeyPart("SBL_NB", group, category));
    EXPECT_EQ(category, "EU 1\\\\Regard EU\\\\Ponctuel");
    // Containment is case-sensitive.
    EXPECT_FALSE(bdr.FindCategoryByQuantityKeyPart("sbl_nb", group, category));
}

TEST(CZodEVIBdr, RemoveByTreePath)
{
    CZodEVIBdr bdr;
    Add(bdr, "PRJ_RES(EU 1)", "A\\\\X-001 - a");
    Add(bdr, "PRJ_RES(EU 1)", "A\\\\X-002 - b");
    CZodEVIArticle* orphan = Add(bdr, "", "B\\\\X-001 - c");
    orphan->groupKey = "PRJ_RES(disparu)";

    EXPECT_FALSE(bdr.RemoveByTreePath("A\\\\X-009 - z"));
    EXPECT_EQ(bdr.Articles().size(), 3u);

    EXPECT_TRUE(bdr.RemoveByTreePath("a\\\\x-001 - A"));
    EXPECT_EQ(bdr.Articles().size(), 2u);
    ASSERT_EQ(bdr.GroupOf("PRJ_RES(EU 1)", false)->size(), 1u);
    EXPECT_EQ(bdr.GroupOf("PRJ_RES(EU 1)", false)->front()->treePath, "A\\\\X-002 - b");

    // Its group no longer exists: the article still leaves the schedule.
    EXPECT_TRUE(bdr.RemoveByTreePath("B\\\\X-001 - c"));
    EXPECT_EQ(bdr.Articles().size(), 1u);
}

struct EditedCase {
    const char* name;
    const char* groupKey;
    const char* treePath;
    int nature;
    bool answer;
    const char* finalKey;
    const char* group; // group that must hold the copy, or null
};

TEST(CZodEVIBdr, AddEditedArticle)
{
    const EditedCase cases[] = {
        {"takes the neighbour's key", "0", "EU 1\\\\Canalisation EU\\\\Linéaire\\\\U-001 - nouveau", 2, true,
         "PRJ_RES(EU1)", "PRJ_RES(EU1)"},
        {"no group compares without case", "0", "eu 1\\\\canalisation eu\\\\Linéaire\\\\U-002 - n", 2, true,
         "PRJ_RES(EU1)", "PRJ_RES(EU1)"},
        {"existing group", "PRJ_RES(EU1)", "EU 1\\\\Canalisation EU\\\\Linéaire\\\\U-003 - n", 2, false,
         "PRJ_RES(EU1)", "PRJ_RES(EU1)"},
        {"no category", "0", "sans chemin", 2, false, "0", nullptr},
        {"no associated neighbour", "0", "Divers\\\\Linéaire\\\\U-004 - n", 2, false, "0", nullptr},
        {"volume article finds its model", "0", "Voirie\\\\Terrassements\\\\Déblais\\\\Volumique\\\\GC-009 - n", 4,
         true, "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()", "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()"},
        {"unknown group key without model", "PRJ_RES(inconnu)", "Divers\\\\Linéaire\\\\U-005 - n", 2, false,
         "PRJ_RES(inconnu)", nullptr},
        // Its own unknown key must not hide the neighbour of the same category.
        {"unknown group key with a neighbour", "PRJ_RES(inconnu)", "EU 1\\\\Canalisation EU\\\\Linéaire\\\\U-006 - n",
         2, true, "PRJ_RES(EU1)", "PRJ_RES(EU1)"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        CZodEVIBdr bdr;
        Add(bdr, "PRJ_RES(EU1)", "EU 1\\\\Canalisation EU\\\\Linéaire\\\\EU-001 - PVC 200");
        Add(bdr, "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()", "Voirie\\\\Terrassements\\\\Déblais\\\\Volumique\\\\GC-001 - Volume des déblais", 4);
        Add(bdr, "0", "Divers\\\\Linéaire\\\\X-001 - libre");

        CZodEVIArticle edited;
        edited.groupKey = c.groupKey;
        edited.treePath = c.treePath;
        edited.nature = c.nature;
        EXPECT_EQ(bdr.AddEditedArticle(edited), c.answer);
        EXPECT_EQ(edited.groupKey, c.groupKey); // the caller's record is left alone
        ASSERT_EQ(bdr.Articles().size(), 4u);
        const CZodEVIArticle* copy = bdr.Articles().back().get();
        EXPECT_EQ(copy->groupKey, c.finalKey);
        int groupsHolding = 0;
        for (const auto& [key, group] : bdr.Groups()) {
            if (std::find(group->begin(), group->end(), copy) != group->end()) {
                ++groupsHolding;
                EXPECT_EQ(key, c.group);
            }
        }
        EXPECT_EQ(groupsHolding, c.group ? 1 : 0);
    }
}

TEST(CZodEVIBdr, FindModelThroughSiblingCategory)
{
    CZodEVIBdr bdr;
    Add(bdr, "0", "Réseaux\\\\Regards\\\\Ponctuel\\\\X-001 - libre", 1);
    Add(bdr, "PRJ_RES(EP)", "Réseaux\\\\Canalisations\\\\Linéaire\\\\EP-001 - PVC", 2);
    CZodEVIArticle model;
    std::set<std::string> visited;
    ASSERT_TRUE(bdr.FindModel("Réseaux\\\\Regards", model, visited));
    EXPECT_EQ(model.groupKey, "PRJ_RES(EP)");

    visited.clear();
    EXPECT_FALSE(bdr.FindModel("Ailleurs", model, visited));
    // A category seen before is not searched twice.
    visited = {"Réseaux\\\\Regards"};
    EXPECT_FALSE(bdr.FindModel("Réseaux\\\\Regards", model, visited));
}

TEST(CZodEVIBdr, FindModelEndsOnCategoriesDifferingOnlyByCase)
{
    CZodEVIBdr bdr;
    const char* categories[] = {"A", "a", "A\\\\B", "a\\\\b", "A\\\\b", "a\\\\B\\\\C", "A\\\\B\\\\c"};
    int n = 0;
    for (const char* c : categories)
        Add(bdr, "0", std::string(c) + "\\\\Linéaire\\\\X-" + std::to_string(++n) + " - d");
    for (const char* c : categories) {
        SCOPED_TRACE(c);
        CZodEVIArticle model;
        std::set<std::string> visited;
        EXPECT_FALSE(bdr.FindModel(c, model, visited));
        EXPECT_LE(visited.size(), 16u);
    }
}

TEST(CZodEVIBdr, CategoryQueries)
{
    CZodEVIBdr bdr;
    Add(bdr, "0", "V\\\\Linéaire\\\\X-001 - a");
    Add(bdr, "0", "V\\\\T\\\\Linéaire\\\\X-002 - b");
    Add(bdr, "0", "v\\\\Ponctuel\\\\X-003 - c", 1);
    Add(bdr, "0", "V\\\\T\\\\Linéaire\\\\X-004 - d");
    Add(bdr, "0", "W\\\\Linéaire\\\\X-005 - e");
    CZodEVIArticleList list;
    EXPECT_EQ(bdr.ArticlesInCategory("V", list), 2);
    std::vector<std::string> subs;
    EXPECT_EQ(bdr.SubCategories("V", subs), 2);
    EXPECT_EQ(subs, (std::vector<std::string>{"V\\\\T", "V\\\\T"}));
}

TEST(CZodEVIBdr, GroupQueries)
{
    CZodEVIBdr bdr;
    Add(bdr, "0", "A\\\\Linéaire\\\\X-001 - a");
    CZodEVIArticle* road = Add(bdr, "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()", "V\\\\Non Graphique\\\\TP-001 - a", 6);
    Add(bdr, "PRJ_RES(RSX_GENERAL)", "F\\\\Linéaire\\\\GC-001 - a");
    Add(bdr, "PRJ_RES(EU (tranche 2))", "EU\\\\Non Graphique\\\\TP-001 - a", 6);
    CZodEVIArticle* free = Add(bdr, "0", "D\\\\Non Graphique\\\\TP-001 - libre", 6);

    std::vector<std::pair<std::string, CZodEVIGroup*>> networks;
    ASSERT_TRUE(bdr.NetworkGroups(networks));
    ASSERT_EQ(networks.size(), 2u);
    EXPECT_EQ(networks[0].first, "RSX_GENERAL");
    EXPECT_EQ(networks[1].first, "EU (tranche 2)");
    EXPECT_EQ(networks[1].second, bdr.GroupOf("PRJ_RES(EU (tranche 2))", false));

    CZodEVIArticleList list;
    ASSERT_TRUE(bdr.RoadProjectArticles(list));
    EXPECT_EQ(list, CZodEVIArticleList{road});
    ASSERT_TRUE(bdr.NonGraphicArticles(list, false));
    EXPECT_EQ(list.size(), 3u);
    ASSERT_TRUE(bdr.NonGraphicArticles(list, true));
    EXPECT_EQ(list, CZodEVIArticleList{free});

    CZodEVIBdr empty;
    EXPECT_FALSE(empty.NetworkGroups(networks));
    EXPECT_FALSE(empty.RoadProjectArticles(list));
}

TEST(CZodEVIBdr, ArticleIndexMapIsFullWidth)
{
    CZodEVIBdr bdr;
    for (int i = 0; i < 70000; ++i) {
        auto article = std::make_unique<CZodEVIArticle>();
        article->number = i + 1;
        bdr.AddArticle(std::move(article));
    }
    std::unordered_map<const CZodEVIArticle*, std::size_t> indexes;
    EXPECT_EQ(bdr.ArticleIndexMap(indexes), 70000u);
    EXPECT_EQ(indexes.at(bdr.Articles()[69999].get()), 69999u);
    EXPECT_EQ(indexes.at(bdr.Articles()[65536].get()), 65536u);
}

TEST(CZodEVIBdr, NetworkIndexesAndClear)
{
    CZodEVIBdr bdr;
    bdr.path = "/tmp/b.xml";
    bdr.SetNetworkIndex("PRJ_RES(EU 1)", 1);
    bdr.SetNetworkIndex("PRJ_RES(EU 1)", 12);
    ASSERT_NE(bdr.NetworkIndexOf("PRJ_RES(EU 1)"), nullptr);
    EXPECT_EQ(*bdr.NetworkIndexOf("PRJ_RES(EU 1)"), 12);
    EXPECT_EQ(bdr.NetworkIndexOf("PRJ_RES(eu 1)"), nullptr);
    Add(bdr, "g", "x");
    bdr.Clear();
    EXPECT_EQ(bdr.NetworkIndexOf("PRJ_RES(EU 1)"), nullptr);
    EXPECT_TRUE(bdr.Articles().empty());
    EXPECT_TRUE(bdr.Groups().Empty());
    EXPECT_EQ(bdr.path, "/tmp/b.xml");
    EXPECT_EQ(bdr.Catalogue().GetSize(), 53);
}

TEST(PurgeFlag, OffUntilArmed)
{
    EXPECT_FALSE(GetPurgeFlag());
    SetPurgeFlag(true);
    EXPECT_TRUE(GetPurgeFlag());
    SetPurgeFlag(false);
}

// Stands in for the main services and the parameter reader.
class FakeEnvironment : public CZodEVIBdrEnvironment {
public:
    std::string stored;
    std::map<int, std::string> found;
    std::vector<int> asked;
    std::string ParameterFile() override { return "/profil/Vela.ini"; }
    std::string ReadParameter(const std::string& file, const std::string& section, const std::string& key,
                              const std::string& defaultValue) override
    {
        EXPECT_EQ(file, "/profil/Vela.ini");
        EXPECT_EQ(section, "VuzazORE");
        EXPECT_EQ(key, "Bordereau");
        return stored.empty() ? defaultValue : stored;
    }
    std::string FindDataFile(const std::string& name, int code) override
    {
        EXPECT_EQ(name, "VelaBordereau.xml");
        asked.push_back(code);
        return found.count(code) ? found[code] : "";
    }
    std::string DataFolder(int code) override { return code == 1 ? "/donnees/" : "/faux/"; }
};

TEST(CZodEVIBdr, DefaultFileResolution)
{
    const std::filesystem::path existing = std::filesystem::temp_directory_path() / "vel_bdr_existant.xml";
    std::ofstream(existing) << "<bordereau/>";

    struct Case { const char* name; std::string stored; std::map<int, std::string> found; std::string path; std::vector<int> asked; };
    const Case cases[] = {
        {"stored file exists", existing.string(), {}, existing.string(), {}},
        {"stored file missing", "/nulle/part.xml", {{0x27, "/trouve/VelaBordereau.xml"}}, "/trouve/VelaBordereau.xml", {4, 7, 0x27}},
        {"nothing stored", "", {{4, "/a/VelaBordereau.xml"}}, "/a/VelaBordereau.xml", {4}},
        {"nothing found", "", {}, "/donnees/VelaBordereau.xml", {4, 7, 0x27, 0x37}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        FakeEnvironment environment;
        environment.stored = c.stored;
        environment.found = c.found;
        SetBdrEnvironment(&environment);
        CZodEVIBdr bdr;
        SetBdrEnvironment(nullptr);
        EXPECT_EQ(bdr.path, c.path);
        EXPECT_EQ(environment.asked, c.asked);
        EXPECT_EQ(bdr.nextNumber, 1);
    }
    std::filesystem::remove(existing);
    CZodEVIBdr alone;
    EXPECT_EQ(alone.path, "VelaBordereau.xml");
}

} // namespace
