// The standard catalogue against the expected texts transcribed by hand in
// tests/data/catalogue_expected.tsv: kinds, natures, codes, units and every network's texts.
#include "schedule/catalogue.hpp"
#include "schedule/schedule_store.hpp"

#include <fstream>
#include <gtest/gtest.h>
#include <map>
#include <set>
#include <sstream>

using namespace zodevi;

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
    int kind = 0;
    int nature = 0;
    int index = 0;
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
        rows.emplace(std::stoi(f[0]), ExpectedRow{.kind = std::stoi(f[1]),
                                                  .nature = std::stoi(f[2]),
                                                  .index = std::stoi(f[5]),
                                                  .code = f[3],
                                                  .unit = f[4],
                                                  .designation = f[6],
                                                  .description = f[7],
                                                  .category = f[8],
                                                  .prefix = f[9]});
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

} // namespace
