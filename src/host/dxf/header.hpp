// The HEADER section of a drawing file: the version and code page, the handle seed and
// the settings of the header table, read from the file and written back where they
// stand, only when they changed.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "host/dxf/codepage.hpp"
#include "host/dxf/objects.hpp"
#include "host/dxf/sections.hpp"
#include "host/dxf/writer.hpp"
#include "velhost/header_vars.h"

namespace vel::dxf {

// A header variable as found in the file: its bytes from the 9 tag to the next one.
struct HeaderVar {
    std::string_view name;
    std::uint64_t begin = 0;
    std::uint64_t end = 0;
};

class Header {
public:
    // Reads the section that starts at `section` (null: a file without header, read as
    // R12 with every setting at its default).
    bool Read(std::string_view text, const Record* section, ParseError& error);

    const std::string& acadver() const { return acadver_; }
    const TextEncoding& encoding() const { return encoding_; }
    // $HANDSEED as read, and whether the file has one.
    std::uint64_t handseed() const { return handseed_; }
    bool HasSeed() const;
    const VelHeaderSettings& settings() const { return settings_; }
    VelHeaderSettings& settings() { return settings_; }

    // Names of the table's variables whose value is not the one read.
    std::vector<std::string> Changed() const;

    // Writes the section (a new one after `section` is null) with the variables named in
    // `changed` written anew, in place or at its end, and $HANDSEED as `seed`.
    void Write(Writer& writer, const Record* section, const std::vector<std::string>& changed, std::uint64_t seed,
               const std::string& eol) const;

private:
    std::string Value(std::string_view name, std::uint64_t seed, const std::string& eol) const;

    std::string acadver_ = "AC1009"; // a file without header is read as R12
    TextEncoding encoding_;
    std::uint64_t handseed_ = 1;
    VelHeaderSettings settings_;
    VelHeaderSettings fileSettings_;
    std::vector<HeaderVar> vars_;
};

} // namespace vel::dxf
