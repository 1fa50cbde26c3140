// Tests of the network reader: lengths of the drawn shapes, the XData layout, grouping by
// network and project, and the warnings that name the entity left out.
#include "network_model.hpp"

#include <gtest/gtest.h>

#include <cmath>
#include <numbers>

#include "network_fixture.hpp"

using namespace network;
using namespace network_test;

namespace {

const Element& OnlyElement(const NetworkDrawing& drawing)
{
    static const Element none;
    if (drawing.networks.size() != 1 || drawing.networks[0].projects.size() != 1 ||
        drawing.networks[0].projects[0].elements.size() != 1) {
        ADD_FAILURE() << "one element expected";
        return none;
    }
    return drawing.networks[0].projects[0].elements[0];
}

} // namespace

TEST(NetworkDrawing, MeasuresEachShape)
{
    const std::string pipe = XData{}.Text();
    struct Case {
        const char* name;
        std::string entity;
        double length3d;
        double length2d;
    };
    const Case cases[] = {
        {"sloped line", Line("A01", 0, 0, 0, 3, 4, 12, pipe), 13, 5},
        {"open lwpolyline", LwPolyline("A01", {{0, 0}, {3, 4}, {3, 10}}, false, pipe), 11, 11},
        {"closed lwpolyline", LwPolyline("A01", {{0, 0}, {10, 0}, {10, 10}, {0, 10}}, true, pipe), 40, 40},
        {"lwpolyline half circle", LwPolyline("A01", {{0, 0, 1}, {2, 0}}, false, pipe), std::numbers::pi,
         std::numbers::pi},
        {"3D polyline", Polyline("A01", 8, {{0, 0, 0}, {3, 4, 0}, {3, 4, 12}}, pipe), 17, 5},
        {"2D polyline with a bulge", Polyline("A01", 0, {{0, 0, 0, -1}, {2, 0, 0}}, pipe), std::numbers::pi,
         std::numbers::pi},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const auto database = DrawingWith(c.entity);
        ASSERT_TRUE(database);
        const NetworkDrawing drawing = NetworkDrawing::Read(*database);
        EXPECT_TRUE(drawing.warnings.empty()) << drawing.warnings.front();
        const Element& element = OnlyElement(drawing);
        EXPECT_NEAR(element.length3d, c.length3d, 1e-9);
        EXPECT_NEAR(element.length2d, c.length2d, 1e-9);
    }
}

TEST(NetworkDrawing, LeavesOutWhatItCannotUse)
{
    const auto xdata = [](auto change) {
        XData x;
        change(x);
        return x.Text();
    };
    // An entity without the network XData: never a warning.
    const std::string plain = "0\nLINE\n5\nB01\n8\n0\n10\n0\n20\n0\n11\n1\n21\n0\n";
    struct Case {
        const char* name;
        std::string entities;
        std::string warning;
    };
    const Case cases[] = {
        {"no network name", Line("A01", 0, 0, 0, 1, 0, 0, xdata([](XData& x) { x.network = ""; })),
         "Entité A01 (LINE) : données VELANTO_RSX incomplètes (nom du réseau attendu) ; ignorée."},
        {"index out of range", Line("A01", 0, 0, 0, 1, 0, 0, xdata([](XData& x) { x.index = 13; })),
         "Entité A01 (LINE) : données VELANTO_RSX incomplètes (indice du réseau, entier de 0 à 12 attendu) ; ignorée."},
        {"unknown kind", Line("A01", 0, 0, 0, 1, 0, 0, xdata([](XData& x) { x.kind = "CABLE"; })),
         "Entité A01 (LINE) : données VELANTO_RSX incomplètes (nature TUY, FRX, TUY_FRNT, SBL ou SBL_FRNT attendu) ; "
         "ignorée."},
        {"empty model", Line("A01", 0, 0, 0, 1, 0, 0, xdata([](XData& x) { x.model = ""; })),
         "Entité A01 (LINE) : données VELANTO_RSX incomplètes (modèle attendu) ; ignorée."},
        {"pipe drawn as a point", Point("A01", 0, 0, XData{}.Text()),
         "Entité A01 (POINT) : type d'entité sans longueur (LINE, LWPOLYLINE ou POLYLINE attendu) ; ignorée."},
        {"pipe drawn as a mesh", Polyline("A01", 16, {{0, 0, 0}, {1, 0, 0}}, XData{}.Text()),
         "Entité A01 (POLYLINE) : maillage ou réseau de faces, pas une canalisation ; ignorée."},
        {"third depth", Line("A01", 0, 0, 0, 1, 0, 0, xdata([](XData& x) {
                                 x.depths = {1, 2, 3};
                             })),
         "Entité A01 (LINE) : profondeur 3 non utilisée (de 0 à 100 m, 2 au plus)."},
        {"negative useful length", Line("A01", 0, 0, 0, 1, 0, 0, xdata([](XData& x) { x.sizes = {-6}; })),
         "Entité A01 (LINE) : longueur utile -6 non utilisée (nombre de mètres positif attendu)."},
        {"zero trench width", Line("A01", 0, 0, 0, 1, 0, 0, xdata([](XData& x) {
                                       x.sizes = {6, 0};
                                   })),
         "Entité A01 (LINE) : largeur de tranchée 0 non utilisée (nombre de mètres positif attendu)."},
        {"other index for the network",
         Line("A01", 0, 0, 0, 1, 0, 0, XData{}.Text()) +
             Line("A02", 0, 0, 0, 1, 0, 0, xdata([](XData& x) { x.index = 1; })),
         "Entité A02 (LINE) : le réseau EP a déjà l'indice 0 ; l'indice 1 n'est pas retenu."},
        {"project of another network",
         Line("A01", 0, 0, 0, 1, 0, 0, xdata([](XData& x) { x.project = "Lot A"; })) +
             Line("A02", 0, 0, 0, 1, 0, 0, xdata([](XData& x) {
                      x.network = "EU";
                      x.index = 1;
                      x.project = "lot a";
                  })),
         "Entité A02 (LINE) : le projet « Lot A » appartient déjà au réseau EP ; ignorée."},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const auto database = DrawingWith(c.entities + plain);
        ASSERT_TRUE(database);
        const NetworkDrawing drawing = NetworkDrawing::Read(*database);
        ASSERT_EQ(drawing.warnings.size(), 1u);
        EXPECT_EQ(drawing.warnings[0], c.warning);
    }
}

