// The section structure of a drawing file: the file cut into its records (every 0-tag
// object, in file order), with the places of what the host needs: the header, the tables
// and their layers and applications, the named-object dictionary, the end of OBJECTS.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "host/dxf/objects.hpp"

namespace vel::dxf {

enum class Section : std::uint8_t { None, Header, Classes, Tables, Blocks, Entities, Objects, Other };

// One 0-tag record of the file; `begin == end` for a record the host added.
struct Record {
    std::uint64_t begin = 0;
    std::uint64_t end = 0;
    std::uint64_t handle = 0;
    std::uint32_t line = 0;
    Section section = Section::None;
    bool added = false;
    std::string_view type;
};

class Sections {
public:
    // Cuts the text into records, checking the XData of each as it goes, then the order
    // of sections and tables. False with where and what was expected otherwise.
    bool Read(std::string_view text, ParseError& error);

    std::size_t size() const { return records_.size(); }
    const Record& operator[](std::size_t record) const { return records_[record]; }
    // Adds a record after the file's ones; answers its index.
    std::size_t Add(const Record& record);
    void SetType(std::size_t record, std::string_view type) { records_[record].type = type; }

    // Line ending of the file ("\n" or "\r\n").
    const std::string& eol() const { return eol_; }
    // The HEADER section's SECTION record, the first dictionary of OBJECTS and the ENDSEC
    // of OBJECTS; SIZE_MAX when the file has none.
    std::size_t header() const { return header_; }
    std::size_t rootDictionary() const { return rootDictionary_; }
    std::size_t objectsEnd() const { return objectsEnd_; }
    // ENDTAB record and TABLE handle of a table; SIZE_MAX and 0 when absent.
    std::size_t TableEnd(const std::string& table) const;
    std::uint64_t TableHandle(const std::string& table) const;
    // Records of the layer and application tables, added ones included.
    const std::vector<std::size_t>& layers() const { return layers_; }
    const std::vector<std::size_t>& apps() const { return apps_; }
    void AddLayer(std::size_t record) { layers_.push_back(record); }
    void AddApp(std::size_t record) { apps_.push_back(record); }

private:
    bool Scan(std::string_view text, ParseError& error);
    bool ReadStructure(std::string_view text, ParseError& error);

    std::vector<Record> records_;
    std::string eol_ = "\n";
    std::size_t header_ = SIZE_MAX;
    std::size_t rootDictionary_ = SIZE_MAX;
    std::size_t objectsEnd_ = SIZE_MAX;
    std::map<std::string, std::size_t> tableEnds_;
    std::map<std::string, std::uint64_t> tableHandles_;
    std::vector<std::size_t> layers_;
    std::vector<std::size_t> apps_;
};

} // namespace vel::dxf
