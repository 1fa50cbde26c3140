// Test module: registers a service, then refuses to start.
#include "velhost/editor.h"
#include "velhost/rx.h"

namespace {
class RefusingService : public AcRxService {};
RefusingService g_service;
} // namespace

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message, void*)
{
    if (message == AcRx::kInitAppMsg) {
        acrxDynamicLinker()->registerService("VelTestRefusingService", &g_service);
        return AcRx::kRetError;
    }
    acutPrintf("refusing: message %d\n", static_cast<int>(message));
    return AcRx::kRetOK;
}
