#include "hal/hal.h"

#include <gtest/gtest.h>

#include "hal/adapter_camera.h"
#include "hal/fw_camera.h"
#include "hal/hal_world.h"

namespace ZV::Test {
namespace {

TEST(HAL, TheTimeoutOfAFWCameraCannotBeSet) {
    HALCamera camera{};

    EXPECT_EQ(HALNotAvailable, HAL_CameraSetTimeout(&camera, 5));
    EXPECT_EQ(HALOk, HAL_CameraGetTimeout(&camera));
}

TEST(HAL, AnAsyncWriteCallbackIsAcceptedAndNotKept) {
    HALWorld mono("mono");
    HALCamera* const camera = mono.Connect();

    EXPECT_EQ(HALOk, HAL_CameraRegisterAsyncWriteCallback(camera, 0xFA000000, 4,
                                                          CameraAsyncWriteCallback));
    EXPECT_TRUE(mono.TakeCodes().empty());
}

TEST(HAL, TheAsyncWriteCallbackGroupsItsBytes) {
    std::uint8_t bytes[18];
    for (std::uint8_t i = 0; i < sizeof bytes; ++i) bytes[i] = static_cast<std::uint8_t>(0xF0 + i);
    testing::internal::CaptureStdout();

    CameraAsyncWriteCallback(bytes, sizeof bytes);

    EXPECT_EQ(
        "CameraAsyncWriteCallback:\n"
        "    \n\t\tf0f1f2f3 f4f5f6f7    f8f9fafb fcfdfeff    \n\t\t0001\n\n",
        testing::internal::GetCapturedStdout());
}

TEST(HAL, AnUnknownKindAnswersZeroAndTouchesNothing) {
    HALCamera camera{};
    camera.kind = 2;
    camera.connected = 1;
    int marker = 0;
    camera.context = &marker;
    const HALCamera before = camera;
    std::uint16_t word = 0xDDDD;
    std::uint32_t quadlet = 0xDDDDDDDD;

    EXPECT_EQ(HALOk, ConnectPlain(&camera, 100));
    EXPECT_EQ(HALOk, HAL_CameraReallocateBandwidth(&camera, 100, 1));
    EXPECT_EQ(HALOk, HAL_CameraFastestPacketSizeSupported(&camera, &word));
    EXPECT_EQ(HALOk, HAL_CameraConnectionSpeed(&camera, &word));
    EXPECT_EQ(HALOk, HAL_CameraGetTimeout(&camera));
    EXPECT_EQ(HALOk, HAL_CameraSetTimeout(&camera, 1));
    EXPECT_EQ(HALOk, HAL_CameraReadData(&camera, 0, &quadlet, 1));
    EXPECT_EQ(HALOk, HAL_CameraWriteData(&camera, 0, &quadlet, 1));
    EXPECT_EQ(HALOk, HAL_CameraStartStreaming(&camera, 0, 1, nullptr));
    EXPECT_EQ(HALOk, HAL_CameraStopStreaming(&camera, 0));
    EXPECT_EQ(HALOk, HAL_CameraWaitingForFrame(&camera));
    EXPECT_EQ(HALOk, HAL_CameraStopWaitingForFrame(&camera));
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(&camera));
    EXPECT_EQ(HALOk, HAL_CameraRelease(&camera));

    EXPECT_EQ(0xDDDD, word);
    EXPECT_EQ(0xDDDDDDDDu, quadlet);
    EXPECT_EQ(before.packetBytes, camera.packetBytes);
    EXPECT_EQ(before.connected, camera.connected);
    EXPECT_EQ(before.context, camera.context);
}

TEST(HAL, ARecordWithoutAContextCountsAsNotOpen) {
    HALCamera camera{};
    std::uint32_t quadlet = 0;

    EXPECT_EQ(HALDeviceNotOpen, ConnectPlain(&camera, 100));
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraReadData(&camera, 0, &quadlet, 1));
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraWriteData(&camera, 0, &quadlet, 1));
    EXPECT_EQ(HALResourcesNotFreed, HAL_CameraReallocateBandwidth(&camera, 100, 1));
    EXPECT_EQ(HALReadFailed, HAL_CameraStartStreaming(&camera, 0, 1, nullptr));
    EXPECT_EQ(HALOk, HAL_CameraStopStreaming(&camera, 0));
    EXPECT_EQ(HALOk, HAL_CameraWaitingForFrame(&camera));
    EXPECT_EQ(HALOk, HAL_CameraStopWaitingForFrame(&camera));
    camera.connected = 1;
    EXPECT_EQ(HALResourcesNotFreed, HAL_CameraDisconnect(&camera));
    EXPECT_EQ(HALOk, HAL_CameraRelease(&camera));
}

TEST(HAL, NoRecordCountsAsNotOpen) {
    std::uint16_t word = 0;
    std::uint32_t quadlet = 0;

    EXPECT_EQ(HALDeviceNotOpen, ConnectPlain(nullptr, 100));
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraDisconnect(nullptr));
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraReadData(nullptr, 0, &quadlet, 1));
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraWriteData(nullptr, 0, &quadlet, 1));
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraConnectionSpeed(nullptr, &word));
    EXPECT_EQ(HALDeviceNotOpen, HAL_CameraStartStreaming(nullptr, 0, 1, nullptr));
    EXPECT_EQ(HALDeviceNotOpen, FWCameraReallocateBandwidth(nullptr, 100, 1));
    EXPECT_EQ(HALOk, HAL_CameraRelease(nullptr));
}

TEST(HAL, AReallocationPastTheDispatchRefusesARecordOfAnotherKind) {
    HALCamera camera = MakeAdapterCamera(0, 1);

    EXPECT_EQ(HALDeviceNotOpen, FWCameraReallocateBandwidth(&camera, 100, 1));

    EXPECT_EQ(0u, camera.packetBytes);
    EXPECT_EQ(HALOk, HAL_CameraRelease(&camera));
}

TEST(HAL, NullOutputsAreNullData) {
    HALCamera camera{};

    EXPECT_EQ(HALNullData, HAL_CameraFastestPacketSizeSupported(&camera, nullptr));
    EXPECT_EQ(HALNullData, HAL_CameraConnectionSpeed(&camera, nullptr));
}

TEST(HAL, OperationsOnACopyOfTheRecordReachTheSameDevice) {
    HALWorld mono("mono");
    HALCamera copy = *mono.Connect();
    std::uint32_t value = 0;

    EXPECT_EQ(HALOk, HAL_CameraReadData(&copy, PrimaryIdAddress, &value, 1));
    EXPECT_EQ(mono.list[0].cameraWord, value);
}

}  // namespace
}  // namespace ZV::Test
