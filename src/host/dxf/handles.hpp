// The handles of a drawing: those of the file in a sorted index, those given to added
// records and to records the file left without one (R12), and the next one free.
#pragma once

#include <cstdint>
#include <map>
#include <utility>
#include <vector>

#include "host/dxf/objects.hpp"
#include "host/dxf/sections.hpp"

namespace vel::dxf {

class Handles {
public:
    // Indexes the handles of the records; false when one is used twice.
    bool Index(const Sections& records, std::uint64_t handseed, ParseError& error);

    // Record of a handle (or made-up handle); SIZE_MAX when unknown.
    std::size_t Find(std::uint64_t handle) const;
    // Same, among the handles written in the file only.
    std::size_t FindInFile(std::uint64_t handle) const;
    // Handle of a record; a record without one in the file (R12) is given one above every
    // handle of the file when first asked, which is never written. 0 when none is left.
    std::uint64_t Of(const Sections& records, std::size_t record);
    // A new handle for an added record; 0 when none is left.
    std::uint64_t Add(std::size_t record);

    // First handle not used yet; 0 when all are taken.
    std::uint64_t next() const { return next_; }
    bool AnyAdded() const { return !added_.empty(); }

private:
    std::vector<std::pair<std::uint64_t, std::uint32_t>> index_; // sorted (handle, record)
    std::map<std::uint64_t, std::size_t> added_;                 // handles of added records
    std::map<std::uint64_t, std::size_t> madeUp_;                // handles given to handle-less records
    std::map<std::size_t, std::uint64_t> madeUpOf_;
    std::uint64_t next_ = 1;
};

} // namespace vel::dxf