TEST(NetworkDrawing, KeepsDepthsAndSizesThatRead)
{
    const auto database =
        DrawingWith(Line("A01", 0, 0, 0, 5, 0, 0, XData{.depths = {1.2}, .sizes = {2.5, 1.1}}.Text()));
    ASSERT_TRUE(database);
    const NetworkDrawing drawing = NetworkDrawing::Read(*database);
    const Element& element = OnlyElement(drawing);
    EXPECT_EQ(element.depthStart, 1.2);
    EXPECT_EQ(element.depthEnd, 1.2); // one depth: the same at both ends
    EXPECT_EQ(element.usefulLength, 2.5);
    EXPECT_EQ(element.trenchWidth, 1.1);
    EXPECT_EQ(element.handle, 0xA01u);
}

TEST(NetworkDrawing, GroupsByNetworkAndProjectWithoutRegardToCase)
{
    const auto element = [](const char* network, int index, const char* project, const char* kind, const char* model) {
        return XData{.network = network, .index = index, .project = project, .kind = kind, .model = model}.Text();
    };
    const std::string entities = Line("A01", 0, 0, 0, 10, 0, 0, element("EP", 0, "", "TUY", "PVC 315")) +
                                 Line("A02", 0, 0, 0, 10, 0, 0, element("eu", 1, "EU Nord", "TUY", "PVC 200")) +
                                 Point("A03", 0, 0, element("ep", 0, "", "SBL", "Regard 1000")) +
                                 Line("A04", 0, 0, 0, 10, 0, 0, element("EP", 0, "EP Sud", "TUY", "pvc 315")) +
                                 Line("A05", 0, 0, 0, 10, 0, 0, element("EP", 0, "ep sud", "TUY", "Béton 400")) +
                                 Point("A06", 0, 0, element("EP", 0, "", "SBL", "Regard 1000"), true);
    const auto database = DrawingWith(entities);
    ASSERT_TRUE(database);
    const NetworkDrawing drawing = NetworkDrawing::Read(*database);
    EXPECT_TRUE(drawing.warnings.empty());
    ASSERT_EQ(drawing.networks.size(), 2u);
    const Network* ep = drawing.FindNetwork("Ep");
    ASSERT_NE(ep, nullptr);
    EXPECT_EQ(ep->name, "EP");
    ASSERT_EQ(ep->projects.size(), 2u);
    EXPECT_EQ(ep->projects[0].name, "EP");          // an empty project name is the network's
    EXPECT_EQ(ep->projects[0].elements.size(), 2u); // the paper-space point is not counted
    EXPECT_EQ(ep->projects[1].name, "EP Sud");
    EXPECT_EQ(ep->projects[1].elements.size(), 2u);
    EXPECT_EQ(ep->Models(ElementKind::Pipe), (std::vector<std::string>{"PVC 315", "Béton 400"}));
    EXPECT_EQ(ep->Models(ElementKind::Fitting), (std::vector<std::string>{"Regard 1000"}));
    EXPECT_TRUE(ep->Models(ElementKind::Duct).empty());
    EXPECT_FALSE(ep->HasDepths());
    const Network* eu = drawing.FindNetwork("EU");
    ASSERT_NE(eu, nullptr);
    EXPECT_EQ(eu->index, 1);
    EXPECT_EQ(eu->name, "eu");
}
