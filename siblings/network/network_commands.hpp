// The network sizing stand-in's commands: writing the networks' quantity records into the
// drawing, and bringing the price schedule up to date with the drawing's networks through
// the metre module's service functions.
#pragma once

#include <string>

namespace network {

inline constexpr const char* kCommandGroup = "VELANTO_RESEDIM_VRD";
inline constexpr const char* kUpdateGlobalName = "VelaRsxMajBordereau";
inline constexpr const char* kUpdateLocalName = "RsxMajBordereau";
inline constexpr const char* kRecordsGlobalName = "VelaRsxMetres";
inline constexpr const char* kRecordsLocalName = "RsxMetres";

// Address of a function the metre module exports, loading the module from the support
// path when its service is not registered yet; null when anything is missing.
void* FindZodEVIFunction(const char* symbol);

// Body of the update command on the current drawing; answers whether the schedule was
// written. Every outcome is printed on the command line.
bool UpdateSchedule();
// Body of the records command on the current drawing; answers whether they were written.
bool WriteRecordsCommand();

// Registers and removes the module's commands.
bool AddCommands();
void RemoveCommands();

} // namespace network
