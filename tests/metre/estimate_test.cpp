// Estimates from a small drawing: quantities from the project records, rounding to the
// cent line by line, chapters, tax per rate and totals, checked cell by cell in the CSV
// and in the workbook as a spreadsheet reader sees it; the record kept in the drawing.
#include "estimate.hpp"
#include "metre_services.hpp"

#include "../host/file_faults.hpp"
#include "../host/temp_dir.hpp"
#include "velhost/dbase.h"
#include "velhost/documents.h"
#include "velhost/ui.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <sstream>

namespace {

using metre::ArticleVector;

// A project record as the sibling modules write it: marker, name, then key/quantity pairs.
void AddProject(AcDbDatabase& db, const char* first, const char* second, const std::string& entry,
                const std::string& name, const std::vector<resbuf*>& pairs)
{
    AcDbDictionary* named = nullptr;
    ASSERT_EQ(db.getNamedObjectsDictionary(named, AcDb::kForWrite), Acad::eOk);
    AcDbObjectId id;
    AcDbObject* object = nullptr;
    AcDbDictionary* level1 = nullptr;
    if (named->getAt(first, object, AcDb::kForWrite) == Acad::eOk) {
        level1 = dynamic_cast<AcDbDictionary*>(object);
    } else {
        level1 = new AcDbDictionary();
        ASSERT_EQ(named->setAt(first, level1, id), Acad::eOk);
    }
    AcDbDictionary* level2 = nullptr;
    if (level1->getAt(second, object, AcDb::kForWrite) == Acad::eOk) {
        level2 = dynamic_cast<AcDbDictionary*>(object);
    } else {
        level2 = new AcDbDictionary();
        ASSERT_EQ(level1->setAt(second, level2, id), Acad::eOk);
    }
    auto* record = new AcDbXrecord();
    ASSERT_EQ(level2->setAt(entry, record, id), Acad::eOk);
    VelRbBuilder data;
    data.add(velRbString(kXdRegAppName, "DAZUVUVUD"));
    data.add(velRbString(kXdAsciiString, "PRJ_NOM"));
    data.add(velRbString(kXdAsciiString, name));
    for (resbuf* item : pairs)
        data.add(item);
    VelRbPtr list(data.release());
    ASSERT_EQ(record->setXData(list.get()), Acad::eOk);
    record->close();
    level2->close();
    level1->close();
    named->close();
}

resbuf* Key(const std::string& key)
{
    return velRbString(kXdAsciiString, key);
}

const std::string kPipePath = "Réseaux\\\\EU1\\\\Linéaire\\\\EU-001 - Tuyau PVC 200";
const std::string kPavingPath = "Voirie\\\\Chaussée\\\\Surfacique\\\\TP-004 - Enrobé";
const std::string kTestsPath = "Divers\\\\Non Graphique\\\\DV-001 - Essais";

CZodEVIAssocLine Line(const std::string& label, int kind, const std::string& key, const std::string& projects,
                      int projectKind, const std::string& treePath, const std::string& unit, double price)
{
    CZodEVIAssocLine line;
    line.label = label;
    line.lineKind = kind;
    line.quantityKey = key;
    line.projects = projects;
    line.projectKind = projectKind;
    line.treePath = treePath;
    line.unit = unit;
    line.unitPrice = price;
    return line;
}

class EstimateTest : public ::testing::Test {
protected:
    void SetUp() override
    {
        db = std::make_unique<AcDbDatabase>();
        AddProject(*db, "VELANTO_RSX_VRD", "PROJECTS", "P1", "EU1",
                   {Key("\"RSX_TUY_LIN_3D_PVC 200\""), velRbReal(kXdReal, 123.456), Key("\"RSX_TUY_NB_Regard\""),
                    velRbShort(kXdInteger16, 12)});
        AddProject(*db, "VELANTO_ROUT2_DICT", "VELANTO_ROUT2_PROJ", "R1", "Route A",
                   {Key("\"PRJ_SFC_MAT_Enrobé\""), velRbString(kXdAsciiString, "250.5 m2")});
        AddProject(*db, "VELANTO_PFM_VRD", "PROJECTS", "F1", "Plateforme",
                   {Key("\"prj_sfc_mat_enrobé\""), velRbLong(kXdInteger32, 100)});
        lines = {Line("Tuyau PVC 200", 3, "\"RSX_TUY_LIN_3D_PVC 200\"", "EU1", 3, kPipePath, "ml", 45.5),
                 Line("Enrobé", 3, "\"PRJ_SFC_MAT_Enrobé\"", "Route A,Plateforme", 2, kPavingPath, "m²", 12.345),
                 Line("Essais", 5, "", "**Forfait", 0, kTestsPath, "", 1.005),
                 Line("Tuyau PVC 200 (EU2)", 3, "\"RSX_TUY_LIN_3D_PVC 200\"", "EU2", 3, kPipePath, "ml", 45.5)};
        for (const auto& [code, path, rate] : {std::tuple{"EU-001", kPipePath, 19.6},
                                              std::tuple{"TP-004", kPavingPath, 19.6},
                                              std::tuple{"DV-001", kTestsPath, 5.5}}) {
            auto a = std::make_unique<CZodEVIArticle>();
            a->code = code;
            a->treePath = path;
            a->taxRate = rate;
            schedule.push_back(std::move(a));
        }
    }
    std::vector<CZodEVIAssocLine*> Pointers()
    {
        std::vector<CZodEVIAssocLine*> out;
        for (CZodEVIAssocLine& line : lines)
            out.push_back(&line);
        return out;
    }
    metre::Estimate Build()
    {
        return metre::BuildEstimate("Devis", Pointers(), metre::ProjectTables::Read(*db), schedule);
    }
    std::unique_ptr<AcDbDatabase> db;
    std::vector<CZodEVIAssocLine> lines;
    ArticleVector schedule;
};

TEST(Rounding, HalfAwayFromZeroOnTheShownDecimals)
{
    const double cases[][2] = {{1.005, 1.01}, {2.675, 2.68}, {-1.005, -1.01}, {0.125, 0.13},
                               {5617.428, 5617.43}, {0.0049, 0}, {1e15 + 0.25, 1e15 + 0.25}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c[0]);
        EXPECT_DOUBLE_EQ(metre::RoundToCents(c[0]), c[1]);
    }
}

