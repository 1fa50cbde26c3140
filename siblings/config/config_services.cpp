// Stand-in of the family's configuration services module (VelSrvConfig15.arx): modules
// register the pages of the configuration dialog, and its command shows them and sends
// them the confirmation.
#include "velsiblings/config_services.h"

#include <dlfcn.h>

#include <memory>

#include "velhost/commands.h"
#include "velhost/editor.h"
#include "velhost/ui.h"

namespace {

constexpr const char* kGroup = "VELANTO_CONFIGURATION";

class ConfigServices final : public CVelConfigServices {
public:
    const char* className() const override { return "CVelConfigServices"; }

    void RegisterConfigPage(const std::string& section, const std::string& createFunction,
                            const std::string& moduleName, const std::string& pageTitle) override
    {
        // The page's function lives in the module that registers it, which is the one
        // the host is running now.
        VelConfigPageEntry entry{section, createFunction, moduleName, pageTitle, acedGetAppName()};
        for (VelConfigPageEntry& existing : pages_) {
            if (existing.createFunction == createFunction) {
                existing = entry;
                return;
            }
        }
        pages_.push_back(entry);
    }

    std::vector<VelConfigPageEntry> RegisteredPages() const override { return pages_; }

private:
    std::vector<VelConfigPageEntry> pages_;
};

ConfigServices* g_services = nullptr;

// The creation function of a page, in the module that registered it (still loaded).
VelCreateConfigPageFn* PageFunction(const VelConfigPageEntry& entry)
{
    void* handle =
        entry.modulePath.empty() ? dlopen(nullptr, RTLD_NOW) : dlopen(entry.modulePath.c_str(), RTLD_NOW | RTLD_NOLOAD);
    if (handle == nullptr)
        return nullptr;
    void* symbol = dlsym(handle, entry.createFunction.c_str());
    dlclose(handle);
    return reinterpret_cast<VelCreateConfigPageFn*>(symbol);
}

bool AskConfirmation()
{
    acedInitGet(0, "Oui Non _ Yes No");
    std::string answer;
    const int status = acedGetKword("\nEnregistrer la configuration ? [Oui/Non] <Oui> : ", answer);
    return status == RTNONE || (status == RTNORM && answer == "Yes");
}

void ConfigurationCommand()
{
    if (g_services == nullptr)
        return;
    const std::vector<VelConfigPageEntry> entries = g_services->RegisteredPages();
    if (entries.empty()) {
        acutPrintf("%s", "\nAucune page de configuration n'est enregistrée.\n");
        return;
    }
    std::vector<std::unique_ptr<CVelConfigPage>> pages;
    for (const VelConfigPageEntry& entry : entries) {
        VelCreateConfigPageFn* create = PageFunction(entry);
        CVelConfigPage* page = nullptr;
        if (create != nullptr)
            create(&page, &velUI());
        if (page == nullptr) {
            acutPrintf("\nPage \"%s\" indisponible : la fonction %s est introuvable dans %s.\n",
                       entry.pageTitle.c_str(), entry.createFunction.c_str(), entry.modulePath.c_str());
            continue;
        }
        pages.emplace_back(page);
    }
    bool confirmed = !pages.empty();
    for (std::size_t i = 0; i < pages.size() && confirmed; ++i) {
        acutPrintf("\n--- Configuration : %s ---\n", entries[i].section.c_str());
        confirmed = pages[i]->Run();
    }
    if (confirmed && AskConfirmation()) {
        for (const auto& page : pages)
            page->OnMessage(kVelConfigApply);
        acutPrintf("%s", "\nConfiguration enregistrée.\n");
    } else {
        acutPrintf("%s", "\nConfiguration abandonnée.\n");
    }
    for (const auto& page : pages)
        page->OnMessage(kVelConfigRelease);
}

} // namespace

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message, void* appId)
{
    switch (message) {
    case AcRx::kInitAppMsg:
        acrxDynamicLinker()->unlockApplication(appId);
        acrxDynamicLinker()->registerAppMDIAware(appId);
        if (g_services == nullptr) {
            g_services = new ConfigServices();
            acrxDynamicLinker()->registerService(kVelConfigServicesName, g_services);
            acedRegCmds()->addCommand(kGroup, "VelaConfiguration", "VelConfig", ACRX_CMD::kModal,
                                      &ConfigurationCommand);
        }
        return AcRx::kRetOK;
    case AcRx::kUnloadAppMsg:
        if (g_services != nullptr) {
            acedRegCmds()->removeGroup(kGroup);
            velUnregisterService(kVelConfigServicesName, g_services);
            delete g_services;
            g_services = nullptr;
        }
        return AcRx::kRetOK;
    default:
        return AcRx::kRetOK;
    }
}
