#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <vector>

#include "support/flat_camera.h"

namespace ZV::Test {
namespace {

class SettingsRead : public OpenedCamera {
  protected:
    explicit SettingsRead(std::string_view scenario = SmallMono) : OpenedCamera(scenario) {}

    static std::uint64_t GetWide(const Zentara_Settings& settings, std::size_t offset) {
        std::uint64_t value;
        std::memcpy(&value, reinterpret_cast<const std::uint8_t*>(&settings) + offset,
                    sizeof(value));
        return value;
    }
    static std::int32_t GetSigned(const Zentara_Settings& settings, std::uint32_t key) {
        return static_cast<std::int32_t>(settings.privateWords[47 + key]);
    }
    static Zentara_Settings MakeFilled(std::uint8_t byte) {
        Zentara_Settings settings;
        std::memset(&settings, byte, sizeof(settings));
        return settings;
    }
};

TEST_F(SettingsRead, ABlockBelongsToItsCameraAndHasSizeAndMagicNumber) {
    const Zentara_Settings settings = ReadSettings();

    EXPECT_EQ(260u, settings.size);
    EXPECT_EQ(handle, GetWide(settings, 244));
    EXPECT_EQ(0xDEADBEEFu, settings.privateWords[62]);
}

TEST_F(SettingsRead, WordsWithoutASourceAndReservedBytesKeepTheClientsMemory) {
    Zentara_Settings first = MakeFilled(0x11);
    Zentara_Settings second = MakeFilled(0x22);

    ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &first));
    ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &first));
    ASSERT_ZERR(zerrNone, Zentara_ReadSettingsFromCam(handle, &second));

    // 58 and 59 are the bytes from 236 on, 63 those from 256 on.
    const std::vector<std::uint32_t> kept{17, 18, 38, 40, 41, 45, 46, 58, 59, 63};
    for (std::uint32_t word = 0; word < 64; ++word) {
        const bool isKept = std::find(kept.begin(), kept.end(), word) != kept.end();
        EXPECT_EQ(isKept ? 0x11111111u : second.privateWords[word], first.privateWords[word])
            << word;
        if (isKept) {
            EXPECT_EQ(0x22222222u, second.privateWords[word]) << word;
        }
    }
}

TEST_F(SettingsRead, TheStateAfterAListingIsTheDefaultOfTheCamera) {
    const Zentara_Settings settings = ReadSettings();

    EXPECT_EQ(1u, settings.privateWords[zprmBinning]);
    EXPECT_EQ(0u, settings.privateWords[zprmTriggerType]);
    EXPECT_EQ(0u, settings.privateWords[zprmRoiX]);
    EXPECT_EQ(0u, settings.privateWords[zprmRoiY]);
    EXPECT_EQ(64u, settings.privateWords[zprmRoiWidth]);
    EXPECT_EQ(48u, settings.privateWords[zprmRoiHeight]);
    EXPECT_EQ(0u, settings.privateWords[zprmCameraMode]);
    EXPECT_EQ(0u, settings.privateWords[zprmDoPostProcessing]);
}

TEST_F(SettingsRead, ExposuresStandTwiceInMicrosecondsAndInNanoseconds) {
    const Zentara_Settings settings = ReadSettings();

    const std::uint64_t nanoseconds = GetWide(settings, 204);
    EXPECT_EQ(nanoseconds / 1000, settings.privateWords[zprmExposure]);
    EXPECT_NE(0u, nanoseconds);
    EXPECT_EQ(std::max<std::uint64_t>(GetWide(settings, 212) / 1000, 1),
              settings.privateWords[zprmExposureRed]);
    EXPECT_EQ(std::max<std::uint64_t>(GetWide(settings, 220) / 1000, 1),
              settings.privateWords[zprmExposureBlue]);
}

TEST_F(SettingsRead, ScalesAreThoseOfAFreshWhiteBalance) {
    const Zentara_Settings settings = ReadSettings();

    EXPECT_EQ(1160u, settings.privateWords[zprmPostProcessGainRed]);
    EXPECT_EQ(1000u, settings.privateWords[zprmPostProcessGainGreen]);
    EXPECT_EQ(1880u, settings.privateWords[zprmPostProcessGainBlue]);
}

TEST_F(SettingsRead, PostProcessingReadsTheCamerasBayerFilter) {
    const Zentara_Settings settings = ReadSettings();

    EXPECT_EQ(1u, settings.privateWords[zprmPostProcessBayerAlgorithm]);
    EXPECT_EQ(12u, settings.privateWords[zprmPostProcessImageFormat]);
}

TEST_F(SettingsRead, AMonochromeCameraWithEightBitsReadsAsFormatTwo) {
    EXPECT_EQ(2u, ReadSettings().privateWords[zprmImageFormat]);
}

TEST_F(SettingsRead, ReadingDoesNotTouchTheBus) {
    const std::size_t before = world.ReadRequests().size();

    ReadSettings();

    EXPECT_EQ(before, world.ReadRequests().size());
}

TEST_F(SettingsRead, ArgumentsAreTestedInOrder) {
    Zentara_Settings settings = MakeFilled(0x11);

    EXPECT_ZERR(zerrBadHandle, Zentara_ReadSettingsFromCam(0, nullptr));
    EXPECT_ZERR(zerrBadParameter, Zentara_ReadSettingsFromCam(0x1000, nullptr));
    EXPECT_ZERR(zerrBadParameter, Zentara_ReadSettingsFromCam(handle, nullptr));
    EXPECT_ZERR(zerrBadHandle, Zentara_ReadSettingsFromCam(0x1000, &settings));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_ZERR(zerrBadHandle, Zentara_ReadSettingsFromCam(handle, &settings));

    EXPECT_EQ(0x11111111u, settings.size);
}

TEST_F(SettingsRead, FramesAfterAReadCarryTheirOwnFormat) {
    ReadSettings();
    ClientFrame frame(GetImageBytes());

    ASSERT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));

    EXPECT_EQ(2u, frame->format);
}

class ColourSettingsRead : public SettingsRead {
  protected:
    ColourSettingsRead() : SettingsRead(SmallColour) {}
};

TEST_F(ColourSettingsRead, AColourCameraWithEightBitsReadsAsFormatFour) {
    EXPECT_EQ(4u, ReadSettings().privateWords[zprmImageFormat]);
}

class IntensifiedSettingsRead : public SettingsRead {
  protected:
    IntensifiedSettingsRead() : SettingsRead("intensified") {}
};

TEST_F(IntensifiedSettingsRead, TheNormalisedIntensifierGainStandsInItsWideWord) {
    const Zentara_Settings settings = ReadSettings();

    EXPECT_NE(0u, GetWide(settings, 228));
}

}  // namespace
}  // namespace ZV::Test
