// Text of a DXF file: UTF-8 from AC1021 on, the $DWGCODEPAGE code page before (with
// \U+XXXX escapes for what the code page cannot hold); converted only when asked for.
#pragma once

#include <string>
#include <string_view>

namespace vel::dxf {

// How the strings of one file are encoded.
struct TextEncoding {
    bool utf8 = true;
    // Code page of older files, as $DWGCODEPAGE names it ("ANSI_1252").
    std::string codepage = "ANSI_1252";

    // From the file's $ACADVER and $DWGCODEPAGE.
    static TextEncoding For(std::string_view acadver, std::string_view dwgcodepage);
};

// File bytes to UTF-8, \U+XXXX escapes (either hex case) resolved. Bytes the code page
// does not define come back as U+FFFD.
std::string DecodeText(std::string_view raw, const TextEncoding& encoding);

// UTF-8 to file bytes; a character the code page cannot hold is written as \U+XXXX.
std::string EncodeText(std::string_view utf8, const TextEncoding& encoding);

// Whether a code page name is one this reader knows how to convert.
bool IsKnownCodepage(std::string_view codepage);

} // namespace vel::dxf
