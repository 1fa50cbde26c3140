// The module object: start-up and shutdown of the module inside the host (service,
// commands, configuration page, the schedule read at load), the command list, and the
// scope that makes the module's resources current around its dialogs.
#pragma once

#include <string>
#include <vector>

#include "module/document_state.hpp"
#include "module/service_api.hpp"
#include "schedule/schedule_store.hpp"
#include "velhost/rx.h"

namespace zodevi {

inline constexpr const char* kZodEVIModuleName = "VelVuzazORE15";
inline constexpr const char* kZodEVICommandGroup = "VELANTO_FONCTIONS_3D_VUZAZORE";
inline constexpr const char* kZodEVITitle = "Métré pour modules VRD";

// Base of the family's module objects.
class CVelAppModul {
public:
    CVelAppModul() = default;
    virtual ~CVelAppModul() = default;
    CVelAppModul(const CVelAppModul&) = delete;
    CVelAppModul& operator=(const CVelAppModul&) = delete;

    virtual AcRx::AppRetCode OnAppMessage(AcRx::AppMsgCode message, void* packet);
    // Non-zero when the module may stay loaded.
    virtual int Init();
    virtual void Unload();
    virtual void OnDrawingMessage();
    virtual std::string GetModuleName() const;

    std::string moduleName = kZodEVIModuleName;
    void* appId = nullptr;
    std::string appPath;
};

// This module's object.
class CVelSrvModul : public CVelAppModul {
public:
    ~CVelSrvModul() override;
    AcRx::AppRetCode OnAppMessage(AcRx::AppMsgCode message, void* packet) override;
    int Init() override;
    void Unload() override;

    // The group's commands as "global|local" entries, sorted without regard to case,
    // the module's own command first; with a line format, every other command is printed
    // with it (module name, column width twice, global name, local name). Answers the
    // number of entries.
    int ListGroupCommands(const std::string& group, const char* lineFormat, std::vector<std::string>* out) const;

    CVelZodEVISrv* service = nullptr;

private:
    // Takes the service out of the host, unless another module filed its own since, and
    // destroys it.
    void RemoveService();
};

// The one module object, while the library is attached.
CVelSrvModul* ModuleObject();
void SetModuleObject(CVelSrvModul* module);

// The per-document records of the module, while it is loaded.
using CZodEVIDocuments = CVelDataMDIManager<CArxGlobals>;
void SetDocumentManager(CZodEVIDocuments* documents);
// The record of the current document; null without a document.
CArxGlobals* CurrentDocumentRecord();

// The module's resources: made current around its dialogs.
struct ModuleResources {
    bool initialised = false;
    void* instance = nullptr;
    void* resource = nullptr;
};
ModuleResources& Resources();

class ResourceOverride {
public:
    ResourceOverride();
    ~ResourceOverride();
    ResourceOverride(const ResourceOverride&) = delete;
    ResourceOverride& operator=(const ResourceOverride&) = delete;

private:
    bool pushed_ = false;
};

// Prepares the current document's settings for a command and puts them back on every
// way out of it.
class CommandSettingsScope {
public:
    explicit CommandSettingsScope(bool echo);
    ~CommandSettingsScope();
    CommandSettingsScope(const CommandSettingsScope&) = delete;
    CommandSettingsScope& operator=(const CommandSettingsScope&) = delete;

private:
    CArxGlobals* record_ = nullptr;
};

// Finds the schedule's default file through the main services module and the user's
// parameter file.
class MainServicesEnvironment : public CZodEVIBdrEnvironment {
public:
    std::string ParameterFile() override;
    std::string ReadParameter(const std::string& file, const std::string& section, const std::string& key,
                              const std::string& defaultValue) override;
    std::string FindDataFile(const std::string& name, int locationCode) override;
    std::string DataFolder(int folderCode) override;
};

// Module name without its trailing version digits ("VelVuzazORE15" -> "VelVuzazORE").
std::string ModuleNameWithoutVersion(std::string name);

// Bodies of the module's commands.
void ListCommandsCommand();
void CreateEstimateCommand();

// The name of a new estimate: "Devis", else "Devis 2", "Devis 3"... compared without
// regard to case with the existing names, each rename starting again from the first.
std::string ChooseEstimateName(const std::vector<std::string>& existing);
void TestCommand();

} // namespace zodevi
