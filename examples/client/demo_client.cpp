// A sibling module of the example project (VelDemoPrix.arx): how a road or network
// module prices an article through the schedule's service API. Its command asks for a
// quantity and a unit price, sets the price, and stores the schedule.
#include <optional>
#include <string>

#include "text/text.hpp"
#include "velhost/commands.h"
#include "velhost/editor.h"
#include "velhost/rx.h"
#include "zodevi/api.h"

namespace {

constexpr const char* kGroup = "VELANTO_DEMO_PRIX";

// The schedule's functions, loading its module when it is not there yet.
template <class Fn>
Fn* ScheduleFunction(const char* name)
{
    velLoadServiceModule(kZodEVIServiceName, {kZodEVIModuleFile});
    return reinterpret_cast<Fn*>(acrxGetServiceSymbolAddr(kZodEVIServiceName, name));
}

bool Ask(const char* prompt, std::string& answer)
{
    return acedGetString(true, prompt, answer) == RTNORM;
}

void SetPriceCommand()
{
    auto* setPrice = ScheduleFunction<ZodEVI_SetBdrPriceFn>("ZodEVI_SetBdrPrice");
    auto* getPrice = ScheduleFunction<ZodEVI_GetBdrPriceFn>("ZodEVI_GetBdrPrice");
    auto* write = ScheduleFunction<ZodEVI_WriteBdrFn>("ZodEVI_WriteBdr");
    if (setPrice == nullptr || getPrice == nullptr || write == nullptr) {
        acutPrintf("%s", "\nLe module de métré (VelVuzazORE15.arx) est introuvable.\n");
        return;
    }
    std::string selectorText, item, network, priceText;
    if (!Ask("\nQuantité (0 tuyaux, 6 regards, 9 à 12 matériaux) <0> : ", selectorText))
        return;
    // Said at once rather than after three more questions.
    const std::optional<long long> quantity = selectorText.empty() ? 0 : ParseInt(selectorText);
    if (!quantity || *quantity < 0 || *quantity > 12) {
        acutPrintf("\n« %s » n'est pas une quantité : tapez un nombre de 0 à 12.\n", selectorText.c_str());
        return;
    }
    const std::int32_t selector = static_cast<std::int32_t>(*quantity);
    if (!Ask("\nNom de l'élément : ", item) || !Ask("\nRéseau (vide : réseau général) : ", network) ||
        !Ask("\nPrix unitaire HT : ", priceText))
        return;
    // Prices are typed the French way as often as not.
    for (char& c : priceText)
        if (c == ',')
            c = '.';
    const auto price = ParseReal(priceText);
    if (!price) {
        acutPrintf("\n« %s » n'est pas un prix.\n", priceText.c_str());
        return;
    }
    if (setPrice(&selector, &item, &*price, network) != kZodEVIOk) {
        acutPrintf("\nAucun article du bordereau ne compte « %s » (quantité %d, réseau « %s »).\n", item.c_str(),
                   selector, network.c_str());
        return;
    }
    double stored = 0;
    getPrice(&selector, &item, &stored, network);
    acutPrintf("\nPrix unitaire de « %s » : %s € HT.\n", item.c_str(), FormatReal(stored, 2).c_str());
    acutPrintf("%s", write() == kZodEVIOk ? "Bordereau des prix enregistré.\n"
                                          : "Le bordereau des prix n'a pas pu être enregistré.\n");
}

} // namespace

extern "C" __attribute__((visibility("default"))) AcRx::AppRetCode acrxEntryPoint(AcRx::AppMsgCode message, void* appId)
{
    switch (message) {
    case AcRx::kInitAppMsg:
        acrxDynamicLinker()->unlockApplication(appId);
        acedRegCmds()->addCommand(kGroup, "VelaDemoPrix", "DemoPrix", ACRX_CMD::kModal, &SetPriceCommand);
        return AcRx::kRetOK;
    case AcRx::kUnloadAppMsg:
        acedRegCmds()->removeGroup(kGroup);
        return AcRx::kRetOK;
    default:
        return AcRx::kRetOK;
    }
}
