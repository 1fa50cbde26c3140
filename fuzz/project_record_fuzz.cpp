// Fuzz target of the project-record reader: the input is cut into XData items (texts,
// reals, integers, points, binary chunks, the record's marker); a record reads or is
// refused, and every quantity read is a finite number.
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "velsiblings/project_records.h"

namespace {

[[noreturn]] void Fault(const char* what)
{
    std::fprintf(stderr, "%s\n", what);
    std::abort();
}

template <class T>
T Take(std::string_view& bytes)
{
    T value{};
    const std::size_t n = std::min(sizeof value, bytes.size());
    std::memcpy(&value, bytes.data(), n);
    bytes.remove_prefix(n);
    return value;
}

// A length byte, then that many bytes (or what is left).
std::string_view TakeText(std::string_view& bytes)
{
    const std::size_t n = std::min<std::size_t>(Take<std::uint8_t>(bytes), bytes.size());
    const std::string_view text = bytes.substr(0, n);
    bytes.remove_prefix(n);
    return text;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    std::string_view bytes(reinterpret_cast<const char*>(data), size);
    VelRbBuilder list;
    list.add(velRbString(kXdRegAppName, velproj::kRecordApp));
    while (!bytes.empty()) {
        switch (Take<std::uint8_t>(bytes) % 8) {
        case 0:
            list.add(velRbString(kXdAsciiString, TakeText(bytes)));
            break;
        case 1:
            list.add(velRbString(kXdAsciiString, velproj::kNameMarker));
            break;
        case 2:
            list.add(velRbReal(kXdReal, Take<double>(bytes)));
            break;
        case 3:
            list.add(velRbShort(kXdInteger16, Take<short>(bytes)));
            break;
        case 4:
            list.add(velRbLong(kXdInteger32, Take<std::int32_t>(bytes)));
            break;
        case 5: {
            const double x = Take<double>(bytes), y = Take<double>(bytes), z = Take<double>(bytes);
            list.add(velRbPoint(kXdXCoord, x, y, z));
            break;
        }
        case 6:
            list.add(velRbBinary(TakeText(bytes)));
            break;
        default:
            list.add(velRbString(kXdControlString, Take<std::uint8_t>(bytes) % 2 ? "{" : "}"));
            break;
        }
    }
    VelRbPtr head(list.release());
    std::string name;
    velproj::QuantityTable quantities;
    if (!velproj::ReadProjectRecord(head.get(), name, quantities))
        return 0;
    for (const auto& [key, quantity] : quantities.Entries())
        if (!std::isfinite(quantity) || quantities.Find(key) == nullptr)
            Fault("quantité non finie ou introuvable");
    for (const resbuf* item = head.get(); item != nullptr; item = item->rbnext)
        if (item->restype == kXdAsciiString && !std::isfinite(velproj::LeadingNumber(velRbText(item))))
            Fault("nombre en tête non fini");
    return 0;
}
