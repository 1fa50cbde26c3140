// The price-schedule store: numbering, codes, searches, removal by path and by identity,
// the model search for articles added by hand, the group indexes, and the default file.
#include "schedule/schedule_store.hpp"

#include "support/schedule.hpp"
#include "support/temp_dir.hpp"
#include "text/text.hpp"

#include <gtest/gtest.h>
#include <algorithm>
#include <map>
#include <random>

using namespace zodevi;

namespace {

// Adds an article filed in its group, as the updates do.
CZodEVIArticle* Add(CZodEVIBdr& bdr, const std::string& groupKey, const std::string& treePath, int nature = 2,
                    const std::string& code = "", int number = -1)
{
    return AddFiled(bdr, {.code = code,
                          .number = number < 0 ? bdr.TakeNextNumber() : number,
                          .nature = nature,
                          .groupKey = groupKey,
                          .treePath = treePath});
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
    struct Case {
        std::vector<std::string> codes;
        const char* prefix;
        const char* expected;
    };
    const Case cases[] = {
        {{}, "GC", "GC-001"},         {{"gc-001", "GC-003"}, "GC", "GC-002"}, {{"GC-001", "GC-002"}, "GC", "GC-003"},
        {{"TP-001"}, "GC", "GC-001"}, {{"Ré-001"}, "RÉ", "RÉ-002"},           {{"EU-001"}, "", "-001"},
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

// Removal by identity: every group that lists an article forgets it, look-alikes stay,
// and pointers the store does not hold are ignored.
TEST(CZodEVIBdr, RemoveArticlesTakesExactlyTheGivenArticles)
{
    CZodEVIBdr bdr;
    CZodEVIArticle* a = Add(bdr, "PRJ_RES(EU 1)", "EU 1\\\\X-001 - a");
    CZodEVIArticle* twin = Add(bdr, "PRJ_RES(eu 1)", "eu 1\\\\x-001 - A");
    CZodEVIArticle* b = Add(bdr, "PRJ_RES(EU 1)", "EU 1\\\\X-002 - b");
    // An article listed by a group other than that of its key is forgotten there too.
    bdr.GroupOf("autre", true)->push_back(b);
    CZodEVIArticle stranger;

    EXPECT_EQ(bdr.RemoveArticles({}), 0u);
    EXPECT_EQ(bdr.RemoveArticles({twin, b, b, &stranger}), 2u);
    ASSERT_EQ(bdr.Articles().size(), 1u);
    EXPECT_EQ(bdr.Articles()[0].get(), a);
    EXPECT_EQ(*bdr.GroupOf("PRJ_RES(EU 1)", false), CZodEVIGroup{a});
    EXPECT_TRUE(bdr.GroupOf("PRJ_RES(eu 1)", false)->empty());
    EXPECT_TRUE(bdr.GroupOf("autre", false)->empty());
    EXPECT_EQ(bdr.RemoveArticles({&stranger}), 0u);
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
        {"existing group", "PRJ_RES(EU1)", "EU 1\\\\Canalisation EU\\\\Linéaire\\\\U-003 - n", 2, false, "PRJ_RES(EU1)",
         "PRJ_RES(EU1)"},
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
        Add(bdr, "PRJ_PFM(),PRJ_RTE(),PRJ_PCV()",
            "Voirie\\\\Terrassements\\\\Déblais\\\\Volumique\\\\GC-001 - Volume des déblais", 4);
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

// What the group queries answered before they had indexes: scans of the schedule.
CZodEVIFound ScannedByKey(const CZodEVIGroup& group, const std::string& key)
{
    for (std::size_t i = 0; i < group.size(); ++i)
        if (EqualsNoCase(group[i]->quantityKey, key))
            return {static_cast<long>(i), group[i]};
    return {};
}

std::string ScannedNewCode(const std::string& prefix, const CZodEVIGroup& group)
{
    for (int n = 1;; ++n) {
        const std::string code = FormatString("%s-%03d", prefix.c_str(), n);
        if (std::none_of(group.begin(), group.end(),
                         [&](const CZodEVIArticle* a) { return EqualsNoCase(a->code, code); }))
            return code;
    }
}

int ScannedNextFree(const CZodEVIBdr& bdr)
{
    for (int n = bdr.nextNumber;; ++n)
        if (std::none_of(bdr.Articles().begin(), bdr.Articles().end(), [&](const auto& a) { return a->number == n; }))
            return n;
}

// One edit of a sequence: `article` names an article by its tree path "P<n>".
struct Edit {
    enum Op { Add, RemovePath, RemoveSome, Regroup, Replace, InPlace, EraseFirst, Edited, Clear } op;
    const char* group = "";
    const char* key = "";
    const char* code = "";
    int article = 0;
    int number = -1;
};

// Answers every query both ways, then compares the indexes themselves.
void ExpectIndexesExact(CZodEVIBdr& bdr, const std::vector<std::string>& keys, const std::vector<std::string>& prefixes)
{
    for (const auto& [groupKey, group] : bdr.Groups()) {
        SCOPED_TRACE(groupKey);
        for (const std::string& key : keys) {
            const CZodEVIFound found = bdr.FindInGroupByQuantityKey(key, group.get());
            const CZodEVIFound scanned = ScannedByKey(*group, key);
            EXPECT_EQ(found.index, scanned.index) << key;
            EXPECT_EQ(found.article, scanned.article) << key;
        }
        for (const std::string& prefix : prefixes)
            EXPECT_EQ(bdr.NewCode(prefix, group.get()), ScannedNewCode(prefix, *group)) << prefix;
        std::vector<CZodEVIArticle*> pipes;
        for (CZodEVIArticle* a : *group)
            if (a->quantityKey.starts_with("\"T"))
                pipes.push_back(a);
        EXPECT_EQ(group->Family("pipes", [](std::string_view k) { return k.starts_with("\"T"); }), pipes);
    }
    EXPECT_EQ(bdr.NextFreeNumber(), ScannedNextFree(bdr));
    EXPECT_EQ(bdr.CheckIndexes(), "");
}

CZodEVIArticle* ByPath(CZodEVIBdr& bdr, int n)
{
    return bdr.FindByTreePath("P" + std::to_string(n)).article;
}

void Apply(CZodEVIBdr& bdr, const Edit& e)
{
    switch (e.op) {
    case Edit::Add: {
        auto article = std::make_unique<CZodEVIArticle>();
        article->groupKey = e.group;
        article->quantityKey = e.key;
        article->code = e.code;
        article->treePath = "P" + std::to_string(e.article);
        article->number = e.number < 0 ? bdr.TakeNextNumber() : e.number;
        bdr.GroupOf(e.group, true)->push_back(bdr.AddArticle(std::move(article)));
        break;
    }
    case Edit::RemovePath:
        bdr.RemoveByTreePath("P" + std::to_string(e.article));
        break;
    case Edit::RemoveSome:
        bdr.RemoveArticles({ByPath(bdr, e.article), ByPath(bdr, e.number)});
        break;
    case Edit::Regroup:
    case Edit::Replace: {
        CZodEVIArticle* stored = ByPath(bdr, e.article);
        ASSERT_NE(stored, nullptr);
        CZodEVIArticle fields = *stored;
        if (e.op == Edit::Regroup)
            fields.groupKey = e.group;
        else {
            fields.quantityKey = e.key;
            fields.code = e.code;
            if (e.number >= 0)
                fields.number = e.number;
        }
        bdr.ReplaceArticle(*stored, fields);
        break;
    }
    case Edit::InPlace: {
        CZodEVIArticle* stored = ByPath(bdr, e.article);
        ASSERT_NE(stored, nullptr);
        stored->quantityKey = e.key;
        stored->code = e.code;
        if (e.number >= 0)
            stored->number = e.number;
        bdr.ArticleChanged();
        break;
    }
    case Edit::EraseFirst: {
        CZodEVIGroup* group = bdr.GroupOf(e.group, false);
        ASSERT_NE(group, nullptr);
        group->erase(group->begin());
        break;
    }
    case Edit::Edited: {
        CZodEVIArticle edited;
        edited.groupKey = e.group;
        edited.quantityKey = e.key;
        edited.code = e.code;
        edited.treePath = "P" + std::to_string(e.article);
        edited.number = e.number;
        bdr.AddEditedArticle(edited);
        break;
    }
    case Edit::Clear:
        bdr.Clear();
        break;
    }
}

// Every edit that can reach a group keeps its indexes equal to a scan, over a long seeded
// mix of edits, with queries only now and then so that indexes are also met half built.
// The keys and codes differ by case, accents and their written number form.
TEST(CZodEVIBdr, IndexesFollowARandomMixOfEdits)
{
    const char* groups[] = {"g", "G", "h"};
    const char* keys[] = {"\"T\"", "\"t\"", "\"Té\"", "\"TÉ\"", "\"A\"", "\"\""};
    const char* codes[] = {"EP-001", "ep-002", "EP-002", "Ép-001", "EP-1000", "EP-01",         "X-EP-003",
                           "",       "ÉP-003", "EP-000", "EP-+01", "EP-0001", "EP-99999999999"};
    std::mt19937 random(14);
    const auto pick = [&](const auto& pool) { return pool[random() % std::size(pool)]; };
    CZodEVIBdr bdr;
    int made = 0;
    for (int step = 0; step < 800; ++step) {
        SCOPED_TRACE("step " + std::to_string(step));
        const int someone = made == 0 ? 0 : static_cast<int>(random() % made) + 1;
        const bool exists = ByPath(bdr, someone) != nullptr;
        const unsigned roll = random() % 20;
        Edit e{Edit::Add, pick(groups), pick(keys), pick(codes), ++made};
        if (roll < 3 && exists)
            e = {Edit::RemovePath, "", "", "", someone};
        else if (roll < 5)
            e = {Edit::RemoveSome, "", "", "", someone, static_cast<int>(random() % made) + 1};
        else if (roll < 7 && exists)
            e = {Edit::Regroup, pick(groups), "", "", someone};
        else if (roll < 9 && exists)
            e = {Edit::Replace, "", pick(keys), pick(codes), someone, static_cast<int>(random() % 900)};
        else if (roll < 10 && exists)
            e = {Edit::InPlace, "", pick(keys), pick(codes), someone};
        else if (roll < 11 && bdr.GroupOf(e.group, false) != nullptr && !bdr.GroupOf(e.group, false)->empty())
            e = {Edit::EraseFirst, e.group};
        else if (roll < 12)
            e.op = Edit::Edited;
        if (step == 400)
            e = {Edit::Clear};
        Apply(bdr, e);
        if (random() % 3 == 0)
            ExpectIndexesExact(bdr, {std::begin(keys), std::end(keys)},
                               {"EP", "ép", "X-EP", "", "EP-", std::string("EP\0X", 4)});
        if (::testing::Test::HasFailure())
            break;
    }
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
    const TempDir dir;
    const std::string existing = dir.Write("existant.xml", "<bordereau/>");

    struct Case {
        const char* name;
        std::string stored;
        std::map<int, std::string> found;
        std::string path;
        std::vector<int> asked;
    };
    const Case cases[] = {
        {"stored file exists", existing, {}, existing, {}},
        {"stored file missing",
         "/nulle/part.xml",
         {{0x27, "/trouve/VelaBordereau.xml"}},
         "/trouve/VelaBordereau.xml",
         {4, 7, 0x27}},
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
    CZodEVIBdr alone;
    EXPECT_EQ(alone.path, "VelaBordereau.xml");
}

} // namespace
