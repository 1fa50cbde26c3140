// Tests of the network quantities and their project records: values by key, the record
// read back item by item, replacement and removal of records, and the projects of a network.
#include "network_records.hpp"

#include <gtest/gtest.h>

#include "network_fixture.hpp"
#include "text/text.hpp"

using namespace network;
using namespace network_test;

namespace {

Element Pipe(const char* model, double length, std::optional<double> d1, std::optional<double> d2, double useful = 6,
             double width = 0.8)
{
    Element e;
    e.kind = ElementKind::Pipe;
    e.model = model;
    e.length3d = length;
    e.length2d = length;
    e.depthStart = d1;
    e.depthEnd = d2;
    e.usefulLength = useful;
    e.trenchWidth = width;
    return e;
}

Element Counted(ElementKind kind, const char* model)
{
    Element e;
    e.kind = kind;
    e.model = model;
    return e;
}

std::vector<std::string> Texts(const std::vector<Quantity>& quantities)
{
    std::vector<std::string> out;
    for (const Quantity& q : quantities)
        out.push_back(q.key + (q.count ? " # " : " = ") + FormatReal(q.value, 3));
    return out;
}

// The record of one project, read back from the drawing; null when absent.
VelRbPtr RecordOf(AcDbDatabase& database, const std::string& project)
{
    AcDbDictionary* named = nullptr;
    if (database.getNamedObjectsDictionary(named, AcDb::kForRead) != Acad::eOk)
        return nullptr;
    AcDbObject* networks = nullptr;
    AcDbObject* projects = nullptr;
    AcDbObject* record = nullptr;
    VelRbPtr data;
    if (named->getAt(kNetworksDictionary, networks, AcDb::kForRead) == Acad::eOk) {
        if (static_cast<AcDbDictionary*>(networks)->getAt(kProjectsDictionary, projects, AcDb::kForRead) == Acad::eOk) {
            if (static_cast<AcDbDictionary*>(projects)->getAt(project, record, AcDb::kForRead) == Acad::eOk) {
                EXPECT_EQ(record->dxfName(), "XRECORD");
                data.reset(record->xData(kRecordApp));
                record->close();
            }
            projects->close();
        }
        networks->close();
    }
    named->close();
    return data;
}

std::uint32_t ProjectCount(AcDbDatabase& database)
{
    std::uint32_t count = 0;
    velproj::ForEachProjectRecord(&database, [&](auto kind, auto&&...) { count += kind == velproj::kKindNetwork; });
    return count;
}

std::string Tagged(const char* network, int index, const char* project, const char* kind, const char* model)
{
    return XData{.network = network, .index = index, .project = project, .kind = kind, .model = model}.Text();
}

} // namespace

TEST(ProjectQuantities, LengthsCountsAndTrenchClasses)
{
    Project project{"EP Lot 1", {}};
    project.elements = {
        Pipe("PVC 200", 13.0, 1.0, 1.4),                  // mean 1.20: class 0.00-1.30, 3 pipes
        Pipe("Béton 400", 10.0, 3.6, 4.0, 2.5, 1.0),      // mean 3.80: over 3.50, 4 pipes
        Pipe("pvc 200", 12.005, 1.3, 1.3),                // on the bound: lower class; 2 pipes, not 3
        Pipe("PVC 200", 5.0, std::nullopt, std::nullopt), // no depth: no trench
        Counted(ElementKind::Fitting, "Regard 1000"),
        Counted(ElementKind::Fitting, "Avaloir"),
        Counted(ElementKind::Fitting, "Regard 1000"),
        Counted(ElementKind::FittingSupply, "Tampon D400"),
    };
    Element duct = Pipe("TPC 90", 50.0, 0.8, 0.8, 25);
    duct.kind = ElementKind::Duct;
    project.elements.push_back(duct);
    Element supply = Pipe("Grillage avertisseur", 30.0, std::nullopt, std::nullopt);
    supply.kind = ElementKind::PipeSupply;
    project.elements.push_back(supply);

    const double lowVolume = 13.0 * 1.2 * 0.8 + 12.005 * 1.3 * 0.8;
    const double highVolume = 10.0 * 3.8 * 1.0;
    EXPECT_EQ(Texts(ProjectQuantities(project, kDepthBounds)),
              (std::vector<std::string>{
                  "\"RSX_LIN_TOT_3D\" = 40.005",
                  "\"RSX_TUY_LIN_3D_PVC 200\" = 30.005",
                  "\"RSX_TUY_NB_PVC 200\" # 6.000",
                  "\"RSX_TUY_LIN_3D_Béton 400\" = 10.000",
                  "\"RSX_TUY_NB_Béton 400\" # 4.000",
                  "\"RSX_FRX_LIN_3D_TPC 90\" = 50.000",
                  "\"RSX_FRX_NB_TPC 90\" # 2.000",
                  "\"RSX_TUY_FRNT_LIN_3D_Grillage avertisseur\" = 30.000",
                  "\"RSX_SBL_NB_Regard 1000\" # 2.000",
                  "\"RSX_SBL_NB_Avaloir\" # 1.000",
                  "\"RSX_SBL_FRNT_NB_Tampon D400\" # 1.000",
                  "\"RSX_VOL_FOU\" = " + FormatReal(lowVolume + highVolume, 3),
                  "\"RSX_LIN_0.00_1.30_2D\" = 25.005",
                  "\"RSX_VOL_0.00_1.30\" = " + FormatReal(lowVolume, 3),
                  "\"RSX_LIN_3.50_2D\" = 10.000",
                  "\"RSX_VOL_3.50\" = " + FormatReal(highVolume, 3),
              }));
}

