// INI files read and written as Windows does: sections and keys without regard to
// case, values trimmed and unquoted, and a write that keeps every other byte.
#include <cerrno>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <vector>

#include "host_internal.h"
#include "text/text.hpp"
#include "velhost/files.h"
#include "velhost/profile.h"

namespace fs = std::filesystem;

namespace {

std::string_view Trim(std::string_view t)
{
    const auto first = t.find_first_not_of(" \t\r");
    if (first == std::string_view::npos)
        return {};
    const auto last = t.find_last_not_of(" \t\r");
    return t.substr(first, last - first + 1);
}

VelReadResult ReadWhole(const std::string& fileName, std::string& content)
{
    std::ifstream in(fileName, std::ios::binary);
    if (!in) {
        const int err = errno;
        return VelReadResult::Failed(err == ENOENT ? VelReadStatus::kNotFound : VelReadStatus::kCannotOpen, fileName,
                                     err);
    }
    std::ostringstream buffer;
    buffer << in.rdbuf();
    if (in.bad())
        return VelReadResult::Failed(VelReadStatus::kCannotRead, fileName, errno != 0 ? errno : EIO);
    content = buffer.str();
    return {};
}

// Lines without their "\n" (a "\r" stays, so that the file's line ends survive).
std::vector<std::string> SplitLines(const std::string& content, bool& endsWithBreak)
{
    std::vector<std::string> lines;
    std::size_t start = 0;
    while (start < content.size()) {
        const auto end = content.find('\n', start);
        if (end == std::string::npos) {
            lines.push_back(content.substr(start));
            break;
        }
        lines.push_back(content.substr(start, end - start));
        start = end + 1;
    }
    endsWithBreak = !content.empty() && content.back() == '\n';
    return lines;
}

// Name of the section a line opens, or nullopt.
std::optional<std::string_view> SectionOf(std::string_view line)
{
    const std::string_view t = Trim(line);
    if (t.empty() || t.front() != '[')
        return std::nullopt;
    const auto close = t.find(']');
    return Trim(t.substr(1, close == std::string_view::npos ? std::string_view::npos : close - 1));
}

// Key of a "key=value" line, or nullopt for anything else (comments included).
std::optional<std::string_view> KeyOf(std::string_view line)
{
    const std::string_view t = Trim(line);
    if (t.empty() || t.front() == ';' || t.front() == '[')
        return std::nullopt;
    const auto eq = t.find('=');
    if (eq == std::string_view::npos)
        return std::nullopt;
    return Trim(t.substr(0, eq));
}

std::string_view ValueOf(std::string_view line)
{
    const auto eq = line.find('=');
    return Trim(line.substr(eq + 1));
}

std::string_view Unquote(std::string_view v)
{
    if (v.size() >= 2 && (v.front() == '"' || v.front() == '\'') && v.back() == v.front())
        return v.substr(1, v.size() - 2);
    return v;
}

std::string CutTo(std::string_view text, std::size_t bufferSize)
{
    if (bufferSize == 0)
        return {};
    std::size_t n = std::min(text.size(), bufferSize - 1);
    if (n < text.size())
        while (n > 0 && (static_cast<unsigned char>(text[n]) & 0xC0) == 0x80)
            --n;
    return std::string(text.substr(0, n));
}

bool HasBreak(const char* s)
{
    return s != nullptr && std::string_view(s).find_first_of("\r\n") != std::string_view::npos;
}

} // namespace

bool velReplaceFile(const std::string& fileName, const std::string& content)
{
    const VelReadResult written = velWriteFileAtomically(fileName, content);
    if (!written)
        errno = written.error;
    return static_cast<bool>(written);
}

std::string velIniValue(const std::string& content, std::string_view section, std::string_view key,
                        std::string_view def, std::size_t bufferSize)
{
    bool endsWithBreak = false;
    bool inSection = false;
    for (const std::string& line : SplitLines(content, endsWithBreak)) {
        if (auto name = SectionOf(line)) {
            inSection = EqualsNoCase(*name, Trim(section));
            continue;
        }
        if (!inSection)
            continue;
        if (auto k = KeyOf(line); k && EqualsNoCase(*k, Trim(key)))
            return CutTo(Unquote(ValueOf(line)), bufferSize);
    }
    return CutTo(Trim(def), bufferSize);
}

