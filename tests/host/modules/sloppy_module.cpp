// Test module: stays locked and leaves its service, commands and document reactor
// registered at unload, so that the host must clean up after it.
#include "velhost/commands.h"
#include "velhost/documents.h"
#include "velhost/editor.h"
#include "velhost/rx.h"

namespace {

class SloppyService : public AcRxService {};

SloppyService g_service;

// Subscribes while the library opens and never unsubscribes.
struct Listener : AcApDocManagerReactor {
    Listener() { acDocManagerPtr()->addReactor(this); }
    void documentCreated(AcApDocument*) override { acutPrintf("sloppy: document\n"); }
};
Listener g_listener;

void HelloCommand()
{
    acutPrintf("sloppy: hello\n");
}

} // namespace

extern "C" __attribute__((visibility("default"))) int VelTest_Sloppy()
{
    return 7;
}

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message, void*)
{
    if (message == AcRx::kInitAppMsg) {
        acrxDynamicLinker()->registerService("VelTestSloppyService", &g_service);
        acedRegCmds()->addCommand("VELTEST_SLOPPY", "VelTestHello", "VelTestHello", ACRX_CMD::kModal, HelloCommand);
        acutPrintf("sloppy: init\n");
    } else if (message == AcRx::kUnloadAppMsg) {
        acutPrintf("sloppy: unload\n");
    }
    return AcRx::kRetOK;
}
