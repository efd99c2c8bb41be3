#include <gtest/gtest.h>

#include "api/camera_context.h"
#include "api/handles.h"
#include "camera/camera.h"
#include "support/flat_camera.h"

// What the flat interface answers of a state that only camera operations reach yet.

namespace ZV {
namespace {

class InformationOfState : public Test::OpenedCamera {
  protected:
    explicit InformationOfState(std::string_view scenario = ZV::Test::SmallMono)
        : OpenedCamera(scenario) {}

    ZCamera& GetCamera() { return *FindCamera(handle); }
    CameraContext& GetContext() { return *GetCameraContext(GetCamera()); }
};

TEST_F(InformationOfState, WithTwelveBitsTheImageSizeIsTwiceThatOfEight) {
    const std::uint32_t bytes = GetInfo(zinfImageSize);

    ASSERT_EQ(CameraOk, GetCamera().SetBitDepth(12));

    EXPECT_EQ(2 * bytes, GetInfo(zinfImageSize));
}

TEST_F(InformationOfState, BehindTheWheelTheImageSizeIsThatOfItsOutput) {
    ASSERT_EQ(CameraOk, GetCamera().SetRGBFilterCycle(true));
    EXPECT_EQ(64u * 48u * 3, GetInfo(zinfImageSize));

    GetContext().rgbWheel->SetOutputFormat(zfmtRGB48);
    EXPECT_EQ(64u * 48u * 6, GetInfo(zinfImageSize));
    // Kept: an output that is not of three colours counts as nothing.
    GetContext().rgbWheel->SetOutputFormat(zfmtMono8);
    EXPECT_EQ(0u, GetInfo(zinfImageSize));
}

TEST_F(InformationOfState, ThePostProcessedSizeFollowsTheBayerFilter) {
    GetContext().bayerFilter->SetOutputFormat(zfmtRGB48);
    EXPECT_EQ(64u * 48u * 6, GetInfo(zinfPostProcessImageSize));
    GetContext().bayerFilter->SetOutputFormat(13);
    EXPECT_EQ(0u, GetInfo(zinfPostProcessImageSize));
    GetContext().bayerFilter->SetOutputFormat(zfmtRGB24);
}

TEST_F(InformationOfState, TheImageIsThatOfTheRegion) {
    ASSERT_EQ(CameraOk, GetCamera().SetROI(8, 4, 32, 16));

    EXPECT_EQ(32u, GetInfo(zinfImageWidth));
    EXPECT_EQ(16u, GetInfo(zinfImageHeight));
    EXPECT_EQ(64u, GetInfo(zinfCcdWidth));
    EXPECT_EQ(48u, GetInfo(zinfCcdHeight));
}

TEST_F(InformationOfState, WithoutAContextWhatNeedsItIsABadHandleAndTheRestIsAnswered) {
    CameraContext* const context = &GetContext();
    ASSERT_EQ(CameraOk, GetCamera().SetRGBFilterCycle(true));
    GetCamera().SetRefCon(nullptr);
    std::uint32_t value = 99;

    EXPECT_ZERR(zerrBadHandle, Zentara_GetInfo(handle, zinfPostProcessImageSize, &value));
    EXPECT_ZERR(zerrBadHandle, Zentara_GetInfo(handle, zinfImageSize, &value));
    EXPECT_EQ(99u, value);
    EXPECT_EQ(64u, GetInfo(zinfCcdWidth));

    GetCamera().SetRefCon(context);
}

class SoftwareTriggered : public InformationOfState {};

TEST_F(SoftwareTriggered, ATriggerGivesOneFrame) {
    ASSERT_EQ(CameraOk, GetCamera().SetTriggerMode(ztrigSoftware));
    ZV::Test::CallbackLog calls;
    ZV::Test::ClientFrame frame(GetImageBytes());
    ASSERT_ZERR(zerrNone, Queue(frame, calls, zcbFrameDone));
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));

    EXPECT_ZERR(zerrNone, Zentara_Trigger(handle));

    EXPECT_TRUE(calls.WaitForCalls(1));
}

}  // namespace
}  // namespace ZV
