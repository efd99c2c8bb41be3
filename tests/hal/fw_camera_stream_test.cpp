#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <string>
#include <thread>
#include <vector>

#include "hal/control_records.h"
#include "hal/frame_info.h"
#include "hal/fw_device_context.h"
#include "hal/hal_world.h"
#include "hal/mutex_hold.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

using namespace std::chrono_literals;

constexpr std::uint32_t ControlAddress = 0xD0002000;
constexpr std::uint32_t TakeOverAddress = 0xD0003004;
constexpr std::uint32_t Width = 64, Height = 48;
constexpr std::uint32_t ImageBytes = Width * Height;
constexpr std::uint8_t ImagePsn = 7;
constexpr char LeavingText[] = "Leaving callback loop!!!";
constexpr char QuietMono[] = R"({"base":"mono","cameras":[{"idlePackets":false}]})";

/// Takes each frame of a stream in one record.
struct FrameTaker {
    FrameTaker() {
        frame.buffer = pixels.data();
        frame.bufferSize = ImageBytes;
        frame.bytesExpected = ImageBytes;
        frame.psn = ImagePsn;
        frame.rowBytes = Width;
    }

    static tStFrameInfo* Peek(void* context) {
        auto& taker = *static_cast<FrameTaker*>(context);
        ++taker.peeks;
        taker.frame.isHeld = true;
        return &taker.frame;
    }
    static tStFrameInfo* Get(void* context) { return &static_cast<FrameTaker*>(context)->frame; }
    static void Done(void* context) {
        auto& taker = *static_cast<FrameTaker*>(context);
        if (taker.images++ == 0)
            taker.firstChecksum = CalculateChecksum(taker.pixels.data(), ImageBytes);
    }

    std::vector<std::uint8_t> pixels = std::vector<std::uint8_t>(ImageBytes);
    tStFrameInfo frame;
    std::atomic<std::uint32_t> peeks{0}, images{0};
    std::atomic<std::uint64_t> firstChecksum{0};
};

class StreamedCamera {
  public:
    explicit StreamedCamera(std::string_view scenario) : hal(scenario), camera(hal.ListFirst()) {
        EXPECT_EQ(HALOk, HAL_CameraConnect(camera, 500, FrameTaker::Get, FrameTaker::Peek,
                                           FrameTaker::Done, nullptr, nullptr, &taker));
        (void)hal.TakeRequests();
    }
    ~StreamedCamera() { (void)HAL_CameraRelease(camera); }
    StreamedCamera(const StreamedCamera&) = delete;
    StreamedCamera& operator=(const StreamedCamera&) = delete;

    HALStatus Start() { return HAL_CameraStartStreaming(camera, StreamSwitchAddress, 1, nullptr); }
    HALStatus Stop() { return HAL_CameraStopStreaming(camera, StreamSwitchAddress); }
    /// Stops in wait-clock time, and tells what the library printed.
    std::string StopPrinted(HALStatus expected) {
        testing::internal::CaptureStdout();
        EXPECT_EQ(expected, Stop());
        return testing::internal::GetCapturedStdout();
    }
    /// Lets the camera send images of 64 by 48 samples of 8 bits with parameter set number 7.
    void SetUpImages() {
        const std::uint32_t format = std::uint32_t{ImagePsn} << 24 | 1u << 2;
        Write(ControlAddress + 4 * 1, format);
        Write(ControlAddress + 4 * 3, Width << 16 | Height);
        Write(TakeOverAddress, 1);
        (void)hal.TakeRequests();
    }
    void Write(std::uint32_t address, std::uint32_t value) {
        EXPECT_EQ(HALOk, HAL_CameraWriteData(camera, address, &value, 1));
    }
    void AddFault(std::string_view fault) { ASSERT_TRUE(hal.world.AddFault(fault)); }
    FWDeviceContext& Context() { return *GetFWContext(*camera); }

    FrameTaker taker;
    HALWorld hal;
    HALCamera* camera;
};

std::size_t Count(const std::vector<std::uint32_t>& codes, std::uint32_t code) {
    return static_cast<std::size_t>(std::count(codes.begin(), codes.end(), code));
}

