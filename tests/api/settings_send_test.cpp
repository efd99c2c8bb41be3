#include <gtest/gtest.h>

#include <future>

#include "api/camera_context.h"
#include "api/delivery.h"
#include "api/entry_queue.h"
#include "api/handles.h"
#include "imaging/ex_image.h"
#include "simulation/register_file.h"
#include "support/flat_camera.h"
#include "support/settings_words.h"

// What a send leaves in the library's own record of a camera. The camera does not stream: the tests
// call what its engine calls, one event at a time.
namespace ZV {
namespace {

using Test::AreSameBytes;
using Test::CallbackLog;
using Test::ClientFrame;
using Test::GetWord;
using Test::MakeFilledBlock;
using Test::SettingsMagicWord;
using Test::SetWord;
using Test::WaitUntil;

class SendRecord : public Test::OpenedCamera {
  protected:
    void SetUp() override {
        OpenedCamera::SetUp();
        ASSERT_ZERR(zerrNone, Zentara_ReadDefaultSettings(handle, &block));
    }

    CameraContext& GetContext() { return *GetCameraContext(*FindCamera(handle)); }
    ZentaraResult Send() { return Zentara_SendSettingsToCam(handle, &block); }
    /// A send whose trigger mode the camera refuses.
    void FailToSend() {
        SetWord(block, zprmRoiX, GetWord(block, zprmRoiX) + 2);
        const std::uint32_t another = FindCamera(handle)->GetTriggerMode() % 4 + 1;
        SetWord(block, zprmTriggerType, another);
        ASSERT_TRUE(world.AddFault(
            R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "address": )" +
            std::to_string(Simulation::ControlAddress + 4 * 11) + "}"));
        ASSERT_ZERR(zerrDriverFault, Send());
    }
    ZentaraResult QueueChange(Zentara_Settings* change) {
        return Zentara_QueueSettings(handle, change, nullptr, 0, 0, 0);
    }
    void EndExposure() { EXPECT_EQ(nullptr, ExposeDone(FindCamera(handle))); }
    void ReceiveImage() {
        const std::uint32_t bytes = GetImageBytes();
        auto* const pixels = static_cast<std::uint8_t*>(std::calloc(bytes, 1));
        auto* const image =
            new ZExImage(pixels, bytes, 64, 48, 8, 1000, 1.0, Mono8, CameraMono, PatternRed, 0,
                         false, 5, 0, 1, false, 17, 0, nullptr, true);
        ZImageReceivedCallbackStruct record{image, FindCamera(handle), 0};
        EXPECT_EQ(nullptr, ImageReceived(&record));
    }
    std::uint32_t PeekTrigger() { return world.Peek(Simulation::ControlAddress + 4 * 11) & 0x10F; }

    Zentara_Settings block{};
    CallbackLog calls;
};

TEST_F(SendRecord, AfterOpeningNoBlockCountsAsSent) {
    EXPECT_TRUE(AreSameBytes(MakeFilledBlock(0xCD), GetLastSettings(GetContext())));
}

TEST_F(SendRecord, ASendThatSucceedsLeavesItsBlockAndNoSendInProgress) {
    SetWord(block, zprmRoiWidth, 1000);

    ASSERT_ZERR(zerrNone, Send());

    EXPECT_EQ(64u, GetWord(block, zprmRoiWidth));
    EXPECT_TRUE(AreSameBytes(block, GetLastSettings(GetContext()))) << "as read back, whole";
    EXPECT_EQ(0, GetContext().sendInProgress);
}

// Kept: a send that failed counts as under way until the next good one.
TEST_F(SendRecord, ASendThatFailsStaysInProgressAndLeavesTheFormerBlock) {
    ASSERT_ZERR(zerrNone, Send());
    const Zentara_Settings former = GetLastSettings(GetContext());

    FailToSend();
    EXPECT_EQ(1, GetContext().sendInProgress);
    EXPECT_TRUE(AreSameBytes(former, GetLastSettings(GetContext())));
    FailToSend();
    EXPECT_EQ(1, GetContext().sendInProgress);

    EXPECT_ZERR(zerrNone, Send());
    EXPECT_EQ(0, GetContext().sendInProgress);
}

// Kept: an exposure that ends then goes on without the queue's lock, which somebody else may hold.
TEST_F(SendRecord, AFailingTriggerLeavesTheRegionAppliedAndExposuresEndWithoutTheQueuesLock) {
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbExposeDone));
    FailToSend();
    EXPECT_EQ(2u, FindCamera(handle)->GetROIX());
    EXPECT_EQ(62u, FindCamera(handle)->GetROIWidth());
    EXPECT_EQ(0u, PeekTrigger());
    GetContext().queueLock->Wait();

    auto exposure = std::async(std::launch::async, [&] { EndExposure(); });
    EXPECT_EQ(std::future_status::ready, exposure.wait_for(std::chrono::seconds(10)));

    GetContext().queueLock->Signal();
    exposure.get();
    EXPECT_EQ(1u, calls.CountCalls());
    EXPECT_ZERR(zerrNone, Send()) << "the lock has one unit";
    EXPECT_EQ(0, GetContext().sendInProgress);
}

