// The module's service API as a sibling module uses it: the module loaded into the host,
// each function found by name through the service, with its status codes and what it
// does with bad arguments.
#include "zodevi/api.h"

#include <gtest/gtest.h>

#include <cmath>
#include <fstream>
#include <sstream>
#include <functional>
#include <filesystem>
#include <limits>

#include "../host/file_faults.hpp"
#include "support/session.hpp"
#include "support/temp_dir.hpp"
#include "velhost/profile.h"
#include "velhost/rx.h"

namespace fs = std::filesystem;

namespace {

template <class Fn>
Fn* Function(const char* name)
{
    return reinterpret_cast<Fn*>(acrxGetServiceSymbolAddr(kZodEVIServiceName, name));
}

// The service's functions, looked up by name each time the module is loaded (it may come
// back at another address).
struct Api {
    ZodEVI_GetBdrPriceFn* getPrice = Function<ZodEVI_GetBdrPriceFn>("ZodEVI_GetBdrPrice");
    ZodEVI_SetBdrPriceFn* setPrice = Function<ZodEVI_SetBdrPriceFn>("ZodEVI_SetBdrPrice");
    ZodEVI_GetBdrPriceRsxFn* getPrices = Function<ZodEVI_GetBdrPriceRsxFn>("ZodEVI_GetBdrPriceRsx");
    ZodEVI_ShowBdrPriceFn* show = Function<ZodEVI_ShowBdrPriceFn>("ZodEVI_ShowBdrPrice");
    ZodEVI_WriteBdrFn* write = Function<ZodEVI_WriteBdrFn>("ZodEVI_WriteBdr");
    ZodEVI_ReadBdrFn* read = Function<ZodEVI_ReadBdrFn>("ZodEVI_ReadBdr");
    ZodEVI_UpdateBdrRsxFn* rsx = Function<ZodEVI_UpdateBdrRsxFn>("ZodEVI_UpdateBdrRsx");
    ZodEVI_UpdateBdrTnePfFn* depth = Function<ZodEVI_UpdateBdrTnePfFn>("ZodEVI_UpdateBdrTnePf");
    ZodEVI_UpdateBdrPgnFn* comb = Function<ZodEVI_UpdateBdrPgnFn>("ZodEVI_UpdateBdrPgn");
    ZodEVI_UpdateBdrMatFn* materials = Function<ZodEVI_UpdateBdrMatFn>("ZodEVI_UpdateBdrMat");
    ZodEVI_UpdateBdrEpDcpFn* stripping = Function<ZodEVI_UpdateBdrEpDcpFn>("ZodEVI_UpdateBdrEpDcp");
    ZodEVI_UpdateBdrEpVegFn* vegetation = Function<ZodEVI_UpdateBdrEpVegFn>("ZodEVI_UpdateBdrEpVeg");
    ZodEVI_UpdateBdrEpRbtFn* planing = Function<ZodEVI_UpdateBdrEpRbtFn>("ZodEVI_UpdateBdrEpRbt");
};

class ModuleApi : public ::testing::Test {
protected:
    void SetUp() override
    {
        saved = velHostSettings();
        velHostSettings().modulesDir = VEL_MODULE_DIR;
        velHostSettings().profileDir = dir.File("profil");
        ASSERT_TRUE(acrxLoadModule((fs::path(VEL_MODULE_DIR) / kZodEVIModuleFile).c_str(), false));
        ASSERT_TRUE(acrxServiceIsRegistered(kZodEVIServiceName));
        api = Api{};
        ASSERT_TRUE(api.getPrice && api.setPrice && api.getPrices && api.show && api.write && api.read && api.rsx &&
                    api.depth && api.comb && api.materials && api.stripping && api.vegetation && api.planing);
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
        return api.rsx(&index, &name, &models, &none, &none, &none, &none, &none, &bounds);
    }