TEST(FWCameraStream, AStartAttachesSixtyBuffersAndEntersListensAndSwitchesTheCameraOn) {
    const FastWaits fast;
    StreamedCamera mono(QuietMono);

    ASSERT_EQ(HALOk, mono.Start());

    ASSERT_TRUE(WaitUntil([&] { return mono.hal.world.GetState().pendedRequests == 61; }));
    EXPECT_EQ(60u, mono.hal.world.GetState().attachedBuffers);
    EXPECT_EQ(1u, mono.hal.world.GetState().isStreaming);
    const std::vector<RegisterWrite> writes = mono.hal.world.ReadRegisterWrites();
    ASSERT_EQ(1u, writes.size());
    EXPECT_EQ(StreamSwitchAddress, writes[0].address);
    EXPECT_EQ(std::vector<std::uint32_t>{mono.Context().channel << 24 | 1}, writes[0].values);
    EXPECT_EQ((std::vector<std::uint32_t>{FW_IOCTL_LISTEN, FW_IOCTL_ASYNC_WRITE}),
              mono.hal.TakeCodes());
    EXPECT_EQ(HALOk, mono.Stop());
    for (const TraceRecord& record : mono.hal.TakeRequests()) {
        if (record.code != FW_IOCTL_ATTACH_BUFFER) continue;
        EXPECT_EQ(30u * 512, record.inputBytes);
    }
}

TEST(FWCameraStream, AStopLeavesTheLoopStopsDetachesAndSwitchesTheCameraOffLast) {
    StreamedCamera mono("mono");
    ASSERT_EQ(HALOk, mono.Start());
    (void)mono.hal.TakeCodes();

    EXPECT_EQ(LeavingText, mono.StopPrinted(HALOk));

    std::vector<std::uint32_t> codes = mono.hal.TakeCodes();
    EXPECT_EQ(1u, Count(codes, FW_IOCTL_STREAM_ENTER));
    std::erase(codes, FW_IOCTL_STREAM_ENTER);
    std::erase(codes, FW_IOCTL_ATTACH_BUFFER);
    EXPECT_EQ((std::vector<std::uint32_t>{FW_IOCTL_STREAM_LEAVE, FW_IOCTL_STOP,
                                          FW_IOCTL_DETACH_BUFFERS, FW_IOCTL_ASYNC_WRITE}),
              codes);
    EXPECT_EQ(std::vector<std::uint32_t>{0}, mono.hal.world.ReadRegisterWrites().back().values);
    EXPECT_EQ(0u, mono.hal.world.GetState().pendedRequests);
    EXPECT_EQ(0u, mono.hal.world.GetState().isStreaming);
    EXPECT_EQ(nullptr, mono.Context().ring);
}

TEST(FWCameraStream, AStartWhileStreamingAndAStopWhileIdleDoNothing) {
    const FastWaits fast;
    StreamedCamera mono(QuietMono);

    EXPECT_EQ(HALOk, mono.Stop());
    EXPECT_TRUE(mono.hal.TakeCodes().empty());

    ASSERT_EQ(HALOk, mono.Start());
    const std::uint32_t served = mono.hal.world.GetState().requestsServed;
    EXPECT_EQ(HALOk, mono.Start());
    EXPECT_LE(mono.hal.world.GetState().requestsServed, served + 1);  // The loop's enter request.
    EXPECT_EQ(HALOk, mono.Stop());
}

TEST(FWCameraStream, FramesArriveInTheCamerasBuffersAsTheyWereSent) {
    StreamedCamera mono("mono");
    mono.SetUpImages();

    ASSERT_EQ(HALOk, mono.Start());
    ASSERT_TRUE(WaitUntil([&] { return mono.taker.images >= 5; }));
    EXPECT_EQ(HALOk, mono.Stop());

    const std::vector<TraceRecord> frames = mono.hal.world.ReadFrames();
    ASSERT_FALSE(frames.empty());
    EXPECT_EQ(frames[0].checksum, mono.taker.firstChecksum.load());
}

