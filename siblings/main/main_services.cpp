// Stand-in of the family's main services module (Vel2000Srv.arx): message texts,
// information output, the parameter file and data folders of the user's profile, the
// family's module list and the command list.
#include "velsiblings/main_services.h"

#include <algorithm>
#include <filesystem>
#include <map>

#include "text/text.hpp"
#include "velhost/documents.h"
#include "velhost/editor.h"
#include "velhost/profile.h"
#include "velhost/ui.h"

namespace {

namespace fs = std::filesystem;

const std::map<int, const char*>& Messages()
{
    static const std::map<int, const char*> messages = {
        {500, "VELANTO - %s"},
        {501, "\n%s\n"},
        {502, "Module chargé : tapez la commande du module pour la liste de ses commandes."},
        {503, "\nDéchargement du module %s.\n"},
        {504, "%s : %-*.*s  %s\n"},
        {505, "Le module %s ne peut pas démarrer : "},
        {506, "les services principaux VELANTO (Vel2000Srv.arx) ne sont pas chargés."},
        {507, "Chargez d'abord le module Vel2000Srv.arx (commande APPLOAD),"},
        {508, "puis chargez de nouveau ce module."},
        {600, "Impossible de créer l'objet de service du module !"},
    };
    return messages;
}

std::string WithSlash(std::string folder)
{
    if (!folder.empty() && folder.back() != '/')
        folder += '/';
    return folder;
}

bool IsFile(const fs::path& p)
{
    std::error_code error;
    return fs::is_regular_file(p, error);
}

class MainServices final : public CVelMainServices {
public:
    const char* className() const override { return "CVelMainServices"; }

    void ShowInfo(const std::string& text) override { velUI().print(text + "\n"); }

    std::string GetProductName() const override { return "VELANTO"; }

    std::string GetDataFolder(int code) override
    {
        const std::string profile = WithSlash(velHostSettings().profileDir);
        switch (code) {
        case 1: {
            // The user's schedule and settings are written there: it exists once asked for.
            std::error_code error;
            fs::create_directories(profile + "Donnees", error);
            return profile + "Donnees/";
        }
        case 2: {
            // The family's shared data live beside the modules folder.
            const fs::path modules(velHostSettings().modulesDir);
            return WithSlash((modules.parent_path() / "data").string());
        }
        default:
            return profile;
        }
    }

    std::string GetParameterFile() override { return WithSlash(velHostSettings().profileDir) + "Velanto.ini"; }

    void RegisterModule(const std::string& moduleName) override
    {
        if (std::find(modules_.begin(), modules_.end(), moduleName) == modules_.end())
            modules_.push_back(moduleName);
    }

    void UnregisterModule(const std::string& moduleName) override
    {
        modules_.erase(std::remove(modules_.begin(), modules_.end(), moduleName), modules_.end());
    }

    std::vector<std::string> RegisteredModules() const override { return modules_; }

    void* GetParentWindow() override { return &velUI(); }

    bool UnloadQuery() override { return unloading_; }

    std::string FindDataFile(const std::string& fileName, int locationCode) override
    {
        if (fileName.empty())
            return {};
        for (int location :
             {kVelLocDrawingFolder, kVelLocWorkingFolder, kVelLocUserData, kVelLocSupportPath, kVelLocSharedData}) {
            if ((locationCode & location) == 0)
                continue;
            if (location == kVelLocSupportPath) {
                std::string found;
                if (acedFindFile(fileName.c_str(), found) == RTNORM)
                    return found;
                continue;
            }
            fs::path folder;
            if (location == kVelLocDrawingFolder) {
                const AcApDocument* document = acDocManager->curDocument();
                if (document == nullptr || document->fileName().empty())
                    continue;
                folder = fs::path(document->fileName()).parent_path();
            } else if (location == kVelLocWorkingFolder) {
                std::error_code error;
                folder = fs::current_path(error);
            } else {
                folder = GetDataFolder(location == kVelLocUserData ? 1 : 2);
            }
            const fs::path candidate = folder / fileName;
            if (IsFile(candidate))
                return candidate.string();
        }
        return {};
    }

    void ShowCommandList(const std::string& title, const std::string& moduleName, int first, int width,
                         const std::vector<std::string>& lines) override
    {
        // Lines are "global|local"; the module's own command comes first and is the title
        // line of the table.
        std::size_t column = static_cast<std::size_t>(std::max(width, 0));
        for (const std::string& line : lines)
            column = std::max(column, CharCount(line.substr(0, line.find('|'))));
        std::string out = "\n" + title + " (" + moduleName + ")\n";
        const std::string heading = "Commande";
        out += "  " + heading + std::string(column + 2 - std::min(column + 2, CharCount(heading)), ' ') + "Nom local\n";
        for (std::size_t i = static_cast<std::size_t>(std::max(first, 0)); i < lines.size(); ++i) {
            const std::size_t bar = lines[i].find('|');
            const std::string global = lines[i].substr(0, bar);
            const std::string local = bar == std::string::npos ? global : lines[i].substr(bar + 1);
            out +=
                "  " + global + std::string(column + 2 - std::min(column + 2, CharCount(global)), ' ') + local + "\n";
        }
        velUI().print(out);
    }

    const char* GetMessageText(int number) override
    {
        const auto found = Messages().find(number);
        return found == Messages().end() ? "" : found->second;
    }

    void SetUnloading() { unloading_ = true; }

private:
    std::vector<std::string> modules_;
    bool unloading_ = false;
};

MainServices* g_services = nullptr;

} // namespace

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message, void* appId)
{
    switch (message) {
    case AcRx::kInitAppMsg:
        acrxDynamicLinker()->unlockApplication(appId);
        acrxDynamicLinker()->registerAppMDIAware(appId);
        if (g_services == nullptr) {
            g_services = new MainServices();
            acrxDynamicLinker()->registerService(kVelMainServicesName, g_services);
        }
        return AcRx::kRetOK;
    case AcRx::kUnloadAppMsg:
        if (g_services != nullptr) {
            g_services->SetUnloading();
            velUnregisterService(kVelMainServicesName, g_services);
            delete g_services;
            g_services = nullptr;
        }
        return AcRx::kRetOK;
    default:
        return AcRx::kRetOK;
    }
}
