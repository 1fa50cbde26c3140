// Building the estimate from its lines (each project of a line read from the drawing as
// the quantities dialog read it) and writing it as a print-ready workbook and a CSV file.
#include "estimate.hpp"

#include "text/text.hpp"
#include "velhost/editor.h"
#include "velhost/files.h"

#include <xlsxwriter.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <filesystem>
#include <map>
#include <numeric>
#include <sys/stat.h>
#include <unistd.h>
#include <unordered_map>

namespace metre {

namespace {

constexpr std::string_view kSeparator = "\\\\";
constexpr double kDefaultTaxRate = 19.6;
constexpr double kLargestAmount = 1e12;

std::vector<std::string> SplitTreePath(const std::string& treePath)
{
    std::vector<std::string> parts;
    std::size_t start = 0;
    for (;;) {
        const std::size_t found = treePath.find(kSeparator, start);
        if (found == std::string::npos) {
            parts.push_back(treePath.substr(start));
            return parts;
        }
        parts.push_back(treePath.substr(start, found - start));
        start = found + kSeparator.size();
    }
}

bool IsNatureLevel(const std::string& level)
{
    for (const char* nature : {"Ponctuel", "Linéaire", "Surfacique", "Volumique", "Textuel", "Non Graphique"})
        if (EqualsNoCase(level, nature))
            return true;
    return false;
}

std::string CodeOfTreePath(const std::string& treePath)
{
    const std::string last = SplitTreePath(treePath).back();
    const std::size_t dash = last.find(" - ");
    return dash == std::string::npos ? last : last.substr(0, dash);
}

// The (name, kind) pairs a line counts. An older line names its projects in `projects`
// only, joined with ",", with the kind of one of them: each name is then looked up under
// that kind first, then under the others.
std::vector<CZodEVILineProject> ProjectsOfLine(const CZodEVIAssocLine& line, const ProjectTables& projects)
{
    std::vector<CZodEVILineProject> pairs = DecodeLineProjects(line);
    if (!pairs.empty())
        return pairs;
    std::vector<std::string> names;
    // A name may hold a comma itself.
    if (IsPseudoProject(line.projects) || projects.KindHolding(line.projectKind, line.projects)) {
        names.push_back(line.projects);
    } else {
        std::size_t start = 0;
        for (;;) {
            const std::size_t comma = line.projects.find(',', start);
            names.push_back(
                line.projects.substr(start, comma == std::string::npos ? std::string::npos : comma - start));
            if (comma == std::string::npos)
                break;
            start = comma + 1;
        }
    }
    for (std::string& name : names) {
        const std::optional<int> kind =
            IsPseudoProject(name) ? std::nullopt : projects.KindHolding(line.projectKind, name);
        pairs.push_back({std::move(name), kind.value_or(line.projectKind)});
    }
    return pairs;
}

// The network of an article's group key PRJ_RES(name): the text up to the key's last ")";
// empty for an article of no network.
std::string NetworkOfArticle(const CZodEVIArticle* article)
{
    static constexpr std::string_view kOpen = "PRJ_RES(";
    if (article == nullptr)
        return {};
    const std::size_t open = article->groupKey.find(kOpen);
    const std::size_t close = article->groupKey.rfind(')');
    if (open == std::string::npos || close == std::string::npos || close < open + kOpen.size())
        return {};
    return article->groupKey.substr(open + kOpen.size(), close - open - kOpen.size());
}

// The line's quantity in each of its projects. A non-graphic article of a network counts 1
// under the network's name even where a project of that name records its key: the dialog
// files the network's lump sums after the projects' quantities, and the later one wins.
std::vector<QuantitySource> LineSources(const CZodEVIAssocLine& line, const ProjectTables& projects,
                                        const std::string& network)
{
    using Origin = QuantitySource::Origin;
    std::vector<QuantitySource> sources;
    for (CZodEVILineProject& pair : ProjectsOfLine(line, projects)) {
        QuantitySource source{std::move(pair.name), pair.kind, 0, Origin::MissingProject};
        const bool networkLumpSum = line.lineKind == kLineKindLumpSum && source.kind == kProjectNetwork;
        if (IsPseudoProject(source.project)) {
            source.quantity = 1.0;
            source.origin = Origin::Pseudo;
        } else if (networkLumpSum && !network.empty() && source.project == network) {
            source.quantity = 1.0;
            source.origin = Origin::NetworkLumpSum;
        } else if (const auto quantity = projects.Quantity(source.kind, source.project, line.quantityKey)) {
            source.quantity = *quantity;
            source.origin = Origin::Drawing;
        } else if (networkLumpSum) {
            source.quantity = 1.0;
            source.origin = Origin::NetworkLumpSum;
        } else if (projects.HasProject(source.kind, source.project)) {
            source.origin = Origin::MissingKey;
        }
        sources.push_back(std::move(source));
    }
    return sources;
}

std::string CsvField(const std::string& text)
{
    if (text.find_first_of(";\"\r\n") == std::string::npos)
        return text;
    std::string quoted = "\"";
    for (char c : text) {
        if (c == '"')
            quoted += '"';
        quoted += c;
    }
    return quoted + "\"";
}

std::string TaxLabel(double rate)
{
    return "TVA " + FrenchNumber(rate, -1) + " %";
}

// Every row of the sheet in order, shared by the workbook and the CSV so that both
// files show the same thing at the same place.
struct SheetRow {
    enum class Kind { Title, Drawing, Blank, Header, Chapter, Line, Subtotal, Total, Tax, TotalIncl } kind;
    const EstimateChapter* chapter = nullptr;
    const EstimateRow* row = nullptr;
    const EstimateTax* tax = nullptr;
};

std::vector<SheetRow> SheetRows(const Estimate& estimate)
{
    using K = SheetRow::Kind;
    std::vector<SheetRow> rows = {{K::Title}, {K::Drawing}, {K::Blank}, {K::Header}};
    for (const EstimateChapter& chapter : estimate.chapters) {
        rows.push_back({K::Chapter, &chapter});
        for (const EstimateRow& row : chapter.rows)
            rows.push_back({K::Line, &chapter, &row});
        rows.push_back({K::Subtotal, &chapter});
        rows.push_back({K::Blank});
    }
    rows.push_back({K::Total});
    for (const EstimateTax& tax : estimate.taxes)
        rows.push_back({K::Tax, nullptr, nullptr, &tax});
    rows.push_back({K::TotalIncl});
    return rows;
}

const char* const kHeaders[] = {"N° de prix",       "Désignation", "Unité",   "Quantité",
                                "Prix unitaire HT", "Montant HT",  "Taux TVA"};

std::string Cell(char column, std::size_t row)
{
    return FormatString("%c%zu", column, row + 1);
}

// A sum of many cells, nested so that no SUM takes more than 200 arguments.
std::string SumOfCells(const std::vector<std::string>& cells)
{
    if (cells.empty())
        return "0";
    if (cells.size() <= 200)
        return "SUM(" + JoinStrings(cells, ",") + ")";
    std::vector<std::string> parts;
    for (std::size_t i = 0; i < cells.size(); i += 200)
        parts.push_back(
            SumOfCells(std::vector<std::string>(cells.begin() + i, cells.begin() + std::min(cells.size(), i + 200))));
    return SumOfCells(parts);
}

std::string WithoutQuotes(std::string text)
{
    std::erase(text, '"');
    return text;
}

} // namespace

std::size_t Estimate::RowCount() const
{
    std::size_t count = 0;
    for (const EstimateChapter& chapter : chapters)
        count += chapter.rows.size();
    return count;
}

std::size_t Estimate::CheckedRowCount() const
{
    std::size_t count = 0;
    for (const EstimateChapter& chapter : chapters)
        for (const EstimateRow& row : chapter.rows)
            count += row.checks.empty() ? 0 : 1;
    return count;
}

double RoundToCents(double value)
{
    if (!std::isfinite(value))
        return value;
    // The decimal value a spreadsheet shows (15 significant digits) decides the rounding,
    // not the binary neighbour below it: 1.005 * 100 is 100.49999999999999.
    const auto shown = ParseReal(FormatString("%.15g", value * 100));
    return std::round(shown.value_or(value * 100)) / 100;
}

bool IsPseudoProject(const std::string& project)
{
    return project == "**Forfait" || project == "**Voirie";
}

std::string ChapterOfTreePath(const std::string& treePath)
{
    std::vector<std::string> parts = SplitTreePath(treePath);
    parts.pop_back();
    std::vector<std::string> levels;
    for (const std::string& part : parts)
        if (!part.empty() && !IsNatureLevel(part))
            levels.push_back(part);
    return levels.empty() ? "Divers" : JoinStrings(levels, " / ");
}

std::string FrenchNumber(double value, int decimals)
{
    std::string text = decimals < 0 ? FormatRealShortest(value) : FormatReal(value, decimals);
    for (char& c : text)
        if (c == '.')
            c = ',';
    return text;
}

namespace {

// French name of a project kind.
std::string ProjectKindName(int kind)
{
    switch (kind) {
    case kProjectLumpSum:
        return "Forfait";
    case kProjectPlatform:
        return "Plate-forme";
    case kProjectRoad:
        return "Projet routier";
    case kProjectNetwork:
        return "Réseau";
    case kProjectKorvane:
        return "Projet Korvane";
    default:
        return FormatString("Type %d", kind);
    }
}

// Width of a character in widths of a digit, in the proportions of the wider of the usual
// sans-serif fonts, so that a row is rather too tall than cutting a line off.
double CharWidth(unsigned char lead)
{
    const auto in = [lead](std::string_view set) {
        return set.find(static_cast<char>(lead)) != std::string_view::npos;
    };
    if (lead >= 0x80)
        return 1.0; // accented letters, mostly lower case
    if (in("ijlI'|J"))
        return 0.45;
    if (in(".,:;!/ f"))
        return 0.55;
    if (in("rt()[]-"))
        return 0.65;
    if (in("mwMW%@"))
        return 1.55;
    if (in("DGHNOQU"))
        return 1.22;
    if (lead >= 'A' && lead <= 'Z')
        return 1.1;
    if (in("cskvxyz"))
        return 0.9;
    return 1.0;
}

} // namespace

int WrappedLineCount(std::string_view text, double columnWidth)
{
    // A cell keeps some padding on each side.
    const double room = std::max(1.0, columnWidth - 1.2);
    int lines = 1;
    double used = 0; // on the current line
    std::size_t i = 0;
    while (i < text.size()) {
        if (text[i] == '\n') {
            ++lines;
            used = 0;
            ++i;
            continue;
        }
        if (text[i] == ' ') {
            ++i;
            continue;
        }
        double word = 0;
        for (; i < text.size() && text[i] != ' ' && text[i] != '\n'; ++i)
            if ((static_cast<unsigned char>(text[i]) & 0xC0) != 0x80)
                word += CharWidth(static_cast<unsigned char>(text[i]));
        if (used > 0 && used + CharWidth(' ') + word <= room) {
            used += CharWidth(' ') + word;
            continue;
        }
        if (used > 0)
            ++lines;
        // A word longer than the column is broken across lines.
        while (word > room) {
            ++lines;
            word -= room;
        }
        used = word;
    }
    return lines;
}

Estimate BuildEstimate(const std::string& name, const std::vector<CZodEVIAssocLine*>& lines,
                       const ProjectTables& projects, const ArticleVector& schedule)
{
    Estimate estimate;
    estimate.name = name;
    std::unordered_map<std::string, const CZodEVIArticle*> byTreePath;
    for (const auto& article : schedule)
        byTreePath.emplace(FoldCase(article->treePath), article.get());
    std::map<std::string, std::size_t> chapterIndex;
    std::map<double, double> bases;
    for (const CZodEVIAssocLine* line : lines) {
        if (line == nullptr)
            continue;
        EstimateRow row;
        const auto found = byTreePath.find(FoldCase(line->treePath));
        const CZodEVIArticle* article = found == byTreePath.end() ? nullptr : found->second;
        row.priceNumber = article != nullptr && !article->code.empty() ? article->code : CodeOfTreePath(line->treePath);
        row.label = line->label;
        row.unit = line->unit;
        row.quantityKey = line->quantityKey;
        row.taxRate = article != nullptr && std::isfinite(article->taxRate) ? article->taxRate : kDefaultTaxRate;
        if (article == nullptr || !std::isfinite(article->taxRate)) {
            const std::string check = FormatString(
                "%s, TVA %s %%", article == nullptr ? "article absent du bordereau" : "taux de TVA illisible",
                FrenchNumber(kDefaultTaxRate, -1).c_str());
            estimate.warnings.push_back(FormatString("« %s » : %s.", line->label.c_str(), check.c_str()));
            row.checks.push_back(check);
        }
        row.sources = LineSources(*line, projects, NetworkOfArticle(article));
        double quantity = 0;
        for (const QuantitySource& source : row.sources) {
            quantity += source.quantity;
            if (source.origin == QuantitySource::Origin::MissingProject ||
                source.origin == QuantitySource::Origin::MissingKey) {
                const std::string check = source.origin == QuantitySource::Origin::MissingProject
                                              ? FormatString("projet « %s » absent du dessin", source.project.c_str())
                                              : FormatString("quantité %s absente du projet « %s »",
                                                             line->quantityKey.c_str(), source.project.c_str());
                estimate.warnings.push_back(
                    FormatString("« %s » : %s, quantité 0.", line->label.c_str(), check.c_str()));
                row.checks.push_back(check);
            }
        }
        row.quantity = RoundToCents(quantity);
        row.unitPrice = line->unitPrice;
        row.amount = RoundToCents(row.quantity * row.unitPrice);
        // Beyond a spreadsheet's 15 digits amounts mean nothing, and their sums could
        // leave what a double holds.
        if (!std::isfinite(row.quantity) || !std::isfinite(row.unitPrice) || !(std::abs(row.amount) < kLargestAmount)) {
            row.checks.push_back("montant hors limites, ligne comptée 0");
            if (!std::isfinite(row.quantity))
                row.quantity = 0;
            if (!std::isfinite(row.unitPrice))
                row.unitPrice = 0;
            row.amount = 0;
        }
        if (RoundToCents(row.unitPrice) == 0)
            row.checks.push_back("prix unitaire 0,00");
        if (row.unit.find_first_not_of(" \t") == std::string::npos)
            row.checks.push_back("sans unité");
        if (row.quantity == 0)
            row.checks.push_back("quantité nulle");
        const std::string title = ChapterOfTreePath(line->treePath);
        auto [position, inserted] = chapterIndex.emplace(FoldCase(title), estimate.chapters.size());
        if (inserted)
            estimate.chapters.push_back({title, {}, 0});
        EstimateChapter& chapter = estimate.chapters[position->second];
        chapter.subtotal = RoundToCents(chapter.subtotal + row.amount);
        bases[row.taxRate] = RoundToCents(bases[row.taxRate] + row.amount);
        chapter.rows.push_back(std::move(row));
    }
    double taxTotal = 0;
    for (const EstimateChapter& chapter : estimate.chapters)
        estimate.totalExclTax = RoundToCents(estimate.totalExclTax + chapter.subtotal);
    for (const auto& [rate, base] : bases) {
        const double tax = RoundToCents(base * rate / 100);
        estimate.taxes.push_back({rate, base, tax});
        taxTotal = RoundToCents(taxTotal + tax);
    }
    estimate.totalInclTax = RoundToCents(estimate.totalExclTax + taxTotal);
    return estimate;
}

namespace {

// "1 234 567,89": an amount as an estimator reads it.
std::string GroupedAmount(double value)
{
    const std::string plain = FrenchNumber(value, 2);
    const std::size_t digitsFrom = plain[0] == '-' ? 1 : 0;
    const std::size_t comma = plain.find(',');
    if (comma == std::string::npos)
        return plain;
    std::string out = plain.substr(0, digitsFrom);
    for (std::size_t i = digitsFrom; i < comma; ++i) {
        if (i > digitsFrom && (comma - i) % 3 == 0)
            out += ' ';
        out += plain[i];
    }
    return out + plain.substr(comma);
}

} // namespace

std::vector<std::string> EstimateSummary(const Estimate& estimate, const std::string& currency,
                                         const std::string& workbookPath, const std::string& csvPath)
{
    std::vector<std::string> out;
    out.push_back(FormatString("Devis « %s » : %zu ligne(s) en %zu chapitre(s).", estimate.name.c_str(),
                               estimate.RowCount(), estimate.chapters.size()));
    // Labels padded to a common width (in characters), amounts right-aligned after them.
    std::size_t width = CharCount("Total TTC");
    for (const EstimateChapter& chapter : estimate.chapters)
        width = std::max(width, std::min<std::size_t>(CharCount(chapter.title), 60));
    const auto amountLine = [&](const std::string& label, double amount) {
        const std::size_t chars = CharCount(label);
        const std::string padding(chars < width ? width - chars : 0, ' ');
        return FormatString("  %s%s %16s %s", label.c_str(), padding.c_str(), GroupedAmount(amount).c_str(),
                            currency.c_str());
    };
    for (const EstimateChapter& chapter : estimate.chapters)
        out.push_back(amountLine(chapter.title, chapter.subtotal));
    out.push_back("  " + std::string(width + 17, '-'));
    out.push_back(amountLine("Total HT", estimate.totalExclTax));
    for (const EstimateTax& tax : estimate.taxes)
        out.push_back(amountLine(TaxLabel(tax.rate), tax.tax));
    out.push_back(amountLine("Total TTC", estimate.totalInclTax));
    const std::size_t checked = estimate.CheckedRowCount();
    if (checked == 0)
        out.push_back("  Aucune ligne à vérifier avant envoi.");
    else
        out.push_back(FormatString(
            "  À vérifier avant envoi : %zu ligne(s), voir la feuille « À vérifier » du classeur.", checked));
    for (const std::string& warning : estimate.warnings)
        out.push_back("  Attention : " + warning);
    out.push_back("  Classeur : " + workbookPath);
    out.push_back("  CSV : " + csvPath);
    return out;
}

std::string EstimateCsv(const Estimate& estimate)
{
    using K = SheetRow::Kind;
    std::string out = "\xEF\xBB\xBF";
    const auto emit = [&](std::vector<std::string> fields) {
        fields.resize(7);
        for (std::size_t i = 0; i < fields.size(); ++i) {
            if (i > 0)
                out += ';';
            out += CsvField(fields[i]);
        }
        out += "\r\n";
    };
    for (const SheetRow& sheet : SheetRows(estimate)) {
        switch (sheet.kind) {
        case K::Title:
            emit({"Devis", estimate.name});
            break;
        case K::Drawing:
            emit({"Dessin", estimate.drawing});
            break;
        case K::Blank:
            emit({});
            break;
        case K::Header:
            emit({std::begin(kHeaders), std::end(kHeaders)});
            break;
        case K::Chapter:
            emit({"", sheet.chapter->title});
            break;
        case K::Line: {
            const EstimateRow& row = *sheet.row;
            emit({row.priceNumber, row.label, row.unit, FrenchNumber(row.quantity, 2), FrenchNumber(row.unitPrice, -1),
                  FrenchNumber(row.amount, 2), FrenchNumber(row.taxRate, -1)});
            break;
        }
        case K::Subtotal:
            emit({"", "Sous-total HT", "", "", "", FrenchNumber(sheet.chapter->subtotal, 2)});
            break;
        case K::Total:
            emit({"", "Total HT", "", "", "", FrenchNumber(estimate.totalExclTax, 2)});
            break;
        case K::Tax:
            emit({"", TaxLabel(sheet.tax->rate), "", "", "", FrenchNumber(sheet.tax->tax, 2)});
            break;
        case K::TotalIncl:
            emit({"", "Total TTC", "", "", "", FrenchNumber(estimate.totalInclTax, 2)});
            break;
        }
    }
    return out;
}

VelReadResult WriteEstimateCsv(const std::string& path, const Estimate& estimate)
{
    return WriteFileAtomically(path, EstimateCsv(estimate), false);
}

namespace {

// Widths of the estimate's columns, in widths of a digit: together one A4 page wide at a
// scale that stays readable.
constexpr double kEstimateWidths[] = {10, 46, 7, 11, 13, 14, 8};
// Height in points of one line of the default font, and the tallest row a sheet allows.
constexpr double kLineHeight = 15;
constexpr double kTallestRow = 409;
// Bold letters take about a tenth more room.
constexpr double kBoldWidth = 1.1;

constexpr const char* kSummarySheet = "Synthèse";
constexpr const char* kChecksSheet = "À vérifier";
constexpr const char* kSourcesSheet = "Origine des quantités";
constexpr std::size_t kSummaryFirstRow = 3;
constexpr const char* kPageFooter = "&CPage &P / &N";

struct Formats {
    lxw_format* bold;
    lxw_format* boldWrap;
    lxw_format* header;
    lxw_format* money;
    lxw_format* moneyBold;
    lxw_format* quantity;
    lxw_format* rawQuantity;
    lxw_format* rate;
    lxw_format* share;
    lxw_format* wrap;
    lxw_format* link;
};

Formats MakeFormats(lxw_workbook* workbook, const std::string& currency)
{
    Formats f{};
    const auto add = [&] {
        lxw_format* format = workbook_add_format(workbook);
        format_set_align(format, LXW_ALIGN_VERTICAL_TOP);
        return format;
    };
    f.bold = add();
    format_set_bold(f.bold);
    f.boldWrap = add();
    format_set_bold(f.boldWrap);
    format_set_text_wrap(f.boldWrap);
    f.header = add();
    format_set_bold(f.header);
    format_set_bottom(f.header, LXW_BORDER_THIN);
    format_set_text_wrap(f.header);
    const std::string moneyPattern = "#,##0.00 \"" + WithoutQuotes(currency) + "\"";
    f.money = add();
    format_set_num_format(f.money, moneyPattern.c_str());
    f.moneyBold = add();
    format_set_num_format(f.moneyBold, moneyPattern.c_str());
    format_set_bold(f.moneyBold);
    f.quantity = add();
    format_set_num_format(f.quantity, "#,##0.00");
    f.rawQuantity = add();
    format_set_num_format(f.rawQuantity, "#,##0.00####");
    f.rate = add();
    format_set_num_format(f.rate, "0.0##");
    f.share = add();
    format_set_num_format(f.share, "0.0%");
    f.wrap = add();
    format_set_text_wrap(f.wrap);
    f.link = add();
    format_set_underline(f.link, LXW_UNDERLINE_SINGLE);
    format_set_font_color(f.link, LXW_COLOR_BLUE);
    return f;
}

// A text for a page header: "&" doubled (it starts the header's codes), cut short so that
// the three parts stay within the header's 255 characters.
std::string HeaderText(std::string_view text)
{
    std::string out;
    std::size_t chars = 0;
    for (std::size_t i = 0; i < text.size() && chars < 75;) {
        std::size_t length = 1;
        while (i + length < text.size() && (static_cast<unsigned char>(text[i + length]) & 0xC0) == 0x80)
            ++length;
        if (text[i] == '&') {
            out += "&&";
            chars += 2;
        } else {
            out.append(text, i, length);
            ++chars;
        }
        i += length;
    }
    return out;
}

std::string PageHeader(const Estimate& estimate)
{
    const std::string drawing = std::filesystem::path(estimate.drawing).filename().string();
    return "&L" + HeaderText("Devis : " + estimate.name) + "&C" + HeaderText(drawing) + "&R" +
           HeaderText(estimate.date);
}

// A4, one page wide, the heading row on every page, the estimate, the drawing and the
// date in the page header and the page number in the footer.
void SetUpPrinting(lxw_worksheet* sheet, const Estimate& estimate, lxw_row_t headingRow, lxw_row_t lastRow,
                   lxw_col_t lastColumn, bool landscape)
{
    worksheet_set_paper(sheet, 9);
    if (landscape)
        worksheet_set_landscape(sheet);
    worksheet_fit_to_pages(sheet, 1, 0);
    worksheet_set_margins(sheet, 0.5, 0.5, 0.8, 0.8);
    worksheet_repeat_rows(sheet, headingRow, headingRow);
    worksheet_print_area(sheet, 0, 0, lastRow, lastColumn);
    worksheet_set_header(sheet, PageHeader(estimate).c_str());
    worksheet_set_footer(sheet, kPageFooter);
    worksheet_freeze_panes(sheet, headingRow + 1, 0);
}

// A text as a cell holds it: at most 32,767 characters, else the cell would stay empty.
std::string CellText(const std::string& text)
{
    constexpr std::size_t kLongest = 32767;
    return CharCount(text) > kLongest ? FirstChars(text, kLongest) : text;
}

void WriteText(lxw_worksheet* sheet, lxw_row_t row, lxw_col_t column, const std::string& text, lxw_format* format)
{
    worksheet_write_string(sheet, row, column, CellText(text).c_str(), format);
}

// Height of a row whose texts wrap in their columns: as many lines as the longest needs.
void FitRowHeight(lxw_worksheet* sheet, lxw_row_t row, std::initializer_list<std::pair<std::string_view, double>> cells)
{
    int lines = 1;
    for (const auto& [text, width] : cells)
        lines = std::max(lines, WrappedLineCount(text, width));
    if (lines > 1)
        worksheet_set_row(sheet, row, std::min(kLineHeight * lines, kTallestRow), nullptr);
}

void WriteHeadings(lxw_worksheet* sheet, lxw_row_t row, const std::vector<const char*>& headings,
                   const std::vector<double>& widths, const Formats& f)
{
    int lines = 1;
    for (std::size_t c = 0; c < headings.size(); ++c) {
        worksheet_set_column(sheet, static_cast<lxw_col_t>(c), static_cast<lxw_col_t>(c), widths[c], nullptr);
        WriteText(sheet, row, static_cast<lxw_col_t>(c), headings[c], f.header);
        lines = std::max(lines, WrappedLineCount(headings[c], widths[c] / kBoldWidth));
    }
    if (lines > 1)
        worksheet_set_row(sheet, row, std::min(kLineHeight * lines, kTallestRow), nullptr);
}

// Where the estimate sheet put each line, its chapters' subtotals and the total.
struct EstimatePlaces {
    std::unordered_map<const EstimateRow*, std::size_t> rows;
    std::vector<std::size_t> subtotals; // one per chapter, in order
    std::size_t total = 0;
};

EstimatePlaces WriteEstimateSheet(lxw_worksheet* sheet, const Estimate& estimate, const Formats& f)
{
    using K = SheetRow::Kind;
    EstimatePlaces places;
    const std::vector<SheetRow> rows = SheetRows(estimate);
    const std::vector<double> widths(std::begin(kEstimateWidths), std::end(kEstimateWidths));
    // Rows of the lines (for the tax sums) and of the subtotals (for the total).
    std::size_t firstLine = 0, lastLine = 0, headingRow = 0;
    bool anyLine = false;
    std::vector<std::string> subtotalCells, taxCells;
    std::size_t chapterFirst = 0;
    for (std::size_t r = 0; r < rows.size(); ++r) {
        if (rows[r].kind == K::Line) {
            if (!anyLine)
                firstLine = r;
            lastLine = r;
            anyLine = true;
        }
    }
    const std::string rateRange = anyLine ? FormatString("G%zu:G%zu", firstLine + 1, lastLine + 1) : "G1:G1";
    const std::string amountRange = anyLine ? FormatString("F%zu:F%zu", firstLine + 1, lastLine + 1) : "F1:F1";
    const double fullWidth = std::accumulate(widths.begin(), widths.end(), 0.0);
    for (std::size_t r = 0; r < rows.size(); ++r) {
        const SheetRow& row = rows[r];
        const auto line = static_cast<lxw_row_t>(r);
        switch (row.kind) {
        case K::Title:
            WriteText(sheet, line, 0, "Devis : " + estimate.name, f.bold);
            break;
        case K::Drawing: {
            // Across the whole width, so that a long path wraps instead of leaving the page.
            const std::string text = "Dessin : " + estimate.drawing;
            worksheet_merge_range(sheet, line, 0, line, 6, CellText(text).c_str(), f.wrap);
            FitRowHeight(sheet, line, {{text, fullWidth}});
            break;
        }
        case K::Blank:
            break;
        case K::Header:
            WriteHeadings(sheet, line, {std::begin(kHeaders), std::end(kHeaders)}, widths, f);
            headingRow = r;
            break;
        case K::Chapter:
            WriteText(sheet, line, 1, row.chapter->title, f.boldWrap);
            FitRowHeight(sheet, line, {{row.chapter->title, widths[1] / kBoldWidth}});
            chapterFirst = r + 1;
            break;
        case K::Line: {
            const EstimateRow& data = *row.row;
            places.rows[&data] = r;
            WriteText(sheet, line, 0, data.priceNumber, f.wrap);
            WriteText(sheet, line, 1, data.label, f.wrap);
            WriteText(sheet, line, 2, data.unit, f.wrap);
            FitRowHeight(sheet, line, {{data.priceNumber, widths[0]}, {data.label, widths[1]}, {data.unit, widths[2]}});
            worksheet_write_number(sheet, line, 3, data.quantity, f.quantity);
            worksheet_write_number(sheet, line, 4, data.unitPrice, f.money);
            const std::string formula = FormatString("=ROUND(%s*%s,2)", Cell('D', r).c_str(), Cell('E', r).c_str());
            worksheet_write_formula_num(sheet, line, 5, formula.c_str(), f.money, data.amount);
            worksheet_write_number(sheet, line, 6, data.taxRate, f.rate);
            break;
        }
        case K::Subtotal: {
            WriteText(sheet, line, 1, "Sous-total HT", f.bold);
            const std::string formula = FormatString("=SUM(F%zu:F%zu)", chapterFirst + 1, r);
            worksheet_write_formula_num(sheet, line, 5, formula.c_str(), f.moneyBold, row.chapter->subtotal);
            subtotalCells.push_back(Cell('F', r));
            places.subtotals.push_back(r);
            break;
        }
        case K::Total: {
            WriteText(sheet, line, 1, "Total HT", f.bold);
            const std::string formula = FormatString("=%s", SumOfCells(subtotalCells).c_str());
            worksheet_write_formula_num(sheet, line, 5, formula.c_str(), f.moneyBold, estimate.totalExclTax);
            places.total = r;
            break;
        }
        case K::Tax: {
            WriteText(sheet, line, 1, TaxLabel(row.tax->rate), nullptr);
            const std::string rateText = FormatRealShortest(row.tax->rate);
            const std::string formula = FormatString("=ROUND(SUMIF(%s,%s,%s)*%s/100,2)", rateRange.c_str(),
                                                     rateText.c_str(), amountRange.c_str(), rateText.c_str());
            worksheet_write_formula_num(sheet, line, 5, formula.c_str(), f.money, row.tax->tax);
            taxCells.push_back(Cell('F', r));
            break;
        }
        case K::TotalIncl: {
            WriteText(sheet, line, 1, "Total TTC", f.bold);
            const std::string formula =
                FormatString("=%s%s%s", Cell('F', places.total).c_str(), taxCells.empty() ? "" : "+",
                             taxCells.empty() ? "" : SumOfCells(taxCells).c_str());
            worksheet_write_formula_num(sheet, line, 5, formula.c_str(), f.moneyBold, estimate.totalInclTax);
            break;
        }
        }
    }
    SetUpPrinting(sheet, estimate, static_cast<lxw_row_t>(headingRow), static_cast<lxw_row_t>(rows.size() - 1), 6,
                  false);
    return places;
}

// Each chapter's amount, drawn from the estimate sheet's subtotals, with its share.
void WriteSummarySheet(lxw_worksheet* sheet, const Estimate& estimate, const EstimatePlaces& places, const Formats& f)
{
    const std::vector<double> widths = {60, 16, 10};
    WriteText(sheet, 0, 0, "Devis : " + estimate.name + " — montants HT par chapitre", f.bold);
    WriteHeadings(sheet, 2, {"Chapitre", "Montant HT", "Part"}, widths, f);
    const std::size_t first = kSummaryFirstRow;
    const std::size_t totalRow = first + estimate.chapters.size();
    for (std::size_t i = 0; i < estimate.chapters.size(); ++i) {
        const EstimateChapter& chapter = estimate.chapters[i];
        const auto row = static_cast<lxw_row_t>(first + i);
        WriteText(sheet, row, 0, chapter.title, f.wrap);
        FitRowHeight(sheet, row, {{chapter.title, widths[0]}});
        const std::string amount = FormatString("=Devis!%s", Cell('F', places.subtotals[i]).c_str());
        worksheet_write_formula_num(sheet, row, 1, amount.c_str(), f.money, chapter.subtotal);
        const std::string share = FormatString("=IF(%s=0,0,%s/%s)", Cell('B', totalRow).c_str(),
                                               Cell('B', first + i).c_str(), Cell('B', totalRow).c_str());
        worksheet_write_formula_num(sheet, row, 2, share.c_str(), f.share,
                                    estimate.totalExclTax == 0 ? 0 : chapter.subtotal / estimate.totalExclTax);
    }
    WriteText(sheet, static_cast<lxw_row_t>(totalRow), 0, "Total HT", f.bold);
    const std::string total = estimate.chapters.empty() ? "=0" : FormatString("=SUM(B%zu:B%zu)", first + 1, totalRow);
    worksheet_write_formula_num(sheet, static_cast<lxw_row_t>(totalRow), 1, total.c_str(), f.moneyBold,
                                estimate.totalExclTax);
    SetUpPrinting(sheet, estimate, 2, static_cast<lxw_row_t>(totalRow), 2, false);
}

// The chapters' amounts as bars, on a page of their own (an estimate has a chapter).
void WriteChart(lxw_workbook* workbook, lxw_chartsheet* sheet, const Estimate& estimate, const std::string& currency)
{
    lxw_chart* chart = workbook_add_chart(workbook, LXW_CHART_BAR);
    lxw_chart_series* series = chart_add_series(chart, nullptr, nullptr);
    const auto first = static_cast<lxw_row_t>(kSummaryFirstRow);
    const auto last = static_cast<lxw_row_t>(kSummaryFirstRow + estimate.chapters.size() - 1);
    chart_series_set_categories(series, kSummarySheet, first, 0, last, 0);
    chart_series_set_values(series, kSummarySheet, first, 1, last, 1);
    const std::string title = "Devis « " + estimate.name + " » : montant HT par chapitre";
    chart_title_set_name(chart, title.c_str());
    chart_legend_set_position(chart, LXW_CHART_LEGEND_NONE);
    // First chapter at the top, as in the estimate.
    chart_axis_set_reverse(chart->y_axis);
    lxw_chart_font small{};
    small.size = 8;
    chart_axis_set_num_font(chart->y_axis, &small);
    const std::string axisFormat = "#,##0 \"" + WithoutQuotes(currency) + "\"";
    chart_axis_set_num_format(chart->x_axis, axisFormat.c_str());
    chartsheet_set_chart(sheet, chart);
    chartsheet_set_paper(sheet, 9);
    chartsheet_set_landscape(sheet);
    chartsheet_set_header(sheet, PageHeader(estimate).c_str());
    chartsheet_set_footer(sheet, kPageFooter);
}

std::string EstimateLink(std::size_t row)
{
    return FormatString("internal:Devis!A%zu", row + 1);
}

void WriteChecksSheet(lxw_worksheet* sheet, const Estimate& estimate, const EstimatePlaces& places, const Formats& f)
{
    const std::vector<double> widths = {10, 40, 44, 10};
    const std::size_t count = estimate.CheckedRowCount();
    const std::string title = count == 0 ? std::string("Aucune ligne à vérifier avant envoi.")
                                         : FormatString("%zu ligne(s) à vérifier avant envoi.", count);
    WriteText(sheet, 0, 0, title, f.bold);
    WriteHeadings(sheet, 2, {"N° de prix", "Désignation", "À vérifier", "Ligne du devis"}, widths, f);
    lxw_row_t row = 3;
    for (const EstimateChapter& chapter : estimate.chapters)
        for (const EstimateRow& data : chapter.rows) {
            if (data.checks.empty())
                continue;
            const std::string checks = JoinStrings(data.checks, " ; ");
            WriteText(sheet, row, 0, data.priceNumber, f.wrap);
            WriteText(sheet, row, 1, data.label, f.wrap);
            WriteText(sheet, row, 2, checks, f.wrap);
            const std::size_t at = places.rows.at(&data);
            const std::string text = FormatString("ligne %zu", at + 1);
            worksheet_write_url_opt(sheet, row, 3, EstimateLink(at).c_str(), f.link, text.c_str(), nullptr);
            FitRowHeight(sheet, row, {{data.priceNumber, widths[0]}, {data.label, widths[1]}, {checks, widths[2]}});
            ++row;
        }
    SetUpPrinting(sheet, estimate, 2, std::max<lxw_row_t>(row, 3) - 1, 3, false);
}

const char* OriginText(QuantitySource::Origin origin)
{
    switch (origin) {
    case QuantitySource::Origin::Pseudo:
        return "forfait";
    case QuantitySource::Origin::Drawing:
        return "dessin";
    case QuantitySource::Origin::NetworkLumpSum:
        return "forfait du réseau";
    case QuantitySource::Origin::MissingProject:
        return "projet absent du dessin";
    case QuantitySource::Origin::MissingKey:
        return "quantité absente du projet";
    }
    return "";
}

void WriteSourcesSheet(lxw_worksheet* sheet, const Estimate& estimate, const EstimatePlaces& places, const Formats& f)
{
    const std::vector<double> widths = {10, 36, 22, 14, 30, 12, 18, 10};
    WriteText(sheet, 0, 0, "Origine des quantités : la quantité de chaque ligne, projet par projet.", f.bold);
    WriteHeadings(sheet, 2,
                  {"N° de prix", "Désignation", "Projet", "Type de projet", "Clé de quantité", "Quantité", "Origine",
                   "Ligne du devis"},
                  widths, f);
    lxw_row_t row = 3;
    for (const EstimateChapter& chapter : estimate.chapters)
        for (const EstimateRow& data : chapter.rows) {
            const std::size_t at = places.rows.at(&data);
            const std::string link = FormatString("ligne %zu", at + 1);
            for (const QuantitySource& source : data.sources) {
                const std::string kind = ProjectKindName(source.kind);
                WriteText(sheet, row, 0, data.priceNumber, f.wrap);
                WriteText(sheet, row, 1, data.label, f.wrap);
                WriteText(sheet, row, 2, source.project, f.wrap);
                WriteText(sheet, row, 3, kind, f.wrap);
                WriteText(sheet, row, 4, data.quantityKey, f.wrap);
                worksheet_write_number(sheet, row, 5, std::isfinite(source.quantity) ? source.quantity : 0,
                                       f.rawQuantity);
                WriteText(sheet, row, 6, OriginText(source.origin), f.wrap);
                worksheet_write_url_opt(sheet, row, 7, EstimateLink(at).c_str(), f.link, link.c_str(), nullptr);
                FitRowHeight(sheet, row,
                             {{data.priceNumber, widths[0]},
                              {data.label, widths[1]},
                              {source.project, widths[2]},
                              {kind, widths[3]},
                              {data.quantityKey, widths[4]},
                              {OriginText(source.origin), widths[6]}});
                ++row;
            }
        }
    SetUpPrinting(sheet, estimate, 2, std::max<lxw_row_t>(row, 3) - 1, 7, true);
}

} // namespace

VelReadResult WriteWorkbookFile(const std::string& file, const Estimate& estimate, const std::string& currency)
{
    lxw_workbook* workbook = workbook_new(file.c_str());
    if (workbook == nullptr)
        return VelReadResult::Failed(VelReadStatus::kCannotWrite, file, 0,
                                     FormatString("Classeur « %s » : création impossible.", file.c_str()));
    const Formats formats = MakeFormats(workbook, currency);
    lxw_worksheet* estimateSheet = workbook_add_worksheet(workbook, "Devis");
    lxw_worksheet* summarySheet = workbook_add_worksheet(workbook, kSummarySheet);
    // A chart needs data: an estimate without lines has none.
    lxw_chartsheet* chartSheet = estimate.chapters.empty() ? nullptr : workbook_add_chartsheet(workbook, "Graphique");
    lxw_worksheet* checksSheet = workbook_add_worksheet(workbook, kChecksSheet);
    lxw_worksheet* sourcesSheet = workbook_add_worksheet(workbook, kSourcesSheet);
    const EstimatePlaces places = WriteEstimateSheet(estimateSheet, estimate, formats);
    WriteSummarySheet(summarySheet, estimate, places, formats);
    if (chartSheet != nullptr)
        WriteChart(workbook, chartSheet, estimate, currency);
    WriteChecksSheet(checksSheet, estimate, places, formats);
    WriteSourcesSheet(sourcesSheet, estimate, places, formats);
    errno = 0;
    const lxw_error closed = workbook_close(workbook);
    const int closeError = errno;
    if (closed != LXW_NO_ERROR)
        return VelReadResult::Failed(
            VelReadStatus::kCannotWrite, file, closeError,
            FormatString("Classeur « %s » non enregistré : %s ; rien n'est remplacé ; %s.", file.c_str(),
                         closeError != 0 ? velFileErrorReason(closeError).c_str()
                                         : "la bibliothèque des classeurs a échoué",
                         closeError != 0 ? velFileErrorAdvice(closeError).c_str() : "recommencez"));
    return {};
}

VelReadResult WriteEstimateWorkbook(const std::string& path, const Estimate& estimate, const std::string& currency)
{
    // The library writes to a name: it is given the writer's temporary file.
    VelAtomicFile file(path);
    if (VelReadResult opened = file.open(); !opened)
        return opened;
    if (VelReadResult written = WriteWorkbookFile(file.temporaryPath(), estimate, currency); !written) {
        // The message names the file the user asked for, not the temporary one.
        const std::string& temporary = file.temporaryPath();
        if (const std::size_t at = written.message.find(temporary); at != std::string::npos)
            written.message.replace(at, temporary.size(), path);
        written.file = path;
        return written;
    }
    VelReadResult committed = file.commit();
    if (!committed)
        return committed;
    if (!committed.message.empty())
        acutPrintf("%s\n", committed.message.c_str());
    return {};
}

} // namespace metre
