#include "models/folary.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "camera/bare_camera.h"

namespace ZV::Test {

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

/// A Folary of 2561 by 1923 pixels whose real-time video is of 640 by 480.
struct TwoFieldCamera : BareCamera<Folary> {
    explicit TwoFieldCamera(std::uint32_t configurationVersion = MakeVersion(2, 11))
        : BareCamera(configurationVersion) {
        StoreConfiguration(4, 2561u << 16 | 1923);
        StoreConfiguration(5, 640u << 16 | 480);
        StoreConfiguration(ConfigColourKind, 1);
        StoreConfiguration(42, 1);
        StoreControl(3, 600u << 16 | 300);
        StoreControl(4, 10u << 16 | 20);
    }
    void BeVideo() { StoreControl(ControlRtvMode, 1); }
};

}  // namespace

TEST(Folary, IsInterlacedOutsideRealTimeVideo) {
    TwoFieldCamera camera;

    EXPECT_FALSE(camera.GetRTVMode());
    EXPECT_TRUE(camera.BeginsInterlacedFrame());
    camera.BeVideo();
    EXPECT_TRUE(camera.GetRTVMode());
}

TEST(Folary, IsNotInterlacedInRealTimeVideo) {
    TwoFieldCamera camera;
    camera.BeVideo();

    EXPECT_FALSE(camera.BeginsInterlacedFrame());
}

TEST(Folary, HasRealTimeVideoByItsBit) {
    TwoFieldCamera camera;

    EXPECT_FALSE(camera.IsRTVModeSupported());
    camera.StoreConfiguration(29, 2);
    EXPECT_TRUE(camera.IsRTVModeSupported());
}

TEST(Folary, CutsItsWidthToPairsAndDividesItsHeight) {
    TwoFieldCamera camera;

    EXPECT_EQ(2560u, camera.GetMaxCCDWidthForBinningMode(1));
    EXPECT_EQ(2560u, camera.GetMaxCCDWidthForBinningMode(2));
    EXPECT_EQ(2556u, camera.GetMaxCCDWidthForBinningMode(3));
    EXPECT_EQ(2560u, camera.GetMaxCCDWidthForBinningMode(8));
    EXPECT_EQ(1922u, camera.GetMaxCCDHeightForBinningMode(1));
    EXPECT_EQ(960u, camera.GetMaxCCDHeightForBinningMode(2));
    EXPECT_EQ(640u, camera.GetMaxCCDHeightForBinningMode(3));
}

TEST(Folary, AnswersForModesThatItDoesNotHave) {
    TwoFieldCamera camera;

    EXPECT_EQ(2560u, camera.GetMaxCCDWidthForBinningMode(0)) << "0 divides as 1";
    EXPECT_EQ(1922u, camera.GetMaxCCDHeightForBinningMode(0));
    EXPECT_EQ(0u, camera.GetMaxCCDWidthForBinningMode(0x80000000));
    EXPECT_EQ(0u, camera.GetMaxCCDHeightForBinningMode(0xFFFFFFFF));
}

TEST(Folary, HasOneSizeInRealTimeVideo) {
    TwoFieldCamera camera;
    camera.BeVideo();

    EXPECT_EQ(640u, camera.GetROIMaxWidthForRTVMode());
    EXPECT_EQ(480u, camera.GetROIMaxHeightForRTVMode());
    EXPECT_EQ(640u, camera.GetMaxCCDWidthForBinningMode(4));
    EXPECT_EQ(480u, camera.GetMaxCCDHeightForBinningMode(4));
}

TEST(Folary, WritesItsThreeBinningFieldsAtOnce) {
    struct Row {
        std::uint32_t mode, bits;
    };
    for (const Row& row : {Row{2, 0x10101}, Row{3, 0x20202}, Row{4, 0x30303}, Row{8, 0x70702}}) {
        TwoFieldCamera camera;
        camera.StoreControl(2, 0xFF0000F8);

        EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(row.mode));

        EXPECT_EQ(0xFF0000F8 | row.bits, camera.ReadControl(2));
        EXPECT_EQ(camera.GetMaxCCDWidthForBinningMode(row.mode), camera.GetROIWidth());
        EXPECT_EQ(0u, camera.ReadControl(4));
    }
}

