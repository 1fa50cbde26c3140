// The article filter: which articles the checked projects bring, with which quantities
// and lines, the levels of a tree path, the order of entries and the column texts.
#include "ui/article_filter.hpp"

#include <gtest/gtest.h>

#include "support/schedule.hpp"

#include <map>
#include <string>
#include <vector>

using namespace zodevi;

namespace {

// A small schedule: road articles (one lump sum), an EU network group with its lump sum,
// the general network, and a lump sum of no project group.
struct Schedule {
    Schedule()
    {
        const std::string road = MakeRoadGroupKey();
        AddFiled(bdr, road, "Voirie\\\\Déblais\\\\Volumique\\\\GC-001 - Déblais", kNatureVolume, "Déblais", "m³",
                 "\"K1\"");
        AddFiled(bdr, road, "Voirie\\\\Travaux\\\\Non Graphique\\\\TP-001 - Installation", kNatureNonGraphic,
                 "Installation", "", "\"\"");
        AddFiled(bdr, "PRJ_RES(EU)", "EU\\\\Tuyaux\\\\Linéaire\\\\EU-001 - PVC", kNatureLinear, "PVC", "m³",
                 "\"RSX_X\"");
        AddFiled(bdr, "PRJ_RES(EU)", "EU\\\\Travaux\\\\Non Graphique\\\\TP-001 - Piquetage", kNatureNonGraphic,
                 "Piquetage", "", "\"\"");
        AddFiled(bdr, "PRJ_RES(RSX_GENERAL)", "Général\\\\Linéaire\\\\G-001 - Réseaux", kNatureLinear, "Réseaux", "m³",
                 "\"RSX_G\"");
        AddFiled(bdr, "0", "Divers\\\\Non Graphique\\\\F-001 - Forfait", kNatureNonGraphic, "Forfait");
        bdr.NetworkGroups(networkGroups);
        bdr.RoadProjectArticles(roadArticles);
        bdr.NonGraphicArticles(lumpSums, true);
        roadKeys.Build(roadArticles);
        for (const auto& [name, group] : networkGroups) {
            networkKeys.emplace_back(name, CZodEVIArticleKeyIndex());
            networkKeys.back().second.Build(*group);
        }
    }
    CZodEVIBdr bdr;
    std::vector<std::pair<std::string, CZodEVIGroup*>> networkGroups;
    std::vector<std::pair<std::string, CZodEVIArticleKeyIndex>> networkKeys;
    CZodEVIArticleList roadArticles, lumpSums;
    CZodEVIArticleKeyIndex roadKeys;
};

struct Project {
    int kind;
    std::string name;
    std::vector<std::pair<std::string, double>> quantities;
    std::string checkedAs; // "" unchecked; the network's name for a network project
};

// What one article shows: its total and its lines' labels, projects and kinds.
struct Shown {
    double total;
    std::vector<std::string> labels;
    std::vector<std::string> projects;
    std::vector<std::string> carried; // assocText1
};

struct FilterCase {
    const char* name;
    std::vector<Project> projects;
    bool perProject;
    std::map<std::string, Shown> expected; // by designation
};

std::map<std::string, Shown> Filter(const Schedule& s, const std::vector<Project>& projects, bool perProject)
{
    CZodEVIProjectMap networks, roads, korvane, platforms;
    CZodEVINameMap checked[5];
    CZodEVIProjectMaps maps{&networks, &roads, &korvane, &platforms};
    for (const Project& p : projects) {
        velproj::QuantityTable& table = maps.OfKind(p.kind)->Get(p.name);
        for (const auto& [key, quantity] : p.quantities)
            table.Set(key, quantity);
        if (!p.checkedAs.empty())
            checked[p.kind][p.name] = p.checkedAs;
    }
    CZodEVIFilterInputs in;
    in.networkGroups = &s.networkGroups;
    in.networkKeys = &s.networkKeys;
    in.roadArticles = &s.roadArticles;
    in.roadKeys = &s.roadKeys;
    in.lumpSumArticles = &s.lumpSums;
    in.projects = maps;
    in.checkedNetworks = &checked[velproj::kKindNetwork];
    in.checkedRoadProjects = &checked[velproj::kKindRoad];
    in.checkedKorvaneProjects = &checked[velproj::kKindKorvane];
    in.checkedPlatforms = &checked[velproj::kKindPlatform];
    CZodEVIFilterEntryArray entries;
    CollectEntries(in, entries);
    std::map<std::string, Shown> shown;
    for (std::size_t i = 0; i < entries.GetSize(); ++i) {
        std::vector<std::unique_ptr<CZodEVIAssocLine>> lines;
        double total = 0;
        const CZodEVIArticle* article = nullptr;
        EXPECT_TRUE(BuildLines(entries[i], lines, total, article, perProject));
        Shown& out = shown[article->designation];
        out.total = total;
        for (const auto& line : lines) {
            out.labels.push_back(line->label);
            out.projects.push_back(line->projects + "/" + std::to_string(line->projectKind));
            out.carried.push_back(line->assocText1);
            EXPECT_EQ(line->lineKind, article->nature == kNatureNonGraphic ? 5 : 3);
            EXPECT_EQ(line->treePath, article->treePath);
        }
    }
    return shown;
}

TEST(ArticleFilter, CheckedProjectsBringTheirArticles)
{
    const Shown forfait{1.0, {"Forfait"}, {"**Forfait/0"}, {"0\t**Forfait"}};
    const Shown voirie{1.0, {"Installation"}, {"**Voirie/1"}, {"1\t**Voirie"}};
    const FilterCase cases[] = {
        {"nothing checked: the lump sums alone",
         {{2, "R1", {{"\"K1\"", 3}}, ""}},
         true,
         {{"Forfait", {1.0, {"Forfait (**Forfait)"}, {"**Forfait/0"}, {"0\t**Forfait"}}}}},
        {"two road projects summed",
         {{2, "R1", {{"\"K1\"", 3}}, "R1"}, {2, "R2", {{"\"k1\"", 4.5}}, "R2"}},
         false,
         {{"Déblais", {7.5, {"Déblais"}, {"R1,R2/2"}, {"2\tR1\n2\tR2"}}},
          {"Installation", voirie},
          {"Forfait", forfait}}},
        {"two road projects in detail",
         {{2, "R1", {{"\"K1\"", 3}}, "R1"}, {2, "R2", {{"\"K1\"", 4.5}}, "R2"}},
         true,
         {{"Déblais", {7.5, {"Déblais (R1)", "Déblais (R2)"}, {"R1/2", "R2/2"}, {"2\tR1", "2\tR2"}}},
          {"Installation", {1.0, {"Installation (**Voirie)"}, {"**Voirie/1"}, {"1\t**Voirie"}}},
          {"Forfait", {1.0, {"Forfait (**Forfait)"}, {"**Forfait/0"}, {"0\t**Forfait"}}}}},
        {"a second key of one table replaces, not adds",
         {{2, "R1", {{"\"K1\"", 2}, {"\"k1\"", 5}}, "R1"}},
         false,
         {{"Déblais", {5.0, {"Déblais"}, {"R1/2"}, {"2\tR1"}}}, {"Installation", voirie}, {"Forfait", forfait}}},
        {"a platform alone brings the road lump sums",
         {{1, "Parking", {}, "Parking"}},
         false,
         {{"Installation", voirie}, {"Forfait", forfait}}},
        {"network lump sums counted once for two projects",
         {{3, "EU 1", {{"\"RSX_X\"", 10}}, "EU"}, {3, "EU 2", {{"\"RSX_X\"", 2.5}}, "EU"}},
         false,
         {{"PVC", {12.5, {"PVC"}, {"EU 1,EU 2/3"}, {"3\tEU 1\n3\tEU 2"}}},
          {"Piquetage", {1.0, {"Piquetage"}, {"EU/3"}, {"3\tEU"}}},
          {"Forfait", forfait}}},
        {"the general network counts unchecked, in any case",
         {{3, "rsx_General", {{"\"RSX_G\"", 4}}, ""}},
         false,
         {{"Réseaux", {4.0, {"Réseaux"}, {"rsx_General/3"}, {"3\trsx_General"}}}, {"Forfait", forfait}}},
        {"a road and a platform of one name both count",
         {{2, "Parking", {{"\"K1\"", 3}}, "Parking"}, {1, "Parking", {{"\"K1\"", 4}}, "Parking"}},
         false,
         {{"Déblais", {7.0, {"Déblais"}, {"Parking,Parking/1"}, {"2\tParking\n1\tParking"}}},
          {"Installation", voirie},
          {"Forfait", forfait}}},
    };
    const Schedule schedule;
    for (const FilterCase& c : cases) {
        SCOPED_TRACE(c.name);
        const auto shown = Filter(schedule, c.projects, c.perProject);
        ASSERT_EQ(shown.size(), c.expected.size());
        for (const auto& [designation, expected] : c.expected) {
            SCOPED_TRACE(designation);
            ASSERT_EQ(shown.count(designation), 1u);
            const Shown& got = shown.at(designation);
            EXPECT_DOUBLE_EQ(got.total, expected.total);
            EXPECT_EQ(got.labels, expected.labels);
            EXPECT_EQ(got.projects, expected.projects);
            EXPECT_EQ(got.carried, expected.carried);
        }
    }
}

TEST(ArticleFilter, LevelsOfATreePath)
{
    const struct {
        const char* path;
        std::vector<std::string> levels;
    } cases[] = {
        {"Voirie\\\\Terrassements\\\\Déblais\\\\Volumique\\\\GC-001 - Volume des déblais",
         {"Voirie", "Terrassements", "Déblais", "Volumique"}},
        {"Voirie\\\\Terrassements\\\\Déblais\\\\linéaire\\\\GC-001 - X", {"Voirie", "Terrassements", "Déblais"}},
        {"EP\\\\Regard\\\\PONCTUEL\\\\EP-1 - X", {"EP", "Regard"}},
        {"EP\\\\Non Graphique\\\\TP-001 - X", {"EP"}},
        {"\\\\GC-001 - X", {}},
        {"GC-001 - X", {}},
        {"A\\\\\\\\B\\\\C - X", {"A"}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.path);
        EXPECT_EQ(FilterLevels(c.path), c.levels);
    }
}

TEST(ArticleFilter, SortKeepsSchedulePositionsBeyondSixteenBits)
{
    CZodEVIArticle a, b, c, d;
    for (CZodEVIArticle* article : {&a, &b, &c, &d})
        article->treePath = "X\\\\Y - Z";
    CZodEVIFilterEntryArray entries;
    for (CZodEVIArticle* article : {&a, &b, &c, &d})
        AddArticleQuantity(entries, article, "P", 1, 2);
    // 65540 would wrap to 4 in 16 bits and go before 5; d is not in the schedule.
    SortEntries(entries, {{&a, 65540}, {&b, 5}, {&c, 5}});
    const std::vector<const CZodEVIArticle*> order = {entries[0].article, entries[1].article, entries[2].article,
                                                      entries[3].article};
    EXPECT_EQ(order, (std::vector<const CZodEVIArticle*>{&d, &b, &c, &a}));
}

TEST(ArticleFilter, LevelsAndArticlesOfAPath)
{
    CZodEVIArticle a, b, c, d;
    a.treePath = "Voirie\\\\Bordures\\\\Linéaire\\\\A-001 - Bordure";
    a.designation = "Bordure";
    b.treePath = "voirie\\\\Bordures\\\\Ponctuel\\\\A-002 - Bordure";
    b.designation = "Bordure";
    c.treePath = "Voirie\\\\Chaussée\\\\A-003 - Enrobé";
    c.designation = "Enrobé";
    d.treePath = "EP\\\\A-004 - Tuyau";
    d.designation = "Tuyau";
    CZodEVIFilterEntryArray entries;
    for (CZodEVIArticle* article : {&d, &a, &b, &c})
        AddArticleQuantity(entries, article, "P", 1, 2);
    std::vector<std::string> out;
    EXPECT_EQ(ListSubLevels(entries, {}, out, false), 2);
    EXPECT_EQ(out, (std::vector<std::string>{"EP", "Voirie"}));
    EXPECT_EQ(ListSubLevels(entries, {"VOIRIE"}, out, false), 2);
    EXPECT_EQ(out, (std::vector<std::string>{"Bordures", "Chaussée"}));
    EXPECT_EQ(ListArticlesAt(entries, {"Voirie", "bordures"}, out, false), 2);
    EXPECT_EQ(out, (std::vector<std::string>{"Bordure", "Bordure"}));
    const auto& here = entries.EntriesAt({"Voirie", "Bordures"});
    ASSERT_EQ(here.size(), 2u);
    EXPECT_EQ(here[0]->article, &a);
    EXPECT_EQ(here[1]->article, &b);
}

TEST(ArticleFilter, ColumnTexts)
{
    CZodEVIArticle article;
    article.unitPrice = 12.5;
    article.unit = "m³";
    EXPECT_EQ(PriceColumnText(article, "€"), "12.50 €/m³");
    EXPECT_EQ(QuantityColumnText(7.5, "m³"), "7.50 m³");
    article.unit.clear();
    EXPECT_EQ(PriceColumnText(article, "€"), "12.50 €");
    EXPECT_EQ(QuantityColumnText(1, ""), "1.00");
    EXPECT_EQ(PriceColumnText(article, "%s%n"), "12.50 %s%n");
}

} // namespace
