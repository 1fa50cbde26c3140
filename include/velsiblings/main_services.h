// The main services module's service object, as the modules of the family call it:
// messages, information texts, the parameter file, data files and folders, the list of
// loaded family modules and the command list. Filed as "VelantoMainServices r17.2".
#pragma once

#include <string>
#include <vector>

#include "velhost/rx.h"

#pragma GCC visibility push(default)

inline constexpr const char* kVelMainServicesName = "VelantoMainServices r17.2";
inline constexpr const char* kVelMainServicesModule = "Vel2000Srv.arx";

// Location codes of FindDataFile: a code is a set of these folders, searched in this
// order.
enum VelDataLocation : int {
    kVelLocDrawingFolder = 0x01, // the current drawing's folder
    kVelLocWorkingFolder = 0x02, // the working folder
    kVelLocUserData = 0x04,      // the user's data folder (GetDataFolder(1))
    kVelLocSupportPath = 0x10,   // the host's support path (acedFindFile)
    kVelLocSharedData = 0x20,    // the family's shared data folder (GetDataFolder(2))
};

class CVelMainServices : public AcRxService {
public:
    // Information text for the user (a banner, a command's description).
    virtual void ShowInfo(const std::string& text) = 0;
    // Name of the product family, for titles.
    virtual std::string GetProductName() const = 0;
    // Folder for a folder code, ending with "/": 1 the user's data, 2 the shared data,
    // anything else the profile folder.
    virtual std::string GetDataFolder(int code) = 0;
    // The user's parameter file (an INI file of the profile).
    virtual std::string GetParameterFile() = 0;
    virtual void RegisterModule(const std::string& moduleName) = 0;
    virtual void UnregisterModule(const std::string& moduleName) = 0;
    // Family modules registered, in registration order.
    virtual std::vector<std::string> RegisteredModules() const = 0;
    // The owner of the family's modal dialogs; never null.
    virtual void* GetParentWindow() = 0;
    // True while the main services themselves are going away: modules then need not
    // unregister.
    virtual bool UnloadQuery() = 0;
    // Full path of a data file searched in the folders of a location code; "" if none.
    virtual std::string FindDataFile(const std::string& fileName, int locationCode) = 0;
    // Shows a command list made of "global|local" lines.
    virtual void ShowCommandList(const std::string& title, const std::string& moduleName, int first, int width,
                                 const std::vector<std::string>& lines) = 0;
    // A message text or format by number; "" for an unknown number. The text stays the
    // main services'.
    virtual const char* GetMessageText(int number) = 0;
};

#pragma GCC visibility pop
