// Shared test helpers: a scripted user interface whose answers and output are strings,
// and an abort handler that throws instead of ending the test process.
#pragma once

#include <sstream>
#include <string>

#include "velhost/rx.h"
#include "velhost/ui.h"

// Installs a scripted back-end reading `script` for the test's lifetime.
class ScriptedSession {
public:
    explicit ScriptedSession(const std::string& script = "")
        : input(script), ui(input, output, "essai.scr")
    {
        previous = velSetUI(&ui);
    }
    ~ScriptedSession() { velSetUI(previous); }
    ScriptedSession(const ScriptedSession&) = delete;
    ScriptedSession& operator=(const ScriptedSession&) = delete;

    std::string Output() const { return output.str(); }
    void ClearOutput() { output.str(""); }

    std::istringstream input;
    std::ostringstream output;
    VelScriptedUI ui;

private:
    VelUserInterface* previous = nullptr;
};

// What acrx_abort threw.
struct AbortCalled {
    std::string message;
};

// Turns acrx_abort into an exception for the test's lifetime.
class AbortCatcher {
public:
    AbortCatcher()
    {
        previous = velSetAbortHandler([](const std::string& message) { throw AbortCalled{message}; });
    }
    ~AbortCatcher() { velSetAbortHandler(previous); }
    AbortCatcher(const AbortCatcher&) = delete;
    AbortCatcher& operator=(const AbortCatcher&) = delete;

private:
    VelAbortHandler previous;
};
