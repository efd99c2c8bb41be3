#include <gtest/gtest.h>

#include <map>

#include "camera/camera.h"
#include "support/flat_camera.h"
#include "support/settings_words.h"

namespace ZV::Test {
namespace {

using Words = std::map<std::uint32_t, std::uint32_t>;

/// What a camera without any extra has as its default.
const Words CommonWords{
    {zprmGain, 600},
    {zprmOffset, 16},
    {zprmExposure, 16384},
    {zprmBinning, 1},
    {zprmHorizontalBinning, 1},
    {zprmVerticalBinning, 1},
    {zprmReadoutSpeed, zspeed20MHz},
    {zprmExposureRed, 28100},
    {zprmExposureBlue, 34900},
    {zprmRoiWidth, 64},
    {zprmRoiHeight, 48},
    {zprmSyncb, 1},
    {zprmMetronaShutterDelay, 1000},
    {zprmNormalizedGain, 1000000},
    {zprmPostProcessGainRed, 1160},
    {zprmPostProcessGainGreen, 1000},
    {zprmPostProcessGainBlue, 1880},
    {zprmFan, 4},
    {zprmReadoutPort, 1},
};

class SettingsDefaults : public OpenedCamera {
  protected:
    explicit SettingsDefaults(std::string_view scenario = SmallMono) : OpenedCamera(scenario) {}

    Zentara_Settings ReadDefaults() {
        Zentara_Settings settings = MakeFilledBlock(0x11);
        EXPECT_ZERR(zerrNone, Zentara_ReadDefaultSettings(handle, &settings));
        return settings;
    }
    ZCamera& GetCamera() { return *reinterpret_cast<ZCamera*>(handle); }

    /// All words of the 32-bit group: the common ones, `changed` in their place, 0 elsewhere.
    static void ExpectWords(const Words& changed, const Zentara_Settings& settings) {
        Words expected = CommonWords;
        for (const auto& [key, value] : changed) expected[key] = value;
        for (std::uint32_t key = 0; key < 47; ++key) {
            EXPECT_EQ(expected[key], GetWord(settings, key)) << "word " << key;
        }
    }
};

TEST_F(SettingsDefaults, AMonochromeCameraHasFormatTwoAndAverageAsItsDefaults) {
    ExpectWords({{zprmCoolerActive, 1},
                 {zprmImageFormat, 2},
                 {zprmPostProcessImageFormat, 2},
                 {zprmPostProcessBayerAlgorithm, 1}},
                ReadDefaults());
}

TEST_F(SettingsDefaults, TheSignedAndWideWordsHaveTheDefaultsThatAreSent) {
    const Zentara_Settings settings = ReadDefaults();

    EXPECT_EQ(0, GetSigned(settings, zprmS32NormalizedGaindB));
    EXPECT_EQ(0, GetSigned(settings, zprmS32AbsoluteOffset));
    EXPECT_EQ(-40, GetSigned(settings, zprmS32RegulatedCoolingTemp));
    EXPECT_EQ(16'384'000u, GetWide(settings, zprm64Exposure));
    EXPECT_EQ(28'100'000u, GetWide(settings, zprm64ExposureRed));
    EXPECT_EQ(34'900'000u, GetWide(settings, zprm64ExposureBlue));
    EXPECT_EQ(0u, GetWide(settings, zprm64NormIntensGain));
}

TEST_F(SettingsDefaults, AllOtherBytesAreCleared) {
    const Zentara_Settings settings = ReadDefaults();

    EXPECT_EQ(260u, settings.size);
    EXPECT_EQ(0u, ReadField<std::uint64_t>(settings, 236));
    EXPECT_EQ(handle, GetHandleOf(settings));
    EXPECT_EQ(0xDEADBEEFu, ReadField<std::uint32_t>(settings, 252));
    EXPECT_EQ(0u, ReadField<std::uint32_t>(settings, 256));
}

TEST_F(SettingsDefaults, AskingForThemDoesNotTouchTheBus) {
    const std::size_t before = world.ReadRequests().size();

    ReadDefaults();

    EXPECT_EQ(before, world.ReadRequests().size());
}

// Kept: the depth is that of the camera, not eight bits.
TEST_F(SettingsDefaults, ACameraAtSixteenBitsKeepsItsDepthByItsDefaults) {
    ASSERT_EQ(CameraOk, GetCamera().SetBitDepth(12));

    const Zentara_Settings settings = ReadDefaults();

    EXPECT_EQ(3u, GetWord(settings, zprmImageFormat));
    EXPECT_EQ(2u, GetWord(settings, zprmPostProcessImageFormat));
}

TEST_F(SettingsDefaults, AChangedCameraChangesNoOtherDefault) {
    const Zentara_Settings before = ReadDefaults();
    ASSERT_EQ(CameraOk, GetCamera().SetROI(2, 4, 6, 8));
    ASSERT_EQ(CameraOk, GetCamera().SetReadoutFrequency(5));
    ASSERT_EQ(CameraOk, GetCamera().SetExposure(123456789));
    ASSERT_EQ(CameraOk, GetCamera().SetTriggerMode(1));
    ASSERT_EQ(CameraOk, GetCamera().SetFanSpeed(1));
    ASSERT_EQ(CameraOk, GetCamera().SetRegulatedCoolingTemp(-5));

    EXPECT_TRUE(AreSameBytes(before, ReadDefaults()));
}

TEST_F(SettingsDefaults, ArgumentsAreTestedInOrderAndNothingIsWrittenOnARefusal) {
    Zentara_Settings settings = MakeFilledBlock(0x11);

    EXPECT_ZERR(zerrBadHandle, Zentara_ReadDefaultSettings(0, nullptr));
    EXPECT_ZERR(zerrBadParameter, Zentara_ReadDefaultSettings(0x1000, nullptr));
    EXPECT_ZERR(zerrBadParameter, Zentara_ReadDefaultSettings(handle, nullptr));
    EXPECT_ZERR(zerrBadHandle, Zentara_ReadDefaultSettings(0, &settings));
    EXPECT_ZERR(zerrBadHandle, Zentara_ReadDefaultSettings(0x1000, &settings));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_ZERR(zerrBadHandle, Zentara_ReadDefaultSettings(handle, &settings));
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNotLoaded, Zentara_ReadDefaultSettings(0, nullptr));

