// The registry kept in the profile's file.
#include <gtest/gtest.h>

#include "support/temp_dir.hpp"
#include "velhost/profile.h"

namespace {

class Registry : public ::testing::Test {
protected:
    void SetUp() override
    {
        saved = velHostSettings();
        velHostSettings().profileDir = dir.File("profil");
    }
    void TearDown() override { velHostSettings() = saved; }
    TempDir dir;
    VelHostSettings saved;
};

TEST_F(Registry, ValuesRoundTripWithoutRegardToCase)
{
    const std::string awkward = "ligne 1\nligne \"2\"\t\\fin";
    ASSERT_TRUE(velRegSetValue("HKEY_CURRENT_USER", "Software\\Velanto\\VuzazORE", "Bordereau", "/b.xml"));
    ASSERT_TRUE(velRegSetValue("hkey_current_user", "software\\velanto\\vuzazore\\", "Texte", awkward));
    ASSERT_TRUE(velRegSetValue("HKEY_CURRENT_USER", "Software\\Velanto\\VuzazORE", "", "défaut"));
    ASSERT_TRUE(velRegSetValue("HKEY_CURRENT_USER", "Software\\Velanto\\VuzazORE", "BORDEREAU", "/c.xml"));
    std::string out;
    EXPECT_TRUE(velRegQueryValue("Hkey_Current_User", "SOFTWARE\\VELANTO\\VUZAZORE", "bordereau", out, 8192));
    EXPECT_EQ(out, "/c.xml");
    EXPECT_TRUE(velRegQueryValue("HKEY_CURRENT_USER", "Software\\Velanto\\VuzazORE", "Texte", out, 8192));
    EXPECT_EQ(out, awkward);
    EXPECT_TRUE(velRegQueryValue("HKEY_CURRENT_USER", "Software\\Velanto\\VuzazORE", "", out, 8192));
    EXPECT_EQ(out, "défaut");
    // Roots are separate trees.
    EXPECT_FALSE(velRegQueryValue("HKEY_LOCAL_MACHINE", "Software\\Velanto\\VuzazORE", "Texte", out, 8192));
    EXPECT_FALSE(velRegQueryValue("HKEY_CURRENT_USER", "Software\\Velanto", "Texte", out, 8192));
    EXPECT_FALSE(velRegQueryValue("HKEY_CURRENT_USER", "Software\\Velanto\\VuzazORE", "Texte", out, 5));
    EXPECT_FALSE(velRegSetValue("HKEY_CURRENT_USER", "", "x", "y"));
    EXPECT_FALSE(velRegSetValue("HKEY_NOTHING", "a", "x", "y"));
}

TEST_F(Registry, MalformedFileIsNamedAndLeftAlone)
{
    struct Case {
        const char* content;
        int line;
        const char* expected;
    };
    const Case cases[] = {
        {"[HKEY_USERS\\a]\n\"x\"=\"1\"\n\"y\"=2\n", 3, "=\"texte\" attendu après le nom de valeur"},
        {"\"x\"=\"1\"\n", 1, "une clé \"[...]\" est attendue avant la première valeur"},
        {"[HKEY_USERS\\a\n", 1, "\"]\" attendu à la fin de la clé"},
        {"[HKEY_USERS\\a]\nx=\"1\"\n", 2, "nom de valeur entre guillemets attendu"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.content);
        dir.Write("profil/registre.reg", c.content);
        const VelReadResult read = velCheckRegistry();
        EXPECT_EQ(read.status, VelReadStatus::kMalformed);
        EXPECT_EQ(read.line, c.line);
        EXPECT_EQ(read.description(),
                  velRegistryFile() + ", ligne " + std::to_string(c.line) + " : " + c.expected + ".");
        EXPECT_FALSE(velRegSetValue("HKEY_USERS", "a", "z", "3"));
        EXPECT_EQ(dir.Read("profil/registre.reg"), c.content);
    }
}

} // namespace
