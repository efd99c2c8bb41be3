// A device's events, mutexes and threads fail once, at the bus layer's own door.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <new>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

#include "camera/test_camera.h"
#include "hal/control_records.h"
#include "hal/frame_gate.h"
#include "hal/fw_camera.h"
#include "hal/fw_device_context.h"
#include "hal/hal_world.h"
#include "hal/semaphore.h"
#include "memory/failing_allocator.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

constexpr std::string_view Mono = R"({"base": "mono", "timeScale": 0})";
constexpr std::int64_t DeviceAllocationsMax = 1000;  ///< Far above what any run takes.

TEST(FrameGateWithoutItsEvent, SaysThatAWaitHasFailedAndRefusesNothingElse) {
    BeginAllocations(1);
    FrameGate gate;
    ASSERT_TRUE(EndAllocations());
    EXPECT_FALSE(gate.IsMade());
    EXPECT_EQ(HALOk, gate.Wait()) << "closed: nothing to wait for";

    gate.Open();

    EXPECT_EQ(HALConditionFailed, gate.Wait());
    gate.Release();
    gate.Close();
    EXPECT_EQ(HALOk, gate.Wait());
}

TEST(DeviceWithoutMemory, IsListedWithTheEventOfItsFramesOrTheListingFails) {
    HALWorld hal(Mono);
    bool hasRefused = true;
    for (std::int64_t failing = 1; hasRefused && failing < DeviceAllocationsMax; ++failing) {
        SCOPED_TRACE(failing);
        BeginAllocations(failing);
        const HALStatus status = hal.List();
        hasRefused = EndAllocations();

        EXPECT_TRUE(status == HALOk || (hasRefused && status == HALDeviceNotOpen)) << status;
        if (status == HALOk) {
            EXPECT_LE(hasRefused ? 0u : 1u, hal.count) << "a walk that ended early finds none";
            if (hal.count != 0) {
                EXPECT_TRUE(GetFWContext(hal.list[0])->frameEvent.IsMade());
            }
            hal.GiveUpList();
        }
        EXPECT_EQ(0u, hal.world.GetState().openHandles);
    }
    EXPECT_FALSE(hasRefused);
    PrintRefusals();
}

TEST(DeviceWithoutMemory, ForTheMutexOfItsWritesIsNotConnectedUntilItCanBe) {
    for (std::int64_t failing = 1; failing <= 2; ++failing) {  // of two parts
        SCOPED_TRACE(failing);
        FWDeviceContext* const context = new FWDeviceContext;
        HALWorld hal(Mono);
        std::memcpy(context->devicePath, GetFWContext(*hal.ListFirst())->devicePath,
                    DevicePathBytes);
        HALCamera camera{};
        camera.context = context;
        BeginAllocations(failing);

        const HALStatus connected = ConnectPlain(&camera, 100);

        EXPECT_TRUE(EndAllocations());
        EXPECT_EQ(HALDeviceNotOpen, connected);
        EXPECT_EQ(0u, camera.connected);
        EXPECT_EQ(0u, hal.world.GetState().openHandles);
        EXPECT_EQ(HALOk, ConnectPlain(&camera, 100));
        EXPECT_NE(nullptr, context->deviceMutex);
        EXPECT_EQ(HALOk, HAL_CameraDisconnect(&camera));
        EXPECT_EQ(HALOk, HAL_CameraRelease(&camera));
    }
    PrintRefusals();
}

TEST(DeviceWithoutMemory, ForItsStreamHasALoopOrGetsItsBuffersBackAndStartsLater) {
    const FastWaits fast;
    HALWorld hal(Mono);
    HALCamera* const camera = hal.Connect();
    const FWDeviceContext& context = *GetFWContext(*camera);
    bool hasRefused = true;
    int refused = 0;
    for (std::int64_t failing = 1; hasRefused && failing < DeviceAllocationsMax; ++failing) {
        SCOPED_TRACE(failing);
        BeginAllocations(failing);
        const HALStatus status = HAL_CameraStartStreaming(camera, StreamSwitchAddress, 1, nullptr);
        hasRefused = EndAllocations();

        EXPECT_EQ(hasRefused, status != HALOk);
        if (context.streaming != 0) {  // kept: also behind a refused listen or write
            EXPECT_TRUE(IsHALThreadStarted(context.callbackThread));
        } else {
            ++refused;
            EXPECT_EQ(HALReadFailed, status);
            EXPECT_EQ(nullptr, context.callbackThread);
            EXPECT_EQ(nullptr, context.ring);
            EXPECT_EQ(nullptr, context.retiredRings);
            EXPECT_EQ(nullptr, context.stopEvent);
            EXPECT_EQ(0u, hal.world.GetState().attachedBuffers);
        }
        EXPECT_EQ(HALOk, HAL_CameraStopStreaming(camera, StreamSwitchAddress));
        EXPECT_EQ(0u, hal.world.GetState().pendedRequests);
    }
    EXPECT_FALSE(hasRefused);
    EXPECT_GT(refused, 2 * 60 + 4) << "a ring of sixty, and a thread";
    PrintRefusals();
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));
}

