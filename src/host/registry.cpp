// The registry of the host, kept as text in the profile's "registre.reg": one
// "[ROOT\key\path]" line per key, then its values as "name"="text" (@ for the default
// value), with \\ \" \n \r \t escapes.
#include <cerrno>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>
#include <vector>

#include "host_internal.h"
#include "text/text.hpp"
#include "velhost/files.h"
#include "velhost/profile.h"

namespace fs = std::filesystem;

namespace {

const char* const kRoots[] = {"HKEY_LOCAL_MACHINE",    "HKEY_CURRENT_USER",   "HKEY_CLASSES_ROOT", "HKEY_USERS",
                              "HKEY_PERFORMANCE_DATA", "HKEY_CURRENT_CONFIG", "HKEY_DYN_DATA"};

using Key = VelRegistryKey;

std::string Escape(std::string_view text)
{
    std::string out;
    for (char c : text) {
        switch (c) {
        case '\\':
            out += "\\\\";
            break;
        case '"':
            out += "\\\"";
            break;
        case '\n':
            out += "\\n";
            break;
        case '\r':
            out += "\\r";
            break;
        case '\t':
            out += "\\t";
            break;
        default:
            out += c;
        }
    }
    return out;
}

// Reads a quoted text at pos (on the opening quote); false when it is not one.
bool ReadQuoted(const std::string& line, std::size_t& pos, std::string& out)
{
    if (pos >= line.size() || line[pos] != '"')
        return false;
    out.clear();
    for (++pos; pos < line.size(); ++pos) {
        char c = line[pos];
        if (c == '"') {
            ++pos;
            return true;
        }
        if (c == '\\') {
            if (++pos >= line.size())
                return false;
            switch (line[pos]) {
            case '\\':
                out += '\\';
                break;
            case '"':
                out += '"';
                break;
            case 'n':
                out += '\n';
                break;
            case 'r':
                out += '\r';
                break;
            case 't':
                out += '\t';
                break;
            default:
                return false;
            }
        } else {
            out += c;
        }
    }
    return false;
}

VelReadResult Load(std::vector<Key>& keys)
{
    const std::string file = velRegistryFile();
    std::error_code ec;
    if (!fs::exists(file, ec))
        return {};
    std::ifstream in(file, std::ios::binary);
    std::string text;
    if (in)
        text.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    if (!in.is_open() || in.bad())
        return VelReadResult::Failed(in.is_open() ? VelReadStatus::kCannotRead : VelReadStatus::kCannotOpen, file, 0,
                                     FormatString("%s : lecture impossible.", file.c_str()));
    return velParseRegistry(text, file, keys);
}

// ROOT\a\b with the root spelt as the table has it and no empty level; "" when invalid.
std::string FullPath(std::string_view root, std::string_view keyPath)
{
    const char* rootName = nullptr;
    for (const char* r : kRoots)
        if (EqualsNoCase(root, r))
            rootName = r;
    if (rootName == nullptr || keyPath.empty())
        return {};
    std::string out = rootName;
    std::string level;
    auto flush = [&]() {
        if (!level.empty())
            out += "\\" + level;
        level.clear();
    };
    for (char c : keyPath) {
        if (c == '\\' || c == '/')
            flush();
        else if (c == '\n' || c == '\r' || c == ']')
            return {};
        else
            level += c;
    }
    flush();
    return out == rootName ? std::string() : out;
}

Key* FindKey(std::vector<Key>& keys, const std::string& path)
{
    for (Key& k : keys)
        if (EqualsNoCase(k.path, path))
            return &k;
    return nullptr;
}

} // namespace

VelReadResult velParseRegistry(const std::string& text, const std::string& file, std::vector<VelRegistryKey>& keys)
{
    std::istringstream in(text);
    std::string line;
    int number = 0;
    // What was expected, as the registry's messages word it: "F, ligne N : <expected>."
    auto refuse = [&](const char* expected) {
        return VelReadResult::Malformed(file, number, expected,
                                        FormatString("%s, ligne %d : %s.", file.c_str(), number, expected));
    };
    while (std::getline(in, line)) {
        ++number;
        if (!line.empty() && line.back() == '\r')
            line.pop_back();
        if (line.empty() || line.front() == ';')
            continue;
        if (line.front() == '[') {
            if (line.back() != ']' || line.size() < 3)
                return refuse("\"]\" attendu à la fin de la clé");
            keys.push_back({line.substr(1, line.size() - 2), {}});
            continue;
        }
        if (keys.empty())
            return refuse("une clé \"[...]\" est attendue avant la première valeur");
        std::string name, value;
        std::size_t pos = 0;
        if (line.front() == '@')
            pos = 1;
        else if (!ReadQuoted(line, pos, name))
            return refuse("nom de valeur entre guillemets attendu");
        if (pos >= line.size() || line[pos] != '=' || !ReadQuoted(line, ++pos, value) || pos != line.size())
            return refuse("=\"texte\" attendu après le nom de valeur");
        keys.back().values.emplace_back(name, value);
    }
    return {};
}

std::string velSerializeRegistry(const std::vector<VelRegistryKey>& keys)
{
    std::string out;
    for (const Key& k : keys) {
        out += "[" + k.path + "]\n";
        for (const auto& [name, value] : k.values)
            out += (name.empty() ? std::string("@") : "\"" + Escape(name) + "\"") + "=\"" + Escape(value) + "\"\n";
        out += "\n";
    }
    return out;
}

bool velIsRegistryRoot(std::string_view name)
{
    for (const char* r : kRoots)
        if (EqualsNoCase(name, r))
            return true;
    return false;
}

std::string velRegistryFile()
{
    return (fs::path(velHostSettings().profileDir) / "registre.reg").string();
}

VelReadResult velCheckRegistry()
{
    std::vector<Key> keys;
    return Load(keys);
}

bool velRegQueryValue(std::string_view root, std::string_view keyPath, std::string_view valueName, std::string& out,
                      std::size_t maxBytes)
{
    const std::string path = FullPath(root, keyPath);
    std::vector<Key> keys;
    if (path.empty() || !Load(keys))
        return false;
    Key* key = FindKey(keys, path);
    if (key == nullptr)
        return false;
    for (const auto& [name, value] : key->values) {
        if (!EqualsNoCase(name, valueName))
            continue;
        if (value.size() >= maxBytes)
            return false;
        out = value;
        return true;
    }
    return false;
}

bool velRegSetValue(std::string_view root, std::string_view keyPath, std::string_view valueName, std::string_view value)
{
    const std::string path = FullPath(root, keyPath);
    if (path.empty())
        return false;
    std::error_code ec;
    fs::create_directories(velHostSettings().profileDir, ec);
    // Read, changed and written under the lock: two hosts of one profile keep both values.
    const VelFileLock lock(velRegistryFile());
    std::vector<Key> keys;
    if (!lock.locked() || !Load(keys))
        return false;
    Key* key = FindKey(keys, path);
    if (key == nullptr) {
        keys.push_back({path, {}});
        key = &keys.back();
    }
    bool replaced = false;
    for (auto& [name, old] : key->values)
        if (EqualsNoCase(name, valueName)) {
            old = value;
            replaced = true;
            break;
        }
    if (!replaced)
        key->values.emplace_back(std::string(valueName), std::string(value));
    return velReplaceFile(velRegistryFile(), velSerializeRegistry(keys));
}
