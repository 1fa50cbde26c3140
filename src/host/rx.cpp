// System registry, service dictionary and dynamic linker: modules are shared libraries
// opened with dlopen and started through their acrxEntryPoint.
#include "velhost/rx.h"

#include <dlfcn.h>

#include <algorithm>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <stdexcept>

#include "host_internal.h"
#include "text/text.hpp"
#include "velhost/commands.h"
#include "velhost/documents.h"
#include "velhost/editor.h"
#include "velhost/ui.h"

namespace fs = std::filesystem;

namespace {

struct LoadedModule {
    std::string path;
    void* handle = nullptr;
    AcRxEntryPointFn entry = nullptr;
    bool locked = true;
    bool mdiAware = false;
    bool unloading = false;
};

struct ServiceOwner {
    void* app = nullptr; // module that registered it, null for the host
    AcRxService* service = nullptr;
    bool inProcess = false;
    VelSymbolTable symbols;
};

// Host singletons are never destroyed: modules' static objects may still call the host
// while the process exits.
struct LinkerState {
    std::vector<std::unique_ptr<LoadedModule>> modules;
    std::vector<void*> running;
    std::map<std::string, ServiceOwner, std::less<>> services;
    VelAbortHandler abortHandler;
};

LinkerState& State()
{
    static LinkerState* state = new LinkerState;
    return *state;
}

AcRxDictionary* ServiceDictionary()
{
    return static_cast<AcRxDictionary*>(acrxSysRegistry()->at("ServiceDictionary"));
}

LoadedModule* FindByApp(void* appId)
{
    for (auto& m : State().modules)
        if (m.get() == appId)
            return m.get();
    return nullptr;
}

// A module named by its full path, its file name or its name without ".arx".
LoadedModule* FindByName(const std::string& name)
{
    std::error_code ec;
    const std::string native = velNativePath(name);
    const fs::path canonical = fs::weakly_canonical(fs::path(native), ec);
    for (auto& m : State().modules) {
        if (!ec && canonical.string() == m->path)
            return m.get();
        const fs::path p(m->path);
        if (EqualsNoCase(p.filename().string(), native) || EqualsNoCase(p.stem().string(), native))
            return m.get();
    }
    return nullptr;
}

// Takes out what a module left registered: its code is about to go, and nobody may call
// it through the host again.
void ForgetModule(LoadedModule* module, bool warn)
{
    auto& services = State().services;
    for (auto it = services.begin(); it != services.end();) {
        if (it->second.app != module) {
            ++it;
            continue;
        }
        AcRxDictionary* dict = ServiceDictionary();
        if (dict->at(it->first.c_str()) == it->second.service) {
            dict->remove(it->first.c_str());
            if (warn)
                acutPrintf("Le module %s n'a pas retiré le service %s ; le service est retiré.\n", module->path.c_str(),
                           it->first.c_str());
        }
        it = services.erase(it);
    }
    for (const std::string& group : acedRegCmds()->groupsOf(module)) {
        acedRegCmds()->removeGroup(group.c_str());
        if (warn)
            acutPrintf("Le module %s n'a pas retiré le groupe de commandes %s ; il est retiré.\n", module->path.c_str(),
                       group.c_str());
    }
}

void RemoveRecord(LoadedModule* module)
{
    auto& modules = State().modules;
    modules.erase(std::remove_if(modules.begin(), modules.end(), [module](const auto& m) { return m.get() == module; }),
                  modules.end());
}

// Takes the module's registrations out, closes the library (its static objects go), then
// drops the document reactors it left behind, and forgets it.
void CloseModule(LoadedModule* module, bool warn)
{
    ForgetModule(module, warn);
    if (module->handle != nullptr) {
        VelAppScope scope(module);
        dlclose(module->handle);
        module->handle = nullptr;
    }
    const std::size_t reactors = acDocManagerPtr()->removeReactorsOf(module);
    if (warn && reactors > 0)
        acutPrintf("Le module %s n'a pas retiré %zu réacteur(s) de documents ; ils sont retirés.\n",
                   module->path.c_str(), reactors);
    RemoveRecord(module);
}

AcRx::AppRetCode Send(LoadedModule* module, AcRx::AppMsgCode message)
{
    if (module->entry == nullptr)
        return AcRx::kRetOK;
    VelAppScope scope(module);
    return module->entry(message, module);
}

// Finds the file of a module: the name as given, else along the support path, trying
// ".arx" after a name without extension.
bool ResolveModule(const std::string& name, std::string& path)
{
    std::vector<std::string> candidates{name};
    if (fs::path(velNativePath(name)).extension().empty())
        candidates.push_back(name + ".arx");
    for (const std::string& c : candidates) {
        const fs::path native(velNativePath(c));
        std::error_code ec;
        if (native.has_parent_path() && fs::is_regular_file(native, ec)) {
            path = fs::weakly_canonical(native, ec).string();
            return true;
        }
        std::string found;
        if (acedFindFile(c.c_str(), found) == RTNORM) {
            path = fs::weakly_canonical(fs::path(found), ec).string();
            return true;
        }
    }
    return false;
}

void DefaultAbort(const std::string& message)
{
    std::fprintf(stderr, "Erreur fatale : %s\n", message.c_str());
    std::fflush(stderr);
}

} // namespace

