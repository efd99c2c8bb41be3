#include "camera/setting_codes.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ZV::Test {

using testing::ElementsAre;

TEST(FrequencyCodes, AreThoseOfTheTable) {
    const float frequencies[] = {20.0F, 10.0F, 5.0F, 2.5F, 25.0F, 30.0F, 35.0F, 40.0F};
    for (std::uint32_t code = 0; code < 8; ++code) {
        EXPECT_EQ(frequencies[code], ConvertCodeToFrequency(code));
        EXPECT_EQ(code, FindFrequencyCode(frequencies[code]));
    }
    for (std::uint32_t code = 8; code < 16; ++code) {
        EXPECT_EQ(0.0F, ConvertCodeToFrequency(code));
    }
    EXPECT_FALSE(FindFrequencyCode(0.0F));
    EXPECT_FALSE(FindFrequencyCode(20.001F));
}

TEST(BitDepthCodes, NeverWrite12AsItsOwnCode) {
    EXPECT_EQ(0u, FindBitDepthCode(8));
    EXPECT_EQ(1u, FindBitDepthCode(10));
    EXPECT_EQ(1u, FindBitDepthCode(12));
    EXPECT_EQ(3u, FindBitDepthCode(14));
    EXPECT_EQ(1u, FindBitDepthCode(16));
    for (const std::uint32_t bits : {0u, 1u, 9u, 11u, 13u, 15u, 17u, 0xFFFFFFFFu}) {
        EXPECT_FALSE(FindBitDepthCode(bits)) << bits;
    }
}

TEST(BinningCodes, ShareCode2BetweenModes3And8) {
    const std::uint32_t codes[] = {9, 0, 1, 2, 3, 9, 9, 9, 2, 9};
    for (std::uint32_t mode = 0; mode < 10; ++mode) {
        EXPECT_EQ(codes[mode], FindBinningCode(mode).value_or(9)) << mode;
    }
    EXPECT_EQ(1, ConvertCodeToBinning(0, true));
    EXPECT_EQ(2, ConvertCodeToBinning(1, true));
    EXPECT_EQ(8, ConvertCodeToBinning(2, true));
    EXPECT_EQ(3, ConvertCodeToBinning(2, false));
    EXPECT_EQ(4, ConvertCodeToBinning(3, false));
}

struct TriggerCase {
    std::uint32_t mode, written, writtenInDoubleShot;
};

TEST(TriggerCodes, AreThoseOfTheTable) {
    const TriggerCase cases[] = {
        {0, 0, 0}, {1, 2, 4}, {2, 0x102, 0x104}, {3, 3, 3}, {4, 0x103, 0x103},
        {5, 1, 1}, {6, 5, 5}, {7, 0x105, 0x105}, {8, 0, 0}, {0xFFFFFFFF, 0, 0}};
    for (const TriggerCase& row : cases) {
        const TriggerCode plain = FindTriggerCode(row.mode, false);
        const TriggerCode doubled = FindTriggerCode(row.mode, true);

        EXPECT_EQ(row.written, plain.polarity << 8 | plain.type) << row.mode;
        EXPECT_EQ(row.writtenInDoubleShot, doubled.polarity << 8 | doubled.type) << row.mode;
        EXPECT_EQ(row.mode <= 7 ? row.mode : 0, FindTriggerMode(plain));
        EXPECT_EQ(row.mode <= 7 ? row.mode : 0, FindTriggerMode(doubled));
    }
}

TEST(TriggerCodes, ReadAs0ForTypesOfNoMeaningAndOfEitherPolarityForTypes0And1) {
    for (std::uint32_t type = 6; type < 16; ++type) {
        EXPECT_EQ(0u, FindTriggerMode({type, 0}));
        EXPECT_EQ(0u, FindTriggerMode({type, 1}));
    }
    EXPECT_EQ(0u, FindTriggerMode({0, 1}));
    EXPECT_EQ(5u, FindTriggerMode({1, 1}));
}

