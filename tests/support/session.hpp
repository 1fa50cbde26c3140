// The user interface of a test: a scripted back-end whose answers and output are strings,
// the answers of a terminal, and an abort handler that throws instead of ending the test.
#pragma once

#include <sstream>
#include <string>

#include "velhost/rx.h"
#include "velhost/ui.h"

// Installs a scripted back-end reading `script` for the test's lifetime.
class ScriptedSession {
public:
    explicit ScriptedSession(const std::string& script = "", const std::string& name = "essai.scr")
        : input(script), ui(input, output, name)
    {
        previous = velSetUI(&ui);
    }
    ~ScriptedSession() { velSetUI(previous); }
    ScriptedSession(const ScriptedSession&) = delete;
    ScriptedSession& operator=(const ScriptedSession&) = delete;

    std::string Output() const { return output.str(); }
    void ClearOutput() { output.str(""); }
    // Replaces what is left of the script.
    void Answer(const std::string& script)
    {
        input.clear();
        input.str(script);
    }

    std::istringstream input;
    std::ostringstream output;
    VelScriptedUI ui;

private:
    VelUserInterface* previous = nullptr;
};

// The user's answers on a terminal rather than in a script, for the test's lifetime.
class TerminalAnswers {
public:
    explicit TerminalAnswers(const std::string& answers) : input(answers), ui(input, output, false)
    {
        previous = velSetUI(&ui);
    }
    ~TerminalAnswers() { velSetUI(previous); }
    TerminalAnswers(const TerminalAnswers&) = delete;
    TerminalAnswers& operator=(const TerminalAnswers&) = delete;

    std::istringstream input;
    std::ostringstream output;
    VelTerminalUI ui;

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