TEST(Chapters, CategoryLevelsWithoutNatureLevels)
{
    EXPECT_EQ(metre::ChapterOfTreePath(kPavingPath), "Voirie / Chaussée");
    EXPECT_EQ(metre::ChapterOfTreePath("\\\\GC-001 - Déblais"), "Divers");
    EXPECT_EQ(metre::ChapterOfTreePath("GC-001 - Déblais"), "Divers");
}

TEST_F(EstimateTest, QuantitiesRoundingAndTotals)
{
    const metre::Estimate estimate = Build();
    ASSERT_EQ(estimate.chapters.size(), 3u);
    EXPECT_EQ(estimate.chapters[0].title, "Réseaux / EU1");
    ASSERT_EQ(estimate.chapters[0].rows.size(), 2u);
    const metre::EstimateRow& pipe = estimate.chapters[0].rows[0];
    EXPECT_EQ(pipe.priceNumber, "EU-001");
    EXPECT_DOUBLE_EQ(pipe.quantity, 123.46);
    EXPECT_DOUBLE_EQ(pipe.amount, 5617.43);
    EXPECT_DOUBLE_EQ(estimate.chapters[0].rows[1].quantity, 0) << "EU2 is not in the drawing";
    const metre::EstimateRow& paving = estimate.chapters[1].rows.at(0);
    EXPECT_DOUBLE_EQ(paving.quantity, 350.5) << "a platform named in a road line is still found";
    EXPECT_DOUBLE_EQ(paving.amount, 4326.92);
    const metre::EstimateRow& tests = estimate.chapters[2].rows.at(0);
    EXPECT_DOUBLE_EQ(tests.quantity, 1);
    EXPECT_DOUBLE_EQ(tests.amount, 1.01);
    EXPECT_DOUBLE_EQ(tests.taxRate, 5.5);
    EXPECT_DOUBLE_EQ(estimate.totalExclTax, 9945.36);
    ASSERT_EQ(estimate.taxes.size(), 2u);
    EXPECT_DOUBLE_EQ(estimate.taxes[0].tax, 0.06);
    EXPECT_DOUBLE_EQ(estimate.taxes[1].base, 9944.35);
    EXPECT_DOUBLE_EQ(estimate.taxes[1].tax, 1949.09);
    EXPECT_DOUBLE_EQ(estimate.totalInclTax, 11894.51);
    ASSERT_EQ(estimate.warnings.size(), 1u);
    EXPECT_NE(estimate.warnings[0].find("projet « EU2 » absent du dessin"), std::string::npos);
}

