#include "api/settings_units.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace ZV {
namespace {

TEST(SettingsUnits, AnExposureOfFiveHundredNanosecondsIsOneMicrosecond) {
    EXPECT_EQ(1u, ConvertNanosecondsToMicroseconds(500));
    EXPECT_EQ(1u, ConvertNanosecondsToMicroseconds(0));
    EXPECT_EQ(1u, ConvertNanosecondsToMicroseconds(1999));
    EXPECT_EQ(2u, ConvertNanosecondsToMicroseconds(2000));
}

TEST(SettingsUnits, MicrosecondsAreHeldAtTheTopOfTheWord) {
    EXPECT_EQ(0xFFFFFFFE, ConvertNanosecondsToMicroseconds(4294967294999));
    EXPECT_EQ(0xFFFFFFFF, ConvertNanosecondsToMicroseconds(4294967295000));
    EXPECT_EQ(0xFFFFFFFF, ConvertNanosecondsToMicroseconds(4294967296000));
    EXPECT_EQ(0xFFFFFFFF,
              ConvertNanosecondsToMicroseconds(std::numeric_limits<std::uint64_t>::max()));
}

TEST(SettingsUnits, MicrosecondsBecomeNanosecondsInSixtyFourBits) {
    EXPECT_EQ(0u, ConvertMicrosecondsToNanoseconds(0));
    EXPECT_EQ(4294967295000u, ConvertMicrosecondsToNanoseconds(0xFFFFFFFF));
}

TEST(SettingsUnits, SpeedsGoBothWaysThroughTheTable) {
    const struct {
        std::uint32_t index;
        float megahertz;
    } rows[] = {{0, 20}, {1, 10}, {2, 5}, {3, 2.5F}, {7, 40}, {8, 30}};

    for (const auto& row : rows) {
        EXPECT_EQ(row.index, ConvertMegahertzToSpeedIndex(row.megahertz));
        EXPECT_EQ(row.megahertz, ConvertSpeedIndexToMegahertz(row.index));
    }
}

TEST(SettingsUnits, AFrequencyOutsideTheTableReadsAsTwentyMegahertz) {
    for (const float megahertz : {25.0F, 35.0F, 0.0F, 1.0F, 24.0F, 48.0F}) {
        EXPECT_EQ(0u, ConvertMegahertzToSpeedIndex(megahertz)) << megahertz;
    }
}

TEST(SettingsUnits, AnIndexOutsideTheTableIsNoSpeed) {
    for (const std::uint32_t index : {4u, 5u, 6u, 9u, 0xFFFFFFFFu}) {
        EXPECT_EQ(0.0F, ConvertSpeedIndexToMegahertz(index)) << index;
    }
}

TEST(SettingsUnits, ScalesAreMultipliedInSinglePrecision) {
    EXPECT_EQ(1160u, ConvertScaleToThousandths(1.16F));
    EXPECT_EQ(1000u, ConvertScaleToThousandths(1.0F));
    EXPECT_EQ(1880u, ConvertScaleToThousandths(1.88F));
}

TEST(SettingsUnits, SomeScalesReadBackOneLower) {
    std::uint32_t lower = 0;
    for (std::uint32_t thousandths = 0; thousandths <= 100000; ++thousandths) {
        const float scale = static_cast<float>(thousandths) / 1000.0F;
        if (ConvertScaleToThousandths(scale) + 1 == thousandths) ++lower;
    }

    EXPECT_EQ(739u, lower);
    EXPECT_EQ(250u, ConvertScaleToThousandths(251.0F / 1000.0F));
}

TEST(SettingsUnits, ScalesThatDoNotFitAreHeld) {
    EXPECT_EQ(0u, ConvertScaleToThousandths(-1.0F));
    EXPECT_EQ(0u, ConvertScaleToThousandths(std::nanf("")));
    EXPECT_EQ(0xFFFFFFFF, ConvertScaleToThousandths(1e30F));
}

}  // namespace
}  // namespace ZV
