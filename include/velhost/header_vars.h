// The drawing header variables the host interprets, in one table: the DXF reader and
// writer, the database, the system variables and a module's saved settings all walk it.
#pragma once

#include <string>
#include <string_view>

// One header variable: its DXF name, the group code of its value and, for an integer,
// the values a drawing may hold. A flag (0 or 1) is read as set for any non-zero value.
struct VelHeaderVar {
    const char* name; // "$OSMODE"
    int code;
    int min = 0;
    int max = 0;
    // The system variable of the same setting ("OSMODE").
    std::string_view sysvar() const { return std::string_view(name).substr(1); }
};

// The settings, named as the table names them, with the values of a drawing whose
// header leaves them out.
struct VelHeaderSettings {
    int aunits = 0;
    double angbase = 0.0;
    bool angdir = false;
    int osmode = 37;   // endpoint, centre, intersection
    int cecolor = 256; // BYLAYER
    bool attdia = false;
    bool attreq = true;
    bool limcheck = false;
    bool orthomode = false;
    std::string clayer = "0";
};

// The table. Calls f(variable, records.member...) for each variable in this order, with
// the member of that name of every record given, so that records of different types
// walk together (a drawing's settings and a module's copy of them, say).
// OSMODE holds object-snap bits in a signed 16-bit value everywhere it travels (group
// code 70, a short result buffer, the modules' records): 0 to 32767, never negative.
template <class F, class... Records>
void velWalkHeaderVars(F&& f, Records&... records)
{
    f(VelHeaderVar{"$AUNITS", 70, 0, 4}, records.aunits...);
    f(VelHeaderVar{"$ANGBASE", 50}, records.angbase...);
    f(VelHeaderVar{"$ANGDIR", 70, 0, 1}, records.angdir...);
    f(VelHeaderVar{"$OSMODE", 70, 0, 32767}, records.osmode...);
    // 257 (by entity) may come from a file; the host itself sets 0 to 256.
    f(VelHeaderVar{"$CECOLOR", 62, 0, 257}, records.cecolor...);
    f(VelHeaderVar{"$ATTDIA", 70, 0, 1}, records.attdia...);
    f(VelHeaderVar{"$ATTREQ", 70, 0, 1}, records.attreq...);
    f(VelHeaderVar{"$LIMCHECK", 70, 0, 1}, records.limcheck...);
    f(VelHeaderVar{"$ORTHOMODE", 70, 0, 1}, records.orthomode...);
    f(VelHeaderVar{"$CLAYER", 8}, records.clayer...);
}