TEST(Folary, OpensItsRoiToTheSensorAfterBinning) {
    TwoFieldCamera camera;
    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(4));
    EXPECT_EQ(2560u, camera.GetROIWidth());
    EXPECT_EQ(480u, camera.GetROIHeight());

    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(1));

    EXPECT_EQ(0u, camera.ReadControl(2));
    EXPECT_EQ(2560u, camera.GetROIWidth()) << "cut to pairs";
    EXPECT_EQ(1922u, camera.GetROIHeight());
}

TEST(Folary, RefusesMode5AndLeavesTheShadowWithTheOldBitsCleared) {
    TwoFieldCamera camera;
    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(4));
    camera.StoreControl(2, camera.ReadControl(2) | 0xF0);

    EXPECT_EQ(CameraBadValue, camera.SetSymmetricalBinning(5));

    EXPECT_EQ(0xF0u, camera.ReadControl(2));
    EXPECT_EQ(1, camera.GetSymmetricalBinningMode());
    EXPECT_EQ(480u, camera.GetROIHeight()) << "the ROI stays";
}

TEST(Folary, StopsAStreamOnlyForItsRoiAndHasNoGuardOnItsFrequency) {
    TwoFieldCamera camera;
    camera.StoreControl(ControlReadoutFrequency, 7);
    camera.streaming.isStreaming = true;

    EXPECT_EQ(CameraBadValue, camera.SetSymmetricalBinning(5));
    EXPECT_TRUE(camera.streaming.isStreaming);
    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(2));

    EXPECT_FALSE(camera.streaming.isStreaming);
    EXPECT_TRUE(camera.streaming.restartAfterUpdate);
    EXPECT_EQ(40.0F, camera.GetReadoutFrequency());
}

TEST(Folary, ReadsMode8As3WithoutItsBitAndWritesItAnew) {
    TwoFieldCamera camera;
    camera.StoreConfiguration(42, 0);
    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(8));
    EXPECT_EQ(3, camera.GetSymmetricalBinningMode());
    camera.StoreControl(2, camera.ReadControl(2) & ~0xFFFF00u);

    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(8));

    EXPECT_EQ(0x70702u, camera.ReadControl(2));
}

TEST(Folary, MovesBothAxesWithItsVerticalBinning) {
    TwoFieldCamera camera;

    EXPECT_EQ(CameraOk, camera.SetVerticalBinning(4));

    EXPECT_EQ(4, camera.GetSymmetricalBinningMode());
    EXPECT_EQ(4, camera.GetVerticalBinningMode());
    EXPECT_EQ(1, camera.GetHorizontalBinningMode()) << "always";
}

TEST(Folary, DoesNotBinInRealTimeVideo) {
    TwoFieldCamera camera;
    EXPECT_EQ(CameraOk, camera.SetVerticalBinning(4));
    camera.BeVideo();

    EXPECT_EQ(CameraOk, camera.SetVerticalBinning(2));

    EXPECT_EQ(1, camera.GetVerticalBinningMode());
}

TEST(Folary, EntersRealTimeVideoWithItsSizeAndLeavesItWithTheSensor) {
    TwoFieldCamera camera;
    EXPECT_EQ(CameraOk, camera.SetVerticalBinning(4));
    camera.StoreControl(4, 10u << 16 | 20);

    EXPECT_EQ(CameraOk, camera.SetRTVMode(true));
    EXPECT_EQ(4u, camera.ReadControl(2)) << "binning 1";
    EXPECT_EQ(640u << 16 | 480, camera.ReadControl(3));
    EXPECT_EQ(0u, camera.ReadControl(4));

    EXPECT_EQ(CameraOk, camera.SetRTVMode(false));
    EXPECT_EQ(0u, camera.ReadControl(2));
    EXPECT_EQ(2560u << 16 | 1922, camera.ReadControl(3));
}

TEST(Folary, TouchesNothingForAVideoModeThatIsInPlace) {
    TwoFieldCamera camera;

    EXPECT_EQ(CameraOk, camera.SetRTVMode(false));

    EXPECT_EQ(600u << 16 | 300, camera.ReadControl(3));
}

