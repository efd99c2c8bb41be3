#include "tools/setting_values.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>

#include "zentara/zentara.h"

namespace ZentaraProgram {
namespace {

using testing::HasSubstr;

const Setting& Find(const char* name) {
    const Setting* setting = FindSetting(name);
    EXPECT_NE(nullptr, setting) << name;
    return *setting;
}

struct Reading {
    const char* setting;
    const char* text;
    SettingValue value;
};

constexpr Reading Readings[] = {
    {"exposure", "250ms", 250000000},
    {"exposure", "1.5s", 1500000000},
    {"exposure", " 1.5 s ", 1500000000},
    {"exposure", "20us", 20000},
    {"exposure", "20 \u00B5s", 20000},
    {"exposure", "20 \u03BCs", 20000},
    {"exposure", "16.384 ms", 16384000},
    {"exposure", "1000000ns", 1000000},
    {"exposure", ".5s", 500000000},
    {"exposure", "2.s", 2000000000},
    {"exposure", "1e-3s", 1000000},
    {"exposure", "1.5E3 ms", 1500000000},
    {"exposure", "250MS", 250000000},
    {"exposure", "0", 0},
    {"exposure", "0.000000001s", 1},
    {"exposure", "0000000000000000000000000000001s", 1000000000},
    {"exposure", "1.000000000000000000000000000000s", 1000000000},
    {"exposure-us", "250", 250},
    {"exposure-us", "250ms", 250000},
    {"trigger-delay", "20us", 20000},
    {"gain-db", "3.5", 3500000},
    {"gain-db", "3.5dB", 3500000},
    {"gain-db", "-0.25 db", -250000},
    {"gain-db", "+1", 1000000},
    {"cooling", "-10C", -10},
    {"cooling", "-10", -10},
    {"cooling", "5 \u00B0C", 5},
    {"normalized-gain", "1.25x", 1250000},
    {"post-process-gain-red", "1.16", 1160},
    {"roi-width", "640px", 640},
    {"roi-width", "640", 640},
    {"roi-width", "640 pixels", 640},
    {"offset", "-16", -16},
    {"cooler-active", "on", 1},
    {"cooler-active", "OFF", 0},
    {"cooler-active", "yes", 1},
    {"cooler-active", "false", 0},
    {"cooler-active", "1", 1},
    {"image-format", "mono16", zfmtMono16},
    {"image-format", "Mono 16-Bit", zfmtMono16},
    {"image-format", "mono-8", zfmtMono8},
    {"image-format", "rgb plane 8", zfmtRGBPlane8},
    {"image-format", "BGR24", zfmtBGR24},
    {"image-format", "77", 77},
    {"trigger-type", "software", ztrigSoftware},
    {"trigger-type", "free-run", ztrigFreeRun},
    {"trigger-type", "Type 2 Polarity 1", ztrigType2Polarity1},
    {"readout-speed", "10MHz", zspeed10MHz},
    {"readout-speed", "2.5 MHz", zspeed2500kHz},
    {"camera-mode", "rtv", zmodeRealTimeVideo},
    {"camera-mode", "standard", zmodeStandard},
    {"post-process-bayer-algorithm", "Bicubic - Faster", zbayerBicubicFaster},
    {"post-process-bayer-algorithm", "bicubic", zbayerBicubic},
    {"fan", "full", zfanFull},
    {"register-tweak", "0x10000123", 0x10000123},
    {"register-tweak", "15", 15},
};

TEST(SettingValues, ValuesAreReadWithTheirUnitsAndNames) {
    for (const Reading& reading : Readings) {
        const ParsedValue parsed = ParseValue(Find(reading.setting), reading.text);

        EXPECT_EQ(reading.value, parsed.value.value_or(-999))
            << reading.setting << "=" << reading.text << ": " << parsed.problem;
    }
}

struct Refusal {
    const char* setting;
    const char* text;
    const char* problem;
};

constexpr Refusal Refusals[] = {
    {"exposure", "250", "exposure: '250' needs a unit: ns, us, ms, s"},
    {"exposure", "250h", "exposure: 'h' is not a unit of it; its units are ns, us, ms, s"},
    {"exposure", "long", "exposure: 'long' is not a number"},
    {"exposure", "", "exposure: '' is not a number"},
    {"exposure", "-", "exposure: '-' is not a number"},
    {"exposure", ".s", "exposure: '.s' is not a number"},
    {"exposure", "0.5ns", "exposure: '0.5ns' is finer than its steps of 1 ns"},
    {"exposure", "1e-400s", "exposure: 'e-400s' is not a unit of it"},
    {"exposure", "9999999999999999999999s", "is out of range"},
    {"exposure", "1e99s", "is out of range"},
    {"gain-db", "0.0000001", "gain-db: '0.0000001' is finer than its steps of 0.000001 dB"},
    {"gain-db", "3x", "gain-db: 'x' is not a unit of it; its units are dB"},
    {"cooling", "-10.5C", "cooling: '-10.5C' is finer than its steps of 1 C"},
    {"cooling", "14F", "cooling: 'F' is not a unit of it; its units are C"},
    {"roi-width", "wide", "roi-width: 'wide' is not a number"},
    {"binning", "2x", "binning: '2x' is not a number"},
    {"cooler-active", "maybe", "cooler-active: 'maybe' is neither on nor off"},
    {"trigger-type", "maybe", "its values are Free Run, Type 2 Polarity 0"},
    {"readout-speed", "2", "its values are 20 MHz, 10 MHz, 5 MHz, 2.5 MHz, 40 MHz, 30 MHz"},
    {"image-format", "-1", "is not a value of it"},
    {"register-tweak", "0x", "is not a word of 32 bits"},
    {"register-tweak", "0x100000000", "is not a word of 32 bits"},
};

TEST(SettingValues, WhatIsNoValueIsRefusedWithTheReason) {
    for (const Refusal& refusal : Refusals) {
        const ParsedValue parsed = ParseValue(Find(refusal.setting), refusal.text);

        EXPECT_FALSE(parsed.value.has_value()) << refusal.setting << "=" << refusal.text;
        EXPECT_THAT(parsed.problem, HasSubstr(refusal.problem));
    }
}

TEST(SettingValues, AChoiceIsReadByItsNumberOnlyWhereThatHasNoName) {
    EXPECT_FALSE(ParseValue(Find("image-format"), "3").value.has_value());
    EXPECT_EQ(99, ParseValue(Find("image-format"), "99").value.value_or(0));
}

struct Form {
    const char* setting;
    SettingValue value;
    const char* text;
};

constexpr Form Forms[] = {
    {"exposure", 16384000, "16.384 ms"},
    {"exposure", 1500000000, "1.5 s"},
    {"exposure", 3600000000000, "3600 s"},
    {"exposure", 999, "999 ns"},
    {"exposure", 1000, "1 us"},
    {"exposure", 1001, "1.001 us"},
    {"exposure", 0, "0 ns"},
    {"exposure", 1000000001, "1.000000001 s"},
    {"exposure-us", 16384, "16.384 ms"},
    {"gain-db", 3500000, "3.5 dB"},
    {"gain-db", -500000, "-0.5 dB"},
    {"gain-db", -1, "-0.000001 dB"},
    {"gain-db", 0, "0 dB"},
    {"cooling", -10, "-10 C"},
    {"normalized-gain", 1250000, "1.25 x"},
    {"post-process-gain-red", 1160, "1.16 x"},
    {"roi-width", 640, "640 px"},
    {"binning", 2, "2"},
    {"offset", -16, "-16"},
    {"cooler-active", 1, "on"},
    {"cooler-active", 0, "off"},
    {"image-format", zfmtMono16, "Mono 16-Bit"},
    {"image-format", 77, "77"},
    {"readout-speed", zspeed2500kHz, "2.5 MHz"},
    {"register-tweak", 0x123, "0x00000123"},
};

TEST(SettingValues, ValuesAreShownWithTheUnitThatFits) {
    for (const Form& form : Forms) {
        EXPECT_EQ(form.text, FormatValue(Find(form.setting), form.value)) << form.setting;
    }
}

TEST(SettingValues, WhatIsShownIsReadAsTheSameValue) {
    constexpr SettingValue Values[] = {0,
                                       1,
                                       2,
                                       3,
                                       7,
                                       8,
                                       10,
                                       99,
                                       1000,
                                       1234567,
                                       60000000,
                                       2147483647,
                                       4294967295,
                                       1234567890123456789,
                                       std::numeric_limits<SettingValue>::max()};
    for (const Setting& setting : GetSettings()) {
        const bool isBit = setting.kind == ValueKind::Switch;
        const bool isWord =
            setting.kind == ValueKind::Choice || setting.kind == ValueKind::Register;
        for (const SettingValue value : Values) {
            if ((isBit && value > 1) || (isWord && value > 4294967295)) continue;
            const std::string text = FormatValue(setting, value);
            const ParsedValue parsed = ParseValue(setting, text);
            EXPECT_EQ(value, parsed.value.value_or(-1)) << setting.name << " " << text;
        }
    }
}

TEST(SettingValues, NegativeValuesAreReadAsTheyAreShown) {
    for (const char* name : {"gain-db", "offset", "cooling"}) {
        for (const SettingValue value :
             {SettingValue{-1}, SettingValue{-123456}, std::numeric_limits<SettingValue>::min()}) {
            const std::string text = FormatValue(Find(name), value);
            EXPECT_EQ(value, ParseValue(Find(name), text).value.value_or(1)) << name << text;
        }
    }
}

TEST(SettingValues, PlainNumbersAreThoseThatCannotMislead) {
    EXPECT_TRUE(IsPlainNumber(Find("roi-width")));
    EXPECT_TRUE(IsPlainNumber(Find("binning")));
    EXPECT_TRUE(IsPlainNumber(Find("offset")));
    EXPECT_FALSE(IsPlainNumber(Find("exposure")));
    EXPECT_FALSE(IsPlainNumber(Find("gain-db")));
    EXPECT_FALSE(IsPlainNumber(Find("cooling")));
    EXPECT_FALSE(IsPlainNumber(Find("image-format")));
}

}  // namespace
}  // namespace ZentaraProgram
