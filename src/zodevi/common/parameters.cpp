// Parameter files (INI or registry), message boxes and the Yes/No question.
#include "common/parameters.hpp"

#include <cerrno>
#include <cstdarg>
#include <filesystem>

#include "text/text.hpp"
#include "velhost/editor.h"
#include "velhost/files.h"
#include "velhost/profile.h"
#include "velhost/ui.h"

namespace zodevi {

namespace {

// The registry value buffer: a longer value fails to read, as a too small buffer would.
constexpr std::size_t kRegistryValueSize = 8192;
constexpr const char* kOwnedCaption = "VELANTO";
constexpr const char* kHostCaption = "velhost";

std::string& LastFile()
{
    static std::string last;
    return last;
}

int ShowBox(void* owner, unsigned flags, const std::string& text)
{
    return velMessageBox(owner != nullptr ? kOwnedCaption : kHostCaption, text, flags);
}

} // namespace

const std::string& LastParameterFile()
{
    return LastFile();
}

void ResetLastParameterFile()
{
    LastFile().clear();
}

bool ReadRegistryValue(const char* root, const char* section, const char* valueName, std::string& out)
{
    if (root == nullptr || section == nullptr || *section == '\0')
        return false;
    return velRegQueryValue(root, section, valueName ? valueName : "", out, kRegistryValueSize);
}

bool WriteRegistryValue(const char* root, const char* section, const char* valueName, const char* value)
{
    if (root == nullptr || section == nullptr || *section == '\0' || value == nullptr)
        return false;
    return velRegSetValue(root, section, valueName ? valueName : "", value);
}

bool ReadParameter(const char* file, const char* section, const char* key, const char* defaultValue, std::string& out)
{
    if (file != nullptr && velIsRegistryRoot(file)) {
        if (defaultValue != nullptr)
            out = defaultValue;
        return ReadRegistryValue(file, section, key, out);
    }
    const char* def = defaultValue ? defaultValue : "";
    if (file == nullptr || section == nullptr || key == nullptr) {
        out = velGetPrivateProfileString("", "", def, "", kIniReadBufferSize);
        return true;
    }
    out = velGetPrivateProfileString(section, key, def, file, kIniReadBufferSize);
    return true;
}

bool WriteParameter(const char* file, const char* section, const char* key, const char* value)
{
    if (file != nullptr && velIsRegistryRoot(file))
        return WriteRegistryValue(file, section, key, value);
    if (file != nullptr && velWritePrivateProfileString(section, key, value, file)) {
        LastFile() = file;
        return true;
    }
    if (file == nullptr)
        errno = EINVAL;
    ReportParameterError(file);
    return false;
}

void ReportParameterError(const char* file)
{
    const int code = errno;
    const std::string name = file ? file : "";
    if (EqualsNoCase(name, LastFile()))
        return;
    std::error_code ec;
    // The code says little to a user: the reason and what to do follow it.
    const std::string why = code != 0 && code != EINVAL
                                ? "\n" + velFileErrorReason(code) + " : " + velFileErrorAdvice(code) + "."
                                : std::string();
    if (file == nullptr)
        MessageBoxText(nullptr, "Pointeur nul pour le fichier de paramètres !\n(Code d'erreur %d)%s", code,
                       why.c_str());
    else if (name.empty())
        MessageBoxText(nullptr, "Pas de nom pour le fichier de paramètres !\n(Code d'erreur %d)%s", code, why.c_str());
    else if (std::filesystem::exists(name, ec))
        MessageBoxText(nullptr, "%s :\nSauvegarde des paramètres imposssible !\n(Code d'erreur %d)%s", name.c_str(),
                       code, why.c_str());
    else
        MessageBoxText(nullptr, "%s :\nFichier de paramètres inexistant !\n(Code d'erreur %d)%s", name.c_str(), code,
                       why.c_str());
    LastFile() = name;
}

int MessageBoxText(void* owner, const char* format, ...)
{
    va_list args;
    va_start(args, format);
    const std::string text = format ? FormatStringV(format, args) : std::string();
    va_end(args);
    return ShowBox(owner, owner != nullptr ? MB_ICONWARNING : MB_OK, text);
}

int MessageBoxFlags(void* owner, unsigned flags, const char* format, ...)
{
    va_list args;
    va_start(args, format);
    const std::string text = format ? FormatStringV(format, args) : std::string();
    va_end(args);
    return ShowBox(owner, flags, text);
}

bool AskYesNo(const char* question, bool hasDefault, bool defaultIsYes, bool& answer)
{
    const char* yes = "Oui";
    const char* no = "Non";
    const std::string keywords = FormatString("%s %s _ Yes No", yes, no);
    const char* q = question ? question : "";
    std::string reply;
    if (hasDefault) {
        const std::string prompt = FormatString("\n%s [%s/%s] <%s> : ", q, yes, no, defaultIsYes ? yes : no);
        acedInitGet(0, keywords.c_str());
        const int status = acedGetKword(prompt.c_str(), reply);
        if (status == RTNONE)
            answer = defaultIsYes;
        else if (status == RTNORM)
            answer = EqualsNoCase(reply, "Yes");
        else
            return false;
        return true;
    }
    const std::string prompt = FormatString("\n%s [%s/%s] : ", q, yes, no);
    acedInitGet(RSG_NONULL, keywords.c_str());
    if (acedGetKword(prompt.c_str(), reply) != RTNORM)
        return false;
    answer = EqualsNoCase(reply, "Yes");
    return true;
}

} // namespace zodevi
