#include "api/camera_context.h"

#include <gtest/gtest.h>

#include <cstring>
#include <thread>

#include "api/handles.h"
#include "api/settings_block.h"
#include "support/flat_camera.h"

namespace ZV {
namespace {

class Context : public Test::OpenedCamera {
  protected:
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
