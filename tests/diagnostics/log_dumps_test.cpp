#include <array>
#include <limits>

#include "api/settings_block.h"
#include "diagnostics/open_log.h"

namespace ZV {
namespace {

using Test::MatchesGolden;

/// A block whose values all differ.
Zentara_Settings MakeBlock() {
    Zentara_Settings block{};
    for (std::uint32_t key = 0; key < SettingsWordCount; ++key) {
        SetSettingsWord(block, key, 1000 + key);
    }
    for (std::uint32_t key = 0; key < SettingsSignedCount; ++key) {
        SetSettingsSigned(block, key, -10 - static_cast<std::int32_t>(key));
    }
    for (std::uint32_t key = 0; key < SettingsWideCount; ++key) {
        SetSettingsWide(block, key, 5000000000 + key);
    }
    return block;
}

Zentara_Frame MakeFrame() {
    Zentara_Frame frame{};
    frame.pBuffer = &frame;
    frame.bufferSize = 0xFFFFFFFF;
    frame.format = zfmtMono16;
    frame.width = 1392;
    frame.height = 1040;
    frame.size = 2895360;
    frame.bits = 12;
    frame.frameNumber = 65535;
    frame.bayerPattern = 3;
    frame.errorCode = zerrMissingData;
    frame.timeStamp = 7;
    return frame;
}

class LogDumps : public Test::OpenLog {
  protected:
    /// One dump of each kind.
    static void WriteEveryKind(const char* function) {
        static constexpr std::array<std::uint32_t, 2> Table{20, 10};
        const Zentara_Settings former = MakeBlock();
        Zentara_Settings present = former;
        SetSettingsWord(present, zprmTriggerType, 5);
        ZentaraDebugOutputSetting32(zprmGain, 7);
        ZentaraDebugOutputSettingS32(zprmS32AbsoluteOffset, -7);
        ZentaraDebugOutputSetting64(zprm64NormIntensGain, 7);
        ZentaraDebugOutputGetInfo(zinfCcd, 53);
        ZLogSettingsChanged(function, former, present);
        ZLogFrame(function, MakeFrame());
        ZLogSparseTable(function, zprmReadoutSpeed, Table.data(), Table.size());
    }
};

TEST_F(LogDumps, ShowEachKeyOfAFamilyInItsWords) {
    OpenToFile("outputSettings = 1\n");

    for (std::uint32_t key = 0; key < 48; ++key) ZentaraDebugOutputSetting32(key, 1250 + key);
    for (std::uint32_t key = 0; key < 4; ++key) ZentaraDebugOutputSettingS32(key, -10);
    for (std::uint32_t key = 0; key < 5; ++key) ZentaraDebugOutputSetting64(key, 1550000);

    EXPECT_TRUE(MatchesGolden("diagnostics/golden/settings.txt", DescribeFile()));
}

TEST_F(LogDumps, ShowChoicesByName) {
    OpenToFile("outputSettings = 1\n");

    for (std::uint32_t value = 0; value < 5; ++value) {
        ZentaraDebugOutputSetting32(zprmColorWheel, value);
    }
    for (std::uint32_t value = 0; value < 3; ++value) {
        ZentaraDebugOutputSetting32(zprmSyncb, value);
    }
    for (std::uint32_t value = 0; value < 14; ++value) {
        ZentaraDebugOutputSetting32(zprmImageFormat, value);
    }
    for (const std::uint32_t key :
         {zprmCameraMode, zprmPostProcessBayerAlgorithm, zprmPostProcessImageFormat, zprmFan}) {
        for (std::uint32_t value = 0; value < 5; ++value) ZentaraDebugOutputSetting32(key, value);
    }

    EXPECT_TRUE(MatchesGolden("diagnostics/golden/choices.txt", DescribeFile()));
}

TEST_F(LogDumps, ShowTheReadoutSpeedByATableOfTheirOwn) {
    OpenToFile("outputSettings = 1\n");

    for (std::uint32_t index = 0; index < 10; ++index) {
        ZentaraDebugOutputSetting32(zprmReadoutSpeed, index);
    }

    EXPECT_EQ(
        "<time> Readout Speed: 20.0 MHz|\n"
        "<time> Readout Speed: 10.0 MHz|\n"
        "<time> Readout Speed: 5.0 MHz|\n"
        "<time> Readout Speed: 2.5 MHz|\n"
        "<time> Readout Speed: 1.0 MHz|\n"
        "<time> Readout Speed: 24.0 MHz|\n"
        "<time> Readout Speed: 48.0 MHz|\n"
        "<time> Readout Speed: 40.0 MHz|\n"
        "<time> Readout Speed: 30.0 MHz|\n"
        "<time> Readout Speed: 0.0 MHz|\n",
        DescribeFile());
}

TEST_F(LogDumps, ShowTheWholeRangeOfAValue) {
    OpenToFile("outputSettings = 1\noutputGetInfo = 1\n");

    ZentaraDebugOutputSetting32(zprmExposure, 0xFFFFFFFF);
    ZentaraDebugOutputSetting32(zprmReadoutSpeed, 0xFFFFFFFF);
    ZentaraDebugOutputSettingS32(zprmS32NormalizedGaindB, std::numeric_limits<std::int32_t>::min());
    ZentaraDebugOutputSettingS32(zprmS32RegulatedCoolingTemp, 2147483647);
    ZentaraDebugOutputSetting64(zprm64Exposure, 0xFFFFFFFFFFFFFFFF);
    ZentaraDebugOutputSetting64(zprm64NormIntensGain, 0xFFFFFFFFFFFFFFFF);
    ZentaraDebugOutputGetInfo(zinfUniqueId, 0xFFFFFFFF);

    EXPECT_EQ(
        "<time> Exposure: 4294967295 us (4294967.3 ms)|\n"
        "<time> Readout Speed: 0.0 MHz|\n"
        "<time> Normalized Gain dB: -2147483648|\n"
        "<time> Regulated Cooling Temp: 2147483647 C|\n"
        "<time> Exposure (64-bit): 18446744073709551615 ns (18446744073709.6 ms)|\n"
        "<time> Normalized Intesifier Gain (64-bit): 18446744073709551615|\n"
        "<time> Unique ID: 4294967295|\n",
        DescribeFile());
}

TEST_F(LogDumps, ShowEachInformationKeyInItsWords) {
    OpenToFile("outputGetInfo = 1\n");

    for (std::uint32_t key = 0; key < 42; ++key) ZentaraDebugOutputGetInfo(key, 100 + key);

    EXPECT_TRUE(MatchesGolden("diagnostics/golden/information.txt", DescribeFile()));
}

TEST_F(LogDumps, NameTheTypesOfCamerasByAListOfTheirOwn) {
    OpenToFile("outputGetInfo = 1\n");

    for (std::uint32_t type = 0; type < 36; ++type) ZentaraDebugOutputGetInfo(0, type);
    ZentaraDebugOutputGetInfo(zinfCameraType, zmodelSolvaneJ1);
    ZentaraDebugOutputGetInfo(zinfCameraType, zmodelMetrona);

    EXPECT_TRUE(MatchesGolden("diagnostics/golden/camera_types.txt", DescribeFile()));
}

TEST_F(LogDumps, ShowABlockWordByWord) {
    OpenToFile("outputSettings = 1\n");

    ZLogSettingsBlock("Zentara_ReadSettingsFromCam", MakeBlock());

    EXPECT_TRUE(MatchesGolden("diagnostics/golden/block.txt", DescribeFile()));
}

TEST_F(LogDumps, ShowOfTwoBlocksTheWordsThatDiffer) {
    OpenToFile("outputSettings = 1\n");
    const Zentara_Settings former = MakeBlock();
    Zentara_Settings present = former;
    SetSettingsWord(present, zprmGain, 1);
    SetSettingsWord(present, zprmExposure, 1500);
    SetSettingsWord(present, zprmShutterState, 1);
    SetSettingsWord(present, zprmRegisterTweak, 1);

    ZLogSettingsChanged("Zentara_SendSettingsToCam", former, present);

    EXPECT_EQ(
        "<time> Settings that changed:|\n"
        "<time> Gain: 1|\n"
        "<time> Exposure: 1500 us (1.5 ms)|\n"
        "<time> ZentaraDebugOutputSetting32() - Unknown parameter|\n"
        "<time> Register Tweak: 1|\n",
        DescribeFile());
}

TEST_F(LogDumps, CallAChangeOfTheSignedOrTheWideValuesNothing) {
    OpenToFile("outputSettings = 1\n");
    const Zentara_Settings former = MakeBlock();
    Zentara_Settings present = former;
    SetSettingsSigned(present, zprmS32NormalizedGaindB, 1);
    SetSettingsWide(present, zprm64Exposure, 1);
    SetSettingsHandle(present, 1);
    SetSettingsSize(present);

    ZLogSettingsChanged("Zentara_SendSettingsToCam", former, present);

    EXPECT_EQ("<time> Settings that changed:|\n<time> Nothing|\n", DescribeFile());
}

TEST_F(LogDumps, ShowTheRunningIndexOfASparseTableAndNotItsEntries) {
    OpenToFile("outputSparseTable = 1\n");
    static constexpr std::array<std::uint32_t, 3> Table{8, 4, 2};

    ZLogSparseTable("Zentara_GetParamSparseTable", zprmBinning, Table.data(), Table.size());
    ZLogSparseTable("Zentara_GetParamSparseTable", zprmDither, Table.data(), 0);

    EXPECT_EQ(
        "<time> Sparse Table for zprmBinning:|\n"
        "<time> 0|\n"
        "<time> 1|\n"
        "<time> 2|\n"
        "<time> Sparse Table for InternalParam32KeyAsString() - Unknown parameter:|\n",
        DescribeFile());
}

TEST_F(LogDumps, ShowOfABufferTheLowThirtyTwoBitsOfItsAddress) {
    OpenToFile("outputFrame = 1\n");
    Zentara_Frame frame = MakeFrame();
    frame.pBuffer = reinterpret_cast<void*>(static_cast<std::uintptr_t>(0x7FFF0001ABCD));

    ZLogFrame("Zentara_GrabFrame", frame);

    EXPECT_NE(std::string::npos, ReadFile().find("pBuffer: 1abcd"));
    EXPECT_TRUE(MatchesGolden("diagnostics/golden/frame.txt", DescribeFile()));
}

TEST_F(LogDumps, FollowTheirOwnSwitchEach) {
    std::string text;
    for (const char* lines :
         {"nothing\n", "outputSettings = 1\n", "outputGetInfo = 1\n", "outputFrame = 1\n",
          "outputSparseTable = 1\n", "outputNestedCalls = 1\n"}) {
        folder.WriteFile("log.txt", "");
        OpenToFile(lines);
        ZLogEnter("Zentara_Outer");
        WriteEveryKind("Zentara_Outer");
        ZLogLeave("Zentara_Outer", zerrNone);
        ZLogClose();
        text += "== also " + std::string(lines) + DescribeFile();
    }

    EXPECT_TRUE(MatchesGolden("diagnostics/golden/switches.txt", text));
}

TEST_F(LogDumps, AreSilentWhileTheLogIsOff) {
    OpenToFile(
        "outputEnabled = 0\noutputToFile = 0\noutputSettings = 1\noutputGetInfo = 1\n"
        "outputFrame = 1\noutputSparseTable = 1\noutputNestedCalls = 1\n");

    WriteEveryKind("Zentara_Outer");
    ZLogSettingsBlock("Zentara_Outer", MakeBlock());

    EXPECT_EQ("", ReadDebuggerOutput());
    EXPECT_EQ("", ReadFile());
}

constexpr char EveryDump[] =
    "outputSettings = 1\noutputGetInfo = 1\noutputFrame = 1\noutputSparseTable = 1\n";

// Kept: the heading of what changed comes alone, as its lines are settings.
TEST_F(LogDumps, OfSettingsAndSparseTablesAreLeftOutInNestedCallsAndOthersAreNot) {
    OpenToFile(EveryDump);
    ZLogEnter("Zentara_Outer");
    ZLogEnter("Zentara_Inner");

    WriteEveryKind("Zentara_Inner");
    ZLogSettingsBlock("Zentara_Inner", MakeBlock());

    EXPECT_TRUE(MatchesGolden("diagnostics/golden/nested_hidden.txt", DescribeFile()));
}

TEST_F(LogDumps, AreAllShownInNestedCallsWhereTheseAre) {
    OpenToFile(std::string(EveryDump) + "outputNestedCalls = 1\n");
    ZLogEnter("Zentara_Outer");
    ZLogEnter("Zentara_Inner");

    WriteEveryKind("Zentara_Inner");

    EXPECT_TRUE(MatchesGolden("diagnostics/golden/nested_shown.txt", DescribeFile()));
}

}  // namespace
}  // namespace ZV
