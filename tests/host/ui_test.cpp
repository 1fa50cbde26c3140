// The user-interface layer: script comments, pending words, message boxes.
#include "velhost/ui.h"

#include <gtest/gtest.h>

#include <sstream>

#include "host_fixture.hpp"

namespace {

TEST(ScriptComment, StrippedOnlyWhereItStarts)
{
    struct Case {
        const char* line;
        const char* expected; // null: the line is only a comment
    };
    const Case cases[] = {
        {"; tout le commentaire", nullptr}, {"   ;indenté", nullptr}, {"OPEN plan.dxf ; le plan", "OPEN plan.dxf"},
        {"SETVAR A;B", "SETVAR A;B"}, {"", ""}, {"Non\r", "Non"}, {"Non\r\r", "Non"}, {"  espaces  ", "  espaces"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.line);
        const std::optional<std::string> got = velStripScriptComment(c.line);
        if (c.expected == nullptr)
            EXPECT_FALSE(got.has_value());
        else
            EXPECT_EQ(got, std::string(c.expected));
    }
}

TEST(ScriptedUI, ReadsLinesWithNumbersAndEchoes)
{
    std::istringstream in("; titre\nAPPLOAD x\n\n^C\nfin\n");
    std::ostringstream out;
    VelScriptedUI ui(in, out, "s.scr");
    auto first = ui.readLine("Commande: ");
    ASSERT_TRUE(first);
    EXPECT_EQ(first->text, "APPLOAD x");
    EXPECT_EQ(first->lineNumber, 2);
    auto empty = ui.readLine("? ");
    ASSERT_TRUE(empty);
    EXPECT_EQ(empty->text, "");
    EXPECT_FALSE(ui.readLine("? "));
    EXPECT_FALSE(ui.inputEnded());
    EXPECT_EQ(ui.readLine("? ")->lineNumber, 5);
    EXPECT_FALSE(ui.readLine("? "));
    EXPECT_TRUE(ui.inputEnded());
    EXPECT_EQ(out.str(), "Commande: APPLOAD x\n? \n? ^C\n? fin\n");
}

TEST(ScriptedUI, PendingWordsComeFirst)
{
    ScriptedSession session("ligne\n");
    velUI().pushPendingInput({"un", "deux"});
    EXPECT_EQ(velUI().readLine("> ")->text, "un");
    EXPECT_EQ(velUI().dropPendingInput(), 1u);
    EXPECT_EQ(velUI().readLine("> ")->text, "ligne");
}

TEST(MessageBox, ScriptAnswersTheDefaultButton)
{
    struct Case {
        unsigned style;
        int answer;
        const char* shown;
    };
    const Case cases[] = {
        {MB_OK | MB_ICONERROR, IDOK, "[VELANTO (erreur)]\nTexte\n<OK>"},
        {MB_YESNO | MB_ICONWARNING, IDYES, "[VELANTO (avertissement)]\nTexte\n<Oui>"},
        {MB_YESNO | MB_DEFBUTTON2, IDNO, "[VELANTO]\nTexte\n<Non>"},
        {MB_YESNOCANCEL | MB_DEFBUTTON3, IDCANCEL, "<Annuler>"},
        // A default button the box does not have falls back on the first.
        {MB_OKCANCEL | MB_DEFBUTTON3, IDOK, "<OK>"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.shown);
        ScriptedSession session;
        EXPECT_EQ(velMessageBox("VELANTO", "Texte", c.style), c.answer);
        EXPECT_NE(session.Output().find(c.shown), std::string::npos) << session.Output();
    }
}

TEST(MessageBox, TerminalAsksForAButton)
{
    std::istringstream in("peut-être\nn\n");
    std::ostringstream out;
    VelTerminalUI ui(in, out, false);
    EXPECT_EQ(ui.messageBox({"VELANTO", "Supprimer ?", MB_YESNO}), IDNO);
    EXPECT_NE(out.str().find("Réponse attendue : Oui/Non."), std::string::npos);
    std::istringstream none("");
    VelTerminalUI ended(none, out, false);
    EXPECT_EQ(ended.messageBox({"VELANTO", "?", MB_YESNOCANCEL}), IDCANCEL);
}

} // namespace
