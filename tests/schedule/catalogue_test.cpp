// The standard catalogue against the expected texts transcribed by hand in
// tests/data/catalogue_expected.tsv, and spot checks of what the generators rely on.
#include "schedule/catalogue.hpp"
#include "schedule/schedule_store.hpp"

#include <fstream>
#include <gtest/gtest.h>
#include <map>
#include <set>
#include <sstream>

namespace {

std::string Unescape(const std::string& field)
{
    std::string out;
    for (std::size_t i = 0; i < field.size(); ++i) {
        if (field[i] != '\\' || i + 1 == field.size()) {
            out += field[i];
            continue;
        }
        const char next = field[++i];
        out += next == 'n' ? '\n' : next == 'r' ? '\r' : next == 't' ? '\t' : next;
    }
    return out;
}

struct ExpectedRow {
    int kind = 0, nature = 0, index = 0;
    std::string code, unit, designation, description, category, prefix;
};

std::multimap<int, ExpectedRow> LoadExpected()
{
    std::ifstream in(std::string(VEL_TEST_DATA) + "/catalogue_expected.tsv");
    std::multimap<int, ExpectedRow> rows;
    std::string line;
    std::getline(in, line); // header
    while (std::getline(in, line)) {
        std::vector<std::string> f;
        std::stringstream ss(line);
        std::string field;
        while (std::getline(ss, field, '\t'))
            f.push_back(Unescape(field));
        while (f.size() < 10)
            f.emplace_back();
        ExpectedRow row;
        row.kind = std::stoi(f[1]);
        row.nature = std::stoi(f[2]);
        row.code = f[3];
        row.unit = f[4];
        row.index = std::stoi(f[5]);
        row.designation = f[6];
        row.description = f[7];
        row.category = f[8];
        row.prefix = f[9];
        rows.emplace(std::stoi(f[0]), row);
    }
    return rows;
}

TEST(Catalogue, MatchesTheExpectedTextsEverywhere)
{
    const auto expected = LoadExpected();
    ASSERT_GT(expected.size(), 300u);
    const CZodEVIBdr bdr;
    const CZodEVIArtTemplateArray& catalogue = bdr.Catalogue();
    ASSERT_EQ(catalogue.GetSize(), 53);
    for (int number = 1; number <= 53; ++number) {
        SCOPED_TRACE("template #" + std::to_string(number));
        const CZodEVIArtTemplate* t = catalogue[number - 1];
        ASSERT_NE(t, nullptr);
        const auto [first, last] = expected.equal_range(number);
        ASSERT_NE(first, last);
        std::set<int> indexes;
        for (auto it = first; it != last; ++it) {
            const ExpectedRow& row = it->second;
            SCOPED_TRACE("index " + std::to_string(row.index));
            indexes.insert(row.index);
            EXPECT_EQ(t->kind, row.kind);
            EXPECT_EQ(t->nature, row.nature);
            EXPECT_EQ(t->codePattern, row.code);
            EXPECT_EQ(t->unit, row.unit);
            const CZodEVIArtParam* texts = t->TextsOf(row.index);
            ASSERT_NE(texts, nullptr);
            EXPECT_EQ(texts->designation, row.designation);
            EXPECT_EQ(texts->description, row.description);
            EXPECT_EQ(texts->categoryPattern, row.category);
            EXPECT_EQ(texts->numberingPrefix, row.prefix);
        }
        // Indexes without an expected row have no text: the template skips that network.
        EXPECT_EQ(t->TextCount(), indexes.size());
    }
}

TEST(Catalogue, KindCounts)
{
    const CZodEVIBdr bdr;
    CZodEVIArtTemplateArray selection;
    selection.SetOwning(false);
    for (int kind = 0; kind <= 51; ++kind) {
        SCOPED_TRACE(kind);
        const int expected = kind == 0 ? 2 : kind == 1 ? 3 : (kind == 10 || kind == 51) ? 0 : 1;
        EXPECT_EQ(bdr.Catalogue().SelectKind(kind, selection), expected);
    }
}

TEST(Catalogue, SpotChecks)
{
    const CZodEVIBdr bdr;
    const auto& c = bdr.Catalogue();
    const CZodEVIArtParam* p = c[28]->TextsOf(5); // #29, BTB
    ASSERT_NE(p, nullptr);
    EXPECT_EQ(p->designation, "Fourniture et pose de câble %s");
    EXPECT_EQ(p->categoryPattern, "%s\\\\Câble BTB");
    EXPECT_EQ(p->numberingPrefix, "BT");
    EXPECT_EQ(p->description, "Article associé aux réseaux BTB.\r\nLongueur 3D totale (SurLongueur comprise) du câble %s");
    p = c[26]->TextsOf(12); // #27, other networks
    ASSERT_NE(p, nullptr);
    EXPECT_EQ(p->categoryPattern, "%s\\\\Câble");
    EXPECT_EQ(p->numberingPrefix, "");
    EXPECT_EQ(p->description, "Longueur 3D totale (SurLongueur comprise) des câbles");
    // #24 keeps its two-limit designation under a one-limit code.
    EXPECT_EQ(c[23]->codePattern, "RSX_BRA_VOL_%.2f");
    EXPECT_EQ(c[23]->TextsOf(0)->designation, "Longueur 2D %.2f m <= H <= %.2f m");
    EXPECT_EQ(c[23]->TextsOf(2), nullptr);
    // #26 counts in "ml", #35/#36 have no network part.
    EXPECT_EQ(c[25]->unit, "ml");
    for (int i : {34, 35}) {
        EXPECT_EQ(c[i]->TextCount(), 1u);
        EXPECT_EQ(c[i]->FirstTexts()->categoryPattern, "Fourreau (peigne)");
    }
    // EP and EU never get duct, supply or coil articles.
    for (int i : {24, 25, 32, 33}) {
        EXPECT_EQ(c[i]->TextsOf(0), nullptr);
        EXPECT_EQ(c[i]->TextsOf(1), nullptr);
        EXPECT_NE(c[i]->TextsOf(2), nullptr);
    }
    EXPECT_STREQ(NetworkNumberingPrefix(10), "EP");
    EXPECT_STREQ(NetworkNumberingPrefix(12), "");
    EXPECT_STREQ(NetworkNumberingPrefix(-1), "");
}

} // namespace
