// Fuzz target of the registry file reader: any text is refused with a message naming the
// file and the line, or read; what reads is written back and reads again the same.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "host_internal.h"

namespace {

[[noreturn]] void Fault(const std::string& what)
{
    std::fprintf(stderr, "%s\n", what.c_str());
    std::abort();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    std::vector<VelRegistryKey> keys;
    if (const VelReadResult read = velParseRegistry(text, "registre.reg", keys); !read) {
        if (read.status != VelReadStatus::kMalformed || read.line < 1 ||
            read.description().rfind("registre.reg, ligne " + std::to_string(read.line) + " : ", 0) != 0)
            Fault("refus sans fichier ni ligne : " + read.description());
        return 0;
    }
    const std::string written = velSerializeRegistry(keys);
    std::vector<VelRegistryKey> back;
    if (const VelReadResult read = velParseRegistry(written, "registre.reg", back); !read)
        Fault("relecture refusée : " + read.description());
    if (back.size() != keys.size())
        Fault("nombre de clés différent à la relecture");
    for (std::size_t i = 0; i < keys.size(); ++i)
        if (back[i].path != keys[i].path || back[i].values != keys[i].values)
            Fault("clé changée à la relecture : " + keys[i].path);
    if (velSerializeRegistry(back) != written)
        Fault("deuxième écriture différente");
    return 0;
}
