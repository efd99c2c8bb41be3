#include <gtest/gtest.h>

#include <initializer_list>
#include <limits>

#include "camera/camera.h"
#include "support/flat_camera.h"
#include "support/settings_words.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t WordMax = std::numeric_limits<std::uint32_t>::max();

struct Region {
    std::uint32_t x, y, width, height;
    bool operator==(const Region&) const = default;
};

void PrintTo(const Region& region, std::ostream* stream) {
    *stream << region.x << ", " << region.y << ", " << region.width << " x " << region.height;
}

class Preflight : public OpenedCamera {
  protected:
    explicit Preflight(std::string_view scenario = SmallMono) : OpenedCamera(scenario) {}

    void SetUp() override {
        OpenedCamera::SetUp();
        ASSERT_ZERR(zerrNone, Zentara_ReadDefaultSettings(handle, &block));
    }

    void SetRegion(const Region& region) {
        SetWord(block, zprmRoiX, region.x);
        SetWord(block, zprmRoiY, region.y);
        SetWord(block, zprmRoiWidth, region.width);
        SetWord(block, zprmRoiHeight, region.height);
    }
    Region GetRegion() const {
        return {GetWord(block, zprmRoiX), GetWord(block, zprmRoiY), GetWord(block, zprmRoiWidth),
                GetWord(block, zprmRoiHeight)};
    }
    Region Mend(const Region& region) {
        SetRegion(region);
        EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));
        return GetRegion();
    }
    void SetBinning(std::uint32_t mode) {
        for (const std::uint32_t key : {zprmBinning, zprmVerticalBinning, zprmHorizontalBinning}) {
            SetWord(block, key, mode);
        }
    }
    std::uint32_t MendSpeed(std::uint32_t format, std::uint32_t speed) {
        SetWord(block, zprmImageFormat, format);
        SetWord(block, zprmReadoutSpeed, speed);
        EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));
        return GetWord(block, zprmReadoutSpeed);
    }
    ZCamera& GetCamera() { return *reinterpret_cast<ZCamera*>(handle); }

    Zentara_Settings block{};
};

TEST_F(Preflight, ArgumentsAreTestedInOrder) {
    EXPECT_ZERR(zerrBadHandle, Zentara_PreflightSettings(0, nullptr));
    EXPECT_ZERR(zerrBadParameter, Zentara_PreflightSettings(0x1000, nullptr));
    EXPECT_ZERR(zerrBadParameter, Zentara_PreflightSettings(handle, nullptr));
    EXPECT_ZERR(zerrBadHandle, Zentara_PreflightSettings(0x1000, &block));
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNotLoaded, Zentara_PreflightSettings(0, nullptr));
}

TEST_F(Preflight, ABlockThatFitsComesBackAsItIs) {
    const Zentara_Settings before = block;

    EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));

    EXPECT_TRUE(AreSameBytes(before, block));
}

TEST_F(Preflight, NothingGoesToTheCamera) {
    const std::size_t before = world.ReadRequests().size();
    SetWide(block, zprm64Exposure, 0);

    Mend({WordMax, WordMax, WordMax, WordMax});

    EXPECT_EQ(before, world.ReadRequests().size());
}

// Kept: without the magic number the region is mended; the exposure's limits are refused.
TEST_F(Preflight, AWrongMagicNumberEndsItAtTheExposureWithTheRegionMended) {
    SetRegion({0, 0, 100, 100});
    SetWide(block, zprm64Exposure, 1);
    block.privateWords[SettingsMagicWord] = 0;

    EXPECT_ZERR(zerrBadSettings, Zentara_PreflightSettings(handle, &block));

    EXPECT_EQ((Region{0, 0, 64, 48}), GetRegion());
    EXPECT_EQ(1u, GetWide(block, zprm64Exposure));
}