TEST(TriggerModes, AreShortWhileTheFilterWheelCycles) {
    std::vector<std::uint32_t> still, cycling;

    AppendTriggerModes(7, false, still);
    AppendTriggerModes(7, true, cycling);

    EXPECT_THAT(still, ElementsAre(0, 1, 2, 3, 4, 5, 6, 7));
    EXPECT_THAT(cycling, ElementsAre(0, 5));
}

TEST(TemperatureCodes, ReadBackAboveZeroOneDegreeLower) {
    EXPECT_EQ(2925u, ConvertCelsiusToCode(20));
    EXPECT_EQ(19, ConvertTemperatureCode(2925));
    for (std::int32_t celsius = -55; celsius <= 0; ++celsius) {
        EXPECT_EQ(celsius, ConvertTemperatureCode(ConvertCelsiusToCode(celsius)));
    }
    for (std::int32_t celsius = 1; celsius <= 49; ++celsius) {
        EXPECT_EQ(celsius - 1, ConvertTemperatureCode(ConvertCelsiusToCode(celsius)));
    }
}

TEST(TemperatureCodes, ReachFromMinus55To50AndReadAs0Beyond) {
    EXPECT_EQ(0u, ConvertCelsiusToCode(-55));
    EXPECT_EQ(-55, ConvertTemperatureCode(0));
    EXPECT_EQ(-54, ConvertTemperatureCode(1)) << "truncated towards zero";
    EXPECT_EQ(49, ConvertTemperatureCode(4095));
    EXPECT_EQ(50, ConvertTemperatureCode(4096));
    EXPECT_EQ(50, ConvertTemperatureCode(4135));
    EXPECT_EQ(0, ConvertTemperatureCode(4136));
    EXPECT_EQ(0, ConvertTemperatureCode(0xFFFF));
}

TEST(VerticalClock, ConvertsCountsAndPeriods) {
    EXPECT_EQ(2000u, ConvertVClockCount(80, 40000000));
    EXPECT_EQ(80u, ConvertVClockPeriod(2000, 40000000));
    EXPECT_EQ(30u, ConvertVClockCount(1, 33000000)) << "truncated";
    EXPECT_EQ(0u, ConvertVClockPeriod(30, 33000000)) << "truncated";
    EXPECT_EQ(40000u, ConvertVClockPeriod(1000000, 40000000));
    EXPECT_EQ(14464u, ConvertVClockPeriod(2000000, 40000000)) << "low 16 bits";
}

TEST(VerticalClock, HasNoPeriodAndNoCountForAResolutionOf0) {
    EXPECT_EQ(0u, ConvertVClockCount(80, 0));
    EXPECT_EQ(0u, ConvertVClockPeriod(2000, 0));
}

TEST(CloseDelay, CountsInStepsOfSixPointFour) {
    EXPECT_EQ(640u, ConvertCloseDelayCode(100));
    EXPECT_EQ(6u, ConvertCloseDelayCode(1));
    EXPECT_EQ(26208u, ConvertCloseDelayCode(4095));
    EXPECT_EQ(100u, ConvertCloseDelay(640));
    EXPECT_EQ(0u, ConvertCloseDelay(6));
    EXPECT_EQ(4095u, ConvertCloseDelay(26208));
}

TEST(Microseconds, AreAtLeast1AndSaturate) {
    EXPECT_EQ(1u, ConvertToMicroseconds(0));
    EXPECT_EQ(1u, ConvertToMicroseconds(1999));
    EXPECT_EQ(2u, ConvertToMicroseconds(2000));
    EXPECT_EQ(0xFFFFFFFEu, ConvertToMicroseconds(0xFFFFFFFEull * 1000));
    EXPECT_EQ(0xFFFFFFFFu, ConvertToMicroseconds(0xFFFFFFFFull * 1000));
    EXPECT_EQ(0xFFFFFFFFu, ConvertToMicroseconds(UINT64_MAX));
}

}  // namespace ZV::Test
