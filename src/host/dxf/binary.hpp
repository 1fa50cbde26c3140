// Binary DXF: converted to the text form when read, and back when written, so that the
// layers above see one form only. Values keep their exact bits both ways.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace vel::dxf {

// Whether the bytes start with the binary DXF sentinel.
bool IsBinaryDxf(std::string_view bytes);

// Binary DXF to text DXF ("\n" line ends). `wideCodes` tells 2-byte group codes (R13 and
// later) from 1-byte ones (R12). False with the number of the faulty group (1-based) and
// what was expected.
bool BinaryToText(std::string_view binary, std::string& text, bool& wideCodes, std::uint64_t& group,
                  std::string& expected);

// Text DXF back to binary.
bool TextToBinary(std::string_view text, bool wideCodes, std::string& binary, std::string& error);

} // namespace vel::dxf
