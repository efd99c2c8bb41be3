#include "api/stream_compatibility.h"

#include <gtest/gtest.h>

#include <set>

#include "api/handles.h"
#include "api/settings_block.h"
#include "support/flat_camera.h"

namespace ZV {
namespace {

class StreamCompatibility : public Test::OpenedCamera {
  protected:
    explicit StreamCompatibility(std::string_view scenario = ZV::Test::SmallMono)
        : OpenedCamera(scenario) {}

    ZCamera& GetCamera() { return *FindCamera(handle); }
    /// Formats up to 20 that the camera would take as it is set now.
    std::set<std::uint32_t> FindFormats() {
        std::set<std::uint32_t> formats;
        Zentara_Settings settings = ReadSettings();
        for (std::uint32_t format = 0; format <= 20; ++format) {
            SetSettingsWord(settings, zprmImageFormat, format);
            if (IsStreamCompatible(GetCamera(), settings)) formats.insert(format);
        }
        return formats;
    }
};

constexpr std::uint32_t Unknown[] = {13, 14, 15, 16, 17, 18, 19, 20};

std::set<std::uint32_t> MakeSet(std::initializer_list<std::uint32_t> known) {
    std::set<std::uint32_t> formats(known);
    formats.insert(std::begin(Unknown), std::end(Unknown));
    return formats;
}

TEST_F(StreamCompatibility, WhatWasReadIsCompatible) {
    EXPECT_TRUE(IsStreamCompatible(GetCamera(), ReadSettings()));
}

TEST_F(StreamCompatibility, WithEightBitsTheByteFormatsOfTheSensorFit) {
    EXPECT_EQ(MakeSet({0, 2, 4}), FindFormats());
}

TEST_F(StreamCompatibility, WithTwelveBitsTheDeepFormatsOfTheSensorFit) {
    ASSERT_EQ(CameraOk, GetCamera().SetBitDepth(12));

    EXPECT_EQ(MakeSet({1, 3, 5}), FindFormats());
}

TEST_F(StreamCompatibility, BehindTheWheelThreeColoursFitAndRawAndMonochromeDoNot) {
    ASSERT_EQ(CameraOk, GetCamera().SetRGBFilterCycle(true));
    ASSERT_TRUE(GetCamera().GetRGBFilterCycleMode());

    EXPECT_EQ(MakeSet({4, 6, 8, 9, 11, 12}), FindFormats());
}

TEST_F(StreamCompatibility, AFormatBeyondTheTableIsNotCompared) {
    Zentara_Settings settings = ReadSettings();
    SetSettingsWord(settings, zprmImageFormat, 0xFFFFFFFF);

    EXPECT_TRUE(IsStreamCompatible(GetCamera(), settings));
}

TEST_F(StreamCompatibility, TheReadoutSpeedIsComparedAsAnIndex) {
    Zentara_Settings settings = ReadSettings();
    ASSERT_EQ(CameraOk, GetCamera().SetReadoutFrequency(10));
    EXPECT_FALSE(IsStreamCompatible(GetCamera(), settings));

    SetSettingsWord(settings, zprmReadoutSpeed, 1);

    EXPECT_TRUE(IsStreamCompatible(GetCamera(), settings));
}

TEST_F(StreamCompatibility, EachSideOfTheRegionIsCompared) {
    for (const std::uint32_t key : {zprmRoiX, zprmRoiY, zprmRoiWidth, zprmRoiHeight}) {
        Zentara_Settings settings = ReadSettings();
        SetSettingsWord(settings, key, GetSettingsWord(settings, key) + 1);

        EXPECT_FALSE(IsStreamCompatible(GetCamera(), settings)) << key;
    }
}

TEST_F(StreamCompatibility, EveryOtherWordIsNotCompared) {
    const Zentara_Settings settings = ReadSettings();
    const std::set<std::uint32_t> compared{6, 12, 13, 14, 15, 16};
    for (std::uint32_t key = 0; key < SettingsWordCount; ++key) {
        if (compared.count(key) != 0) continue;
        Zentara_Settings changed = settings;
        SetSettingsWord(changed, key, 0x12345678);

        EXPECT_TRUE(IsStreamCompatible(GetCamera(), changed)) << key;
    }
}

}  // namespace
}  // namespace ZV
