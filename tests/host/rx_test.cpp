// Module loading, the service dictionary, service symbols and the fatal exit.
#include "velhost/rx.h"

#include <gtest/gtest.h>

#include <filesystem>

#include "support/session.hpp"
#include "support/temp_dir.hpp"
#include "velhost/commands.h"
#include "velhost/documents.h"
#include "velhost/profile.h"

namespace {

std::string ModulePath(const char* name)
{
    return (std::filesystem::path(VEL_TEST_MODULE_DIR) / name).string();
}

class DynamicLinker : public ::testing::Test {
protected:
    void SetUp() override { velHostSettings().modulesDir = VEL_TEST_MODULE_DIR; }
    void TearDown() override
    {
        velUnloadAllModules();
        velHostSettings().modulesDir.clear();
    }
    ScriptedSession session;
};

TEST_F(DynamicLinker, LoadFailuresSayWhichStepFailed)
{
    const TempDir dir;
    const std::string bogus = dir.Write("vel_bogus_module.arx", "pas une bibliothèque");
    struct Case {
        std::string name;
        std::string expected;
    };
    const Case cases[] = {
        {bogus, "Impossible d'ouvrir le module " + bogus},
        {"absent_module.arx", "Impossible de trouver le module absent_module.arx."},
        {"entryless_module.arx", "n'exporte pas de point d'entrée acrxEntryPoint"},
        {"refusing_module.arx", "a refusé de démarrer (réponse 3)"},
        {"old_release_module.arx", "old_release_module.arx est écrit pour la version 14 de l'interface de l'hôte, "
                                   "et cet hôte est de la version 15 : il n'est pas chargé."},
        {"versionless_module.arx", "versionless_module.arx n'exporte pas acrxGetApiVersion"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        session.ClearOutput();
        EXPECT_FALSE(acrxLoadModule(c.name.c_str(), false));
        EXPECT_NE(session.Output().find(c.expected), std::string::npos) << session.Output();
        // A module of another release is never started.
        EXPECT_EQ(session.Output().find("entry point called"), std::string::npos);
    }
    EXPECT_TRUE(velLoadedModules().empty());
    // What the refusing module registered before refusing went with it.
    EXPECT_FALSE(acrxServiceIsRegistered("VelTestRefusingService"));
}

TEST_F(DynamicLinker, ServiceSymbolsComeFromTheRegisteringModule)
{
    ASSERT_TRUE(acrxLoadModule("good_module", true));
    EXPECT_NE(session.Output().find("good: init"), std::string::npos);
    EXPECT_NE(session.Output().find("Module " + ModulePath("good_module.arx") + " chargé."), std::string::npos);
    ASSERT_TRUE(acrxServiceIsRegistered("VelTestGoodService"));
    auto answer = reinterpret_cast<int (*)()>(acrxGetServiceSymbolAddr("VelTestGoodService", "VelTest_Answer"));
    ASSERT_NE(answer, nullptr);
    EXPECT_EQ(answer(), 42);
    EXPECT_EQ(acrxGetServiceSymbolAddr("VelTestGoodService", "Absent"), nullptr);
    EXPECT_EQ(acrxGetServiceSymbolAddr("NoSuchService", "VelTest_Answer"), nullptr);
    // A second load of the same file starts nothing.
    session.ClearOutput();
    EXPECT_TRUE(acrxLoadModule(ModulePath("good_module.arx").c_str(), false));
    EXPECT_EQ(session.Output().find("good: init"), std::string::npos);
    EXPECT_EQ(velLoadedModules().size(), 1u);
}

TEST_F(DynamicLinker, UnloadGoesInReverseOrderAndCleansUp)
{
    ASSERT_TRUE(acrxLoadModule("good_module.arx", false));
    ASSERT_TRUE(acrxLoadModule("sloppy_module.arx", false));
    session.ClearOutput();
    velUnloadAllModules();
    const std::string out = session.Output();
    const auto sloppy = out.find("sloppy: unload");
    const auto good = out.find("good: unload");
    ASSERT_NE(sloppy, std::string::npos);
    ASSERT_NE(good, std::string::npos);
    EXPECT_LT(sloppy, good);
    EXPECT_NE(out.find("n'a pas retiré le service VelTestSloppyService"), std::string::npos);
    EXPECT_NE(out.find("n'a pas retiré le groupe de commandes VELTEST_SLOPPY"), std::string::npos);
    EXPECT_NE(out.find("n'a pas retiré 1 réacteur(s) de documents"), std::string::npos);
    // Its reactor is no longer told of anything.
    session.ClearOutput();
    acDocManagerPtr()->createDocument(nullptr, "");
    acDocManagerPtr()->closeAll();
    EXPECT_EQ(session.Output().find("sloppy: document"), std::string::npos);
    EXPECT_FALSE(acrxServiceIsRegistered("VelTestSloppyService"));
    EXPECT_EQ(acedRegCmds()->lookupCmd("VelTestHello"), nullptr);
    EXPECT_TRUE(velLoadedModules().empty());
}

TEST_F(DynamicLinker, LockedModuleStaysUntilForced)
{
    ASSERT_TRUE(acrxLoadModule("sloppy_module.arx", false));
    EXPECT_TRUE(acrxDynamicLinker()->isApplicationLocked("sloppy_module"));
    EXPECT_FALSE(acrxUnloadModule("sloppy_module", true));
    EXPECT_NE(session.Output().find("est verrouillé"), std::string::npos);
    EXPECT_EQ(velLoadedModules().size(), 1u);
    ASSERT_TRUE(acrxLoadModule("good_module.arx", false));
    EXPECT_TRUE(acrxUnloadModule("GOOD_MODULE.ARX", true));
    EXPECT_EQ(velLoadedModules().size(), 1u);
}

TEST_F(DynamicLinker, AppNameIsTheRunningModule)
{
    ASSERT_TRUE(acrxLoadModule("good_module.arx", false));
    EXPECT_STREQ(acedGetAppName(), "");
    std::string error;
    session.ClearOutput();
    ASSERT_EQ(velRunCommand("TestNom", error), VelCommandResult::kDone) << error;
    EXPECT_NE(session.Output().find("module=" + ModulePath("good_module.arx")), std::string::npos);
}

TEST_F(DynamicLinker, AbortDuringStartUpLeavesNothingLoaded)
{
    AbortCatcher catcher;
    try {
        acrxLoadModule("aborting_module.arx", false);
        FAIL() << "acrx_abort did not end the load";
    } catch (const AbortCalled& abort) {
        EXPECT_EQ(abort.message, "Impossible de trouver le module <Absent.arx>!!!");
    }
    EXPECT_TRUE(velLoadedModules().empty());
}

TEST_F(DynamicLinker, ServiceModuleLoadSaysHowItWent)
{
    struct Case {
        const char* service;
        std::vector<std::string> candidates;
        VelServiceModule::Status status;
        const char* path;
    };
    const Case cases[] = {
        {"VelTestGoodService", {"absent_module.arx", "good_module.arx"}, VelServiceModule::kLoaded, "good_module.arx"},
        // Now there: nothing is searched.
        {"VelTestGoodService", {"absent_module.arx"}, VelServiceModule::kRegistered, nullptr},
        {"VelTestOther", {"absent_module.arx"}, VelServiceModule::kNotFound, nullptr},
        {"VelTestOther", {"refusing_module.arx"}, VelServiceModule::kNotLoaded, "refusing_module.arx"},
        {"VelTestOther", {"sloppy_module.arx"}, VelServiceModule::kNoService, "sloppy_module.arx"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.candidates.back());
        const VelServiceModule module = velLoadServiceModule(c.service, c.candidates);
        EXPECT_EQ(module.status, c.status);
        EXPECT_EQ(module.path, c.path ? ModulePath(c.path) : "");
    }
}

TEST(ServiceDictionary, InProcessServiceAnswersItsTable)
{
    static AcRxService service;
    static int marker = 5;
    velRegisterInProcessService("VelTestInProcess", &service, {{"Marker", &marker}});
    EXPECT_TRUE(acrxServiceIsRegistered("VelTestInProcess"));
    EXPECT_EQ(acrxGetServiceSymbolAddr("VelTestInProcess", "Marker"), &marker);
    EXPECT_EQ(acrxGetServiceSymbolAddr("VelTestInProcess", "Other"), nullptr);
    auto* dict = static_cast<AcRxDictionary*>(acrxSysRegistry()->at("ServiceDictionary"));
    EXPECT_EQ(dict->at("VelTestInProcess"), &service);
    // Once taken out of the dictionary, its symbols are gone too.
    EXPECT_EQ(dict->remove("VelTestInProcess"), &service);
    EXPECT_FALSE(acrxServiceIsRegistered("VelTestInProcess"));
    EXPECT_EQ(acrxGetServiceSymbolAddr("VelTestInProcess", "Marker"), nullptr);
}

TEST(ServiceDictionary, UnregisterTakesOnlyTheCallersService)
{
    static AcRxService mine, theirs;
    velRegisterInProcessService("VelTestShared", &mine, {});
    // Another filed its own service under the name since.
    velRegisterInProcessService("VelTestShared", &theirs, {});
    struct Case {
        const char* what;
        const char* name;
        const AcRxService* service;
        bool removed;
        bool registeredAfter;
    };
    const Case cases[] = {
        {"no longer mine", "VelTestShared", &mine, false, true},
        {"no name", nullptr, &theirs, false, true},
        {"no service", "VelTestShared", nullptr, false, true},
        {"still theirs", "VelTestShared", &theirs, true, false},
        {"already gone", "VelTestShared", &theirs, false, false},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        EXPECT_EQ(velUnregisterService(c.name, c.service), c.removed);
        EXPECT_EQ(acrxServiceIsRegistered("VelTestShared"), c.registeredAfter);
    }
}

TEST(Abort, HandlerReceivesTheFormattedMessage)
{
    AbortCatcher catcher;
    try {
        acrx_abort("Pas de service <%s>\nenregistré par le module <%s>!!!", "S", "/m/x.arx");
    } catch (const AbortCalled& abort) {
        EXPECT_EQ(abort.message, "Pas de service <S>\nenregistré par le module </m/x.arx>!!!");
        return;
    }
    FAIL();
}

TEST(AbortDeathTest, DefaultEndsTheProcessWithFailure)
{
    EXPECT_EXIT(acrx_abort("fin %d", 1), ::testing::ExitedWithCode(1), "Erreur fatale : fin 1");
}

} // namespace