    EXPECT_TRUE(AreSameBytes(MakeFilledBlock(0x11), settings));
}

TEST_F(SettingsDefaults, TranslatingABlockIsNotSupportedOnceLoadedAndTouchesNothing) {
    Zentara_Settings settings = MakeFilledBlock(0x11);

    EXPECT_ZERR(zerrNotSupported, Zentara_TranslateSettings(handle, &settings));
    EXPECT_ZERR(zerrNotSupported, Zentara_TranslateSettings(0, nullptr));
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNotLoaded, Zentara_TranslateSettings(handle, &settings));

    EXPECT_TRUE(AreSameBytes(MakeFilledBlock(0x11), settings));
}

TEST_F(SettingsDefaults, AnExposureOf500NanosecondsReadsAsOneMicrosecond) {
    ASSERT_EQ(CameraOk, GetCamera().SetExposure(500));

    const Zentara_Settings settings = ReadSettings();

    EXPECT_EQ(1u, GetWord(settings, zprmExposure));
    EXPECT_EQ(500u, GetWide(settings, zprm64Exposure));
}

TEST_F(SettingsDefaults, AnExposureBeyondTheWordReadsAsItsGreatestValue) {
    ASSERT_EQ(CameraOk, GetCamera().SetExposure(4'294'967'295'000));

    EXPECT_EQ(0xFFFFFFFFu, GetWord(ReadSettings(), zprmExposure));
}

TEST_F(SettingsDefaults, AFrequencyOutsideTheTableReadsAsSpeedIndexZero) {
    for (const float megahertz : {25.0f, 35.0f}) {
        ASSERT_EQ(CameraOk, GetCamera().SetReadoutFrequency(megahertz));
        ASSERT_EQ(megahertz, GetCamera().GetReadoutFrequency());

        EXPECT_EQ(0u, GetWord(ReadSettings(), zprmReadoutSpeed)) << megahertz;
    }
}

TEST_F(SettingsDefaults, EverySpeedOfTheTableReadsAsItsIndex) {
    constexpr std::pair<float, std::uint32_t> Speeds[] = {{20.0f, 0}, {10.0f, 1}, {5.0f, 2},
                                                          {2.5f, 3},  {40.0f, 7}, {30.0f, 8}};
    for (const auto& [megahertz, index] : Speeds) {
        ASSERT_EQ(CameraOk, GetCamera().SetReadoutFrequency(megahertz));

        EXPECT_EQ(index, GetWord(ReadSettings(), zprmReadoutSpeed)) << megahertz;
    }
}

class ColourSettingsDefaults : public SettingsDefaults {
  protected:
    ColourSettingsDefaults() : SettingsDefaults(SmallColour) {}
};

