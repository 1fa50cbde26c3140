// Building the estimate from its lines and writing it as a workbook and a CSV file.
#include "estimate.hpp"

#include "text/text.hpp"
#include "velhost/editor.h"
#include "velhost/files.h"

#include <xlsxwriter.h>

#include <cerrno>
#include <cmath>
#include <cstdio>
#include <map>
#include <sys/stat.h>
#include <unistd.h>
#include <unordered_map>

namespace metre {

namespace {

constexpr std::string_view kSeparator = "\\\\";
constexpr double kDefaultTaxRate = 19.6;

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

std::vector<std::string> ProjectsOfLine(const CZodEVIAssocLine& line, const ProjectTables& projects)
{
    // Names are joined with "," in sum mode, but a name may hold a comma itself.
    if (IsPseudoProject(line.projects) || projects.KindHolding(line.projectKind, line.projects))
        return {line.projects};
    std::vector<std::string> names;
    std::size_t start = 0;
    for (;;) {
        const std::size_t comma = line.projects.find(',', start);
        names.push_back(line.projects.substr(start, comma == std::string::npos ? std::string::npos : comma - start));
        if (comma == std::string::npos)
            return names;
        start = comma + 1;
    }
}

double LineQuantity(const CZodEVIAssocLine& line, const ProjectTables& projects, std::vector<std::string>& warnings)
{
    if (line.lineKind == kLineKindLumpSum)
        return 1.0;
    double total = 0;
    for (const std::string& project : ProjectsOfLine(line, projects)) {
        if (IsPseudoProject(project)) {
            total += 1.0;
            continue;
        }
        const std::optional<int> kind = projects.KindHolding(line.projectKind, project);
        if (const auto quantity = kind ? projects.Quantity(*kind, project, line.quantityKey) : std::nullopt)
            total += *quantity;
        else if (!kind)
            warnings.push_back(FormatString("« %s » : projet « %s » absent du dessin, quantité 0.", line.label.c_str(),
                                            project.c_str()));
        else
            warnings.push_back(FormatString("« %s » : quantité %s absente du projet « %s », quantité 0.",
                                            line.label.c_str(), line.quantityKey.c_str(), project.c_str()));
    }
    return total;
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

const char* const kHeaders[] = {"N° de prix", "Désignation", "Unité", "Quantité", "Prix unitaire HT", "Montant HT",
                                "Taux TVA"};

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
        parts.push_back(SumOfCells(std::vector<std::string>(cells.begin() + i,
                                                            cells.begin() + std::min(cells.size(), i + 200))));
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
        if (article == nullptr)
            estimate.warnings.push_back(FormatString("« %s » : article absent du bordereau, TVA %s %%.",
                                                     line->label.c_str(), FrenchNumber(kDefaultTaxRate, -1).c_str()));
        row.priceNumber = article != nullptr && !article->code.empty() ? article->code : CodeOfTreePath(line->treePath);
        row.taxRate = article != nullptr ? article->taxRate : kDefaultTaxRate;
        row.label = line->label;
        row.unit = line->unit;
        row.quantity = RoundToCents(LineQuantity(*line, projects, estimate.warnings));
        row.unitPrice = line->unitPrice;
        row.amount = RoundToCents(row.quantity * row.unitPrice);
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

FileResult WriteEstimateCsv(const std::string& path, const Estimate& estimate)
{
    return WriteFileAtomically(path, EstimateCsv(estimate), false);
}

FileResult WriteEstimateWorkbook(const std::string& path, const Estimate& estimate, const std::string& currency)
{
    using K = SheetRow::Kind;
    // The library writes to a name: it is given the writer's temporary file.
    VelAtomicFile file(path);
    if (VelFileResult opened = file.open(); !opened)
        return FileResult::Failure(opened.message);
    lxw_workbook* workbook = workbook_new(file.temporaryPath().c_str());
    if (workbook == nullptr)
        return FileResult::Failure(FormatString("Classeur « %s » : création impossible.", path.c_str()));
    lxw_worksheet* sheet = workbook_add_worksheet(workbook, "Devis");
    lxw_format* bold = workbook_add_format(workbook);
    format_set_bold(bold);
    lxw_format* header = workbook_add_format(workbook);
    format_set_bold(header);
    format_set_bottom(header, LXW_BORDER_THIN);
    format_set_text_wrap(header);
    const std::string moneyPattern = "#,##0.00 \"" + WithoutQuotes(currency) + "\"";
    lxw_format* money = workbook_add_format(workbook);
    format_set_num_format(money, moneyPattern.c_str());
    lxw_format* moneyBold = workbook_add_format(workbook);
    format_set_num_format(moneyBold, moneyPattern.c_str());
    format_set_bold(moneyBold);
    lxw_format* quantity = workbook_add_format(workbook);
    format_set_num_format(quantity, "#,##0.00");
    lxw_format* rate = workbook_add_format(workbook);
    format_set_num_format(rate, "0.0##");
    lxw_format* wrap = workbook_add_format(workbook);
    format_set_text_wrap(wrap);
    worksheet_set_column(sheet, 0, 0, 12, nullptr);
    worksheet_set_column(sheet, 1, 1, 50, nullptr);
    worksheet_set_column(sheet, 2, 2, 8, nullptr);
    worksheet_set_column(sheet, 3, 6, 15, nullptr);

    const std::vector<SheetRow> rows = SheetRows(estimate);
    // Rows of the lines (for the tax sums) and of the subtotals (for the total).
    std::size_t firstLine = 0, lastLine = 0;
    bool anyLine = false;
    std::vector<std::string> subtotalCells, taxCells;
    std::size_t chapterFirst = 0, totalRow = 0;
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
    for (std::size_t r = 0; r < rows.size(); ++r) {
        const SheetRow& row = rows[r];
        const auto line = static_cast<lxw_row_t>(r);
        switch (row.kind) {
        case K::Title:
            worksheet_write_string(sheet, line, 0, ("Devis : " + estimate.name).c_str(), bold);
            break;
        case K::Drawing:
            worksheet_write_string(sheet, line, 0, ("Dessin : " + estimate.drawing).c_str(), nullptr);
            break;
        case K::Blank:
            break;
        case K::Header:
            for (lxw_col_t c = 0; c < 7; ++c)
                worksheet_write_string(sheet, line, c, kHeaders[c], header);
            break;
        case K::Chapter:
            worksheet_write_string(sheet, line, 1, row.chapter->title.c_str(), bold);
            chapterFirst = r + 1;
            break;
        case K::Line: {
            const EstimateRow& data = *row.row;
            worksheet_write_string(sheet, line, 0, data.priceNumber.c_str(), nullptr);
            worksheet_write_string(sheet, line, 1, data.label.c_str(), wrap);
            worksheet_write_string(sheet, line, 2, data.unit.c_str(), nullptr);
            worksheet_write_number(sheet, line, 3, data.quantity, quantity);
            worksheet_write_number(sheet, line, 4, data.unitPrice, money);
            const std::string formula = FormatString("=ROUND(%s*%s,2)", Cell('D', r).c_str(), Cell('E', r).c_str());
            worksheet_write_formula_num(sheet, line, 5, formula.c_str(), money, data.amount);
            worksheet_write_number(sheet, line, 6, data.taxRate, rate);
            break;
        }
        case K::Subtotal: {
            worksheet_write_string(sheet, line, 1, "Sous-total HT", bold);
            const std::string formula = FormatString("=SUM(F%zu:F%zu)", chapterFirst + 1, r);
            worksheet_write_formula_num(sheet, line, 5, formula.c_str(), moneyBold, row.chapter->subtotal);
            subtotalCells.push_back(Cell('F', r));
            break;
        }
        case K::Total: {
            worksheet_write_string(sheet, line, 1, "Total HT", bold);
            const std::string formula = FormatString("=%s", SumOfCells(subtotalCells).c_str());
            worksheet_write_formula_num(sheet, line, 5, formula.c_str(), moneyBold, estimate.totalExclTax);
            totalRow = r;
            break;
        }
        case K::Tax: {
            worksheet_write_string(sheet, line, 1, TaxLabel(row.tax->rate).c_str(), nullptr);
            const std::string rateText = FormatRealShortest(row.tax->rate);
            const std::string formula = FormatString("=ROUND(SUMIF(%s,%s,%s)*%s/100,2)", rateRange.c_str(),
                                                     rateText.c_str(), amountRange.c_str(), rateText.c_str());
            worksheet_write_formula_num(sheet, line, 5, formula.c_str(), money, row.tax->tax);
            taxCells.push_back(Cell('F', r));
            break;
        }
        case K::TotalIncl: {
            worksheet_write_string(sheet, line, 1, "Total TTC", bold);
            const std::string formula =
                FormatString("=%s%s%s", Cell('F', totalRow).c_str(), taxCells.empty() ? "" : "+",
                             taxCells.empty() ? "" : SumOfCells(taxCells).c_str());
            worksheet_write_formula_num(sheet, line, 5, formula.c_str(), moneyBold, estimate.totalInclTax);
            break;
        }
        }
    }
    errno = 0;
    const lxw_error closed = workbook_close(workbook);
    const int closeError = errno;
    if (closed != LXW_NO_ERROR)
        return FileResult::Failure(FormatString(
            "Classeur « %s » non enregistré : %s ; rien n'est remplacé ; %s.", path.c_str(),
            closeError != 0 ? velFileErrorReason(closeError).c_str() : "la bibliothèque des classeurs a échoué",
            closeError != 0 ? velFileErrorAdvice(closeError).c_str() : "recommencez"));
    VelFileResult committed = file.commit();
    if (!committed)
        return FileResult::Failure(committed.message);
    if (!committed.message.empty())
        acutPrintf("%s\n", committed.message.c_str());
    return {};
}

} // namespace metre
