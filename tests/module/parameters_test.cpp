// Parameters in INI files and the registry, the error message once per file, message
// boxes and the Yes/No question.
#include "common/parameters.hpp"

#include <gtest/gtest.h>

#include "support/session.hpp"
#include "support/temp_dir.hpp"
#include "velhost/profile.h"

using namespace zodevi;

namespace {

class Parameters : public ::testing::Test {
protected:
    void SetUp() override
    {
        ResetLastParameterFile();
        saved = velHostSettings();
        velHostSettings().profileDir = dir.File("profil");
    }
    void TearDown() override { velHostSettings() = saved; }
    TempDir dir;
    VelHostSettings saved;
    ScriptedSession session;
};

TEST_F(Parameters, IniRoundTrip)
{
    const std::string file = dir.Write("VelParam.ini", "[Autre]\nx=1\n");
    ASSERT_TRUE(WriteParameter(file.c_str(), "VuzazORE", "Bordereau", "/data/VelaBordereau.xml"));
    EXPECT_EQ(LastParameterFile(), file);
    std::string out;
    EXPECT_TRUE(ReadParameter(file.c_str(), "vuzazore", "BORDEREAU", "", out));
    EXPECT_EQ(out, "/data/VelaBordereau.xml");
    EXPECT_TRUE(ReadParameter(file.c_str(), "VuzazORE", "Absent", "défaut", out));
    EXPECT_EQ(out, "défaut");
    EXPECT_TRUE(ReadParameter(dir.File("absent.ini").c_str(), "S", "K", "d", out));
    EXPECT_EQ(out, "d");
    EXPECT_EQ(dir.Read("VelParam.ini"), "[Autre]\nx=1\n[VuzazORE]\nBordereau=/data/VelaBordereau.xml\n");
}

TEST_F(Parameters, LongValuesAreCutToTheReadBuffer)
{
    const std::string file = dir.File("p.ini");
    ASSERT_TRUE(WriteParameter(file.c_str(), "S", "K", std::string(5000, 'x').c_str()));
    std::string out;
    EXPECT_TRUE(ReadParameter(file.c_str(), "S", "K", "", out));
    EXPECT_EQ(out.size(), 4095u);
}

TEST_F(Parameters, RegistryRootSelectsTheRegistry)
{
    ASSERT_TRUE(WriteParameter("hkey_current_user", "Software\\Velanto\\VuzazORE", "Bordereau", "/b.xml"));
    EXPECT_EQ(LastParameterFile(), "");
    std::string out;
    EXPECT_TRUE(ReadParameter("HKEY_CURRENT_USER", "Software\\Velanto\\VuzazORE", "Bordereau", "d", out));
    EXPECT_EQ(out, "/b.xml");
    // A missing value answers false with the default in place.
    EXPECT_FALSE(ReadParameter("HKEY_CURRENT_USER", "Software\\Velanto\\VuzazORE", "Absent", "d", out));
    EXPECT_EQ(out, "d");
    EXPECT_FALSE(WriteParameter("HKEY_CURRENT_USER", "", "x", "y"));
    EXPECT_EQ(session.Output(), "");
}

TEST_F(Parameters, WriteErrorReportedOncePerFile)
{
    const std::string missing = dir.File("absent/p.ini");
    const std::string folder = dir.File("dossier");
    std::filesystem::create_directories(folder);
    const std::string good = dir.File("bon.ini");
    struct Step {
        const char* file;
        const char* shown; // null: no message
    };
    const Step steps[] = {
        {missing.c_str(), "Fichier de paramètres inexistant !\n(Code d'erreur 2)\ndossier introuvable : vérifiez le "
                          "chemin du fichier."},
        {missing.c_str(), nullptr},
        {folder.c_str(), "Sauvegarde des paramètres imposssible !"},
        {"", "Pas de nom pour le fichier de paramètres !\n(Code d'erreur 22)"},
        {nullptr, nullptr}, // the last file reported was also "no name"
        {good.c_str(), nullptr},
        {nullptr, "Pointeur nul pour le fichier de paramètres !\n(Code d'erreur 22)"},
        {missing.c_str(), "Fichier de paramètres inexistant !"},
    };
    int index = 0;
    for (const Step& s : steps) {
        SCOPED_TRACE(index++);
        session.ClearOutput();
        const bool written = WriteParameter(s.file, "S", "K", "V");
        EXPECT_EQ(written, s.file == good.c_str());
        if (s.shown == nullptr) {
            EXPECT_EQ(session.Output(), "");
        } else {
            EXPECT_NE(session.Output().find(s.shown), std::string::npos) << session.Output();
            EXPECT_NE(session.Output().find("[velhost]"), std::string::npos);
        }
    }
}

TEST_F(Parameters, MessageBoxCaptionDependsOnTheOwner)
{
    int owner = 0;
    EXPECT_EQ(MessageBoxText(&owner, "%d article(s) à %s", 3, "50 %"), IDOK);
    EXPECT_NE(session.Output().find("[VELANTO (avertissement)]\n3 article(s) à 50 %"), std::string::npos);
    session.ClearOutput();
    EXPECT_EQ(MessageBoxFlags(nullptr, MB_YESNO | MB_ICONERROR | MB_DEFBUTTON2, "%s", "Supprimer ?"), IDNO);
    EXPECT_NE(session.Output().find("[velhost (erreur)]\nSupprimer ?\n<Non>"), std::string::npos);
    session.ClearOutput();
    EXPECT_EQ(MessageBoxFlags(&owner, MB_ICONERROR, "x"), IDOK);
    EXPECT_NE(session.Output().find("[VELANTO (erreur)]"), std::string::npos);
}

TEST(AskYesNo, AnswersFromTheScript)
{
    struct Case {
        const char* script;
        bool hasDefault;
        bool defaultYes;
        bool obtained;
        bool answer; // when obtained
        const char* prompt;
    };
    const Case cases[] = {
        {"\n", true, true, true, true, "\nPurger ? [Oui/Non] <Oui> : "},
        {"\n", true, false, true, false, "\nPurger ? [Oui/Non] <Non> : "},
        {"Non\n", true, true, true, false, "<Oui> : Non"},
        {"oui\n", true, false, true, true, "<Non> : oui"},
        {"_Yes\n", false, false, true, true, "\nPurger ? [Oui/Non] : _Yes"},
        {"^C\n", true, true, false, false, "<Oui> : ^C"},
        // The script has ended: nothing is asked, nothing answered.
        {"", true, true, false, false, ""},
        // Without a default an empty answer is refused and asked again.
        {"\nn\n", false, false, true, false, "Une réponse est requise."},
        {"\n", false, true, false, false, "Une réponse est requise."},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.script);
        ScriptedSession session(c.script);
        bool answer = !c.answer;
        const bool untouched = answer;
        EXPECT_EQ(AskYesNo("Purger ?", c.hasDefault, c.defaultYes, answer), c.obtained);
        EXPECT_EQ(answer, c.obtained ? c.answer : untouched);
        EXPECT_NE(session.Output().find(c.prompt), std::string::npos) << session.Output();
    }
}

} // namespace
