// The host's command stack: commands registered by modules in named groups, found by
// global or local name without regard to case, and run on behalf of their module.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "velhost/dbase.h"
#include "velhost/rx.h"

#pragma GCC visibility push(default)

using AcRxFunctionPtr = void (*)();

namespace ACRX_CMD {
constexpr int kModal = 0x00000000;
constexpr int kTransparent = 0x00000001;
constexpr int kUsePickSet = 0x00000002;
constexpr int kRedraw = 0x00000004;
constexpr int kNoUndoMarker = 0x00000008;
} // namespace ACRX_CMD

// One registered command.
struct AcEdCommand {
    std::string groupName;
    std::string globalName;
    std::string localName;
    int flags = 0;
    AcRxFunctionPtr function = nullptr;
    int functionCode = -1;
    void* resourceHandle = nullptr;
    // The module that registered it (its appId), null for the host.
    void* owner = nullptr;
};

// Walks the commands, group by group in registration order:
// `for (it = stack->iterator(); !it->done(); it->next())`.
class AcEdCommandIterator {
public:
    explicit AcEdCommandIterator(std::vector<AcEdCommand> snapshot);
    bool done() const;
    bool next();
    const AcEdCommand* command() const;
    const char* commandGroup() const;

private:
    std::vector<AcEdCommand> commands_;
    std::size_t pos_ = 0;
};

class AcEdCommandStack : public AcRxObject {
public:
    const char* className() const override;
    // eDuplicateKey when the group already has a command of that global or local name;
    // eInvalidInput for an empty group or name, a name with blanks, or no function.
    Acad::ErrorStatus addCommand(const char* groupName, const char* globalName, const char* localName, int flags,
                                 AcRxFunctionPtr function, void* uiContext = nullptr, int functionCode = -1,
                                 void* resourceHandle = nullptr);
    Acad::ErrorStatus removeCmd(const char* groupName, const char* globalName);
    Acad::ErrorStatus removeGroup(const char* groupName);
    // New iterator over a snapshot of the commands; delete it when done.
    AcEdCommandIterator* iterator() const;
    // A command by name: "_NAME" is looked up among global names only; otherwise local
    // names first, then global ones. Case does not matter. Null when unknown.
    const AcEdCommand* lookupCmd(const char* name) const;
    // Groups registered by a module (owner), so that the host can clean up after it.
    std::vector<std::string> groupsOf(void* owner) const;

private:
    std::vector<AcEdCommand> commands_;
};

AcEdCommandStack* acedRegCmds();

// Outcome of running a command by name.
enum class VelCommandResult { kDone, kUnknown, kFailed };

// Runs a registered command on behalf of its module (acedGetAppName answers the module
// during the call); a command that throws is stopped and reported. error receives the
// French message when the answer is not kDone.
VelCommandResult velRunCommand(const std::string& name, std::string& error);

// Makes the running command end as failed with this French message once it returns (a
// script then stops at the command's line); outside a command, nothing happens.
void velFailCommand(const std::string& message);

#pragma GCC visibility pop
