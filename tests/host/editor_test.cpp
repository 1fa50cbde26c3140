// Keyword and text input read through the scripted back-end, and command-line output.
#include "velhost/editor.h"

#include <gtest/gtest.h>

#include "support/session.hpp"

namespace {

TEST(GetKword, AnswersTheGlobalKeyword)
{
    struct Case {
        const char* typed;
        int status;
        const char* result;
        int flags = 0;
        const char* shown = "";
    };
    const Case cases[] = {
        {"Oui\n", RTNORM, "Yes"},
        {"non\n", RTNORM, "No"},
        {"N\n", RTNORM, "No"},
        {"o\n", RTNORM, "Yes"},
        {"_no\n", RTNORM, "No"},
        {"_Y\n", RTNORM, "Yes"},
        {"\n", RTNONE, ""},
        // A wrong answer is refused and asked again.
        {"peut-être\nNon\n", RTNORM, "No"},
        {"Nonne\nOui\n", RTNORM, "Yes"},
        {"^C\n", RTCAN, "inchangé"},
        {"", RTCAN, "inchangé"},
        {"\n\nNon\n", RTNORM, "No", RSG_NONULL, "Une réponse est requise."},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.typed);
        ScriptedSession session(c.typed);
        acedInitGet(c.flags, "Oui Non _ Yes No");
        std::string result = "inchangé";
        EXPECT_EQ(acedGetKword("Continuer ? ", result), c.status);
        EXPECT_EQ(result, c.result);
        EXPECT_NE(session.Output().find(c.shown), std::string::npos) << session.Output();
    }
}

TEST(GetKword, InitGetHoldsForOneCallOnly)
{
    ScriptedSession session("Oui\nOui\n");
    acedInitGet(0, "Oui Non");
    std::string result;
    EXPECT_EQ(acedGetKword("1 ", result), RTNORM);
    EXPECT_EQ(result, "Oui");
    // Without keywords nothing can match: the answer is refused until the input ends.
    EXPECT_EQ(acedGetKword("2 ", result), RTCAN);
    EXPECT_NE(session.Output().find("Aucun mot-clé n'est attendu ici."), std::string::npos);
}

TEST(GetKword, CapitalsSetTheShortestAbbreviation)
{
    ScriptedSession session("C\nDé\nCH\n");
    acedInitGet(0, "? Charger DEcharger");
    std::string result;
    EXPECT_EQ(acedGetKword("> ", result), RTNORM);
    EXPECT_EQ(result, "Charger");
    EXPECT_EQ(acedGetKword("> ", result), RTCAN);
    acedInitGet(0, "? Charger DEcharger");
    ScriptedSession second("d\nde\n");
    EXPECT_EQ(acedGetKword("> ", result), RTNORM);
    EXPECT_EQ(result, "DEcharger");
    EXPECT_NE(second.Output().find("Mot-clé attendu : ?, Charger, DEcharger."), std::string::npos);
}

TEST(GetString, TakesTheLineOrItsFirstWord)
{
    ScriptedSession session("plan de masse.dxf\nplan de masse.dxf\n");
    std::string text;
    EXPECT_EQ(acedGetString(true, "Nom : ", text), RTNORM);
    EXPECT_EQ(text, "plan de masse.dxf");
    EXPECT_EQ(acedGetString(false, "Nom : ", text), RTNORM);
    EXPECT_EQ(text, "plan");
    EXPECT_EQ(acedGetString(true, "Nom : ", text), RTCAN);
}

} // namespace