TEST(FWCameraStream, AStreamStartsAndStopsAgainAndAgain) {
    StreamedCamera mono("mono");
    mono.SetUpImages();
    for (std::uint32_t i = 0; i < 5; ++i) {
        const std::uint32_t before = mono.taker.images;
        ASSERT_EQ(HALOk, mono.Start());
        ASSERT_TRUE(WaitUntil([&] { return mono.taker.images > before; }));
        ASSERT_EQ(HALOk, mono.Stop());
        EXPECT_EQ(0u, mono.hal.world.GetState().pendedRequests);
    }
}

TEST(FWCameraStream, AStaleParameterSetNumberNeverBecomesAnImage) {
    StreamedCamera mono("mono");
    mono.SetUpImages();
    mono.taker.frame.psn = ImagePsn + 1;

    ASSERT_EQ(HALOk, mono.Start());
    ASSERT_TRUE(WaitUntil([&] { return mono.taker.peeks >= 3; }));
    ASSERT_EQ(HALOk, mono.Stop());

    EXPECT_EQ(0u, mono.taker.images);
    EXPECT_EQ(FrameRefused, mono.taker.frame.frameStatus);
}

TEST(FWCameraStream, ARefusedListenIs18AndLeavesTheLoopRunning) {
    StreamedCamera mono(QuietMono);
    const FastWaits fast;
    mono.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_LISTEN"})");

    EXPECT_EQ(HALReadFailed, mono.Start());

    EXPECT_EQ(1, mono.Context().streaming.load());
    EXPECT_TRUE(mono.hal.world.ReadRegisterWrites().empty());
    ASSERT_TRUE(WaitUntil([&] { return mono.hal.world.GetState().pendedRequests == 61; }));
    EXPECT_EQ(HALOk, mono.Start());
    EXPECT_EQ(HALOk, mono.Stop());
    EXPECT_EQ(0u, mono.hal.world.GetState().pendedRequests);
}

TEST(FWCameraStream, APendedListenThatFailsIs18) {
    const FastWaits fast;
    StreamedCamera mono(QuietMono);
    mono.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_LISTEN","pended":true})");

    EXPECT_EQ(HALReadFailed, mono.Start());
    EXPECT_EQ(HALOk, mono.Stop());
}

TEST(FWCameraStream, TheResultOfTheRegisterWriteIsTheResultOfTheStart) {
    const FastWaits fast;
    StreamedCamera mono(QuietMono);
    mono.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_ASYNC_WRITE","count":2})");

    EXPECT_EQ(HALWriteFailed, mono.Start());
    EXPECT_EQ(HALWriteFailed, mono.Stop());
    EXPECT_EQ(nullptr, mono.Context().ring);
}

TEST(FWCameraStream, WithoutPacketsAStopWaitsFiveSecondsAndEndsTheLoopFromOutside) {
    StreamedCamera mono(QuietMono);
    ASSERT_EQ(HALOk, mono.Start());
    ASSERT_TRUE(WaitUntil([&] { return mono.hal.world.GetState().pendedRequests == 61; }));
    (void)mono.hal.TakeCodes();

    const auto begin = std::chrono::steady_clock::now();
    EXPECT_EQ("", mono.StopPrinted(HALOk));
    const auto waited = std::chrono::steady_clock::now() - begin;

    EXPECT_GE(waited, 5000ms);
    EXPECT_LT(waited, 9000ms);
    EXPECT_EQ(0u, Count(mono.hal.TakeCodes(), FW_IOCTL_STREAM_LEAVE));
    EXPECT_EQ(0u, mono.hal.world.GetState().pendedRequests);
}

TEST(FWCameraStream, WithPacketsAStopIsQuick) {
    StreamedCamera mono("mono");
    ASSERT_EQ(HALOk, mono.Start());

    const auto begin = std::chrono::steady_clock::now();
    EXPECT_EQ(HALOk, mono.Stop());

    EXPECT_LT(std::chrono::steady_clock::now() - begin, 4000ms);
}

TEST(FWCameraStream, ARequestRefusedAtTheStartIsNotLookedAt) {
    StreamedCamera mono("mono");
    mono.SetUpImages();
    mono.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_ATTACH_BUFFER","request":1})");

    ASSERT_EQ(HALOk, mono.Start());

    EXPECT_TRUE(WaitUntil([&] { return mono.taker.images >= 3; }));
    EXPECT_EQ(HALOk, mono.Stop());
}