// ---- running module ----

void* velCurrentApp()
{
    const auto& running = State().running;
    return running.empty() ? nullptr : running.back();
}

VelAppScope::VelAppScope(void* appId)
{
    State().running.push_back(appId);
}
VelAppScope::~VelAppScope()
{
    State().running.pop_back();
}

bool velIsLoadedApp(void* appId)
{
    return appId != nullptr && FindByApp(appId) != nullptr;
}

std::string velAppPath(void* appId)
{
    const LoadedModule* m = FindByApp(appId);
    return m ? m->path : std::string();
}

std::string velNativePath(const std::string& name)
{
    std::string out = name;
    std::replace(out.begin(), out.end(), '\\', '/');
    return out;
}

// ---- registry objects ----

AcRxObject::~AcRxObject() = default;
const char* AcRxObject::className() const
{
    return "AcRxObject";
}
const char* AcRxService::className() const
{
    return "AcRxService";
}
const char* AcRxDictionary::className() const
{
    return "AcRxDictionary";
}
const char* AcRxDynamicLinker::className() const
{
    return "AcRxDynamicLinker";
}

AcRxObject* AcRxDictionary::at(const char* key) const
{
    if (key == nullptr)
        return nullptr;
    auto it = entries_.find(std::string_view(key));
    return it == entries_.end() ? nullptr : it->second;
}

AcRxObject* AcRxDictionary::atPut(const char* key, AcRxObject* obj)
{
    if (key == nullptr || *key == '\0')
        return nullptr;
    AcRxObject*& slot = entries_[key];
    AcRxObject* previous = slot;
    slot = obj;
    return previous;
}

AcRxObject* AcRxDictionary::remove(const char* key)
{
    if (key == nullptr)
        return nullptr;
    auto it = entries_.find(std::string_view(key));
    if (it == entries_.end())
        return nullptr;
    AcRxObject* obj = it->second;
    entries_.erase(it);
    return obj;
}

bool AcRxDictionary::has(const char* key) const
{
    return key != nullptr && entries_.find(std::string_view(key)) != entries_.end();
}

unsigned AcRxDictionary::numEntries() const
{
    return static_cast<unsigned>(entries_.size());
}

std::vector<std::string> AcRxDictionary::keys() const
{
    std::vector<std::string> out;
    for (const auto& [k, v] : entries_)
        out.push_back(k);
    return out;
}

