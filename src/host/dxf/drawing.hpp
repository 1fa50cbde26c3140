// The top of the DXF layer: a whole drawing file as its source bytes, its sections and
// records, its header and handles, and the objects read from it so far (each parsed on
// first use) or added to it. It knows nothing of the database that uses it.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "host/dxf/codepage.hpp"
#include "host/dxf/handles.hpp"
#include "host/dxf/header.hpp"
#include "host/dxf/objects.hpp"
#include "host/dxf/sections.hpp"
#include "host/dxf/source.hpp"
#include "host/dxf/writer.hpp"
#include "velhost/header_vars.h"
#include "velhost/read_result.h"

namespace vel::dxf {

class DrawingFile {
public:
    ~DrawingFile();
    DrawingFile(const DrawingFile&) = delete;
    DrawingFile& operator=(const DrawingFile&) = delete;

    // Reads a drawing (ASCII or binary DXF) into `out`, left alone unless the whole file
    // is sound; `name` stands for the file in messages.
    static VelReadResult Read(std::unique_ptr<Source> source, const std::string& name,
                              std::unique_ptr<DrawingFile>& out);
    // A new empty drawing (layer "0" current, an empty named-object dictionary): a copy
    // of the built-in template, read once. Should the template be unreadable, a drawing
    // with no section at all.
    static std::unique_ptr<DrawingFile> New();

    // Writes the drawing through calls of `sink` with consecutive pieces: what did not
    // change is copied byte for byte. False with `error` set when the sink stops it.
    bool Write(const Sink& sink, std::string& error) const;

    // The records of the file and those added since.
    const Sections& records() const { return sections_; }
    // The object of a record, read from the file on first use; null when malformed.
    ObjectBody* Body(std::size_t record, ParseError* failure = nullptr);
    // Record of a handle; SIZE_MAX when unknown.
    std::size_t FindRecord(std::uint64_t handle) const { return handles_.Find(handle); }
    // Handle of a record (see Handles::Of).
    std::uint64_t HandleOf(std::size_t record) { return handles_.Of(sections_, record); }
    // Adds an object to the OBJECTS section with a new handle and its owner; `body` is
    // taken only on success. False when the drawing cannot hold it (R12, or no handle
    // left).
    bool AddObject(std::unique_ptr<ObjectBody>& body, std::uint64_t owner, std::size_t& record);

    // Layers and applications by name, without regard to case; SIZE_MAX when absent.
    std::size_t LayerRecord(const std::string& name);
    std::size_t AppRecord(const std::string& name);
    // Name (UTF-8) of a table record.
    std::string RecordName(std::size_t record);
    // New layer (colour 7, continuous) and application; false when the drawing has no
    // such table or no handle left.
    bool AddLayer(const std::string& name, std::size_t& record);
    bool AddApp(const std::string& name);

    const VelHeaderSettings& settings() const { return header_.settings(); }
    VelHeaderSettings& settings() { return header_.settings(); }
    const std::string& acadver() const { return header_.acadver(); }
    const TextEncoding& encoding() const { return header_.encoding(); }
    // Size of the file's bytes, as a first guess of what a writing takes.
    std::size_t SourceSize() const { return source_->view().size(); }

private:
    DrawingFile() = default;
    // A copy of a drawing nothing was added to: the bytes are shared, the objects read
    // again from them on use.
    std::unique_ptr<DrawingFile> Copy() const;
    VelReadResult Load(std::shared_ptr<const Source> source);
    bool CheckDictionaries(ParseError& error);
    // The refusal of the file at a line of its text form, or at a group of the binary
    // file it came from.
    VelReadResult Fail(std::uint32_t line, const std::string& expected) const;
    VelReadResult FailAtGroup(std::uint64_t group, const std::string& expected) const;
    bool AddRecord(std::unique_ptr<ObjectBody>&& body, std::size_t before, Section section, std::uint64_t owner,
                   bool withHandle, std::size_t& record);
    std::vector<std::string> ChangedHeaderVars() const;
    bool WriteText(const Sink& sink, std::string& error) const;

    std::shared_ptr<const Source> source_;
    std::string name_;
    bool binary_ = false;   // read from binary DXF (the source holds its text form)
    bool wideCodes_ = true; // binary group codes of two bytes (R13 and later)
    Sections sections_;
    Header header_;
    Handles handles_;
    std::size_t sourceCount_ = 0;                                // records read from the file; added ones follow
    std::vector<std::unique_ptr<ObjectBody>> bodies_;            // parallel to the records, filled on use
    std::map<std::size_t, std::vector<std::size_t>> insertions_; // before record -> added records
};

} // namespace vel::dxf
