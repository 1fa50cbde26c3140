// Quantities of each network project and their records in the drawing: one XRECORD per
// project in "VELANTO_RSX_VRD" / "PROJECTS", its XData of application "DAZUVUVUD" holding
// "PRJ_NOM", the project's name, then quantity keys (between double quotes, as the price
// schedule's articles carry them) each followed by its quantity.
#pragma once

#include <string>
#include <vector>

#include "network_model.hpp"
#include "velsiblings/project_records.h"

namespace network {

// Where and how the records are filed: the one definition every reader shares.
inline constexpr const velproj::ProjectGroupPlace& kNetworkPlace = velproj::kProjectGroups[0];
static_assert(kNetworkPlace.kind == velproj::kKindNetwork, "the networks' place comes first");
inline constexpr const char* kRecordApp = velproj::kRecordApp;
inline constexpr const char* kNetworksDictionary = kNetworkPlace.first;
inline constexpr const char* kProjectsDictionary = kNetworkPlace.second;

// Limits of the trench depth classes, in metres: 0-1.30, 1.30-2.00, 2.00-3.50, over 3.50.
inline const std::vector<double> kDepthBounds = {0.0, 1.30, 2.00, 3.50};

// One quantity of a project; counts go to the record as 32-bit integers, the rest as reals.
struct Quantity {
    std::string key; // with its double quotes
    double value = 0;
    bool count = false;
};

// The quantity key of a quantity name: the name between double quotes.
std::string QuantityKey(const std::string& name);

// A project's quantities: total pipe length, then by model the 3D lengths and element
// counts of pipes, ducts and supplies and the counts of fittings, then the trench volume
// and, by depth class (mean depth of each pipe), the 2D length and the trench volume.
// Element counts are rounded up per drawn element (a run of 13 m of 6 m pipes takes 3;
// one of 12.005 m takes 2).
std::vector<Quantity> ProjectQuantities(const Project& project, const std::vector<double>& depthBounds);

// What writing the records did.
struct RecordReport {
    struct Written {
        std::string network;
        std::string project;
        std::size_t quantities = 0;
        double pipeLength = 0;
        std::size_t fittings = 0;
    };
    std::vector<Written> written;
    std::vector<std::string> removed; // records of projects no longer in the drawing
    std::string error;                // French, when the drawing refused a change
};

// Writes (or replaces) the record of every project of the networks and removes the
// records of projects the drawing no longer holds. False with report.error set when the
// drawing refuses a change; the records written before stay.
bool WriteProjectRecords(AcDbDatabase& database, const NetworkDrawing& drawing, RecordReport& report);

// Rsx_WriteXDataMetres on a drawing: 0 written, 2 refused by the drawing.
int WriteNetworkQuantities(AcDbDatabase& database, RecordReport& report, std::vector<std::string>& warnings);

// Rsx_GetRsxFromType on a drawing: the names of the projects of the network (without
// regard to case), sorted. 0 when at least one was found, 1 when none, 2 for a null
// argument (the list is then left alone).
int ProjectsOfNetwork(AcDbDatabase* database, const std::string* networkName, std::vector<std::string>* projects);

} // namespace network
