// Reaching sibling modules: symbols, service objects, the file search rules and the
// fatal messages.
#include "module/siblings.hpp"

#include <gtest/gtest.h>

#include <filesystem>

#include "support/session.hpp"
#include "support/temp_dir.hpp"
#include "velhost/profile.h"

using namespace zodevi;

namespace fs = std::filesystem;

namespace {

const std::string kGood = (fs::path(VEL_TEST_MODULE_DIR) / "good_module.arx").string();
constexpr const char* kGoodService = "VelTestGoodService";

class Siblings : public ::testing::Test {
protected:
    void SetUp() override
    {
        saved = velHostSettings();
        velHostSettings().modulesDir = dir.File("modules");
        fs::create_directories(dir.path / "modules");
        fs::create_directories(dir.path / "Programmes");
    }
    void TearDown() override
    {
        velUnloadAllModules();
        velHostSettings() = saved;
    }
    // A copy of the test module under another name.
    void Install(const std::string& relative) { fs::create_symlink(kGood, dir.path / relative); }
    TempDir dir;
    VelHostSettings saved;
    ScriptedSession session;
};

TEST_F(Siblings, ExtensionAddedOnlyWhenMissing)
{
    struct Case {
        const char* installed;
        const char* asked;
        bool found;
    };
    const Case cases[] = {
        {"modules/x.arx", "x.arx", true},
        {"modules/x.arx", "x", true},
        // Already carries its extension: no second one, whatever the case.
        {"modules/x.arx", "X.ARX", true},
        {"modules/a.ARX.arx", "a.ARX", false},
        // ".arx" alone is not an extension.
        {"modules/.arx.arx", ".arx", true},
        {"Programmes/p.arx", "p", true},
        {"modules/q.arx", "r", false},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.asked);
        Install(c.installed);
        void* symbol = GetServiceSymbol(c.asked, kGoodService, "VelTest_Answer");
        if (c.found) {
            ASSERT_NE(symbol, nullptr);
            EXPECT_EQ(reinterpret_cast<int (*)()>(symbol)(), 42);
        } else {
            EXPECT_EQ(symbol, nullptr);
            EXPECT_TRUE(velLoadedModules().empty());
        }
        velUnloadAllModules();
        fs::remove(dir.path / c.installed);
    }
}

TEST_F(Siblings, RegisteredServiceNeedsNoFile)
{
    static AcRxService service;
    static int marker;
    velRegisterInProcessService("VelTestSibling", &service, {{"Marqueur", &marker}});
    EXPECT_EQ(GetServiceSymbol("Absent.arx", "VelTestSibling", "Marqueur"), &marker);
    EXPECT_EQ(GetServiceSymbol(nullptr, "VelTestSibling", "Marqueur"), &marker);
    EXPECT_EQ(GetServiceObject("Absent.arx", "VelTestSibling"), &service);
    EXPECT_EQ(session.Output(), "");
    velUnregisterService("VelTestSibling", &service);
}

TEST_F(Siblings, MissingNamesAnswerNothingWithoutSearching)
{
    Install("modules/x.arx");
    struct Case {
        const char* file;
        const char* service;
        const char* symbol;
    };
    const Case cases[] = {
        {"x", kGoodService, ""},
        {"x", kGoodService, nullptr},
        {"x", "", "VelTest_Answer"},
        {"x", nullptr, "VelTest_Answer"},
        {"", kGoodService, "VelTest_Answer"},
        {nullptr, kGoodService, "VelTest_Answer"},
    };
    for (const Case& c : cases) {
        EXPECT_EQ(GetServiceSymbol(c.file, c.service, c.symbol), nullptr);
        EXPECT_TRUE(velLoadedModules().empty());
    }
}

TEST_F(Siblings, ServiceObjectLoadsItsModule)
{
    Install("Programmes/Vel2000Srv.arx");
    AcRxObject* object = GetServiceObject("Vel2000Srv.arx", kGoodService);
    ASSERT_NE(object, nullptr);
    EXPECT_EQ(velLoadedModules().size(), 1u);
    EXPECT_EQ(GetServiceObject("Vel2000Srv.arx", kGoodService), object);
    EXPECT_EQ(velLoadedModules().size(), 1u);
}

TEST_F(Siblings, ServiceObjectAbortsWithTheReason)
{
    AbortCatcher catcher;
    Install("modules/Autre.arx");
    dir.Write("modules/Casse.arx", "pas une bibliothèque");
    struct Case {
        const char* file;
        const char* service;
        std::string message;
    };
    const Case cases[] = {
        {"Absent.arx", "S", "Impossible de trouver le module <Absent.arx>!!!"},
        // No extension is added here.
        {"Autre", kGoodService, "Impossible de trouver le module <Autre>!!!"},
        {"Casse.arx", "S", "Impossible de charger le module <" + dir.File("modules/Casse.arx") + ">!!!"},
        {"Autre.arx", "VelAutreService",
         "Pas de service <VelAutreService>\nenregistré par le module <" + dir.File("modules/Autre.arx") + ">!!!"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.file);
        try {
            GetServiceObject(c.file, c.service);
            ADD_FAILURE() << "no abort";
        } catch (const AbortCalled& abort) {
            EXPECT_EQ(abort.message, c.message);
        }
        velUnloadAllModules();
    }
}

std::int32_t FakeList(std::vector<std::string>* names, std::int32_t* out)
{
    names->push_back("Devis");
    *out = 9;
    return 0;
}

std::int32_t FakeWrite()
{
    return 5;
}

TEST_F(Siblings, ForwardersAnswerOneWhenTheFunctionIsMissing)
{
    std::vector<std::string> names;
    std::int32_t out = 0;
    std::string text;
    EXPECT_EQ(sibling::VtMetre_ListeDesMetres(&names, &out), 1);
    EXPECT_EQ(sibling::Rsx_WriteXDataMetres(), 1);
    EXPECT_EQ(sibling::Rsx_GetRsxFromType(&text, &names), 1);
    EXPECT_EQ(sibling::VtMetre_SymbMonetaire(&text), 1);
    EXPECT_TRUE(names.empty());

    static AcRxService metre, network;
    velRegisterInProcessService(kVelMetreServicesName, &metre,
                                {{"VtMetre_ListeDesMetres", reinterpret_cast<void*>(&FakeList)}});
    velRegisterInProcessService(kVelNetworkServicesName, &network,
                                {{"Rsx_WriteXDataMetres", reinterpret_cast<void*>(&FakeWrite)}});
    EXPECT_EQ(sibling::VtMetre_ListeDesMetres(&names, &out), 0);
    EXPECT_EQ(names, std::vector<std::string>{"Devis"});
    EXPECT_EQ(out, 9);
    EXPECT_EQ(sibling::Rsx_WriteXDataMetres(), 5);
    EXPECT_EQ(sibling::VtMetre_SymbMonetaire(&text), 1);
    velUnregisterService(kVelMetreServicesName, &metre);
    velUnregisterService(kVelNetworkServicesName, &network);
}

} // namespace
