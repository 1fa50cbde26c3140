// The host's settings and user profile: the modules and profile folders, INI files
// read and written as Windows does, and the registry kept in a file of the profile.
#pragma once

#include <string>
#include <string_view>

#include "velhost/read_result.h"

#pragma GCC visibility push(default)

struct VelHostSettings {
    std::string modulesDir;  // where modules are looked for first
    std::string profileDir;  // holds the registry file and the user's settings
    std::string profileName; // CPROFILE
};

VelHostSettings& velHostSettings();

// Default profile folder: $XDG_CONFIG_HOME/velhost, else ~/.config/velhost.
std::string velDefaultProfileDir();

// Reads a value as GetPrivateProfileString does: section and key without regard to
// case, the value trimmed and unquoted, def (trimmed) when the file, section or key is
// missing; at most bufferSize - 1 bytes, cut at a character boundary.
std::string velGetPrivateProfileString(std::string_view section, std::string_view key, std::string_view def,
                                       const std::string& fileName, std::size_t bufferSize);

// Writes a value as WritePrivateProfileString does: the key's value is replaced where it
// stands, a new key ends its section, a new section ends the file, a missing file is
// created; every other byte of the file stays as it was. A null value removes the key,
// a null key the whole section. Texts holding a line break, a key holding "=" or a
// section holding "]" are refused. False with errno set on failure; the file is then
// unchanged (it is replaced only once the new one is complete).
bool velWritePrivateProfileString(const char* section, const char* key, const char* value, const std::string& fileName);

// True for one of the seven root key names ("HKEY_CURRENT_USER"...), any case.
bool velIsRegistryRoot(std::string_view name);

// Registry values, kept in the profile's "registre.reg": keys are paths of names
// separated by "\" under a root, compared without regard to case, as value names are.
// A query fails for an empty or missing key or value, or a value longer than maxBytes.
bool velRegQueryValue(std::string_view root, std::string_view keyPath, std::string_view valueName, std::string& out,
                      std::size_t maxBytes);
// Creates the key when it does not exist and sets the value (text).
bool velRegSetValue(std::string_view root, std::string_view keyPath, std::string_view valueName,
                    std::string_view value);
// Path of the registry file, and a check of it: a refusal names the file and, for a
// malformed file, the line.
std::string velRegistryFile();
VelReadResult velCheckRegistry();

#pragma GCC visibility pop
