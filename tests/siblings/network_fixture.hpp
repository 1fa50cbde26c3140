// Drawings for the network sizing stand-in's tests: a new drawing with entities written
// into its ENTITIES section as DXF text, each with the stand-in's XData.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "velhost/dbase.h"

namespace network_test {

// DXF text of the XData of one network element (group codes and values, one per pair).
struct XData {
    std::string network = "EP";
    int index = 0;
    std::string project = "";
    std::string kind = "TUY";
    std::string model = "PVC 200";
    std::vector<double> depths; // 1040 items
    std::vector<double> sizes;  // 1041 items

    std::string Text() const;
};

// Tags of one entity: "0\nLINE\n5\n<handle>\n..." followed by the XData text when given.
std::string Line(const std::string& handle, double x1, double y1, double z1, double x2, double y2, double z2,
                 const std::string& xdata);
std::string LwPolyline(const std::string& handle, const std::vector<std::vector<double>>& vertices, bool closed,
                       const std::string& xdata); // vertex: x, y[, bulge]
std::string Polyline(const std::string& handle, int flags, const std::vector<std::vector<double>>& vertices,
                     const std::string& xdata); // vertex: x, y, z[, bulge]
std::string Point(const std::string& handle, double x, double y, const std::string& xdata, bool paperSpace = false);

// A new drawing holding the entities; the test fails (and null comes back) when it does
// not read.
std::unique_ptr<AcDbDatabase> DrawingWith(const std::string& entities);

} // namespace network_test
