// The module's service object and the current schedule that the exported functions
// (declared in zodevi/api.h) work on.
#pragma once

#include <string>

#include "schedule/schedule_store.hpp"
#include "velhost/rx.h"

// What the module files under "VelantoZodEVIServices r17.2"; it only makes the
// service name known, the exported functions hold no state of their own. A global name:
// its type information is exported under it.
class __attribute__((visibility("default"))) CVelZodEVISrv : public AcRxService {
public:
    const char* className() const override { return "CVelZodEVISrv"; }
    void SetVersion(const std::string& version) { version_ = version; }
    const std::string& GetVersion() const { return version_; }
    void SetApplicationName(const std::string& name) { applicationName_ = name; }
    const std::string& GetApplicationName() const { return applicationName_; }

private:
    std::string applicationName_ = "???";
    std::string version_ = "10.0";
};

namespace zodevi {

// The schedule the exported functions apply to: the module's one schedule, or null
// before it is built and after it is gone (the functions then answer failure).
CZodEVIBdr* CurrentBdr();
void SetCurrentBdr(CZodEVIBdr* bdr);

} // namespace zodevi
