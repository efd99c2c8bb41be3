#include <gtest/gtest.h>

#include <atomic>
#include <fstream>
#include <string>
#include <thread>

#include "support/flat_camera.h"

namespace ZV::Test {
namespace {

class Capture : public OpenedCamera {
  protected:
    explicit Capture(std::string_view scenario = SmallMono) : OpenedCamera(scenario) {}

    /// Ends a grab that waits, from another thread.
    ZentaraResult GrabAndAbort(ClientFrame& frame) {
        std::atomic<bool> hasEnded{false};
        ZentaraResult result = zerrNone;
        std::thread grabber([&] {
            result = Zentara_GrabFrame(handle, frame.Get());
            hasEnded = true;
        });
        // An abort before the grab waits does not count, so it is repeated.
        EXPECT_TRUE(WaitUntil([&] {
            EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
            return hasEnded.load();
        }));
        grabber.join();
        return result;
    }
};

TEST_F(Capture, AGrabTakesOneImage) {
    ClientFrame frame(GetImageBytes());

    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));

    EXPECT_ZERR(zerrNone, frame->errorCode);
    EXPECT_EQ(64u, frame->width);
    EXPECT_EQ(48u, frame->height);
    EXPECT_EQ(64u * 48u, frame->size);
    EXPECT_EQ(8, frame->bits);
    EXPECT_EQ(static_cast<std::uint32_t>(zfmtMono8), frame->format);
    EXPECT_EQ(0u, frame->timeStamp);
    EXPECT_EQ(1u, frame->privateFilled);
    EXPECT_TRUE(frame.IsGuardIntact());
    const auto frames = world.ReadFrames();
    bool isOneOfThem = false;
    for (const TraceRecord& sent : frames) {
        if (sent.rollingFrameNumber != frame->frameNumber) continue;
        isOneOfThem = sent.checksum == CalculateChecksum(frame.GetPixels(), frame->size);
    }
    EXPECT_TRUE(isOneOfThem) << "frame " << frame->frameNumber << " of " << frames.size();
}

TEST_F(Capture, AGrabLeavesStreamingAsItWas) {
    ClientFrame frame(GetImageBytes());

    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
    EXPECT_EQ(0u, world.GetState().isStreaming);

    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
    EXPECT_EQ(1u, world.GetState().isStreaming);
}

TEST_F(Capture, AGrabWithAFrameQueuedIsBusy) {
    CallbackLog calls;
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbFrameDone));

    EXPECT_ZERR(zerrBusy, Zentara_GrabFrame(handle, frame.Get()));
}

TEST_F(Capture, AGrabTestsItsArgumentsInOrder) {
    CallbackLog calls;
    ClientFrame queued(GetImageBytes());
    ClientFrame small(GetImageBytes() - 1);
    ASSERT_ZERR(zerrNone, Queue(queued, calls, 0));

    EXPECT_ZERR(zerrBadHandle, Zentara_GrabFrame(0, nullptr));
    EXPECT_ZERR(zerrBadParameter, Zentara_GrabFrame(handle, nullptr));
    EXPECT_ZERR(zerrBadParameter, Zentara_GrabFrame(0x1000, nullptr));
    EXPECT_ZERR(zerrBusy, Zentara_GrabFrame(handle, small.Get()));
    ASSERT_ZERR(zerrNone, Zentara_Abort(handle));
    EXPECT_ZERR(zerrBufferTooSmall, Zentara_GrabFrame(handle, small.Get()));

    EXPECT_TRUE(small.IsUntouched());
    EXPECT_EQ(0u, small->privateFilled);
}

TEST_F(Capture, AGrabIntoNoBufferIsTooSmall) {
    ClientFrame frame(GetImageBytes());
    frame->pBuffer = nullptr;

    EXPECT_ZERR(zerrBufferTooSmall, Zentara_GrabFrame(handle, frame.Get()));
}

TEST_F(Capture, AGrabThatTheBusRefusesReturnsTheDriversFault) {
    ClientFrame frame(GetImageBytes());
    ASSERT_TRUE(
        world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "count": 0})"));

    EXPECT_ZERR(zerrDriverFault, Zentara_GrabFrame(handle, frame.Get()));

    EXPECT_TRUE(frame.IsUntouched());
}

TEST_F(Capture, AGrabSaysInItsFrameThatDataWereMissing) {
    ClientFrame frame(GetImageBytes());
    ASSERT_TRUE(world.AddFault(R"({"kind": "losePacket", "packet": 1, "count": 0})"));

    const ZentaraResult result = Zentara_GrabFrame(handle, frame.Get());

    EXPECT_ZERR(zerrNone, result);
    EXPECT_ZERR(zerrMissingData, frame->errorCode);
}

