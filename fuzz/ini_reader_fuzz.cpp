// Fuzz target of the INI reader and writer: the input's first three lines are a section,
// a key and a value, the rest an INI file. Reading never fails nor overflows its buffer;
// a value written with names the writer accepts reads back as written.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "host_internal.h"

namespace {

[[noreturn]] void Fault(const char* what)
{
    std::fprintf(stderr, "%s\n", what);
    std::abort();
}

// A line of the input, as a C string passes it (up to a zero byte).
std::string NextLine(std::string_view& rest)
{
    const std::size_t end = rest.find('\n');
    const std::string_view line = rest.substr(0, end);
    rest.remove_prefix(end == std::string_view::npos ? rest.size() : end + 1);
    return std::string(line.substr(0, line.find('\0')));
}

// What a reader gives for a written value: blanks around it and one pair of quotes go.
std::string AsRead(std::string_view value)
{
    const std::size_t first = value.find_first_not_of(" \t\r");
    if (first == std::string_view::npos)
        return {};
    value = value.substr(first, value.find_last_not_of(" \t\r") - first + 1);
    if (value.size() >= 2 && (value.front() == '"' || value.front() == '\'') && value.back() == value.front())
        value = value.substr(1, value.size() - 2);
    return std::string(value);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    std::string_view rest(reinterpret_cast<const char*>(data), size);
    const std::string section = NextLine(rest), key = NextLine(rest), value = NextLine(rest);
    std::string content(rest);

    const std::size_t small = size % 7 + 1;
    if (velIniValue(content, section, key, "défaut", small).size() >= small)
        Fault("valeur plus longue que le tampon");
    velIniValue(content, section, key, value, 4096);

    if (!velIniNamesValid(section.c_str(), key.c_str(), value.c_str()))
        return 0;
    const std::string before = content;
    velIniSetValue(content, section.c_str(), key.c_str(), value.c_str());
    if (velIniValue(content, section, key, "\x01", 1 << 20) != AsRead(value))
        Fault("valeur écrite relue autrement");
    std::string removed = content;
    velIniSetValue(removed, section.c_str(), key.c_str(), nullptr);
    velIniSetValue(removed, section.c_str(), nullptr, nullptr);
    return 0;
}