TEST(Folary, MakesItsRoiEvenAndItsWidthAnEvenNumberOfChunks) {
    TwoFieldCamera camera;
    EXPECT_EQ(CameraOk, camera.SetROI(11, 21, 101, 31));
    EXPECT_EQ(10u << 16 | 20, camera.ReadControl(4));
    EXPECT_EQ(100u << 16 | 30, camera.ReadControl(3));

    EXPECT_EQ(CameraOk, camera.SetVerticalBinning(4));
    EXPECT_EQ(CameraOk, camera.SetROI(0, 0, 103, 30));
    EXPECT_EQ(98u, camera.GetROIWidth()) << "102 has 25 chunks of 4";
}

TEST(Folary, TakesTheChunkOfItsSensorInRealTimeVideo) {
    TwoFieldCamera camera;
    camera.BeVideo();
    camera.StoreConfiguration(4, 2048u << 16 | 1536);
    EXPECT_EQ(CameraOk, camera.SetROI(0, 0, 100, 30));
    EXPECT_EQ(97u, camera.GetROIWidth()) << "33 chunks of 3";

    camera.StoreConfiguration(4, 2560u << 16 | 1920);
    EXPECT_EQ(CameraOk, camera.SetROI(0, 0, 100, 30));
    EXPECT_EQ(96u, camera.GetROIWidth()) << "25 chunks of 4";
}

TEST(Folary, TakesTheHeightForAChunkOnOtherSensorsInRealTimeVideo) {
    TwoFieldCamera camera;
    camera.BeVideo();

    EXPECT_EQ(CameraOk, camera.SetROI(0, 0, 100, 30));
    EXPECT_EQ(70u, camera.GetROIWidth()) << "3 chunks of 30";
    EXPECT_EQ(CameraOk, camera.SetROI(0, 0, 100, 0x10000));
    EXPECT_EQ(100u, camera.GetROIWidth()) << "a chunk of 0 narrows nothing";
}

TEST(Folary, IsACameraOfBayerMosaicWhileBinning) {
    TwoFieldCamera camera;
    EXPECT_EQ(2u, camera.GetImageFormat());
    EXPECT_EQ(CameraOk, camera.SetVerticalBinning(2));
    EXPECT_EQ(2u, camera.GetImageFormat());

    camera.StoreConfiguration(ConfigColourKind, 0);
    EXPECT_EQ(2u, camera.GetImageFormat()) << "whatever the sensor";
}

TEST(Folary, HasAGainMaximumOfItsOwnBelowConfiguration24) {
    struct Row {
        std::uint32_t version, gainMax;
    };
    for (const Row& row : {Row{MakeVersion(1, 2), 3171}, Row{MakeVersion(2, 3), 3171},
                           Row{MakeVersion(2, 4), 4000}, Row{MakeVersion(2, 11), 4000}}) {
        TwoFieldCamera camera(row.version);
        camera.StoreConfiguration(ConfigGainMax, 4000);

        EXPECT_EQ(row.gainMax, camera.GetGainMax());
    }
}

TEST(Folary, ListsVerticalModesAloneAndTwoTriggers) {
    TwoFieldCamera camera;
    std::vector<std::uint16_t> symmetrical{7}, vertical;
    std::vector<std::uint32_t> sync{7}, triggers;

    camera.GetSymmetricalBinningModes(symmetrical);
    camera.GetVerticalBinningModes(vertical);
    camera.GetSyncBModes(sync);
    camera.GetTriggerModes(triggers);

    EXPECT_THAT(symmetrical, IsEmpty());
    EXPECT_THAT(vertical, ElementsAre(1, 2, 3, 4));
    EXPECT_THAT(sync, IsEmpty());
    EXPECT_THAT(triggers, ElementsAre(0, 5));
    EXPECT_FALSE(camera.IsSymmetricalBinningSupported());
    EXPECT_TRUE(camera.IsVerticalBinningSupported());
    EXPECT_FALSE(camera.IsHorizontalBinningSupported());
    EXPECT_FALSE(camera.IsSyncBSupported());
    EXPECT_EQ(100000000u, camera.GetDefaultExposure());
}

}  // namespace ZV::Test