    // Loads the module again, so that it reads the schedule file as it is now.
    void Reload()
    {
        velUnloadAllModules();
        ASSERT_TRUE(acrxLoadModule((fs::path(VEL_MODULE_DIR) / kZodEVIModuleFile).c_str(), false));
        api = Api{};
    }
    std::string SchedulePath() const { return dir.File("profil/Donnees/VelaBordereau.xml"); }
    std::string Schedule() const { return dir.Read("profil/Donnees/VelaBordereau.xml"); }
    // Another user's version: the same schedule with one price changed.
    void ChangePriceOnDisk(const std::string& from, const std::string& to)
    {
        std::string text = Schedule();
        const std::size_t at = text.find("unitPrice=\"" + from + "\"");
        ASSERT_NE(at, std::string::npos);
        text.replace(at, from.size() + 12, "unitPrice=\"" + to + "\"");
        dir.Write("profil/Donnees/VelaBordereau.xml", text);
    }

    TempDir dir;
    VelHostSettings saved;
    ScriptedSession session;
    Api api;
};

TEST_F(ModuleApi, PricesThroughUpdateSetWriteAndRead)
{
    const std::int32_t pipeLength = kZodEVIPipeLength;
    const std::string pvc = "PVC 200";
    double price = 99;
    EXPECT_EQ(api.getPrice(&pipeLength, &pvc, &price, "EU 1"), kZodEVINotFound);
    EXPECT_EQ(price, 0.0);

    EXPECT_EQ(UpdateNetwork(1, "EU 1", {"PVC 200"}, {1.3, 2.0}), kZodEVIOk);
    EXPECT_EQ(UpdateNetwork(1, "EU 1", {"PVC 200"}, {1.3, 2.0}), kZodEVIFailed); // nothing new

    const double set = 48.5;
    EXPECT_EQ(api.setPrice(&pipeLength, &pvc, &set, "EU 1"), kZodEVIOk);
    EXPECT_EQ(api.getPrice(&pipeLength, &pvc, &price, "EU 1"), kZodEVIOk);
    EXPECT_EQ(price, 48.5);
    EXPECT_EQ(api.setPrice(&pipeLength, &pvc, &set, "EU 2"), kZodEVIFailed);

    // Per network, for the networks the updates named.
    CZodEVIStringMap prices;
    EXPECT_EQ(api.getPrices(&pipeLength, &pvc, &prices), kZodEVIOk);
    EXPECT_EQ(prices["EU 1"], "48.5");

    EXPECT_EQ(api.write(), kZodEVIOk);
    EXPECT_TRUE(fs::exists(dir.File("profil/Donnees/VelaBordereau.xml")));
    const double other = 1;
    api.setPrice(&pipeLength, &pvc, &other, "EU 1");
    EXPECT_EQ(api.read(), kZodEVIOk);
    EXPECT_EQ(api.getPrice(&pipeLength, &pvc, &price, "EU 1"), kZodEVIOk);
    EXPECT_EQ(price, 48.5);
}

// Without the metre module the schedule can neither be read nor written: both say so, the
// failed read leaves the schedule empty, and the file stays as it was.
TEST_F(ModuleApi, ReadAndWriteWithoutTheMetreModule)
{
    ASSERT_EQ(UpdateNetwork(1, "EU 1", {"PVC 200"}), kZodEVIOk);
    ASSERT_EQ(api.write(), kZodEVIOk);
    const std::string written = Schedule();

    ASSERT_TRUE(acrxUnloadModule("VelMetre15.arx"));
    velHostSettings().modulesDir = dir.File("vide");
    const std::int32_t pipeLength = kZodEVIPipeLength;
    const std::string pvc = "PVC 200";
    double price = 1;
    EXPECT_EQ(api.write(), kZodEVIFailed);
    EXPECT_EQ(api.getPrice(&pipeLength, &pvc, &price, "EU 1"), kZodEVIOk);
    EXPECT_EQ(api.read(), kZodEVIFailed);
    EXPECT_EQ(api.getPrice(&pipeLength, &pvc, &price, "EU 1"), kZodEVINotFound);
    EXPECT_EQ(api.write(), kZodEVIFailed);
    EXPECT_EQ(Schedule(), written);
}

TEST_F(ModuleApi, BadArgumentsAnswerAStatusAndChangeNothing)
{
    ASSERT_EQ(UpdateNetwork(0, "EP", {"Fonte 150"}), kZodEVIOk);
    const std::int32_t selector = kZodEVIPipeLength;
    const std::string item = "Fonte 150";
    const double good = 10;
    ASSERT_EQ(api.setPrice(&selector, &item, &good, "EP"), kZodEVIOk);

    const CZodEVIStringList list;
    const CZodEVIRealArray values;
    const std::string name = "EP";
    const std::int32_t index = 0;
    double price = 5;
    const double nan = std::nan("");
    const double infinite = std::numeric_limits<double>::infinity();
    const std::int32_t outOfRange = 13;
    const std::int32_t negative = -1;
    CZodEVIStringMap prices{{"EP", "10"}};
    struct Case {
        const char* name;
        std::int32_t status;
    };
    const Case cases[] = {
        {"rsx index", api.rsx(nullptr, &name, &list, &list, &list, &list, &list, &list, &values)},
        {"rsx name", api.rsx(&index, nullptr, &list, &list, &list, &list, &list, &list, &values)},
        {"rsx list", api.rsx(&index, &name, &list, &list, &list, nullptr, &list, &list, &values)},
        {"rsx bounds", api.rsx(&index, &name, &list, &list, &list, &list, &list, &list, nullptr)},
        {"depth", api.depth(nullptr)},
        {"comb", api.comb(nullptr)},
        {"materials", api.materials(&list, nullptr, &list)},
        {"stripping", api.stripping(nullptr)},
        {"vegetation", api.vegetation(nullptr)},
        {"planing", api.planing(nullptr)},
        {"set selector", api.setPrice(nullptr, &item, &good, "EP")},
        {"set item", api.setPrice(&selector, nullptr, &good, "EP")},
        {"set price", api.setPrice(&selector, &item, nullptr, "EP")},
        {"set nan", api.setPrice(&selector, &item, &nan, "EP")},
        {"set infinite", api.setPrice(&selector, &item, &infinite, "EP")},
        {"set selector out of range", api.setPrice(&outOfRange, &item, &good, "EP")},
        {"set negative selector", api.setPrice(&negative, &item, &good, "EP")},
        {"show selector", api.show(nullptr, &item, "EP")},
        {"show item", api.show(&selector, nullptr, "EP")},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(c.status, kZodEVIFailed);
    }
    const Case queries[] = {
        {"get selector", api.getPrice(nullptr, &item, &price, "EP")},
        {"get item", api.getPrice(&selector, nullptr, &price, "EP")},
        {"get price", api.getPrice(&selector, &item, nullptr, "EP")},
        {"get out of range", api.getPrice(&outOfRange, &item, &price, "EP")},
        {"prices selector", api.getPrices(nullptr, &item, &prices)},
        {"prices map", api.getPrices(&selector, &item, nullptr)},
        {"prices out of range", api.getPrices(&outOfRange, &item, &prices)},
    };
    for (const Case& c : queries) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(c.status, kZodEVINotFound);
    }
    EXPECT_TRUE(prices.empty()) << "a refused query leaves no stale price behind";
    // Nothing above touched the price.
    EXPECT_EQ(api.getPrice(&selector, &item, &price, "EP"), kZodEVIOk);
    EXPECT_EQ(price, 10.0);
}

