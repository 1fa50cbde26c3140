// The estimate line handed to the metre module: one article with the project or
// projects whose quantities it counts. Both sides read the record directly.
#pragma once

#include <string>

// Project kinds of an estimate line.
enum : int {
    kProjectLumpSum = 0,  // the pseudo-project "**Forfait"
    kProjectPlatform = 1, // a platform, or the pseudo-project "**Voirie"
    kProjectRoad = 2,
    kProjectNetwork = 3,  // a network project, or a network's lump sums under its name
    kProjectKorvane = 4,
};

// Line kind of a lump-sum article (non-graphic); other articles give 3.
inline constexpr int kLineKindQuantity = 3;
inline constexpr int kLineKindLumpSum = 5;

// Fields in exchange order; the assocXxx fields belong to the metre module and are left
// at their defaults by the module that builds the lines.
class CZodEVIAssocLine {
public:
    std::string label;
    int lineKind = -1;
    std::string quantityKey;
    std::string assocText1;
    // One project name, or several joined with ",".
    std::string projects;
    int projectKind = 0;
    int articleNature = -1;
    std::string description;
    std::string assocText2;
    std::string treePath;
    std::string metreText3;
    std::string unit;
    std::string assocText3;
    std::string assocText4;
    std::string assocText5;
    int assocInt1 = -1;
    double assocReal1 = -999999.0;
    double assocReal2 = -999999.0;
    double unitPrice = 0;
    int assocInt2 = 0;
};
