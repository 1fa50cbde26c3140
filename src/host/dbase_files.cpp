// Opening a drawing from a DXF file or a buffer, and writing it to a string or, whole
// or not at all, to a file.
#include <memory>
#include <string>

#include "host/dxf/drawing.hpp"
#include "text/text.hpp"
#include "velhost/dbase.h"
#include "velhost/editor.h"
#include "velhost/files.h"

using vel::dxf::DrawingFile;

namespace {

VelReadResult ReadFrom(std::unique_ptr<vel::dxf::Source> source, const std::string& name,
                       std::unique_ptr<AcDbDatabase>& out)
{
    std::unique_ptr<DrawingFile> file;
    VelReadResult result = DrawingFile::Read(std::move(source), name, file);
    if (result)
        out = std::make_unique<AcDbDatabase>(std::move(file), name);
    return result;
}

} // namespace

VelReadResult velOpenDrawing(const std::string& path, std::unique_ptr<AcDbDatabase>& out)
{
    auto source = std::make_unique<vel::dxf::Source>();
    if (VelReadResult loaded = source->Load(path); !loaded)
        return loaded;
    return ReadFrom(std::move(source), path, out);
}

VelReadResult velReadDrawing(std::string content, const std::string& name, std::unique_ptr<AcDbDatabase>& out)
{
    auto source = std::make_unique<vel::dxf::Source>();
    source->Own(std::move(content));
    return ReadFrom(std::move(source), name, out);
}

bool velWriteDrawing(AcDbDatabase& database, std::string& out, std::string& error)
{
    out.clear();
    out.reserve(database.file().SourceSize() + 4096);
    return database.file().Write(
        [&](std::string_view piece) {
            out.append(piece);
            return true;
        },
        error);
}

bool velSaveDrawing(AcDbDatabase& database, const std::string& path, std::string& error)
{
    VelAtomicFile file(path);
    VelReadResult result = file.open();
    std::string writeError;
    if (result && !database.file().Write(
                      [&](std::string_view piece) {
                          result = file.write(piece);
                          return static_cast<bool>(result);
                      },
                      writeError)) {
        error = result ? FormatString("« %s » : %s", path.c_str(), writeError.c_str()) : result.message;
        return false;
    }
    if (result)
        result = file.commit();
    if (!result) {
        error = result.message;
        return false;
    }
    if (!result.message.empty())
        acutPrintf("%s\n", result.message.c_str());
    database.fileName_ = path;
    database.modified_ = false;
    return true;
}
