// The top layer of the DXF reader and writer: a whole drawing as the list of its
// records (every 0-tag object, in file order) over the file read into memory, with the header
// settings, the handle index and the objects the host has opened so far.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "host/dxf/codepage.hpp"
#include "host/dxf/objects.hpp"
#include "velhost/dbase.h"
#include "velhost/header_vars.h"

namespace vel::dxf {

// Bytes of a drawing: a read-only mapping of the file, or a string.
class Source {
public:
    Source() = default;
    ~Source();
    Source(const Source&) = delete;
    Source& operator=(const Source&) = delete;
    // Reads the whole file into memory: a mapping of the file would fault on every page
    // that another program cut off it while it is open, and the writer copies from it at
    // save.
    bool Load(const std::string& path, std::string& error);
    void Own(std::string content);
    std::string_view view() const { return {data_, size_}; }

private:
    std::string owned_;
    void* buffer_ = nullptr;
    std::size_t capacity_ = 0;
    const char* data_ = "";
    std::size_t size_ = 0;
};

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

// A header variable as found in the file: its bytes from the 9 tag to the next one.
struct HeaderVar {
    std::string_view name;
    std::uint64_t begin = 0;
    std::uint64_t end = 0;
};

class Writer;


class DrawingFile {
public:
    explicit DrawingFile(AcDbDatabase* database);
    ~DrawingFile();

    // Reads a drawing; the database is built only when the whole file is sound.
    static bool Read(std::unique_ptr<Source> source, const std::string& name,
                     std::unique_ptr<AcDbDatabase>& out, std::string& error);
    // Writes the drawing through calls of `sink` with consecutive pieces; a false answer
    // of the sink stops the writing.
    bool Write(const std::function<bool(std::string_view)>& sink, std::string& error);

    // Builds `db` from a source; `db` is changed only when the whole file is sound.
    static bool Load(AcDbDatabase& db, std::unique_ptr<Source> source, const std::string& name,
                     std::string& error);

    // The object of a record, read from the file on first use; null when malformed.
    AcDbObject* ObjectAt(std::size_t record, ParseError* failure = nullptr);
    // Record of a handle (or made-up handle); SIZE_MAX when unknown.
    std::size_t FindRecord(std::uint64_t handle) const;
    // Same, among the handles written in the file only.
    std::size_t FindFileRecord(std::uint64_t handle) const;
    // Handle of a record; a record without one in the file (R12) is given one above every
    // handle of the file when first asked, which is never written. 0 when none is left.
    std::uint64_t HandleOf(std::size_t record);
    // Adds a new object (table record, or object of the OBJECTS section); gives it a
    // handle and writes its owner. False when the drawing cannot hold it (R12 objects).
    bool AddObject(AcDbObject* object, std::uint64_t owner, std::string& error);

    std::size_t LayerRecord(const std::string& name) const;
    std::size_t AppRecord(const std::string& name) const;
    std::string RecordName(std::size_t record);
    bool AddLayer(const std::string& name, std::size_t& record, std::string& error);
    bool AddApp(const std::string& name, std::string& error);

    AcDbDatabase* database;
    std::unique_ptr<Source> source;
    std::string fileName;
    std::string acadver = "AC1032";
    TextEncoding encoding;
    std::string eol = "\n";
    bool binary = false;            // read from binary DXF (the source holds its text form)
    bool wideCodes = true;          // binary group codes of two bytes (R13 and later)
    bool modified = false;

    VelHeaderSettings settings;
    VelHeaderSettings fileSettings;  // as read, to know what changed
    std::uint64_t handseed = 1;     // as read
    std::uint64_t nextHandle = 1;   // first handle not used yet; 0 when all are taken

    std::vector<Record> records;
    std::size_t sourceCount = 0;    // records read from the file; added ones follow
    std::vector<std::unique_ptr<AcDbObject>> objects;  // parallel to records, filled on use
    std::vector<std::pair<std::uint64_t, std::uint32_t>> index;  // sorted (handle, record)
    std::map<std::uint64_t, std::size_t> addedIndex;             // handles of added records
    std::map<std::uint64_t, std::size_t> madeUpIndex;            // handles given to handle-less records
    std::map<std::size_t, std::uint64_t> madeUpHandles;

    std::size_t headerRecord = SIZE_MAX;
    std::vector<HeaderVar> headerVars;
    std::size_t rootDictionary = SIZE_MAX;
    std::size_t objectsEnd = SIZE_MAX;                 // ENDSEC of OBJECTS
    std::map<std::string, std::size_t> tableEnds;       // ENDTAB of each table
    std::map<std::string, std::uint64_t> tableHandles;  // TABLE record handle
    std::vector<std::size_t> layers;
    std::vector<std::size_t> apps;
    std::map<std::size_t, std::vector<std::size_t>> insertions;  // before record -> added records

private:
    bool WriteText(const std::function<bool(std::string_view)>& sink, std::string& error);
    bool Scan(std::string& error);
    bool ReadHeader(std::string& error);
    bool ReadStructure(std::string& error);
    bool IndexHandles(std::string& error);
    bool CheckDictionaries(std::string& error);
    std::string Where(std::uint32_t line) const;
    std::string Fail(std::uint32_t line, const std::string& expected) const;
    bool AddRecord(std::unique_ptr<AcDbObject> object, std::size_t before, Section section,
                   std::uint64_t owner, bool withHandle);
    std::string HeaderValue(std::string_view name, std::uint64_t seed) const;
    std::vector<std::string> ChangedHeaderVars() const;
    void WriteHeader(Writer& writer, const std::vector<std::string>& changed) const;
};

}  // namespace vel::dxf
