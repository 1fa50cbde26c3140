// What the database's files share apart from modules: the text encoding of an object's
// drawing and the registration of the applications its XData names.
#pragma once

#include <string>
#include <vector>

#include "host/dxf/codepage.hpp"
#include "velhost/dbase.h"

// Encoding of the object's drawing; UTF-8 for an object outside any.
const vel::dxf::TextEncoding& velEncodingOf(const AcDbObject& object);
// Registers each application the drawing does not know yet.
void velRegisterApps(AcDbDatabase* database, const std::vector<std::string>& apps);
