// Builds test drawings by writing a new drawing, putting entities into its ENTITIES
// section and reading it back, so that the entities are what a DXF file would give.
#include "network_fixture.hpp"

#include <gtest/gtest.h>

#include "text/text.hpp"

namespace network_test {

namespace {

std::string Tag(int code, const std::string& value)
{
    return FormatString("%d\n%s\n", code, value.c_str());
}

std::string Real(int code, double value)
{
    return Tag(code, FormatRealShortest(value));
}

std::string Head(const std::string& type, const std::string& handle, const char* subclass, bool paperSpace = false)
{
    std::string text = Tag(0, type) + Tag(5, handle) + Tag(100, "AcDbEntity");
    if (paperSpace)
        text += Tag(67, "1");
    return text + Tag(8, "RESEAUX") + Tag(100, subclass);
}

} // namespace

std::string XData::Text() const
{
    std::string text = Tag(1001, "VELANTO_RSX") + Tag(1000, network) + Tag(1070, FormatInt(index)) +
                       Tag(1000, project) + Tag(1000, kind) + Tag(1000, model);
    for (double depth : depths)
        text += Real(1040, depth);
    for (double size : sizes)
        text += Real(1041, size);
    return text;
}

std::string Line(const std::string& handle, double x1, double y1, double z1, double x2, double y2, double z2,
                 const std::string& xdata)
{
    return Head("LINE", handle, "AcDbLine") + Real(10, x1) + Real(20, y1) + Real(30, z1) + Real(11, x2) + Real(21, y2) +
           Real(31, z2) + xdata;
}

std::string LwPolyline(const std::string& handle, const std::vector<std::vector<double>>& vertices, bool closed,
                       const std::string& xdata)
{
    std::string text = Head("LWPOLYLINE", handle, "AcDbPolyline") +
                       Tag(90, FormatInt(static_cast<int>(vertices.size()))) + Tag(70, closed ? "1" : "0");
    for (const auto& v : vertices) {
        text += Real(10, v[0]) + Real(20, v[1]);
        if (v.size() > 2)
            text += Real(42, v[2]);
    }
    return text + xdata;
}

std::string Polyline(const std::string& handle, int flags, const std::vector<std::vector<double>>& vertices,
                     const std::string& xdata)
{
    const bool threeD = (flags & 8) != 0;
    std::string text = Head("POLYLINE", handle, threeD ? "AcDb3dPolyline" : "AcDb2dPolyline") + Tag(66, "1") +
                       Real(10, 0) + Real(20, 0) + Real(30, 0) + Tag(70, FormatInt(flags)) + xdata;
    int n = 0;
    for (const auto& v : vertices) {
        text += Head("VERTEX", handle + FormatString("%X", ++n), "AcDbVertex") +
                Tag(100, threeD ? "AcDb3dPolylineVertex" : "AcDb2dVertex") + Real(10, v[0]) + Real(20, v[1]) +
                Real(30, v[2]);
        if (v.size() > 3)
            text += Real(42, v[3]);
        text += Tag(70, threeD ? "32" : "0");
    }
    return text + Tag(0, "SEQEND") + Tag(5, handle + "F") + Tag(100, "AcDbEntity") + Tag(8, "RESEAUX");
}

std::string Point(const std::string& handle, double x, double y, const std::string& xdata, bool paperSpace)
{
    return Head("POINT", handle, "AcDbPoint", paperSpace) + Real(10, x) + Real(20, y) + Real(30, 0) + xdata;
}

std::unique_ptr<AcDbDatabase> DrawingWith(const std::string& entities)
{
    AcDbDatabase blank;
    std::string text, error;
    if (!velWriteDrawing(blank, text, error)) {
        ADD_FAILURE() << error;
        return nullptr;
    }
    const std::string marker = "ENTITIES\n";
    const std::size_t at = text.find(marker);
    if (at == std::string::npos) {
        ADD_FAILURE() << "no ENTITIES section in a new drawing";
        return nullptr;
    }
    text.insert(at + marker.size(), entities);
    std::unique_ptr<AcDbDatabase> database;
    if (const VelReadResult read = velReadDrawing(text, "reseaux.dxf", database); !read) {
        ADD_FAILURE() << read.description();
        return nullptr;
    }
    return database;
}

} // namespace network_test