TEST_F(ModuleApi, UnusualNamesAndValuesAreData)
{
    const std::string longName(10000, 'x');
    const std::string odd = "PVC %s%n \"200\" \\ 50%";
    EXPECT_EQ(UpdateNetwork(1, "EU %d", {odd, longName}, {2.0, 1.3, 1.3, std::nan("")}), kZodEVIOk);
    const CZodEVIRealArray bounds{3.5, -1.0};
    EXPECT_EQ(api.depth(&bounds), kZodEVIOk);
    // Only the low 16 bits of the index choose the texts: 65537 is EU, 70000 is no network.
    EXPECT_EQ(UpdateNetwork(70000, "Autre", {"Câble 3x2.5"}), kZodEVIFailed);
    EXPECT_EQ(UpdateNetwork(65537, "Autre", {"Câble 3x2.5"}), kZodEVIOk);
    const std::int32_t selector = kZodEVIPipeLength;
    double price = 1;
    EXPECT_EQ(api.getPrice(&selector, &odd, &price, "EU %d"), kZodEVIOk);
    EXPECT_EQ(api.getPrice(&selector, &longName, &price, "EU %d"), kZodEVIOk);
}

TEST_F(ModuleApi, RoadAndEarthworkUpdatesAnswerWhetherTheyChangedSomething)
{
    const CZodEVIStringList combs{"PEHD 4x45"}, volumes{"Grave"}, surfaces{"Enrobé"}, lengths{"Bordure T2"};
    const CZodEVIRealArray thicknesses{0.3}, limits{0.05, 0.1};
    ASSERT_EQ(UpdateNetwork(1, "EU 1", {"PVC 200"}), kZodEVIOk);
    const CZodEVIRealArray bounds{1.3, 2.0};
    struct Case {
        const char* name;
        std::function<std::int32_t()> call;
    };
    const Case cases[] = {
        {"comb ducts", [&] { return api.comb(&combs); }},
        {"materials", [&] { return api.materials(&volumes, &surfaces, &lengths); }},
        {"stripping", [&] { return api.stripping(&thicknesses); }},
        {"vegetation", [&] { return api.vegetation(&thicknesses); }},
        {"planing", [&] { return api.planing(&limits); }},
        {"depth classes", [&] { return api.depth(&bounds); }},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(c.call(), kZodEVIOk);
        EXPECT_EQ(c.call(), kZodEVIFailed); // the same again creates nothing
    }
}

