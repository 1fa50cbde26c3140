// Parameters kept in INI files or the registry, the message boxes and the Yes/No
// question on the host's command line.
#pragma once

#include <string>

namespace zodevi {

// The INI read limit: a longer value is cut to 4095 bytes.
inline constexpr std::size_t kIniReadBufferSize = 4096;

// Reads a key of an INI file, or a registry value when file is one of the registry root
// names (the section is then the key path). An INI read always answers true (the default
// when file, section or key is missing); a registry read answers its success.
bool ReadParameter(const char* file, const char* section, const char* key, const char* defaultValue, std::string& out);

// Writes a key; a failed INI write is reported once per file (ReportParameterError).
bool WriteParameter(const char* file, const char* section, const char* key, const char* value);

// Shows why a parameter file could not be written, unless that file was the last one
// written or reported.
void ReportParameterError(const char* file);

// Registry values under a root name; failures are silent.
bool ReadRegistryValue(const char* root, const char* section, const char* valueName, std::string& out);
bool WriteRegistryValue(const char* root, const char* section, const char* valueName, const char* value);

// Message box with a printf format: with an owner, caption "VELANTO" and the warning
// icon; without, the host's caption and style 0. Answers the button chosen.
int MessageBoxText(void* owner, const char* format, ...) __attribute__((format(printf, 2, 3)));
// Same with the caller's style.
int MessageBoxFlags(void* owner, unsigned flags, const char* format, ...) __attribute__((format(printf, 3, 4)));

// Asks a Yes/No question on the command line ("Oui"/"Non"); true when an answer was
// obtained, then stored in answer.
bool AskYesNo(const char* question, bool hasDefault, bool defaultIsYes, bool& answer);

// The name of the last parameter file written or reported, for tests and diagnostics.
const std::string& LastParameterFile();
void ResetLastParameterFile();

} // namespace zodevi
