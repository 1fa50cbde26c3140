// Test module: reaches a sibling that does not exist, which ends the host.
#include "velhost/rx.h"

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message, void* appId)
{
    if (message == AcRx::kInitAppMsg) {
        acrxDynamicLinker()->unlockApplication(appId);
        acrx_abort("Impossible de trouver le module <%s>!!!", "Absent.arx");
    }
    return AcRx::kRetOK;
}
