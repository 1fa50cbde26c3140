// What the host loads: the module's objects, built in this order when the library is
// loaded (the schedule, the resources, the per-document records), the attach and detach
// of the library, and the host's entry point.
#include "module/module_object.hpp"
#include "module/siblings.hpp"
#include "schedule/schedule_store.hpp"

namespace zodevi {

namespace {

// The schedule's constructor finds its default file through the main services; the
// environment is in place before it, and the metre module it exchanges with.
struct CurrentSchedule {
    CurrentSchedule()
    {
        SetBdrEnvironment(&environment);
        SetBdrMetre(&MetreModule());
        bdr = std::make_unique<CZodEVIBdr>();
        SetCurrentBdr(bdr.get());
    }
    ~CurrentSchedule()
    {
        SetCurrentBdr(nullptr);
        bdr.reset();
        SetBdrMetre(nullptr);
        SetBdrEnvironment(nullptr);
    }
    MainServicesEnvironment environment;
    std::unique_ptr<CZodEVIBdr> bdr;
};

struct DocumentRecords {
    DocumentRecords() { SetDocumentManager(&documents); }
    ~DocumentRecords() { SetDocumentManager(nullptr); }
    CZodEVIDocuments documents;
};

int g_resourceAnchor = 0;

// Library attach and detach: built after the objects above, destroyed before them.
struct Library {
    Library()
    {
        Resources().instance = &g_resourceAnchor;
        Resources().resource = &g_resourceAnchor;
        Resources().initialised = true;
        SetModuleObject(new CVelSrvModul());
    }
    ~Library()
    {
        Resources().initialised = false;
        delete ModuleObject();
        SetModuleObject(nullptr);
    }
};

CurrentSchedule g_schedule;
DocumentRecords g_documents;
Library g_library;

} // namespace

} // namespace zodevi

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message,
                                                                                  void* packet)
{
    zodevi::CVelSrvModul* module = zodevi::ModuleObject();
    if (module == nullptr)
        return AcRx::kRetError;
    return module->OnAppMessage(message, packet);
}
