#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <atomic>
#include <csignal>
#include <cstdlib>
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

// ---- Waits for ever, in a child process ----

int reportPipe[2];
ZentaraHandle childHandle;

void Report(pid_t thread) {
    if (write(reportPipe[1], &thread, sizeof(thread)) != sizeof(thread)) _exit(2);
}

/// Tells the parent who calls, and that the call returned if ever it does.
template <typename Call>
void ReportAround(Call&& call) {
    Report(gettid());
    call();
    Report(0);
}

void AbortFromCallback(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    ReportAround([] { (void)Zentara_Abort(childHandle); });
}

void CloseFromCallback(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    ReportAround([] { (void)Zentara_CloseCamera(childHandle); });
}

void QueueFromCallback(std::uint64_t, std::uint32_t, std::uint32_t, std::uint32_t) {
    ReportAround([] {
        Zentara_Frame frame{};
        (void)Zentara_QueueFrame(childHandle, &frame, nullptr, 0, 0, 0);
    });
}

void Require(ZentaraResult result) {
    if (result != zerrNone) _exit(2);
}

void OpenInChild() {
    Zentara_CamListItem item{};
    std::uint32_t length = 1;
    Require(Zentara_LoadDriver());
    Require(Zentara_ListCameras(&item, &length));
    Require(Zentara_OpenCamera(0, &childHandle));
}

[[noreturn]] void RunFrameCallback(ZentaraAsyncCallback callback) {
    OpenInChild();
    ClientFrame frame(64 * 48);
    Require(Zentara_QueueFrame(childHandle, frame.Get(), callback, zcbFrameDone, 0, 0));
    Require(Zentara_SetStreaming(childHandle, 1));
    while (true) pause();
}

[[noreturn]] void RunSettingsCallback(ZentaraAsyncCallback callback) {
    OpenInChild();
    Zentara_Settings settings{};
    Require(Zentara_ReadSettingsFromCam(childHandle, &settings));
    (void)Zentara_QueueSettings(childHandle, &settings, callback, zcbFrameDone, 0, 0);
    _exit(3);
}

bool IsThreadAsleep(pid_t process, pid_t thread) {
    std::ifstream stat("/proc/" + std::to_string(process) + "/task/" + std::to_string(thread) +
                       "/stat");
    std::string text;
    std::getline(stat, text);
    const std::size_t name = text.rfind(')');
    return name != std::string::npos && text.substr(name + 2, 1) == "S";
}

/// True when the thread that `run` reports is seen to wait, and its call has not returned by then.
bool DoesWaitForEver(void (*run)(ZentaraAsyncCallback), ZentaraAsyncCallback callback) {
    const SimulationWorld world(SmallMono);
    if (pipe(reportPipe) != 0) return false;
    const pid_t child = fork();
    if (child == 0) run(callback);
    close(reportPipe[1]);
    pid_t thread = 0;
    const bool hasReported = read(reportPipe[0], &thread, sizeof(thread)) == sizeof(thread);
    std::uint32_t asleep = 0;
    const bool isWaiting = hasReported && WaitUntil([&] {
                               if (IsThreadAsleep(child, thread)) ++asleep;
                               return asleep >= 100;
                           });
    kill(child, SIGKILL);
    waitpid(child, nullptr, 0);
    const bool hasReturned = read(reportPipe[0], &thread, sizeof(thread)) != 0;
    close(reportPipe[0]);
    return isWaiting && !hasReturned;
}

TEST(WaitForEver, AnAbortFromAFrameCallbackWaitsForItself) {
    EXPECT_TRUE(DoesWaitForEver(RunFrameCallback, AbortFromCallback));
}

TEST(WaitForEver, ACloseFromAFrameCallbackWaitsForItsOwnThread) {
    EXPECT_TRUE(DoesWaitForEver(RunFrameCallback, CloseFromCallback));
}

TEST(WaitForEver, AQueueCallFromTheCallbackOfSettingsAppliedAtOnceWaitsForItself) {
    EXPECT_TRUE(DoesWaitForEver(RunSettingsCallback, QueueFromCallback));
}

}  // namespace
}  // namespace ZV::Test