TEST_F(SendRecord, AfterAGoodSendAnExposureWaitsForTheQueuesLock) {
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbExposeDone));
    ASSERT_ZERR(zerrNone, Send());
    GetContext().queueLock->Wait();

    auto exposure = std::async(std::launch::async, [&] { EndExposure(); });
    EXPECT_EQ(std::future_status::timeout, exposure.wait_for(std::chrono::milliseconds(20)));
    EXPECT_EQ(0u, calls.CountCalls());

    GetContext().queueLock->Signal();
    exposure.get();
    EXPECT_EQ(1u, calls.CountCalls());
}

// Kept: the change behind a frame then waits for the image.
TEST_F(SendRecord, AfterAFailedSendNoChangeIsAppliedEarly) {
    ClientFrame frame(GetImageBytes()), second(GetImageBytes());
    Zentara_Settings change = ReadSettings();
    SetWord(change, zprmTriggerType, 3);
    ASSERT_ZERR(zerrNone, Queue(frame, calls, 0));
    ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, &change, CallbackLog::Record, zcbFrameDone,
                                                calls.GetPrivate(), 7));
    ASSERT_ZERR(zerrNone, Queue(second, calls, 0));
    GetContext().sendInProgress = 1;

    EndExposure();
    EXPECT_EQ(0u, calls.CountCalls());
    EXPECT_EQ(0u, PeekTrigger());

    ReceiveImage();
    EXPECT_EQ(1u, calls.CountCalls());
    EXPECT_EQ(3u, PeekTrigger());
    EXPECT_EQ(0, GetContext().sendInProgress) << "that send was a good one";
}

TEST_F(SendRecord, AChangeBehindAFrameIsOnTheCameraWhenTheExposureEnds) {
    ClientFrame frame(GetImageBytes());
    Zentara_Settings change = ReadSettings();
    SetWord(change, zprmTriggerType, 3);
    ASSERT_ZERR(zerrNone, Queue(frame, calls, 0));
    ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, &change, CallbackLog::Record, zcbFrameDone,
                                                calls.GetPrivate(), 7));
    EXPECT_EQ(0u, PeekTrigger());

    EndExposure();

    EXPECT_EQ(3u, PeekTrigger());
    ASSERT_EQ(1u, calls.CountCalls());
    EXPECT_ZERR(zerrNone, calls.GetCalls()[0].errorCode);
    EXPECT_TRUE(AreSameBytes(change, GetLastSettings(GetContext())));
}

TEST_F(SendRecord, AChangeThatTheCameraRefusesTellsItsCallback) {
    ClientFrame frame(GetImageBytes());
    Zentara_Settings change = ReadSettings();
    SetWord(change, zprmBinning, 5);
    ASSERT_ZERR(zerrNone, Queue(frame, calls, 0));
    ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, &change, CallbackLog::Record, 0xF1,
                                                calls.GetPrivate(), 7));

    EndExposure();

    const auto heard = calls.GetCalls();
    ASSERT_EQ(1u, heard.size());
    EXPECT_ZERR(zerrDriverFault, heard[0].errorCode);
    EXPECT_EQ(0xF1u, heard[0].flags);
    EXPECT_EQ(7u, heard[0].userData);
    EXPECT_EQ(1, GetContext().sendInProgress);
}

TEST_F(SendRecord, AChangeBehindADeliveredFrameThatTheCameraRefusesTellsItsCallback) {
    ClientFrame frame(GetImageBytes()), second(GetImageBytes());
    Zentara_Settings change = ReadSettings();
    SetWord(change, zprmBinning, 5);
    ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbFrameDone, 1));
    ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, &change, CallbackLog::Record, 0xF1,
                                                calls.GetPrivate(), 7));
    ASSERT_ZERR(zerrNone, Queue(second, calls, zcbFrameDone, 2));

    ReceiveImage();

    const auto heard = calls.GetCalls();
    ASSERT_EQ(2u, heard.size());
    EXPECT_EQ(1u, heard[0].userData);
    EXPECT_ZERR(zerrNone, heard[0].errorCode);
    EXPECT_EQ(7u, heard[1].userData);
    EXPECT_ZERR(zerrDriverFault, heard[1].errorCode);
    EXPECT_EQ(0xF1u, heard[1].flags);
    EXPECT_EQ(1u, GetQueueCount(GetContext()));
    EXPECT_EQ(1, GetContext().sendInProgress);
}

