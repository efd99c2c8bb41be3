#include "api/parameter_checks.h"

#include <gtest/gtest.h>

#include <limits>
#include <optional>
#include <vector>

#include "api/handles.h"
#include "api/parameter_values.h"
#include "api/settings_block.h"
#include "models/folary.h"
#include "models/solvane_a1.h"
#include "support/flat_camera.h"

namespace ZV {
namespace {

using Test::SmallMono;

class ParameterChecks : public Test::OpenedCamera {
  protected:
    explicit ParameterChecks(std::string_view scenario = SmallMono) : OpenedCamera(scenario) {}

    void SetUp() override {
        OpenedCamera::SetUp();
        block = ReadSettings();
    }

    Zentara_Settings block{};
};

TEST_F(ParameterChecks, AValueFarAboveTheGreatestPassesTheCheckOfItsRange) {
    for (const std::uint32_t value : {0u, 1u, 64u, 65u, 1'000'000u, 0xFFFFFFFFu}) {
        EXPECT_ZERR(zerrNone, CheckRangeTableEntry(block, zprmRoiWidth, value)) << value;
    }
}

TEST_F(ParameterChecks, AFailureToReadALimitIsThatOfTheCheck) {
    EXPECT_ZERR(zerrNotSupported, CheckRangeTableEntry(block, zprmBlackoutMode, 0));
    EXPECT_ZERR(zerrNotSupported, CheckRangeTableEntry(block, 47, 0));
    SetSettingsHandle(block, 0);
    EXPECT_ZERR(zerrBadSettings, CheckRangeTableEntry(block, zprmRoiWidth, 0));
}

TEST_F(ParameterChecks, AValueOfTheListPassesAndAnotherIsABadParameter) {
    for (const std::uint32_t value : {1u, 2u, 3u, 4u}) {
        EXPECT_ZERR(zerrNone, CheckSparseTableEntry(block, zprmFan, value)) << value;
    }
    for (const std::uint32_t value : {0u, 5u, 0xFFFFFFFFu}) {
        EXPECT_ZERR(zerrBadParameter, CheckSparseTableEntry(block, zprmFan, value)) << value;
    }
}

TEST_F(ParameterChecks, AFailureToReadTheListIsThatOfTheCheck) {
    EXPECT_ZERR(zerrNotSupported, CheckSparseTableEntry(block, zprmRoiWidth, 0));
    EXPECT_ZERR(zerrNotSupported, CheckSparseTableEntry(block, zprmReadoutPort, 1));
    EXPECT_ZERR(zerrNotSupported, CheckSparseTableEntry(block, 47, 0));
    SetSettingsMagic(block);
    SetSettingsHandle(block, 0x1000);
    EXPECT_ZERR(zerrBadSettings, CheckSparseTableEntry(block, zprmFan, 1));
}

TEST_F(ParameterChecks, TheCameraOfABlockIsFoundWhileItIsOpen) {
    EXPECT_EQ(FindCamera(handle), FindBlockCamera(block));
    ASSERT_ZERR(zerrNone, Zentara_CloseCamera(handle));
    EXPECT_EQ(nullptr, FindBlockCamera(block));
}

class SeparateBinning : public ParameterChecks {
  protected:
    SeparateBinning() : ParameterChecks("metrona") {}
};

// The check has room for 30 entries; the setters of binning look at the camera's whole list.
TEST_F(SeparateBinning, TheCheckOfAListSeesItsFirstThirtyEntries) {
    EXPECT_ZERR(zerrNone, CheckSparseTableEntry(block, zprmVerticalBinning, 30));
    EXPECT_ZERR(zerrBadParameter, CheckSparseTableEntry(block, zprmVerticalBinning, 31));
    EXPECT_ZERR(zerrNone, Zentara_SetParam(&block, zprmVerticalBinning, 64));
}

TEST(ParameterLists, TheReadoutPortIsOneEntry) {
    SolvaneA1 camera{HALCamera{}};
    std::vector<std::uint32_t> values;

    FindWordParameter(zprmReadoutPort)->list(camera, values);

    EXPECT_EQ((std::vector<std::uint32_t>{1}), values);
}

class OddSpeeds : public SolvaneA1 {
  public:
    using SolvaneA1::SolvaneA1;
    void GetReadoutFrequencyModes(std::vector<float>& modes) override {
        modes.insert(modes.end(), frequencies.begin(), frequencies.end());
    }
    std::vector<float> frequencies;
};

TEST(ParameterLists, AFrequencyWithoutASpeedIndexIsSkipped) {
    OddSpeeds camera{HALCamera{}};
    camera.frequencies = {25.0F, 2.5F, 35.0F, 40.0F, 12.0F, 30.0F, 1.0F};
    std::vector<std::uint32_t> values;

    ListReadoutSpeeds(camera, values);

    EXPECT_EQ((std::vector<std::uint32_t>{8, 7, 3}), values);
}

TEST(ParameterLists, AFirstFrequencyWithoutASpeedIndexMakesZeroTheGreatest) {
    OddSpeeds camera{HALCamera{}};
    camera.frequencies = {25.0F, 40.0F};
    EXPECT_EQ(0u, GetFirstReadoutSpeed(camera));
    camera.frequencies = {40.0F, 25.0F};
    EXPECT_EQ(7u, GetFirstReadoutSpeed(camera));
    camera.frequencies.clear();
    EXPECT_EQ(std::nullopt, GetFirstReadoutSpeed(camera));
}

TEST(ParameterLists, SyncBWithoutAModeHasNoLimits) {
    Folary none{HALCamera{}};
    EXPECT_EQ(std::nullopt, GetFirstSyncBMode(none));
    EXPECT_EQ(std::nullopt, GetLastSyncBMode(none));
    SolvaneA1 two{HALCamera{}};
    EXPECT_EQ(0u, GetFirstSyncBMode(two));
    EXPECT_EQ(1u, GetLastSyncBMode(two));
}

class OddGain : public SolvaneA1 {
  public:
    using SolvaneA1::SolvaneA1;
    double GetNormalizedGainMin() override { return least; }
    double GetNormalizedGainMax() override { return greatest; }
    double least = 0;
    double greatest = 0;
};

TEST(ParameterLists, LimitsOfTheNormalisedGainAreTruncatedMillionths) {
    OddGain camera{HALCamera{}};
    camera.least = 0.2500009;
    camera.greatest = 3.984375;
    EXPECT_EQ(250'000u, GetLeastNormalizedGain(camera));
    EXPECT_EQ(3'984'375u, GetGreatestNormalizedGain(camera));
}

TEST(ParameterLists, ALimitOfTheNormalisedGainThatFitsNoWordEndsAtItsEnds) {
    OddGain camera{HALCamera{}};
    camera.least = -1.0;
    camera.greatest = 1e12;
    EXPECT_EQ(0u, GetLeastNormalizedGain(camera));
    EXPECT_EQ(0xFFFFFFFFu, GetGreatestNormalizedGain(camera));
    camera.greatest = std::numeric_limits<double>::quiet_NaN();
    EXPECT_EQ(0u, GetGreatestNormalizedGain(camera));
}

}  // namespace
}  // namespace ZV
