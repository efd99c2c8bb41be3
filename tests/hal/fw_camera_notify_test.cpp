#include <gtest/gtest.h>

#include <algorithm>

#include "hal/control_records.h"
#include "hal/fw_camera.h"
#include "hal/fw_device_context.h"
#include "hal/hal_world.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

struct FWCameraNotification : testing::Test {
    FWCameraNotification() : camera(mono.Connect()) {}

    bool WaitForPended(std::uint32_t count) {
        return WaitUntil([&] { return mono.world.GetState().pendedRequests == count; });
    }

    HALWorld mono{"mono"};
    HALCamera* camera;
};

TEST_F(FWCameraNotification, EnablingKeepsOneRequestWithTheDriver) {
    ASSERT_EQ(HALOk, FWCameraEnableNotification(*camera));

    EXPECT_TRUE(WaitForPended(1));
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));
    const std::vector<TraceRecord> requests = mono.TakeRequests();
    ASSERT_GE(requests.size(), 2u);
    EXPECT_EQ(FW_IOCTL_NOTIFY_ENABLE, requests[0].code);
    const auto wait = std::find_if(requests.begin(), requests.end(), [](const TraceRecord& record) {
        return record.code == FW_IOCTL_NOTIFY_WAIT;
    });
    ASSERT_NE(requests.end(), wait);
    EXPECT_EQ(2056u, wait->inputBytes);
    EXPECT_TRUE(std::all_of(wait->input.begin(), wait->input.end(),
                            [](std::uint8_t byte) { return byte == 0; }));
}

TEST_F(FWCameraNotification, DisablingEndsTheLoop) {
    ASSERT_EQ(HALOk, FWCameraEnableNotification(*camera));
    ASSERT_TRUE(WaitForPended(1));

    EXPECT_EQ(HALOk, FWCameraDisableNotification(*camera));

    EXPECT_TRUE(WaitForPended(0));
    EXPECT_EQ(0, GetFWContext(*camera)->notifying.load());
}

TEST_F(FWCameraNotification, EnablingTwiceKeepsOneLoop) {
    ASSERT_EQ(HALOk, FWCameraEnableNotification(*camera));
    ASSERT_TRUE(WaitForPended(1));

    EXPECT_EQ(HALOk, FWCameraEnableNotification(*camera));

    EXPECT_TRUE(WaitForPended(1));
}

TEST_F(FWCameraNotification, RefusalsAre19) {
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_NOTIFY_ENABLE"})"));
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_NOTIFY_DISABLE"})"));

    EXPECT_EQ(HALWriteFailed, FWCameraEnableNotification(*camera));
    EXPECT_EQ(nullptr, GetFWContext(*camera)->notifyThread);
    EXPECT_EQ(HALWriteFailed, FWCameraDisableNotification(*camera));
}

TEST_F(FWCameraNotification, WithoutADeviceItIs17) {
    ASSERT_EQ(HALOk, HAL_CameraDisconnect(camera));

    EXPECT_EQ(HALDeviceNotOpen, FWCameraEnableNotification(*camera));
    EXPECT_EQ(HALDeviceNotOpen, FWCameraDisableNotification(*camera));
}

TEST_F(FWCameraNotification, ADisconnectTakesARequestBackThatNeverCompletes) {
    const FastWaits fast;
    ASSERT_TRUE(mono.world.AddFault(R"({"kind":"neverComplete","code":"FW_IOCTL_NOTIFY_WAIT"})"));
    ASSERT_EQ(HALOk, FWCameraEnableNotification(*camera));
    ASSERT_TRUE(WaitForPended(1));

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));

    EXPECT_EQ(0u, mono.world.GetState().pendedRequests);
}

}  // namespace
}  // namespace ZV::Test