// ---- What queueing a change makes of an abort ----

TEST_F(SendRecord, AChangeAtOnceEndsTheAbortWhetherItSucceedsOrFails) {
    Zentara_Settings change = ReadSettings();
    for (const std::uint32_t binning : {1u, 5u}) {
        SetWord(change, zprmBinning, binning);
        ASSERT_ZERR(zerrNone, Zentara_Abort(handle));
        ASSERT_EQ(1, GetContext().abortRequested);

        EXPECT_ZERR(binning == 1 ? zerrNone : zerrDriverFault, QueueChange(&change));

        EXPECT_EQ(0, GetContext().abortRequested) << "binning " << binning;
    }
}

TEST_F(SendRecord, AChangeBehindAFrameEndsTheAbort) {
    ClientFrame frame(GetImageBytes());
    Zentara_Settings change = ReadSettings();
    ASSERT_ZERR(zerrNone, Queue(frame, calls, 0));
    GetContext().abortRequested = 1;

    EXPECT_ZERR(zerrNone, QueueChange(&change));

    EXPECT_EQ(0, GetContext().abortRequested);
}

TEST_F(SendRecord, ARefusedChangeLeavesTheAbort) {
    Zentara_Settings change = ReadSettings();
    Zentara_Settings moved = change, wrongMagic = change;
    SetWord(moved, zprmRoiX, 2);
    wrongMagic.privateWords[SettingsMagicWord] ^= 1;
    ASSERT_ZERR(zerrNone, Zentara_Abort(handle));

    EXPECT_ZERR(zerrBadSettings, QueueChange(nullptr));
    EXPECT_ZERR(zerrBadSettings, QueueChange(&wrongMagic));
    EXPECT_ZERR(zerrBadSettings, QueueChange(&moved));
    EXPECT_EQ(1, GetContext().abortRequested);

    ClientFrame frame(GetImageBytes());
    for (std::uint32_t i = 0; i < QueueCapacity; ++i) {
        ASSERT_ZERR(zerrNone, Queue(frame, calls, 0));
    }
    GetContext().abortRequested = 1;
    EXPECT_ZERR(zerrQueueFull, QueueChange(&change));
    EXPECT_EQ(1, GetContext().abortRequested);
}

// ---- What the settings leave in the record ----

TEST_F(SendRecord, PostProcessingIsOneForAnyWordButZero) {
    for (const std::uint32_t word : {1u, 7u, 256u, 0xFFFFFFFFu}) {
        SetWord(block, zprmDoPostProcessing, word);
        ASSERT_ZERR(zerrNone, Send());
        EXPECT_EQ(1, GetContext().postProcessing) << word;
    }

    SetWord(block, zprmDoPostProcessing, 0);
    ASSERT_ZERR(zerrNone, Send());
    EXPECT_EQ(0, GetContext().postProcessing);
}

// Kept: before the block is sent.
TEST_F(SendRecord, AskingForDefaultsSwitchesPostProcessingOffAndLeavesTheLastBlock) {
    SetWord(block, zprmDoPostProcessing, 1);
    ASSERT_ZERR(zerrNone, Send());
    const Zentara_Settings last = GetLastSettings(GetContext());

    ASSERT_ZERR(zerrNone, Zentara_ReadDefaultSettings(handle, &block));

    EXPECT_EQ(0, GetContext().postProcessing);
    EXPECT_TRUE(AreSameBytes(last, GetLastSettings(GetContext())));
}

TEST_F(SendRecord, ScalesAreSinglePrecisionThousandths) {
    SetWord(block, zprmPostProcessGainRed, 1160);
    SetWord(block, zprmPostProcessGainGreen, 0);
    SetWord(block, zprmPostProcessGainBlue, 0xFFFFFFFF);

    ASSERT_ZERR(zerrNone, Send());

    EXPECT_EQ(1160.0f / 1000.0f, GetContext().whiteBalance->GetRedScale());
    EXPECT_EQ(0.0f, GetContext().whiteBalance->GetGreenScale());
    EXPECT_EQ(4294967296.0f / 1000.0f, GetContext().whiteBalance->GetBlueScale());
}

TEST_F(SendRecord, TheFormatOfPostProcessingIsTakenAsItIs) {
    for (const std::uint32_t format : {0u, 8u, 12u, 13u, 0xFFFFFFFFu}) {
        SetWord(block, zprmPostProcessImageFormat, format);

        ASSERT_ZERR(zerrNone, Send());

        EXPECT_EQ(format, GetContext().bayerFilter->GetOutputFormat());
    }
}

