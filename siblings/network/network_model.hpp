// The networks drawn in a drawing, as the network sizing stand-in reads them: entities
// carrying its XData (application VELANTO_RSX), grouped by network and project, with the
// 3D and 2D lengths of pipes and the depths of their trench.
//
// XData layout of one entity (application "VELANTO_RSX"), items in this order:
//   1000  network name                   "EP", "EU", ... (not empty)
//   1070  network index                  0 EP, 1 EU, 2 AEP, ... 12 other
//   1000  project name                   "" means the network's name
//   1000  element kind                   TUY pipe, FRX duct, TUY_FRNT supply along a pipe,
//                                        SBL manhole or fitting, SBL_FRNT supply on a fitting
//   1000  model                          "PVC 200", "Regard 1000", ... (not empty)
// then, all optional:
//   1040  trench depth in metres         linear kinds: at the first point, then at the last
//                                        (one value: the same at both ends); counted kinds: one
//   1041  useful length of one element   linear kinds, metres (default 6.00)
//   1041  trench width                   linear kinds, metres (default 0.80)
// Linear kinds are drawn as LINE, LWPOLYLINE or POLYLINE; counted kinds as any entity
// (INSERT, POINT, CIRCLE...), each counting one.
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "velhost/dbase.h"
#include "velhost/entities.h"

namespace network {

inline constexpr const char* kNetworkApp = "VELANTO_RSX";
inline constexpr double kDefaultUsefulLength = 6.0;
inline constexpr double kDefaultTrenchWidth = 0.8;

enum class ElementKind { Pipe, Duct, PipeSupply, Fitting, FittingSupply };

// Kind code of the XData ("TUY", ...) and back; nullopt for an unknown code.
const char* KindCode(ElementKind kind);
std::optional<ElementKind> KindFromCode(const std::string& code);
bool IsLinear(ElementKind kind);

// One drawn element of a network project.
struct Element {
    ElementKind kind = ElementKind::Pipe;
    std::string model;
    AcDbHandle handle = 0;
    double length3d = 0; // linear kinds only
    double length2d = 0;
    std::optional<double> depthStart; // metres below the ground
    std::optional<double> depthEnd;
    double usefulLength = kDefaultUsefulLength;
    double trenchWidth = kDefaultTrenchWidth;
};

struct Project {
    std::string name;
    std::vector<Element> elements;
};

struct Network {
    std::string name;
    int index = 0;
    std::vector<Project> projects; // in order of first appearance

    // Distinct models of one kind over all projects, first spelling and first appearance.
    std::vector<std::string> Models(ElementKind kind) const;
    bool HasDepths() const;
};

// Lengths of a linear entity; false with `why` when its type or shape has none.
struct Lengths {
    double length3d = 0;
    double length2d = 0;
};
bool MeasureEntity(const VelEntity& entity, Lengths& lengths, std::string& why);

// The networks of a drawing. Names of networks and projects are matched without regard
// to case (the first spelling is kept), as the schedule and the drawing's dictionaries do.
struct NetworkDrawing {
    std::vector<Network> networks; // in order of first appearance
    // One French line per entity left out or value not used, naming the entity's handle.
    std::vector<std::string> warnings;

    static NetworkDrawing Read(AcDbDatabase& database);
    // Reads one entity's XData list (starting at its 1001 item) into the networks.
    void Add(const VelEntity& entity, const resbuf* xdata);

    Network* FindNetwork(const std::string& name);
    const Network* FindNetwork(const std::string& name) const;
};

} // namespace network
