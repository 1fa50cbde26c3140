// Reading the network entities of a drawing: their XData, their lengths (straight and
// bulged segments, 2D and 3D polylines), grouped by network and project.
#include "network_model.hpp"

#include <cmath>

#include "text/text.hpp"

namespace network {

namespace {

struct KindName {
    ElementKind kind;
    const char* code;
};

constexpr KindName kKinds[] = {
    {ElementKind::Pipe, "TUY"},
    {ElementKind::Duct, "FRX"},
    {ElementKind::PipeSupply, "TUY_FRNT"},
    {ElementKind::Fitting, "SBL"},
    {ElementKind::FittingSupply, "SBL_FRNT"},
};

struct Vertex {
    double x = 0, y = 0, z = 0;
    double bulge = 0;
};

double Distance(const Vertex& a, const Vertex& b, bool withZ)
{
    const double dz = withZ ? b.z - a.z : 0.0;
    return std::sqrt((b.x - a.x) * (b.x - a.x) + (b.y - a.y) * (b.y - a.y) + dz * dz);
}

// Length of the arc that a bulge (tangent of a quarter of the included angle) draws on a chord.
double ArcLength(double chord, double bulge)
{
    if (std::fabs(bulge) < 1e-12 || chord == 0)
        return chord;
    const double angle = 4.0 * std::atan(std::fabs(bulge));
    return chord / (2.0 * std::sin(angle / 2.0)) * angle;
}

// Walks the segments of a polyline; a closed one has a segment back to its first vertex.
Lengths PolylineLengths(const std::vector<Vertex>& vertices, bool closed, bool threeD)
{
    Lengths lengths;
    const std::size_t n = vertices.size();
    const std::size_t segments = n < 2 ? 0 : (closed ? n : n - 1);
    for (std::size_t i = 0; i < segments; ++i) {
        const Vertex& a = vertices[i];
        const Vertex& b = vertices[(i + 1) % n];
        const double flat = ArcLength(Distance(a, b, false), threeD ? 0.0 : a.bulge);
        lengths.length2d += flat;
        lengths.length3d += threeD ? Distance(a, b, true) : flat;
    }
    return lengths;
}

bool Number(const std::string& text, double& value)
{
    std::string_view view = text;
    while (!view.empty() && view.front() == ' ')
        view.remove_prefix(1);
    while (!view.empty() && view.back() == ' ')
        view.remove_suffix(1);
    const auto parsed = ParseReal(view);
    if (!parsed || !std::isfinite(*parsed))
        return false;
    value = *parsed;
    return true;
}

// Vertices of an LWPOLYLINE: each 10 starts a vertex, 20 and 42 complete it.
bool LightweightVertices(const std::vector<VelDxfValue>& values, std::vector<Vertex>& vertices)
{
    for (const VelDxfValue& value : values) {
        double number = 0;
        if (value.code != 10 && value.code != 20 && value.code != 42)
            continue;
        if (!Number(value.text, number))
            return false;
        if (value.code == 10) {
            vertices.push_back({number, 0, 0, 0});
        } else if (!vertices.empty()) {
            (value.code == 20 ? vertices.back().y : vertices.back().bulge) = number;
        }
    }
    return true;
}

int Flags(const std::vector<VelDxfValue>& values)
{
    const auto flags = velDxfReal(values, 70);
    return flags ? static_cast<int>(*flags) : 0;
}

std::string Handle(AcDbHandle handle)
{
    return FormatString("%llX", static_cast<unsigned long long>(handle));
}

std::string Where(const VelEntity& entity)
{
    return FormatString("Entité %s (%s)", Handle(entity.handle).c_str(), entity.dxfName.c_str());
}

bool ValidLength(double value)
{
    return std::isfinite(value) && value > 0 && value < 1000;
}

} // namespace

const char* KindCode(ElementKind kind)
{
    for (const KindName& k : kKinds)
        if (k.kind == kind)
            return k.code;
    return "";
}

std::optional<ElementKind> KindFromCode(const std::string& code)
{
    for (const KindName& k : kKinds)
        if (EqualsNoCase(code, k.code))
            return k.kind;
    return std::nullopt;
}

bool IsLinear(ElementKind kind)
{
    return kind == ElementKind::Pipe || kind == ElementKind::Duct || kind == ElementKind::PipeSupply;
}

std::vector<std::string> Network::Models(ElementKind kind) const
{
    std::vector<std::string> models;
    for (const Project& project : projects)
        for (const Element& element : project.elements) {
            if (element.kind != kind)
                continue;
            bool known = false;
            for (const std::string& model : models)
                known = known || EqualsNoCase(model, element.model);
            if (!known)
                models.push_back(element.model);
        }
    return models;
}

bool Network::HasDepths() const
{
    for (const Project& project : projects)
        for (const Element& element : project.elements)
            if (element.kind == ElementKind::Pipe && element.depthStart)
                return true;
    return false;
}

bool MeasureEntity(const VelEntity& entity, Lengths& lengths, std::string& why)
{
    lengths = {};
    if (entity.dxfName == "LINE") {
        Vertex a, b;
        const auto get = [&](int code, double& out) {
            const auto value = entity.real(code);
            if (value && std::isfinite(*value))
                out = *value;
            return value.has_value() || code == 30 || code == 31;
        };
        if (!get(10, a.x) || !get(20, a.y) || !get(30, a.z) || !get(11, b.x) || !get(21, b.y) || !get(31, b.z)) {
            why = "ligne sans ses deux points";
            return false;
        }
        lengths.length2d = Distance(a, b, false);
        lengths.length3d = Distance(a, b, true);
        return true;
    }
    if (entity.dxfName == "LWPOLYLINE") {
        std::vector<Vertex> vertices;
        if (!LightweightVertices(entity.values, vertices)) {
            why = "sommet illisible";
            return false;
        }
        lengths = PolylineLengths(vertices, (Flags(entity.values) & 1) != 0, false);
        return true;
    }
    if (entity.dxfName == "POLYLINE") {
        const int flags = Flags(entity.values);
        if (flags & (16 | 64)) {
            why = "maillage ou réseau de faces, pas une canalisation";
            return false;
        }
        const bool threeD = (flags & 8) != 0;
        std::vector<Vertex> vertices;
        for (const auto& child : entity.children) {
            if (Flags(child) & 16) // frame point of a spline-fit polyline, not on the curve
                continue;
            Vertex v;
            const auto x = velDxfReal(child, 10), y = velDxfReal(child, 20);
            if (!x || !y) {
                why = "sommet illisible";
                return false;
            }
            v.x = *x;
            v.y = *y;
            v.z = velDxfReal(child, 30).value_or(0.0);
            v.bulge = velDxfReal(child, 42).value_or(0.0);
            vertices.push_back(v);
        }
        lengths = PolylineLengths(vertices, (flags & 1) != 0, threeD);
        return true;
    }
    why = "type d'entité sans longueur (LINE, LWPOLYLINE ou POLYLINE attendu)";
    return false;
}

void NetworkDrawing::Add(const VelEntity& entity, const resbuf* xdata)
{
    const resbuf* item = xdata != nullptr ? xdata->rbnext : nullptr;
    const auto refuse = [&](const char* what) {
        warnings.push_back(FormatString("%s : données %s incomplètes (%s attendu) ; ignorée.", Where(entity).c_str(),
                                        kNetworkApp, what));
    };
    const auto text = [&](std::string& out) {
        if (item == nullptr || item->restype != kXdAsciiString)
            return false;
        out = velRbText(item);
        item = item->rbnext;
        return true;
    };
    std::string networkName, projectName, kindCode, model;
    if (!text(networkName) || networkName.empty())
        return refuse("nom du réseau");
    if (item == nullptr || (item->restype != kXdInteger16 && item->restype != kXdInteger32))
        return refuse("indice du réseau, entier de 0 à 12");
    const long index = item->restype == kXdInteger16 ? item->resval.rint : item->resval.rlong;
    if (index < 0 || index > 12)
        return refuse("indice du réseau, entier de 0 à 12");
    item = item->rbnext;
    if (!text(projectName))
        return refuse("nom du projet");
    if (projectName.empty())
        projectName = networkName;
    if (!text(kindCode))
        return refuse("nature de l'élément");
    const auto kind = KindFromCode(kindCode);
    if (!kind)
        return refuse("nature TUY, FRX, TUY_FRNT, SBL ou SBL_FRNT");
    if (!text(model) || model.empty())
        return refuse("modèle");

    Element element;
    element.kind = *kind;
    element.model = model;
    element.handle = entity.handle;
    std::vector<double> depths, sizes;
    for (; item != nullptr; item = item->rbnext) {
        if (item->restype == kXdReal)
            depths.push_back(item->resval.rreal);
        else if (item->restype == kXdDist)
            sizes.push_back(item->resval.rreal);
        else
            warnings.push_back(FormatString("%s : donnée %d inattendue après le modèle, non utilisée.",
                                            Where(entity).c_str(), item->restype));
    }
    const std::size_t maxDepths = IsLinear(*kind) ? 2 : 1;
    for (std::size_t i = 0; i < depths.size(); ++i) {
        if (i >= maxDepths || !std::isfinite(depths[i]) || depths[i] < 0 || depths[i] > 100) {
            warnings.push_back(FormatString("%s : profondeur %s non utilisée (de 0 à 100 m, %zu au plus).",
                                            Where(entity).c_str(), FormatRealShortest(depths[i]).c_str(), maxDepths));
            continue;
        }
        (element.depthStart ? element.depthEnd : element.depthStart) = depths[i];
    }
    if (element.depthStart && !element.depthEnd)
        element.depthEnd = element.depthStart;
    if (IsLinear(*kind)) {
        for (std::size_t i = 0; i < sizes.size() && i < 2; ++i) {
            if (!ValidLength(sizes[i])) {
                warnings.push_back(FormatString(
                    "%s : %s %s non utilisée (nombre de mètres positif attendu).", Where(entity).c_str(),
                    i == 0 ? "longueur utile" : "largeur de tranchée", FormatRealShortest(sizes[i]).c_str()));
                continue;
            }
            (i == 0 ? element.usefulLength : element.trenchWidth) = sizes[i];
        }
        Lengths lengths;
        std::string why;
        if (!MeasureEntity(entity, lengths, why)) {
            warnings.push_back(FormatString("%s : %s ; ignorée.", Where(entity).c_str(), why.c_str()));
            return;
        }
        if (!std::isfinite(lengths.length3d) || !std::isfinite(lengths.length2d)) {
            warnings.push_back(FormatString("%s : longueur non calculable ; ignorée.", Where(entity).c_str()));
            return;
        }
        element.length3d = lengths.length3d;
        element.length2d = lengths.length2d;
    }

    Network* network = FindNetwork(networkName);
    if (network == nullptr) {
        networks.push_back({networkName, static_cast<int>(index), {}});
        network = &networks.back();
    } else if (network->index != index) {
        warnings.push_back(FormatString("%s : le réseau %s a déjà l'indice %d ; l'indice %ld n'est pas retenu.",
                                        Where(entity).c_str(), network->name.c_str(), network->index, index));
    }
    // A project belongs to one network: its record in the drawing is filed by name alone.
    for (const Network& other : networks) {
        if (&other == network)
            continue;
        for (const Project& project : other.projects)
            if (EqualsNoCase(project.name, projectName)) {
                warnings.push_back(FormatString("%s : le projet « %s » appartient déjà au réseau %s ; ignorée.",
                                                Where(entity).c_str(), project.name.c_str(), other.name.c_str()));
                return;
            }
    }
    for (Project& project : network->projects)
        if (EqualsNoCase(project.name, projectName)) {
            project.elements.push_back(std::move(element));
            return;
        }
    network->projects.push_back({projectName, {std::move(element)}});
}

NetworkDrawing NetworkDrawing::Read(AcDbDatabase& database)
{
    NetworkDrawing drawing;
    std::size_t skipped = 0;
    for (const VelEntity& entity : velReadEntities(database, &skipped)) {
        if (entity.paperSpace)
            continue;
        VelRbPtr xdata(entity.xData(kNetworkApp));
        if (xdata)
            drawing.Add(entity, xdata.get());
    }
    if (skipped > 0)
        drawing.warnings.push_back(FormatString("%zu entité(s) illisible(s) dans le dessin, non lue(s).", skipped));
    return drawing;
}

Network* NetworkDrawing::FindNetwork(const std::string& name)
{
    for (Network& network : networks)
        if (EqualsNoCase(network.name, name))
            return &network;
    return nullptr;
}

const Network* NetworkDrawing::FindNetwork(const std::string& name) const
{
    return const_cast<NetworkDrawing*>(this)->FindNetwork(name);
}

} // namespace network
