// The bottom of a drawing file: its bytes, read whole into memory or given as a string,
// shared read-only by everything that points into them.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

#include "velhost/read_result.h"

namespace vel::dxf {

// Bytes of a drawing: a read-only copy of the file, or a string.
class Source {
public:
    Source() = default;
    ~Source();
    Source(const Source&) = delete;
    Source& operator=(const Source&) = delete;
    // Reads the whole file into memory: a mapping of the file would fault on every page
    // that another program cut off it while it is open, and the writer copies from it at
    // save.
    VelReadResult Load(const std::string& path);
    void Own(std::string content);
    std::string_view view() const { return {data_, size_}; }

private:
    std::string owned_;
    void* buffer_ = nullptr;
    std::size_t capacity_ = 0;
    const char* data_ = "";
    std::size_t size_ = 0;
};

} // namespace vel::dxf
