#include <gtest/gtest.h>

#include "camera/camera.h"
#include "simulation/register_file.h"
#include "support/flat_camera.h"
#include "support/settings_words.h"

// What a block that was sent or queued means for the frames and the calls that follow.
namespace ZV::Test {
namespace {

class QueuedSettings : public OpenedCamera {
  protected:
    explicit QueuedSettings(std::string_view scenario = SmallMono) : OpenedCamera(scenario) {}

    void SetUp() override {
        OpenedCamera::SetUp();
        ASSERT_ZERR(zerrNone, Zentara_ReadDefaultSettings(handle, &block));
    }

    ZentaraResult QueueBlock(std::uint32_t flags = zcbFrameDone, std::uint32_t userData = 0) {
        return Zentara_QueueSettings(handle, &block, CallbackLog::Record, flags, calls.GetPrivate(),
                                     userData);
    }
    void Send() { ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &block)); }
    void SendTrigger(std::uint32_t mode) {
        SetWord(block, zprmTriggerType, mode);
        Send();
    }
    /// Streams until this many callbacks have come.
    void StreamUntil(std::size_t count) {
        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
        EXPECT_TRUE(calls.WaitForCalls(count));
        EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
        EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
    }
    std::uint32_t PeekOffset() const {
        return (world.Peek(Simulation::ControlAddress + 4 * 5) >> 4) & 0xFFF;
    }

    Zentara_Settings block{};
    CallbackLog calls;
};

// ---- With an empty queue ----

struct SeenAtCall {
    const SimulationWorld* world;
    std::uint32_t trigger;
    std::thread::id thread;
};

void LookAtTrigger(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t) {
    auto* const seen = reinterpret_cast<SeenAtCall*>(static_cast<std::uintptr_t>(userPrivate));
    seen->trigger = seen->world->Peek(Simulation::ControlAddress + 4 * 11) & 0xF;
    seen->thread = std::this_thread::get_id();
}

TEST_F(QueuedSettings, AnEmptyQueueSendsAtOnceAndCallsBackFromTheCallingThreadBeforeReturning) {
    SeenAtCall seen{&world, 0, {}};
    SetWord(block, zprmTriggerType, 3);

    ASSERT_ZERR(zerrNone, Zentara_QueueSettings(handle, &block, LookAtTrigger, zcbFrameDone,
                                                reinterpret_cast<std::uintptr_t>(&seen), 0));

    EXPECT_EQ(3u, seen.trigger) << "the camera had it at the callback";
    EXPECT_EQ(std::this_thread::get_id(), seen.thread);
}

TEST_F(QueuedSettings, AFailureAtOnceIsTheResultAndIsToldTheCallbackWithTheFlagsAsGiven) {
    SetWord(block, zprmBinning, 5);

    EXPECT_ZERR(zerrDriverFault, QueueBlock(0xF1, 9));

    const auto heard = calls.GetCalls();
    ASSERT_EQ(1u, heard.size());
    EXPECT_ZERR(zerrDriverFault, heard[0].errorCode);
    EXPECT_EQ(0xF1u, heard[0].flags);
    EXPECT_EQ(9u, heard[0].userData);
}

TEST_F(QueuedSettings, ABlockAppliedAtOnceComesBackMended) {
    SetWide(block, zprm64Exposure, 1);

    ASSERT_ZERR(zerrNone, QueueBlock());

    EXPECT_EQ(10'000u, GetWide(block, zprm64Exposure));
}

TEST_F(QueuedSettings, ADepthThatDiffersIsRefusedAndNothingIsSent) {
    SetWord(block, zprmImageFormat, zfmtMono16);
    const std::size_t before = world.ReadRegisterWrites().size();

    EXPECT_ZERR(zerrBadSettings, QueueBlock());

    EXPECT_EQ(before, world.ReadRegisterWrites().size());
    EXPECT_EQ(0u, calls.CountCalls());
}

// Binning is not compared, and so a block may change it behind a frame.
TEST_F(QueuedSettings, BinningMayBeChangedAtOnce) {
    SetWord(block, zprmBinning, 2);

    // The region of the block is that of the present binning, which the mending then cuts.
    EXPECT_ZERR(zerrNone, QueueBlock());

    EXPECT_EQ(2u, GetWord(ReadSettings(), zprmBinning));
    EXPECT_EQ(32u, GetWord(block, zprmRoiWidth));
}

// ---- While the camera streams ----

TEST_F(QueuedSettings, AChangeBetweenTwoFramesIsAppliedAndBothFramesAreDeliveredInOrder) {
    Send();
    const std::uint32_t before = PeekOffset();
    ClientFrame first(GetImageBytes()), second(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(first, calls, zcbFrameDone, 1));
    SetSigned(block, zprmS32AbsoluteOffset, 5);
    ASSERT_ZERR(zerrNone, QueueBlock(zcbFrameDone, 2));
    ASSERT_ZERR(zerrNone, Queue(second, calls, zcbFrameDone, 3));

    StreamUntil(3);

    EXPECT_EQ(before + 5, PeekOffset());
    // The exposure's thread may still be inside the change while the run loop delivers both frames.
    std::vector<std::uint32_t> frames;
    for (const CallbackLog::Call& call : calls.GetCalls()) {
        EXPECT_ZERR(zerrNone, call.errorCode);
        if (call.userData != 2) frames.push_back(call.userData);
    }
    EXPECT_EQ((std::vector<std::uint32_t>{1, 3}), frames);
}

TEST_F(QueuedSettings, AChangeBehindALoneFrameIsAppliedByItsExposureOrGoesWithTheNextImage) {
    Send();
    ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbFrameDone, 1));
    SetSigned(block, zprmS32AbsoluteOffset, 5);
    ASSERT_ZERR(zerrNone, QueueBlock(zcbFrameDone, 2));

    StreamUntil(1);

    EXPECT_LE(calls.CountCalls(), 2u);
}

