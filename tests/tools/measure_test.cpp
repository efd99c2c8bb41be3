#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "support/wait_until.h"
#include "tools/program.h"
#include "tools/traced_scenario.h"

namespace ZentaraTest {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::IsEmpty;

/// A scenario file of one camera that sends the same image each time.
struct StillScenario {
    StillScenario(const std::string& base, const std::string& scene) {
        WriteFile(GetName(), R"({"base": ")" + base + R"(", "cameras": [{"scene": )" + scene +
                                 R"(, "sensor": {"noise": false, "darkCurrent": 0}}]})");
    }
    [[nodiscard]] std::string GetName() const { return folder.GetPath("still.json"); }

    TemporaryFolder folder;
};

/// Of a value as "12.5 ms".
double GetMilliseconds(const std::string& value) {
    EXPECT_THAT(value, testing::EndsWith(" ms"));
    return std::stod(value);
}

TEST(AutoExposeCommand, FindsAnExposureThatBringsTheImageJustBelowFullScale) {
    for (const char* brightness : {"1e5", "2e6", "2e7"}) {
        const StillScenario scenario(
            "mono",
            std::string(R"({"kind": "flat", "level": 1, "brightness": )") + brightness + "}");

        const ProgramResult found =
            RunProgram({"auto-expose", "0", "--simulation", scenario.GetName(), "--json"});

        ASSERT_EQ(0, found.exitCode) << found.errors;
        const std::string exposure = json::parse(found.output)["exposure"];
        const ProgramResult image =
            RunProgram({"histogram", "0", "--simulation", scenario.GetName(), "--json", "--set",
                        "exposure=" + exposure});
        const int maximum = json::parse(image.output)["channels"][0]["maximum"];
        EXPECT_GE(maximum, 200) << brightness;
        EXPECT_LE(maximum, 254) << brightness;
    }
}

TEST(AutoExposeCommand, MeasuresTheRegionAlone) {
    // The ramp is dark at the top left and bright at the bottom right.
    const StillScenario scenario("mono", R"({"kind": "ramp", "brightness": 1e6})");
    const auto find = [&](const char* region) {
        const ProgramResult found = RunProgram(
            {"auto-expose", "0", "--simulation", scenario.GetName(), "--json", "--region", region});
        return GetMilliseconds(json::parse(found.output)["exposure"]);
    };

    EXPECT_GT(find("0,0,100x10"), 2 * find("1292,1030,100x10"));
}

TEST(AutoExposeCommand, PrintsTheExposuresOfAWheelOnlyWhereThereIsOne) {
    const ProgramResult mosaic = RunProgram({"auto-expose", "0", "--simulation", "colour"});
    const ProgramResult wheel = RunProgram({"auto-expose", "0", "--simulation", "wheel"});

    EXPECT_EQ(0, mosaic.exitCode) << mosaic.errors;
    EXPECT_THAT(mosaic.output, HasSubstr("exposure"));
    EXPECT_THAT(mosaic.output, testing::Not(HasSubstr("exposure-red")));
    EXPECT_EQ(0, wheel.exitCode) << wheel.errors;
    EXPECT_THAT(wheel.output, HasSubstr("exposure-red"));
    EXPECT_THAT(wheel.output, HasSubstr("exposure-blue"));
}

TEST(WhiteBalanceCommand, BalancesTheExposuresOfAWheelAndLeavesItsGainsEven) {
    // Red light is twice and blue light half as strong as green.
    const StillScenario scenario(
        "wheel", R"({"kind": "flat", "level": 1, "brightness": 5e5, "light": [2, 1, 0.5]})");

    const ProgramResult result =
        RunProgram({"white-balance", "0", "--simulation", scenario.GetName(), "--json"});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    const json found = json::parse(result.output);
    const double green = GetMilliseconds(found["exposure"]);
    EXPECT_NEAR(0.5, GetMilliseconds(found["exposure-red"]) / green, 0.05);
    EXPECT_NEAR(2.0, GetMilliseconds(found["exposure-blue"]) / green, 0.2);
    EXPECT_EQ("1 x", found["post-process-gain-red"]);
    EXPECT_EQ("1 x", found["post-process-gain-blue"]);
}

/// Of a value as "1.25 x".
double GetGain(const json& value) {
    EXPECT_THAT(value.get<std::string>(), testing::EndsWith(" x"));
    return std::stod(value.get<std::string>());
}

TEST(WhiteBalanceCommand, TheGainsOfAMosaicFitTheLight) {
    const StillScenario scenario(
        "colour", R"({"kind": "flat", "level": 1, "brightness": 2e5, "light": [1.5, 1, 0.5]})");

    const ProgramResult result =
        RunProgram({"white-balance", "0", "--simulation", scenario.GetName(), "--json"});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    const json found = json::parse(result.output);
    // Means lose their fraction, and the black level lies below all of them.
    EXPECT_NEAR(1 / 1.5, GetGain(found["post-process-gain-red"]), 0.03);
    EXPECT_NEAR(1, GetGain(found["post-process-gain-green"]), 0.001);
    EXPECT_NEAR(1 / 0.5, GetGain(found["post-process-gain-blue"]), 0.1);
    EXPECT_THAT(result.errors, testing::Not(HasSubstr("out of range")));
}

TEST(WhiteBalanceCommand, GainsOutOfRangeAreTold) {
    const StillScenario scenario(
        "colour", R"({"kind": "flat", "level": 1, "brightness": 5e5, "light": [1, 1, 0]})");

    const ProgramResult result =
        RunProgram({"white-balance", "0", "--simulation", scenario.GetName(), "--set", "offset=0"});

    EXPECT_EQ(0, result.exitCode) << result.errors;
    EXPECT_THAT(result.errors, HasSubstr("post-process-gain-blue: "));
    EXPECT_THAT(result.errors, HasSubstr("out of range"));
}

TEST(WhiteBalanceCommand, ACameraWithoutColoursIsRefusedBeforeItTakesAnImage) {
    // The colour kind of the sensor stands in bits 8 to 11 of configuration quadlet 17.
    const TemporaryFolder folder;
    const std::string scenario = folder.GetPath("kind.json");
    WriteFile(scenario, R"({"base": "mono", "cameras": [{"configuration": {"17": 1280}}]})");

    const ProgramResult result = RunProgram({"white-balance", "0", "--simulation", scenario});

    EXPECT_EQ(2, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("makes no colours"));
    EXPECT_THAT(result.output, IsEmpty());
}

class Measurements : public testing::TestWithParam<const char*> {};

TEST_P(Measurements, GiveTheTriggersThatTheirImagesWaitFor) {
    const ProgramResult result =
        RunProgram({GetParam(), "0", "--simulation", "wheel", "--set", "trigger-type=software"});

    EXPECT_EQ(0, result.exitCode) << result.errors;
}

TEST_P(Measurements, RegionsThatAreNoneAreWrongUse) {
    for (const char* region : {"5", "1,2,3", "0,0,0x5", "0,0,16x", "0,0,16x16 ", "-1,0,16x16",
                               "0,0,16y16", "0,0,99999999999x16", "0,0,1393x16", "1,0,1392x16",
                               "4294967295,0,16x16", "0,1025,16x16", "0,0,15x15", "a,b,cxd"}) {
        const ProgramResult result =
            RunProgram({GetParam(), "0", "--simulation", "wheel", "--region", region});

        EXPECT_EQ(2, result.exitCode) << region;
        EXPECT_THAT(result.errors, HasSubstr("--region")) << region;
    }
}

TEST_P(Measurements, ARegionOfOneNarrowSideIsMeasured) {
    const ProgramResult result =
        RunProgram({GetParam(), "0", "--simulation", "wheel", "--region", "1384,0,8x100"});

    EXPECT_EQ(0, result.exitCode) << result.errors;
}

TEST_P(Measurements, ACameraThatIsUnpluggedMeanwhileEndsWithCode5) {
    const TracedScenario scenario(R"({"sensor": {"width": 64, "height": 48},
        "faults": [{"kind": "unplug", "frame": 2, "packet": 0}]})");

