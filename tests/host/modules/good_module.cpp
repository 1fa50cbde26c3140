// Test module: registers a service with an exported function and a command that asks a
// Yes/No question, and takes both away again at unload.
#include <string>

#include "velhost/commands.h"
#include "velhost/editor.h"
#include "velhost/rx.h"

namespace {

class GoodService : public AcRxService {};

GoodService* g_service = nullptr;

void AskCommand()
{
    acedInitGet(0, "Oui Non _ Yes No");
    std::string answer;
    const int status = acedGetKword("\nContinuer ? [Oui/Non] <Oui> : ", answer);
    if (status == RTNORM)
        acutPrintf("réponse=%s\n", answer.c_str());
    else if (status == RTNONE)
        acutPrintf("réponse=défaut\n");
    else
        acutPrintf("réponse=annulée\n");
}

void NameCommand()
{
    acutPrintf("module=%s\n", acedGetAppName());
}

} // namespace

extern "C" __attribute__((visibility("default"))) int VelTest_Answer()
{
    return 42;
}

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message, void* appId)
{
    switch (message) {
    case AcRx::kInitAppMsg:
        acrxDynamicLinker()->unlockApplication(appId);
        acrxDynamicLinker()->registerAppMDIAware(appId);
        g_service = new GoodService;
        acrxDynamicLinker()->registerService("VelTestGoodService", g_service);
        acedRegCmds()->addCommand("VELTEST_GOOD", "VelTestAsk", "TestDemande", ACRX_CMD::kModal, AskCommand);
        acedRegCmds()->addCommand("VELTEST_GOOD", "VelTestName", "TestNom", ACRX_CMD::kModal, NameCommand);
        acutPrintf("good: init\n");
        break;
    case AcRx::kUnloadAppMsg:
        acedRegCmds()->removeGroup("VELTEST_GOOD");
        velUnregisterService("VelTestGoodService", g_service);
        delete g_service;
        g_service = nullptr;
        acutPrintf("good: unload\n");
        break;
    case AcRx::kLoadDwgMsg:
        acutPrintf("good: load dwg\n");
        break;
    case AcRx::kUnloadDwgMsg:
        acutPrintf("good: unload dwg\n");
        break;
    default:
        break;
    }
    return AcRx::kRetOK;
}
