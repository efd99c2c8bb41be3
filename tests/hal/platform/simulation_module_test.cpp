#include "hal/platform/simulation_module.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <string>

#include "hal/platform/last_error.h"
#include "support/debugger_output.h"
#include "support/scoped_variable.h"
#include "support/simulation_world.h"
#include "support/temporary_folder.h"

namespace ZV {
namespace {

using Test::DebuggerOutput;
using Test::ScopedVariable;
using Test::SimulationWorld;
using Test::TemporaryFolder;

constexpr char Variable[] = "ZENTARA_SIMULATION";

class SimulationModule : public testing::Test {
  protected:
    ~SimulationModule() override { EndSimulation(); }

    const KernelDriver* Select() { return SelectSimulation(&isSelected); }

    static int CountInterfaces(const KernelDriver& driver) {
        void* list = nullptr;
        if (driver.openList(&list) != PlatformErrorNone) return -1;
        std::uint32_t count = 0;
        while (driver.selectInterface(list, count) == PlatformErrorNone) ++count;
        driver.closeList(list);
        return static_cast<int>(count);
    }

    ScopedVariable variable{Variable, nullptr};
    bool isSelected = true;
};

TEST_F(SimulationModule, IsNotSelectedWhileItsVariableIsUnset) {
    EXPECT_EQ(Select(), nullptr);
    EXPECT_FALSE(isSelected);
}

TEST_F(SimulationModule, IsNotSelectedWhileItsVariableIsEmpty) {
    variable.Set("");

    EXPECT_EQ(Select(), nullptr);
    EXPECT_FALSE(isSelected);
}

TEST_F(SimulationModule, BeginsTheBusThatItsVariableNames) {
    isSelected = false;
    variable.Set("mono");

    const KernelDriver* driver = Select();

    ASSERT_NE(driver, nullptr);
    EXPECT_TRUE(isSelected);
    EXPECT_EQ(CountInterfaces(*driver), 1);
}

TEST_F(SimulationModule, ReadsItsVariableAnewAtEachSelection) {
    variable.Set("mono");
    ASSERT_NE(Select(), nullptr);
    variable.Set("empty");

    const KernelDriver* driver = Select();
    ASSERT_NE(driver, nullptr);
    EXPECT_EQ(CountInterfaces(*driver), 0);
    variable.Set(nullptr);

    EXPECT_EQ(Select(), nullptr);
    EXPECT_FALSE(isSelected);
}

TEST_F(SimulationModule, GoesOnWithTheSameBusForTheSameValue) {
    const SimulationWorld world("mono");
    ASSERT_NE(Select(), nullptr);
    ZentaraSimulation_PokeRegister(0, 0xD0000000, 0x12345678);
    const std::uint32_t poked = world.Peek(0xD0000000);

    ASSERT_NE(Select(), nullptr);

    EXPECT_EQ(world.Peek(0xD0000000), poked);
}

TEST_F(SimulationModule, HasNoDevicesForARefusedScenarioAndSaysWhyOnTheDebuggerOutput) {
    const TemporaryFolder folder;
    DebuggerOutput output;
    variable.Set(folder.WriteFile("bad.json", R"({"unknownKey": 1})").c_str());

    const KernelDriver* driver = Select();

    ASSERT_NE(driver, nullptr);
    EXPECT_TRUE(isSelected);
    EXPECT_EQ(CountInterfaces(*driver), 0);
    void* handle = nullptr;
    EXPECT_EQ(driver->open("any", &handle), PlatformErrorFileNotFound);
    const std::string message = output.Take();
    EXPECT_NE(message.find("unknownKey"), std::string::npos) << message;
    EXPECT_EQ(message.back(), '\n');
}

TEST_F(SimulationModule, TellsTheLastSelectionWhateverItsVariableSaysNow) {
    variable.Set("mono");
    const KernelDriver* selected = Select();
    variable.Set(nullptr);
    isSelected = false;

    EXPECT_EQ(GetSelectedSimulation(&isSelected), selected);
    EXPECT_TRUE(isSelected);
}

TEST_F(SimulationModule, EndsItsBusAndIsNoLongerSelected) {
    variable.Set("mono");
    const KernelDriver* driver = Select();
    ASSERT_NE(driver, nullptr);

    EndSimulation();

    EXPECT_EQ(GetSelectedSimulation(&isSelected), nullptr);
    EXPECT_FALSE(isSelected);
    ZentaraSimulationState state{};
    EXPECT_EQ(ZentaraSimulation_GetState(0, &state), 1u);
    EndSimulation();
}

}  // namespace
}  // namespace ZV