bool velIniNamesValid(const char* section, const char* key, const char* value)
{
    return section != nullptr && !Trim(section).empty() && !HasBreak(section) && !HasBreak(key) && !HasBreak(value) &&
           std::string_view(section).find(']') == std::string_view::npos &&
           (key == nullptr || (!Trim(key).empty() && std::string_view(key).find('=') == std::string_view::npos &&
                               Trim(key).front() != '[' && Trim(key).front() != ';'));
}

bool velIniSetValue(std::string& content, const char* section, const char* key, const char* value)
{
    bool endsWithBreak = true;
    std::vector<std::string> lines = SplitLines(content, endsWithBreak);
    const std::string eol = (!lines.empty() && !lines.front().empty() && lines.front().back() == '\r') ? "\r\n" : "\n";
    const std::string cr = eol.size() == 2 ? "\r" : "";

    std::size_t header = lines.size();
    for (std::size_t i = 0; i < lines.size(); ++i) {
        if (auto name = SectionOf(lines[i]); name && EqualsNoCase(*name, Trim(section))) {
            header = i;
            break;
        }
    }
    std::size_t end = header;
    if (header < lines.size()) {
        end = header + 1;
        while (end < lines.size() && !SectionOf(lines[end]))
            ++end;
    }

    if (key == nullptr) {
        if (header == lines.size())
            return false;
        lines.erase(lines.begin() + static_cast<std::ptrdiff_t>(header),
                    lines.begin() + static_cast<std::ptrdiff_t>(end));
    } else {
        std::size_t found = lines.size();
        for (std::size_t i = header + 1; i < end; ++i)
            if (auto k = KeyOf(lines[i]); k && EqualsNoCase(*k, Trim(key))) {
                found = i;
                break;
            }
        if (value == nullptr) {
            if (found == lines.size())
                return false;
            lines.erase(lines.begin() + static_cast<std::ptrdiff_t>(found));
        } else if (found != lines.size()) {
            lines[found] = std::string(*KeyOf(lines[found])) + "=" + value + cr;
        } else if (header != lines.size()) {
            std::size_t at = end;
            while (at > header + 1 && Trim(lines[at - 1]).empty())
                --at;
            lines.insert(lines.begin() + static_cast<std::ptrdiff_t>(at), std::string(Trim(key)) + "=" + value + cr);
        } else {
            lines.push_back("[" + std::string(Trim(section)) + "]" + cr);
            lines.push_back(std::string(Trim(key)) + "=" + value + cr);
            endsWithBreak = true;
        }
    }
    std::string out;
    for (std::size_t i = 0; i < lines.size(); ++i) {
        out += lines[i];
        if (i + 1 < lines.size() || endsWithBreak)
            out += '\n';
    }
    content = std::move(out);
    return true;
}

std::string velGetPrivateProfileString(std::string_view section, std::string_view key, std::string_view def,
                                       const std::string& fileName, std::size_t bufferSize)
{
    std::string content;
    if (fileName.empty() || !ReadWhole(fileName, content))
        content.clear();
    return velIniValue(content, section, key, def, bufferSize);
}

bool velWritePrivateProfileString(const char* section, const char* key, const char* value, const std::string& fileName)
{
    if (fileName.empty() || !velIniNamesValid(section, key, value)) {
        errno = EINVAL;
        return false;
    }
    // Read, changed and written under the lock, so that two programs writing different
    // keys at the same time both keep theirs.
    const VelFileLock lock(fileName);
    if (!lock.locked()) {
        errno = lock.result().error;
        return false;
    }
    std::string content;
    std::error_code ec;
    if (fs::exists(fileName, ec)) {
        // A file that exists but does not read is left alone rather than replaced by the
        // one key.
        if (const VelReadResult read = ReadWhole(fileName, content); !read) {
            errno = read.error != 0 ? read.error : EACCES;
            return false;
        }
    }
    if (!velIniSetValue(content, section, key, value))
        return true;
    return velReplaceFile(fileName, content);
}
