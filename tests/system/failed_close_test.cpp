#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include "support/flat_camera.h"

// The device refuses to stop or to give its resources back. The client's close returns as if all
// were well, and nothing of the client's is touched afterwards.

namespace ZV::Test {
namespace {

/// A frame callback that stays inside until the test lets it go.
struct LastingDelivery {
    std::atomic<bool> isInside{false}, mayLeave{false}, hasLeft{false};

    static void Stay(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t) {
        auto& self = *reinterpret_cast<LastingDelivery*>(static_cast<std::uintptr_t>(userPrivate));
        self.isInside = true;
        EXPECT_TRUE(WaitUntil([&] { return self.mayLeave.load(); }));
        self.hasLeft = true;
    }
};

class CameraThatCannotBeClosed : public OpenedCamera {
  protected:
    void SetUp() override {
        OpenedCamera::SetUp();
        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    }
    void BreakStop() {
        ASSERT_TRUE(
            world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_STOP", "count": 0})"));
    }
    void BreakDisconnect() {
        ASSERT_TRUE(world.AddFault(
            R"({"kind": "failRequest", "code": "FW_IOCTL_FREE_RESOURCES", "count": 0})"));
    }
};

TEST_F(CameraThatCannotBeClosed, AnswersAsItsStreamStands) {
    BreakDisconnect();
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    EXPECT_ZERR(zerrCameraBusy, Zentara_SetStreaming(handle, 1)) << "no bandwidth is given back";
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0)) << "off already";
    EXPECT_ZERR(zerrNotStreaming, Zentara_Trigger(handle));
    EXPECT_EQ(0u, world.GetState().attachedBuffers);
}

TEST_F(CameraThatCannotBeClosed, IsClosedAllTheSameWhenOnlyItsStreamCouldNotBeStopped) {
    BreakStop();
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    EXPECT_ZERR(zerrBadHandle, Zentara_Trigger(handle));
    EXPECT_ZERR(zerrBadHandle, Zentara_SetStreaming(handle, 0));
    EXPECT_EQ(0u, world.GetState().openHandles);
}

TEST_F(CameraThatCannotBeClosed, CanBeSwitchedOnAndOffAndDropsTheImagesOfItsStream) {
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_FREE_RESOURCES"})"));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    const std::uint64_t before = world.GetState().framesSent;

    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    EXPECT_TRUE(WaitUntil([&] { return world.GetState().framesSent > before + 4; }));
    EXPECT_ZERR(zerrNotSupported, Zentara_Trigger(handle)) << "not in the software mode";
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_ZERR(zerrNotStreaming, Zentara_Trigger(handle));
}

TEST_F(CameraThatCannotBeClosed, TakesASecondCloseWhichTriesAgain) {
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_FREE_RESOURCES"})"));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_EQ(1u, world.GetState().openHandles);

    EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    EXPECT_EQ(0u, world.GetState().openHandles);
    EXPECT_ZERR(zerrBadHandle, Zentara_CloseCamera(handle));
    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    ClientFrame frame(GetImageBytes());
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
}

TEST_F(CameraThatCannotBeClosed, IsGivenUpAtTheNextListingWhichFindsItAgain) {
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_FREE_RESOURCES"})"));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    ASSERT_EQ(1u, world.GetState().openHandles);

    ASSERT_EQ(1u, ListCameras().size());

    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    ClientFrame frame(GetImageBytes());
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
}

TEST_F(CameraThatCannotBeClosed, IsFoundByTheListingAfterItHasGoneAndComeBack) {
    ASSERT_TRUE(world.Unplug());
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    ASSERT_TRUE(world.Plug());

    ASSERT_EQ(1u, ListCameras().size());

    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    ClientFrame frame(GetImageBytes());
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
}

TEST_F(CameraThatCannotBeClosed, ReturnsFromItsCloseWhenTheDeliveryInProgressHasEnded) {
    LastingDelivery delivery;
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone,
                Zentara_QueueFrame(handle, frame.Get(), LastingDelivery::Stay, zcbFrameDone,
                                   reinterpret_cast<std::uintptr_t>(&delivery), 0));
    ASSERT_TRUE(WaitUntil([&] { return delivery.isInside.load(); }));
    BreakStop();
    std::atomic<bool> isClosed{false};
    std::thread closing([&] {
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
        EXPECT_TRUE(delivery.hasLeft);
        isClosed = true;
    });
    EXPECT_FALSE(WaitUntil([&] { return isClosed.load(); }, std::chrono::milliseconds(50)));

    delivery.mayLeave = true;
    closing.join();
}

}  // namespace
}  // namespace ZV::Test
