// Test module of another release of the host interface: built with VEL_TEST_RELEASE it
// reports that release, built without it has no acrxGetApiVersion at all. The host must
// call neither it nor its entry point.
#include "velhost/editor.h"
#include "velhost/rx.h"

#ifdef VEL_TEST_RELEASE
extern "C" __attribute__((visibility("default"))) int acrxGetApiVersion()
{
    return VEL_TEST_RELEASE;
}
#endif

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode, void*)
{
    acutPrintf("release: entry point called\n");
    return AcRx::kRetOK;
}
