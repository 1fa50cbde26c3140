// The command interpreter of velhost: built-in commands (drawings, modules, system
// variables, documents) and the commands that modules register, line by line.
#pragma once

#include <string>

// What one line did.
enum class VelLineResult { kDone, kFailed, kQuit };

class VelShell {
public:
    // Runs one line as typed at the "Commande: " prompt; error receives the French
    // message of a failure.
    VelLineResult runLine(const std::string& line, std::string& error);
    // Reads and runs lines from the current user interface until the input ends or QUIT;
    // answers the process exit status (0 when every line ran, 1 after a failed line, which
    // ends a script), then shuts down.
    int run();
    // Opens a drawing (a new empty one for ""), as the OPEN command does.
    bool openDrawing(const std::string& path, std::string& error);
    // Closes every drawing without saving (saying which had changes), then unloads every
    // module, the last loaded first.
    void shutdown();
};

// "<Name>.arx" for a name without extension; the name itself otherwise.
std::string velModuleFileName(const std::string& name);
