// Project discovery on drawings built in memory: record layouts, the walk order, the four
// groups' places, and malformed records.
#include "ui/project_discovery.hpp"

#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <string>
#include <vector>

#include "support/drawing.hpp"
#include "velhost/dbase.h"

using namespace zodevi;

namespace {

using Items = std::vector<std::function<resbuf*()>>;

std::function<resbuf*()> Text(std::string text)
{
    return [text] { return velRbString(kXdAsciiString, text); };
}
std::function<resbuf*()> Real(double value)
{
    return [value] { return velRbReal(kXdReal, value); };
}
std::function<resbuf*()> Short(short value)
{
    return [value] { return velRbShort(kXdInteger16, value); };
}
std::function<resbuf*()> Long(std::int32_t value)
{
    return [value] { return velRbLong(kXdInteger32, value); };
}
std::function<resbuf*()> Handle()
{
    return [] { return velRbString(kXdHandle, "1F"); };
}

// Files one record under first/second/key, its XData made of the items.
void File(AcDbDatabase& db, const char* first, const char* second, const std::string& key, const Items& items)
{
    std::vector<resbuf*> made;
    for (const auto& item : items)
        made.push_back(item());
    FileProjectRecord(db, first, second, key, made);
}

void FileRoad(AcDbDatabase& db, const std::string& key, const Items& items)
{
    File(db, "VELANTO_ROUT2_DICT", "VELANTO_ROUT2_PROJ", key, items);
}

using Found = std::map<std::string, std::vector<std::pair<std::string, double>>>;

Found Contents(const CZodEVIProjectMap& map)
{
    Found found;
    for (const auto& [name, table] : map)
        found[name] = table->Entries();
    return found;
}

struct Maps {
    CZodEVIProjectMap networks, roads, korvane, platforms;
    void Discover(AcDbDatabase* db) { DiscoverProjectsIn(db, {&networks, &roads, &korvane, &platforms}); }
};

struct RecordCase {
    const char* name;
    Items items;
    Found roads;
};

TEST(DiscoverProjects, ReadsEachRecordAsItIsLaidOut)
{
    const std::string longName(10000, 'n');
    const RecordCase cases[] = {
        {"four quantity codes",
         {Text("PRJ_NOM"), Text("P"), Text("T"), Text("12.5"), Text("R"), Real(12.5), Text("S"), Short(12), Text("L"),
          Long(12)},
         {{"P", {{"T", 12.5}, {"R", 12.5}, {"S", 12.0}, {"L", 12.0}}}}},
        {"texts without a plain number",
         {Text("PRJ_NOM"), Text("P"), Text("A"), Text("abc"), Text("C"), Text("1,5"), Text("E"), Text("")},
         {{"P", {{"A", 0.0}, {"C", 1.0}, {"E", 0.0}}}}},
        {"16-bit limits",
         {Text("PRJ_NOM"), Text("P"), Text("MIN"), Short(-32768), Text("MAX"), Short(32767)},
         {{"P", {{"MIN", -32768.0}, {"MAX", 32767.0}}}}},
        {"marker in lower case", {Text("prj_nom"), Text("P"), Text("K"), Real(1)}, {}},
        {"no name", {Text("PRJ_NOM")}, {}},
        {"name that is not a text", {Text("PRJ_NOM"), Real(4), Text("K"), Real(1)}, {}},
        {"real where a key is expected",
         {Text("PRJ_NOM"), Text("P"), Text("K1"), Long(3), Real(2), Text("K2"), Real(5)},
         {{"P", {{"K1", 3.0}}}}},
        {"unknown quantity code",
         {Text("PRJ_NOM"), Text("P"), Text("K1"), Long(3), Text("K2"), Handle(), Text("K3"), Real(5)},
         {{"P", {{"K1", 3.0}}}}},
        {"key without quantity", {Text("PRJ_NOM"), Text("P"), Text("K1"), Long(3), Text("K2")}, {{"P", {{"K1", 3.0}}}}},
        {"key met again",
         {Text("PRJ_NOM"), Text("P"), Text("K"), Real(1), Text("J"), Real(2), Text("K"), Real(3)},
         {{"P", {{"K", 3.0}, {"J", 2.0}}}}},
        {"names and keys with printf and path characters",
         {Text("PRJ_NOM"), Text("100% \"voie\" \\\\ %s%n"), Text("\"%d\\x\""), Real(2)},
         {{"100% \"voie\" \\\\ %s%n", {{"\"%d\\x\"", 2.0}}}}},
        {"very long name", {Text("PRJ_NOM"), Text(longName), Text("K"), Real(1)}, {{longName, {{"K", 1.0}}}}},
    };
    for (const RecordCase& c : cases) {
        SCOPED_TRACE(c.name);
        AcDbDatabase db;
        FileRoad(db, "entry", c.items);
        Maps maps;
        maps.Discover(&db);
        EXPECT_EQ(Contents(maps.roads), c.roads);
        EXPECT_TRUE(maps.networks.Empty() && maps.korvane.Empty() && maps.platforms.Empty());
    }
}

TEST(DiscoverProjects, LastEntryInByteOrderWinsAName)
{
    // "B" comes before "a" in byte order (not without regard to case): "a" wins.
    AcDbDatabase db;
    FileRoad(db, "a", {Text("PRJ_NOM"), Text("P"), Text("K"), Real(1)});
    FileRoad(db, "B", {Text("PRJ_NOM"), Text("P"), Text("K"), Real(2), Text("J"), Real(7)});
    FileRoad(db, "c", {Text("PRJ_NOM"), Text("Q"), Text("K"), Real(3)});
    Maps maps;
    maps.Discover(&db);
    EXPECT_EQ(Contents(maps.roads), (Found{{"P", {{"K", 1.0}}}, {"Q", {{"K", 3.0}}}}));
}

TEST(DiscoverProjects, FindsEachGroupInItsOwnPlace)
{
    AcDbDatabase db;
    File(db, "VELANTO_RSX_VRD", "PROJECTS", "n", {Text("PRJ_NOM"), Text("EU 1"), Text("K"), Real(1)});
    File(db, "VELANTO_PFM_VRD", "PROJECTS", "p", {Text("PRJ_NOM"), Text("Parking"), Text("K"), Real(2)});
    File(db, "KORVANE", "KORVANE_PROJET", "k", {Text("PRJ_NOM"), Text("Parking"), Text("K"), Real(3)});
    FileRoad(db, "r", {Text("PRJ_NOM"), Text("Parking"), Text("K"), Real(4)});
    // A dictionary of the right name in the wrong place holds nothing discovery reads.
    File(db, "AUTRE", "PROJECTS", "x", {Text("PRJ_NOM"), Text("X"), Text("K"), Real(5)});
    const bool modifiedBefore = db.isModified();
    Maps maps;
    maps.Discover(&db);
    EXPECT_EQ(Contents(maps.networks), (Found{{"EU 1", {{"K", 1.0}}}}));
    EXPECT_EQ(Contents(maps.platforms), (Found{{"Parking", {{"K", 2.0}}}}));
    EXPECT_EQ(Contents(maps.korvane), (Found{{"Parking", {{"K", 3.0}}}}));
    EXPECT_EQ(Contents(maps.roads), (Found{{"Parking", {{"K", 4.0}}}}));
    EXPECT_EQ(db.isModified(), modifiedBefore);

    Maps none;
    AcDbDatabase empty;
    none.Discover(&empty);
    none.Discover(nullptr);
    EXPECT_TRUE(none.networks.Empty() && none.roads.Empty() && none.korvane.Empty() && none.platforms.Empty());
}

} // namespace
