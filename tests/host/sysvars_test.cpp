// System variables kept by the host and those of the current drawing's header.
#include <gtest/gtest.h>

#include <type_traits>

#include "support/session.hpp"
#include "velhost/dbase.h"
#include "velhost/documents.h"
#include "velhost/editor.h"
#include "velhost/header_vars.h"

namespace {

int GetShort(const char* name)
{
    resbuf rb;
    EXPECT_EQ(acedGetVar(name, &rb), RTNORM);
    EXPECT_EQ(rb.restype, RTSHORT);
    return rb.resval.rint;
}

std::string FormatRange(const std::string& name, const VelHeaderVar& var)
{
    return "La variable " + name + " attend une valeur de " + std::to_string(var.min) + " à " +
           std::to_string(var.max) + ".";
}

int SetShort(const char* name, int value)
{
    resbuf rb;
    rb.restype = RTSHORT;
    rb.resval.rint = static_cast<short>(value);
    return acedSetVar(name, &rb);
}

TEST(SysVars, HostVariablesRoundTripWithinRange)
{
    struct Case {
        const char* name;
        int value;
        int status;
    };
    const Case cases[] = {
        {"CMDECHO", 0, RTNORM},     {"cmdecho", 1, RTNORM}, {"CMDECHO", 2, RTERROR},  {"UCSFOLLOW", 1, RTNORM},
        {"UCSFOLLOW", -1, RTERROR}, {"AFLAGS", 10, RTNORM}, {"AFLAGS", 128, RTERROR}, {"NOSUCHVAR", 0, RTERROR},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(SetShort(c.name, c.value), c.status);
        if (c.status == RTNORM) {
            EXPECT_EQ(GetShort(c.name), c.value);
        }
    }
    SetShort("CMDECHO", 1);
    SetShort("UCSFOLLOW", 0);
    SetShort("AFLAGS", 0);
}

TEST(SysVars, WrongTypesAndReadOnlyAreRefused)
{
    resbuf text;
    ASSERT_EQ(acedGetVar("CPROFILE", &text), RTNORM);
    EXPECT_EQ(text.restype, RTSTR);
    EXPECT_EQ(acedSetVar("CPROFILE", &text), RTERROR);
    EXPECT_EQ(acedSetVar("CMDECHO", &text), RTERROR);
    velRbClear(&text);
    std::string error;
    EXPECT_EQ(velSetSysVarText("CPROFILE", "x", error), RTERROR);
    EXPECT_EQ(error, "La variable CPROFILE est en lecture seule.");
    EXPECT_EQ(velSetSysVarText("CMDECHO", "oui", error), RTERROR);
    EXPECT_EQ(error, "La variable CMDECHO attend un nombre entier, pas \"oui\".");
    EXPECT_EQ(velSetSysVarText("NOPE", "1", error), RTERROR);
    EXPECT_EQ(error, "Variable inconnue \"NOPE\".");
}

TEST(SysVars, DrawingVariablesFollowTheCurrentDocument)
{
    ScriptedSession session;
    resbuf rb;
    ASSERT_EQ(acDocManagerPtr()->curDocument(), nullptr);
    EXPECT_EQ(acedGetVar("AUNITS", &rb), RTERROR);

    AcApDocument* a = acDocManagerPtr()->createDocument(nullptr, "");
    AcApDocument* b = acDocManagerPtr()->createDocument(nullptr, "");
    std::string error;
    EXPECT_EQ(velSetSysVarText("AUNITS", "3", error), RTNORM) << error;
    EXPECT_EQ(velSetSysVarText("ANGBASE", "1.5", error), RTNORM) << error;
    EXPECT_EQ(velSetSysVarText("CECOLOR", "5", error), RTNORM) << error;
    EXPECT_EQ(velSetSysVarText("CLAYER", "Absent", error), RTERROR);
    EXPECT_EQ(error, "Le calque \"Absent\" n'existe pas.");
    EXPECT_EQ(b->database()->aunits(), 3);
    EXPECT_EQ(b->database()->angbase(), 1.5);
    EXPECT_EQ(b->database()->cecolor().colorIndex(), 5);
    EXPECT_EQ(a->database()->aunits(), 0);
    acDocManagerPtr()->activateDocument(a);
    EXPECT_EQ(velSysVarText("AUNITS"), "0");
    EXPECT_EQ(velSysVarText("CECOLOR"), "DUCALQUE");
    EXPECT_EQ(velSysVarText("CLAYER"), "0");
    EXPECT_EQ(velSysVarText("DWGNAME"), a->docTitle());
    acDocManagerPtr()->closeAll();
}

// Each variable of the header table set away from its default through its system
// variable, then saved and read back: the system variables, the database, the writer
// and the reader must agree on every row.
TEST(SysVars, EveryHeaderVariableRoundTripsThroughTheDrawingFile)
{
    ScriptedSession session;
    AcApDocument* doc = acDocManagerPtr()->createDocument(nullptr, "");
    AcDbObjectId layer;
    ASSERT_EQ(doc->database()->addLayer("Voirie", layer), Acad::eOk);
    const VelHeaderSettings defaults;
    velWalkHeaderVars(
        [&](const VelHeaderVar& var, const auto& initial) {
            using Field = std::remove_cvref_t<decltype(initial)>;
            const std::string name(var.sysvar());
            SCOPED_TRACE(name);
            std::string error;
            std::string value;
            if constexpr (std::is_same_v<Field, std::string>)
                value = "voirie";
            else if constexpr (std::is_same_v<Field, double>)
                value = "1.5";
            else if (var.code == 62)
                value = "5";
            else
                value = std::to_string(static_cast<int>(initial) == var.max ? var.min : var.max);
            EXPECT_EQ(velSetSysVarText(name, value, error), RTNORM) << error;
            if (std::is_integral_v<Field> && var.code != 62) {
                EXPECT_EQ(velSetSysVarText(name, std::to_string(var.max + 1), error), RTERROR);
                EXPECT_EQ(error, FormatRange(name, var));
            }
        },
        defaults);
    std::string text;
    std::string error;
    ASSERT_TRUE(velWriteDrawing(*doc->database(), text, error)) << error;
    std::unique_ptr<AcDbDatabase> back;
    ASSERT_EQ(velReadDrawing(text, "retour.dxf", back).description(), "");
    velWalkHeaderVars(
        [&](const VelHeaderVar& var, const auto& read, const auto& set, const auto& initial) {
            SCOPED_TRACE(var.name);
            EXPECT_EQ(read, set);
            EXPECT_NE(read, initial);
        },
        back->headerSettings(), doc->database()->headerSettings(), defaults);
    EXPECT_EQ(back->layerName(back->clayer()), "Voirie");
    acDocManagerPtr()->closeAll();
}

} // namespace
