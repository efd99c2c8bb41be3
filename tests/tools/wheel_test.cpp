#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "support/wait_until.h"
#include "tools/colour_image.h"
#include "tools/fits_file.h"
#include "tools/program.h"

namespace ZentaraTest {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::IsEmpty;

/// A small camera before a chart, with a filter wheel, that sends the same image each time.
class Wheel : public testing::Test {
  protected:
    Wheel() {
        WriteFile(scenario, R"({"base": "wheel", "cameras": [{
            "scene": {"kind": "chart", "brightness": 5e5},
            "sensor": {"width": 96, "height": 64, "noise": false, "darkCurrent": 0}}]})");
    }
    ProgramResult Run(std::vector<std::string> words) {
        words.insert(words.end(), {"--simulation", scenario});
        return RunProgram(words);
    }
    std::vector<std::uint16_t> Grab(std::vector<std::string> words) {
        const std::string path = folder.GetPath("a.png");
        words.insert(words.begin(), {"grab", "0", "-o", path});
        const ProgramResult result = Run(words);
        EXPECT_EQ(0, result.exitCode) << result.errors;
        return ReadPng(path).values;
    }

    TemporaryFolder folder;
    const std::string scenario = folder.GetPath("wheel.json");
};

const std::vector<std::string> Triggered{"--colour", "--set", "trigger-type=software", "--timeout",
                                         "30"};

TEST_F(Wheel, EachOfTheThreeExposuresOfAGrabIsTriggered) {
    EXPECT_EQ(Grab({"--colour"}), Grab(Triggered));
}

TEST_F(Wheel, TheExposuresOfAHistogramAreTriggered) {
    std::vector<std::string> words{"histogram", "0"};
    words.insert(words.end(), Triggered.begin(), Triggered.end());

    const ProgramResult result = Run(words);

    EXPECT_EQ(0, result.exitCode) << result.errors;
    EXPECT_THAT(result.output, HasSubstr("blue: "));
}

TEST_F(Wheel, TheExposuresOfAStreamAreTriggered) {
    std::vector<std::string> words{"stream", "0", "--count", "2", "--json"};
    words.insert(words.end(), Triggered.begin(), Triggered.end());

    const ProgramResult result = Run(words);

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_EQ(2, json::parse(result.output)["frames"]);
}

TEST_F(Wheel, AStreamWhoseImagesTakeThreeExposuresEachHasNoGaps) {
    // Triggered by the program, so that nothing is lost on a busy machine.
    std::vector<std::string> words{
        "stream", "0", "--count", "3", "--json", "-o", folder.GetPath("night.fits")};
    words.insert(words.end(), Triggered.begin(), Triggered.end());

    const ProgramResult result = Run(words);

    ASSERT_EQ(0, result.exitCode) << result.errors;
    const json report = json::parse(result.output);
    EXPECT_EQ(0, report["gaps"]);
    EXPECT_EQ(0, report["drops"]);
    const FitsFile first(folder.GetPath("night-000001.fits"));
    const FitsFile second(folder.GetPath("night-000002.fits"));
    EXPECT_EQ(3,
              ReadFitsNumber(second.Get(), "FRAMENUM") - ReadFitsNumber(first.Get(), "FRAMENUM"));
    EXPECT_EQ(3, ReadFitsNumber(second.Get(), "NAXIS3"));
}

TEST_F(Wheel, AStreamInColourHoldsTheImageOfAGrab) {
    for (const char* format : {"rgb24", "xrgb32", "rgb-planes"}) {
        const std::vector<std::uint16_t> expected = Grab({"--format", format});

        const ProgramResult result = Run(
            {"stream", "0", "--count", "1", "--format", format, "-o", folder.GetPath("night.png")});

        ASSERT_EQ(0, result.exitCode) << result.errors;
        EXPECT_EQ(expected, ReadPng(folder.GetPath("night-000001.png")).values) << format;
    }
}

TEST_F(Wheel, EveryFormatOfADepthHoldsTheSameImage) {
    const std::vector<std::uint16_t> bytes = Grab({"--format", "rgb24"});
    for (const char* format : {"bgr24", "xrgb32", "bgrx32", "rgb-planes"})
        EXPECT_EQ(bytes, Grab({"--format", format})) << format;
    EXPECT_EQ(Grab({"--format", "rgb48"}), Grab({"--format", "rgb-planes16"}));
}

TEST_F(Wheel, AFrameOfItIsProcessedAsItIs) {
    const std::string raw = folder.GetPath("raw.fits"), copy = folder.GetPath("copy.fits");
    ASSERT_EQ(0, Run({"grab", "0", "-o", raw}).exitCode);

    const ProgramResult result = Run({"process", raw, "-o", copy});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_EQ(FitsFile(raw).ReadPixels(), FitsFile(copy).ReadPixels());
    int status = 0, isProcessed = 1;
    fits_read_key_log(FitsFile(copy).Get(), "POSTPROC", &isProcessed, nullptr, &status);
    EXPECT_EQ(0, status);
    EXPECT_EQ(0, isProcessed);
}

TEST_F(Wheel, ItMakesNothingOfAMosaicOfAnotherCamera) {
    const std::string raw = folder.GetPath("raw.fits");
    const std::string mosaic = folder.GetPath("mosaic.json");
    WriteFile(mosaic,
              R"({"base": "colour", "cameras": [{"sensor": {"width": 64, "height": 48}}]})");
    ASSERT_EQ(0, RunProgram({"grab", "0", "--simulation", mosaic, "-o", raw}).exitCode);

    const ProgramResult result = Run({"process", raw, "-o", folder.GetPath("never.png")});

    EXPECT_EQ(2, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("no mosaic"));
}

TEST_F(Wheel, FormatsThatContradictEachOtherAreWrongUse) {
    const std::vector<std::vector<std::string>> cases{
        {"--format", "rgb24", "--set", "image-format=rgb48"},
        {"--colour", "--set", "do-post-processing=off"},
        {"--colour", "--set", "post-process-image-format=bgr24"},
    };
    for (std::vector<std::string> words : cases) {
        words.insert(words.begin(), {"grab", "0", "-o", folder.GetPath("never.png")});

        const ProgramResult result = Run(words);

        EXPECT_EQ(2, result.exitCode) << words.back();
        EXPECT_THAT(result.errors, HasSubstr("but --set asks for")) << words.back();
    }
}

TEST(WheelOfDeepSamples, ColoursOfBytesAreRefusedByTheDepth) {
    const TemporaryFolder folder;
    for (const char* format : {"rgb24", "bgr24", "xrgb32", "bgrx32", "rgb-planes"}) {
        const ProgramResult grab = RunProgram({"grab", "0", "--simulation", "metrona", "--format",
                                               format, "-o", folder.GetPath("never.png")});
        const ProgramResult stream =
            RunProgram({"stream", "0", "--simulation", "metrona", "--format", format, "--count",
                        "1", "-o", folder.GetPath("never.png")});

        EXPECT_EQ(2, grab.exitCode) << format;
        EXPECT_THAT(grab.errors, HasSubstr("16 bits")) << format;
        EXPECT_EQ(2, stream.exitCode) << format;
        EXPECT_THAT(stream.output, IsEmpty());
    }
    EXPECT_EQ(0, RunProgram({"grab", "0", "--simulation", "metrona", "--format", "rgb48", "-o",
                             folder.GetPath("a.png")})
                     .exitCode);
}

}  // namespace
}  // namespace ZentaraTest
