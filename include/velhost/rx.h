// Runtime registry of the stand-in host: the system registry and its dictionaries, the
// service dictionary, the dynamic linker that loads modules (<Name>.arx shared
// libraries), service symbol lookup and the host's fatal exit.
#pragma once

#include <functional>
#include <map>
#include <string>
#include <vector>

#pragma GCC visibility push(default)

namespace AcRx {
// Messages the host sends to a module's acrxEntryPoint.
enum AppMsgCode {
    kNullMsg = 0,
    kInitAppMsg = 1,
    kUnloadAppMsg = 2,
    kLoadDwgMsg = 3,
    kUnloadDwgMsg = 4,
};
// What acrxEntryPoint answers; kRetError to kInitAppMsg makes the host unload the module.
enum AppRetCode { kRetOK = 0, kRetError = 3 };
} // namespace AcRx

// Signature of the entry point every module exports (extern "C").
using AcRxEntryPointFn = AcRx::AppRetCode (*)(AcRx::AppMsgCode message, void* appId);

// Release of the host's module interface that these headers describe.
inline constexpr int kAcRxApiVersion = 15;
// Signature of acrxGetApiVersion, which every module exports (extern "C") and answers
// the release it was built for. The kit supplies it (velhost_module, which
// vel_add_module links): a module does not write it.
using AcRxGetApiVersionFn = int (*)();

// Base of everything the host files in its dictionaries.
class AcRxObject {
public:
    virtual ~AcRxObject();
    // Name of the most derived host class, for listings.
    virtual const char* className() const;
};

// A named service; modules derive their service objects from it.
class AcRxService : public AcRxObject {
public:
    const char* className() const override;
};

// Name -> object map of the system registry; it does not own what it holds. Keys are
// exact (service names are compared as given).
class AcRxDictionary : public AcRxObject {
public:
    const char* className() const override;
    // The object filed under key, or null.
    AcRxObject* at(const char* key) const;
    // Files obj under key and answers what was there before (null when nothing).
    AcRxObject* atPut(const char* key, AcRxObject* obj);
    // Takes the entry out and answers its object (null when absent); the caller owns it.
    AcRxObject* remove(const char* key);
    bool has(const char* key) const;
    unsigned numEntries() const;
    // Keys in ascending order.
    std::vector<std::string> keys() const;

private:
    std::map<std::string, AcRxObject*, std::less<>> entries_;
};

// The host's root dictionary: "ServiceDictionary", "DynamicLinker" and
// "ACAD_REGISTERED_COMMANDS" live in it.
AcRxDictionary* acrxSysRegistry();

// Symbols of a service registered in-process (no shared library behind it).
using VelSymbolTable = std::map<std::string, void*, std::less<>>;

// Loads and unloads modules and keeps what they registered.
class AcRxDynamicLinker : public AcRxObject {
public:
    const char* className() const override;
    // dlopen, acrxGetApiVersion, then acrxEntryPoint(kInitAppMsg, appId). A module that
    // cannot be found or opened, lacks one of the two symbols, was built for another
    // release of the interface or refuses to start is closed again, and a message says
    // which step failed. A module already loaded answers true without a second start. printit prints the
    // success message; asCmd marks a load asked for by the user (only used in messages).
    bool loadModule(const char* fileName, bool printit, bool asCmd = false);
    // kUnloadAppMsg, then dlclose. A locked module (one that never called
    // unlockApplication) or one that answers kRetError stays loaded, unless forced.
    bool unloadModule(const char* fileName, bool asCmd = false, bool force = false);
    // Files the service in "ServiceDictionary", remembering the module that is running
    // (its symbols answer acrxGetServiceSymbolAddr). Answers the service filed before
    // under that name, or null.
    AcRxObject* registerService(const char* serviceName, AcRxService* service);
    bool unlockApplication(void* appId);
    bool lockApplication(void* appId);
    bool isApplicationLocked(const char* fileName) const;
    bool registerAppMDIAware(void* appId);
    bool registerAppNotMDIAware(void* appId);
};

AcRxDynamicLinker* acrxDynamicLinker();

// Same as acrxDynamicLinker()->loadModule; a name without folder is searched with
// acedFindFile.
bool acrxLoadModule(const char* fileName, bool printit, bool asCmd = false);
bool acrxUnloadModule(const char* fileName, bool asCmd = false);

bool acrxServiceIsRegistered(const char* serviceName);

// How velLoadServiceModule went.
struct VelServiceModule {
    enum Status {
        kRegistered, // the service was there: nothing was searched
        kLoaded,     // the module was found, loaded, and registered the service
        kNotFound,   // no candidate file was found
        kNotLoaded,  // the file was found but did not load (the loader said why)
        kNoService,  // the module loaded without registering the service
    };
    Status status = kNotFound;
    std::string path; // the module file found, "" when none was
    explicit operator bool() const { return status == kRegistered || status == kLoaded; }
};

// Makes sure a sibling's service is registered: when it is not, the first of the
// candidate file names that acedFindFile finds is loaded (printing, as a command).
VelServiceModule velLoadServiceModule(const char* serviceName, const std::vector<std::string>& candidates);

// Address of symbolName in the module that registered serviceName (or in the table of a
// service registered in-process); null when either is unknown.
void* acrxGetServiceSymbolAddr(const char* serviceName, const char* symbolName);

// Registers a service without a module, with the symbols it offers: lets a test or the
// host itself stand in for a sibling module.
void velRegisterInProcessService(const char* serviceName, AcRxService* service, VelSymbolTable symbols);

// Takes serviceName out of "ServiceDictionary" only while service is what is filed there,
// so that nobody removes a service that another filed since under that name; answers
// whether it did. The caller still owns service.
bool velUnregisterService(const char* serviceName, const AcRxService* service);

// Full path of the module whose code the host is running (entry point or command);
// "" when the host itself is running.
const char* acedGetAppName();

// Prints the message (a printf format) and ends the host with a failure status. The
// handler decides how it ends: velhost names the script line; tests throw.
[[noreturn]] void acrx_abort(const char* format, ...) __attribute__((format(printf, 1, 2)));
using VelAbortHandler = std::function<void(const std::string& message)>;
// Installs a handler (an empty one restores the default: print to stderr, exit(1)).
// A handler that returns still ends the process. Answers the previous handler.
VelAbortHandler velSetAbortHandler(VelAbortHandler handler);

// What the host knows of one loaded module.
struct VelModuleInfo {
    std::string path;
    bool locked = true;
    bool mdiAware = false;
};

// Loaded modules, in load order.
std::vector<VelModuleInfo> velLoadedModules();

// Unloads every module, the last loaded first (forced: locks are ignored).
void velUnloadAllModules();

// Sends a drawing message (kLoadDwgMsg/kUnloadDwgMsg) to every loaded module.
void velBroadcastAppMessage(AcRx::AppMsgCode message);

#pragma GCC visibility pop
