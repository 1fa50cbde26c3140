// The middle layer of the DXF reader: one object (entity, table record, dictionary,
// XRECORD or anything else) as its tags, with the parts the host interprets - handle,
// owner, dictionary entries, XData - picked out and the rest kept as read.
#pragma once

#include <cstdint>
#include <deque>
#include <string>
#include <string_view>
#include <vector>

#include "host/dxf/codepage.hpp"
#include "host/dxf/tags.hpp"
#include "velhost/resbuf.h"

namespace vel::dxf {

// A dictionary entry: key (UTF-8 and as written in the file), object, and whether the
// dictionary owns it (360) or only refers to it (350).
struct DictEntry {
    std::string key;
    std::string_view rawKey;
    std::uint64_t handle = 0;
    int code = 350;
    std::uint32_t line = 0;
};

// Where a malformed object went wrong.
struct ParseError {
    std::uint32_t line = 0;
    std::string expected;
};

// One object as its tags, with the parts the host interprets picked out.
struct ObjectBody {
    std::string type;
    std::uint64_t handle = 0;   // 0: the object has none (R12)
    bool handleWritten = false; // the file holds the handle as a tag
    std::uint64_t owner = 0;
    bool dirty = false; // must be written from the tags, not the file bytes
    bool isDictionary = false;
    bool hardOwner = false; // dictionary entries written as 360

    std::vector<Tag> tags;    // own tags, from the 0 tag, without entries and XData
    std::size_t entryPos = 0; // where the entries stand among the tags
    std::vector<DictEntry> entries;
    std::vector<Tag> xdata; // from the first 1001 to the last XData tag
    std::vector<Tag> tail;  // tags after the XData, kept after it

    // Storage for the values set after reading; views into it stay valid.
    std::string_view keep(std::string value)
    {
        arena.push_back(std::move(value));
        return arena.back();
    }
    std::deque<std::string> arena;
};

// Whether a record of this type is a dictionary.
bool IsDictionaryType(std::string_view type);

// Reads one object from its bytes (beginning with its 0 tag). False with `error` set
// when the object is malformed.
bool ParseObject(std::string_view bytes, std::uint32_t firstLine, const TextEncoding& encoding, ObjectBody& body,
                 ParseError& error);

// Writes the object's tags.
void WriteObject(const ObjectBody& body, std::string& out, std::string_view eol);

// XData of one application (all when app is empty) as a result-buffer list; null when
// there is none.
resbuf* XDataToRb(const std::vector<Tag>& xdata, std::string_view app, const TextEncoding& encoding);

// Merges a result-buffer list into the object's XData: each application of the list
// replaces its own group (an application with no item loses it). Answers the names of
// the applications of the list, or false with `error` for a malformed list.
bool MergeXData(ObjectBody& body, const resbuf* list, const TextEncoding& encoding, std::vector<std::string>& apps,
                std::string& error);

// Application names in the object's XData, in order.
std::vector<std::string> XDataApps(const std::vector<Tag>& xdata, const TextEncoding& encoding);

// Data of an XRECORD (tags after its subclass marker and cloning flag).
resbuf* XrecordToRb(const ObjectBody& body, const TextEncoding& encoding);
bool SetXrecordData(ObjectBody& body, const resbuf* list, const TextEncoding& encoding, std::string& error);

// Text of the first tag with the code among the object's own tags ("" when absent).
std::string_view FirstValue(const ObjectBody& body, int code);

// Checks the XData tags of one object as they come: known codes, numbers that read,
// points of three tags, balanced braces.
class XDataChecker {
public:
    // False on a malformed tag; expected() then says what should have stood there.
    bool Feed(const Tag& tag);
    // End of the object's XData.
    bool Finish();
    const std::string& expected() const { return expected_; }

private:
    bool Fail(std::string expected);
    int depth_ = 0;
    int pendingAxis_ = 0;
    int optionalAxis_ = 0;
    std::string expected_;
};

} // namespace vel::dxf
