// Links between the pieces of the host library that modules never see: which module
// is running, and the clean-up after a module has gone.
#pragma once

#include <string>

// The module whose code runs (its appId), null for the host itself.
void* velCurrentApp();

// Marks a module as running for the scope (commands, entry point calls).
class VelAppScope {
 public:
  explicit VelAppScope(void* appId);
  ~VelAppScope();
  VelAppScope(const VelAppScope&) = delete;
  VelAppScope& operator=(const VelAppScope&) = delete;
};

// True while the module is loaded (its code may be called).
bool velIsLoadedApp(void* appId);

// Path of a loaded module, "" for null or unknown.
std::string velAppPath(void* appId);

// Converts "\" to "/" so that names written for Windows find Linux files.
std::string velNativePath(const std::string& name);

// Replaces a file once its new content is completely on disk, keeping its mode; false
// with errno set, the old file untouched, on failure.
bool velReplaceFile(const std::string& fileName, const std::string& content);

// Why the process's terminal cannot show a full-screen dialog (input or output not a
// terminal, TERM unset, "dumb", unknown or unable to place the cursor); "" when it can.
std::string velScreenTerminalProblem();

// True while a dialog's screen view holds the terminal: output then waits for its end.
bool velDialogScreenShowing();
// Gives the terminal back to the command line (a question to ask) until the dialog's
// screen view next draws.
void velSuspendDialogScreen();
