// The service API of the metre module (VelVuzazORE15.arx), as sibling modules compile
// against it: the service name, the exported functions with their arguments and status
// codes, and the types they exchange. A caller finds a function with
// acrxGetServiceSymbolAddr(kZodEVIServiceName, "<name>") after loading the module.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "zodevi/article.h"
#include "zodevi/assoc_line.h"
#include "zodevi/value_array.h"

inline constexpr const char* kZodEVIServiceName = "VelantoZodEVIServices r17.2";
inline constexpr const char* kZodEVIModuleFile = "VelVuzazORE15.arx";

// Ordered list of names, and map from name to text.
using CZodEVIStringList = std::vector<std::string>;
using CZodEVIStringMap = std::map<std::string, std::string>;
using CZodEVIRealArray = CZodEVIValueArray<double>;

// Status codes of the exported functions.
enum : std::int32_t {
    kZodEVIOk = 0,       // done
    kZodEVIFailed = 2,   // failed, or nothing to do
    kZodEVINotFound = 3, // price queries: no article counts that quantity
};

// Quantity selectors of the price functions: which code pattern the item name fills.
enum : std::int32_t {
    kZodEVIPipeLength = 0,         // RSX_TUY_LIN_3D_%s
    kZodEVIPipeCount = 1,          // RSX_TUY_NB_%s
    kZodEVIDuctLength = 2,         // RSX_FRX_LIN_3D_%s
    kZodEVIDuctCount = 3,          // RSX_FRX_NB_%s
    kZodEVICombLength = 4,         // RSX_PGN_LIN_3D_%s
    kZodEVICombCount = 5,          // RSX_PGN_NB_%s
    kZodEVIFittingCount = 6,       // RSX_SBL_NB_%s
    kZodEVIPipeSupplyLength = 7,   // RSX_TUY_FRNT_LIN_3D_%s
    kZodEVIFittingSupplyCount = 8, // RSX_SBL_FRNT_NB_%s
    kZodEVIMaterialVolume = 9,     // PRJ_VOL_MAT_%s
    kZodEVIMaterialSurface = 10,   // PRJ_SFC_MAT_%s
    kZodEVIMaterialLength = 11,    // PRJ_LIN_MAT_%s
    kZodEVIMaterialTonnage = 12,   // PRJ_TON_MAT_%s
};

#define ZODEVI_EXPORT extern "C" __attribute__((visibility("default")))

// Every function answers a status code and never throws; a null pointer answers
// kZodEVIFailed (kZodEVINotFound for the price queries) and changes nothing.

// Reads the schedule file into the current schedule (emptied first). A file that exists
// but does not read is then never written over, until a read of it succeeds.
ZODEVI_EXPORT std::int32_t ZodEVI_ReadBdr();
// Writes the current schedule to its file. kZodEVIFailed, with a message on the command
// line, when the file did not read or changed on disk since it was read or written here
// (an interactive user is asked whether to read it again and make the changes of memory
// on it, or to replace it), or when the file cannot be written.
ZODEVI_EXPORT std::int32_t ZodEVI_WriteBdr();
// Brings a network's articles up to date: network index (0 EP ... 12 other), network
// name, then models, pipe supplies, fittings, fitting supplies, ducts, trench materials,
// and the trench depth bounds in metres. kZodEVIOk when an article was created or removed.
ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrRsx(const std::int32_t* networkIndex, const std::string* networkName,
                                               const CZodEVIStringList* models, const CZodEVIStringList* pipeSupplies,
                                               const CZodEVIStringList* fittings,
                                               const CZodEVIStringList* fittingSupplies, const CZodEVIStringList* ducts,
                                               const CZodEVIStringList* materials, const CZodEVIRealArray* depthBounds);
// Re-applies depth classes to every network of the schedule.
ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrTnePf(const CZodEVIRealArray* depthBounds);
// Comb-duct models.
ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrPgn(const CZodEVIStringList* models);
// Structure materials measured in volume, surface and length.
ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrMat(const CZodEVIStringList* volumeMaterials,
                                               const CZodEVIStringList* surfaceMaterials,
                                               const CZodEVIStringList* lengthMaterials);
// Topsoil stripping and slope vegetation thicknesses, planing class limits (metres).
ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrEpDcp(const CZodEVIRealArray* thicknesses);
ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrEpVeg(const CZodEVIRealArray* thicknesses);
ZODEVI_EXPORT std::int32_t ZodEVI_UpdateBdrEpRbt(const CZodEVIRealArray* classLimits);
// Unit price of the article counting a quantity; an empty network name means the
// general network group. kZodEVINotFound (price set to 0) when none counts it.
ZODEVI_EXPORT std::int32_t ZodEVI_GetBdrPrice(const std::int32_t* selector, const std::string* itemName, double* price,
                                              std::string networkName);
// Network name -> price text of every network group with such an article; the map is
// emptied first, whatever the answer.
ZODEVI_EXPORT std::int32_t ZodEVI_GetBdrPriceRsx(const std::int32_t* selector, const std::string* itemName,
                                                 CZodEVIStringMap* prices);
// Sets the unit price of the article counting a quantity (in memory; write to keep it).
ZODEVI_EXPORT std::int32_t ZodEVI_SetBdrPrice(const std::int32_t* selector, const std::string* itemName,
                                              const double* price, std::string networkName);
// Opens the schedule's editor on the article counting a quantity; kZodEVIOk when it was
// opened and closed normally, whether anything changed or not.
ZODEVI_EXPORT std::int32_t ZodEVI_ShowBdrPrice(const std::int32_t* selector, const std::string* itemName,
                                               std::string networkName);

// Function types, for callers that look the functions up by name.
using ZodEVI_ReadBdrFn = std::int32_t();
using ZodEVI_WriteBdrFn = std::int32_t();
using ZodEVI_UpdateBdrRsxFn = decltype(ZodEVI_UpdateBdrRsx);
using ZodEVI_UpdateBdrTnePfFn = decltype(ZodEVI_UpdateBdrTnePf);
using ZodEVI_UpdateBdrPgnFn = decltype(ZodEVI_UpdateBdrPgn);
using ZodEVI_UpdateBdrMatFn = decltype(ZodEVI_UpdateBdrMat);
using ZodEVI_UpdateBdrEpDcpFn = decltype(ZodEVI_UpdateBdrEpDcp);
using ZodEVI_UpdateBdrEpVegFn = decltype(ZodEVI_UpdateBdrEpVeg);
using ZodEVI_UpdateBdrEpRbtFn = decltype(ZodEVI_UpdateBdrEpRbt);
using ZodEVI_GetBdrPriceFn = decltype(ZodEVI_GetBdrPrice);
using ZodEVI_GetBdrPriceRsxFn = decltype(ZodEVI_GetBdrPriceRsx);
using ZodEVI_SetBdrPriceFn = decltype(ZodEVI_SetBdrPrice);
using ZodEVI_ShowBdrPriceFn = decltype(ZodEVI_ShowBdrPrice);