TEST_F(Preflight, AClosedCameraHasNoExclusiveAccessAndMendsNothing) {
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    SetRegion({0, 0, 100, 100});

    EXPECT_ZERR(zerrBadHandle, Zentara_PreflightSettings(handle, &block));

    EXPECT_EQ((Region{0, 0, 100, 100}), GetRegion());
}

// ---- The region ----

TEST_F(Preflight, ATopEdgeBeyondTheLimitBecomesZeroAndTheHeightFits) {
    EXPECT_EQ((Region{0, 0, 64, 10}), Mend({0, 49, 64, 10}));
    EXPECT_EQ((Region{0, 0, 64, 48}), Mend({0, 5000, 64, 5000}));
    EXPECT_EQ((Region{0, 0, 64, 48}), Mend({0, WordMax, 64, WordMax}));
}

TEST_F(Preflight, ALeftEdgeBeyondTheLimitBecomesZeroAndTheWidthFits) {
    EXPECT_EQ((Region{0, 0, 10, 48}), Mend({65, 0, 10, 48}));
    EXPECT_EQ((Region{0, 0, 64, 48}), Mend({WordMax, 0, WordMax, 48}));
}

// Kept: an edge at the limit itself passes and leaves no pixel.
TEST_F(Preflight, AnEdgeAtTheLimitStaysAndLeavesALengthOfZero) {
    EXPECT_EQ((Region{64, 48, 0, 0}), Mend({64, 48, 1, 1}));
}

TEST_F(Preflight, ARegionOverTheFarEdgeIsCutThere) {
    EXPECT_EQ((Region{60, 40, 4, 8}), Mend({60, 40, 5, 9}));
    EXPECT_EQ((Region{60, 40, 4, 8}), Mend({60, 40, WordMax, WordMax}));
    EXPECT_EQ((Region{60, 40, 4, 8}), Mend({60, 40, 4, 8}));
}

TEST_F(Preflight, BinningSetsTheLimits) {
    SetBinning(2);

    EXPECT_EQ((Region{4, 4, 28, 20}), Mend({4, 4, 64, 48}));
    EXPECT_EQ((Region{0, 0, 10, 10}), Mend({33, 25, 10, 10}));
}

TEST_F(Preflight, UnknownBinningHasTheLimitsOfTheFullSensor) {
    for (const std::uint32_t mode : {0u, 5u, 6u, 7u, 9u, 64u, WordMax}) {
        SetBinning(mode);

        EXPECT_EQ((Region{4, 4, 60, 44}), Mend({4, 4, 64, 48})) << mode;
        EXPECT_EQ(mode, GetWord(block, zprmBinning));
    }
}

TEST_F(Preflight, AMonochromeCameraKeepsOddRegions) {
    EXPECT_EQ((Region{1, 3, 5, 7}), Mend({1, 3, 5, 7}));
}

class ColourPreflight : public Preflight {
  protected:
    explicit ColourPreflight(std::string_view scenario = SmallColour) : Preflight(scenario) {}
};

TEST_F(ColourPreflight, AMosaicMakesTheRegionEven) {
    EXPECT_EQ((Region{2, 4, 6, 8}), Mend({3, 5, 7, 9}));
    EXPECT_EQ((Region{2, 4, 6, 8}), Mend({2, 4, 6, 8}));
}

TEST_F(ColourPreflight, AWidthOfOneBecomesTwo) {
    EXPECT_EQ((Region{0, 0, 2, 2}), Mend({1, 1, 1, 1}));
}

TEST_F(ColourPreflight, ALengthOfZeroStays) {
    EXPECT_EQ((Region{0, 0, 0, 0}), Mend({0, 0, 0, 0}));
}

class OddColourPreflight : public ColourPreflight {
  protected:
    OddColourPreflight()
        : ColourPreflight(
              R"({"base": "colour", "cameras": [{"sensor": {"width": 65, "height": 49}}]})") {}
};