TEST(FWCameraStream, ARequestThatFailsIsParsedAsItStandsAndResubmitted) {
    StreamedCamera mono("mono");
    mono.SetUpImages();
    mono.AddFault(
        R"({"kind":"failRequest","code":"FW_IOCTL_ATTACH_BUFFER","request":70,"pended":true})");

    ASSERT_EQ(HALOk, mono.Start());

    EXPECT_TRUE(WaitUntil([&] { return mono.taker.images >= 20; }));
    EXPECT_EQ(HALOk, mono.Stop());
}

TEST(FWCameraStream, AResubmissionThatFailsEndsTheLoopWhileTheContextGoesOnStreaming) {
    const FastWaits fast;
    StreamedCamera mono("mono");
    mono.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_ATTACH_BUFFER","request":61})");

    testing::internal::CaptureStdout();
    ASSERT_EQ(HALOk, mono.Start());
    EXPECT_TRUE(WaitUntil([&] { return Count(mono.hal.TakeCodes(), FW_IOCTL_STREAM_LEAVE) == 1; }));
    EXPECT_EQ(1, mono.Context().streaming.load());
    EXPECT_EQ(HALOk, mono.Start());
    EXPECT_EQ(HALOk, mono.Stop());
    EXPECT_EQ(LeavingText, testing::internal::GetCapturedStdout());
    EXPECT_EQ(0u, Count(mono.hal.TakeCodes(), FW_IOCTL_STREAM_LEAVE));
}

TEST(FWCameraStream, AStopWaitsInVainForALoopThatHasLeftByItself) {
    const FastWaits fast(/*divisor=*/20);
    StreamedCamera mono("mono");
    mono.AddFault(R"({"kind":"failRequest","code":"FW_IOCTL_ATTACH_BUFFER","request":61})");
    ASSERT_EQ(HALOk, mono.Start());
    ASSERT_TRUE(WaitUntil([&] { return Count(mono.hal.TakeCodes(), FW_IOCTL_STREAM_LEAVE) == 1; }));

    const auto begin = std::chrono::steady_clock::now();
    EXPECT_EQ(HALOk, mono.Stop());

    EXPECT_GE(std::chrono::steady_clock::now() - begin, 250ms);
}

TEST(FWCameraStream, ARequestThatNeverCompletesIsTakenBackAtTheStop) {
    const FastWaits fast;
    StreamedCamera mono(QuietMono);
    mono.AddFault(R"({"kind":"neverComplete","code":"FW_IOCTL_ATTACH_BUFFER","count":0})");

    ASSERT_EQ(HALOk, mono.Start());
    EXPECT_EQ(HALOk, mono.Stop());

    EXPECT_EQ(0u, mono.hal.world.GetState().pendedRequests);
    EXPECT_EQ(nullptr, mono.Context().retiredRings);
}

TEST(FWCameraStream, ALoopThatTheDriverKeepsInItsLeaveFailsTheStopAndEndsWithTheDevice) {
    const FastWaits fast(/*divisor=*/5);
    StreamedCamera mono("mono");
    mono.AddFault(R"({"kind":"neverComplete","code":"FW_IOCTL_STREAM_LEAVE"})");
    ASSERT_EQ(HALOk, mono.Start());

    EXPECT_EQ(HALStopFailed, mono.Stop());
    EXPECT_NE(nullptr, mono.Context().ring);

    ASSERT_TRUE(mono.hal.world.Unplug());
    EXPECT_EQ(HALOk, HAL_CameraRelease(mono.camera));
    EXPECT_EQ(0u, mono.hal.world.GetState().openHandles);
}

struct FailedStop {
    const char* code;
    HALStatus status;
};

struct FailedStopRequest : testing::TestWithParam<FailedStop> {};

TEST_P(FailedStopRequest, KeepsTheBuffersUntilTheDeviceIsClosed) {
    const FastWaits fast;
    StreamedCamera mono(QuietMono);
    ASSERT_EQ(HALOk, mono.Start());
    mono.AddFault(std::string(R"({"kind":"failRequest","code":")") + GetParam().code + "\"}");
    (void)mono.hal.TakeCodes();

    EXPECT_EQ(GetParam().status, mono.Stop());

    EXPECT_EQ(0u, Count(mono.hal.TakeCodes(), FW_IOCTL_ASYNC_WRITE));
    EXPECT_EQ(0, mono.Context().streaming.load());
    EXPECT_NE(nullptr, mono.Context().retiredRings);
    EXPECT_EQ(HALOk, HAL_CameraDisconnect(mono.camera));
    EXPECT_EQ(nullptr, mono.Context().retiredRings);
}

