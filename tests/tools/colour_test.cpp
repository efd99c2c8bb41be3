#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "tools/chart.h"
#include "tools/fits_file.h"
#include "tools/program.h"

namespace ZentaraTest {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;

/// Chart images of the program, in files of a folder that goes with the test.
class Colour : public testing::Test {
  protected:
    std::string WriteScenario(const std::string& text) {
        const std::string path = folder.GetPath("scenario.json");
        WriteFile(path, text);
        return path;
    }
    /// Grabs into a PNG with these words behind the usual ones.
    ReadSamples Grab(const std::string& simulation, std::vector<std::string> words) {
        const std::string path = folder.GetPath("chart.png");
        std::vector<std::string> all{"grab", "0", "--simulation", simulation, "-o", path};
        all.insert(all.end(), words.begin(), words.end());
        const ProgramResult result = RunProgram(all);
        EXPECT_EQ(0, result.exitCode) << result.errors;
        return ReadPng(path);
    }

    TemporaryFolder folder;
};

/// What makes the mean over the chart, or over its greys, grey.
std::array<double, 3> GetGains(const ChartLight& light, bool isOfGreys) {
    const double green = light.GetMean(1, isOfGreys);
    return {green / light.GetMean(0, isOfGreys), 1, green / light.GetMean(2, isOfGreys)};
}

TEST_F(Colour, ABalancedImageShowsTheChartInItsColours) {
    const ReadSamples image = Grab("colour", {"--colour", "--white-balance"});

    const ChartLight light;
    EXPECT_EQ(8U, image.bits);
    ExpectPatches(image, light, GetGains(light, false), GetGainShare(light, false));
}

TEST_F(Colour, ABalanceOverTheGreysTakesTheTintOutOfTheLight) {
    const std::string scenario = WriteScenario(
        R"({"base": "colour", "cameras": [{"scene": {"kind": "chart", "brightness": 3e5,
            "light": [1.6, 1, 0.6]}}]})");

    const ReadSamples image =
        Grab(scenario, {"--colour", "--white-balance", "--region", "16,796,1360x228"});

    ChartLight light;
    light.brightness = 3e5;
    light.light = {1.6, 1, 0.6};
    const double share = GetGainShare(light, true);
    ExpectPatches(image, light, GetGains(light, true), share);
    for (std::uint32_t column = 0; column < ChartColumns; ++column) {
        const double green = MeasurePatch(image, column, 3, 1);
        EXPECT_NEAR(green, MeasurePatch(image, column, 3, 0), 2 + share * green);
        EXPECT_NEAR(green, MeasurePatch(image, column, 3, 2), 2 + share * green);
    }
}

TEST_F(Colour, SixteenBitsShowTheSameColours) {
    const ReadSamples image = Grab("colour", {"--colour", "--white-balance", "--format", "rgb48"});

    ChartLight light;
    light.bits = 12;
    EXPECT_EQ(16U, image.bits);
    ExpectPatches(image, light, GetGains(light, false), GetGainShare(light, false));
}

TEST_F(Colour, AWheelCameraShowsTheChartInItsColours) {
    const std::string scenario = WriteScenario(
        R"({"base": "wheel", "cameras": [{"scene": {"kind": "chart", "brightness": 5e5}}]})");

    // A camera starts with longer exposures for red and blue.
    const ReadSamples image = Grab(scenario, {"--format", "rgb24", "--set", "exposure-red=16384us",
                                              "--set", "exposure-blue=16384us"});

    ChartLight light;
    light.brightness = 5e5;
    light.fullWell = 22000;
    ExpectPatches(image, light, {1, 1, 1});
}

TEST_F(Colour, AWheelCameraBalancesByItsExposures) {
    const std::string scenario = WriteScenario(
        R"({"base": "wheel", "cameras": [{"scene": {"kind": "chart", "brightness": 5e5,
            "light": [1.6, 1, 0.6]}}]})");

    const ReadSamples image =
        Grab(scenario, {"--colour", "--white-balance", "--region", "16,796,1360x228"});

    ChartLight light;
    light.brightness = 5e5;
    light.fullWell = 22000;
    ExpectPatches(image, light, {1, 1, 1}, GetGainShare(light, true));
}

TEST_F(Colour, WithoutABalanceTheGainsOfTheSettingsCount) {
    const ReadSamples image = Grab("colour", {"--colour", "--set", "post-process-gain-red=0.5x",
                                              "--set", "post-process-gain-blue=1.5x"});

    ExpectPatches(image, ChartLight{}, {0.5, 1, 1.5});
}

TEST_F(Colour, EveryFormatOfThreeColoursHoldsTheSameImage) {
    const std::string scenario = WriteScenario(
        R"({"base": "colour", "cameras": [{"sensor": {"noise": false, "darkCurrent": 0}}]})");
    const ReadSamples expected = Grab(scenario, {"--colour"});
    for (const char* format : {"rgb24", "bgr24", "xrgb32", "bgrx32", "BGR 24"}) {
        EXPECT_EQ(expected.values, Grab(scenario, {"--format", format}).values) << format;
    }
}