TEST(ProjectQuantities, DepthBelowTheFirstBoundCountsInTheFirstClass)
{
    const Project project{"EU", {Pipe("PVC 200", 10.0, 0.5, 0.5)}};
    const auto quantities = Texts(ProjectQuantities(project, {1.30, 2.00}));
    EXPECT_EQ(quantities.back(), "\"RSX_VOL_1.30_2.00\" = 4.000");
    // Without bounds there are no classes, and without pipes no total.
    EXPECT_EQ(Texts(ProjectQuantities(project, {})).back(), "\"RSX_TUY_NB_PVC 200\" # 2.000");
    const Project fittings{"EU", {Counted(ElementKind::Fitting, "Regard 1000")}};
    EXPECT_EQ(Texts(ProjectQuantities(fittings, kDepthBounds)),
              (std::vector<std::string>{"\"RSX_SBL_NB_Regard 1000\" # 1.000"}));
}

TEST(ProjectRecords, RecordReadsBackItemByItem)
{
    const auto database = DrawingWith(Line("A01", 0, 0, 0, 30, 40, 0, Tagged("EP", 0, "EP Lot 1", "TUY", "PVC 315")) +
                                      Point("A02", 0, 0, Tagged("EP", 0, "EP Lot 1", "SBL", "Regard 1000")));
    ASSERT_TRUE(database);
    EXPECT_FALSE(database->isRegApp(kRecordApp));
    RecordReport report;
    std::vector<std::string> warnings;
    ASSERT_EQ(WriteNetworkQuantities(*database, report, warnings), 0) << report.error;
    EXPECT_TRUE(warnings.empty());
    EXPECT_TRUE(database->isRegApp(kRecordApp));
    ASSERT_EQ(report.written.size(), 1u);
    EXPECT_EQ(report.written[0].network, "EP");
    EXPECT_EQ(report.written[0].pipeLength, 50.0);
    EXPECT_EQ(report.written[0].fittings, 1u);

    const VelRbPtr record = RecordOf(*database, "EP Lot 1");
    ASSERT_TRUE(record);
    struct Item {
        short code;
        std::string text;
        double value;
    };
    const Item expected[] = {
        {kXdRegAppName, "DAZUVUVUD", 0},
        {kXdAsciiString, "PRJ_NOM", 0},
        {kXdAsciiString, "EP Lot 1", 0},
        {kXdAsciiString, "\"RSX_LIN_TOT_3D\"", 0},
        {kXdReal, "", 50.0},
        {kXdAsciiString, "\"RSX_TUY_LIN_3D_PVC 315\"", 0},
        {kXdReal, "", 50.0},
        {kXdAsciiString, "\"RSX_TUY_NB_PVC 315\"", 0},
        {kXdInteger32, "", 9},
        {kXdAsciiString, "\"RSX_SBL_NB_Regard 1000\"", 0},
        {kXdInteger32, "", 1},
    };
    const resbuf* item = record.get();
    for (const Item& e : expected) {
        SCOPED_TRACE(e.text.empty() ? FormatRealShortest(e.value) : e.text);
        ASSERT_NE(item, nullptr);
        EXPECT_EQ(item->restype, e.code);
        if (e.code == kXdReal)
            EXPECT_EQ(item->resval.rreal, e.value);
        else if (e.code == kXdInteger32)
            EXPECT_EQ(item->resval.rlong, e.value);
        else
            EXPECT_EQ(velRbText(item), e.text);
        item = item->rbnext;
    }
    EXPECT_EQ(item, nullptr);
}