TEST_P(FailedStopRequest, LeavesTheCameraFitForAnotherStream) {
    StreamedCamera mono("mono");
    mono.SetUpImages();
    ASSERT_EQ(HALOk, mono.Start());
    mono.AddFault(std::string(R"({"kind":"failRequest","code":")") + GetParam().code + "\"}");
    EXPECT_EQ(GetParam().status, mono.Stop());
    ASSERT_EQ(HALOk, HAL_CameraReallocateBandwidth(mono.camera, 500, 1));

    const std::uint32_t before = mono.taker.images;
    EXPECT_EQ(HALOk, mono.Start());
    EXPECT_TRUE(WaitUntil([&] { return mono.taker.images > before; }));
    EXPECT_EQ(HALOk, mono.Stop());
}

INSTANTIATE_TEST_SUITE_P(Codes, FailedStopRequest,
                         testing::Values(FailedStop{"FW_IOCTL_STOP", HALStopFailed},
                                         FailedStop{"FW_IOCTL_DETACH_BUFFERS",
                                                    HALResourcesNotFreed}));

TEST(FWCameraStream, UnpluggingMidFrameEndsTheLoopAndTheStopAbandonsTheFrame) {
    const FastWaits fast;
    StreamedCamera mono("mono");
    mono.SetUpImages();
    mono.AddFault(R"({"kind":"unplug","frame":1,"packet":3})");

    ASSERT_EQ(HALOk, mono.Start());
    ASSERT_TRUE(WaitUntil([&] {
        return mono.hal.world.GetState().openHandles == 1 &&
               mono.hal.world.GetState().pendedRequests == 0;
    }));
    EXPECT_EQ(HALStopFailed, mono.Stop());

    EXPECT_EQ(0u, mono.taker.images);
    if (mono.taker.peeks != 0) {
        EXPECT_EQ(0u, mono.taker.frame.bufferSize);
        EXPECT_FALSE(mono.taker.frame.isHeld);
    }
    EXPECT_EQ(HALResourcesNotFreed, HAL_CameraDisconnect(mono.camera));
    EXPECT_EQ(1, mono.camera->connected);
}

TEST(FWCameraStream, AFrameInHandIsAbandonedAtTheStopWithoutBeingReported) {
    const FastWaits fast;
    StreamedCamera mono(QuietMono);
    ASSERT_EQ(HALOk, mono.Start());
    mono.taker.frame.isHeld = true;
    mono.Context().assembler.current = &mono.taker.frame;

    EXPECT_EQ(HALOk, mono.Stop());

    EXPECT_EQ(nullptr, mono.Context().assembler.current);
    EXPECT_EQ(0u, mono.taker.frame.bufferSize);
    EXPECT_FALSE(mono.taker.frame.isHeld);
    EXPECT_EQ(0u, mono.taker.images);
}

TEST(FWCameraStream, AFrameThatBeginsBeforeTheLoopSeesTheStopIsAbandonedToo) {
    const FastWaits fast(/*divisor=*/5);
    StreamedCamera mono(QuietMono);
    ASSERT_EQ(HALOk, mono.Start());
    // Stands for a loop that was about to parse a request when the stop came.
    std::thread lateLoop([&] {
        EXPECT_TRUE(WaitUntil([&] { return mono.Context().streaming.load() == 0; }));
        const MutexHold hold(mono.Context().streamMutex);
        mono.taker.frame.isHeld = true;
        mono.Context().assembler.current = &mono.taker.frame;
    });

    EXPECT_EQ(HALOk, mono.Stop());
    lateLoop.join();

    EXPECT_EQ(nullptr, mono.Context().assembler.current);
    EXPECT_EQ(0u, mono.taker.frame.bufferSize);
    EXPECT_FALSE(mono.taker.frame.isHeld);
}

