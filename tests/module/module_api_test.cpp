// The module's service API as a sibling module uses it: the module loaded into the host,
// each function found by name through the service, with its status codes and what it
// does with bad arguments.
#include "zodevi/api.h"

#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <filesystem>
#include <limits>

#include "../host/host_fixture.hpp"
#include "../host/temp_dir.hpp"
#include "velhost/profile.h"
#include "velhost/rx.h"

namespace fs = std::filesystem;

namespace {

template <class Fn>
Fn* Function(const char* name)
{
    return reinterpret_cast<Fn*>(acrxGetServiceSymbolAddr(kZodEVIServiceName, name));
}

class ModuleApi : public ::testing::Test {
protected:
    void SetUp() override
    {
        saved = velHostSettings();
        velHostSettings().modulesDir = VEL_MODULE_DIR;
        velHostSettings().profileDir = dir.File("profil");
        ASSERT_TRUE(acrxLoadModule((fs::path(VEL_MODULE_DIR) / kZodEVIModuleFile).c_str(), false));
        ASSERT_TRUE(acrxServiceIsRegistered(kZodEVIServiceName));
    }
    void TearDown() override
    {
        velUnloadAllModules();
        velHostSettings() = saved;
    }

    std::int32_t UpdateNetwork(std::int32_t index, const std::string& name, const CZodEVIStringList& models,
                               const CZodEVIRealArray& bounds = {})
    {
        const CZodEVIStringList none;
        return Function<ZodEVI_UpdateBdrRsxFn>("ZodEVI_UpdateBdrRsx")(&index, &name, &models, &none, &none, &none,
                                                                       &none, &none, &bounds);
    }

