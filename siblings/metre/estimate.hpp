// The estimate ("devis") built from the estimate lines: quantities evaluated in the
// drawing's projects, rows filed by chapter, amounts rounded to the cent line by line,
// totals per tax rate, the lines to check before sending; written as a workbook with live
// formulas and as a French CSV.
#pragma once

#include "drawing_records.hpp"
#include "schedule_file.hpp"
#include "zodevi/assoc_line.h"

#include <string>
#include <string_view>
#include <vector>

namespace metre {

// One project counted by a line, and what its quantity is taken from.
struct QuantitySource {
    enum class Origin {
        Pseudo,         // "**Forfait" or "**Voirie": 1
        Drawing,        // the project's record in the drawing
        NetworkLumpSum, // a network's lump sum filed under the network's name: 1
        MissingProject, // 0: no record of that kind and name
        MissingKey,     // 0: the record has no such quantity
    };
    std::string project;
    int kind = 0;
    double quantity = 0;
    Origin origin = Origin::Drawing;
};

struct EstimateRow {
    std::string priceNumber; // the article's code
    std::string label;
    std::string unit;
    std::string quantityKey;
    double quantity = 0; // the sum of the sources, rounded to the cent
    double unitPrice = 0;
    double taxRate = 0;
    double amount = 0; // quantity x unit price, rounded to the cent
    std::vector<QuantitySource> sources;
    // What an estimator must look at before sending, as short French phrases.
    std::vector<std::string> checks;
};

struct EstimateChapter {
    std::string title;
    std::vector<EstimateRow> rows;
    double subtotal = 0;
};

struct EstimateTax {
    double rate = 0;
    double base = 0;
    double tax = 0;
};

struct Estimate {
    std::string name;
    std::string drawing;
    std::string date; // "06/12/2026"
    std::vector<EstimateChapter> chapters;
    double totalExclTax = 0;
    std::vector<EstimateTax> taxes; // ascending rates
    double totalInclTax = 0;
    // Lines whose quantity or article could not be found, as French sentences.
    std::vector<std::string> warnings;
    std::size_t RowCount() const;
    // Lines that carry at least one check.
    std::size_t CheckedRowCount() const;
};

// Rounds half away from zero to two decimals, as a spreadsheet's ROUND does on the
// decimal value shown (1.005 gives 1.01).
double RoundToCents(double value);

// Pseudo-projects that count 1 whatever the drawing holds.
bool IsPseudoProject(const std::string& project);

// Builds the estimate. A line counts each of its projects (with their kinds from
// assocText1, else from `projects` and `projectKind`): 1 for a pseudo-project; else the
// quantity of the line's key in the drawing's record of that kind and name; else 1 for
// a network's lump sum (line kind 5, project kind 3); else 0, to be checked. The tax rate
// and the price number come from the schedule article with the line's tree path (19.6
// and the code of the tree path when the schedule lacks it). Chapters follow the order in
// which lines first name them.
Estimate BuildEstimate(const std::string& name, const std::vector<CZodEVIAssocLine*>& lines,
                       const ProjectTables& projects, const ArticleVector& schedule);

// What the command line shows of an estimate: chapters with their subtotals, the totals,
// the count of lines to check and the problems found, then the files.
std::vector<std::string> EstimateSummary(const Estimate& estimate, const std::string& currency,
                                         const std::string& workbookPath, const std::string& csvPath);

// Lines that a text takes once wrapped at spaces in a column of this width (in widths of
// a digit of the sheet's font), estimated from the usual widths of its letters; at least 1.
int WrappedLineCount(std::string_view text, double columnWidth);

// The chapter of a tree path: its category levels without nature levels, joined by " / ".
std::string ChapterOfTreePath(const std::string& treePath);

// "12,5" style number for French spreadsheets; `decimals` < 0 for the shortest exact text.
std::string FrenchNumber(double value, int decimals);

// The CSV text (UTF-8 with its byte-order mark, ";" separated, decimal comma).
std::string EstimateCsv(const Estimate& estimate);

// The workbook: the estimate (the same rows as the CSV, live formulas carrying their
// computed values, ready to print), its summary by chapter with a chart, the lines to
// check, and where each line's quantity comes from. Written at exactly `file`.
VelReadResult WriteWorkbookFile(const std::string& file, const Estimate& estimate, const std::string& currency);

// Replace `path` with the workbook or the CSV once written whole.
VelReadResult WriteEstimateWorkbook(const std::string& path, const Estimate& estimate, const std::string& currency);
VelReadResult WriteEstimateCsv(const std::string& path, const Estimate& estimate);

} // namespace metre
