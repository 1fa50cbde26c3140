// velhost's command interpreter, line by line, with answers from a script.
#include "shell.h"

#include <gtest/gtest.h>

#include <sstream>

#include "support/session.hpp"
#include "support/temp_dir.hpp"
#include "velhost/documents.h"
#include "velhost/profile.h"

namespace {

class Shell : public ::testing::Test {
protected:
    void SetUp() override
    {
        saved = velHostSettings();
        velHostSettings().modulesDir = VEL_TEST_MODULE_DIR;
        velHostSettings().profileDir = dir.File("profil");
    }
    void TearDown() override
    {
        shell.shutdown();
        velHostSettings() = saved;
    }
    VelLineResult Run(const std::string& line)
    {
        error.clear();
        return shell.runLine(line, error);
    }
    TempDir dir;
    VelHostSettings saved;
    VelShell shell;
    std::string error;
};

TEST_F(Shell, AScriptCutShortByAnInputErrorFails)
{
    // A script whose reading fails after its first line, as a disk or a pipe can fail.
    struct FailingBuffer : std::streambuf {
        std::string first = "NEW\n";
        bool given = false;
        int_type underflow() override
        {
            if (given)
                throw std::ios_base::failure("lecture");
            given = true;
            setg(first.data(), first.data(), first.data() + first.size());
            return traits_type::to_int_type(first[0]);
        }
    } buffer;
    std::istream in(&buffer);
    std::ostringstream out;
    VelScriptedUI ui(in, out, "s.scr");
    VelUserInterface* before = velSetUI(&ui);
    EXPECT_EQ(shell.run(), 1);
    velSetUI(before);
    EXPECT_EQ(ui.readResult().status, VelReadStatus::kCannotRead);
    EXPECT_EQ(ui.readResult().line, 2);
}

TEST_F(Shell, BuiltInFailuresSayWhy)
{
    ScriptedSession session;
    struct Case {
        const char* line;
        VelLineResult result;
        const char* error;
    };
    const Case cases[] = {
        {"SAVE", VelLineResult::kFailed, "Aucun dessin ouvert."},
        {"CLOSE", VelLineResult::kFailed, "Aucun dessin ouvert."},
        {"APPLOAD absent_module", VelLineResult::kFailed, "Le module absent_module n'a pas pu être chargé."},
        {"ARX Décharger absent_module", VelLineResult::kFailed,
         "Le module absent_module.arx n'a pas pu être déchargé."},
        {"SETVAR CMDECHO 5", VelLineResult::kFailed, "La variable CMDECHO attend une valeur de 0 à 1."},
        {"GETVAR NIMPORTE", VelLineResult::kFailed,
         "Variable inconnue \"NIMPORTE\" (ou sans valeur sans dessin ouvert)."},
        {"DOCUMENT 3", VelLineResult::kFailed, "Aucun dessin ouvert ne s'appelle \"3\" (numéro ou nom attendu)."},
        {"Inconnue a b", VelLineResult::kFailed, "Commande inconnue \"Inconnue\"."},
        {"   ", VelLineResult::kDone, ""},
        {"_quit", VelLineResult::kQuit, ""},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.line);
        EXPECT_EQ(Run(c.line), c.result);
        EXPECT_EQ(error, c.error);
    }
}

TEST_F(Shell, MissingArgumentsAreAskedFor)
{
    ScriptedSession session("CMDECHO\n0\nCMDECHO\n");
    EXPECT_EQ(Run("SETVAR"), VelLineResult::kDone) << error;
    EXPECT_EQ(Run("GETVAR"), VelLineResult::kDone) << error;
    EXPECT_NE(session.Output().find("Nouvelle valeur de CMDECHO : 0"), std::string::npos);
    EXPECT_NE(session.Output().find("CMDECHO = 0"), std::string::npos);
    Run("SETVAR CMDECHO 1");
}

TEST_F(Shell, WordsLeftOverAfterAModuleCommandFailTheLine)
{
    ScriptedSession session;
    ASSERT_EQ(Run("APPLOAD good_module"), VelLineResult::kDone) << error;
    EXPECT_EQ(Run("TestDemande Non Encore"), VelLineResult::kFailed);
    EXPECT_EQ(error, "1 réponse(s) en trop après la commande TestDemande.");
    EXPECT_NE(session.Output().find("réponse=No"), std::string::npos);
}

TEST_F(Shell, CloseCanBeCancelled)
{
    ScriptedSession session("Annuler\n");
    ASSERT_TRUE(shell.openDrawing("", error));
    Run("SETVAR AUNITS 1");
    EXPECT_EQ(Run("CLOSE"), VelLineResult::kFailed);
    EXPECT_EQ(error.rfind("Fermeture de Dessin", 0), 0u) << error;
    EXPECT_EQ(acDocManagerPtr()->documentCount(), 1);
}

TEST_F(Shell, SaveAsThenCloseAsksNothing)
{
    ScriptedSession session;
    ASSERT_TRUE(shell.openDrawing("", error));
    Run("SETVAR AUNITS 4");
    const std::string file = dir.File("plan.dxf");
    ASSERT_EQ(Run("SAVEAS " + file), VelLineResult::kDone) << error;
    EXPECT_EQ(acDocManagerPtr()->curDocument()->docTitle(), "plan.dxf");
    EXPECT_EQ(Run("CLOSE"), VelLineResult::kDone) << error;
    EXPECT_EQ(acDocManagerPtr()->documentCount(), 0);
    EXPECT_EQ(Run("OPEN " + file), VelLineResult::kDone) << error;
    EXPECT_EQ(acDocManagerPtr()->curDocument()->database()->aunits(), 4);
}

} // namespace
