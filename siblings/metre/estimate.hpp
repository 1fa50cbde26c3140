// The estimate ("devis") built from the estimate lines: quantities evaluated in the
// drawing's projects, rows filed by chapter, amounts rounded to the cent line by line,
// totals per tax rate; written as a workbook with live formulas and as a French CSV.
#pragma once

#include "drawing_records.hpp"
#include "schedule_file.hpp"
#include "zodevi/assoc_line.h"

#include <string>
#include <vector>

namespace metre {

struct EstimateRow {
    std::string priceNumber; // the article's code
    std::string label;
    std::string unit;
    double quantity = 0;
    double unitPrice = 0;
    double taxRate = 0;
    double amount = 0; // quantity x unit price, rounded to the cent
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
    std::vector<EstimateChapter> chapters;
    double totalExclTax = 0;
    std::vector<EstimateTax> taxes; // ascending rates
    double totalInclTax = 0;
    // Lines whose quantity or article could not be found, as French sentences.
    std::vector<std::string> warnings;
    std::size_t RowCount() const;
};

// Rounds half away from zero to two decimals, as a spreadsheet's ROUND does on the
// decimal value shown (1.005 gives 1.01).
double RoundToCents(double value);

// Pseudo-projects that count 1 whatever the drawing holds.
bool IsPseudoProject(const std::string& project);

// Builds the estimate: each line's quantity is the sum over its projects of the line's
// quantity key (1 for a lump sum), the tax rate and the price number come from the
// schedule article with the line's tree path (19.6 and the code of the tree path when
// the schedule lacks it). Chapters follow the order in which lines first name them.
Estimate BuildEstimate(const std::string& name, const std::vector<CZodEVIAssocLine*>& lines,
                       const ProjectTables& projects, const ArticleVector& schedule);

// The chapter of a tree path: its category levels without nature levels, joined by " / ".
std::string ChapterOfTreePath(const std::string& treePath);

// "12,5" style number for French spreadsheets; `decimals` < 0 for the shortest exact text.
std::string FrenchNumber(double value, int decimals);

// The CSV text (UTF-8 with its byte-order mark, ";" separated, decimal comma).
std::string EstimateCsv(const Estimate& estimate);

// Writes the workbook (the same rows, live formulas carrying their computed values).
FileResult WriteEstimateWorkbook(const std::string& path, const Estimate& estimate, const std::string& currency);
FileResult WriteEstimateCsv(const std::string& path, const Estimate& estimate);

} // namespace metre