TEST(FWCameraStream, ADisconnectAbandonsAFrameInHand) {
    const FastWaits fast;
    StreamedCamera mono(QuietMono);
    ASSERT_EQ(HALOk, mono.Start());
    mono.taker.frame.isHeld = true;
    mono.Context().assembler.current = &mono.taker.frame;

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(mono.camera));

    EXPECT_EQ(nullptr, mono.Context().assembler.current);
    EXPECT_FALSE(mono.taker.frame.isHeld);
}

TEST(FWCameraStream, AReleaseWhileStreamingEndsTheLoopAndFreesAll) {
    StreamedCamera mono("mono");
    mono.SetUpImages();
    ASSERT_EQ(HALOk, mono.Start());
    ASSERT_TRUE(WaitUntil([&] { return mono.taker.images != 0; }));

    EXPECT_EQ(HALOk, HAL_CameraRelease(mono.camera));

    EXPECT_EQ(0u, mono.hal.world.GetState().openHandles);
    EXPECT_EQ(0u, mono.hal.world.GetState().pendedRequests);
}

TEST(FWCameraStream, ADisconnectWhileStreamingEndsTheLoop) {
    StreamedCamera mono("mono");
    mono.SetUpImages();
    ASSERT_EQ(HALOk, mono.Start());
    ASSERT_TRUE(WaitUntil([&] { return mono.taker.images != 0; }));

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(mono.camera));

    EXPECT_EQ(0u, mono.hal.world.GetState().openHandles);
    EXPECT_EQ(HALOk, mono.Stop());
    EXPECT_EQ(HALReadFailed, mono.Start());
}

TEST(FWCameraStream, OnlyTheBlockCounterIsClearedForANewStream) {
    const FastWaits fast;
    StreamedCamera mono(QuietMono);
    StreamAssembler& assembler = mono.Context().assembler;
    assembler.blockCounter = 9;
    assembler.blockLeft = 8;
    assembler.remaining = 7;

    ASSERT_EQ(HALOk, HAL_CameraStartStreaming(mono.camera, StreamSwitchAddress, 2, nullptr));
    EXPECT_EQ(HALOk, mono.Stop());

    EXPECT_EQ(2, assembler.streamingVersion);
    EXPECT_EQ(0, assembler.blockCounter);
    EXPECT_EQ(8, assembler.blockLeft);
    EXPECT_EQ(7u, assembler.remaining);
}

TEST(FWCameraStream, TheWaitForAFrameLastsUntilItIsReleased) {
    StreamedCamera mono("mono");
    std::atomic<bool> hasReturned{false};
    std::thread waiter([&] {
        EXPECT_EQ(HALOk, HAL_CameraWaitingForFrame(mono.camera));
        hasReturned = true;
    });
    EXPECT_FALSE(WaitUntil([&] { return hasReturned.load(); }, 30ms));

    // A signal before the wait's own clearing is lost.
    EXPECT_TRUE(WaitUntil([&] {
        EXPECT_EQ(HALOk, HAL_CameraStopWaitingForFrame(mono.camera));
        return hasReturned.load();
    }));
    waiter.join();
}

TEST(FWCameraStream, ASignalBeforeTheWaitIsLost) {
    StreamedCamera mono("mono");
    ASSERT_EQ(HALOk, HAL_CameraStopWaitingForFrame(mono.camera));
    std::atomic<bool> hasReturned{false};
    std::thread waiter([&] {
        (void)HAL_CameraWaitingForFrame(mono.camera);
        hasReturned = true;
    });

    EXPECT_FALSE(WaitUntil([&] { return hasReturned.load(); }, 30ms));

    EXPECT_EQ(HALOk, HAL_CameraDisconnect(mono.camera));
    waiter.join();
}

TEST(FWCameraStream, WithoutAConnectionTheWaitReturnsAtOnce) {
    StreamedCamera mono("mono");
    ASSERT_EQ(HALOk, HAL_CameraDisconnect(mono.camera));

    EXPECT_EQ(HALOk, HAL_CameraWaitingForFrame(mono.camera));
    EXPECT_EQ(HALOk, HAL_CameraStopWaitingForFrame(mono.camera));
}

}  // namespace
}  // namespace ZV::Test