TEST_F(Colour, AWheelCameraAlsoHasWholePlanes) {
    const std::string scenario = WriteScenario(
        R"({"base": "wheel", "cameras": [{"scene": {"kind": "chart", "brightness": 5e5},
            "sensor": {"noise": false, "darkCurrent": 0}}]})");

    const ReadSamples expected = Grab(scenario, {"--format", "rgb24"});

    EXPECT_EQ(expected.values, Grab(scenario, {"--format", "rgb-planes"}).values);
}

TEST_F(Colour, TheAlgorithmsOfAMosaicDifferAtEdgesAlone) {
    const std::string scenario = WriteScenario(
        R"({"base": "colour", "cameras": [{"sensor": {"noise": false, "darkCurrent": 0}}]})");
    const ReadSamples fast = Grab(scenario, {"--colour", "--bayer", "fast"});
    const ReadSamples average = Grab(scenario, {"--colour", "--bayer", "average"});
    const ReadSamples bicubic = Grab(scenario, {"--colour", "--bayer", "bicubic"});

    EXPECT_NE(fast.values, average.values);
    EXPECT_NE(average.values, bicubic.values);
    EXPECT_EQ(MeasurePatch(fast, 2, 1, 0), MeasurePatch(average, 2, 1, 0));
    EXPECT_NEAR(MeasurePatch(fast, 2, 1, 0), MeasurePatch(bicubic, 2, 1, 0), 1);
}

TEST_F(Colour, ARawFormatStillGivesTheMosaic) {
    const std::string path = folder.GetPath("a.fits");

    const ProgramResult result =
        RunProgram({"grab", "0", "--simulation", "colour", "--format", "bayer16", "-o", path});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_EQ(5, ReadFitsNumber(FitsFile(path).Get(), "PIXFORM"));
}

TEST_F(Colour, AStreamWritesImagesOfThreePlanes) {
    const ProgramResult result = RunProgram({"stream", "0", "--simulation", "colour", "--colour",
                                             "--count", "2", "-o", folder.GetPath("night.fits")});

    ASSERT_TRUE(result.exitCode == 0 || result.exitCode == 6) << result.errors;
    EXPECT_EQ(3, ReadFitsNumber(FitsFile(folder.GetPath("night-000002.fits")).Get(), "NAXIS3"));
}

TEST_F(Colour, TheHistogramShowsThreeColours) {
    const ProgramResult result =
        RunProgram({"histogram", "0", "--simulation", "colour", "--colour"});

    EXPECT_EQ(0, result.exitCode) << result.errors;
    for (const char* name : {"red: ", "green: ", "blue: "})
        EXPECT_THAT(result.output, HasSubstr(name));
}

struct WrongCase {
    const char* name;
    const char* scenario;
    std::vector<std::string> words;
    const char* expected;
};
const WrongCase WrongCases[] = {
    {"AnUnknownFormat", "colour", {"--format", "rgb25"}, "did you mean rgb24"},
    {"APlainFormatForColours", "colour", {"--colour", "--format", "mono8"}, "three colours"},
    {"AnUnknownAlgorithm", "colour", {"--colour", "--bayer", "best"}, "average, fast, bicubic"},
    {"AnAlgorithmWithoutColours", "colour", {"--bayer", "fast"}, "--colour"},
    {"AnAlgorithmForAWheel", "wheel", {"--colour", "--bayer", "fast"}, "no mosaic"},
    {"WholePlanesOfAMosaic", "colour", {"--format", "rgb-planes"}, "not allowed"},
    {"BytesOfADeepMosaic",
     "colour",
     {"--format", "rgb24", "--set", "image-format=bayer16"},
     "but --set asks for"},
    {"ColoursWithoutPostProcessing",
     "colour",
     {"--colour", "--set", "do-post-processing=off"},
     "but --set asks for"},
    {"AnotherFormatOfPostProcessing",
     "colour",
     {"--colour", "--format", "rgb24", "--set", "post-process-image-format=bgr24"},
     "but --set asks for"},
};

class WrongColour : public testing::TestWithParam<WrongCase> {};

TEST_P(WrongColour, IsWrongUse) {
    std::vector<std::string> words{"grab", "0",         "--simulation", GetParam().scenario,
                                   "-o",   "never.fits"};
    words.insert(words.end(), GetParam().words.begin(), GetParam().words.end());

    const ProgramResult result = RunProgram(words);

    EXPECT_EQ(2, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr(GetParam().expected));
    EXPECT_THAT(result.output, IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(Cases, WrongColour, testing::ValuesIn(WrongCases),
                         [](const testing::TestParamInfo<WrongCase>& tested) {
                             return std::string(tested.param.name);
                         });

}  // namespace
}  // namespace ZentaraTest
