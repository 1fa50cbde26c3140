// Round trips checked by ezdxf: drawings written by ezdxf are opened, changed and saved
// by the host, then read back by ezdxf (/usr/bin/python3 with python3-ezdxf), which must
// find the same header, layers, dictionaries, XData and entities, with only the change.
#include <gtest/gtest.h>

#include "support/temp_dir.hpp"

#include <algorithm>
#include <cstdio>
#include <fstream>
#include <set>
#include <sstream>

#include "velhost/dbase.h"

namespace {

std::set<std::string> Dump(const std::string& path)
{
    const std::string command = std::string("/usr/bin/python3 '") + VEL_EZDXF_DUMP + "' '" + path + "' 2>&1";
    std::set<std::string> lines;
    FILE* pipe = popen(command.c_str(), "r");
    if (pipe == nullptr)
        return lines;
    std::string all;
    char buffer[4096];
    std::size_t n;
    while ((n = fread(buffer, 1, sizeof buffer, pipe)) > 0)
        all.append(buffer, n);
    EXPECT_EQ(pclose(pipe), 0) << all;
    std::istringstream in(all);
    for (std::string line; std::getline(in, line);)
        lines.insert(line);
    return lines;
}

std::vector<std::string> Minus(const std::set<std::string>& a, const std::set<std::string>& b)
{
    std::vector<std::string> out;
    std::set_difference(a.begin(), a.end(), b.begin(), b.end(), std::back_inserter(out));
    return out;
}

// Replaces the quantities of project P1 as the network module would.
void ChangeProject(AcDbDatabase& db)
{
    AcDbDictionary* nod = nullptr;
    ASSERT_EQ(db.getNamedObjectsDictionary(nod, AcDb::kForRead), Acad::eOk);
    AcDbObject* rsx = nullptr;
    ASSERT_EQ(nod->getAt("VELANTO_RSX_VRD", rsx, AcDb::kForRead), Acad::eOk);
    AcDbObject* projects = nullptr;
    ASSERT_EQ(static_cast<AcDbDictionary*>(rsx)->getAt("PROJECTS", projects, AcDb::kForRead), Acad::eOk);
    AcDbObject* p1 = nullptr;
    ASSERT_EQ(static_cast<AcDbDictionary*>(projects)->getAt("P1", p1, AcDb::kForWrite), Acad::eOk);
    VelRbBuilder list;
    list.add(velRbString(1001, "DAZUVUVUD")).add(velRbString(1000, "PRJ_NOM")).add(velRbString(1000, "Réseau EP Ω"));
    list.add(velRbString(1000, "EP_LIN")).add(velRbReal(1040, 99.25));
    ASSERT_EQ(p1->setXData(list.head()), Acad::eOk);
    p1->close();
    projects->close();
    rsx->close();
    nod->close();
}

TEST(EzdxfRoundTrip, OnlyWhatTheHostChangedDiffers)
{
    const struct {
        const char* file;
        bool hasProjects;
        const char* oldOsmode;
        const char* omega; // as ezdxf gives it back: it leaves the escapes of XData as they are
    } cases[] = {
        {"r12.dxf", false, "33", ""},
        {"r2000.dxf", true, "None", "\\\\U+03A9"},
        {"r2004_1252.dxf", true, "None", "\\\\U+03A9"},
        {"r2018.dxf", true, "None", "Ω"},
        {"crlf.dxf", true, "None", "Ω"},
        {"r2018_bin.dxf", true, "None", "Ω"},
        {"r12_bin.dxf", false, "20583", ""},
    };
    // A folder of its own: runs of the suite side by side never share a file.
    const TempDir dir;
    for (const auto& c : cases) {
        SCOPED_TRACE(c.file);
        const std::string original = std::string(VEL_TEST_DATA) + "/dxf/" + c.file;
        const std::string saved = dir.File(c.file);
        std::unique_ptr<AcDbDatabase> db;
        std::string error;
        ASSERT_EQ(velOpenDrawing(original, db).description(), "");
        ASSERT_EQ(db->setOsmode(100), Acad::eOk);
        if (c.hasProjects)
            ChangeProject(*db);
        ASSERT_TRUE(velSaveDrawing(*db, saved, error)) << error;
        const auto before = Dump(original);
        const auto after = Dump(saved);
        ASSERT_GT(before.size(), 10u);
        std::vector<std::string> gone{std::string("header $OSMODE ") + c.oldOsmode};
        std::vector<std::string> added{"header $OSMODE 100"};
        if (c.hasProjects) {
            gone.push_back("xdata /VELANTO_RSX_VRD/PROJECTS/P1 DAZUVUVUD [(1000, 'PRJ_NOM'), (1000, 'Réseau EP'), "
                           "(1000, 'EP_LIN'), (1000, '12.5'), (1000, 'EP_BIG'), (1071, 100000)]");
            added.push_back(std::string("xdata /VELANTO_RSX_VRD/PROJECTS/P1 DAZUVUVUD [(1000, 'PRJ_NOM'), "
                                        "(1000, 'Réseau EP ") +
                            c.omega + "'), (1000, 'EP_LIN'), (1040, 99.25)]");
        }
        EXPECT_EQ(Minus(before, after), gone);
        EXPECT_EQ(Minus(after, before), added);
    }
}

TEST(EzdxfRoundTrip, UnknownEntitiesAndObjectsAreKeptByteForByte)
{
    const std::string original = std::string(VEL_TEST_DATA) + "/dxf/r2018.dxf";
    const TempDir dir;
    const std::string saved = dir.File("unknown.dxf");
    std::unique_ptr<AcDbDatabase> db;
    std::string error;
    ASSERT_EQ(velOpenDrawing(original, db).description(), "");
    ChangeProject(*db);
    ASSERT_TRUE(velSaveDrawing(*db, saved, error)) << error;
    const std::string before = ReadFile(original);
    const std::string after = ReadFile(saved);
    for (const char* type : {"VEL_CHOSE", "VEL_OBJET"}) {
        SCOPED_TRACE(type);
        const auto begin = before.find(std::string("  0\n") + type);
        ASSERT_NE(begin, std::string::npos);
        const auto end = before.find("  0\n", begin + 4);
        const std::string raw = before.substr(begin, end - begin);
        EXPECT_NE(after.find(raw), std::string::npos);
    }
    EXPECT_NE(after.find(" valeur  avec espaces \n"), std::string::npos);
}

} // namespace