AcRxDictionary* acrxSysRegistry()
{
    static AcRxDictionary* root = [] {
        auto* r = new AcRxDictionary;
        r->atPut("ServiceDictionary", new AcRxDictionary);
        r->atPut("DynamicLinker", new AcRxDynamicLinker);
        r->atPut("ACAD_REGISTERED_COMMANDS", new AcEdCommandStack);
        return r;
    }();
    return root;
}

AcRxDynamicLinker* acrxDynamicLinker()
{
    return static_cast<AcRxDynamicLinker*>(acrxSysRegistry()->at("DynamicLinker"));
}

// ---- dynamic linker ----

bool AcRxDynamicLinker::loadModule(const char* fileName, bool printit, bool asCmd)
{
    (void)asCmd;
    if (fileName == nullptr || *fileName == '\0') {
        acutPrintf("Aucun nom de module donné.\n");
        return false;
    }
    std::string path;
    if (!ResolveModule(fileName, path)) {
        acutPrintf("Impossible de trouver le module %s.\n", fileName);
        return false;
    }
    // Also true for a module asking for itself while its static objects are built.
    if (FindByName(path) != nullptr)
        return true;

    // The record exists before dlopen: what the module's static objects register while it
    // opens (a document reactor, a nested load) is known to be the module's.
    auto record = std::make_unique<LoadedModule>();
    record->path = path;
    LoadedModule* module = record.get();
    State().modules.push_back(std::move(record));

    // Whatever leaves the start-up early (a refusal, an exception, an abort that a test
    // turns into one) must not leave a half-started module behind.
    struct Undo {
        LoadedModule* module;
        bool armed = true;
        ~Undo()
        {
            if (armed)
                CloseModule(module, false);
        }
    } undo{module};

    {
        VelAppScope scope(module);
        module->handle = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
    }
    if (module->handle == nullptr) {
        const char* why = dlerror();
        acutPrintf("Impossible d'ouvrir le module %s : %s\n", path.c_str(), why ? why : "?");
        return false;
    }
    // Nothing of a module built for another interface is called: its objects and
    // messages would not mean what this host means by them.
    const auto version = reinterpret_cast<AcRxGetApiVersionFn>(dlsym(module->handle, "acrxGetApiVersion"));
    if (version == nullptr) {
        acutPrintf("Le module %s n'exporte pas acrxGetApiVersion : on ne sait pas pour quelle version de l'interface "
                   "de l'hôte il est écrit ; il n'est pas chargé.\n",
                   path.c_str());
        return false;
    }
    int release = 0;
    {
        VelAppScope scope(module);
        release = version();
    }
    if (release != kAcRxApiVersion) {
        acutPrintf("Le module %s est écrit pour la version %d de l'interface de l'hôte, et cet hôte est de la "
                   "version %d : il n'est pas chargé.\n",
                   path.c_str(), release, kAcRxApiVersion);
        return false;
    }
    module->entry = reinterpret_cast<AcRxEntryPointFn>(dlsym(module->handle, "acrxEntryPoint"));
    if (module->entry == nullptr) {
        acutPrintf("Le module %s n'exporte pas de point d'entrée acrxEntryPoint.\n", path.c_str());
        return false;
    }

    AcRx::AppRetCode answer = AcRx::kRetError;
    try {
        answer = Send(module, AcRx::kInitAppMsg);
    } catch (const std::exception& e) {
        acutPrintf("Le module %s a échoué au démarrage : %s\n", path.c_str(), e.what());
        return false;
    }
    if (answer != AcRx::kRetOK) {
        acutPrintf("Le module %s a refusé de démarrer (réponse %d).\n", path.c_str(), static_cast<int>(answer));
        return false;
    }
    undo.armed = false;
    // The modules it loaded while starting serve it: it goes after them, so that unloading
    // in reverse order takes it away while they are still there.
    auto& modules = State().modules;
    const auto at = std::find_if(modules.begin(), modules.end(), [module](const auto& m) { return m.get() == module; });
    if (at != modules.end())
        std::rotate(at, at + 1, modules.end());
    if (printit)
        acutPrintf("Module %s chargé.\n", path.c_str());
    return true;
}

