// Tests of the network sizing stand-in's commands: the schedule update against an
// in-process stand-in of the metre module's service (arguments checked), its failures
// with their messages, and the records command.
#include "network_commands.hpp"

#include <gtest/gtest.h>

#include "support/session.hpp"

#include <sstream>

#include "network_fixture.hpp"
#include "network_records.hpp"
#include "velhost/commands.h"
#include "velhost/documents.h"
#include "velhost/rx.h"
#include "velhost/ui.h"
#include "zodevi/api.h"

using namespace network;
using namespace network_test;

namespace {

// What the stand-in of ZodEVI_UpdateBdrRsx received in one call.
struct UpdateCall {
    int index = -1;
    std::string name;
    std::vector<CZodEVIStringList> lists;
    std::vector<double> bounds;
};

std::vector<UpdateCall> g_calls;
std::int32_t g_updateAnswer = kZodEVIOk;
std::int32_t g_writeAnswer = kZodEVIOk;
int g_writes = 0;

std::int32_t FakeUpdate(const std::int32_t* index, const std::string* name, const CZodEVIStringList* models,
                        const CZodEVIStringList* pipeSupplies, const CZodEVIStringList* fittings,
                        const CZodEVIStringList* fittingSupplies, const CZodEVIStringList* ducts,
                        const CZodEVIStringList* materials, const CZodEVIRealArray* bounds)
{
    UpdateCall call;
    call.index = *index;
    call.name = *name;
    call.lists = {*models, *pipeSupplies, *fittings, *fittingSupplies, *ducts, *materials};
    call.bounds.assign(bounds->begin(), bounds->end());
    g_calls.push_back(std::move(call));
    return g_updateAnswer;
}

std::int32_t FakeWrite()
{
    ++g_writes;
    return g_writeAnswer;
}

class CFakeZodEVISrv : public AcRxService {};

std::string Tagged(const char* network, int index, const char* kind, const char* model, std::vector<double> depths)
{
    return XData{.network = network, .index = index, .kind = kind, .model = model, .depths = std::move(depths)}.Text();
}

class NetworkCommands : public ::testing::Test {
protected:
    void SetUp() override { Reset(); }
    void TearDown() override { Clean(); }
    void Reset()
    {
        g_calls.clear();
        g_updateAnswer = kZodEVIOk;
        g_writeAnswer = kZodEVIOk;
        g_writes = 0;
        output.str("");
    }
    // No service and no drawing left behind.
    void Clean()
    {
        velUnregisterService(kZodEVIServiceName, &service);
        acDocManager->closeAll();
    }
    void OfferService(bool withWrite = true)
    {
        VelSymbolTable symbols{{"ZodEVI_UpdateBdrRsx", reinterpret_cast<void*>(&FakeUpdate)}};
        if (withWrite)
            symbols.emplace("ZodEVI_WriteBdr", reinterpret_cast<void*>(&FakeWrite));
        velRegisterInProcessService(kZodEVIServiceName, &service, std::move(symbols));
    }
    void Open(const std::string& entities)
    {
        auto database = DrawingWith(entities);
        ASSERT_TRUE(database);
        acDocManager->createDocument(std::move(database), "");
    }
    bool Printed(const std::string& text) const { return output.str().find(text) != std::string::npos; }

    CFakeZodEVISrv service;
    ScriptedSession session{"", "reseaux.scr"};
    std::ostringstream& output = session.output;
};

const std::string kTwoNetworks = Line("A01", 0, 0, 0, 40, 0, 0, Tagged("EP", 0, "TUY", "PVC 315", {1.3, 1.6})) +
                                 Line("A02", 0, 0, 0, 40, 0, 0, Tagged("EP", 0, "TUY", "Béton 400", {1.6})) +
                                 Point("A03", 0, 0, Tagged("EP", 0, "SBL", "Regard 1000", {1.3})) +
                                 Line("A04", 0, 0, 0, 40, 0, 0, Tagged("EU", 1, "TUY", "PVC 200", {})) +
                                 Line("A05", 0, 0, 0, 40, 0, 0, Tagged("EU", 1, "FRX", "TPC 90", {})) +
                                 Point("A06", 0, 0, Tagged("EU", 1, "SBL_FRNT", "Tampon D400", {})) +
                                 Line("A07", 0, 0, 0, 40, 0, 0, Tagged("EU", 1, "TUY_FRNT", "Grillage", {}));

} // namespace

