// The drawing's entities as read-only copies: walks the records of the ENTITIES section,
// folds vertices and attributes into their owner, and decodes every value to UTF-8.
#include "velhost/entities.h"

#include "host/dxf/drawing.hpp"
#include "text/text.hpp"

using vel::dxf::DrawingFile;
using vel::dxf::ObjectBody;
using vel::dxf::Section;

namespace {

std::vector<VelDxfValue> ValuesOf(const ObjectBody& body, const vel::dxf::TextEncoding& encoding)
{
    std::vector<VelDxfValue> values;
    values.reserve(body.tags.size() + body.tail.size());
    bool first = true;
    for (const auto* part : {&body.tags, &body.tail}) {
        for (const vel::dxf::Tag& tag : *part) {
            if (first && tag.code == 0) {
                first = false;
                continue;
            }
            first = false;
            values.push_back({tag.code, vel::dxf::DecodeText(tag.value, encoding)});
        }
    }
    return values;
}

const std::string* FirstText(const std::vector<VelDxfValue>& values, int code)
{
    for (const VelDxfValue& value : values)
        if (value.code == code)
            return &value.text;
    return nullptr;
}

} // namespace

std::optional<double> velDxfReal(const std::vector<VelDxfValue>& values, int code)
{
    const std::string* text = FirstText(values, code);
    if (text == nullptr)
        return std::nullopt;
    std::string_view view = *text;
    while (!view.empty() && view.front() == ' ')
        view.remove_prefix(1);
    while (!view.empty() && view.back() == ' ')
        view.remove_suffix(1);
    return ParseReal(view);
}

std::optional<std::string> VelEntity::text(int code) const
{
    const std::string* found = FirstText(values, code);
    if (found == nullptr)
        return std::nullopt;
    return *found;
}

std::optional<double> VelEntity::real(int code) const
{
    return velDxfReal(values, code);
}

resbuf* VelEntity::xData(const char* regappName) const
{
    AcDbObject* object = nullptr;
    if (acdbOpenObject(object, id, AcDb::kForRead) != Acad::eOk)
        return nullptr;
    resbuf* list = object->xData(regappName);
    object->close();
    return list;
}

std::vector<VelEntity> velReadEntities(AcDbDatabase& database, std::size_t* skipped)
{
    std::vector<VelEntity> entities;
    std::size_t bad = 0;
    DrawingFile& file = database.file();
    // The entity that VERTEX or ATTRIB records join until its SEQEND.
    std::size_t parent = SIZE_MAX;
    for (std::size_t record = 0; record < file.records().size(); ++record) {
        if (file.records()[record].section != Section::Entities)
            continue;
        const std::string_view type = file.records()[record].type;
        if (type == "SECTION" || type == "ENDSEC")
            continue;
        if (type == "SEQEND") {
            parent = SIZE_MAX;
            continue;
        }
        const ObjectBody* body = file.Body(record);
        if (body == nullptr) {
            ++bad;
            continue;
        }
        if (type == "VERTEX" || type == "ATTRIB") {
            if (parent != SIZE_MAX)
                entities[parent].children.push_back(ValuesOf(*body, file.encoding()));
            continue;
        }
        VelEntity entity;
        entity.dxfName = body->type;
        entity.handle = body->handle;
        entity.id = AcDbObjectId(&database, body->handle);
        entity.values = ValuesOf(*body, file.encoding());
        const std::string* layer = FirstText(entity.values, 8);
        entity.layer = layer != nullptr ? *layer : "0";
        const auto space = velDxfReal(entity.values, 67);
        entity.paperSpace = space && *space == 1;
        entities.push_back(std::move(entity));
        parent = (type == "POLYLINE" || type == "INSERT") ? entities.size() - 1 : SIZE_MAX;
    }
    if (skipped != nullptr)
        *skipped = bad;
    return entities;
}
