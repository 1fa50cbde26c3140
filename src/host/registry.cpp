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

const char* const kRoots[] = {"HKEY_LOCAL_MACHINE", "HKEY_CURRENT_USER", "HKEY_CLASSES_ROOT",
                              "HKEY_USERS", "HKEY_PERFORMANCE_DATA", "HKEY_CURRENT_CONFIG",
                              "HKEY_DYN_DATA"};

using Key = VelRegistryKey;

std::string Escape(std::string_view text) {
  std::string out;
  for (char c : text) {
    switch (c) {
      case '\\': out += "\\\\"; break;
      case '"': out += "\\\""; break;
      case '\n': out += "\\n"; break;
      case '\r': out += "\\r"; break;
      case '\t': out += "\\t"; break;
      default: out += c;
    }
  }
  return out;
}

// Reads a quoted text at pos (on the opening quote); false when it is not one.
bool ReadQuoted(const std::string& line, std::size_t& pos, std::string& out) {
  if (pos >= line.size() || line[pos] != '"') return false;
  out.clear();
  for (++pos; pos < line.size(); ++pos) {
    char c = line[pos];
    if (c == '"') {
      ++pos;
      return true;
    }
    if (c == '\\') {
      if (++pos >= line.size()) return false;
      switch (line[pos]) {
        case '\\': out += '\\'; break;
        case '"': out += '"'; break;
        case 'n': out += '\n'; break;
        case 'r': out += '\r'; break;
        case 't': out += '\t'; break;
        default: return false;
      }
    } else {
      out += c;
    }
  }
  return false;
}

bool Load(std::vector<Key>& keys, std::string& error) {
  const std::string file = velRegistryFile();
  std::error_code ec;
  if (!fs::exists(file, ec)) return true;
  std::ifstream in(file, std::ios::binary);
  std::string text;
  if (in) text.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
  if (!in.is_open() || in.bad()) {
    error = FormatString("%s : lecture impossible.", file.c_str());
    return false;
  }
  return velParseRegistry(text, file, keys, error);
}

// ROOT\a\b with the root spelt as the table has it and no empty level; "" when invalid.
std::string FullPath(std::string_view root, std::string_view keyPath) {
  const char* rootName = nullptr;
  for (const char* r : kRoots)
    if (EqualsNoCase(root, r)) rootName = r;
  if (rootName == nullptr || keyPath.empty()) return {};
  std::string out = rootName;
  std::string level;
  auto flush = [&]() {
    if (!level.empty()) out += "\\" + level;
    level.clear();
  };
  for (char c : keyPath) {
    if (c == '\\' || c == '/') flush();
    else if (c == '\n' || c == '\r' || c == ']') return {};
    else level += c;
  }
  flush();
  return out == rootName ? std::string() : out;
}

Key* FindKey(std::vector<Key>& keys, const std::string& path) {
  for (Key& k : keys)
    if (EqualsNoCase(k.path, path)) return &k;
  return nullptr;
}

}  // namespace

bool velParseRegistry(const std::string& text, const std::string& file, std::vector<VelRegistryKey>& keys,
                      std::string& error) {
  std::istringstream in(text);
  std::string line;
  int number = 0;
  while (std::getline(in, line)) {
    ++number;
    if (!line.empty() && line.back() == '\r') line.pop_back();
    if (line.empty() || line.front() == ';') continue;
    if (line.front() == '[') {
      if (line.back() != ']' || line.size() < 3) {
        error = FormatString("%s, ligne %d : \"]\" attendu à la fin de la clé.", file.c_str(), number);
        return false;
      }
      keys.push_back({line.substr(1, line.size() - 2), {}});
      continue;
    }
    if (keys.empty()) {
      error = FormatString("%s, ligne %d : une clé \"[...]\" est attendue avant la première valeur.",
                           file.c_str(), number);
      return false;
    }
    std::string name, value;
    std::size_t pos = 0;
    if (line.front() == '@')
      pos = 1;
    else if (!ReadQuoted(line, pos, name)) {
      error = FormatString("%s, ligne %d : nom de valeur entre guillemets attendu.", file.c_str(), number);
      return false;
    }
    if (pos >= line.size() || line[pos] != '=' || !ReadQuoted(line, ++pos, value) || pos != line.size()) {
      error = FormatString("%s, ligne %d : =\"texte\" attendu après le nom de valeur.", file.c_str(), number);
      return false;
    }
    keys.back().values.emplace_back(name, value);
  }
  return true;
}

std::string velSerializeRegistry(const std::vector<VelRegistryKey>& keys) {
  std::string out;
  for (const Key& k : keys) {
    out += "[" + k.path + "]\n";
    for (const auto& [name, value] : k.values)
      out += (name.empty() ? std::string("@") : "\"" + Escape(name) + "\"") + "=\"" + Escape(value) + "\"\n";
    out += "\n";
  }
  return out;
}

bool velIsRegistryRoot(std::string_view name) {
  for (const char* r : kRoots)
    if (EqualsNoCase(name, r)) return true;
  return false;
}

std::string velRegistryFile() { return (fs::path(velHostSettings().profileDir) / "registre.reg").string(); }

bool velCheckRegistry(std::string& error) {
  std::vector<Key> keys;
  return Load(keys, error);
}

bool velRegQueryValue(std::string_view root, std::string_view keyPath, std::string_view valueName,
                      std::string& out, std::size_t maxBytes) {
  const std::string path = FullPath(root, keyPath);
  std::vector<Key> keys;
  std::string error;
  if (path.empty() || !Load(keys, error)) return false;
  Key* key = FindKey(keys, path);
  if (key == nullptr) return false;
  for (const auto& [name, value] : key->values) {
    if (!EqualsNoCase(name, valueName)) continue;
    if (value.size() >= maxBytes) return false;
    out = value;
    return true;
  }
  return false;
}

bool velRegSetValue(std::string_view root, std::string_view keyPath, std::string_view valueName,
                    std::string_view value) {
  const std::string path = FullPath(root, keyPath);
  if (path.empty()) return false;
  std::error_code ec;
  fs::create_directories(velHostSettings().profileDir, ec);
  // Read, changed and written under the lock: two hosts of one profile keep both values.
  const VelFileLock lock(velRegistryFile());
  std::vector<Key> keys;
  std::string error;
  if (!lock.locked() || !Load(keys, error)) return false;
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
  if (!replaced) key->values.emplace_back(std::string(valueName), std::string(value));
  return velReplaceFile(velRegistryFile(), velSerializeRegistry(keys));
}