    const ProgramResult result =
        RunProgram({GetParam(), "0", "--simulation", scenario.GetName(), "--timeout", "0.5"});

    EXPECT_EQ(5, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("gone"));
}

TEST_P(Measurements, WithoutImagesTheyEndAfterTheirTimeout) {
    const TracedScenario scenario(
        R"({"faults": [{"kind": "losePacket", "count": 0, "frame": 1, "packet": 0},
                       {"kind": "losePacket", "probability": 1}]})");

    const ProgramResult result =
        RunProgram({GetParam(), "0", "--simulation", scenario.GetName(), "--timeout", "0.5"});

    EXPECT_EQ(1, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("not finished within 0.5 s"));
    EXPECT_THAT(result.output, IsEmpty());
}

TEST_P(Measurements, AnInterruptEndsThemWithCode130) {
    const TracedScenario still(
        R"({"faults": [{"kind": "losePacket", "count": 0, "frame": 1, "packet": 0},
                       {"kind": "losePacket", "probability": 1}]})");
    RunningProgram program({GetParam(), "0", "--simulation", still.GetName()});
    ASSERT_TRUE(ZV::Test::WaitUntil(
        [&] { return ReadFile(still.GetTrace()).find("\"type\":\"frame\"") != std::string::npos; },
        std::chrono::seconds(60)));

    program.Interrupt();

    const ProgramResult ended = program.Wait();
    EXPECT_EQ(130, ended.exitCode) << ended.errors;
}

