// The module object: start-up and shutdown through the host's messages, its configuration
// page, the command list, and the refusal to start without the main services.
#include "module/module_object.hpp"

#include <gtest/gtest.h>

#include <memory>

#include "support/session.hpp"
#include "support/temp_dir.hpp"
#include "velhost/commands.h"
#include "velhost/profile.h"
#include "velsiblings/config_services.h"
#include "velsiblings/main_services.h"
#include "zodevi/api.h"

using namespace zodevi;

namespace {

void Nothing() {}

AcRxDictionary* Services()
{
    return static_cast<AcRxDictionary*>(acrxSysRegistry()->at("ServiceDictionary"));
}

CVelConfigServices* ConfigServices()
{
    return static_cast<CVelConfigServices*>(Services()->at(kVelConfigServicesName));
}

// Main services whose answer to UnloadQuery the test chooses.
class FakeMainServices : public CVelMainServices {
public:
    void ShowInfo(const std::string&) override {}
    std::string GetProductName() const override { return "VELANTO"; }
    std::string GetDataFolder(int) override { return "/"; }
    std::string GetParameterFile() override { return "/Velanto.ini"; }
    void RegisterModule(const std::string& name) override { modules.push_back(name); }
    void UnregisterModule(const std::string& name) override { std::erase(modules, name); }
    std::vector<std::string> RegisteredModules() const override { return modules; }
    void* GetParentWindow() override { return this; }
    bool UnloadQuery() override { return unloading; }
    std::string FindDataFile(const std::string&, int) override { return ""; }
    void ShowCommandList(const std::string&, const std::string&, int, int, const std::vector<std::string>&) override {}
    const char* GetMessageText(int) override { return ""; }