TEST_F(ModuleApi, UnreadableScheduleIsNeverWrittenOver)
{
    ASSERT_EQ(UpdateNetwork(0, "EP", {"PVC 200"}), kZodEVIOk);
    ASSERT_EQ(api.write(), kZodEVIOk);
    const std::string whole = Schedule();
    const std::string cut = whole.substr(0, whole.size() / 2);
    dir.Write("profil/Donnees/VelaBordereau.xml", cut);
    Reload();
    session.ClearOutput();

    // Updates still run in memory; nothing reaches the file, each time with the reason.
    EXPECT_EQ(UpdateNetwork(0, "EP", {"Fonte 150"}), kZodEVIOk);
    const std::int32_t selector = kZodEVIPipeLength;
    const std::string item = "Fonte 150";
    for (int attempt = 0; attempt < 2; ++attempt) {
        EXPECT_EQ(api.write(), kZodEVIFailed);
        EXPECT_EQ(api.show(&selector, &item, "EP"), kZodEVIFailed);
    }
    EXPECT_EQ(Schedule(), cut);
    EXPECT_FALSE(fs::exists(SchedulePath() + ".bak"));
    const std::string refusal = "ERREUR : le bordereau « " + SchedulePath() +
                                " » n'a pas pu être lu (contenu refusé par le module de métré : fichier tronqué, "
                                "mal formé ou champ inconnu) ; il n'est ni ouvert ni enregistré";
    EXPECT_NE(session.Output().find(refusal), std::string::npos) << session.Output();

    // Repaired, it is read again at the next write, which makes the update on it.
    dir.Write("profil/Donnees/VelaBordereau.xml", whole);
    EXPECT_EQ(api.write(), kZodEVIOk) << session.Output();
    const std::string now = Schedule();
    EXPECT_NE(now.find("PVC 200"), std::string::npos);
    EXPECT_NE(now.find("Fonte 150"), std::string::npos);
}

TEST_F(ModuleApi, ScheduleChangedByAnotherUserIsNotOverwrittenSilently)
{
    const std::int32_t selector = kZodEVIPipeLength;
    const std::string pvc = "PVC 200", cast = "Fonte 150";
    struct Case {
        const char* name;
        const char* answers; // null: a script
        std::int32_t status;
        bool theirsKept;
    } cases[] = {
        {"script", nullptr, kZodEVIFailed, true},
        {"read again and make the change on it", "Oui\n", kZodEVIOk, true},
        {"replace it", "Non\n", kZodEVIOk, false},
        {"cancelled", "", kZodEVIFailed, true},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        fs::remove(SchedulePath());
        ASSERT_EQ(api.read(), kZodEVIFailed) << "no file yet";
        ASSERT_EQ(UpdateNetwork(0, "EP", {"PVC 200", "Fonte 150"}), kZodEVIOk);
        ASSERT_EQ(api.write(), kZodEVIOk);
        ChangePriceOnDisk("0", "77"); // the first price of the file: another user's work
        const std::string theirs = Schedule();
        const double mine = 31.5;
        ASSERT_EQ(api.setPrice(&selector, &pvc, &mine, "EP"), kZodEVIOk);
        session.ClearOutput();
        std::int32_t status = 0;
        std::string shown;
        if (c.answers == nullptr) {
            status = api.write();
            shown = session.Output();
        } else {
            TerminalAnswers user(c.answers);
            status = api.write();
            shown = user.output.str();
        }
        EXPECT_EQ(status, c.status) << shown;
        EXPECT_NE(shown.find("« " + SchedulePath() + " » a été modifié par un autre utilisateur ou programme"),
                  std::string::npos)
            << shown;
        if (c.status != kZodEVIOk) {
            EXPECT_EQ(Schedule(), theirs);
            continue;
        }
        ASSERT_EQ(api.read(), kZodEVIOk);
        double price = 0;
        EXPECT_EQ(api.getPrice(&selector, &pvc, &price, "EP"), kZodEVIOk);
        EXPECT_EQ(price, 31.5);
        EXPECT_EQ(Schedule().find("unitPrice=\"77\"") != std::string::npos, c.theirsKept);
        EXPECT_EQ(api.getPrice(&selector, &cast, &price, "EP"), kZodEVIOk);
    }
}

