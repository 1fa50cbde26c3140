// Links between the pieces of the host library that modules never see: which module
// is running, and the clean-up after a module has gone.
#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "velhost/read_result.h"

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

// Replaces a file with velWriteFileAtomically; false with errno set, the old file
// untouched, on failure.
bool velReplaceFile(const std::string& fileName, const std::string& content);

// Why the process's terminal cannot show a full-screen dialog (input or output not a
// terminal, TERM unset, "dumb", unknown or unable to place the cursor); "" when it can.
std::string velScreenTerminalProblem();

// True while a dialog's screen view holds the terminal: output then waits for its end.
bool velDialogScreenShowing();
// Gives the terminal back to the command line (a question to ask) until the dialog's
// screen view next draws.
void velSuspendDialogScreen();

// INI text as Windows reads and writes it, apart from the file: the value of a key; the
// names WritePrivateProfileString accepts; the text with a key set, a key removed (null
// value) or a section removed (null key), false when that changes nothing.
std::string velIniValue(const std::string& content, std::string_view section, std::string_view key,
                        std::string_view def, std::size_t bufferSize);
bool velIniNamesValid(const char* section, const char* key, const char* value);
bool velIniSetValue(std::string& content, const char* section, const char* key, const char* value);

// The registry file's text apart from the file: its keys with their values, read (a
// refusal names the file and the line) and written back.
struct VelRegistryKey {
    std::string path; // ROOT\a\b, as first written
    std::vector<std::pair<std::string, std::string>> values;
};
VelReadResult velParseRegistry(const std::string& text, const std::string& fileName, std::vector<VelRegistryKey>& keys);
std::string velSerializeRegistry(const std::vector<VelRegistryKey>& keys);
