// Start-up and shutdown of the module, its command table and command list, resources
// and the per-document settings around commands.
#include "module/module_object.hpp"

#include <algorithm>
#include <memory>

#include "common/parameters.hpp"
#include "module/schedule_commands.hpp"
#include "module/siblings.hpp"
#include "schedule/schedule_exchange.hpp"
#include "text/text.hpp"
#include "velhost/commands.h"
#include "velhost/documents.h"
#include "velhost/editor.h"
#include "velhost/ui.h"
#include "velsiblings/config_services.h"
#include "zodevi/api.h"

namespace zodevi {

namespace {

CVelSrvModul* g_module = nullptr;
CZodEVIDocuments* g_documents = nullptr;

struct CommandEntry {
    const char* globalName;
    const char* localName;
    AcRxFunctionPtr function;
};

const CommandEntry kCommands[] = {
    {"VelVuzazORE15", "VelVuzazORE15", &ListCommandsCommand},
    {"VelaZodEVIBdrPrix", "ZodEVIBdrPrix", &DisplayScheduleCommand},
    {"VelaZodEVIBdrPurge", "ZodEVIBdrPurge", &PurgeScheduleCommand},
    {"VelaZodEVICreate", "ZodEVICreate", &CreateEstimateCommand},
    {"ZodEVITest1", "ZodEVITest1", &TestCommand},
};

const char* Message(int number)
{
    return MainServices()->GetMessageText(number);
}

// A hyphen in front of a name sorts it by its letters: "-X" is handled as "X-".
std::string HyphenToEnd(const std::string& name)
{
    return !name.empty() && name.front() == '-' ? name.substr(1) + "-" : name;
}

std::string HyphenToFront(const std::string& name)
{
    return !name.empty() && name.back() == '-' ? "-" + name.substr(0, name.size() - 1) : name;
}

} // namespace

AcRx::AppRetCode CVelAppModul::OnAppMessage(AcRx::AppMsgCode, void*)
{
    return AcRx::kRetOK;
}

int CVelAppModul::Init()
{
    return 1;
}

void CVelAppModul::Unload() {}

void CVelAppModul::OnDrawingMessage() {}

std::string CVelAppModul::GetModuleName() const
{
    return moduleName;
}

CVelSrvModul::~CVelSrvModul()
{
    // Normally gone with Unload; a module detached without it must not leave its service
    // filed under a deleted object.
    RemoveService();
}

void CVelSrvModul::RemoveService()
{
    velUnregisterService(kZodEVIServiceName, service);
    delete service;
    service = nullptr;
}

AcRx::AppRetCode CVelSrvModul::OnAppMessage(AcRx::AppMsgCode message, void* packet)
{
    switch (message) {
    case AcRx::kInitAppMsg: {
        appId = packet;
        acrxDynamicLinker()->unlockApplication(packet);
        acrxDynamicLinker()->registerAppMDIAware(packet);
        if (Init() == 0)
            return AcRx::kRetError;
        auto* config =
            static_cast<CVelConfigServices*>(GetServiceObject(kVelConfigServicesModule, kVelConfigServicesName));
        config->RegisterConfigPage("Métré", "Vel_ZodEVI_CfgUser", ModuleNameWithoutVersion(moduleName), "Métré");
        return AcRx::kRetOK;
    }
    case AcRx::kUnloadAppMsg:
        Unload();
        return AcRx::kRetOK;
    case AcRx::kLoadDwgMsg:
    case AcRx::kUnloadDwgMsg:
        OnDrawingMessage();
        return AcRx::kRetOK;
    default:
        return AcRx::kRetOK;
    }
}

int CVelSrvModul::Init()
{
    appPath = acedGetAppName();
    if (!acrxServiceIsRegistered(kVelMainServicesName)) {
        const std::string text =
            FormatPattern(Message(505), {moduleName}) + Message(506) + "\n" + Message(507) + "\n" + Message(508);
        MessageBoxFlags(nullptr, MB_ICONERROR, "%s", text.c_str());
        return 0;
    }
    MainServices()->ShowInfo(FormatPattern(Message(500), {kZodEVITitle}));

    service = new CVelZodEVISrv();
    acrxDynamicLinker()->registerService(kZodEVIServiceName, service);
    service->SetApplicationName(GetModuleName());

    AcEdCommandStack* stack = acedRegCmds();
    for (const CommandEntry& command : kCommands)
        stack->addCommand(kZodEVICommandGroup, command.globalName, command.localName, ACRX_CMD::kModal,
                          command.function, nullptr, -1, nullptr);

    MainServices()->RegisterModule(moduleName);
    // A schedule that cannot be read leaves the schedule empty; nothing is said here.
    if (CurrentBdr() != nullptr)
        Read(*CurrentBdr());
    acutPrintf("%s", FormatPattern(Message(501), {Message(502)}).c_str());
    return 1;
}

void CVelSrvModul::Unload()
{
    acutPrintf("%s", FormatPattern(Message(503), {moduleName}).c_str());
    OnDrawingMessage();
    if (acrxServiceIsRegistered(kVelMainServicesName) && !MainServices()->UnloadQuery())
        MainServices()->UnregisterModule(moduleName);
    acedRegCmds()->removeGroup(kZodEVICommandGroup);
    RemoveService();
}

int CVelSrvModul::ListGroupCommands(const std::string& group, const char* lineFormat,
                                    std::vector<std::string>* out) const
{
    std::vector<std::string> entries;
    std::size_t width = 0;
    std::unique_ptr<AcEdCommandIterator> it(acedRegCmds()->iterator());
    for (; !it->done(); it->next()) {
        if (!EqualsNoCase(it->commandGroup(), group))
            continue;
        const AcEdCommand* command = it->command();
        width = std::max({width, CharCount(command->globalName), CharCount(command->localName)});
        entries.push_back(HyphenToEnd(command->globalName) + "|" + HyphenToEnd(command->localName));
    }
    SortStrings(entries, true);
    if (entries.size() > 1) {
        const auto own = std::find(entries.begin(), entries.end(), moduleName + "|" + moduleName);
        if (own != entries.end())
            std::rotate(entries.begin(), own, own + 1);
    }
    if (lineFormat != nullptr)
        acutPrintf(" \n");
    const int columnWidth = static_cast<int>(width);
    for (std::size_t i = 1; i < entries.size(); ++i) {
        const std::size_t bar = entries[i].find('|');
        const std::string global = HyphenToFront(entries[i].substr(0, bar));
        const std::string local = HyphenToFront(bar == std::string::npos ? "" : entries[i].substr(bar + 1));
        if (lineFormat != nullptr)
            acutPrintf("%s", FormatPattern(lineFormat, {moduleName, columnWidth, columnWidth, global, local}).c_str());
        entries[i] = global + "|" + local;
    }
    if (out != nullptr)
        out->insert(out->end(), entries.begin(), entries.end());
    return static_cast<int>(entries.size());
}

CVelSrvModul* ModuleObject()
{
    return g_module;
}

void SetModuleObject(CVelSrvModul* module)
{
    g_module = module;
}

void SetDocumentManager(CZodEVIDocuments* documents)
{
    g_documents = documents;
}

CArxGlobals* CurrentDocumentRecord()
{
    if (g_documents == nullptr || acDocManager->curDocument() == nullptr)
        return nullptr;
    return g_documents->DataFor(nullptr);
}

ModuleResources& Resources()
{
    static ModuleResources resources;
    return resources;
}

ResourceOverride::ResourceOverride()
{
    pushed_ = acDocManager->pushResourceHandle(Resources().resource);
}

ResourceOverride::~ResourceOverride()
{
    if (pushed_)
        acDocManager->popResourceHandle();
}

CommandSettingsScope::CommandSettingsScope(bool echo) : record_(CurrentDocumentRecord())
{
    if (record_ != nullptr)
        record_->PrepareForCommand(echo);
}

CommandSettingsScope::~CommandSettingsScope()
{
    if (record_ != nullptr)
        record_->RestoreSettings(true);
}

std::string MainServicesEnvironment::ParameterFile()
{
    return MainServices()->GetParameterFile();
}

std::string MainServicesEnvironment::ReadParameter(const std::string& file, const std::string& section,
                                                   const std::string& key, const std::string& defaultValue)
{
    std::string value;
    zodevi::ReadParameter(file.c_str(), section.c_str(), key.c_str(), defaultValue.c_str(), value);
    return value;
}

std::string MainServicesEnvironment::FindDataFile(const std::string& name, int locationCode)
{
    return MainServices()->FindDataFile(name, locationCode);
}

std::string MainServicesEnvironment::DataFolder(int folderCode)
{
    return MainServices()->GetDataFolder(folderCode);
}

std::string ModuleNameWithoutVersion(std::string name)
{
    while (!name.empty() && (name.back() == '1' || name.back() == '5'))
        name.pop_back();
    return name;
}

void ListCommandsCommand()
{
    const CVelSrvModul* module = ModuleObject();
    if (module == nullptr)
        return;
    std::vector<std::string> lines;
    module->ListGroupCommands(kZodEVICommandGroup, Message(504), &lines);
    MainServices()->ShowCommandList(kZodEVITitle, kZodEVIModuleName, 0, 13, lines);
}

void TestCommand() {}

} // namespace zodevi
