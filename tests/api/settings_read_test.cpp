#include <gtest/gtest.h>

#include "api/camera_context.h"
#include "api/handles.h"
#include "api/settings_block.h"
#include "camera/camera.h"
#include "support/flat_camera.h"

// What a block reads of a state that only camera operations reach yet.

namespace ZV {
namespace {

class SettingsOfState : public Test::OpenedCamera {
  protected:
    explicit SettingsOfState(std::string_view scenario = ZV::Test::SmallMono)
        : OpenedCamera(scenario) {}

    ZCamera& GetCamera() { return *FindCamera(handle); }
    CameraContext& GetContext() { return *GetCameraContext(GetCamera()); }
    std::uint32_t ReadWord(std::uint32_t key) { return GetSettingsWord(ReadSettings(), key); }
};

TEST_F(SettingsOfState, ACameraInAFrequencyOutsideTheTableReadsAsIndexZero) {
    ASSERT_EQ(CameraOk, GetCamera().SetReadoutFrequency(25));
    ASSERT_EQ(25.0F, GetCamera().GetReadoutFrequency());

    EXPECT_EQ(0u, ReadWord(zprmReadoutSpeed));
}

TEST_F(SettingsOfState, AnExposureBelowAMicrosecondReadsAsOne) {
    ASSERT_EQ(CameraOk, GetCamera().SetExposure(500));
    ASSERT_EQ(500u, GetCamera().GetExposure());

    const Zentara_Settings settings = ReadSettings();

    EXPECT_EQ(1u, GetSettingsWord(settings, zprmExposure));
    EXPECT_EQ(500u, GetSettingsWide(settings, zprm64Exposure));
}

TEST_F(SettingsOfState, TwelveBitsReadAsTheSixteenBitFormat) {
    ASSERT_EQ(CameraOk, GetCamera().SetBitDepth(12));

    EXPECT_EQ(static_cast<std::uint32_t>(zfmtMono16), ReadWord(zprmImageFormat));
}

TEST_F(SettingsOfState, ACameraThatWasSentARawFormatReadsBackItsOwn) {
    Zentara_Settings sent = ReadSettings();
    SetSettingsWord(sent, zprmImageFormat, zfmtRaw8);
    SetLastSettings(GetContext(), sent);

    EXPECT_EQ(static_cast<std::uint32_t>(zfmtMono8), ReadWord(zprmImageFormat));

    EXPECT_EQ(static_cast<std::uint32_t>(zfmtMono8),
              GetSettingsWord(GetLastSettings(GetContext()), zprmImageFormat));
}

TEST_F(SettingsOfState, BehindTheWheelTheFormatIsThatOfTheWheel) {
    ASSERT_EQ(CameraOk, GetCamera().SetRGBFilterCycle(true));
    GetContext().rgbWheel->SetOutputFormat(zfmtRGB24);

    ASSERT_EQ(3u, GetCamera().GetImageFormat());

    EXPECT_EQ(static_cast<std::uint32_t>(zfmtRGB24), ReadWord(zprmImageFormat));
}

TEST_F(SettingsOfState, ScalesAndPostProcessingComeFromTheContext) {
    GetContext().whiteBalance->SetRedScale(2.5F);
    GetContext().whiteBalance->SetGreenScale(0.5F);
    GetContext().whiteBalance->SetBlueScale(0.251F);
    GetContext().postProcessing = 1;
    GetContext().bayerFilter->SetAlgorithm(4);
    GetContext().bayerFilter->SetOutputFormat(zfmtBGR24);

    const Zentara_Settings settings = ReadSettings();

    EXPECT_EQ(2500u, GetSettingsWord(settings, zprmPostProcessGainRed));
    EXPECT_EQ(500u, GetSettingsWord(settings, zprmPostProcessGainGreen));
    EXPECT_EQ(250u, GetSettingsWord(settings, zprmPostProcessGainBlue));
    EXPECT_EQ(1u, GetSettingsWord(settings, zprmDoPostProcessing));
    EXPECT_EQ(4u, GetSettingsWord(settings, zprmPostProcessBayerAlgorithm));
    EXPECT_EQ(static_cast<std::uint32_t>(zfmtBGR24),
              GetSettingsWord(settings, zprmPostProcessImageFormat));
}

TEST_F(SettingsOfState, EveryWordIsWhatTheCameraSays) {
    ZCamera& camera = GetCamera();
    const Zentara_Settings settings = ReadSettings();
    auto word = [&](std::uint32_t key) { return GetSettingsWord(settings, key); };

    EXPECT_EQ(camera.ConvertNormGaindBToGain(camera.GetNormalizedGaindB()), word(0));
    EXPECT_EQ(camera.ConvertAbsoluteOffsetToOffset(camera.GetAbsoluteOffset()), word(1));
    EXPECT_EQ(camera.GetSymmetricalBinningMode(), word(3));
    EXPECT_EQ(camera.GetHorizontalBinningMode(), word(4));
    EXPECT_EQ(camera.GetVerticalBinningMode(), word(5));
    EXPECT_EQ(camera.GetTriggerMode(), word(7));
    EXPECT_EQ(camera.GetRGBFilterStartColour(), word(8));
    EXPECT_EQ(camera.GetCoolerStatus(), word(9) != 0);
    EXPECT_EQ(camera.GetROIX(), word(13));
    EXPECT_EQ(camera.GetROIY(), word(14));
    EXPECT_EQ(camera.GetROIWidth(), word(15));
    EXPECT_EQ(camera.GetROIHeight(), word(16));
    EXPECT_EQ(camera.GetDoubleShotMode(), word(19) != 0);
    EXPECT_EQ(camera.GetSyncBMode(), word(20));
    EXPECT_EQ(camera.GetMetronaShutterDelay(), word(21));
    EXPECT_EQ(camera.GetIntensifierGain(), word(22));
    EXPECT_EQ(camera.GetTriggerDelay(), word(23));
    EXPECT_EQ(camera.GetRTVMode(), word(24) != 0);
    EXPECT_EQ(camera.GetNormalizedGain(), word(25));
    EXPECT_EQ(camera.GetNormalizedIntensifierGaindB(), word(26));
    EXPECT_EQ(camera.GetFanSpeed(), word(33));
    EXPECT_EQ(camera.GetBlackoutMode(), word(34) != 0);
    EXPECT_EQ(camera.GetHighSensitivityMode(), word(35) != 0);
    EXPECT_EQ(camera.GetReadoutPort(), word(36));
    EXPECT_EQ(camera.GetEMGain(), word(37));
    EXPECT_EQ(camera.GetShutterCloseDelay(), word(39));
    EXPECT_EQ(camera.GetDitherMode(), word(42) != 0);
    EXPECT_EQ(camera.GetHighGainMode(), word(43) != 0);
    EXPECT_EQ(camera.GetVClockPeriod(), word(44));
    EXPECT_EQ(camera.GetNormalizedGaindB(), GetSettingsSigned(settings, 0));
    EXPECT_EQ(camera.GetAbsoluteOffset(), GetSettingsSigned(settings, 1));
    EXPECT_EQ(camera.GetRegulatedCoolingTemperature(), GetSettingsSigned(settings, 2));
    EXPECT_EQ(camera.GetExposure(), GetSettingsWide(settings, 0));
    EXPECT_EQ(camera.GetRGBFilterRedExposure(), GetSettingsWide(settings, 1));
    EXPECT_EQ(camera.GetRGBFilterBlueExposure(), GetSettingsWide(settings, 2));
    EXPECT_EQ(camera.GetNormalizedIntensifierGain(), GetSettingsWide(settings, 3));
}

class ColourSettingsOfState : public SettingsOfState {
  protected:
    ColourSettingsOfState() : SettingsOfState(ZV::Test::SmallColour) {}
};

TEST_F(ColourSettingsOfState, AMosaicOfTwelveBitsReadsAsFormatFive) {
    ASSERT_EQ(CameraOk, GetCamera().SetBitDepth(12));

    EXPECT_EQ(static_cast<std::uint32_t>(zfmtBayer16), ReadWord(zprmImageFormat));
}

}  // namespace
}  // namespace ZV