bool AcRxDynamicLinker::unloadModule(const char* fileName, bool asCmd, bool force)
{
    LoadedModule* module = fileName ? FindByName(fileName) : nullptr;
    if (module == nullptr) {
        acutPrintf("Le module %s n'est pas chargé.\n", fileName ? fileName : "");
        return false;
    }
    if (module->unloading)
        return false;
    // Its code is on the stack: closing it now would pull the ground from under it.
    const auto& running = State().running;
    if (std::find(running.begin(), running.end(), module) != running.end()) {
        acutPrintf("Le module %s est en cours d'exécution et ne peut pas être déchargé.\n", module->path.c_str());
        return false;
    }
    if (module->locked && !force) {
        acutPrintf("Le module %s est verrouillé et ne peut pas être déchargé.\n", module->path.c_str());
        return false;
    }
    module->unloading = true;
    AcRx::AppRetCode answer = AcRx::kRetOK;
    try {
        answer = Send(module, AcRx::kUnloadAppMsg);
    } catch (const std::exception& e) {
        acutPrintf("Le module %s a échoué au déchargement : %s\n", module->path.c_str(), e.what());
    }
    if (answer != AcRx::kRetOK && !force) {
        module->unloading = false;
        acutPrintf("Le module %s refuse d'être déchargé.\n", module->path.c_str());
        return false;
    }
    const std::string path = module->path;
    CloseModule(module, true);
    if (asCmd)
        acutPrintf("Module %s déchargé.\n", path.c_str());
    return true;
}

AcRxObject* AcRxDynamicLinker::registerService(const char* serviceName, AcRxService* service)
{
    if (serviceName == nullptr || *serviceName == '\0' || service == nullptr)
        return nullptr;
    AcRxObject* previous = ServiceDictionary()->atPut(serviceName, service);
    ServiceOwner owner;
    owner.app = velCurrentApp();
    owner.service = service;
    State().services[serviceName] = std::move(owner);
    return previous;
}

bool AcRxDynamicLinker::unlockApplication(void* appId)
{
    LoadedModule* m = FindByApp(appId);
    if (m)
        m->locked = false;
    return m != nullptr;
}

bool AcRxDynamicLinker::lockApplication(void* appId)
{
    LoadedModule* m = FindByApp(appId);
    if (m)
        m->locked = true;
    return m != nullptr;
}

bool AcRxDynamicLinker::isApplicationLocked(const char* fileName) const
{
    const LoadedModule* m = fileName ? FindByName(fileName) : nullptr;
    return m != nullptr && m->locked;
}

bool AcRxDynamicLinker::registerAppMDIAware(void* appId)
{
    LoadedModule* m = FindByApp(appId);
    if (m)
        m->mdiAware = true;
    return m != nullptr;
}

bool AcRxDynamicLinker::registerAppNotMDIAware(void* appId)
{
    LoadedModule* m = FindByApp(appId);
    if (m)
        m->mdiAware = false;
    return m != nullptr;
}

bool acrxLoadModule(const char* fileName, bool printit, bool asCmd)
{
    return acrxDynamicLinker()->loadModule(fileName, printit, asCmd);
}

bool acrxUnloadModule(const char* fileName, bool asCmd)
{
    return acrxDynamicLinker()->unloadModule(fileName, asCmd);
}

bool acrxServiceIsRegistered(const char* serviceName)
{
    return serviceName != nullptr && ServiceDictionary()->has(serviceName);
}