    std::vector<std::string> modules;
    bool unloading = false;
};

class ModuleObject : public ::testing::Test {
protected:
    void SetUp() override
    {
        saved = velHostSettings();
        velHostSettings().modulesDir = VEL_MODULE_DIR;
        velHostSettings().profileDir = dir.File("profil");
    }
    void TearDown() override
    {
        acedRegCmds()->removeGroup(kZodEVICommandGroup);
        velUnloadAllModules();
        velHostSettings() = saved;
    }
    std::vector<std::string> GroupCommands() const
    {
        std::vector<std::string> names;
        std::unique_ptr<AcEdCommandIterator> it(acedRegCmds()->iterator());
        for (; !it->done(); it->next())
            if (std::string(it->commandGroup()) == kZodEVICommandGroup)
                names.push_back(it->command()->localName);
        return names;
    }
    TempDir dir;
    VelHostSettings saved;
    ScriptedSession session;
};

TEST_F(ModuleObject, CommandListSortsHyphensAndPutsItsOwnCommandFirst)
{
    struct Case {
        const char* name;
        std::vector<std::pair<const char*, const char*>> commands;
        std::vector<std::string> list;
        std::string printed;
    };
    const Case cases[] = {
        {"only its own command", {{"VelVuzazORE15", "VelVuzazORE15"}}, {"VelVuzazORE15|VelVuzazORE15"}, " \n"},
        {"hyphen sorts after the letters",
         {{"b", "b"}, {"-X", "-X"}, {"VelVuzazORE15", "VelVuzazORE15"}, {"Xa", "xa"}, {"a", "A"}},
         {"VelVuzazORE15|VelVuzazORE15", "a|A", "b|b", "-X|-X", "Xa|xa"},
         " \n<V|13|13|a|A>\n<V|13|13|b|b>\n<V|13|13|-X|-X>\n<V|13|13|Xa|xa>\n"},
        {"without its own command", {{"b", "b"}, {"a", "a"}}, {"a|a", "b|b"}, " \n<V|1|1|b|b>\n"},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        acedRegCmds()->removeGroup(kZodEVICommandGroup);
        for (const auto& [global, local] : c.commands)
            ASSERT_EQ(acedRegCmds()->addCommand(kZodEVICommandGroup, global, local, 0, &Nothing), Acad::eOk);
        // Another group never shows.
        acedRegCmds()->addCommand("AUTRE_GROUPE", "Zz", "Zz", 0, &Nothing);
        session.ClearOutput();
        CVelSrvModul module;
        std::vector<std::string> list;
        EXPECT_EQ(module.ListGroupCommands("velanto_fonctions_3d_vuzazore", "<%.1s|%d|%d|%s|%s>\n", &list),
                  static_cast<int>(c.list.size()));
        EXPECT_EQ(list, c.list);
        EXPECT_EQ(session.Output(), c.printed);
        acedRegCmds()->removeGroup("AUTRE_GROUPE");
    }
}

TEST_F(ModuleObject, StartsAndStopsThroughTheHost)
{
    // In the module, building the schedule has loaded the main services by now.
    ASSERT_TRUE(acrxLoadModule(kVelMainServicesModule, false));
    CZodEVIBdr bdr;
    SetCurrentBdr(&bdr);
    ASSERT_TRUE(acrxLoadModule(kVelConfigServicesModule, false));
    CVelSrvModul module;
    ASSERT_EQ(module.OnAppMessage(AcRx::kInitAppMsg, nullptr), AcRx::kRetOK);
    EXPECT_TRUE(acrxServiceIsRegistered(kZodEVIServiceName));
    const std::vector<VelConfigPageEntry> pages = ConfigServices()->RegisteredPages();
    ASSERT_EQ(pages.size(), 1u);
    EXPECT_EQ(pages[0].moduleName, "VelVuzazORE");
    EXPECT_EQ(pages[0].createFunction, "Vel_ZodEVI_CfgUser");
    EXPECT_EQ(pages[0].section, "Métré");
    EXPECT_EQ(pages[0].pageTitle, "Métré");
    ASSERT_NE(module.service, nullptr);
    EXPECT_EQ(module.service->GetApplicationName(), "VelVuzazORE15");
    EXPECT_EQ(module.service->GetVersion(), "10.0");
    EXPECT_EQ(GroupCommands(), (std::vector<std::string>{"VelVuzazORE15", "ZodEVIBdrPrix", "ZodEVIBdrPurge",
                                                         "ZodEVICreate", "ZodEVITest1"}));
    EXPECT_NE(session.Output().find("VELANTO - Métré pour modules VRD"), std::string::npos);

    // Messages other than the four known ones change nothing.
    EXPECT_EQ(module.OnAppMessage(static_cast<AcRx::AppMsgCode>(7), nullptr), AcRx::kRetOK);
    EXPECT_TRUE(acrxServiceIsRegistered(kZodEVIServiceName));

    module.Unload();
    EXPECT_FALSE(acrxServiceIsRegistered(kZodEVIServiceName));
    EXPECT_EQ(module.service, nullptr);
    EXPECT_TRUE(GroupCommands().empty());
    EXPECT_NE(session.Output().find("Déchargement du module VelVuzazORE15."), std::string::npos);
    SetCurrentBdr(nullptr);
}

TEST_F(ModuleObject, RefusesToStartWhenTheMainServicesWereNotThere)
{
    ASSERT_TRUE(acrxLoadModule(kVelConfigServicesModule, false));
    ASSERT_FALSE(acrxServiceIsRegistered(kVelMainServicesName));
    CVelSrvModul module;
    EXPECT_EQ(module.OnAppMessage(AcRx::kInitAppMsg, nullptr), AcRx::kRetError);
    const std::string out = session.Output();
    EXPECT_NE(out.find("(erreur)]\nLe module VelVuzazORE15 ne peut pas démarrer"), std::string::npos) << out;
    EXPECT_NE(out.find("puis chargez de nouveau ce module."), std::string::npos) << out;
    EXPECT_FALSE(acrxServiceIsRegistered(kZodEVIServiceName));
    EXPECT_TRUE(GroupCommands().empty());
    EXPECT_TRUE(ConfigServices()->RegisteredPages().empty());
}

// Main services that are themselves going away no longer keep the list of modules: the
// module leaves it only while they stay.
TEST_F(ModuleObject, UnloadUnregistersOnlyFromMainServicesThatStay)
{
    for (const bool going : {false, true}) {
        SCOPED_TRACE(going ? "main services unloading" : "main services staying");
        FakeMainServices main;
        main.unloading = going;
        main.modules = {"VelVuzazORE15", "Autre"};
        velRegisterInProcessService(kVelMainServicesName, &main, {});
        CVelSrvModul module;
        module.Unload();
        Services()->remove(kVelMainServicesName);
        EXPECT_EQ(main.modules,
                  going ? (std::vector<std::string>{"VelVuzazORE15", "Autre"}) : (std::vector<std::string>{"Autre"}));
    }
}

TEST_F(ModuleObject, ModuleNameWithoutVersion)
{
    struct Case {
        const char* name;
        const char* expected;
    };
    const Case cases[] = {{"VelVuzazORE15", "VelVuzazORE"}, {"A51", "A"}, {"Mod", "Mod"}, {"15", ""}};
    for (const Case& c : cases)
        EXPECT_EQ(ModuleNameWithoutVersion(c.name), c.expected);
}

} // namespace
