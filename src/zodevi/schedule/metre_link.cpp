// The metre module the schedule exchanges with, and the stand-in for its absence.
#include "schedule/metre_link.hpp"

namespace zodevi {

namespace {

class MissingMetre final : public CZodEVIBdrMetre {
public:
    std::int32_t FillTable(const std::string&, std::vector<CZodEVIArticle*>&) override { return 1; }
    std::int32_t ExportTable(const std::string&, std::vector<CZodEVIArticle*>&) override { return 1; }
    std::int32_t EditSchedule(const std::string&, const std::string&, std::vector<CZodEVIArticle*>&,
                              std::vector<std::uint32_t>&) override
    {
        return 1;
    }
    std::int32_t CurrencySymbol(std::string&) override { return 1; }
};

CZodEVIBdrMetre* g_metre = nullptr;

} // namespace

void SetBdrMetre(CZodEVIBdrMetre* metre)
{
    g_metre = metre;
}

CZodEVIBdrMetre& BdrMetre()
{
    static MissingMetre missing;
    return g_metre != nullptr ? *g_metre : missing;
}

} // namespace zodevi