TEST_F(ModuleApi, ScheduleWriteThatFailsAnywhereLeavesThePreviousFile)
{
    ASSERT_EQ(UpdateNetwork(0, "EP", {"PVC 200"}), kZodEVIOk);
    ASSERT_EQ(api.write(), kZodEVIOk);
    ASSERT_EQ(api.write(), kZodEVIOk);
    const std::string previous = Schedule(), backup = dir.Read("profil/Donnees/VelaBordereau.xml.bak");
    const std::int32_t selector = kZodEVIPipeLength;
    const std::string pvc = "PVC 200";
    const double price = 12.25;
    std::int32_t status = 0;
    const int calls = ForEveryFailingCall(
        [&] {
            dir.Write("profil/Donnees/VelaBordereau.xml", previous);
            dir.Write("profil/Donnees/VelaBordereau.xml.bak", backup);
            ASSERT_EQ(api.read(), kZodEVIOk);
            ASSERT_EQ(api.setPrice(&selector, &pvc, &price, "EP"), kZodEVIOk);
            session.ClearOutput();
        },
        [&] { status = api.write(); },
        [&](const FaultRun& run) {
            SCOPED_TRACE(run.failed + " n° " + std::to_string(run.calls));
            if (run.committed) {
                EXPECT_EQ(status, kZodEVIOk);
                EXPECT_NE(Schedule().find("unitPrice=\"12.25\""), std::string::npos);
                return;
            }
            EXPECT_EQ(status, kZodEVIFailed);
            EXPECT_EQ(Schedule(), previous);
            const std::string b = dir.Read("profil/Donnees/VelaBordereau.xml.bak");
            EXPECT_EQ(b, backup);
            EXPECT_NE(session.Output().find("Fichier « " + SchedulePath() + " » non enregistré : " +
                                            velFileErrorReason(FileFaults::ErrorOf(run.failed))),
                      std::string::npos)
                << session.Output();
            EXPECT_NE(session.Output().find("Le fichier précédent est conservé tel quel"), std::string::npos);
        });
    EXPECT_GT(calls, 10);
    std::size_t entries = 0;
    for ([[maybe_unused]] const auto& entry : fs::directory_iterator(dir.File("profil/Donnees")))
        ++entries;
    EXPECT_EQ(entries, 3u) << "the schedule, its backup and its lock";
}

TEST_F(ModuleApi, ShowPriceAnswersOkWhenTheEditorClosesNormally)
{
    ASSERT_EQ(UpdateNetwork(0, "EP", {"PVC 200"}), kZodEVIOk);
    ASSERT_EQ(api.write(), kZodEVIOk);
    const std::int32_t selector = kZodEVIPipeLength;
    const std::string pvc = "PVC 200";
    struct Case {
        const char* name;
        const char* script;
        std::int32_t status;
    } cases[] = {
        {"only looked", "fin\n", kZodEVIOk},
        {"cancelled", "annuler\n", kZodEVIFailed},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        session.input.clear();
        session.input.str(c.script);
        EXPECT_EQ(api.show(&selector, &pvc, "EP"), c.status) << session.Output();
    }
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