class NoImages : public Capture {
  protected:
    NoImages()
        : Capture(R"({"base": "mono", "cameras": [{"sensor": {"width": 64, "height": 48},
              "faults": [{"kind": "losePacket", "packet": 0, "count": 0}]}]})") {}
};

TEST_F(NoImages, AnAbortEndsAGrabThatWaits) {
    ClientFrame frame(GetImageBytes());

    EXPECT_ZERR(zerrDriverFault, GrabAndAbort(frame));

    EXPECT_TRUE(frame.IsUntouched());
    EXPECT_EQ(0u, world.GetState().isStreaming);
}

TEST_F(Capture, StreamingThatIsOnOrOffAlreadyIsNoFailure) {
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_EQ(0u, world.GetState().isStreaming);

    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0xFFFFFFFF));
    EXPECT_EQ(1u, world.GetState().isStreaming);

    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_EQ(0u, world.GetState().isStreaming);
}

TEST_F(Capture, ATriggerWithoutStreamingIsRefused) {
    EXPECT_ZERR(zerrNotStreaming, Zentara_Trigger(handle));
}

TEST_F(Capture, ATriggerInAnotherModeThanSoftwareIsNotSupported) {
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    EXPECT_ZERR(zerrNotSupported, Zentara_Trigger(handle));
}

class TooFastForTheBus : public Capture {
  protected:
    TooFastForTheBus() : Capture(R"({"base": "model:PellanB1", "buses": [{"speed": 400}]})") {}
};

TEST_F(TooFastForTheBus, AStreamThatTheBusCannotCarryIsBusy) {
    ClientFrame frame(GetImageBytes());

    EXPECT_ZERR(zerrCameraBusy, Zentara_SetStreaming(handle, 1));
    EXPECT_ZERR(zerrCameraBusy, Zentara_GrabFrame(handle, frame.Get()));
}

TEST_F(Capture, AfterAnAbortNoCallbackComesForWhatWasQueuedBefore) {
    CallbackLog before;
    CallbackLog after;
    ClientFrame frame(GetImageBytes());
    for (int i = 0; i < 10; ++i) ASSERT_ZERR(zerrNone, Queue(frame, before, 3));

    EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
    ASSERT_ZERR(zerrNone, Queue(frame, after, zcbFrameDone));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    EXPECT_TRUE(after.WaitForCalls(1));
    EXPECT_EQ(0u, before.CountCalls());
}

TEST_F(Capture, AnAbortDuringAStreamEmptiesTheQueueAndTheNextFrameIsServed) {
    CallbackLog before;
    CallbackLog after;
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    for (int i = 0; i < 100; ++i) {
        ASSERT_ZERR(zerrNone, Queue(frame, before, zcbFrameDone));
    }

    ASSERT_ZERR(zerrNone, Zentara_Abort(handle));
    const std::size_t served = before.CountCalls();
    ASSERT_ZERR(zerrNone, Queue(frame, after, zcbFrameDone));

    EXPECT_TRUE(after.WaitForCalls(1));
    EXPECT_EQ(served, before.CountCalls());
}

TEST_F(Capture, AnAbortWithNothingToDoSucceeds) {
    EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
    EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
}

TEST_F(Capture, AStaleExposureCallbackFindsAnEmptyQueueDuringAGrab) {
    CallbackLog calls;
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, 3));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    ASSERT_TRUE(calls.WaitForCalls(2));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));

    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));

    EXPECT_EQ(2u, calls.CountCalls());
}

/// A callback that stays inside until the test lets it go.
struct SlowCallback {
    std::atomic<bool> isInside{false};
    std::atomic<bool> mayLeave{false};

    std::uint64_t GetPrivate() { return reinterpret_cast<std::uintptr_t>(this); }
    static void Stay(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t) {
        auto& self = *reinterpret_cast<SlowCallback*>(static_cast<std::uintptr_t>(userPrivate));
        self.isInside = true;
        EXPECT_TRUE(WaitUntil([&] { return self.mayLeave.load(); }));
    }
};

TEST_F(Capture, AReleaseWaitsForACallbackThatIsRunning) {
    SlowCallback callback;
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), SlowCallback::Stay, zcbFrameDone,
                                             callback.GetPrivate(), 0));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    ASSERT_TRUE(WaitUntil([&] { return callback.isInside.load(); }));
    std::atomic<bool> hasReturned{false};
    std::thread releaser([&] {
        Zentara_ReleaseDriver();
        hasReturned = true;
    });
    EXPECT_FALSE(WaitUntil([&] { return hasReturned.load(); }, std::chrono::milliseconds(100)));

    callback.mayLeave = true;
    releaser.join();

    EXPECT_EQ(0u, world.GetState().openHandles);
    EXPECT_ZERR(zerrNone, Zentara_LoadDriver());
}

}  // namespace
}  // namespace ZV::Test
