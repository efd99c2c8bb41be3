#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "support/random_blocks.h"
#include "support/rounds.h"
#include "support/sending_camera.h"

// The registers that a send writes, in their order, against a list that is calculated from the
// camera's configuration and the block without the library.
namespace ZV::Test {
namespace {

struct TraceCase {
    const char* name;
    const char* className;
    std::string scenario;
};

void PrintTo(const TraceCase& traced, std::ostream* stream) {
    *stream << traced.name;
}

std::string NameCase(const testing::TestParamInfo<TraceCase>& info) {
    return info.param.name;
}

TraceCase MakeModelCase(const char* className) {
    return {className, className, std::string("model:") + className};
}

TraceCase MakeCase(const char* name, const char* className, const std::string& camera) {
    return {name, className,
            std::string(R"({"base": "model:)") + className + R"(", "cameras": [)" + camera + "]}"};
}

TraceCase MakeConfigurationCase(const char* name, const std::string& version) {
    return MakeCase(name, "SolvaneA1", R"({"versions": {"configuration": ")" + version + R"("}})");
}

TraceCase MakeControlCase(const char* name, const char* className, const std::string& version) {
    return MakeCase(name, className, R"({"versions": {"control": ")" + version + R"("}})");
}

constexpr int Rounds = CountRounds(24);

class SettingsTrace : public testing::TestWithParam<TraceCase> {
  protected:
    void SetUp() override {
        client = std::make_unique<SendingCamera>(GetParam().scenario, GetParam().className);
        ASSERT_TRUE(client->IsOpen());
    }

    std::unique_ptr<SendingCamera> client;
};

TEST_P(SettingsTrace, TheDefaultsWriteTheseRegistersAndAreTakenOverTheFirstTimeAlone) {
    Zentara_Settings block = client->ReadDefaults();

    EXPECT_TRUE(client->Send(block));
    EXPECT_TRUE(client->WasCommitted());

    EXPECT_TRUE(client->Send(block)) << "once more";
    EXPECT_FALSE(client->WasCommitted());
}

/// A block that differs from the camera in every setting that any model has.
void ChangeEverything(Zentara_Settings& block, bool isMetrona) {
    SetWord(block, zprmImageFormat, 3);
    SetWord(block, zprmBinning, 2);
    SetWord(block, zprmVerticalBinning, 2);
    SetWord(block, zprmHorizontalBinning, isMetrona ? 3 : 1);
    SetWord(block, zprmRoiX, 20);
    SetWord(block, zprmRoiY, 10);
    SetWord(block, zprmRoiWidth, 200);
    SetWord(block, zprmRoiHeight, 16);
    SetWord(block, zprmReadoutSpeed, zspeed10MHz);
    SetWord(block, zprmTriggerType, 2);
    SetWord(block, zprmColorWheel, 3);
    SetWord(block, zprmCoolerActive, 0);
    SetWord(block, zprmDoubleShot, 1);
    SetWord(block, zprmSyncb, 0);
    SetWord(block, zprmMetronaShutterDelay, 1234);
    SetSigned(block, zprmS32NormalizedGaindB, 6'020'000);
    SetSigned(block, zprmS32AbsoluteOffset, -3);
    SetSigned(block, zprmS32RegulatedCoolingTemp, -17);
    SetWide(block, zprm64Exposure, 5'000'123'456);
    SetWide(block, zprm64ExposureRed, 6'000'000'000);
    SetWide(block, zprm64ExposureBlue, 7'000'000'000);
    SetWide(block, zprm64NormIntensGain, 100'000'000);
    SetWord(block, zprmFan, 2);
    SetWord(block, zprmBlackoutMode, 1);
    SetWord(block, zprmHighSensitivityMode, 1);
    SetWord(block, zprmEMGain, 100);
    SetWord(block, zprmCloseDelay, 1000);
    SetWord(block, zprmDither, 1);
    SetWord(block, zprmHighGainMode, 1);
    SetWord(block, zprmVClockPeriod, 5000);
}

TEST_P(SettingsTrace, ABlockThatChangesEverythingWritesTheseRegisters) {
    Zentara_Settings block = client->ReadDefaults();
    ASSERT_TRUE(client->Send(block));
    ChangeEverything(block, GetParam().className == std::string_view("Metrona"));

    EXPECT_TRUE(client->Send(block));

    EXPECT_TRUE(client->WasCommitted());
}

struct Choice {
    std::vector<std::uint32_t> keys;
    std::vector<std::uint32_t> values;
};

// The known values, unknown ones, and the same value twice.
const Choice Choices[] = {
    {{zprmImageFormat}, {6, 10, 2, 12, 1, 1, 13}},
    {{zprmTriggerType}, {1, 1, 2, 3, 4, 5, 6, 7, 8, 0, 0}},
    {{zprmBinning, zprmVerticalBinning, zprmHorizontalBinning}, {2, 2, 1, 3, 4, 8, 64, 2, 5, 0, 1}},
    {{zprmReadoutSpeed}, {1, 1, 2, 3, 7, 8, 4, 9, 0}},
};

TEST_P(SettingsTrace, EachValueOfAChoiceWritesTheseRegisters) {
    const Zentara_Settings defaults = client->ReadDefaults();
    for (const Choice& choice : Choices) {
        Zentara_Settings block = defaults;
        for (const std::uint32_t value : choice.values) {
            for (const std::uint32_t key : choice.keys) SetWord(block, key, value);

            EXPECT_TRUE(client->Send(block)) << "key " << choice.keys[0] << ", value " << value;
        }
    }
}

class TweakTrace : public SettingsTrace {};

TEST_P(TweakTrace, EachSelectorOfTheRegisterTweakWritesItsRegister) {
    Zentara_Settings block = client->ReadDefaults();
    ASSERT_TRUE(client->Send(block));
    for (std::uint32_t selector = 0; selector < 16; ++selector) {
        SetWord(block, zprmRegisterTweak, selector << 28 | 0x0FFF0000 | (selector + 100));
        // Something else must change for the tweak to be taken over.
        SetWord(block, zprmReserved17, selector);

        EXPECT_TRUE(client->Send(block)) << "selector " << selector;
    }
}

INSTANTIATE_TEST_SUITE_P(Of, TweakTrace,
                         testing::Values(MakeModelCase("SolvaneA1"), MakeModelCase("TirelM1"),
                                         MakeModelCase("TirelM2"),
                                         MakeControlCase("ShortControl", "TirelM1", "2.7")),
                         NameCase);

TEST_P(SettingsTrace, RandomBlocksWriteWhatIsExpectedAndComeBackAsExpected) {
    RandomBlocks blocks;
    SCOPED_TRACE(blocks.DescribeSeed());
    Zentara_Settings block = client->ReadDefaults();
    const Zentara_Settings defaults = block;
    for (int round = 0; round < Rounds; ++round) {
        const bool isFresh = round % 8 == 0 || client->GetResult() != zerrNone;
        if (isFresh) block = defaults;
        blocks.Change(block);
        Zentara_Settings preflighted = block;

        ASSERT_TRUE(client->Preflight(preflighted)) << "round " << round;
        ASSERT_TRUE(client->Send(block)) << "round " << round;
    }
}

INSTANTIATE_TEST_SUITE_P(Of, SettingsTrace,
                         testing::Values(MakeModelCase("SolvaneA1"), MakeModelCase("SolvaneA2"),
                                         MakeModelCase("DorixB1"), MakeModelCase("Folary"),
                                         MakeModelCase("SolvaneK1"), MakeModelCase("DorixR1"),
                                         MakeModelCase("SolvaneC1"), MakeModelCase("SolvaneB1"),
                                         MakeModelCase("PellanA1"), MakeModelCase("SolvaneD1"),
                                         MakeModelCase("SolvaneF1"), MakeModelCase("SolvaneC2"),
                                         MakeModelCase("SolvaneB2"), MakeModelCase("PellanB1"),
                                         MakeModelCase("SolvaneE1"), MakeModelCase("PellanA2"),
                                         MakeModelCase("SolvaneD2"), MakeModelCase("SolvaneG2"),
                                         MakeModelCase("SolvaneG1"), MakeModelCase("TirelM2"),
                                         MakeModelCase("TirelM1"), MakeModelCase("SolvaneH1"),
                                         MakeModelCase("SolvaneJ1"), MakeModelCase("Metrona"),
                                         MakeModelCase("Unknown")),
                         NameCase);

INSTANTIATE_TEST_SUITE_P(
    WithConfiguration, SettingsTrace,
    testing::Values(MakeConfigurationCase("V1_1", "1.1"), MakeConfigurationCase("V2_1", "2.1"),
                    MakeConfigurationCase("V2_4", "2.4"), MakeConfigurationCase("V2_7", "2.7"),
                    MakeConfigurationCase("V2_9", "2.9"), MakeConfigurationCase("V2_11", "2.11")),
    NameCase);

INSTANTIATE_TEST_SUITE_P(
    WithControl, SettingsTrace,
    testing::Values(TraceCase{"OfTheFirstGeneration", "SolvaneA1", "old"},
                    MakeControlCase("V1_1", "SolvaneA1", "1.1"),
                    MakeControlCase("V2_2AndItsFrequencyGuard", "PellanB1", "2.2"),
                    MakeControlCase("TooShortForTheRatioBoard", "PellanB1", "2.6"),
                    MakeControlCase("TooShortForTheCloseDelay", "SolvaneF1", "2.5"),
                    MakeControlCase("TooShortForTheFan", "SolvaneA1", "2.4"),
                    MakeControlCase("TooShortForTheTweaks", "TirelM1", "2.7"),
                    MakeControlCase("TooShortForTheIntensifier", "SolvaneK1", "1.2")),
    NameCase);

INSTANTIATE_TEST_SUITE_P(
    When, SettingsTrace,
    testing::Values(
        MakeCase("ItsFeaturesAreAllThere", "SolvaneG1",
                 R"({"configuration": {"169": "0x1F5E", "29": 1}})"),
        MakeCase("TheTweaksMeetAllFeatures", "TirelM1",
                 R"({"configuration": {"169": "0x1F5E", "29": 1}})"),
        MakeCase("PellanB1HasNoHardwareProfile", "PellanB1", R"({"configuration": {"201": 0}})"),
        MakeCase("PellanB1HasAnOldAnalogBoard", "PellanB1",
                 R"({"configuration": {"201": 0}, "firmwareVersion": 99})"),
        MakeCase("TheAnalogBoardIsOld", "SolvaneC1", R"({"firmwareVersion": 99})"),
        MakeCase("AWheelModelHasAMosaic", "SolvaneG1", R"({"sensor": {"colour": "bayer"}})"),
        MakeCase("TheSensorIsOdd", "PellanA1", R"({"sensor": {"width": 641, "height": 481}})"),
        MakeCase("TheSensorOfFolaryIsOdd", "Folary",
                 R"({"sensor": {"width": 641, "height": 481}})"),
        MakeCase("TheSensorOfFolaryIs2048Wide", "Folary",
                 R"({"sensor": {"width": 2048, "height": 1536}})"),
        MakeCase("SolvaneD1SendsTheOldPackets", "SolvaneD1", R"({"streamingVersion": 1})"),
        MakeCase("PacketsAreOfVersion0", "SolvaneG2", R"({"streamingVersion": 0})"),
        MakeCase("TheDepthIs15Bits", "SolvaneG2", R"({"sensor": {"maxBitDepth": 15}})"),
        TraceCase{"SolvaneA1IsASolvaneB1", "SolvaneB1",
                  R"({"base": "mono", "cameras": [{"sensor": {"id": 46}}]})"}),
    NameCase);

}  // namespace
}  // namespace ZV::Test
