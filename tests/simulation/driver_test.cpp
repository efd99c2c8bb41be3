#include <gtest/gtest.h>

#include <cstring>
#include <fstream>

#include "hal/platform/last_error.h"
#include "simulation/driver_client.h"
#include "simulation/register_file.h"
#include "support/simulation_world.h"

namespace ZV::Test {
namespace {

using namespace Simulation;

class Driver : public ::testing::Test {
  protected:
    void TearDown() override { GetDriver().end(); }

    std::uint32_t Begin(const char* scenario) {
        return GetDriver().begin(scenario, message, sizeof message);
    }

    char message[256] = "";
};

TEST_F(Driver, IsThereForItsVersionAlone) {
    EXPECT_NE(nullptr, ZentaraSimulation_GetKernelDriver(KernelDriverVersion));
    EXPECT_EQ(nullptr, ZentaraSimulation_GetKernelDriver(KernelDriverVersion + 1));
}

TEST_F(Driver, ListsNoDeviceBeforeItBegins) {
    EXPECT_TRUE(ListDevices().empty());
}

TEST_F(Driver, GoesOnWithTheSameBusForTheSameText) {
    ASSERT_EQ(0u, Begin("mono"));
    DriverClient client;
    ASSERT_EQ(0u, client.Write(ControlAddress + 20, 5));

    ASSERT_EQ(0u, Begin("mono"));

    std::uint32_t value = 0;
    EXPECT_EQ(0u, client.Read(ControlAddress + 20, &value));
    EXPECT_EQ(5u, value);
}

TEST_F(Driver, StartsAnewForAnotherText) {
    ASSERT_EQ(0u, Begin("mono"));
    DriverClient client;

    ASSERT_EQ(0u, Begin("ten"));

    std::uint32_t value = 0;
    EXPECT_EQ(10u, ListDevices().size());
    EXPECT_EQ(PlatformErrorDeviceNotConnected, client.Read(ControlAddress, &value));
}

TEST_F(Driver, ARefusedScenarioLeavesNoDevice) {
    ASSERT_EQ(0u, Begin("mono"));

    EXPECT_EQ(PlatformErrorInvalidParameter, Begin("no such scenario"));

    EXPECT_NE(nullptr, std::strstr(message, "no such scenario"));
    EXPECT_TRUE(ListDevices().empty());
}

TEST_F(Driver, ATraceThatCannotBeWrittenIsRefused) {
    SimulationWorld world(R"({"base": "mono", "trace": "no/such/folder/trace.jsonl"})");

    EXPECT_NE(0u, Begin(world.GetScenarioPath().c_str()));

    EXPECT_NE(nullptr, std::strstr(message, "no/such/folder"));
}

TEST_F(Driver, ASceneThatCannotBeReadIsRefusedWithItsPlace) {
    SimulationWorld world(
        R"({"base": "mono", "cameras": [{"scene": {"kind": "image", "path": "none.png"}}]})");

    EXPECT_NE(0u, Begin(world.GetScenarioPath().c_str()));

    EXPECT_NE(nullptr, std::strstr(message, "/cameras/0/scene"));
}

TEST_F(Driver, MayEndTwiceAndBeginAgain) {
    ASSERT_EQ(0u, Begin("mono"));
    GetDriver().end();
    GetDriver().end();

    EXPECT_EQ(0u, Begin("mono"));
    EXPECT_EQ(1u, ListDevices().size());
}

TEST_F(Driver, TheDetailRecordIsFourBytesThePathAndItsTerminator) {
    SimulationWorld world(R"({"base": "mono", "cameras": [{"path": "device"}]})");
    ASSERT_TRUE(world.Start());
    void* list = nullptr;
    ASSERT_EQ(0u, GetDriver().openList(&list));
    std::uint32_t required = 0;
    char path[7];

    EXPECT_EQ(PlatformErrorInsufficientBuffer, GetDriver().getDetail(list, 0, path, 10, &required));
    EXPECT_EQ(11u, required);
    EXPECT_EQ(0u, GetDriver().getDetail(list, 0, path, 11, &required));
    EXPECT_STREQ("device", path);
    EXPECT_EQ(PlatformErrorNoMoreItems, GetDriver().getDetail(list, 1, path, 11, &required));
    EXPECT_EQ(PlatformErrorNoMoreItems, GetDriver().selectInterface(list, 1));
    GetDriver().closeList(list);
}

TEST_F(Driver, AnUnknownPathCannotBeOpened) {
    ASSERT_EQ(0u, Begin("mono"));
    void* handle = nullptr;

    EXPECT_EQ(PlatformErrorFileNotFound, GetDriver().open("nothing", &handle));
    EXPECT_EQ(PlatformErrorFileNotFound, GetDriver().open(nullptr, &handle));
    EXPECT_EQ(nullptr, handle);
}

TEST_F(Driver, StateOfACameraThatIsNotThereIsRefused) {
    ZentaraSimulationState state{};
    EXPECT_EQ(1u, ZentaraSimulation_GetState(0, &state));
    ASSERT_EQ(0u, Begin("ten"));
    DriverClient first(0), second(9);

    EXPECT_EQ(1u, ZentaraSimulation_GetState(10, &state));
    EXPECT_EQ(1u, ZentaraSimulation_GetState(0, nullptr));
    EXPECT_EQ(0u, ZentaraSimulation_GetState(0xFFFFFFFF, &state));
    EXPECT_EQ(2u, state.openHandles);
    std::uint32_t value = 0;
    EXPECT_EQ(1u, ZentaraSimulation_PeekRegister(0, 0xFA000000, &value));
    EXPECT_EQ(1u, ZentaraSimulation_PeekRegister(0, ControlAddress, nullptr));
    EXPECT_EQ(1u, ZentaraSimulation_PokeRegister(10, ControlAddress, 0));
    EXPECT_EQ(1u, ZentaraSimulation_Plug(10));
}

// The lines of a trace, byte for byte, so that readers in other languages may rely on them.
TEST_F(Driver, ATraceLineIsOneJsonObject) {
    SimulationWorld world("mono");
    ASSERT_TRUE(world.Start());
    {
        DriverClient client;
        std::uint32_t busy = 7;
        ASSERT_EQ(0u, client.Call(FW_IOCTL_QUERY_BUSY, &busy));
    }

    std::ifstream file(world.GetFolder() / "trace.jsonl");
    std::string line;
    std::getline(file, line);
    std::getline(file, line);
    EXPECT_EQ(R"("type":"request","camera":0,"code":2236566,"name":"FW_IOCTL_QUERY_BUSY",)"
              R"("inputBytes":4,"input":"07000000","outputBytes":4,"output":"00000000",)"
              R"("pended":false,"error":0})",
              line.substr(line.find(',') + 1));
}

TEST_F(Driver, TheProcessMayEndWhileACameraStreams) {
    EXPECT_EXIT(
        {
            (void)Begin("mono");
            DriverClient client;
            (void)client.Write(StreamAddress + 4, 1);
            std::exit(0);
        },
        ::testing::ExitedWithCode(0), "");
}

}  // namespace
}  // namespace ZV::Test
