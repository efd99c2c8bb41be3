#include "models/metrona.h"

#include <gtest/gtest.h>

#include "camera/bare_camera.h"

namespace ZV::Test {

namespace {

struct SeparateCamera : BareCamera<Metrona> {
    explicit SeparateCamera(std::uint32_t controlVersion = MakeVersion(1, 2))
        : BareCamera(MakeVersion(2, 9), controlVersion) {
        StoreConfiguration(4, 1024u << 16 | 58);
        StoreControl(3, 1000u << 16 | 50);
    }
};

}  // namespace

TEST(Metrona, BinsItsAxesSeparately) {
    SeparateCamera camera;
    camera.StoreControl(2, 0xFF000000);

    EXPECT_EQ(CameraOk, camera.SetHorizontalBinning(64));
    EXPECT_EQ(CameraOk, camera.SetVerticalBinning(3));

    EXPECT_EQ(0xFF3F0200u, camera.ReadControl(2));
    EXPECT_EQ(64, camera.GetHorizontalBinningMode());
    EXPECT_EQ(3, camera.GetVerticalBinningMode());
    EXPECT_EQ(1, camera.GetSymmetricalBinningMode());
    EXPECT_EQ(1000u << 16 | 50, camera.ReadControl(3)) << "no new ROI";
}

TEST(Metrona, RefusesBinningOutside1To64AndChangesNothing) {
    SeparateCamera camera;
    EXPECT_EQ(CameraOk, camera.SetHorizontalBinning(7));
    for (const std::uint32_t mode : {0u, 65u, 0xFFFFFFFFu}) {
        EXPECT_EQ(CameraBadValue, camera.SetHorizontalBinning(mode));
        EXPECT_EQ(CameraBadValue, camera.SetVerticalBinning(mode));
    }

    EXPECT_EQ(0x60000u, camera.ReadControl(2));
}

TEST(Metrona, KeepsStreamingWhenItsBinningChanges) {
    SeparateCamera camera;
    camera.streaming.isStreaming = true;

    EXPECT_EQ(CameraOk, camera.SetHorizontalBinning(7));

    EXPECT_TRUE(camera.streaming.isStreaming);
    camera.streaming.isStreaming = false;
}

TEST(Metrona, ListsAll64ModesOfEachAxis) {
    SeparateCamera camera;
    std::vector<std::uint16_t> symmetrical{7}, horizontal, vertical;

    camera.GetSymmetricalBinningModes(symmetrical);
    camera.GetHorizontalBinningModes(horizontal);
    camera.GetVerticalBinningModes(vertical);

    EXPECT_TRUE(symmetrical.empty());
    ASSERT_EQ(64u, horizontal.size());
    EXPECT_EQ(1, horizontal.front());
    EXPECT_EQ(64, horizontal.back());
    EXPECT_EQ(horizontal, vertical);
    EXPECT_FALSE(camera.IsSymmetricalBinningSupported());
    EXPECT_TRUE(camera.IsHorizontalBinningSupported());
    EXPECT_TRUE(camera.IsVerticalBinningSupported());
}

TEST(Metrona, DividesItsSensorByAnyModeAndKeepsOneRow) {
    SeparateCamera camera;

    EXPECT_EQ(341u, camera.GetMaxCCDWidthForBinningMode(3));
    EXPECT_EQ(19u, camera.GetMaxCCDHeightForBinningMode(3));
    EXPECT_EQ(1u, camera.GetMaxCCDHeightForBinningMode(64));
    EXPECT_EQ(1024u, camera.GetMaxCCDWidthForBinningMode(0)) << "0 divides as 1";
    EXPECT_EQ(58u, camera.GetMaxCCDHeightForBinningMode(0));
}

TEST(Metrona, CutsItsImageByTheBinningOfEachAxis) {
    SeparateCamera camera;
    EXPECT_EQ(1000u, camera.GetImageWidth());
    EXPECT_EQ(50u, camera.GetImageHeight());

    EXPECT_EQ(CameraOk, camera.SetHorizontalBinning(2));
    EXPECT_EQ(512u, camera.GetImageWidth());
    EXPECT_EQ(50u, camera.GetImageHeight());
    EXPECT_EQ(CameraOk, camera.SetVerticalBinning(64));
    EXPECT_EQ(1u, camera.GetImageHeight());
    EXPECT_EQ(1024u, camera.GetImageSize());
}

TEST(Metrona, CutsItsRoiToTheFullSensorAtAnyBinning) {
    SeparateCamera camera;
    EXPECT_EQ(CameraOk, camera.SetHorizontalBinning(64));

    EXPECT_EQ(CameraOk, camera.SetROIWidth(2000));

    EXPECT_EQ(1024u, camera.GetROIWidth());
}

TEST(Metrona, Has16BitsWhateverItsCodeSays) {
    SeparateCamera camera;
    camera.StoreConfiguration(ConfigMaxBitDepthMinusOne, 11);
    for (std::uint32_t code = 0; code < 4; ++code) {
        camera.StoreControl(ControlBitDepth, code);
        EXPECT_EQ(16u, camera.GetBitDepth());
    }
    EXPECT_EQ(100000000u, camera.GetDefaultExposure());
}

TEST(Metrona, RoundsItsShutterDelayUpToAMultipleOf50) {
    SeparateCamera camera;

    EXPECT_EQ(CameraOk, camera.SetMetronaShutterDelay(1));
    EXPECT_EQ(50u, camera.GetMetronaShutterDelay());
    EXPECT_EQ(CameraOk, camera.SetMetronaShutterDelay(0));
    EXPECT_EQ(0u, camera.GetMetronaShutterDelay());
    EXPECT_EQ(CameraOk, camera.SetMetronaShutterDelay(100));
    EXPECT_EQ(100u, camera.GetMetronaShutterDelay());
    EXPECT_EQ(CameraOk, camera.SetMetronaShutterDelay(101));
    EXPECT_EQ(150u, camera.ReadControl(15));
    EXPECT_TRUE(camera.IsMetronaShutterDelaySupported());
}

TEST(Metrona, WrapsAShutterDelayNearTheGreatest) {
    SeparateCamera camera;
    camera.StoreControl(15, 50);

    EXPECT_EQ(CameraOk, camera.SetMetronaShutterDelay(0xFFFFFFFF));

    EXPECT_EQ(0u, camera.GetMetronaShutterDelay());
}

TEST(Metrona, HasItsShutterDelayOnControl12Alone) {
    for (const std::uint32_t version : {MakeVersion(2, 1), MakeVersion(1, 1)}) {
        SeparateCamera camera(version);

        EXPECT_EQ(CameraNotSupported, camera.SetMetronaShutterDelay(1));
        EXPECT_EQ(CameraOk, camera.SetMetronaShutterDelay(0)) << "in place already";
    }
}

TEST(Metrona, ShowsBitsOfTheExposureAsDelayFromControlMajor2) {
    SeparateCamera camera(MakeVersion(2, 1));

    EXPECT_EQ(CameraOk, camera.SetExposure(12345));

    EXPECT_EQ(12345u, camera.GetMetronaShutterDelay());
}

}  // namespace ZV::Test
