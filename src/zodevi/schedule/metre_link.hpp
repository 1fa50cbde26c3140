// What the schedule asks of the metre module: a schedule file read into articles,
// articles written to it, its editor, and the currency of its prices. The module frame
// plugs the module in, reached through its service; without it every call answers as
// the module missing does.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "zodevi/article.h"

namespace zodevi {

class CZodEVIBdrMetre {
public:
    virtual ~CZodEVIBdrMetre() = default;
    // Each answers as the metre module does: 0 for success, 1 when it is missing.
    // Appends the file's articles to the table, in file order; the caller owns them, even
    // those delivered before a failure.
    virtual std::int32_t FillTable(const std::string& file, std::vector<CZodEVIArticle*>& table) = 0;
    // Writes the table's articles to the file, in table order.
    virtual std::int32_t ExportTable(const std::string& file, std::vector<CZodEVIArticle*>& table) = 0;
    // Opens the editor on the file (on the article of that tree path, or everywhere) and
    // answers the changed articles, owned by the caller, with their change kinds.
    virtual std::int32_t EditSchedule(const std::string& file, const std::string& treePath,
                                      std::vector<CZodEVIArticle*>& records, std::vector<std::uint32_t>& actions) = 0;
    virtual std::int32_t CurrencySymbol(std::string& symbol) = 0;
};

// The metre module used by every exchange from now on; null for none. Not owned.
void SetBdrMetre(CZodEVIBdrMetre* metre);
// The metre module set, or one that answers 1 to everything.
CZodEVIBdrMetre& BdrMetre();

} // namespace zodevi