// Kept: the limits come after the alignment, so the second run makes even what the first left odd.
TEST_F(OddColourPreflight, AnOddSensorGivesAnOddRegionThatASecondRunMakesEven) {
    EXPECT_EQ((Region{0, 0, 65, 49}), Mend({0, 0, 66, 50}));
    EXPECT_EQ((Region{0, 0, 64, 48}), Mend({0, 0, 65, 49}));
}

// ---- The readout speed ----

constexpr std::uint32_t DeepFormats[] = {1, 3, 5, 7, 10};
constexpr std::uint32_t OtherFormats[] = {0, 2, 4, 6, 8, 9, 11, 12, 13, WordMax};

class OldPreflight : public Preflight {
  protected:
    OldPreflight()
        : Preflight(R"({"base": "mono", "cameras": [{"sensor": {"width": 64, "height": 48},
                        "streamingVersion": 0}]})") {}
};

TEST_F(OldPreflight, PacketsOfVersion0CarrySixteenBitsAtTenMegahertz) {
    for (const std::uint32_t format : DeepFormats) {
        EXPECT_EQ(1u, MendSpeed(format, 0)) << format;
        for (const std::uint32_t speed : {1u, 2u, 3u, 7u, 8u, 99u}) {
            EXPECT_EQ(speed, MendSpeed(format, speed)) << format;
        }
    }
}

TEST_F(OldPreflight, OtherFormatsKeepTheirSpeed) {
    for (const std::uint32_t format : OtherFormats) EXPECT_EQ(0u, MendSpeed(format, 0)) << format;
}

TEST_F(Preflight, LaterPacketsKeepTheSpeed) {
    for (const std::uint32_t format : DeepFormats) EXPECT_EQ(0u, MendSpeed(format, 0)) << format;
}

class FirstConfigurationPreflight : public Preflight {
  protected:
    FirstConfigurationPreflight()
        : Preflight(R"({"base": "mono", "cameras": [{"sensor": {"width": 64, "height": 48},
                        "versions": {"configuration": "1.2"}}]})") {}
};

TEST_F(FirstConfigurationPreflight, AConfigurationThatDoesNotTellMeansVersion0) {
    EXPECT_EQ(1u, MendSpeed(zfmtMono16, 0));
}

TEST_F(FirstConfigurationPreflight, ItsLimitsAreInMicroseconds) {
    SetWide(block, zprm64Exposure, 9'999);
    EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));
    EXPECT_EQ(10'000u, GetWide(block, zprm64Exposure));
    SetWide(block, zprm64Exposure, 3'600'000'000'001);
    EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));
    EXPECT_EQ(3'600'000'000'000u, GetWide(block, zprm64Exposure));
}

// ---- Exposures ----

TEST_F(Preflight, ExposuresAreHeldWithinTheLimitsAndTheirWordsInMicrosecondsStay) {
    constexpr std::pair<std::uint64_t, std::uint64_t> Exposures[] = {
        {0, 10'000},
        {9'999, 10'000},
        {10'000, 10'000},
        {12'345, 12'345},
        {3'600'000'000'000, 3'600'000'000'000},
        {3'600'000'000'001, 3'600'000'000'000},
        {std::numeric_limits<std::uint64_t>::max(), 3'600'000'000'000}};
    for (const std::uint32_t key : {zprm64Exposure, zprm64ExposureRed, zprm64ExposureBlue}) {
        for (const auto& [asked, expected] : Exposures) {
            const Zentara_Settings before = block;
            SetWide(block, key, asked);

            EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));

            EXPECT_EQ(expected, GetWide(block, key)) << "key " << key;
            for (const std::uint32_t word : {zprmExposure, zprmExposureRed, zprmExposureBlue}) {
                EXPECT_EQ(GetWord(before, word), GetWord(block, word));
            }
        }
    }
}

TEST_F(ColourPreflight, WithoutAWheelTheExposuresOfItsFiltersAreLeftAlone) {
    SetWide(block, zprm64ExposureRed, 1);
    SetWide(block, zprm64ExposureBlue, std::numeric_limits<std::uint64_t>::max());

    EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));

    EXPECT_EQ(1u, GetWide(block, zprm64ExposureRed));
    EXPECT_EQ(std::numeric_limits<std::uint64_t>::max(), GetWide(block, zprm64ExposureBlue));
}

