#include "api/camera_context.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <thread>

#include "api/handles.h"
#include "api/settings_block.h"
#include "hal/platform/clock.h"
#include "support/flat_camera.h"

namespace ZV {
namespace {

class Context : public Test::OpenedCamera {
  protected:
    explicit Context(std::string_view scenario = ZV::Test::SmallMono) : OpenedCamera(scenario) {}

    ZCamera& GetCamera() { return *FindCamera(handle); }
    CameraContext& GetContext() { return *GetCameraContext(GetCamera()); }
};

TEST_F(Context, StartsWithAnEmptyQueueAndWithoutPostProcessing) {
    EXPECT_EQ(0u, GetContext().queueCount);
    for (const QueueEntry* entry : GetContext().queue) EXPECT_EQ(nullptr, entry);
    EXPECT_EQ(0, GetContext().abortRequested);
    EXPECT_EQ(0, GetContext().sendInProgress);
    EXPECT_EQ(0, GetContext().postProcessing);
    EXPECT_EQ(6u, GetContext().rgbWheel->GetOutputFormat());
}

TEST_F(Context, BorrowsTheFiltersOfItsCamera) {
    EXPECT_EQ(GetCamera().GetBayerPipeline(), GetContext().bayerPipeline);
    EXPECT_EQ(GetCamera().GetBayerFilter(), GetContext().bayerFilter);
    EXPECT_EQ(GetCamera().GetFYRatioCorrectionFilter(), GetContext().ratioCorrection);
}

TEST_F(Context, KnowsNoSettingsUntilABlockIsReadSoThatAFirstSendIsAChange) {
    Zentara_Settings unknown;
    std::memset(&unknown, 0xCD, sizeof(unknown));
    const Zentara_Settings before = GetLastSettings(GetContext());
    EXPECT_EQ(0, std::memcmp(&unknown, &before, sizeof(before)));

    const Zentara_Settings read = ReadSettings();

    const Zentara_Settings after = GetLastSettings(GetContext());
    EXPECT_EQ(0, std::memcmp(&read, &after, sizeof(after)));
}

TEST_F(Context, TheWheelStandsInTheCamerasOwnPipelineUntilTheClose) {
    EXPECT_TRUE(GetCamera().GetImagePipeline()->RemoveFilter(GetContext().rgbWheel.get()));
    EXPECT_FALSE(GetCamera().GetImagePipeline()->RemoveFilter(GetContext().rgbWheel.get()));

    ZCamera* const camera = &GetCamera();
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    EXPECT_EQ(nullptr, GetCameraContext(*camera));
}

TEST_F(Context, PostProcessingRunsRatioThenBayerThenWhiteBalance) {
    CameraContext& context = GetContext();
    EXPECT_TRUE(context.postPipeline->RemoveFilter(context.ratioCorrection));
    EXPECT_TRUE(context.postPipeline->RemoveFilter(context.bayerFilter));
    EXPECT_TRUE(context.postPipeline->RemoveFilter(context.whiteBalance.get()));
    EXPECT_FALSE(context.postPipeline->RemoveFilter(context.rgbWheel.get()));
}

/// An exposure callback that stays inside until the test lets it go.
struct LastingCallback {
    std::atomic<bool> isInside{false};
    std::atomic<bool> mayLeave{false};
    std::atomic<bool> hasLeft{false};

    static void Stay(std::uint64_t userPrivate, std::uint32_t, std::uint32_t, std::uint32_t) {
        auto& self = *reinterpret_cast<LastingCallback*>(static_cast<std::uintptr_t>(userPrivate));
        self.isInside = true;
        EXPECT_TRUE(ZV::Test::WaitUntil([&] { return self.mayLeave.load(); }));
        self.hasLeft = true;
    }
};

/// One frame comes for each trigger, and never ends: its exposure is told by the exposure thread
/// alone.
class EndlessFrame : public Context {
  protected:
    EndlessFrame()
        : Context(R"({"base": "mono", "cameras": [{"faults":
              [{"kind": "losePacket", "packet": 1, "count": 0}]}]})") {}

    /// Closes while the exposure thread sits in the callback of a frame.
    void CloseUnderTheCallback() {
        ASSERT_ZERR(zerrNone,
                    Zentara_QueueFrame(handle, frame.Get(), LastingCallback::Stay, zcbExposeDone,
                                       reinterpret_cast<std::uintptr_t>(&callback), 0));
        ASSERT_EQ(CameraOk, GetCamera().SetTriggerMode(ztrigSoftware));
        ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
        ASSERT_ZERR(zerrNone, Zentara_Trigger(handle));
        ASSERT_TRUE(ZV::Test::WaitUntil([&] { return callback.isInside.load(); }));
        SetWaitClockDivisor(1000);
        EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
        SetWaitClockDivisor(1);
    }

    LastingCallback callback;
    ZV::Test::ClientFrame frame{1392 * 1040};
};

TEST_F(EndlessFrame, AnExposureCallbackThatOutlastsTheCloseLeavesNoWheelInThePipeline) {
    ZCamera& camera = GetCamera();
    ZRGBFilterWheel* const wheel = GetContext().rgbWheel.get();

    CloseUnderTheCallback();

    EXPECT_FALSE(camera.GetImagePipeline()->RemoveFilter(wheel));
    callback.mayLeave = true;
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNone, Zentara_LoadDriver());
}

TEST_F(EndlessFrame, ACameraOpenedAgainIsServedWhileAFormerExposureCallbackLasts) {
    ZV::Test::CallbackLog calls;
    CloseUnderTheCallback();

    ASSERT_ZERR(zerrNone, Zentara_OpenCamera(0, &handle));
    ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbExposeDone));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    ASSERT_ZERR(zerrNone, Zentara_Trigger(handle));

    EXPECT_TRUE(calls.WaitForCalls(1));
    callback.mayLeave = true;
    EXPECT_TRUE(ZV::Test::WaitUntil([&] { return callback.hasLeft.load(); }));
    EXPECT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_EQ(1u, calls.CountCalls());
}

TEST_F(Context, LastSettingsAreExchangedWhole) {
    constexpr int Rounds = 2000;
    CameraContext& context = GetContext();
    std::thread writer([&] {
        for (int i = 0; i < Rounds; ++i) {
            Zentara_Settings settings;
            std::memset(&settings, i & 0xFF, sizeof(settings));
            SetLastSettings(context, settings);
        }
    });
    for (int i = 0; i < Rounds; ++i) {
        const Zentara_Settings settings = GetLastSettings(context);
        for (const std::uint32_t word : settings.privateWords) ASSERT_EQ(settings.size, word);
    }
    writer.join();
}

}  // namespace
}  // namespace ZV