INSTANTIATE_TEST_SUITE_P(Commands, Measurements, testing::Values("white-balance", "auto-expose"),
                         [](const testing::TestParamInfo<const char*>& tested) {
                             return std::string(tested.param) == "auto-expose" ? "AutoExpose"
                                                                               : "WhiteBalance";
                         });

TEST(GrabCommand, AnInterruptInTheWhiteBalanceLeavesNoFile) {
    const TracedScenario still(
        R"({"faults": [{"kind": "losePacket", "count": 0, "frame": 1, "packet": 0},
                       {"kind": "losePacket", "probability": 1}]})");
    const std::string path = still.folder.GetPath("never.fits");
    RunningProgram program(
        {"grab", "0", "--simulation", still.GetName(), "--colour", "--white-balance", "-o", path});
    ASSERT_TRUE(ZV::Test::WaitUntil(
        [&] { return ReadFile(still.GetTrace()).find("\"type\":\"frame\"") != std::string::npos; },
        std::chrono::seconds(60)));

    program.Interrupt();

    const ProgramResult ended = program.Wait();
    EXPECT_EQ(130, ended.exitCode) << ended.errors;
    EXPECT_THAT(ReadFile(path), IsEmpty());
}

TEST(GrabCommand, ATimeWithoutANumberIsWrongUse) {
    for (const char* time : {"nan", "inf", "-nan", "0", "soon"}) {
        const ProgramResult grab = RunProgram(
            {"grab", "0", "--simulation", "mono", "-o", "never.fits", "--timeout", time});
        const ProgramResult stream =
            RunProgram({"stream", "0", "--simulation", "mono", "--duration", time});

        EXPECT_EQ(2, grab.exitCode) << time;
        EXPECT_EQ(2, stream.exitCode) << time;
    }
}

TEST(GrabCommand, ARegionWithoutWhiteBalanceIsWrongUse) {
    const ProgramResult result =
        RunProgram({"grab", "0", "--simulation", "mono", "-o", "a.fits", "--region", "0,0,16x16"});

    EXPECT_EQ(2, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("--white-balance"));
}

}  // namespace
}  // namespace ZentaraTest
