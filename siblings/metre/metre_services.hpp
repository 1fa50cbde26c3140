// The metre module's services behind its exported functions: the schedule file, its
// editor, the estimates of the current drawing and the module's settings.
#pragma once

#include "zodevi/article.h"
#include "zodevi/assoc_line.h"

#include <cstdint>
#include <string>
#include <vector>

namespace metre {

// The module's settings file in the host's profile: section "Metre", keys "Monnaie"
// (currency symbol, "€" when absent) and "Bordereau" (schedule used for estimates when
// none was exchanged since start-up).
std::string SettingsFile();
std::string CurrencySymbol();

// The schedule file last read, written or edited; estimates take tax rates and price
// numbers from it.
void RememberSchedulePath(const std::string& path);
std::string EstimateSchedulePath();

// Appends one newly allocated article per article of the file; 0 when read, else
// non-zero with the list untouched and a message printed.
int FillArticles(const std::string& path, std::vector<CZodEVIArticle*>* table);
// Writes the listed articles, in their order; 0 when written.
int ExportArticles(const std::string& path, const std::vector<CZodEVIArticle*>* table);

// Builds the estimate of the current drawing, writes "<drawing folder>/<name>.xlsx" and
// ".csv", records it in the drawing and prints a summary; 0 when all of it was done.
int ShowEstimate(const std::string& name, const std::vector<CZodEVIAssocLine*>* lines);
// Names of the estimates recorded in the current drawing.
int ListEstimates(std::vector<std::string>* names);

} // namespace metre