TEST_F(EstimateTest, CsvCells)
{
    metre::Estimate estimate = Build();
    estimate.drawing = "plan.dxf";
    const std::string csv = metre::EstimateCsv(estimate);
    ASSERT_EQ(csv.substr(0, 3), "\xEF\xBB\xBF");
    std::vector<std::string> rows;
    std::istringstream in(csv.substr(3));
    for (std::string row; std::getline(in, row);) {
        ASSERT_FALSE(row.empty() || row.back() != '\r') << "rows end with CR LF";
        rows.push_back(row.substr(0, row.size() - 1));
    }
    const std::vector<std::string> expected = {
        "Devis;Devis;;;;;",
        "Dessin;plan.dxf;;;;;",
        ";;;;;;",
        "N° de prix;Désignation;Unité;Quantité;Prix unitaire HT;Montant HT;Taux TVA",
        ";Réseaux / EU1;;;;;",
        "EU-001;Tuyau PVC 200;ml;123,46;45,5;5617,43;19,6",
        "EU-001;Tuyau PVC 200 (EU2);ml;0,00;45,5;0,00;19,6",
        ";Sous-total HT;;;;5617,43;",
        ";;;;;;",
        ";Voirie / Chaussée;;;;;",
        "TP-004;Enrobé;m²;350,50;12,345;4326,92;19,6",
        ";Sous-total HT;;;;4326,92;",
        ";;;;;;",
        ";Divers;;;;;",
        "DV-001;Essais;;1,00;1,005;1,01;5,5",
        ";Sous-total HT;;;;1,01;",
        ";;;;;;",
        ";Total HT;;;;9945,36;",
        ";TVA 5,5 %;;;;0,06;",
        ";TVA 19,6 %;;;;1949,09;",
        ";Total TTC;;;;11894,51;",
    };
    EXPECT_EQ(rows, expected);
}

TEST_F(EstimateTest, CsvQuotesWhatWouldSplitACell)
{
    lines = {Line("Bordure \"T2\"; pose", 5, "", "**Forfait", 0, kTestsPath, "", 1)};
    const std::string csv = metre::EstimateCsv(Build());
    EXPECT_NE(csv.find("DV-001;\"Bordure \"\"T2\"\"; pose\";"), std::string::npos) << csv;
}

// Output of a shell command (standard error included).
std::string Shell(const std::string& command)
{
    std::string out;
    FILE* pipe = popen((command + " 2>&1").c_str(), "r");
    if (pipe == nullptr)
        return out;
    char buffer[4096];
    while (std::size_t n = fread(buffer, 1, sizeof buffer, pipe))
        out.append(buffer, n);
    pclose(pipe);
    return out;
}

// The workbook as a spreadsheet reader sees it: each listed cell's formula and value.
std::string ReadWorkbook(const std::string& path)
{
    const std::string script = R"(
import sys, openpyxl
formulas = openpyxl.load_workbook(sys.argv[1])["Devis"]
values = openpyxl.load_workbook(sys.argv[1], data_only=True)["Devis"]
for row in formulas.iter_rows():
    for cell in row:
        if cell.value is not None:
            v = values[cell.coordinate].value
            print("%s|%s|%s" % (cell.coordinate, cell.value, v))
)";
    return Shell("/usr/bin/python3 -c '" + script + "' '" + path + "'");
}

TEST_F(EstimateTest, WorkbookHasLiveFormulasWithTheirValues)
{
    if (std::system("/usr/bin/python3 -c 'import openpyxl' >/dev/null 2>&1") != 0)
        GTEST_SKIP() << "python3-openpyxl is not installed";
    TempDir dir;
    const std::string path = dir.File("Devis.xlsx");
    metre::Estimate estimate = Build();
    estimate.drawing = "plan.dxf";
    ASSERT_TRUE(metre::WriteEstimateWorkbook(path, estimate, "€"));
    const std::string cells = ReadWorkbook(path);
    const char* const expected[] = {
        "A1|Devis : Devis|",
        "A4|N° de prix|",
        "F4|Montant HT|",
        "G4|Taux TVA|",
        "B5|Réseaux / EU1|",
        "A6|EU-001|",
        "D6|123.46|123.46",
        "E6|45.5|45.5",
        "F6|=ROUND(D6*E6,2)|5617.43",
        "G6|19.6|19.6",
        "F8|=SUM(F6:F7)|5617.43",
        "F11|=ROUND(D11*E11,2)|4326.92",
        "F12|=SUM(F11:F11)|4326.92",
        "F15|=ROUND(D15*E15,2)|1.01",
        "B18|Total HT|",
        "F18|=SUM(F8,F12,F16)|9945.36",
        "B19|TVA 5,5 %|",
        "F19|=ROUND(SUMIF(G6:G15,5.5,F6:F15)*5.5/100,2)|0.06",
        "F20|=ROUND(SUMIF(G6:G15,19.6,F6:F15)*19.6/100,2)|1949.09",
        "B21|Total TTC|",
        "F21|=F18+SUM(F19,F20)|11894.51",
    };
    for (const char* cell : expected) {
        SCOPED_TRACE(cell);
        const std::string line = std::string(cell);
        const bool plain = line.back() == '|';
        // Cells without a computed value hold their text as value too.
        const std::string wanted = plain ? line + line.substr(line.find('|') + 1, line.rfind('|') - line.find('|') - 1)
                                         : line;
        EXPECT_NE(cells.find(wanted + "\n"), std::string::npos) << cells;
    }
}