TEST_F(SendRecord, OnlyAColourFormatChangesTheOutputOfTheWheel) {
    for (std::uint32_t format = 6; format <= 12; ++format) {
        SetWord(block, zprmImageFormat, format);
        ASSERT_ZERR(zerrNone, Send());
        EXPECT_EQ(format, GetContext().rgbWheel->GetOutputFormat());
    }

    SetWord(block, zprmImageFormat, zfmtMono8);
    ASSERT_ZERR(zerrNone, Send());
    EXPECT_EQ(12u, GetContext().rgbWheel->GetOutputFormat());
}

TEST_F(SendRecord, AFailedSendLeavesPostProcessingAsItWas) {
    ASSERT_ZERR(zerrNone, Send());
    SetWord(block, zprmDoPostProcessing, 1);
    SetWord(block, zprmPostProcessGainRed, 3000);
    SetWord(block, zprmPostProcessImageFormat, 10);
    SetWord(block, zprmPostProcessBayerAlgorithm, 2);

    FailToSend();

    EXPECT_EQ(0, GetContext().postProcessing);
    EXPECT_EQ(1.16f, GetContext().whiteBalance->GetRedScale());
    EXPECT_EQ(2u, GetContext().bayerFilter->GetOutputFormat());
    EXPECT_EQ(1u, GetContext().bayerFilter->GetAlgorithm());
}

TEST_F(SendRecord, APreflightLeavesTheRecordAlone) {
    ASSERT_ZERR(zerrNone, Send());
    const Zentara_Settings last = GetLastSettings(GetContext());
    SetWord(block, zprmRoiX, 9999);

    ASSERT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));

    EXPECT_TRUE(AreSameBytes(last, GetLastSettings(GetContext())));
    EXPECT_EQ(0, GetContext().sendInProgress);
}

TEST_F(SendRecord, ASendWaitsForTheQueuesLock) {
    SetWord(block, zprmTriggerType, 3);
    const std::size_t before = world.ReadRegisterWrites().size();
    GetContext().queueLock->Wait();

    auto client = std::async(std::launch::async, [&] { return Send(); });
    EXPECT_EQ(std::future_status::timeout, client.wait_for(std::chrono::milliseconds(50)));
    EXPECT_EQ(before, world.ReadRegisterWrites().size());
    EXPECT_EQ(0, GetContext().sendInProgress);

    GetContext().queueLock->Signal();
    EXPECT_ZERR(zerrNone, client.get());
    EXPECT_EQ(3u, PeekTrigger());
}

// A camera that does not answer holds the send in its middle.
TEST_F(SendRecord, AClientThatQueuesWaitsForTheEndOfASend) {
    SetWord(block, zprmTriggerType, 3);
    ClientFrame frame(GetImageBytes());
    ASSERT_TRUE(
        world.AddFault(R"({"kind": "neverComplete", "code": "FW_IOCTL_ASYNC_WRITE", "address": )" +
                       std::to_string(Simulation::ControlAddress + 4 * 11) + "}"));
    const auto pended = world.GetState().pendedRequests;

    auto sending = std::async(std::launch::async, [&] { return Send(); });
    EXPECT_TRUE(WaitUntil([&] { return world.GetState().pendedRequests > pended; }));
    auto queueing = std::async(std::launch::async, [&] { return Queue(frame, calls, 0); });
    EXPECT_EQ(std::future_status::timeout, queueing.wait_for(std::chrono::milliseconds(50)));
    EXPECT_EQ(1, GetContext().sendInProgress);

    EXPECT_TRUE(world.Unplug());
    EXPECT_ZERR(zerrDriverFault, sending.get());
    EXPECT_ZERR(zerrNone, queueing.get());
}

TEST_F(SendRecord, SendsOfSeveralThreadsComeOneAfterTheOther) {
    constexpr int Threads = 3, Sends = 20;
    std::vector<std::future<void>> clients;
    for (int i = 0; i < Threads; ++i) {
        clients.push_back(std::async(std::launch::async, [this, i] {
            Zentara_Settings own = block;
            for (int round = 0; round < Sends; ++round) {
                SetWord(own, zprmRoiWidth, 10 + static_cast<std::uint32_t>(i) * 10);
                SetWord(own, zprmRoiHeight, 10 + static_cast<std::uint32_t>(i) * 10);
                EXPECT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &own));
                EXPECT_EQ(GetWord(own, zprmRoiWidth), GetWord(own, zprmRoiHeight));
            }
        }));
    }
    for (std::future<void>& client : clients) client.get();

    const Zentara_Settings last = GetLastSettings(GetContext());
    EXPECT_EQ(GetWord(last, zprmRoiWidth), GetWord(ReadSettings(), zprmRoiWidth));
    EXPECT_EQ(0, GetContext().sendInProgress);
}

}  // namespace
}  // namespace ZV
