// Linked into every module (velhost_module): the release of the host interface that the
// module was built against, which the host checks before it calls anything else.
#include "velhost/rx.h"

extern "C" __attribute__((visibility("default"))) int acrxGetApiVersion()
{
    return kAcRxApiVersion;
}
