// The network sizing module loaded into a host: its service and commands come and go with
// it, and its two exported functions answer through the service as the metre module calls them.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "network_fixture.hpp"
#include "velhost/commands.h"
#include "velhost/documents.h"
#include "velhost/rx.h"
#include "velsiblings/network_services.h"

namespace {

constexpr const char* kModule = VEL_MODULE_DIR "/VelReseDimVRD15.arx";

class NetworkModule : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_TRUE(acrxLoadModule(kModule, false)); }
    void TearDown() override
    {
        acDocManager->closeAll();
        velUnloadAllModules();
    }
    template <class Fn>
    Fn* Symbol(const char* name)
    {
        return reinterpret_cast<Fn*>(acrxGetServiceSymbolAddr(kVelNetworkServicesName, name));
    }
};

} // namespace

TEST_F(NetworkModule, RegistersServiceAndCommandsUntilUnloaded)
{
    ASSERT_TRUE(acrxServiceIsRegistered(kVelNetworkServicesName));
    const AcEdCommand* command = acedRegCmds()->lookupCmd("VelaRsxMajBordereau");
    ASSERT_NE(command, nullptr);
    EXPECT_EQ(command->localName, "RsxMajBordereau");
    EXPECT_NE(acedRegCmds()->lookupCmd("RsxMetres"), nullptr);
    EXPECT_TRUE(acrxUnloadModule(kModule));
    EXPECT_FALSE(acrxServiceIsRegistered(kVelNetworkServicesName));
    EXPECT_EQ(acedRegCmds()->lookupCmd("RsxMajBordereau"), nullptr);
    EXPECT_EQ(acedRegCmds()->lookupCmd("RsxMetres"), nullptr);
}

TEST_F(NetworkModule, ExportedFunctionsWorkOnTheCurrentDrawing)
{
    auto* write = Symbol<Rsx_WriteXDataMetresFn>("Rsx_WriteXDataMetres");
    auto* projects = Symbol<Rsx_GetRsxFromTypeFn>("Rsx_GetRsxFromType");
    ASSERT_NE(write, nullptr);
    ASSERT_NE(projects, nullptr);
    std::string network = "EU";
    std::vector<std::string> names;
    EXPECT_EQ(write(), 1); // no drawing open
    EXPECT_EQ(projects(&network, &names), 1);

    const network_test::XData x{.network = "EU", .index = 1, .project = "EU Centre"};
    auto database = network_test::DrawingWith(network_test::Line("A01", 0, 0, 0, 10, 0, 0, x.Text()));
    ASSERT_TRUE(database);
    AcDbDatabase* drawing = database.get();
    acDocManager->createDocument(std::move(database), "");
    EXPECT_EQ(projects(&network, &names), 0);
    EXPECT_EQ(names, (std::vector<std::string>{"EU Centre"}));
    EXPECT_EQ(write(), 0);
    EXPECT_TRUE(drawing->isRegApp("DAZUVUVUD"));
    EXPECT_TRUE(drawing->isModified());
}
