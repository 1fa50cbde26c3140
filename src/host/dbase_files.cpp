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

bool velOpenDrawing(const std::string& path, std::unique_ptr<AcDbDatabase>& out, std::string& error)
{
    auto source = std::make_unique<vel::dxf::Source>();
    if (!source->Load(path, error))
        return false;
    std::unique_ptr<DrawingFile> file = DrawingFile::Read(std::move(source), path, error);
    if (!file)
        return false;
    out = std::make_unique<AcDbDatabase>(std::move(file), path);
    return true;
}

bool velReadDrawing(std::string content, const std::string& name, std::unique_ptr<AcDbDatabase>& out,
                    std::string& error)
{
    auto source = std::make_unique<vel::dxf::Source>();
    source->Own(std::move(content));
    std::unique_ptr<DrawingFile> file = DrawingFile::Read(std::move(source), name, error);
    if (!file)
        return false;
    out = std::make_unique<AcDbDatabase>(std::move(file), name);
    return true;
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
    VelFileResult result = file.open();
    std::string writeError;
    if (result && !database.file().Write(
                      [&](std::string_view piece) {
                          result = file.write(piece);
                          return result.ok;
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
