// INI files read and written with Windows semantics.
#include <gtest/gtest.h>

#include <cerrno>

#include "support/temp_dir.hpp"
#include "velhost/profile.h"

namespace {

constexpr const char* kSample = "; réglages\n"
                                "[VuzazORE]\n"
                                "Bordereau = /data/VelaBordereau.xml  \n"
                                "Cite=\"  avec espaces  \"\n"
                                "\n"
                                "[Autre]\n"
                                "Bordereau=autre\n";

TEST(IniRead, SectionAndKeyIgnoreCase)
{
    TempDir dir;
    const std::string file = dir.Write("p.ini", kSample);
    struct Case {
        const char* section;
        const char* key;
        const char* expected;
    };
    const Case cases[] = {
        {"VuzazORE", "Bordereau", "/data/VelaBordereau.xml"},
        {"vuzazore", "BORDEREAU", "/data/VelaBordereau.xml"},
        {"VuzazORE", "Cite", "  avec espaces  "},
        {"Autre", "bordereau", "autre"},
        {"VuzazORE", "Absent", "défaut"},
        {"Absente", "Bordereau", "défaut"},
        {"VuzazORE", "; réglages", "défaut"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.section) + "/" + c.key);
        EXPECT_EQ(velGetPrivateProfileString(c.section, c.key, " défaut ", file, 4096), c.expected);
    }
    EXPECT_EQ(velGetPrivateProfileString("A", "B", "x", dir.File("absent.ini"), 4096), "x");
}

TEST(IniRead, LongValueIsCutAtACharacterBoundary)
{
    TempDir dir;
    const std::string value = std::string(4094, 'a') + "éé";
    const std::string file = dir.Write("p.ini", "[S]\nK=" + value + "\n");
    const std::string read = velGetPrivateProfileString("S", "K", "", file, 4096);
    EXPECT_EQ(read, std::string(4094, 'a'));
    EXPECT_EQ(velGetPrivateProfileString("S", "K", "", file, 4099).size(), 4098u);
}

TEST(IniWrite, KeepsEveryOtherByte)
{
    TempDir dir;
    const std::string crlf = "[A]\r\nx=1\r\n\r\n[B]\r\ny=2\r\n";
    struct Case {
        const char* name;
        std::string before;
        const char* section;
        const char* key;
        const char* value;
        std::string after;
    };
    const Case cases[] = {
        {"replace", kSample, "vuzazore", "BORDEREAU", "/n.xml",
         "; réglages\n[VuzazORE]\nBordereau=/n.xml\nCite=\"  avec espaces  \"\n\n[Autre]\nBordereau=autre\n"},
        {"new key ends its section", kSample, "VuzazORE", "Neuf", "1",
         "; réglages\n[VuzazORE]\nBordereau = /data/VelaBordereau.xml  \nCite=\"  avec espaces  "
         "\"\nNeuf=1\n\n[Autre]\nBordereau=autre\n"},
        {"new section ends the file", "[A]\nx=1", "B", "y", "2", "[A]\nx=1\n[B]\ny=2\n"},
        {"line ends kept", crlf, "A", "z", "3", "[A]\r\nx=1\r\nz=3\r\n\r\n[B]\r\ny=2\r\n"},
        {"delete key", crlf, "B", "y", nullptr, "[A]\r\nx=1\r\n\r\n[B]\r\n"},
        {"delete section", crlf, "a", nullptr, nullptr, "[B]\r\ny=2\r\n"},
        {"new file", "", "S", "K", "V", "[S]\nK=V\n"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const std::string file = dir.File("w.ini");
        std::filesystem::remove(file);
        if (!c.before.empty())
            dir.Write("w.ini", c.before);
        ASSERT_TRUE(velWritePrivateProfileString(c.section, c.key, c.value, file));
        EXPECT_EQ(dir.Read("w.ini"), c.after);
    }
}

TEST(IniWrite, RefusesWhatWouldCorruptTheFile)
{
    TempDir dir;
    const std::string file = dir.Write("p.ini", kSample);
    struct Case {
        const char* name;
        const char* section;
        const char* key;
        const char* value;
    };
    const Case cases[] = {
        {"break in value", "S", "K", "a\nb"}, {"break in key", "S", "K\r", "v"}, {"= in key", "S", "a=b", "v"},
        {"] in section", "S]", "K", "v"},     {"empty section", "", "K", "v"},   {"no section", nullptr, "K", "v"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        errno = 0;
        EXPECT_FALSE(velWritePrivateProfileString(c.section, c.key, c.value, file));
        EXPECT_EQ(errno, EINVAL);
        EXPECT_EQ(dir.Read("p.ini"), kSample);
    }
}

TEST(IniWrite, MissingFolderFails)
{
    TempDir dir;
    errno = 0;
    EXPECT_FALSE(velWritePrivateProfileString("S", "K", "V", dir.File("absent/p.ini")));
    EXPECT_EQ(errno, ENOENT);
    EXPECT_FALSE(std::filesystem::exists(dir.File("absent")));
}

} // namespace
