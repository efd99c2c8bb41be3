// Streams that end without packets. The stop waits its five seconds for them, here on a wait clock
// that runs faster.

#include <gtest/gtest.h>

#include "hal/platform/clock.h"
#include "support/flat_camera.h"

namespace ZV::Test {
namespace {

class SilentStream : public OpenedCamera {
  protected:
    SilentStream() { SetWaitClockDivisor(1000); }
    ~SilentStream() override { SetWaitClockDivisor(1); }
};

TEST_F(SilentStream, AStartThatFailsInTheStreamLayerLeavesStreamingOn) {
    ASSERT_TRUE(
        world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_LISTEN", "count": 0})"));

    EXPECT_ZERR(zerrDriverFault, Zentara_SetStreaming(handle, 1));

    // Kept: the second call says that it is on, and switching it off cleans up.
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    (void)Zentara_SetStreaming(handle, 0);
    EXPECT_EQ(0u, world.GetState().attachedBuffers);
}

TEST_F(SilentStream, UnpluggingIsNotReportedAndTheCameraCanBeClosed) {
    CallbackLog calls;
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    ASSERT_TRUE(world.Unplug());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, 3));

    EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    for (const CallbackLog::Call& call : calls.GetCalls()) EXPECT_ZERR(zerrNone, call.errorCode);
    EXPECT_TRUE(ListCameras().empty());
    // The close could not end the stream; what it left ends with the listing that follows.
    EXPECT_TRUE(ListCameras().empty());
    EXPECT_EQ(0u, world.GetState().openHandles);
}

TEST_F(SilentStream, ACameraThatIsPluggedInAgainIsListedAndStreams) {
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    ASSERT_TRUE(world.Unplug());
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    ListCameras();
    ASSERT_TRUE(world.Plug());

    ASSERT_EQ(1u, ListCameras().size());

    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    ClientFrame frame(GetImageBytes());
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
}

}  // namespace
}  // namespace ZV::Test