// Gain, offset and temperature are the business of the camera's setters.
TEST_F(Preflight, NothingElseIsLimited) {
    for (std::uint32_t word = 0; word < 47; ++word) {
        const bool isMended = word == zprmCameraMode || (word >= zprmRoiX && word <= zprmRoiHeight);
        if (!isMended) SetWord(block, word, WordMax);
    }
    for (std::uint32_t key = 0; key < 3; ++key) SetSigned(block, key, -2'000'000'000);
    SetWide(block, zprm64NormIntensGain, std::numeric_limits<std::uint64_t>::max());
    const Zentara_Settings before = block;

    EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));

    EXPECT_TRUE(AreSameBytes(before, block));
}

// ---- Real-time video ----

// Kept: on a camera without the mode its largest region is one pixel.
TEST_F(Preflight, RealTimeVideoOnACameraWithoutItLeavesOnePixelAndNoBinning) {
    SetBinning(2);
    SetWord(block, zprmCameraMode, 1);

    EXPECT_EQ((Region{0, 0, 1, 1}), Mend({0, 0, 64, 48}));

    EXPECT_EQ(1u, GetWord(block, zprmBinning));
    EXPECT_EQ(1u, GetWord(block, zprmHorizontalBinning));
    EXPECT_EQ(1u, GetWord(block, zprmVerticalBinning));
}

class FolaryPreflight : public Preflight {
  protected:
    FolaryPreflight()
        : Preflight(R"({"base": "folary", "cameras": [{"sensor": {"width": 64, "height": 48},
                        "configuration": {"5": "0x00200018"}}]})") {}
};

TEST_F(FolaryPreflight, TheWayIntoTheModeReplacesTheRegionByItsLargest) {
    SetBinning(2);
    SetWord(block, zprmCameraMode, 1);

    EXPECT_EQ((Region{2, 2, 32, 24}), Mend({2, 2, 10, 10}));

    EXPECT_EQ(1u, GetWord(block, zprmVerticalBinning));
    EXPECT_FALSE(GetCamera().GetRTVMode());
}

TEST_F(FolaryPreflight, InsideTheModeAClientsRegionStaysWithinTheModesLimits) {
    ASSERT_EQ(CameraOk, GetCamera().SetRTVMode(true));
    SetWord(block, zprmCameraMode, 1);

    EXPECT_EQ((Region{2, 2, 10, 10}), Mend({2, 2, 10, 10}));
    EXPECT_EQ((Region{2, 2, 30, 22}), Mend({2, 2, 64, 48}));
}

// Kept: the mode is really left and entered again, which moves the camera's region to the mode's
// largest.
TEST_F(FolaryPreflight, LeavingTheModeTakesTheLimitsOfTheStandardModeAndLeavesItForAMoment) {
    ASSERT_EQ(CameraOk, GetCamera().SetRTVMode(true));
    ASSERT_EQ(CameraOk, GetCamera().SetROI(2, 2, 8, 8));
    const std::size_t before = world.ReadRegisterWrites().size();
    SetWord(block, zprmCameraMode, 0);

    EXPECT_EQ((Region{4, 4, 60, 44}), Mend({4, 4, 64, 48}));

    EXPECT_TRUE(GetCamera().GetRTVMode());
    EXPECT_EQ(32u, GetCamera().GetROIWidth());
    EXPECT_EQ(24u, GetCamera().GetROIHeight());
    EXPECT_LT(before, world.ReadRegisterWrites().size());
}