VelServiceModule velLoadServiceModule(const char* serviceName, const std::vector<std::string>& candidates)
{
    VelServiceModule result;
    if (acrxServiceIsRegistered(serviceName)) {
        result.status = VelServiceModule::kRegistered;
        return result;
    }
    for (const std::string& candidate : candidates)
        if (acedFindFile(candidate.c_str(), result.path) == RTNORM)
            break;
    if (result.path.empty()) {
        result.status = VelServiceModule::kNotFound;
    } else if (!acrxLoadModule(result.path.c_str(), true, true)) {
        result.status = VelServiceModule::kNotLoaded;
    } else {
        result.status = acrxServiceIsRegistered(serviceName) ? VelServiceModule::kLoaded : VelServiceModule::kNoService;
    }
    return result;
}

void* acrxGetServiceSymbolAddr(const char* serviceName, const char* symbolName)
{
    if (serviceName == nullptr || symbolName == nullptr || *symbolName == '\0')
        return nullptr;
    auto it = State().services.find(std::string_view(serviceName));
    if (it == State().services.end())
        return nullptr;
    const ServiceOwner& owner = it->second;
    if (ServiceDictionary()->at(serviceName) != owner.service)
        return nullptr;
    if (owner.inProcess) {
        auto sym = owner.symbols.find(std::string_view(symbolName));
        return sym == owner.symbols.end() ? nullptr : sym->second;
    }
    const LoadedModule* m = FindByApp(owner.app);
    if (m == nullptr)
        return nullptr;
    dlerror();
    return dlsym(m->handle, symbolName);
}

void velRegisterInProcessService(const char* serviceName, AcRxService* service, VelSymbolTable symbols)
{
    if (serviceName == nullptr || *serviceName == '\0' || service == nullptr)
        return;
    ServiceDictionary()->atPut(serviceName, service);
    ServiceOwner owner;
    owner.service = service;
    owner.inProcess = true;
    owner.symbols = std::move(symbols);
    State().services[serviceName] = std::move(owner);
}

bool velUnregisterService(const char* serviceName, const AcRxService* service)
{
    if (serviceName == nullptr || service == nullptr || ServiceDictionary()->at(serviceName) != service)
        return false;
    ServiceDictionary()->remove(serviceName);
    auto& services = State().services;
    const auto owner = services.find(std::string_view(serviceName));
    if (owner != services.end() && owner->second.service == service)
        services.erase(owner);
    return true;
}

const char* acedGetAppName()
{
    static std::string name;
    name = velAppPath(velCurrentApp());
    return name.c_str();
}

void acrx_abort(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    const std::string message = format ? FormatStringV(format, args) : std::string();
    va_end(args);
    VelAbortHandler handler = State().abortHandler;
    if (handler)
        handler(message);
    else
        DefaultAbort(message);
    std::exit(EXIT_FAILURE);
}

VelAbortHandler velSetAbortHandler(VelAbortHandler handler)
{
    VelAbortHandler previous = std::move(State().abortHandler);
    State().abortHandler = std::move(handler);
    return previous;
}

std::vector<VelModuleInfo> velLoadedModules()
{
    std::vector<VelModuleInfo> out;
    for (const auto& m : State().modules)
        out.push_back({m->path, m->locked, m->mdiAware});
    return out;
}

void velUnloadAllModules()
{
    while (!State().modules.empty()) {
        const std::string path = State().modules.back()->path;
        const std::size_t before = State().modules.size();
        acrxDynamicLinker()->unloadModule(path.c_str(), false, true);
        if (State().modules.size() >= before)
            break;
    }
}

void velBroadcastAppMessage(AcRx::AppMsgCode message)
{
    std::vector<LoadedModule*> modules;
    for (auto& m : State().modules)
        modules.push_back(m.get());
    for (LoadedModule* m : modules) {
        if (FindByApp(m) == nullptr || m->unloading)
            continue;
        try {
            Send(m, message);
        } catch (const std::exception& e) {
            acutPrintf("Le module %s a échoué sur un message de dessin : %s\n", m->path.c_str(), e.what());
        }
    }
}
