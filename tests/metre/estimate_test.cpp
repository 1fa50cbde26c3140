// Estimates from a small drawing: quantities from the project records, rounding to the
// cent line by line, chapters, tax per rate and totals, checked cell by cell in the CSV
// and in the workbook as a spreadsheet reader sees it; the record kept in the drawing.
#include "estimate.hpp"
#include "metre_services.hpp"

#include "../host/file_faults.hpp"
#include "support/drawing.hpp"
#include "support/temp_dir.hpp"
#include "velhost/dbase.h"
#include "velhost/documents.h"
#include "velhost/ui.h"

#include <gtest/gtest.h>

#include "support/session.hpp"

#include <cstdlib>
#include <sstream>

namespace {

using metre::ArticleVector;

// A project record as the sibling modules write it: marker, name, then key/quantity pairs.
void AddProject(AcDbDatabase& db, const char* first, const char* second, const std::string& entry,
                const std::string& name, std::vector<resbuf*> pairs)
{
    pairs.insert(pairs.begin(), {velRbString(kXdAsciiString, "PRJ_NOM"), velRbString(kXdAsciiString, name)});
    FileProjectRecord(db, first, second, entry, pairs);
}

resbuf* Key(const std::string& key)
{
    return velRbString(kXdAsciiString, key);
}

const std::string kPipePath = "Réseaux\\\\EU1\\\\Linéaire\\\\EU-001 - Tuyau PVC 200";
const std::string kPavingPath = "Voirie\\\\Chaussée\\\\Surfacique\\\\TP-004 - Enrobé";
const std::string kTestsPath = "Divers\\\\Non Graphique\\\\DV-001 - Essais";

// A line of the quantities dialog, its projects given by name only.
CZodEVIAssocLine Line(const std::string& label, int lineKind, const std::string& quantityKey,
                      const std::string& projects, int projectKind, const std::string& treePath,
                      const std::string& unit, double unitPrice)
{
    return {.label = label,
            .lineKind = lineKind,
            .quantityKey = quantityKey,
            .projects = projects,
            .projectKind = projectKind,
            .treePath = treePath,
            .unit = unit,
            .unitPrice = unitPrice};
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
        for (const auto& [code, path, rate] :
             {std::tuple{"EU-001", kPipePath, 19.6}, std::tuple{"TP-004", kPavingPath, 19.6},
              std::tuple{"DV-001", kTestsPath, 5.5}}) {
            auto a = std::make_unique<CZodEVIArticle>();
            a->code = code;
            a->treePath = path;
            a->taxRate = rate;
            if (path == kPipePath)
                a->groupKey = "PRJ_RES(EU1)";
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
    const double cases[][2] = {{1.005, 1.01},       {2.675, 2.68}, {-1.005, -1.01},           {0.125, 0.13},
                               {5617.428, 5617.43}, {0.0049, 0},   {1e15 + 0.25, 1e15 + 0.25}};
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

TEST(RowHeights, WrappedLinesOfADesignation)
{
    const struct {
        const char* text;
        double width;
        int lines;
    } cases[] = {
        {"", 46, 1},
        {"Regard de visite", 46, 1},
        {"Fourniture et pose des canalisations PVC 315 (EP Les Tilleuls)", 46, 2},
        {"Fourniture et pose des canalisations PVC 315 (EP Les Tilleuls)", 80, 1},
        {"ligne\nsuite", 46, 2},
        // Sixty digits in a column of twenty: broken inside the word.
        {"012345678901234567890123456789012345678901234567890123456789", 21, 4},
        {"x", -3, 1},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        EXPECT_EQ(metre::WrappedLineCount(c.text, c.width), c.lines);
    }
}

// The quantity of each line is what the quantities dialog showed for it: the same
// records, read the same way, each project taken in its own group.
TEST_F(EstimateTest, LineQuantitiesFollowTheirProjectsAndKinds)
{
    // A road project and a platform both named "Parking"; keys differing only by case.
    AddProject(*db, "VELANTO_ROUT2_DICT", "VELANTO_ROUT2_PROJ", "R2", "Parking",
               {Key("\"PRJ_SFC\""), velRbReal(kXdReal, 3.0), Key("\"PRJ_BOR\""), velRbReal(kXdReal, 10)});
    AddProject(*db, "VELANTO_PFM_VRD", "PROJECTS", "F2", "Parking",
               {Key("\"PRJ_SFC\""), velRbReal(kXdReal, 4.5), Key("\"prj_bor\""), velRbReal(kXdReal, 1),
                Key("\"PRJ_BOR\""), velRbReal(kXdReal, 2), Key("\"prj_bor\""), velRbReal(kXdReal, 7)});
    AddProject(*db, "VELANTO_ROUT2_DICT", "VELANTO_ROUT2_PROJ", "R3", "Route B",
               {Key("\"PRJ_BOR\""), velRbReal(kXdReal, 2.5)});
    const std::string parkings = EncodeLineProjects({{"Parking", kProjectRoad}, {"Parking", kProjectPlatform}});
    const std::string roads =
        EncodeLineProjects({{"**Voirie", kProjectPlatform}, {"Parking", kProjectRoad}, {"Route B", kProjectRoad}});
    struct Case {
        const char* what;
        int lineKind;
        const char* key;
        const char* projects;
        int projectKind;
        std::string assocText1;
        double quantity;
        const char* check; // expected among the line's checks, or ""
        const std::string* treePath = &kPavingPath;
    };
    const Case cases[] = {
        {"one name in two groups", 3, "\"PRJ_SFC\"", "Parking,Parking", 1, parkings, 7.5, ""},
        {"the road one alone", 3, "\"PRJ_SFC\"", "Parking", 2, EncodeLineProjects({{"Parking", 2}}), 3.0, ""},
        {"an older line takes its own kind first", 3, "\"PRJ_SFC\"", "Parking", 1, "", 4.5, ""},
        {"non-graphic road article: **Voirie and two roads", 5, "\"PRJ_BOR\"", "**Voirie,Parking,Route B", 2, roads,
         13.5, ""},
        {"the last key equal but for case, in the table's order", 3, "\"Prj_Bor\"", "Parking", 1,
         EncodeLineProjects({{"Parking", 1}}), 2, ""},
        {"a network's lump sums under its name", 5, "\"\"", "EU", 3, EncodeLineProjects({{"EU", 3}}), 1, ""},
        {"a lump sum line still reads a record that has its key", 5, "\"RSX_TUY_NB_Regard\"", "EU1", 3,
         EncodeLineProjects({{"EU1", 3}}), 12, ""},
        {"a non-graphic road article whose road lacks the key", 5, "\"PRJ_SFC\"", "Route B", 2,
         EncodeLineProjects({{"Route B", 2}}), 0, "quantité \"PRJ_SFC\" absente du projet « Route B »"},
        {"a project of another group is not taken", 3, "\"PRJ_BOR\"", "Route B", 1,
         EncodeLineProjects({{"Route B", 1}}), 0, "projet « Route B » absent du dessin"},
        {"an unreadable project list falls back on the names", 3, "\"PRJ_SFC\"", "Parking", 2, "x", 3.0, ""},
        {"**Forfait", 5, "\"\"", "**Forfait", 0, EncodeLineProjects({{"**Forfait", 0}}), 1, "sans unité"},
        {"a network's lump sum under a project named as the network", 5, "\"RSX_TUY_NB_Regard\"", "EU1", 3,
         EncodeLineProjects({{"EU1", 3}}), 1, "", &kPipePath},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.what);
        lines = {{.label = c.what,
                  .lineKind = c.lineKind,
                  .quantityKey = c.key,
                  .assocText1 = c.assocText1,
                  .projects = c.projects,
                  .projectKind = c.projectKind,
                  .treePath = *c.treePath,
                  .unitPrice = 2}};
        const metre::Estimate estimate = Build();
        ASSERT_EQ(estimate.RowCount(), 1u);
        const metre::EstimateRow& row = estimate.chapters[0].rows[0];
        EXPECT_DOUBLE_EQ(row.quantity, c.quantity);
        const std::string checks = JoinStrings(row.checks, " | ");
        if (*c.check != '\0') {
            EXPECT_NE(checks.find(c.check), std::string::npos) << checks;
        }
        EXPECT_EQ(row.quantity == 0, checks.find("quantité nulle") != std::string::npos) << checks;
    }
}

// What an estimator must look at before sending, line by line.
TEST_F(EstimateTest, ChecksBeforeSending)
{
    const auto paving = [](const char* label, const std::string& treePath, const char* unit, double unitPrice) {
        return Line(label, 3, "\"PRJ_SFC_MAT_Enrobé\"", "Route A", 2, treePath, unit, unitPrice);
    };
    lines = {paving("Bon", kPavingPath, "m²", 12), paving("Gratuit", kPavingPath, "m²", 0.004),
             paving("Sans unité", kPavingPath, " ", 12), paving("Inconnu", "X\\\\Y-1 - Inconnu", "m²", 12),
             paving("Démesuré", kPavingPath, "m²", 1e300)};
    const metre::Estimate estimate = Build();
    std::vector<std::string> checks;
    for (const metre::EstimateChapter& chapter : estimate.chapters)
        for (const metre::EstimateRow& row : chapter.rows)
            checks.push_back(row.label + ": " + JoinStrings(row.checks, " ; "));
    EXPECT_EQ(checks, (std::vector<std::string>{"Bon: ", "Gratuit: prix unitaire 0,00", "Sans unité: sans unité",
                                                "Démesuré: montant hors limites, ligne comptée 0",
                                                "Inconnu: article absent du bordereau, TVA 19,6 %"}));
    EXPECT_EQ(estimate.CheckedRowCount(), 4u);
    EXPECT_DOUBLE_EQ(estimate.totalExclTax, 3 * 3006 + 1.0) << "the out-of-bounds line counts 0";
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

    lines = {Line("Bordure \"T2\"; pose", 5, "", "**Forfait", 0, kTestsPath, "", 1)};
    const std::string quoted = metre::EstimateCsv(Build());
    EXPECT_NE(quoted.find("DV-001;\"Bordure \"\"T2\"\"; pose\";"), std::string::npos) << quoted;
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

// The workbook as a spreadsheet reader sees it: each cell's formula and value, each
// sheet's print set-up and row heights, the chart's data ranges.
std::string ReadWorkbook(const std::string& path)
{
    const std::string script = R"(
import sys, re, zipfile, openpyxl
formulas = openpyxl.load_workbook(sys.argv[1])
values = openpyxl.load_workbook(sys.argv[1], data_only=True)
print("sheets|" + ",".join(formulas.sheetnames))
for sheet in formulas.worksheets:
    name = sheet.title
    for row in sheet.iter_rows():
        for cell in row:
            if cell.value is not None:
                v = values[name][cell.coordinate].value
                link = "|" + cell.hyperlink.location if cell.hyperlink is not None else ""
                print("%s!%s|%s|%s%s" % (name, cell.coordinate, cell.value, v, link))
    setup = sheet.page_setup
    # Without fitToWidth a page set-up is one page wide.
    print("%s!print|%s|%s|%s,%s|%s|%s|%s|%s|%s" % (name, sheet.print_title_rows, setup.paperSize,
          setup.fitToWidth or 1, setup.fitToHeight, sheet.sheet_properties.pageSetUpPr.fitToPage, setup.orientation,
          sheet.oddHeader.left.text, sheet.oddHeader.center.text, sheet.oddHeader.right.text))
    print("%s!footer|%s" % (name, sheet.oddFooter.center.text))
    for index, dimension in sorted(sheet.row_dimensions.items()):
        if dimension.height is not None:
            print("%s!height%d|%g" % (name, index, dimension.height))
with zipfile.ZipFile(sys.argv[1]) as z:
    for chart in sorted(n for n in z.namelist() if n.startswith("xl/charts/chart")):
        print("chart|" + "|".join(re.findall(r"<c:f>([^<]*)</c:f>", z.read(chart).decode())))
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
    estimate.drawing = "/chantiers/plan R&D.dxf";
    estimate.date = "06/12/2026";
    // Two lines' worth in the designation column.
    estimate.chapters[0].rows[0].label = "Fourniture et pose de canalisations en PVC CR8 de diamètre 200 mm, "
                                         "y compris lit de pose";
    ASSERT_TRUE(metre::WriteEstimateWorkbook(path, estimate, "€"));
    const std::string cells = ReadWorkbook(path);
    const char* const expected[] = {
        "sheets|Devis,Synthèse,Graphique,À vérifier,Origine des quantités",
        "Devis!A1|Devis : Devis|",
        "Devis!A4|N° de prix|",
        "Devis!B5|Réseaux / EU1|",
        "Devis!A6|EU-001|",
        "Devis!D6|123.46|123.46",
        "Devis!E6|45.5|45.5",
        "Devis!F6|=ROUND(D6*E6,2)|5617.43",
        "Devis!G6|19.6|19.6",
        "Devis!F8|=SUM(F6:F7)|5617.43",
        "Devis!F11|=ROUND(D11*E11,2)|4326.92",
        "Devis!F12|=SUM(F11:F11)|4326.92",
        "Devis!F15|=ROUND(D15*E15,2)|1.01",
        "Devis!B18|Total HT|",
        "Devis!F18|=SUM(F8,F12,F16)|9945.36",
        "Devis!B19|TVA 5,5 %|",
        "Devis!F19|=ROUND(SUMIF(G6:G15,5.5,F6:F15)*5.5/100,2)|0.06",
        "Devis!F20|=ROUND(SUMIF(G6:G15,19.6,F6:F15)*19.6/100,2)|1949.09",
        "Devis!B21|Total TTC|",
        "Devis!F21|=F18+SUM(F19,F20)|11894.51",
        // Printed one A4 page wide, headings on every page.
        "Devis!print|$4:$4|9|1,0|True|portrait|Devis : Devis|plan R&&D.dxf|06/12/2026",
        "Devis!footer|Page &P / &N",
        "Devis!height6|30",
        "Synthèse!A4|Réseaux / EU1|",
        "Synthèse!B4|=Devis!F8|5617.43",
        "Synthèse!B7|=SUM(B4:B6)|9945.36",
        "chart|'Synthèse'!$A$4:$A$6|'Synthèse'!$B$4:$B$6",
        // The lines to check, each linked to its row of the estimate.
        "À vérifier!A1|2 ligne(s) à vérifier avant envoi.|",
        "À vérifier!C4|projet « EU2 » absent du dessin ; quantité nulle|",
        "À vérifier!D4|ligne 7|ligne 7|Devis!A7",
        "À vérifier!B5|Essais|",
        "À vérifier!C5|sans unité|",
        "À vérifier!print|$3:$3|9|1,0|True|portrait|Devis : Devis|plan R&&D.dxf|06/12/2026",
        // Every project of every line, and what its quantity was taken from.
        "Origine des quantités!C4|EU1|",
        "Origine des quantités!F4|123.456|123.456",
        "Origine des quantités!G4|dessin|",
        "Origine des quantités!C5|EU2|",
        "Origine des quantités!G5|projet absent du dessin|",
        "Origine des quantités!C6|Route A|",
        "Origine des quantités!D6|Projet routier|",
        "Origine des quantités!F6|250.5|250.5",
        "Origine des quantités!C7|Plateforme|",
        "Origine des quantités!D7|Plate-forme|",
        "Origine des quantités!E7|\"PRJ_SFC_MAT_Enrobé\"|",
        "Origine des quantités!F7|100|100",
        "Origine des quantités!C8|**Forfait|",
        "Origine des quantités!G8|forfait|",
        "Origine des quantités!H8|ligne 15|ligne 15|Devis!A15",
        "Origine des quantités!print|$3:$3|9|1,0|True|landscape|Devis : Devis|plan R&&D.dxf|06/12/2026",
    };
    for (const char* cell : expected) {
        SCOPED_TRACE(cell);
        const std::string line = std::string(cell);
        const bool plain = line.back() == '|';
        // Cells without a computed value hold their text as value too.
        const std::string wanted =
            plain ? line + line.substr(line.find('|') + 1, line.rfind('|') - line.find('|') - 1) : line;
        EXPECT_NE(cells.find(wanted + "\n"), std::string::npos) << cells;
    }
    EXPECT_EQ(cells.find("Devis!height7|"), std::string::npos) << "a one-line row keeps the default height";
    EXPECT_EQ(cells.find("Origine des quantités!A9|"), std::string::npos) << "one row per project of a line";
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
    }
    void TearDown() override { acDocManager->closeAll(); }
    TempDir dir;
    ScriptedSession session{"", "devis.scr"};
    std::istringstream& script = session.input;
    std::ostringstream& output = session.output;
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
    // What an estimator reads on the command line: chapters, totals, what to check, files.
    for (const std::string& line :
         {std::string("Devis « Devis » : 4 ligne(s) en 3 chapitre(s).\n"
                      "  Réseaux / EU1             5 617,43 €\n"
                      "  Voirie / Chaussée         4 326,92 €\n"
                      "  Divers                        1,01 €\n"
                      "  ----------------------------------\n"
                      "  Total HT                  9 945,36 €\n"
                      "  TVA 5,5 %                     0,06 €\n"
                      "  TVA 19,6 %                1 949,09 €\n"
                      "  Total TTC                11 894,51 €\n"
                      "  À vérifier avant envoi : 2 ligne(s), voir la feuille « À vérifier » du classeur.\n"
                      "  Attention : « Tuyau PVC 200 (EU2) » : projet « EU2 » absent du dessin, quantité 0.\n"),
          "  Classeur : " + dir.File("Devis.xlsx") + "\n  CSV : " + dir.File("Devis.csv") + "\n"}) {
        EXPECT_NE(output.str().find(line), std::string::npos) << output.str();
    }
    ASSERT_EQ(metre::ShowEstimate("Devis", &pointers), 0) << "the same name replaces the estimate";
    std::vector<std::string> names;
    ASSERT_EQ(metre::ListEstimates(&names), 0);
    EXPECT_EQ(names, (std::vector<std::string>{"Devis", "Devis 2"}));

    // The record survives a save and a new reading of the drawing.
    std::string text, error;
    ASSERT_TRUE(velWriteDrawing(*acDocManager->curDocument()->database(), text, error)) << error;
    std::unique_ptr<AcDbDatabase> reread;
    ASSERT_EQ(velReadDrawing(text, "plan.dxf", reread).description(), "");
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
            const bool workbookFailed = output.str().find("Fichier « " + dir.File("Devis.xlsx") +
                                                          " » non enregistré : " + reason) != std::string::npos;
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

namespace {

// The example project's estimate as the create-estimate command makes it with every
// project and article checked, one line per project: the example drawing's road and
// platform records, network records for its two networks, the example schedule.
struct ExampleEstimate {
    std::unique_ptr<AcDbDatabase> db;
    ArticleVector schedule;
    std::vector<CZodEVIAssocLine> lines;
};

ExampleEstimate MakeExampleEstimate()
{
    ExampleEstimate example;
    EXPECT_EQ(velOpenDrawing(VEL_EXAMPLES_DIR "/projet_vrd.dxf", example.db).description(), "");
    EXPECT_TRUE(metre::ReadScheduleFile(VEL_EXAMPLES_DIR "/VelaBordereau.xml", example.schedule));
    if (!example.db)
        return example;
    for (const char* network : {"EP", "EU"}) {
        std::vector<resbuf*> pairs;
        for (const auto& a : example.schedule)
            if (a->groupKey == std::string("PRJ_RES(") + network + ")" && a->nature != 6) {
                pairs.push_back(Key(a->quantityKey));
                pairs.push_back(velRbReal(kXdReal, 10 + a->number * 1.25));
            }
        AddProject(*example.db, "VELANTO_RSX_VRD", "PROJECTS", network, std::string(network) + " Les Tilleuls", pairs);
    }
    const metre::ProjectTables tables = metre::ProjectTables::Read(*example.db);
    const auto add = [&](const CZodEVIArticle& a, const std::string& project, int kind) {
        example.lines.push_back({.label = a.designation + " (" + project + ")",
                                 .lineKind = a.nature == 6 ? 5 : 3,
                                 .quantityKey = a.quantityKey,
                                 .assocText1 = EncodeLineProjects({{project, kind}}),
                                 .projects = project,
                                 .projectKind = kind,
                                 .treePath = a.treePath,
                                 .unit = a.unit,
                                 .unitPrice = a.unitPrice});
    };
    for (const auto& a : example.schedule) {
        if (a->groupKey.rfind("PRJ_RES(", 0) == 0) {
            const std::string network = a->groupKey.substr(8, a->groupKey.size() - 9);
            add(*a, a->nature == 6 ? network : network + " Les Tilleuls", 3);
        } else if (a->nature == 6) {
            add(*a, "**Voirie", 1);
        } else {
            for (const auto& [project, kind] : {std::pair{"Voie principale", 2}, std::pair{"Parking visiteurs", 1}})
                if (tables.Quantity(kind, project, a->quantityKey))
                    add(*a, project, kind);
        }
    }
    return example;
}

// Each page of a PDF: its size in points, how many of its text lines overlap another,
// and its text, one "page <n>|<w>x<h>|<overlaps>|<text>" line a page.
std::string PdfPages(const std::string& pdf)
{
    const std::string script = R"(
import sys, xml.etree.ElementTree as ET
x = "{http://www.w3.org/1999/xhtml}"
for number, page in enumerate(ET.parse(sys.argv[1]).getroot().iter(x + "page"), 1):
    lines = [([float(l.get(k)) for k in ("xMin", "yMin", "xMax", "yMax")], " ".join(w.text or "" for w in l))
             for l in page.iter(x + "line")]
    overlaps = sum(1 for i, (a, _) in enumerate(lines) for (b, _) in lines[i + 1:]
                   if min(a[2], b[2]) - max(a[0], b[0]) > 1 and min(a[3], b[3]) - max(a[1], b[1]) > 2)
    print("page %d|%.0fx%.0f|%d|%s" % (number, float(page.get("width")), float(page.get("height")), overlaps,
                                       " / ".join(t for _, t in lines)))
)";
    const std::string boxes = pdf + ".html";
    Shell("pdftotext -bbox-layout '" + pdf + "' '" + boxes + "'");
    return Shell("/usr/bin/python3 -c '" + script + "' '" + boxes + "'");
}

// The example project's workbook printed by LibreOffice: every page A4 with the page
// header and number, no wrapped text running over the next row, and the estimate itself
// one page wide with its headings on every page.
TEST(EstimatePrint, ExampleEstimatePrintsOnePageWide)
{
    if (std::system("command -v soffice >/dev/null 2>&1") != 0 ||
        std::system("command -v pdftotext >/dev/null 2>&1") != 0)
        GTEST_SKIP() << "LibreOffice (soffice) or poppler-utils (pdftotext) is not installed";
    ExampleEstimate example = MakeExampleEstimate();
    std::vector<CZodEVIAssocLine*> pointers;
    for (CZodEVIAssocLine& line : example.lines)
        pointers.push_back(&line);
    metre::Estimate estimate =
        metre::BuildEstimate("Devis", pointers, metre::ProjectTables::Read(*example.db), example.schedule);
    ASSERT_GT(estimate.RowCount(), 90u);
    estimate.drawing = "/chantiers/Les Tilleuls/projet_vrd.dxf";
    estimate.date = "06/12/2026";
    TempDir dir;
    ASSERT_TRUE(metre::WriteEstimateWorkbook(dir.File("Devis.xlsx"), estimate, "€"));
    const std::string log = Shell("cd '" + dir.path.string() + "' && soffice -env:UserInstallation=file://" +
                                  dir.File("profile") + " --headless --convert-to pdf Devis.xlsx");
    std::istringstream pages(PdfPages(dir.File("Devis.pdf")));
    int number = 0, estimateEnd = 0; // the page where the estimate ends
    for (std::string page; std::getline(pages, page);) {
        SCOPED_TRACE(page.substr(0, 200));
        ++number;
        const std::string size = page.substr(0, page.find('|', page.find('|') + 1) + 1);
        EXPECT_TRUE(size == FormatString("page %d|595x842|", number) ||
                    size == FormatString("page %d|842x595|", number))
            << "A4";
        EXPECT_EQ(page.substr(size.size(), 2), "0|") << "text lines overlap";
        for (const char* text : {"Devis : Devis", "projet_vrd.dxf", "06/12/2026"})
            EXPECT_NE(page.find(text), std::string::npos) << text;
        EXPECT_NE(page.find(FormatString("Page %d / ", number)), std::string::npos);
        if (estimateEnd == 0) {
            // A page of the estimate: every column, under its heading.
            for (const char* text : {"N° de prix", "Désignation", "Quantité", "Montant HT", "Taux TVA"})
                EXPECT_NE(page.find(text), std::string::npos) << text;
            if (page.find("Total TTC") != std::string::npos)
                estimateEnd = number;
        }
    }
    EXPECT_GT(number, estimateEnd) << "the other sheets follow the estimate" << log;
    EXPECT_GE(estimateEnd, 2);
    EXPECT_LE(estimateEnd, 5) << "pages of the estimate";
}

} // namespace
