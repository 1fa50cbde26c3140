// Test module: the disk looks full while it is loaded; every write of the host's file
// writer fails with ENOSPC, as on a file system that has no space left.
#include <cerrno>

#include "velhost/files.h"
#include "velhost/rx.h"

namespace {

ssize_t NoSpace(int, const void*, size_t)
{
    errno = ENOSPC;
    return -1;
}

} // namespace

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message, void* appId)
{
    if (message == AcRx::kInitAppMsg) {
        acrxDynamicLinker()->unlockApplication(appId);
        velFileSystemCalls().write = &NoSpace;
    } else if (message == AcRx::kUnloadAppMsg) {
        velResetFileSystemCalls();
    }
    return AcRx::kRetOK;
}
