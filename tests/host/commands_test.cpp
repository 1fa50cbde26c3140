// The command stack: registration rules, look-up by name, groups and running.
#include "velhost/commands.h"

#include <gtest/gtest.h>

#include <memory>
#include <stdexcept>

#include "support/session.hpp"

namespace {

int g_runs = 0;
void Count()
{
    ++g_runs;
}
void Throw()
{
    throw std::runtime_error("disque plein");
}

class CommandStack : public ::testing::Test {
protected:
    void TearDown() override
    {
        acedRegCmds()->removeGroup("VEL_T1");
        acedRegCmds()->removeGroup("VEL_T2");
    }
};

TEST_F(CommandStack, LookupByLocalGlobalAndUnderscore)
{
    AcEdCommandStack* stack = acedRegCmds();
    ASSERT_EQ(stack->addCommand("VEL_T1", "VelaZodEVICreate", "ZodEVICreate", 0, Count), Acad::eOk);
    ASSERT_EQ(stack->addCommand("VEL_T1", "Alpha", "Beta", 0, Count), Acad::eOk);
    ASSERT_EQ(stack->addCommand("VEL_T2", "Beta", "Gamma", 0, Count), Acad::eOk);
    struct Case {
        const char* typed;
        const char* globalFound; // null: not found
    };
    const Case cases[] = {
        {"zodevicreate", "VelaZodEVICreate"},
        {"VELAZODEVICREATE", "VelaZodEVICreate"},
        {"_velazodevicreate", "VelaZodEVICreate"},
        {"_ZodEVICreate", nullptr},
        // A local name wins over another command's global name.
        {"beta", "Alpha"},
        {"_beta", "Beta"},
        {"gamma", "Beta"},
        {"", nullptr},
        {"_", nullptr},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.typed);
        const AcEdCommand* cmd = stack->lookupCmd(c.typed);
        if (c.globalFound == nullptr) {
            EXPECT_EQ(cmd, nullptr);
            continue;
        }
        ASSERT_NE(cmd, nullptr);
        EXPECT_EQ(cmd->globalName, c.globalFound);
    }
}

TEST_F(CommandStack, RefusesDuplicatesAndBadNames)
{
    AcEdCommandStack* stack = acedRegCmds();
    ASSERT_EQ(stack->addCommand("VEL_T1", "Un", "One", 0, Count), Acad::eOk);
    EXPECT_EQ(stack->addCommand("vel_t1", "UN", "Autre", 0, Count), Acad::eDuplicateKey);
    EXPECT_EQ(stack->addCommand("VEL_T1", "Deux", "one", 0, Count), Acad::eDuplicateKey);
    EXPECT_EQ(stack->addCommand("VEL_T2", "Un", "One", 0, Count), Acad::eOk);
    EXPECT_EQ(stack->addCommand("VEL_T1", "A B", "AB", 0, Count), Acad::eInvalidInput);
    EXPECT_EQ(stack->addCommand("VEL_T1", "C", "C", 0, nullptr), Acad::eInvalidInput);
    EXPECT_EQ(stack->addCommand("", "C", "C", 0, Count), Acad::eInvalidInput);
    EXPECT_EQ(stack->removeCmd("VEL_T1", "Un"), Acad::eOk);
    EXPECT_EQ(stack->removeCmd("VEL_T1", "Un"), Acad::eKeyNotFound);
    EXPECT_EQ(stack->removeGroup("VEL_T2"), Acad::eOk);
    EXPECT_EQ(stack->removeGroup("VEL_T2"), Acad::eKeyNotFound);
}

TEST_F(CommandStack, IteratorWalksGroupByGroup)
{
    AcEdCommandStack* stack = acedRegCmds();
    stack->addCommand("VEL_T1", "A1", "a1", 0, Count);
    stack->addCommand("VEL_T2", "B1", "b1", 0, Count);
    stack->addCommand("VEL_T1", "-A2", "-a2", 0, Count);
    std::vector<std::string> seen;
    std::unique_ptr<AcEdCommandIterator> it(stack->iterator());
    for (; !it->done(); it->next()) {
        const std::string group = it->commandGroup();
        if (group == "VEL_T1" || group == "VEL_T2")
            seen.push_back(group + ":" + it->command()->globalName + "/" + it->command()->localName);
    }
    EXPECT_EQ(seen, (std::vector<std::string>{"VEL_T1:A1/a1", "VEL_T1:-A2/-a2", "VEL_T2:B1/b1"}));
}

TEST_F(CommandStack, RunReportsUnknownAndFailingCommands)
{
    ScriptedSession session;
    acedRegCmds()->addCommand("VEL_T1", "Compte", "Compte", 0, Count);
    acedRegCmds()->addCommand("VEL_T1", "Casse", "Casse", 0, Throw);
    std::string error;
    g_runs = 0;
    EXPECT_EQ(velRunCommand("compte", error), VelCommandResult::kDone);
    EXPECT_EQ(g_runs, 1);
    EXPECT_EQ(velRunCommand("Inconnue", error), VelCommandResult::kUnknown);
    EXPECT_EQ(error, "Commande inconnue \"Inconnue\".");
    EXPECT_EQ(velRunCommand("Casse", error), VelCommandResult::kFailed);
    EXPECT_EQ(error, "La commande Casse a échoué : disque plein");
}

} // namespace