// Kept: a preflight alone commits nothing, and so nothing starts the stream again.
TEST_F(FolaryPreflight, LeavingTheModeForAMomentStopsAStreamWhichOnlyASendStartsAgain) {
    ASSERT_EQ(CameraOk, GetCamera().SetRTVMode(true));
    ASSERT_EQ(CameraOk, GetCamera().UpdateSettingsOnCamera());
    ASSERT_ZERR(zerrNone, Zentara_SetStreaming(handle, 1));
    SetWord(block, zprmCameraMode, 0);

    ASSERT_ZERR(zerrNone, Zentara_PreflightSettings(handle, &block));

    EXPECT_FALSE(GetCamera().IsCameraStreaming());
    EXPECT_EQ(0u, world.GetState().isStreaming);
    EXPECT_TRUE(GetCamera().GetRTVMode());
    ASSERT_ZERR(zerrNone, Zentara_SendSettingsToCam(handle, &block));
    EXPECT_TRUE(GetCamera().IsCameraStreaming());
}

// Kept: the vertical limit then goes by the camera's binning, the horizontal one by the block's.
TEST_F(FolaryPreflight, LeavingTheModeTakesTheCamerasBinningForTheHeightAlone) {
    ASSERT_EQ(CameraOk, GetCamera().SetRTVMode(true));
    SetWord(block, zprmCameraMode, 0);
    SetBinning(2);

    EXPECT_EQ((Region{0, 0, 32, 48}).height, Mend({0, 0, 64, 48}).height);
    EXPECT_EQ(64u, Mend({0, 0, 64, 48}).width) << "rounded to whole chunks of the full sensor";
}

class MetronaPreflight : public Preflight {
  protected:
    MetronaPreflight()
        : Preflight(
              R"({"base": "metrona", "cameras": [{"sensor": {"width": 64, "height": 48}}]})") {}
};

TEST_F(MetronaPreflight, EachAxisHasTheLimitOfItsOwnBinning) {
    SetWord(block, zprmBinning, 8);
    SetWord(block, zprmVerticalBinning, 3);
    SetWord(block, zprmHorizontalBinning, 5);

    EXPECT_EQ((Region{0, 0, 12, 16}), Mend({0, 0, 64, 48}));
    SetWord(block, zprmVerticalBinning, 0);
    SetWord(block, zprmHorizontalBinning, 0);
    EXPECT_EQ((Region{0, 0, 64, 48}), Mend({0, 0, 64, 48}));
}

// ---- Two cameras ----

class PreflightOfTwoCameras : public Preflight {
  protected:
    PreflightOfTwoCameras()
        : Preflight(R"({"base": "mono", "cameras": [{"sensor": {"width": 64, "height": 48}},
                        {"model": "SolvaneC1", "sensor": {"width": 96, "height": 80},
                         "configuration": {"39": 777000}}]})") {}

    void SetUp() override {
        Preflight::SetUp();
        ASSERT_ZERR(zerrNone, Zentara_OpenCamera(1, &other));
    }

    ZentaraHandle other = 0;
};

// Kept: the region goes by the handle of the call, exposures go by the block's own.
TEST_F(PreflightOfTwoCameras, RegionAndExposureHaveTheLimitsOfDifferentCameras) {
    SetRegion({0, 0, 1000, 1000});
    SetWide(block, zprm64Exposure, 1);

    EXPECT_ZERR(zerrNone, Zentara_PreflightSettings(other, &block));

    EXPECT_EQ((Region{0, 0, 96, 80}), GetRegion());
    EXPECT_EQ(10'000u, GetWide(block, zprm64Exposure));
}

TEST_F(PreflightOfTwoCameras, ABlockOfAClosedCameraKeepsItsExposure) {
    SetRegion({0, 0, 1000, 1000});
    SetWide(block, zprm64Exposure, 1);
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));

    EXPECT_ZERR(zerrBadSettings, Zentara_PreflightSettings(other, &block));

    EXPECT_EQ((Region{0, 0, 96, 80}), GetRegion());
    EXPECT_EQ(1u, GetWide(block, zprm64Exposure));
}

}  // namespace
}  // namespace ZV::Test