TEST(ProjectRecords, ReplacesRecordsAndRemovesThoseOfGoneProjects)
{
    const auto database = DrawingWith(Line("A01", 0, 0, 0, 10, 0, 0, Tagged("EU", 1, "Lot A", "TUY", "PVC 200")) +
                                      Line("A02", 0, 0, 0, 20, 0, 0, Tagged("EU", 1, "Lot B", "TUY", "PVC 200")));
    ASSERT_TRUE(database);
    RecordReport first;
    NetworkDrawing drawing = NetworkDrawing::Read(*database);
    ASSERT_TRUE(WriteProjectRecords(*database, drawing, first)) << first.error;
    EXPECT_EQ(ProjectCount(*database), 2u);

    // Lot B's pipe is gone and Lot A's grew: one record replaced, one removed.
    drawing.networks[0].projects.pop_back();
    drawing.networks[0].projects[0].elements[0].length3d = 12.5;
    RecordReport second;
    ASSERT_TRUE(WriteProjectRecords(*database, drawing, second)) << second.error;
    EXPECT_EQ(second.removed, (std::vector<std::string>{"Lot B"}));
    EXPECT_EQ(ProjectCount(*database), 1u);
    const VelRbPtr record = RecordOf(*database, "lot a");
    ASSERT_TRUE(record);
    const resbuf* total = record->rbnext->rbnext->rbnext->rbnext;
    ASSERT_NE(total, nullptr);
    EXPECT_EQ(total->resval.rreal, 12.5);

    // The saved drawing holds the same record.
    std::string text, error;
    ASSERT_TRUE(velWriteDrawing(*database, text, error)) << error;
    std::unique_ptr<AcDbDatabase> reread;
    ASSERT_EQ(velReadDrawing(text, "relu.dxf", reread).description(), "");
    const VelRbPtr saved = RecordOf(*reread, "Lot A");
    ASSERT_TRUE(saved);
    EXPECT_EQ(velRbText(saved->rbnext->rbnext), "Lot A");
}

TEST(ProjectRecords, DrawingWithoutNetworksIsLeftAlone)
{
    const auto database = DrawingWith("");
    ASSERT_TRUE(database);
    RecordReport report;
    std::vector<std::string> warnings;
    EXPECT_EQ(WriteNetworkQuantities(*database, report, warnings), 0);
    EXPECT_TRUE(report.written.empty());
    EXPECT_FALSE(database->isModified());
    AcDbDictionary* named = nullptr;
    ASSERT_EQ(database->getNamedObjectsDictionary(named, AcDb::kForRead), Acad::eOk);
    EXPECT_FALSE(named->has(kNetworksDictionary));
    named->close();
}

TEST(ProjectsOfNetwork, AnswersTheProjectsOfOneNetwork)
{
    const auto database = DrawingWith(Line("A01", 0, 0, 0, 1, 0, 0, Tagged("EP", 0, "Zone Sud", "TUY", "PVC 200")) +
                                      Line("A02", 0, 0, 0, 1, 0, 0, Tagged("EU", 1, "", "TUY", "PVC 200")) +
                                      Point("A03", 0, 0, Tagged("EP", 0, "Zone Nord", "SBL", "Regard 1000")));
    ASSERT_TRUE(database);
    const std::string ep = "ep", eu = "EU", gaz = "GAZ";
    struct Case {
        const char* name;
        AcDbDatabase* database;
        const std::string* network;
        bool withList;
        int status;
        std::vector<std::string> projects;
    };
    const Case cases[] = {
        {"two projects, sorted", database.get(), &ep, true, 0, {"Zone Nord", "Zone Sud"}},
        {"project named after its network", database.get(), &eu, true, 0, {"EU"}},
        {"network absent from the drawing", database.get(), &gaz, true, 1, {}},
        {"no drawing", nullptr, &ep, true, 1, {}},
        {"no network name", database.get(), nullptr, true, 2, {"gardé"}},
        {"no list", database.get(), &ep, false, 2, {"gardé"}},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        std::vector<std::string> projects{"gardé"};
        EXPECT_EQ(ProjectsOfNetwork(c.database, c.network, c.withList ? &projects : nullptr), c.status);
        EXPECT_EQ(projects, c.projects);
    }
}
