// Entry point of the network sizing stand-in (VelReseDimVRD15.arx): its service, its
// commands, and the two functions the metre module calls by name.
#include <cstdint>
#include <string>
#include <vector>

#include "network_commands.hpp"
#include "network_records.hpp"
#include "velhost/documents.h"
#include "velhost/rx.h"
#include "velsiblings/network_services.h"

namespace {

class CVelReseDimSrv final : public AcRxService {
public:
    const char* className() const override { return "CVelReseDimSrv"; }
};

CVelReseDimSrv* g_service = nullptr;

void RemoveService()
{
    velUnregisterService(kVelNetworkServicesName, g_service);
    delete g_service;
    g_service = nullptr;
}

} // namespace

// 0 the records are written, 1 no drawing is open, 2 the drawing refused a change.
std::int32_t Rsx_WriteXDataMetres()
{
    AcDbDatabase* database = acdbHostApplicationServices()->workingDatabase();
    if (database == nullptr)
        return 1;
    network::RecordReport report;
    std::vector<std::string> warnings;
    return network::WriteNetworkQuantities(*database, report, warnings);
}

// 0 the list holds the network's projects, 1 none (or no drawing), 2 a null argument.
std::int32_t Rsx_GetRsxFromType(std::string* networkName, std::vector<std::string>* projects)
{
    return network::ProjectsOfNetwork(acdbHostApplicationServices()->workingDatabase(), networkName, projects);
}

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message, void* appId)
{
    switch (message) {
    case AcRx::kInitAppMsg:
        acrxDynamicLinker()->unlockApplication(appId);
        acrxDynamicLinker()->registerAppMDIAware(appId);
        if (g_service == nullptr) {
            g_service = new CVelReseDimSrv();
            acrxDynamicLinker()->registerService(kVelNetworkServicesName, g_service);
        }
        if (!network::AddCommands()) {
            RemoveService();
            return AcRx::kRetError;
        }
        return AcRx::kRetOK;
    case AcRx::kUnloadAppMsg:
        network::RemoveCommands();
        RemoveService();
        return AcRx::kRetOK;
    default:
        return AcRx::kRetOK;
    }
}
