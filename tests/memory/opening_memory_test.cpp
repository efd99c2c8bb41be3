// What an opened camera cannot do without fails once. Number n of what the library makes is refused
// during an opening or a start of the stream: it is told by a code, or the camera does all that it
// did, and a second try goes well.

#include <gtest/gtest.h>

#include "api/camera_context.h"
#include "api/handles.h"
#include "hal/platform/clock.h"
#include "memory/failing_allocator.h"
#include "support/flat_camera.h"

namespace ZV::Test {
namespace {

constexpr std::int64_t OpeningAllocationsMax = 20'000;  ///< Far above what any run takes.

class CameraWithoutMemory : public LoadedLibrary {
  protected:
    CameraWithoutMemory()
        : LoadedLibrary(R"({"base": "mono", "timeScale": 0, "cameras": [
              {"sensor": {"width": 64, "height": 48, "noise": false}}]})") {
        SetWaitClockDivisor(1000);
    }
    ~CameraWithoutMemory() override { SetWaitClockDivisor(1); }
    void SetUp() override {
        LoadedLibrary::SetUp();
        ASSERT_EQ(1u, ListCameras().size());
    }

    /// Calls `run` with each allocation refused in turn, until it makes none more.
    template <typename Run>
    void RefuseEach(Run run) {
        bool hasRefused = true;
        for (std::int64_t failing = 1; hasRefused && !HasFailure(); ++failing) {
            ASSERT_LT(failing, OpeningAllocationsMax);
            SCOPED_TRACE(failing);
            hasRefused = run(failing);
        }
        PrintRefusals();
    }

    void OpenIt() { ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle)); }
    void CloseIt() {
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
        ExpectNothingOpen();
    }
    void ExpectNothingOpen() {
        EXPECT_EQ(0u, world.GetState().openHandles);
        EXPECT_EQ(0u, world.GetState().reservedBandwidths);
        EXPECT_EQ(0u, world.GetState().reservedChannels);
    }
    void ExpectAFrameOfTheStream() {
        ClientFrame frame(64 * 48);
        CallbackLog calls;
        EXPECT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), CallbackLog::Record,
                                                 zcbFrameDone, calls.GetPrivate(), 0));
        EXPECT_TRUE(calls.WaitForCalls(1));
    }
    /// In bounded time, also without a run loop.
    void ExpectItStreams() {
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
        ExpectAFrameOfTheStream();
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    }

    ZentaraHandle handle = 0;
};

TEST_F(CameraWithoutMemory, ThatOpensHasItsLocksAndItsRunLoopAndElseIsClosed) {
    int refused = 0;
    RefuseEach([&](std::int64_t failing) {
        handle = 0;
        BeginAllocations(failing);
        const ZentaraResult opened = Zentara_OpenCamera(0, &handle);
        const bool hasRefused = EndAllocations();
        if (opened != zerrNone) {
            ++refused;
            EXPECT_ZERR(zerrDriverFault, opened);
            EXPECT_EQ(0u, handle);
            ExpectNothingOpen();
            OpenIt();
        }
        const CameraContext& context = *GetCameraContext(*FindCamera(handle));
        EXPECT_TRUE(context.deliveryLock->IsMade());
        EXPECT_TRUE(context.queueLock->IsMade());
        EXPECT_TRUE(context.rgbWheel->HasSemaphore());
        ExpectItStreams();
        CloseIt();
        return hasRefused;
    });
    EXPECT_GE(refused, 13 + 4) << "seven objects, three locks of two parts, a thread of four";
}

TEST_F(CameraWithoutMemory, ThatCannotStartItsStreamTellsAndStreamsOnceItIsStoppedAndStartedAgain) {
    int refused = 0;
    OpenIt();
    RefuseEach([&](std::int64_t failing) {
        BeginAllocations(failing);
        const ZentaraResult started = Zentara_SetStreaming(handle, 1);
        const bool hasRefused = EndAllocations();
        // Kept: a parameter set number that cannot be written is not told.
        if (started != zerrNone) {
            ++refused;
            EXPECT_ZERR(zerrDriverFault, started);
        }
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
        EXPECT_EQ(0u, world.GetState().attachedBuffers);
        EXPECT_EQ(0u, world.GetState().pendedRequests);
        ExpectItStreams();
        return hasRefused;
    });
    EXPECT_GT(refused, 120) << "sixty buffers and their records, and a thread";
    CloseIt();
}

}  // namespace
}  // namespace ZV::Test
