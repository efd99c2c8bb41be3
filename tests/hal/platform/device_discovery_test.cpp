#include "hal/platform/device_discovery.h"

#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "hal/platform/last_error.h"
#include "hal/platform/simulation_module.h"
#include "support/scoped_variable.h"
#include "support/simulation_world.h"

namespace ZV {
namespace {

using Test::ScopedVariable;
using Test::SimulationWorld;

constexpr char Variable[] = "ZENTARA_SIMULATION";

struct CloseList {
    void operator()(DeviceInterfaceList* list) const { CloseDeviceInterfaceList(list); }
};
using OwnedList = std::unique_ptr<DeviceInterfaceList, CloseList>;

std::uint32_t CountInterfaces(DeviceInterfaceList* list) {
    std::uint32_t count = 0;
    while (SelectDeviceInterface(list, count)) ++count;
    return count;
}

std::string ReadPath(DeviceInterfaceList* list) {
    constexpr std::uint32_t SizeField = 8;
    std::uint32_t bytes = 0;
    EXPECT_FALSE(GetDeviceInterfaceDetail(list, nullptr, 0, &bytes));
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorInsufficientBuffer);
    std::vector<char> detail(bytes);
    std::memcpy(detail.data(), &SizeField, sizeof SizeField);
    EXPECT_TRUE(GetDeviceInterfaceDetail(list, detail.data(), bytes, &bytes));
    return detail.data() + DeviceDetailPathOffset;
}

class Discovery : public testing::Test {
  protected:
    ~Discovery() override { EndSimulation(); }

    ScopedVariable variable{Variable, nullptr};
};

TEST_F(Discovery, FindsNothingWithoutASimulationWhereThereIsNoDriver) {
    const OwnedList list(OpenDeviceInterfaceList());
    ASSERT_NE(list, nullptr);

    EXPECT_FALSE(SelectDeviceInterface(list.get(), 0));

    EXPECT_EQ(GetLastPlatformError(), PlatformErrorNoMoreItems);
}

TEST_F(Discovery, FindsEachSimulatedDeviceAtAPathOfItsOwn) {
    variable.Set("ten");
    const OwnedList list(OpenDeviceInterfaceList());
    ASSERT_NE(list, nullptr);

    EXPECT_EQ(CountInterfaces(list.get()), 10u);

    ASSERT_TRUE(SelectDeviceInterface(list.get(), 0));
    const std::string first = ReadPath(list.get());
    ASSERT_TRUE(SelectDeviceInterface(list.get(), 9));
    EXPECT_NE(ReadPath(list.get()), first);
    EXPECT_FALSE(first.empty());
}

TEST_F(Discovery, FindsNoDeviceOnAnEmptyBus) {
    variable.Set("empty");
    const OwnedList list(OpenDeviceInterfaceList());
    ASSERT_NE(list, nullptr);

    EXPECT_EQ(CountInterfaces(list.get()), 0u);
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorNoMoreItems);
}

TEST(NullList, IsIgnored) {
    CloseDeviceInterfaceList(nullptr);
}

}  // namespace
}  // namespace ZV