TEST_F(NetworkCommands, UpdateHandsEachNetworkToTheSchedule)
{
    Open(kTwoNetworks);
    OfferService();
    g_updateAnswer = kZodEVIFailed; // "nothing changed" is no failure of the command
    EXPECT_TRUE(UpdateSchedule()) << output.str();
    ASSERT_EQ(g_calls.size(), 2u);
    EXPECT_EQ(g_calls[0].index, 0);
    EXPECT_EQ(g_calls[0].name, "EP");
    EXPECT_EQ(g_calls[0].lists,
              (std::vector<CZodEVIStringList>{{"PVC 315", "Béton 400"}, {}, {"Regard 1000"}, {}, {}, {}}));
    EXPECT_EQ(g_calls[0].bounds, kDepthBounds);
    EXPECT_EQ(g_calls[1].index, 1);
    EXPECT_EQ(g_calls[1].name, "EU");
    EXPECT_EQ(g_calls[1].lists,
              (std::vector<CZodEVIStringList>{{"PVC 200"}, {"Grillage"}, {}, {"Tampon D400"}, {"TPC 90"}, {}}));
    EXPECT_TRUE(g_calls[1].bounds.empty()); // no depth drawn: no depth classes
    EXPECT_EQ(g_writes, 1);
    EXPECT_TRUE(Printed("Réseau EP (indice 0) : 2 modèle(s) de canalisation, 1 de regard : bordereau déjà à jour."));
    EXPECT_TRUE(Printed("Réseau EU (indice 1) : 1 modèle(s) de canalisation, 0 de regard : bordereau déjà à jour."));
    EXPECT_TRUE(Printed("Bordereau des prix enregistré."));
}

TEST_F(NetworkCommands, UpdateReportsEveryFailure)
{
    struct Case {
        const char* name;
        bool document;
        std::string entities;
        int service; // 0 none, 1 without ZodEVI_WriteBdr, 2 complete
        std::int32_t updateAnswer;
        std::int32_t writeAnswer;
        bool result;
        std::size_t calls;
        std::string message;
    };
    const Case cases[] = {
        {"no drawing", false, "", 2, 0, 0, false, 0, "Aucun dessin ouvert : ouvrez le dessin des réseaux d'abord."},
        {"no network", true, "", 2, 0, 0, false, 0,
         "Aucun réseau dans le dessin (données VELANTO_RSX) : bordereau inchangé."},
        {"no metre module", true, kTwoNetworks, 0, 0, 0, false, 0,
         "Module de métré VelVuzazORE15.arx introuvable ou incomplet (fonction ZodEVI_UpdateBdrRsx absente) : "
         "bordereau non mis à jour."},
        {"no write function", true, kTwoNetworks, 1, 0, 0, false, 0,
         "Module de métré VelVuzazORE15.arx introuvable ou incomplet (fonction ZodEVI_WriteBdr absente) : "
         "bordereau non mis à jour."},
        {"update refused", true, kTwoNetworks, 2, 7, 0, true, 2,
         "Réseau EP (indice 0) : 2 modèle(s) de canalisation, 1 de regard : mise à jour refusée (code 7)."},
        {"write refused", true, kTwoNetworks, 2, 0, 2, false, 2, "Le bordereau n'a pas pu être enregistré (code 2)."},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        Reset();
        if (c.document)
            Open(c.entities);
        if (c.service > 0)
            OfferService(c.service == 2);
        g_updateAnswer = c.updateAnswer;
        g_writeAnswer = c.writeAnswer;
        EXPECT_EQ(UpdateSchedule(), c.result);
        EXPECT_EQ(g_calls.size(), c.calls);
        EXPECT_TRUE(Printed(c.message)) << output.str();
        Clean();
    }
}

TEST_F(NetworkCommands, CommandsAreRegisteredUnderBothNames)
{
    ASSERT_TRUE(AddCommands());
    EXPECT_FALSE(AddCommands()); // a second registration is refused, the first one stays
    const AcEdCommand* update = acedRegCmds()->lookupCmd("RsxMajBordereau");
    ASSERT_NE(update, nullptr);
    EXPECT_EQ(update->globalName, kUpdateGlobalName);
    EXPECT_EQ(update->groupName, kCommandGroup);
    ASSERT_NE(acedRegCmds()->lookupCmd("_VelaRsxMetres"), nullptr);
    // The records command says what it wrote and what it left out.
    Open(kTwoNetworks + Point("A08", 0, 0, Tagged("EU", 42, "SBL", "Regard", {})));
    std::string error;
    EXPECT_EQ(velRunCommand("RsxMetres", error), VelCommandResult::kDone) << error;
    EXPECT_TRUE(Printed("Attention : Entité A08 (POINT) : données VELANTO_RSX incomplètes (indice du réseau, entier de "
                        "0 à 12 attendu) ; ignorée."))
        << output.str();
    EXPECT_TRUE(Printed("Réseau EP, projet « EP » : 80.00 m de canalisations, 1 regard(s) ou accessoire(s), "
                        "9 quantité(s) enregistrée(s)."));
    EXPECT_TRUE(Printed("Réseau EU, projet « EU » : 40.00 m de canalisations, 0 regard(s) ou accessoire(s), "));
    RemoveCommands();
    EXPECT_EQ(acedRegCmds()->lookupCmd("RsxMajBordereau"), nullptr);
}