    TempDir dir;
    VelHostSettings saved;
    ScriptedSession session;
};

TEST_F(ModuleApi, PricesThroughUpdateSetWriteAndRead)
{
    auto* getPrice = Function<ZodEVI_GetBdrPriceFn>("ZodEVI_GetBdrPrice");
    auto* setPrice = Function<ZodEVI_SetBdrPriceFn>("ZodEVI_SetBdrPrice");
    auto* getPrices = Function<ZodEVI_GetBdrPriceRsxFn>("ZodEVI_GetBdrPriceRsx");
    auto* write = Function<ZodEVI_WriteBdrFn>("ZodEVI_WriteBdr");
    auto* read = Function<ZodEVI_ReadBdrFn>("ZodEVI_ReadBdr");
    ASSERT_TRUE(getPrice && setPrice && getPrices && write && read);

    const std::int32_t pipeLength = kZodEVIPipeLength;
    const std::string pvc = "PVC 200";
    double price = 99;
    EXPECT_EQ(getPrice(&pipeLength, &pvc, &price, "EU 1"), kZodEVINotFound);
    EXPECT_EQ(price, 0.0);

    EXPECT_EQ(UpdateNetwork(1, "EU 1", {"PVC 200"}, {1.3, 2.0}), kZodEVIOk);
    EXPECT_EQ(UpdateNetwork(1, "EU 1", {"PVC 200"}, {1.3, 2.0}), kZodEVIFailed); // nothing new

    const double set = 48.5;
    EXPECT_EQ(setPrice(&pipeLength, &pvc, &set, "EU 1"), kZodEVIOk);
    EXPECT_EQ(getPrice(&pipeLength, &pvc, &price, "EU 1"), kZodEVIOk);
    EXPECT_EQ(price, 48.5);
    EXPECT_EQ(setPrice(&pipeLength, &pvc, &set, "EU 2"), kZodEVIFailed);

    // Per network, for the networks the updates named.
    CZodEVIStringMap prices;
    EXPECT_EQ(getPrices(&pipeLength, &pvc, &prices), kZodEVIOk);
    EXPECT_EQ(prices["EU 1"], "48.5");

    EXPECT_EQ(write(), kZodEVIOk);
    EXPECT_TRUE(fs::exists(dir.File("profil/Donnees/VelaBordereau.xml")));
    const double other = 1;
    setPrice(&pipeLength, &pvc, &other, "EU 1");
    EXPECT_EQ(read(), kZodEVIOk);
    EXPECT_EQ(getPrice(&pipeLength, &pvc, &price, "EU 1"), kZodEVIOk);
    EXPECT_EQ(price, 48.5);
}

TEST_F(ModuleApi, BadArgumentsAnswerAStatusAndChangeNothing)
{
    auto* getPrice = Function<ZodEVI_GetBdrPriceFn>("ZodEVI_GetBdrPrice");
    auto* setPrice = Function<ZodEVI_SetBdrPriceFn>("ZodEVI_SetBdrPrice");
    auto* getPrices = Function<ZodEVI_GetBdrPriceRsxFn>("ZodEVI_GetBdrPriceRsx");
    auto* show = Function<ZodEVI_ShowBdrPriceFn>("ZodEVI_ShowBdrPrice");
    auto* rsx = Function<ZodEVI_UpdateBdrRsxFn>("ZodEVI_UpdateBdrRsx");
    auto* depth = Function<ZodEVI_UpdateBdrTnePfFn>("ZodEVI_UpdateBdrTnePf");
    auto* comb = Function<ZodEVI_UpdateBdrPgnFn>("ZodEVI_UpdateBdrPgn");
    auto* materials = Function<ZodEVI_UpdateBdrMatFn>("ZodEVI_UpdateBdrMat");
    auto* stripping = Function<ZodEVI_UpdateBdrEpDcpFn>("ZodEVI_UpdateBdrEpDcp");
    auto* vegetation = Function<ZodEVI_UpdateBdrEpVegFn>("ZodEVI_UpdateBdrEpVeg");
    auto* planing = Function<ZodEVI_UpdateBdrEpRbtFn>("ZodEVI_UpdateBdrEpRbt");
    ASSERT_TRUE(getPrice && setPrice && getPrices && show && rsx && depth && comb && materials && stripping &&
                vegetation && planing);

    ASSERT_EQ(UpdateNetwork(0, "EP", {"Fonte 150"}), kZodEVIOk);
    const std::int32_t selector = kZodEVIPipeLength;
    const std::string item = "Fonte 150";
    const double good = 10;
    ASSERT_EQ(setPrice(&selector, &item, &good, "EP"), kZodEVIOk);

    const CZodEVIStringList list;
    const CZodEVIRealArray values;
    const std::string name = "EP";
    const std::int32_t index = 0;
    double price = 5;
    const double nan = std::nan("");
    const double infinite = std::numeric_limits<double>::infinity();
    const std::int32_t outOfRange = 13;
    const std::int32_t negative = -1;
    CZodEVIStringMap prices;
    struct Case {
        const char* name;
        std::int32_t status;
    };
    const Case cases[] = {
        {"rsx index", rsx(nullptr, &name, &list, &list, &list, &list, &list, &list, &values)},
        {"rsx name", rsx(&index, nullptr, &list, &list, &list, &list, &list, &list, &values)},
        {"rsx list", rsx(&index, &name, &list, &list, &list, nullptr, &list, &list, &values)},
        {"rsx bounds", rsx(&index, &name, &list, &list, &list, &list, &list, &list, nullptr)},
        {"depth", depth(nullptr)},
        {"comb", comb(nullptr)},
        {"materials", materials(&list, nullptr, &list)},
        {"stripping", stripping(nullptr)},
        {"vegetation", vegetation(nullptr)},
        {"planing", planing(nullptr)},
        {"set selector", setPrice(nullptr, &item, &good, "EP")},
        {"set item", setPrice(&selector, nullptr, &good, "EP")},
        {"set price", setPrice(&selector, &item, nullptr, "EP")},
        {"set nan", setPrice(&selector, &item, &nan, "EP")},
        {"set infinite", setPrice(&selector, &item, &infinite, "EP")},
        {"set selector out of range", setPrice(&outOfRange, &item, &good, "EP")},
        {"set negative selector", setPrice(&negative, &item, &good, "EP")},
        {"show selector", show(nullptr, &item, "EP")},
        {"show item", show(&selector, nullptr, "EP")},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(c.status, kZodEVIFailed);
    }
    const Case queries[] = {
        {"get selector", getPrice(nullptr, &item, &price, "EP")},
        {"get item", getPrice(&selector, nullptr, &price, "EP")},
        {"get price", getPrice(&selector, &item, nullptr, "EP")},
        {"get out of range", getPrice(&outOfRange, &item, &price, "EP")},
        {"prices selector", getPrices(nullptr, &item, &prices)},
        {"prices map", getPrices(&selector, &item, nullptr)},
        {"prices out of range", getPrices(&outOfRange, &item, &prices)},
    };
    for (const Case& c : queries) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(c.status, kZodEVINotFound);
    }
    // Nothing above touched the price.
    EXPECT_EQ(getPrice(&selector, &item, &price, "EP"), kZodEVIOk);
    EXPECT_EQ(price, 10.0);
}

