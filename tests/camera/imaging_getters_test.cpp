#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <thread>

#include "camera/bare_camera.h"
#include "camera/test_camera.h"

namespace ZV::Test {

using testing::ElementsAre;

TEST(BitDepth, FollowsItsCode) {
    BareBase camera;
    camera.StoreConfiguration(ConfigMaxBitDepthMinusOne, 15);
    const std::uint32_t depths[] = {8, 16, 12, 14};
    for (std::uint32_t code = 0; code < 4; ++code) {
        camera.StoreControl(ControlBitDepth, code);
        EXPECT_EQ(depths[code], camera.GetBitDepth());
    }
}

TEST(Exposures, AreMicrosecondsAtMajor1AndWholeNanosecondsAbove) {
    BareBase early(MakeVersion(2, 9), MakeVersion(1, 2));
    BareBase late(MakeVersion(1, 2), MakeVersion(2, 8));
    for (BareBase* camera : {&early, &late}) {
        for (std::uint32_t quadlet = 6; quadlet <= 8; ++quadlet) camera->StoreControl(quadlet, 7);
        for (std::uint32_t quadlet = 15; quadlet <= 17; ++quadlet) camera->StoreControl(quadlet, 9);
        camera->StoreConfiguration(3, 5);
        camera->StoreConfiguration(26, 6);
        camera->StoreConfiguration(39, 1);
        camera->StoreConfiguration(40, 2);
    }

    EXPECT_EQ(7000u, early.GetExposure());
    EXPECT_EQ(7000u, early.GetRGBFilterRedExposure());
    EXPECT_EQ(7000u, early.GetRGBFilterBlueExposure());
    EXPECT_EQ(5ull << 32 | 1, early.GetMinExposure()) << "the test is on the configuration";
    EXPECT_EQ(6ull << 32 | 2, early.GetMaxExposure());
    EXPECT_EQ(7ull << 32 | 9, late.GetExposure());
    EXPECT_EQ(7ull << 32 | 9, late.GetRGBFilterRedExposure());
    EXPECT_EQ(7ull << 32 | 9, late.GetRGBFilterBlueExposure());
    EXPECT_EQ(5000u, late.GetMinExposure());
    EXPECT_EQ(6000u, late.GetMaxExposure());
}

TEST(Exposures, Of32BitsOfMicrosecondsDoNotWrap) {
    BareBase camera(MakeVersion(2, 9), MakeVersion(1, 1));
    camera.StoreControl(6, 0xFFFFFFFF);

    EXPECT_EQ(0xFFFFFFFFull * 1000, camera.GetExposure());
}

TEST(Exposures, HaveTheirDefaultAndResolution) {
    BareBase early(MakeVersion(1, 2));
    BareBase late(MakeVersion(2, 1));
    late.StoreConfiguration(35, 500);

    EXPECT_EQ(16384000u, late.GetDefaultExposure());
    EXPECT_EQ(1000u, early.GetExposureResolution());
    EXPECT_EQ(500u, late.GetExposureResolution());
}

TEST(ImageFormat, FollowsSensorWheelAndBinning) {
    BareBase camera;

    EXPECT_EQ(1, camera.GetCCDImageFormat());
    EXPECT_TRUE(camera.IsRGBFilterSupported());
    EXPECT_EQ(1u, camera.GetImageFormat());
    camera.StoreControl(ControlFilterCycle, 1);
    EXPECT_EQ(3u, camera.GetImageFormat());

    camera.StoreConfiguration(ConfigColourKind, 1);
    EXPECT_EQ(2, camera.GetCCDImageFormat());
    EXPECT_FALSE(camera.IsRGBFilterSupported());
    EXPECT_EQ(2u, camera.GetImageFormat());
    camera.StoreControl(ControlBinning, 1);
    EXPECT_EQ(1u, camera.GetImageFormat());

    camera.StoreConfiguration(ConfigColourKind, 2);
    EXPECT_EQ(0, camera.GetCCDImageFormat());
    EXPECT_EQ(0u, camera.GetImageFormat());
}

TEST(ImageSize, IsTheLesserOfRoiAndModeWhileBinning) {
    BareBase camera;
    camera.StoreConfiguration(4, 1000u << 16 | 800);
    camera.StoreConfiguration(5, 500u << 16 | 400);
    camera.StoreControl(3, 700u << 16 | 300);

    EXPECT_EQ(700u, camera.GetImageWidth());
    EXPECT_EQ(300u, camera.GetImageHeight());
    EXPECT_EQ(210000u, camera.GetImageSize());
    camera.StoreControl(ControlBitDepth, 3);
    EXPECT_EQ(420000u, camera.GetImageSize());

    camera.StoreControl(ControlBinning, 1);
    EXPECT_EQ(500u, camera.GetImageWidth());
    EXPECT_EQ(300u, camera.GetImageHeight());
}

TEST(BinningLimits, HaveARegisterForEachModeAndTheFullSensorForAnyOther) {
    BareBase camera;
    for (std::uint32_t quadlet = 4; quadlet <= 7; ++quadlet)
        camera.StoreConfiguration(quadlet, quadlet * 100 << 16 | quadlet * 10);
    const std::uint32_t quadletOfMode[] = {4, 4, 5, 6, 7, 4, 4, 4, 6, 4};
    for (std::uint32_t mode = 0; mode < 10; ++mode) {
        EXPECT_EQ(quadletOfMode[mode] * 100, camera.GetMaxCCDWidthForBinningMode(mode)) << mode;
        EXPECT_EQ(quadletOfMode[mode] * 10, camera.GetMaxCCDHeightForBinningMode(mode)) << mode;
        EXPECT_EQ(quadletOfMode[mode] * 100, camera.GetROIMaxWidthForBinningMode(mode));
        EXPECT_EQ(quadletOfMode[mode] * 10, camera.GetROIMaxHeightForBinningMode(mode));
    }
    EXPECT_EQ(400u, camera.GetMaxCCDWidthForBinningMode(0xFFFFFFFF));
}

TEST(BinningMode, OfCode2Is8OnlyFromConfiguration22WithItsBit) {
    BareBase early(MakeVersion(2, 1));
    BareBase late(MakeVersion(2, 2));
    early.StoreControl(ControlBinning, 2);
    late.StoreControl(ControlBinning, 2);

    EXPECT_EQ(3, late.GetSymmetricalBinningMode());
    late.StoreConfiguration(42, 1);
    EXPECT_EQ(8, late.GetSymmetricalBinningMode());
    EXPECT_EQ(8, late.GetHorizontalBinningMode());
    EXPECT_EQ(8, late.GetVerticalBinningMode());
    EXPECT_EQ(3, early.GetSymmetricalBinningMode());
}

TEST(HardwareVersion, IsTheProfileFromConfiguration29) {
    BareBase early(MakeVersion(2, 8));
    BareBase late(MakeVersion(2, 9));
    for (BareBase* camera : {&early, &late}) camera->StoreConfiguration(15, 77);

    EXPECT_EQ(77u, early.GetHardwareVersion());
    EXPECT_EQ(0, early.GetHardwareProfile());
    const std::uint16_t kept[] = {0, 1, 2, 3, 0, 0};
    for (std::uint32_t profile = 0; profile < 6; ++profile) {
        late.StoreConfiguration(201, profile);
        EXPECT_EQ(kept[profile], late.GetHardwareProfile());
        EXPECT_EQ(kept[profile], late.GetHardwareVersion());
    }
}

TEST(StreamingVersion, Is0BelowConfiguration21) {
    BareBase early(MakeVersion(1, 2));
    BareBase late(MakeVersion(2, 1));
    late.StoreConfiguration(41, 0xABCD0002);

    EXPECT_EQ(0, early.GetStreamingVersion());
    EXPECT_EQ(2, late.GetStreamingVersion());
}

TEST(Features, AreAbsentBelowConfiguration27) {
    BareBase early(MakeVersion(2, 6));
    BareBase late(MakeVersion(2, 7));
    late.StoreConfiguration(169, 0xFFFFFFFF);

    for (BareBase* camera : {&early, &late}) {
        const bool isLate = camera == &late;
        EXPECT_EQ(isLate, camera->IsHighSensitivityModeAvailable());
        EXPECT_EQ(isLate, camera->IsBlackoutModeAvailable());
        EXPECT_EQ(isLate, camera->IsFanControlAvailable());
        EXPECT_EQ(isLate, camera->IsRegulatedCoolingAvailable());
        EXPECT_EQ(isLate, camera->IsEMGainAvailable());
        EXPECT_EQ(isLate, camera->IsShutterCloseDelayAvailable());
        EXPECT_EQ(isLate, camera->IsDitherControlAvailable());
        EXPECT_EQ(isLate, camera->IsHighGainModeAvailable());
        EXPECT_EQ(isLate, camera->IsVClockControlAvailable());
        EXPECT_EQ(isLate, camera->IsDualChannelSupported());
    }
}

TEST(Features, AreOneBitEach) {
    BareBase camera;
    const auto onlyAt = [&](std::uint32_t bit) { camera.StoreConfiguration(169, 1u << bit); };

    onlyAt(1);
    EXPECT_TRUE(camera.IsHighSensitivityModeAvailable());
    onlyAt(2);
    EXPECT_TRUE(camera.IsBlackoutModeAvailable());
    onlyAt(3);
    EXPECT_TRUE(camera.IsFanControlAvailable());
    onlyAt(4);
    EXPECT_TRUE(camera.IsRegulatedCoolingAvailable());
    onlyAt(6);
    EXPECT_TRUE(camera.IsEMGainAvailable());
    onlyAt(8);
    EXPECT_TRUE(camera.IsShutterCloseDelayAvailable());
    onlyAt(9);
    EXPECT_TRUE(camera.IsDitherControlAvailable());
    onlyAt(10);
    EXPECT_TRUE(camera.IsHighGainModeAvailable());
    onlyAt(11);
    EXPECT_TRUE(camera.IsVClockControlAvailable());
    onlyAt(12);
    EXPECT_TRUE(camera.IsDualChannelSupported());
    EXPECT_FALSE(camera.IsVClockControlAvailable());
}

TEST(Features, OfOtherQuadletsHaveTheirVersions) {
    BareBase first(MakeVersion(1, 1));
    BareBase second(MakeVersion(1, 2));
    second.StoreConfiguration(29, 1);
    EXPECT_FALSE(first.IsDoubleShotSupported());
    EXPECT_TRUE(second.IsDoubleShotSupported());

    BareBase before(MakeVersion(2, 9)), from(MakeVersion(2, 10));
    EXPECT_FALSE(before.IsTweekingRegisterSupported());
    EXPECT_TRUE(from.IsTweekingRegisterSupported());

    EXPECT_FALSE(from.IsCoolerAvailable());
    from.StoreConfiguration(10, 1u << 31);
    EXPECT_TRUE(from.IsCoolerAvailable());
}

TEST(AbsentFeatures, ReadAsTheirNeutralValues) {
    BareBase camera(MakeVersion(2, 6));
    for (std::uint32_t quadlet = 12; quadlet < 43; ++quadlet)
        camera.StoreControl(quadlet, 0xFFFFFFFF);

    EXPECT_EQ(4u, camera.GetFanSpeed());
    EXPECT_FALSE(camera.GetBlackoutMode());
    EXPECT_FALSE(camera.GetHighSensitivityMode());
    EXPECT_FALSE(camera.GetDoubleShotMode());
    EXPECT_FALSE(camera.GetDitherMode());
    EXPECT_FALSE(camera.GetHighGainMode());
    EXPECT_FALSE(camera.GetDitherModeDefault());
    EXPECT_FALSE(camera.GetHighGainModeDefault());
    EXPECT_EQ(0u, camera.GetEMGain());
    EXPECT_EQ(0u, camera.GetEMGainDefault());
    EXPECT_EQ(0u, camera.GetShutterCloseDelay());
    EXPECT_EQ(0u, camera.GetShutterCloseDelayDefault());
    EXPECT_EQ(0u, camera.GetShutterCloseDelayMin());
    EXPECT_EQ(0u, camera.GetShutterCloseDelayMax());
    EXPECT_EQ(0u, camera.GetChan1CalibrationGain());
    EXPECT_EQ(0u, camera.GetChan1CalibrationGainDefault());
    EXPECT_EQ(0u, camera.GetVClockFrequencyResolution());
    EXPECT_EQ(0u, camera.GetVClockPeriod());
    EXPECT_EQ(0u, camera.GetVClockPeriodDefault());
    EXPECT_EQ(0u, camera.GetVClockPeriodMin());
    EXPECT_EQ(0u, camera.GetVClockPeriodMax());
    EXPECT_EQ(0, camera.GetMinRegulatedCoolingTemp());
    EXPECT_EQ(0, camera.GetMaxRegulatedCoolingTemp());
    EXPECT_EQ(0, camera.GetRegulatedCoolingTemperature());
    EXPECT_FALSE(camera.GetRegulatedCoolingTemperatureLock());
}

TEST(PresentFeatures, ReadFromTheirRegisters) {
    BareBase camera;
    camera.StoreConfiguration(169, 0xFFFFFFFF);
    camera.StoreConfiguration(29, 1);
    camera.StoreConfiguration(201, 2);
    camera.StoreConfiguration(167, 3315u << 16 | 585);
    camera.StoreConfiguration(176, 10);
    camera.StoreConfiguration(177, 100);
    camera.StoreConfiguration(192, 5);
    camera.StoreConfiguration(193, 1023);
    camera.StoreConfiguration(194, 0x1FF);
    camera.StoreConfiguration(196, 3);
    camera.StoreConfiguration(197, 80);
    camera.StoreConfiguration(198, 20);
    camera.StoreConfiguration(199, 400);
    camera.StoreConfiguration(200, 40000000);
    camera.StoreControl(13, 1);
    camera.StoreControl(14, 2925u << 16);
    camera.StoreControl(21, 3);
    camera.StoreControl(22, 2u << 16);
    camera.StoreControl(24, 23);
    camera.StoreControl(25, 50);
    camera.StoreControl(30, 3);
    camera.StoreControl(31, 40);
    camera.StoreControl(32, 0x1AB);

    EXPECT_EQ(2u, camera.GetFanSpeed());
    EXPECT_TRUE(camera.GetBlackoutMode());
    EXPECT_TRUE(camera.GetHighSensitivityMode());
    EXPECT_TRUE(camera.GetDoubleShotMode());
    EXPECT_TRUE(camera.GetDitherMode());
    EXPECT_TRUE(camera.GetHighGainMode());
    EXPECT_TRUE(camera.GetDitherModeDefault());
    EXPECT_TRUE(camera.GetHighGainModeDefault());
    EXPECT_EQ(1000u, camera.GetEMGain());
    EXPECT_EQ(10u, camera.GetEMGainDefault());
    EXPECT_EQ(1013u, camera.GetEMGainDefaultWithFlip());
    EXPECT_EQ(5u, camera.GetEMGainMin());
    EXPECT_EQ(1023u, camera.GetEMGainMax());
    EXPECT_EQ(320u, camera.GetShutterCloseDelay());
    EXPECT_EQ(640u, camera.GetShutterCloseDelayDefault());
    EXPECT_EQ(26208u, camera.GetShutterCloseDelayMax());
    EXPECT_EQ(0xABu, camera.GetChan1CalibrationGain());
    EXPECT_EQ(0xFFu, camera.GetChan1CalibrationGainDefault());
    EXPECT_EQ(40000000u, camera.GetVClockFrequencyResolution());
    EXPECT_EQ(1000u, camera.GetVClockPeriod());
    EXPECT_EQ(2000u, camera.GetVClockPeriodDefault());
    EXPECT_EQ(500u, camera.GetVClockPeriodMin());
    EXPECT_EQ(10000u, camera.GetVClockPeriodMax());
    EXPECT_EQ(-40, camera.GetMinRegulatedCoolingTemp());
    EXPECT_EQ(29, camera.GetMaxRegulatedCoolingTemp());
    EXPECT_EQ(19, camera.GetRegulatedCoolingTemperature());
}

TEST(PresentFeatures, HaveNoLimitsWhereTheBlockEndsBeforeThem) {
    BareBase camera(MakeVersion(2, 7));
    camera.StoreConfiguration(169, 0xFFFFFFFF);

    EXPECT_EQ(0u, camera.GetEMGainMin());
    EXPECT_EQ(0u, camera.GetEMGainMax());
    EXPECT_EQ(0u, camera.GetEMGainDefault());
    EXPECT_EQ(0u, camera.GetShutterCloseDelayDefault());
}

TEST(FanSpeed, OfAnyOtherFieldValueIs4) {
    BareBase camera;
    camera.StoreConfiguration(169, 8);
    const std::uint32_t speeds[] = {4, 1, 2, 3, 4, 4};
    for (std::uint32_t code = 0; code < 6; ++code) {
        camera.StoreControl(ControlFanSpeed, code);
        EXPECT_EQ(speeds[code], camera.GetFanSpeed());
    }
}

TEST(Offsets, AreStatedFromTheDefaultAsWell) {
    BareBase camera;
    camera.StoreConfiguration(2, 600u << 20 | 16u << 4);
    camera.StoreConfiguration(31, 2u << 20 | 1000u << 4);
    camera.StoreControl(5, 100u << 4 | 7u << 20);

    EXPECT_EQ(100, camera.GetOffset());
    EXPECT_EQ(16, camera.GetOffsetDefault());
    EXPECT_EQ(16u, camera.GetGainOffsetDefault());
    EXPECT_EQ(2, camera.GetOffsetMin());
    EXPECT_EQ(1000, camera.GetOffsetMax());
    EXPECT_EQ(84, camera.GetAbsoluteOffset());
    EXPECT_EQ(-14, camera.GetAbsoluteOffsetMin());
    EXPECT_EQ(984, camera.GetAbsoluteOffsetMax());
    EXPECT_EQ(0, camera.GetAbsoluteOffsetDefault());
}

TEST(ModeLists, AreAppendedInTheirOrder) {
    BareBase camera;
    std::vector<std::uint32_t> syncModes{9}, triggerModes{9}, cyclingModes;
    std::vector<float> readoutModes{9.0F};

    camera.GetSyncBModes(syncModes);
    camera.GetTriggerModes(triggerModes);
    camera.GetReadoutFrequencyModes(readoutModes);
    camera.StoreControl(ControlFilterCycle, 1);
    camera.GetTriggerModes(cyclingModes);

    EXPECT_THAT(syncModes, ElementsAre(9, 0, 1));
    EXPECT_THAT(triggerModes, ElementsAre(9, 0, 1, 2, 3, 4, 5));
    EXPECT_THAT(cyclingModes, ElementsAre(0, 5));
    EXPECT_THAT(readoutModes, ElementsAre(9.0F, 2.5F, 5.0F, 10.0F, 20.0F));
    EXPECT_EQ(2.5F, camera.GetReadoutFrequencyMin());
    EXPECT_EQ(20.0F, camera.GetReadoutFrequencyMax());
    EXPECT_EQ(20.0F, camera.GetReadoutFrequencyDefault());
}

TEST(SerialNumber, IsTurnedToTextOnceTheCameraIsLittleEndian) {
    BareBase camera;
    camera.StoreConfiguration(18, 0x41424344);
    camera.StoreConfiguration(19, 0x45000000);

    EXPECT_STREQ("DCBA", std::string(camera.GetSerialNumberString(), 4).c_str())
        << "big-endian: as it lies";
    camera.StoreControl(ControlLittleEndian, 1);
    EXPECT_STREQ("ABCDE", camera.GetSerialNumberString());
}

TEST(SerialNumber, Of28BytesIsEndedAllTheSame) {
    BareBase camera;
    camera.StoreControl(ControlLittleEndian, 1);
    for (std::uint32_t quadlet = 18; quadlet <= 24; ++quadlet)
        camera.StoreConfiguration(quadlet, 0x78787878);
    camera.StoreConfiguration(25, 0x79797979);

    EXPECT_EQ(28u, std::strlen(camera.GetSerialNumberString()));
}

TEST(SerialNumber, ThatWasCopiedStaysWhenTheRegistersChange) {
    BareBase camera;
    camera.StoreControl(ControlLittleEndian, 1);
    camera.StoreConfiguration(18, 0x41424344);
    const ZCamera::SerialNumberText copy = camera.CopySerialNumber();
    const char* const shared = camera.GetSerialNumberString();

    camera.StoreConfiguration(18, 0x45464748);
    (void)camera.GetSerialNumberString();

    EXPECT_STREQ("ABCD", copy.data());
    EXPECT_STREQ("EFGH", shared);
}

TEST(SerialNumber, IsCopiedWholeWhileAnotherThreadFindsALongerOne) {
    constexpr int Rounds = 2000;
    BareBase camera;
    camera.StoreControl(ControlLittleEndian, 1);
    std::thread changing([&] {
        for (int round = 0; round < Rounds; ++round) {
            const std::uint32_t quadletOfText = round % 2 == 0 ? 0x78787878 : 0;
            for (std::uint32_t quadlet = 18; quadlet <= 24; ++quadlet)
                camera.StoreConfiguration(quadlet, quadletOfText);
            (void)camera.GetSerialNumberString();
        }
    });

    for (int round = 0; round < Rounds; ++round) {
        const ZCamera::SerialNumberText text = camera.CopySerialNumber();
        EXPECT_EQ('\0', text.back());
        EXPECT_EQ(std::string::npos, std::string(text.data()).find_first_not_of('x'));
    }
    changing.join();
}

TEST(Identity, StandsInTheConfiguration) {
    BareBase camera;
    camera.StoreConfiguration(12, 0x01234567);
    camera.StoreConfiguration(13, 0x89ABCDEF);
    camera.StoreConfiguration(14, 0x00070005);
    camera.StoreConfiguration(16, 0x00090074);
    camera.StoreConfiguration(32, 0x00030000);
    camera.StoreConfiguration(36, 30);
    camera.StoreConfiguration(37, 10);
    camera.StoreConfiguration(38, 20);
    camera.StoreControl(19, 15);

    EXPECT_EQ(0x0123456789ABCDEFull, camera.GetUniqueID());
    EXPECT_EQ(7u, camera.GetModel());
    EXPECT_EQ(0x74u, camera.GetFirmwareVersion());
    EXPECT_EQ(9u, camera.GetFirmwareBuildNumber());
    EXPECT_EQ(3, camera.GetIntensifierModel());
    EXPECT_EQ(30u, camera.GetTriggerDelayMax());
    EXPECT_EQ(10u, camera.GetTriggerDelayMin());
    EXPECT_EQ(20u, camera.GetTriggerDelayResolution());
    EXPECT_EQ(15u, camera.GetTriggerDelay());
}

TEST(TweakDefaults, AreReadFromConfiguration210) {
    BareBase early(MakeVersion(2, 9)), late(MakeVersion(2, 10));
    for (std::uint32_t quadlet = 202; quadlet <= 208; ++quadlet)
        late.StoreConfiguration(quadlet, 0xFFFF0000 | quadlet);
    for (BareBase* camera : {&early, &late}) camera->StoreConfiguration(69, 40000);

    EXPECT_EQ(0u, early.GetSubDefAd());
    EXPECT_EQ(0u, early.GetSubCpDefAd());
    EXPECT_EQ(40000u, late.GetSubDefAd());
    EXPECT_EQ(202u, late.GetSubCpDefAd());
    EXPECT_EQ(203u, late.GetResetVhDefAd());
    EXPECT_EQ(204u, late.GetV1VmDefAd());
    EXPECT_EQ(205u, late.GetV2VmDefAd());
    EXPECT_EQ(206u, late.GetV3VmDefAd());
    EXPECT_EQ(207u, late.GetV4VmDefAd());
    EXPECT_EQ(208u, late.GetMiscCtrlDefAd());
}

TEST(TemperatureLock, AsksTheCameraAnewAndIgnoresAFailedReading) {
    CameraWorld world(SmallCamera);
    TestCamera& camera = *world.camera;
    ASSERT_EQ(CameraOk, camera.Ready());
    EXPECT_TRUE(camera.GetRegulatedCoolingTemperatureLock());
    ASSERT_EQ(CameraOk, camera.SetCoolerStatus(false));
    ASSERT_EQ(CameraOk, camera.UpdateSettingsOnCamera());

    ASSERT_TRUE(world.world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_READ"})"));

    EXPECT_TRUE(camera.GetRegulatedCoolingTemperatureLock()) << "the answer of the last time";
    EXPECT_FALSE(camera.GetRegulatedCoolingTemperatureLock());
}

}  // namespace ZV::Test
