// The estimate line handed to the metre module: one article with the project or
// projects whose quantities it counts. Both sides read the record directly.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

// Project kinds of an estimate line.
enum : int {
    kProjectLumpSum = 0,  // the pseudo-project "**Forfait"
    kProjectPlatform = 1, // a platform, or the pseudo-project "**Voirie"
    kProjectRoad = 2,
    kProjectNetwork = 3, // a network project, or a network's lump sums under its name
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

// One project counted by a line, with its kind.
struct CZodEVILineProject {
    std::string name;
    int kind = 0;
};

// A project name may stand in two groups (a road and a platform both named "Parking"), so
// the module also files each project of a line with its kind in assocText1: one
// "<kind>\t<name>" per project, joined with "\n", in the order of `projects`.
inline std::string EncodeLineProjects(const std::vector<CZodEVILineProject>& projects)
{
    std::string text;
    for (std::size_t i = 0; i < projects.size(); ++i) {
        if (i > 0)
            text += '\n';
        text += std::to_string(projects[i].kind);
        text += '\t';
        text += projects[i].name;
    }
    return text;
}

// The projects of a line with their kinds, from assocText1; empty when the line does not
// carry them (a line of another module), the caller then falls back on `projects` and
// `projectKind`.
inline std::vector<CZodEVILineProject> DecodeLineProjects(const CZodEVIAssocLine& line)
{
    std::vector<CZodEVILineProject> projects;
    std::size_t start = 0;
    while (start < line.assocText1.size()) {
        std::size_t end = line.assocText1.find('\n', start);
        if (end == std::string::npos)
            end = line.assocText1.size();
        const std::size_t tab = line.assocText1.find('\t', start);
        if (tab == std::string::npos || tab >= end || tab == start || tab - start > 2)
            return {};
        int kind = 0;
        for (std::size_t i = start; i < tab; ++i) {
            const char c = line.assocText1[i];
            if (c < '0' || c > '9')
                return {};
            kind = kind * 10 + (c - '0');
        }
        projects.push_back({line.assocText1.substr(tab + 1, end - tab - 1), kind});
        start = end + 1;
    }
    return projects;
}
