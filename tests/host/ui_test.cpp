// The user-interface layer: script comments, pending words, message boxes, the locale
// of terminal programs.
#include "velhost/ui.h"

#include <gtest/gtest.h>
#include <langinfo.h>

#include <algorithm>
#include <clocale>
#include <cstdlib>
#include <sstream>

#include "support/session.hpp"

namespace {

TEST(ScriptComment, StrippedOnlyWhereItStarts)
{
    struct Case {
        const char* line;
        const char* expected; // null: the line is only a comment
    };
    const Case cases[] = {
        {"; tout le commentaire", nullptr},
        {"   ;indenté", nullptr},
        {"OPEN plan.dxf ; le plan", "OPEN plan.dxf"},
        {"SETVAR A;B", "SETVAR A;B"},
        {"", ""},
        {"Non\r", "Non"},
        {"Non\r\r", "Non"},
        {"  espaces  ", "  espaces"},
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

TEST(Utf8CharacterType, OnlyTheCharacterTypeChangesAndComesBack)
{
    if (VelUtf8CharacterType::localeName().empty())
        GTEST_SKIP() << "no UTF-8 locale on this system";
    std::setlocale(LC_ALL, "C");
    {
        VelUtf8CharacterType utf8;
        EXPECT_STREQ(nl_langinfo(CODESET), "UTF-8");
        EXPECT_STREQ(std::setlocale(LC_NUMERIC, nullptr), "C");
    }
    EXPECT_STREQ(std::setlocale(LC_CTYPE, nullptr), "C");
}

TEST(TerminalProgramEnvironment, CharacterTypeMadeUtf8OnlyWhenTheUsersIsNot)
{
    const std::string utf8 = VelUtf8CharacterType::localeName();
    if (utf8.empty())
        GTEST_SKIP() << "no UTF-8 locale on this system";
    struct Case {
        const char* lcAll; // null: unset
        const char* lcCtype;
        const char* lang;
        std::vector<std::string> present;
        std::vector<std::string> absent;
    };
    const Case cases[] = {
        {nullptr, nullptr, "C.UTF-8", {"LANG=C.UTF-8"}, {"LC_CTYPE="}},
        {nullptr, nullptr, nullptr, {"LC_CTYPE=" + utf8}, {"LANG="}},
        {nullptr, nullptr, "fr_FR.ISO-8859-1", {"LANG=fr_FR.ISO-8859-1", "LC_CTYPE=" + utf8}, {}},
        {nullptr, "POSIX", "C.UTF-8", {"LC_CTYPE=" + utf8}, {"LC_CTYPE=POSIX"}},
        // LC_ALL would win over the character type: it becomes the language.
        {"C", nullptr, "C.UTF-8", {"LANG=C", "LC_CTYPE=" + utf8}, {"LC_ALL=", "LANG=C.UTF-8"}},
    };
    auto set = [](const char* name, const char* value) {
        if (value)
            setenv(name, value, 1);
        else
            unsetenv(name);
    };
    const char* saved[3];
    std::string savedText[3];
    const char* names[3] = {"LC_ALL", "LC_CTYPE", "LANG"};
    for (int i = 0; i < 3; ++i) {
        saved[i] = std::getenv(names[i]);
        savedText[i] = saved[i] ? saved[i] : "";
    }
    for (const Case& c : cases) {
        SCOPED_TRACE(std::string(c.lcAll ? c.lcAll : "-") + " " + (c.lcCtype ? c.lcCtype : "-") + " " +
                     (c.lang ? c.lang : "-"));
        set("LC_ALL", c.lcAll);
        set("LC_CTYPE", c.lcCtype);
        set("LANG", c.lang);
        const std::vector<std::string> environment = velTerminalProgramEnvironment();
        auto has = [&](const std::string& start) {
            return std::any_of(environment.begin(), environment.end(),
                               [&](const std::string& e) { return e.rfind(start, 0) == 0; });
        };
        for (const std::string& e : c.present)
            EXPECT_TRUE(has(e)) << e;
        for (const std::string& e : c.absent)
            EXPECT_FALSE(has(e)) << e;
    }
    for (int i = 0; i < 3; ++i)
        set(names[i], saved[i] ? savedText[i].c_str() : nullptr);
}

} // namespace