TEST_F(EstimateTest, WorkbookFormulasGiveTheTotalsInLibreOffice)
{
    if (std::system("command -v soffice >/dev/null 2>&1") != 0 ||
        std::system("/usr/bin/python3 -c 'import openpyxl' >/dev/null 2>&1") != 0)
        GTEST_SKIP() << "LibreOffice (soffice) or python3-openpyxl is not installed";
    TempDir dir;
    ASSERT_TRUE(metre::WriteEstimateWorkbook(dir.File("Devis.xlsx"), Build(), "€"));
    // A copy without the computed values, and a profile that recalculates on load: the
    // totals can then only come from the formulas.
    Shell("/usr/bin/python3 -c 'import sys, openpyxl; openpyxl.load_workbook(sys.argv[1]).save(sys.argv[2])' '" +
        dir.File("Devis.xlsx") + "' '" + dir.File("Formules.xlsx") + "'");
    dir.Write("profile/user/registrymodifications.xcu",
              "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
              "<oor:items xmlns:oor=\"http://openoffice.org/2001/registry\" "
              "xmlns:xs=\"http://www.w3.org/2001/XMLSchema\" xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\">\n"
              "<item oor:path=\"/org.openoffice.Office.Calc/Formula/Load\"><prop oor:name=\"OOXMLRecalcMode\" "
              "oor:op=\"fuse\"><value>0</value></prop></item>\n</oor:items>\n");
    const std::string log = Shell("cd '" + dir.path.string() + "' && soffice -env:UserInstallation=file://" +
                                dir.File("profile") + " --headless --convert-to csv Formules.xlsx");
    const std::string csv = dir.Read("Formules.csv");
    ASSERT_FALSE(csv.empty()) << log;
    // Only the digits of each total line: the separators follow LibreOffice's locale.
    const auto digitsOf = [&](const std::string& label) {
        const std::size_t at = csv.find(label);
        std::string digits;
        if (at == std::string::npos)
            return digits;
        for (std::size_t i = at + label.size(); i < csv.size() && csv[i] != '\n'; ++i)
            if (csv[i] >= '0' && csv[i] <= '9')
                digits += csv[i];
        return digits;
    };
    EXPECT_EQ(digitsOf("Total HT"), "994536") << csv;
    EXPECT_EQ(digitsOf("TVA 5,5 %"), "006");
    EXPECT_EQ(digitsOf("TVA 19,6 %"), "194909");
    EXPECT_EQ(digitsOf("Total TTC"), "1189451");
}

class EstimateService : public EstimateTest {
protected:
    void SetUp() override
    {
        EstimateTest::SetUp();
        std::vector<const CZodEVIArticle*> pointers;
        for (const auto& a : schedule)
            pointers.push_back(a.get());
        ASSERT_TRUE(metre::WriteScheduleFile(dir.File("VelaBordereau.xml"), pointers));
        metre::RememberSchedulePath(dir.File("VelaBordereau.xml"));
        previousUI = velSetUI(&ui);
    }
    void TearDown() override
    {
        velSetUI(previousUI);
        acDocManager->closeAll();
    }
    TempDir dir;
    std::istringstream script;
    std::ostringstream output;
    VelScriptedUI ui{script, output, "devis.scr"};
    VelUserInterface* previousUI = nullptr;
};

