// Command stack: registration by group, look-up by local or global name without regard
// to case, and running a command on behalf of the module that registered it.
#include "velhost/commands.h"

#include <algorithm>
#include <exception>
#include <optional>

#include "host_internal.h"
#include "text/text.hpp"
#include "velhost/documents.h"

AcEdCommandIterator::AcEdCommandIterator(std::vector<AcEdCommand> snapshot) : commands_(std::move(snapshot)) {}

bool AcEdCommandIterator::done() const
{
    return pos_ >= commands_.size();
}

bool AcEdCommandIterator::next()
{
    if (pos_ < commands_.size())
        ++pos_;
    return !done();
}

const AcEdCommand* AcEdCommandIterator::command() const
{
    return done() ? nullptr : &commands_[pos_];
}

const char* AcEdCommandIterator::commandGroup() const
{
    return done() ? "" : commands_[pos_].groupName.c_str();
}

const char* AcEdCommandStack::className() const
{
    return "AcEdCommandStack";
}

namespace {

// The failure a command's dialog reported, while commands run (they may nest).
struct CommandFailure {
    int depth = 0;
    std::optional<std::string> message;
};

CommandFailure& Failure()
{
    static CommandFailure failure;
    return failure;
}

bool ValidName(const char* name)
{
    if (name == nullptr || *name == '\0')
        return false;
    for (const char* p = name; *p; ++p)
        if (*p == ' ' || *p == '\t' || *p == '\n' || *p == '\r')
            return false;
    return true;
}

} // namespace

Acad::ErrorStatus AcEdCommandStack::addCommand(const char* groupName, const char* globalName, const char* localName,
                                               int flags, AcRxFunctionPtr function, void* uiContext, int functionCode,
                                               void* resourceHandle)
{
    (void)uiContext;
    if (!ValidName(groupName) || !ValidName(globalName) || !ValidName(localName) || function == nullptr)
        return Acad::eInvalidInput;
    for (const AcEdCommand& c : commands_) {
        if (!EqualsNoCase(c.groupName, groupName))
            continue;
        if (EqualsNoCase(c.globalName, globalName) || EqualsNoCase(c.localName, localName))
            return Acad::eDuplicateKey;
    }
    AcEdCommand cmd;
    cmd.groupName = groupName;
    cmd.globalName = globalName;
    cmd.localName = localName;
    cmd.flags = flags;
    cmd.function = function;
    cmd.functionCode = functionCode;
    cmd.resourceHandle = resourceHandle;
    cmd.owner = velCurrentApp();
    // Keep the commands of a group together so that the iterator walks group by group.
    auto last = std::find_if(commands_.rbegin(), commands_.rend(),
                             [&](const AcEdCommand& c) { return EqualsNoCase(c.groupName, groupName); });
    if (last == commands_.rend())
        commands_.push_back(std::move(cmd));
    else
        commands_.insert(last.base(), std::move(cmd));
    return Acad::eOk;
}

Acad::ErrorStatus AcEdCommandStack::removeCmd(const char* groupName, const char* globalName)
{
    if (groupName == nullptr || globalName == nullptr)
        return Acad::eInvalidInput;
    auto it = std::find_if(commands_.begin(), commands_.end(), [&](const AcEdCommand& c) {
        return EqualsNoCase(c.groupName, groupName) && EqualsNoCase(c.globalName, globalName);
    });
    if (it == commands_.end())
        return Acad::eKeyNotFound;
    commands_.erase(it);
    return Acad::eOk;
}

Acad::ErrorStatus AcEdCommandStack::removeGroup(const char* groupName)
{
    if (groupName == nullptr)
        return Acad::eInvalidInput;
    const auto before = commands_.size();
    std::erase_if(commands_, [&](const AcEdCommand& c) { return EqualsNoCase(c.groupName, groupName); });
    return commands_.size() == before ? Acad::eKeyNotFound : Acad::eOk;
}

AcEdCommandIterator* AcEdCommandStack::iterator() const
{
    return new AcEdCommandIterator(commands_);
}

const AcEdCommand* AcEdCommandStack::lookupCmd(const char* name) const
{
    if (name == nullptr || *name == '\0')
        return nullptr;
    std::string_view n(name);
    if (n.front() == '_') {
        n.remove_prefix(1);
        for (const AcEdCommand& c : commands_)
            if (EqualsNoCase(c.globalName, n))
                return &c;
        return nullptr;
    }
    for (const AcEdCommand& c : commands_)
        if (EqualsNoCase(c.localName, n))
            return &c;
    for (const AcEdCommand& c : commands_)
        if (EqualsNoCase(c.globalName, n))
            return &c;
    return nullptr;
}

std::vector<std::string> AcEdCommandStack::groupsOf(void* owner) const
{
    std::vector<std::string> groups;
    for (const AcEdCommand& c : commands_) {
        if (c.owner != owner)
            continue;
        if (std::none_of(groups.begin(), groups.end(),
                         [&](const std::string& g) { return EqualsNoCase(g, c.groupName); }))
            groups.push_back(c.groupName);
    }
    return groups;
}

AcEdCommandStack* acedRegCmds()
{
    return static_cast<AcEdCommandStack*>(acrxSysRegistry()->at("ACAD_REGISTERED_COMMANDS"));
}

VelCommandResult velRunCommand(const std::string& name, std::string& error)
{
    const AcEdCommand* found = acedRegCmds()->lookupCmd(name.c_str());
    if (found == nullptr) {
        error = FormatString("Commande inconnue \"%s\".", name.c_str());
        return VelCommandResult::kUnknown;
    }
    // The command may remove itself (an unload from inside): work on a copy.
    const AcEdCommand cmd = *found;
    VelAppScope scope(cmd.owner);
    acDocManagerPtr()->lockForCommand(cmd.globalName.c_str());
    VelCommandResult result = VelCommandResult::kDone;
    std::optional<std::string> outer = std::move(Failure().message);
    Failure().message.reset();
    ++Failure().depth;
    try {
        cmd.function();
    } catch (const std::exception& e) {
        error = FormatString("La commande %s a échoué : %s", cmd.globalName.c_str(), e.what());
        result = VelCommandResult::kFailed;
    }
    --Failure().depth;
    if (Failure().message && result == VelCommandResult::kDone) {
        error = *Failure().message;
        result = VelCommandResult::kFailed;
    }
    Failure().message = std::move(outer);
    acDocManagerPtr()->unlockAfterCommand(cmd.globalName.c_str());
    return result;
}

void velFailCommand(const std::string& message)
{
    if (Failure().depth > 0 && !Failure().message)
        Failure().message = message;
}