TEST_F(ColourSettingsDefaults,
       ABayerCameraHasFormatFourAndPostProcessingToRGB24ByTheFasterBicubic) {
    ExpectWords({{zprmImageFormat, 4},
                 {zprmPostProcessImageFormat, 12},
                 {zprmPostProcessBayerAlgorithm, 4}},
                ReadDefaults());
}

TEST_F(ColourSettingsDefaults, AtSixteenBitsTheFormatIsFive) {
    ASSERT_EQ(CameraOk, GetCamera().SetBitDepth(12));

    EXPECT_EQ(5u, GetWord(ReadDefaults(), zprmImageFormat));
    EXPECT_EQ(5u, GetWord(ReadSettings(), zprmImageFormat));
}

TEST_F(ColourSettingsDefaults, WithoutCoolingTheTargetIsZero) {
    EXPECT_EQ(0, GetSigned(ReadDefaults(), zprmS32RegulatedCoolingTemp));
}

class OtherColourKind : public SettingsDefaults {
  protected:
    OtherColourKind()
        : SettingsDefaults(R"({"base": "mono", "cameras": [{"sensor": {"width": 64, "height": 48},
                               "configuration": {"17": "0x00060200"}}]})") {}
};

TEST_F(OtherColourKind, TheWordsThatGoByTheColourStayZero) {
    const Zentara_Settings settings = ReadDefaults();

    EXPECT_EQ(0u, GetWord(settings, zprmImageFormat));
    EXPECT_EQ(0u, GetWord(settings, zprmPostProcessImageFormat));
    EXPECT_EQ(0u, GetWord(settings, zprmPostProcessBayerAlgorithm));
}

TEST_F(OtherColourKind, ReadingLeavesTheFormatWordToTheClient) {
    Zentara_Settings settings = MakeFilledBlock(0x11);

    ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &settings));

    EXPECT_EQ(0x11111111u, GetWord(settings, zprmImageFormat));
}

/// All features of quadlet 169, dither and high gain on by default.
class RichSettingsDefaults : public SettingsDefaults {
  protected:
    RichSettingsDefaults()
        : SettingsDefaults(
              R"({"base": "model:SolvaneG1", "cameras": [{"sensor": {"width": 64, "height": 48},
                  "configuration": {"169": "0x1F5E", "196": 3}}]})") {}
};

// Kept: dither has a default of its own; high gain takes the present state, which is off.
TEST_F(RichSettingsDefaults, ComeFromTheCameraExceptForHighGain) {
    ExpectWords({{zprmCoolerActive, 1},
                 {zprmImageFormat, 2},
                 {zprmPostProcessImageFormat, 2},
                 {zprmPostProcessBayerAlgorithm, 1},
                 {zprmEMGain, 10},
                 {zprmCloseDelay, 640},
                 {zprmDither, 1},
                 {zprmHighGainMode, 0},
                 {zprmVClockPeriod, 2000}},
                ReadDefaults());
}

class IntensifiedSettingsDefaults : public SettingsDefaults {
  protected:
    IntensifiedSettingsDefaults() : SettingsDefaults("intensified") {}
};

TEST_F(IntensifiedSettingsDefaults, TheIntensifierHasItsLeastGain) {
    const Zentara_Settings settings = ReadDefaults();

    // Kept: the word of the gain in dB gets the least control value.
    EXPECT_EQ(100u, GetWord(settings, zprmNormIntensGaindB));
    EXPECT_EQ(0u, GetWord(settings, zprmIntensifierGain));
    EXPECT_EQ(GetCamera().GetNormalizedIntensifierGainMin(),
              GetWide(settings, zprm64NormIntensGain));
    EXPECT_LT(1'000'000u, GetWide(settings, zprm64NormIntensGain));
}

class MetronaSettingsDefaults : public SettingsDefaults {
  protected:
    MetronaSettingsDefaults() : SettingsDefaults("metrona") {}
};

TEST_F(MetronaSettingsDefaults, AModelHasItsOwnExposureSpeedAndDepth) {
    const Zentara_Settings settings = ReadDefaults();

    EXPECT_EQ(100'000u, GetWord(settings, zprmExposure));
    EXPECT_EQ(100'000'000u, GetWide(settings, zprm64Exposure));
    EXPECT_EQ(2u, GetWord(settings, zprmReadoutSpeed));
    EXPECT_EQ(3u, GetWord(settings, zprmImageFormat));
}

}  // namespace
}  // namespace ZV::Test
