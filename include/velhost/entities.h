// Read-only access to the graphical entities of a drawing: each entity of the ENTITIES
// section as its type, handle, layer and group-code values, with its XData on demand.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "velhost/dbase.h"
#include "velhost/resbuf.h"

#pragma GCC visibility push(default)

// One group code and its value, decoded to UTF-8.
struct VelDxfValue {
    int code = 0;
    std::string text;
};

// A copy of one entity, taken when the drawing was walked; changing it changes nothing.
struct VelEntity {
    std::string dxfName; // "LINE", "LWPOLYLINE", "INSERT", ...
    AcDbObjectId id;
    AcDbHandle handle = 0;
    std::string layer;       // group 8; "0" when the file leaves it out
    bool paperSpace = false; // group 67 set to 1
    // Every tag of the entity after its 0 tag, in file order, XData excluded.
    std::vector<VelDxfValue> values;
    // The VERTEX records of a POLYLINE, the ATTRIB records of an INSERT, each as its values.
    std::vector<std::vector<VelDxfValue>> children;

    // Value of the first tag with the code; nullopt when absent (or not a number).
    std::optional<std::string> text(int code) const;
    std::optional<double> real(int code) const;
    // The entity's XData of one application (all when null), as AcDbObject::xData answers
    // it; null when there is none or the entity is gone. Free with acutRelRb.
    resbuf* xData(const char* regappName) const;
};

// The first tag with the code among values, as a number; nullopt when absent or not one.
std::optional<double> velDxfReal(const std::vector<VelDxfValue>& values, int code);

// The entities of the ENTITIES section (model and paper space; the contents of block
// definitions are not visited) in file order. VERTEX, ATTRIB and SEQEND records are
// folded into the entity they follow. An entity that does not parse is left out and
// counted in *skipped when given.
std::vector<VelEntity> velReadEntities(AcDbDatabase& database, std::size_t* skipped = nullptr);

#pragma GCC visibility pop
