// What the metre module reads and writes in a drawing: the quantity records of the
// projects (platforms, road projects, networks, Korvane projects) and its own record of
// the estimates made from the drawing.
#pragma once

#include "velsiblings/project_records.h"

#include <map>
#include <optional>
#include <string>
#include <vector>

class AcDbDatabase;

namespace metre {

// Every project of the drawing by kind (1 platform, 2 road, 3 network, 4 Korvane), then
// by name, read as the module's project discovery reads them: the record met last in a
// dictionary's sorted walk wins a repeated name within its kind.
class ProjectTables {
public:
    // Reads the four project dictionaries; a missing one leaves its kind empty.
    static ProjectTables Read(AcDbDatabase& database);

    // The quantity of a key in a project of that kind, the key compared without regard to
    // case. Of keys that differ only by case the last in the table counts, as in the
    // module's article filter, where each matching key replaces the one before. nullopt
    // when the project or the key is missing.
    std::optional<double> Quantity(int projectKind, const std::string& project, const std::string& key) const;
    bool HasProject(int projectKind, const std::string& project) const;
    // The kind under which the project is found: the given one first, then the others
    // (an older line summing several projects carries the kind of only one of them);
    // nullopt when no kind has it.
    std::optional<int> KindHolding(int projectKind, const std::string& project) const;

    void Add(int projectKind, const std::string& project, velproj::QuantityTable quantities);

private:
    std::map<int, std::map<std::string, velproj::QuantityTable>> tables_;
};

// Dictionary of the named-object dictionary where the estimates are recorded.
inline constexpr const char* kEstimateDictionary = "VELANTO_METRE_DEVIS";

// What the drawing keeps of one estimate.
struct EstimateRecord {
    std::string name;
    std::string workbookPath;
    std::string csvPath;
    int lineCount = 0;
    double totalExclTax = 0;
    double totalInclTax = 0;
};

// Files the estimate under its name (replacing one of the same name, compared without
// regard to case); false with a French message when the drawing refuses it.
bool RecordEstimate(AcDbDatabase& database, const EstimateRecord& record, std::string& error);

// The estimates recorded in the drawing, in the dictionary's sorted order.
std::vector<EstimateRecord> RecordedEstimates(AcDbDatabase& database);

} // namespace metre