TEST(DeviceWithoutMemory, ForItsNotificationsSaysSoAndCanBeEnabledLater) {
    HALWorld hal(Mono);
    HALCamera* const camera = hal.Connect();
    FWDeviceContext& context = *GetFWContext(*camera);
    bool hasRefused = true;
    int refused = 0;
    for (std::int64_t failing = 1; hasRefused && failing < DeviceAllocationsMax; ++failing) {
        SCOPED_TRACE(failing);
        BeginAllocations(failing);
        const HALStatus status = FWCameraEnableNotification(*camera);
        hasRefused = EndAllocations();

        EXPECT_EQ(hasRefused ? HALWriteFailed : HALOk, status);
        EXPECT_EQ(hasRefused ? 0 : 1, context.notifying.load());
        EXPECT_EQ(hasRefused, context.notifyThread == nullptr);
        const std::vector<std::uint32_t> codes = hal.TakeCodes();
        const auto enabled = std::count(codes.begin(), codes.end(), FW_IOCTL_NOTIFY_ENABLE);
        const auto disabled = std::count(codes.begin(), codes.end(), FW_IOCTL_NOTIFY_DISABLE);
        EXPECT_EQ(hasRefused ? 0 : 1, enabled - disabled) << "the driver notifies nobody";
        refused += hasRefused ? 1 : 0;
    }
    EXPECT_FALSE(hasRefused);
    EXPECT_GE(refused, 4) << "the request, a thread";
    PrintRefusals();
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(camera));
}

/// A camera over a device whose gate has no event: its run loop's waits fail.
TEST(CameraWithoutTheEventOfItsFrames, SaysSoAndItsRunLoopGoesOn) {
    HALWorld hal(Mono);
    BeginAllocations(2);  // the gate's, behind the context
    FWDeviceContext* const context = new (std::nothrow) FWDeviceContext;
    ASSERT_TRUE(EndAllocations());
    ASSERT_NE(nullptr, context);
    ASSERT_FALSE(context->frameEvent.IsMade());
    context->frameEvent.Open();
    HALCamera record{};
    record.context = context;
    TestCamera camera(record);
    camera.streaming.runLoopActive = true;
    camera.streaming.isStreaming = true;
    camera.streaming.frameQueue.PushNewest(MakeFrame());
    testing::internal::CaptureStdout();

    std::thread loop([&] { camera.PrivateImageStreamingRunLoop(); });
    const bool hasGoneOn = WaitUntil([&] { return camera.streaming.frameQueue.GetCount() == 0; });
    camera.streaming.runLoopActive = false;
    loop.join();

    const std::string printed = testing::internal::GetCapturedStdout();
    EXPECT_TRUE(hasGoneOn) << "the frame, which is not valid, was looked at";
    EXPECT_EQ(0u, printed.find("PrivateImageStreamingRunLoop() - call to HAL_WaitingForFrame "
                               "failed with error 33\n"));
    camera.streaming.isStreaming = false;
    PrintRefusals();
}

TEST(SemaphoreWithoutMemory, PrintsALineForEachWaitAndTheCallerGoesOn) {
    for (std::int64_t failing = 1; failing <= 2; ++failing) {  // of two parts
        SCOPED_TRACE(failing);
        testing::internal::CaptureStdout();
        BeginAllocations(failing);
        {
            ZSemaphore semaphore;
            EXPECT_TRUE(EndAllocations());
            EXPECT_FALSE(semaphore.IsMade());
            // Kept: its making is always a success to who makes it, and so are giving and end.
            semaphore.Wait();
            semaphore.Signal();
            const SemaphoreHold hold(semaphore);
        }
        EXPECT_EQ(
            "ZSemaphore::ZSemaphore() call to HAL_SemaphoreWait failed\n"
            "ZSemaphore::ZSemaphore() call to HAL_SemaphoreWait failed\n",
            testing::internal::GetCapturedStdout());
    }
    PrintRefusals();
}

}  // namespace
}  // namespace ZV::Test
