// The configuration services module's service object and the pages of the family's
// configuration dialog. Filed as "VelantoConfigServices r17.2".
#pragma once

#include <string>
#include <vector>

#include "velhost/rx.h"

#pragma GCC visibility push(default)

inline constexpr const char* kVelConfigServicesName = "VelantoConfigServices r17.2";
inline constexpr const char* kVelConfigServicesModule = "VelSrvConfig15.arx";

// Messages the dialog sends to its pages.
constexpr unsigned kVelWmUser = 0x0400;
constexpr unsigned kVelConfigApply = kVelWmUser + 1001;   // the user confirmed: commit
constexpr unsigned kVelConfigRelease = kVelWmUser + 1002; // the dialog is closing

// One page of the dialog. The dialog owns the pages it creates and deletes them.
class CVelConfigPage {
public:
    virtual ~CVelConfigPage() = default;
    // Lets the user work on the page (fields, buttons); false when the user cancels.
    virtual bool Run() = 0;
    // A message of the dialog; answers the message's result.
    virtual long OnMessage(unsigned message) = 0;
};

// The function a module exports to create its page: stores the new page in *page, made
// as a child of parent (the dialog).
using VelCreateConfigPageFn = void(CVelConfigPage** page, void* parent);

// A page as a module registered it.
struct VelConfigPageEntry {
    std::string section;        // section title of the dialog
    std::string createFunction; // exported name of the page's creation function
    std::string moduleName;     // registering module, without its version digits
    std::string pageTitle;
    std::string modulePath; // file of the module that registered it
};

class CVelConfigServices : public AcRxService {
public:
    // Records a page; a second registration of the same function replaces the first.
    virtual void RegisterConfigPage(const std::string& section, const std::string& createFunction,
                                    const std::string& moduleName, const std::string& pageTitle) = 0;
    virtual std::vector<VelConfigPageEntry> RegisteredPages() const = 0;
};

#pragma GCC visibility pop
