#include "hal/platform/device.h"

#include <gtest/gtest.h>

#include <array>
#include <cstring>
#include <string>
#include <vector>

#include "hal/control_records.h"
#include "hal/platform/device_discovery.h"
#include "hal/platform/last_error.h"
#include "hal/platform/simulation_module.h"
#include "support/scoped_variable.h"
#include "support/simulation_world.h"

namespace ZV {
namespace {

using Test::ScopedVariable;
using Test::SimulationWorld;

constexpr std::uint32_t IdentityAddress = 0xE0010038;

/// Path of the first device as it is listed now; empty when there is none.
std::string ListFirstPath() {
    DeviceInterfaceList* list = OpenDeviceInterfaceList();
    std::vector<char> detail(1024);
    const std::uint32_t sizeField = 8;
    std::memcpy(detail.data(), &sizeField, sizeof sizeField);
    const bool isThere = SelectDeviceInterface(list, 0) &&
                         GetDeviceInterfaceDetail(list, detail.data(), 1024, nullptr);
    CloseDeviceInterfaceList(list);
    return isThere ? detail.data() + DeviceDetailPathOffset : "";
}

class SimulatedDevice : public testing::Test {
  protected:
    SimulatedDevice() {
        path = ListFirstPath();
        device = OpenDevice(path.c_str());
        EXPECT_NE(device, nullptr);
        record.getGeneration = 1;
        record.destinationNode = AsyncDestinationNode;
        record.offsetHigh = AsyncOffsetHigh;
        record.offsetLow = IdentityAddress;
        record.bytes = sizeof quadlet;
    }
    ~SimulatedDevice() override {
        CloseDevice(device);
        DestroyOverlapped(overlapped);
        EndSimulation();
    }

    ControlRequest MakeRead() {
        return {FW_IOCTL_ASYNC_READ, &record, sizeof record, &quadlet, sizeof quadlet};
    }

    SimulationWorld world{"mono"};
    std::string path;
    PlatformDevice* device = nullptr;
    PlatformOverlapped* overlapped = MakeOverlapped();
    AsyncReadRecord record{};
    std::uint32_t quadlet = 0;
};

TEST_F(SimulatedDevice, IsNoRealDevice) {
    EXPECT_FALSE(IsRealDevice(device));
}

TEST_F(SimulatedDevice, EndsAPendedReadWithItsAnswer) {
    EXPECT_EQ(ControlDeviceOverlapped(device, MakeRead(), overlapped), ControlOutcome::Pending);

    EXPECT_EQ(WaitForCompletion(device, overlapped, WaitForEver), CompletionOutcome::Completed);

    EXPECT_FALSE(IsOverlappedPending(overlapped));
    EXPECT_EQ(__builtin_bswap32(quadlet), world.Peek(IdentityAddress));
}

TEST_F(SimulatedDevice, EndsAWaitWithoutARequestAtOnceAlsoAfterTheRecordWasCleared) {
    (void)ControlDeviceOverlapped(device, MakeRead(), overlapped);
    (void)WaitForCompletion(device, overlapped, WaitForEver);

    ClearOverlapped(overlapped);

    EXPECT_EQ(WaitForCompletion(device, overlapped, WaitForEver), CompletionOutcome::Completed);
}

TEST_F(SimulatedDevice, LeavesARecordAloneThatHasARequestUnderWay) {
    std::array<std::uint8_t, PlainRecordBytes> answer{};
    const ControlRequest enter{FW_IOCTL_STREAM_ENTER, answer.data(), PlainRecordBytes,
                               answer.data(), PlainRecordBytes};
    ASSERT_EQ(ControlDeviceOverlapped(device, enter, overlapped), ControlOutcome::Pending);

    DestroyOverlapped(overlapped);

    EXPECT_TRUE(IsOverlappedPending(overlapped));
    CancelOverlapped(device, overlapped);
    EXPECT_EQ(WaitForCompletion(device, overlapped, WaitForEver), CompletionOutcome::Failed);
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorOperationAborted);
}

TEST_F(SimulatedDevice, AnswersAPlainRequestBeforeItReturns) {
    std::uint8_t answer[4] = {0xFF, 0xFF, 0xFF, 0xFF};
    std::uint32_t bytes = 0;
    const ControlRequest query{FW_IOCTL_QUERY_BUSY, answer, sizeof answer, answer, sizeof answer};

    EXPECT_TRUE(ControlDevice(device, query, &bytes));

    EXPECT_EQ(bytes, 4u);
}

TEST_F(SimulatedDevice, IsOpenedWhereItWasListedWhateverTheVariableSaysNow) {
    const ScopedVariable other("ZENTARA_SIMULATION", nullptr);

    PlatformDevice* second = OpenDevice(path.c_str());

    EXPECT_NE(second, nullptr);
    CloseDevice(second);
}

TEST_F(SimulatedDevice, IsNotOpenedAtAnotherPath) {
    EXPECT_EQ(OpenDevice("elsewhere"), nullptr);
    EXPECT_NE(GetLastPlatformError(), PlatformErrorNone);
}

TEST(UnlistedDevice, IsNotOpened) {
    EndSimulation();

    EXPECT_EQ(OpenDevice("any"), nullptr);

    EXPECT_EQ(GetLastPlatformError(), PlatformErrorFileNotFound);
    CloseDevice(nullptr);
    DestroyOverlapped(nullptr);
}

}  // namespace
}  // namespace ZV