TEST_F(ModuleApi, UnusualNamesAndValuesAreData)
{
    auto* depth = Function<ZodEVI_UpdateBdrTnePfFn>("ZodEVI_UpdateBdrTnePf");
    auto* getPrice = Function<ZodEVI_GetBdrPriceFn>("ZodEVI_GetBdrPrice");
    const std::string longName(10000, 'x');
    const std::string odd = "PVC %s%n \"200\" \\ 50%";
    EXPECT_EQ(UpdateNetwork(1, "EU %d", {odd, longName}, {2.0, 1.3, 1.3, std::nan("")}), kZodEVIOk);
    const CZodEVIRealArray bounds{3.5, -1.0};
    EXPECT_EQ(depth(&bounds), kZodEVIOk);
    // Only the low 16 bits of the index choose the texts: 65537 is EU, 70000 is no network.
    EXPECT_EQ(UpdateNetwork(70000, "Autre", {"Câble 3x2.5"}), kZodEVIFailed);
    EXPECT_EQ(UpdateNetwork(65537, "Autre", {"Câble 3x2.5"}), kZodEVIOk);
    const std::int32_t selector = kZodEVIPipeLength;
    double price = 1;
    EXPECT_EQ(getPrice(&selector, &odd, &price, "EU %d"), kZodEVIOk);
    EXPECT_EQ(getPrice(&selector, &longName, &price, "EU %d"), kZodEVIOk);
}

TEST_F(ModuleApi, RoadAndEarthworkUpdatesAnswerWhetherTheyChangedSomething)
{
    auto* comb = Function<ZodEVI_UpdateBdrPgnFn>("ZodEVI_UpdateBdrPgn");
    auto* materials = Function<ZodEVI_UpdateBdrMatFn>("ZodEVI_UpdateBdrMat");
    auto* stripping = Function<ZodEVI_UpdateBdrEpDcpFn>("ZodEVI_UpdateBdrEpDcp");
    auto* vegetation = Function<ZodEVI_UpdateBdrEpVegFn>("ZodEVI_UpdateBdrEpVeg");
    auto* planing = Function<ZodEVI_UpdateBdrEpRbtFn>("ZodEVI_UpdateBdrEpRbt");
    auto* depth = Function<ZodEVI_UpdateBdrTnePfFn>("ZodEVI_UpdateBdrTnePf");
    const CZodEVIStringList combs{"PEHD 4x45"}, volumes{"Grave"}, surfaces{"Enrobé"}, lengths{"Bordure T2"};
    const CZodEVIRealArray thicknesses{0.3}, limits{0.05, 0.1};
    ASSERT_EQ(UpdateNetwork(1, "EU 1", {"PVC 200"}), kZodEVIOk);
    const CZodEVIRealArray bounds{1.3, 2.0};
    struct Case {
        const char* name;
        std::function<std::int32_t()> call;
    };
    const Case cases[] = {
        {"comb ducts", [&] { return comb(&combs); }},
        {"materials", [&] { return materials(&volumes, &surfaces, &lengths); }},
        {"stripping", [&] { return stripping(&thicknesses); }},
        {"vegetation", [&] { return vegetation(&thicknesses); }},
        {"planing", [&] { return planing(&limits); }},
        {"depth classes", [&] { return depth(&bounds); }},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(c.call(), kZodEVIOk);
        EXPECT_EQ(c.call(), kZodEVIFailed); // the same again creates nothing
    }
}

TEST_F(ModuleApi, ShowPriceSaysWhenNoArticleCountsTheItem)
{
    auto* show = Function<ZodEVI_ShowBdrPriceFn>("ZodEVI_ShowBdrPrice");
    const std::int32_t selector = kZodEVIFittingCount;
    const std::string item = "Regard inconnu";
    EXPECT_EQ(show(&selector, &item, "EU 1"), kZodEVIFailed);
    EXPECT_NE(session.Output().find("ERREUR : aucun article ne se réfère à l'élément !"), std::string::npos)
        << session.Output();
}

TEST_F(ModuleApi, ServiceAndCommandsGoWithTheModule)
{
    auto* services = static_cast<AcRxDictionary*>(acrxSysRegistry()->at("ServiceDictionary"));
    ASSERT_NE(services, nullptr);
    EXPECT_TRUE(services->has(kZodEVIServiceName));
    velUnloadAllModules();
    EXPECT_FALSE(acrxServiceIsRegistered(kZodEVIServiceName));
    EXPECT_EQ(acrxGetServiceSymbolAddr(kZodEVIServiceName, "ZodEVI_ReadBdr"), nullptr);
}

} // namespace
