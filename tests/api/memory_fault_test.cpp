#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "api/camera_context.h"
#include "api/camera_store.h"
#include "api/entry_queue.h"
#include "api/failing_memory.h"
#include "api/handles.h"
#include "support/flat_camera.h"

namespace ZV {
namespace {

class OpeningWithoutMemory : public ZV::Test::LoadedLibrary {
  protected:
    void SetUp() override {
        LoadedLibrary::SetUp();
        ASSERT_EQ(1u, ListCameras().size());
    }

    ZCamera& GetCamera() { return *CameraStore::Get().GetList()[0]; }

    /// Allocations of this thread that `open` makes.
    template <typename Open>
    static std::uint32_t CountAllocations(Open open) {
        ZV::Test::FailAllocation(Plenty);
        open();
        return Plenty - ZV::Test::EndFailingAllocation();
    }
    std::uint32_t CountOfConnection() {
        const std::uint32_t count =
            CountAllocations([&] { EXPECT_EQ(CameraOk, GetCamera().OpenCamera()); });
        EXPECT_EQ(CameraOk, GetCamera().CloseCamera());
        return count;
    }
    std::uint32_t CountOfOpening() {
        const std::uint32_t count =
            CountAllocations([&] { EXPECT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle)); });
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
        return count;
    }
    ZentaraResult OpenWithout(std::uint32_t allocation) {
        ZV::Test::FailAllocation(allocation);
        const ZentaraResult result = Zentara_OpenCamera(0, &handle);
        EXPECT_EQ(0u, ZV::Test::EndFailingAllocation()) << allocation << " was not reached";
        EXPECT_TRUE(result == zerrNone || result == zerrDriverFault) << result;
        return result;
    }

    static constexpr std::uint32_t Plenty = 100000;
    ZentaraHandle handle = 0;
};

TEST_F(OpeningWithoutMemory, OfItsContextClosesTheCameraAgain) {
    (void)CountOfOpening();  // what is made once for all is made now
    const std::uint32_t first = CountOfConnection() + 1;
    const std::uint32_t last = CountOfOpening();
    ASSERT_LT(first, last);

    std::uint32_t failures = 0;
    for (std::uint32_t allocation = first; allocation <= last; ++allocation) {
        if (OpenWithout(allocation) == zerrNone) {
            // It could do without, as a filter does without its scratch space.
            const CameraContext& context = *GetCameraContext(GetCamera());
            EXPECT_TRUE(context.deliveryLock->IsMade()) << allocation;
            EXPECT_TRUE(context.queueLock->IsMade()) << allocation;
            EXPECT_TRUE(context.rgbWheel->HasSemaphore()) << allocation;
            EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle)) << allocation;
            continue;
        }
        ++failures;
        EXPECT_FALSE(GetCamera().IsCameraOpen()) << allocation;
        EXPECT_EQ(nullptr, GetCameraContext(GetCamera())) << allocation;
        EXPECT_EQ(0u, world.GetState().openHandles) << allocation;
    }
    EXPECT_GE(failures, 13u) << "seven objects, and three locks of two parts";

    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    ZV::Test::ClientFrame frame(64 * 48);
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
}

class DeliveringWithoutMemory : public ZV::Test::OpenedCamera {};

TEST_F(DeliveringWithoutMemory, ForALockPrintsALineForEachWaitAndTheRunGoesOn) {
    for (const auto lock : {&CameraContext::deliveryLock, &CameraContext::queueLock}) {
        // Nothing streams yet, and the close waits for whoever holds it.
        CameraContext& context = *GetCameraContext(*FindCamera(handle));
        ZV::Test::FailAllocation(2);  // the first one is the object
        (context.*lock).reset(new ZSemaphore);
        ASSERT_EQ(0u, ZV::Test::EndFailingAllocation());
        ASSERT_FALSE((context.*lock)->IsMade());
        ZV::Test::CallbackLog calls;
        ZV::Test::ClientFrame frame(64 * 48);
        testing::internal::CaptureStdout();

        EXPECT_ZERR(zerrNone, Queue(frame, calls, zcbFrameDone));
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
        EXPECT_TRUE(calls.WaitForCalls(1));
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));

        EXPECT_NE(std::string::npos,
                  testing::internal::GetCapturedStdout().find(
                      "ZSemaphore::ZSemaphore() call to HAL_SemaphoreWait failed\n"));
        EXPECT_ZERR(zerrNone, frame->errorCode);
        ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
        ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    }
}

class QueueingWithoutMemory : public ZV::Test::OpenedCamera {};

TEST_F(QueueingWithoutMemory, IsADriverFaultAndQueuesNothing) {
    ZV::Test::CallbackLog calls;
    ZV::Test::ClientFrame frame(64 * 48);
    Zentara_Settings settings = ReadSettings();

    ZV::Test::FailAllocation(1);
    EXPECT_ZERR(zerrDriverFault, Queue(frame, calls, zcbFrameDone));
    EXPECT_EQ(0u, ZV::Test::EndFailingAllocation());
    EXPECT_EQ(0u, GetQueueCount(*GetCameraContext(*FindCamera(handle))));

    ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbFrameDone));
    ZV::Test::FailAllocation(1);
    EXPECT_ZERR(zerrDriverFault, Zentara_QueueSettings(handle, &settings, nullptr, 0, 0, 0));
    EXPECT_EQ(0u, ZV::Test::EndFailingAllocation());
    EXPECT_EQ(1u, GetQueueCount(*GetCameraContext(*FindCamera(handle))));
}

}  // namespace
}  // namespace ZV
