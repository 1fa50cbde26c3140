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
                                               const CZodEVIStringList* fittingSupplies,
                                               const CZodEVIStringList* ducts, const CZodEVIStringList* materials,
                                               const CZodEVIRealArray* depthBounds)
{
    if (g_current == nullptr || networkIndex == nullptr || networkName == nullptr || models == nullptr ||
        pipeSupplies == nullptr || fittings == nullptr || fittingSupplies == nullptr || ducts == nullptr ||
        materials == nullptr || depthBounds == nullptr)
        return kZodEVIFailed;
    // Only the low 16 bits choose the texts of the templates.
    const int index = static_cast<int>(static_cast<std::uint16_t>(*networkIndex));
    return Status(UpdateNetwork(*g_current, index, *networkName, *models, *pipeSupplies, *fittings,
                                *fittingSupplies, *ducts, *materials, FiniteValues(*depthBounds)));
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrTnePf(const CZodEVIRealArray* depthBounds)
{
    if (g_current == nullptr || depthBounds == nullptr)
        return kZodEVIFailed;
    return Status(UpdateDepthClasses(*g_current, FiniteValues(*depthBounds)));
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrPgn(const CZodEVIStringList* models)
{
    if (g_current == nullptr || models == nullptr)
        return kZodEVIFailed;
    return Status(UpdateCombDucts(*g_current, *models));
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrMat(const CZodEVIStringList* volumeMaterials,
                                               const CZodEVIStringList* surfaceMaterials,
                                               const CZodEVIStringList* lengthMaterials)
{
    if (g_current == nullptr || volumeMaterials == nullptr || surfaceMaterials == nullptr || lengthMaterials == nullptr)
        return kZodEVIFailed;
    return Status(UpdateMaterials(*g_current, *volumeMaterials, *surfaceMaterials, *lengthMaterials));
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrEpDcp(const CZodEVIRealArray* thicknesses)
{
    if (g_current == nullptr || thicknesses == nullptr)
        return kZodEVIFailed;
    return Status(UpdateStripping(*g_current, FiniteValues(*thicknesses)));
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrEpVeg(const CZodEVIRealArray* thicknesses)
{
    if (g_current == nullptr || thicknesses == nullptr)
        return kZodEVIFailed;
    return Status(UpdateVegetation(*g_current, FiniteValues(*thicknesses)));
}

ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrEpRbt(const CZodEVIRealArray* classLimits)
{
    if (g_current == nullptr || classLimits == nullptr)
        return kZodEVIFailed;
    return Status(UpdatePlaning(*g_current, FiniteValues(*classLimits)));
}

ZODEVI_EXPORT std::int32_t ZodEVI_GetBdrPrice(const std::int32_t* selector, const std::string* itemName,
                                              double* price, std::string networkName)
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
    return Status(SetPrice(*g_current, *selector, *itemName, *price, networkName));
}

ZODEVI_EXPORT std::int32_t ZodEVI_ShowBdrPrice(const std::int32_t* selector, const std::string* itemName,
                                               std::string networkName)
{
    if (g_current == nullptr || !KnownSelector(selector) || itemName == nullptr)
        return kZodEVIFailed;
    return Status(ShowPrice(*g_current, *selector, *itemName, networkName));
}
