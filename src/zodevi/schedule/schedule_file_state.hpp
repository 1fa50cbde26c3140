// What a schedule knows of its file: the version it read or last wrote, whether its last
// reading failed and why, and the changes made in memory since, kept so that they can be
// made again on a newer version of the file.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "velhost/files.h"

namespace zodevi {

class CZodEVIBdr;

struct CZodEVIBdrFileState {
    // The file the facts below are about; a schedule given another path knows nothing of
    // that one.
    std::string path;
    // False until a read or a write: the version then on disk is unknown.
    bool known = false;
    VelFileIdentity identity;
    // The file exists but could not be read: nothing may replace it.
    bool notRead = false;
    std::string notReadReason;
    // Changes made in memory since the version above, in order.
    std::vector<std::function<void(CZodEVIBdr&)>> pending;
};

} // namespace zodevi
