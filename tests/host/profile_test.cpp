// Host settings and the file search along the support path.
#include "velhost/profile.h"

#include <gtest/gtest.h>

#include "support/temp_dir.hpp"
#include "velhost/editor.h"

namespace {

class FindFile : public ::testing::Test {
protected:
    void SetUp() override
    {
        saved = velHostSettings();
        velHostSettings().modulesDir = dir.File("modules");
        velHostSettings().profileDir = dir.File("profil");
        cwd = std::filesystem::current_path();
        std::filesystem::create_directories(dir.path / "travail");
        std::filesystem::current_path(dir.path / "travail");
    }
    void TearDown() override
    {
        std::filesystem::current_path(cwd);
        velHostSettings() = saved;
    }
    TempDir dir;
    VelHostSettings saved;
    std::filesystem::path cwd;
};

TEST_F(FindFile, SearchesModulesThenProfileThenWorkingFolder)
{
    dir.Write("modules/Vel2000Srv.arx", "m");
    dir.Write("profil/Vel2000Srv.arx", "p");
    dir.Write("profil/params.ini", "p");
    dir.Write("travail/params.ini", "w");
    dir.Write("travail/seul.txt", "w");
    dir.Write("Programmes/VelMetre15.arx", "m");
    struct Case {
        const char* name;
        std::string expected; // empty: not found
    };
    const Case cases[] = {
        {"Vel2000Srv.arx", dir.File("modules/Vel2000Srv.arx")},
        {"params.ini", dir.File("profil/params.ini")},
        {"seul.txt", dir.File("travail/seul.txt")},
        // Names written for Windows find the file too.
        {"..\\Programmes\\VelMetre15.arx", dir.File("Programmes/VelMetre15.arx")},
        {"absent.arx", ""},
        {"", ""},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        std::string found = "inchangé";
        const int status = acedFindFile(c.name, found);
        if (c.expected.empty()) {
            EXPECT_EQ(status, RTERROR);
            EXPECT_EQ(found, "inchangé");
        } else {
            EXPECT_EQ(status, RTNORM);
            EXPECT_EQ(found, c.expected);
        }
    }
}

TEST_F(FindFile, AbsoluteNamesAreTakenAsTheyAre)
{
    const std::string file = dir.Write("ailleurs/a.ini", "x");
    std::string found;
    EXPECT_EQ(acedFindFile(file.c_str(), found), RTNORM);
    EXPECT_EQ(found, file);
    EXPECT_EQ(acedFindFile(dir.File("ailleurs").c_str(), found), RTERROR);
}

} // namespace