TEST_F(EstimateService, EstimatesAreWrittenBesideTheDrawingAndRecordedInIt)
{
    const std::string drawing = dir.File("plan.dxf");
    acDocManager->createDocument(std::move(db), drawing);
    std::vector<CZodEVIAssocLine*> pointers = Pointers();
    ASSERT_EQ(metre::ShowEstimate("Devis", &pointers), 0) << output.str();
    ASSERT_EQ(metre::ShowEstimate("Devis 2", &pointers), 0) << output.str();
    EXPECT_TRUE(std::filesystem::exists(dir.File("Devis.xlsx")));
    EXPECT_NE(dir.Read("Devis 2.csv").find(";Total TTC;;;;11894,51;"), std::string::npos);
    EXPECT_NE(output.str().find("Total TTC : 11894,51 €"), std::string::npos) << output.str();
    EXPECT_NE(output.str().find("Attention : « Tuyau PVC 200 (EU2) »"), std::string::npos);
    ASSERT_EQ(metre::ShowEstimate("Devis", &pointers), 0) << "the same name replaces the estimate";
    std::vector<std::string> names;
    ASSERT_EQ(metre::ListEstimates(&names), 0);
    EXPECT_EQ(names, (std::vector<std::string>{"Devis", "Devis 2"}));

    // The record survives a save and a new reading of the drawing.
    std::string text, error;
    ASSERT_TRUE(velWriteDrawing(*acDocManager->curDocument()->database(), text, error)) << error;
    std::unique_ptr<AcDbDatabase> reread;
    ASSERT_TRUE(velReadDrawing(text, "plan.dxf", reread, error)) << error;
    const std::vector<metre::EstimateRecord> records = metre::RecordedEstimates(*reread);
    ASSERT_EQ(records.size(), 2u);
    EXPECT_EQ(records[0].workbookPath, dir.File("Devis.xlsx"));
    EXPECT_EQ(records[0].lineCount, 4);
    EXPECT_DOUBLE_EQ(records[1].totalInclTax, 11894.51);
}

TEST_F(EstimateService, WriteThatFailsAnywhereLeavesEachFileWholeAndSaysWhich)
{
    acDocManager->createDocument(std::move(db), dir.File("plan.dxf"));
    std::vector<CZodEVIAssocLine*> pointers = Pointers();
    ASSERT_EQ(metre::ShowEstimate("Devis", &pointers), 0) << output.str();
    const std::string workbook = dir.Read("Devis.xlsx"), csv = dir.Read("Devis.csv");
    const std::size_t entries = std::distance(std::filesystem::directory_iterator(dir.path), {});
    lines[0].label = "Tuyau PVC 200 (modifié)";
    int status = 0;
    ForEveryFailingCall(
        [&] {
            dir.Write("Devis.xlsx", workbook);
            dir.Write("Devis.csv", csv);
            output.str("");
        },
        [&] { status = metre::ShowEstimate("Devis", &pointers); },
        [&](const FaultRun& run) {
            SCOPED_TRACE(run.failed + " n° " + std::to_string(run.calls));
            const std::string nowWorkbook = dir.Read("Devis.xlsx"), nowCsv = dir.Read("Devis.csv");
            EXPECT_TRUE(nowWorkbook == workbook || nowWorkbook.rfind("PK\x03\x04", 0) == 0);
            EXPECT_TRUE(nowCsv == csv || nowCsv.find("(modifié)") != std::string::npos);
            EXPECT_EQ(std::distance(std::filesystem::directory_iterator(dir.path), {}), entries);
            if (status == 0)
                return;
            const std::string reason = velFileErrorReason(FileFaults::ErrorOf(run.failed));
            const bool workbookFailed =
                output.str().find("Fichier « " + dir.File("Devis.xlsx") + " » non enregistré : " + reason) !=
                std::string::npos;
            const bool csvFailed = output.str().find("Fichier « " + dir.File("Devis.csv") +
                                                     " » non enregistré : " + reason) != std::string::npos;
            ASSERT_TRUE(workbookFailed || csvFailed) << output.str();
            EXPECT_EQ(workbookFailed ? nowWorkbook : nowCsv, workbookFailed ? workbook : csv);
        });
}

TEST_F(EstimateService, RefusedWithoutDrawingOrWithABadName)
{
    std::vector<CZodEVIAssocLine*> pointers = Pointers();
    EXPECT_NE(metre::ShowEstimate("Devis", &pointers), 0);
    EXPECT_NE(output.str().find("Devis « Devis » : aucun dessin ouvert."), std::string::npos) << output.str();
    acDocManager->createDocument(std::move(db), dir.File("plan.dxf"));
    EXPECT_NE(metre::ShowEstimate("../Devis", &pointers), 0);
    EXPECT_NE(output.str().find("ne peut pas servir de nom de fichier"), std::string::npos);
    EXPECT_FALSE(std::filesystem::exists(dir.path.parent_path() / "Devis.xlsx"));
}

} // namespace