// ---- The trigger ----

TEST_F(QueuedSettings, OnlyTheSoftwareTriggerModeCanBeTriggered) {
    for (std::uint32_t mode = 0; mode < 8; ++mode) {
        SendTrigger(mode);
        ASSERT_ZERR(zerrNotStreaming, Zentara_Trigger(handle));
        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

        EXPECT_ZERR(mode == 5 ? zerrNone : zerrNotSupported, Zentara_Trigger(handle)) << mode;

        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    }
}

TEST_F(QueuedSettings, ATriggeredCameraGivesOneFramePerTrigger) {
    SendTrigger(5);
    ClientFrame first(GetImageBytes()), second(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(first, calls, zcbFrameDone, 1));
    ASSERT_ZERR(zerrNone, Queue(second, calls, zcbFrameDone, 2));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    ASSERT_ZERR(zerrNone, Zentara_Trigger(handle));
    EXPECT_TRUE(calls.WaitForCalls(1));
    EXPECT_EQ(1u, calls.CountCalls());
    ASSERT_ZERR(zerrNone, Zentara_Trigger(handle));
    EXPECT_TRUE(calls.WaitForCalls(2));

    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
}

// ---- Formats ----

TEST_F(QueuedSettings, TheImageSizeFollowsDepthBinningAndWheel) {
    SetWord(block, zprmImageFormat, zfmtMono16);
    Send();
    EXPECT_EQ(64u * 48 * 2, GetInfo(zinfImageSize)) << "twelve bits";

    SetWord(block, zprmBinning, 2);
    Send();
    EXPECT_EQ(32u * 24 * 2, GetInfo(zinfImageSize));

    SetWord(block, zprmImageFormat, zfmtRGB48);
    Send();
    EXPECT_EQ(32u * 24 * 6, GetInfo(zinfImageSize)) << "what the wheel makes of three images";

    SetWord(block, zprmImageFormat, zfmtMono8);
    Send();
    EXPECT_EQ(32u * 24, GetInfo(zinfImageSize));
}

class QueuedColourSettings : public QueuedSettings {
  protected:
    QueuedColourSettings() : QueuedSettings(SmallColour) {}

    /// Post-processing on, to 24 bits per pixel.
    void SendFormat(std::uint32_t format) {
        SetWord(block, zprmImageFormat, format);
        SetWord(block, zprmDoPostProcessing, 1);
        Send();
    }
};

TEST_F(QueuedColourSettings, ARawFormatDeliversTheCamerasSamplesWhateverPostProcessingSays) {
    for (const std::uint32_t raw : {zfmtRaw8, zfmtRaw16}) {
        SendFormat(raw);
        const std::uint32_t bytes = 64 * 48 * (raw == zfmtRaw8 ? 1 : 2);
        ASSERT_EQ(bytes, GetInfo(zinfImageSize));
        ClientFrame frame(4 * bytes), streamed(4 * bytes);

        ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
        ASSERT_ZERR(zerrNone, Queue(streamed, calls, zcbFrameDone));
        StreamUntil(calls.CountCalls() + 1);

        for (ClientFrame* delivered : {&frame, &streamed}) {
            EXPECT_EQ(raw, (*delivered)->format);
            EXPECT_EQ(bytes, (*delivered)->size);
            EXPECT_ZERR(zerrNone, (*delivered)->errorCode);
        }
    }
}

// Kept: word and depth need not agree; the label is the word's.
TEST_F(QueuedColourSettings, AFrameIsCalledRawByTheWordAlone) {
    SendFormat(zfmtRaw8);
    ClientFrame frame(64 * 48 * 2);
    auto& camera = *reinterpret_cast<ZCamera*>(handle);
    ASSERT_EQ(CameraOk, camera.SetBitDepth(12));
    ASSERT_EQ(CameraOk, camera.UpdateSettingsOnCamera());

    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));

    EXPECT_EQ(zfmtRaw8, frame->format);
    EXPECT_EQ(12u, frame->bits);
    EXPECT_EQ(64u * 48 * 2, frame->size);
}

}  // namespace
}  // namespace ZV::Test
