// The exported service functions: each applies one operation to the current schedule
// and turns its outcome into a status code. Null pointers and unusable numbers are
// refused with the failure code before anything changes.
#include "module/service_api.hpp"

#include <cmath>

#include "generation/earthwork_update.hpp"
#include "generation/network_update.hpp"
#include "generation/road_update.hpp"
#include "schedule/schedule_exchange.hpp"
#include "zodevi/api.h"

namespace zodevi {

namespace {

CZodEVIBdr* g_current = nullptr;

// A selector names one of the 13 code patterns; any other would match the articles
// whose key is empty (the lump sums).
bool KnownSelector(const std::int32_t* selector)
{
    return selector != nullptr && *selector >= 0 && *selector <= kZodEVIMaterialTonnage;
}

std::int32_t Status(bool done)
{
    return done ? kZodEVIOk : kZodEVIFailed;
}

std::int32_t PriceStatus(bool found)
{
    return found ? kZodEVIOk : kZodEVINotFound;
}

// Applies a change to the current schedule and, when it changed something, keeps it to
// be made again if the file must be read anew before it is written.
template <class Change>
std::int32_t Apply(Change change)
{
    if (!change(*g_current))
        return kZodEVIFailed;
    RecordPendingChange(*g_current, [change](CZodEVIBdr& bdr) { change(bdr); });
    return kZodEVIOk;
}

// Values that cannot name a depth, thickness or price ("nan", "inf") are dropped rather
// than written into codes and texts.
CZodEVIRealArray FiniteValues(const CZodEVIRealArray& values)
{
    CZodEVIRealArray finite;
    for (double v : values)
        if (std::isfinite(v))
            finite.Add(v);
    return finite;
}

} // namespace

CZodEVIBdr* CurrentBdr()
{
    return g_current;
}

void SetCurrentBdr(CZodEVIBdr* bdr)
{
    g_current = bdr;
}

} // namespace zodevi

// The exported functions keep their C names outside the namespace.
using namespace zodevi;

ZODEVI_EXPORT std::int32_t ZodEVI_ReadBdr()
{
    return g_current != nullptr ? Status(Read(*g_current)) : kZodEVIFailed;
}

ZODEVI_EXPORT std::int32_t ZodEVI_WriteBdr()
{
    return g_current != nullptr ? Status(Write(*g_current)) : kZodEVIFailed;
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrRsx(const std::int32_t* networkIndex, const std::string* networkName,
                                               const CZodEVIStringList* models, const CZodEVIStringList* pipeSupplies,
                                               const CZodEVIStringList* fittings,
                                               const CZodEVIStringList* fittingSupplies, const CZodEVIStringList* ducts,
                                               const CZodEVIStringList* materials, const CZodEVIRealArray* depthBounds)
{
    if (g_current == nullptr || networkIndex == nullptr || networkName == nullptr || models == nullptr ||
        pipeSupplies == nullptr || fittings == nullptr || fittingSupplies == nullptr || ducts == nullptr ||
        materials == nullptr || depthBounds == nullptr)
        return kZodEVIFailed;
    // Only the low 16 bits choose the texts of the templates.
    const int index = static_cast<int>(static_cast<std::uint16_t>(*networkIndex));
    return Apply([index, name = *networkName, models = *models, pipeSupplies = *pipeSupplies, fittings = *fittings,
                  fittingSupplies = *fittingSupplies, ducts = *ducts, materials = *materials,
                  bounds = FiniteValues(*depthBounds)](CZodEVIBdr& bdr) {
        return UpdateNetwork(bdr, index, name, models, pipeSupplies, fittings, fittingSupplies, ducts, materials,
                             bounds);
    });
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrTnePf(const CZodEVIRealArray* depthBounds)
{
    if (g_current == nullptr || depthBounds == nullptr)
        return kZodEVIFailed;
    return Apply([bounds = FiniteValues(*depthBounds)](CZodEVIBdr& bdr) { return UpdateDepthClasses(bdr, bounds); });
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrPgn(const CZodEVIStringList* models)
{
    if (g_current == nullptr || models == nullptr)
        return kZodEVIFailed;
    return Apply([models = *models](CZodEVIBdr& bdr) { return UpdateCombDucts(bdr, models); });
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrMat(const CZodEVIStringList* volumeMaterials,
                                               const CZodEVIStringList* surfaceMaterials,
                                               const CZodEVIStringList* lengthMaterials)
{
    if (g_current == nullptr || volumeMaterials == nullptr || surfaceMaterials == nullptr || lengthMaterials == nullptr)
        return kZodEVIFailed;
    return Apply([volumes = *volumeMaterials, surfaces = *surfaceMaterials, lengths = *lengthMaterials](
                     CZodEVIBdr& bdr) { return UpdateMaterials(bdr, volumes, surfaces, lengths); });
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrEpDcp(const CZodEVIRealArray* thicknesses)
{
    if (g_current == nullptr || thicknesses == nullptr)
        return kZodEVIFailed;
    return Apply([values = FiniteValues(*thicknesses)](CZodEVIBdr& bdr) { return UpdateStripping(bdr, values); });
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrEpVeg(const CZodEVIRealArray* thicknesses)
{
    if (g_current == nullptr || thicknesses == nullptr)
        return kZodEVIFailed;
    return Apply([values = FiniteValues(*thicknesses)](CZodEVIBdr& bdr) { return UpdateVegetation(bdr, values); });
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrEpRbt(const CZodEVIRealArray* classLimits)
{
    if (g_current == nullptr || classLimits == nullptr)
        return kZodEVIFailed;
    return Apply([limits = FiniteValues(*classLimits)](CZodEVIBdr& bdr) { return UpdatePlaning(bdr, limits); });
}

ZODEVI_EXPORT std::int32_t ZodEVI_GetBdrPrice(const std::int32_t* selector, const std::string* itemName, double* price,
                                              std::string networkName)
{
    if (price != nullptr)
        *price = 0;
    if (g_current == nullptr || !KnownSelector(selector) || itemName == nullptr || price == nullptr)
        return kZodEVINotFound;
    return PriceStatus(GetPrice(*g_current, *selector, *itemName, *price, networkName));
}

ZODEVI_EXPORT std::int32_t ZodEVI_GetBdrPriceRsx(const std::int32_t* selector, const std::string* itemName,
                                                 CZodEVIStringMap* prices)
{
    // Every answer leaves the map with this query's prices only.
    if (prices != nullptr)
        prices->clear();
    if (g_current == nullptr || !KnownSelector(selector) || itemName == nullptr || prices == nullptr)
        return kZodEVINotFound;
    return PriceStatus(GetPricesPerNetwork(*g_current, *selector, *itemName, *prices));
}

ZODEVI_EXPORT std::int32_t ZodEVI_SetBdrPrice(const std::int32_t* selector, const std::string* itemName,
                                              const double* price, std::string networkName)
{
    // A price that is not a number would be written into the file as "nan".
    if (g_current == nullptr || !KnownSelector(selector) || itemName == nullptr || price == nullptr ||
        !std::isfinite(*price))
        return kZodEVIFailed;
    return Apply([selector = *selector, item = *itemName, value = *price, networkName](CZodEVIBdr& bdr) {
        return SetPrice(bdr, selector, item, value, networkName);
    });
}

ZODEVI_EXPORT std::int32_t ZodEVI_ShowBdrPrice(const std::int32_t* selector, const std::string* itemName,
                                               std::string networkName)
{
    if (g_current == nullptr || !KnownSelector(selector) || itemName == nullptr)
        return kZodEVIFailed;
    return Status(ShowPrice(*g_current, *selector, *itemName, networkName));
}
