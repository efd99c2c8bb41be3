#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "tools/colour_image.h"
#include "tools/fits_file.h"
#include "tools/program.h"

namespace ZentaraTest {
namespace {

using testing::HasSubstr;

/// A camera whose post-processing corrects proportions: of a sensor of 2560 x 96 pixels, in
/// real-time video of 2560 x 12 and 8 rows added to each. It sends the same image each time.
class FolaryFrames : public testing::Test {
  protected:
    FolaryFrames() {
        WriteFile(scenario, R"({"base": "folary", "cameras": [{"sensor": {"width": 2560,
            "height": 96, "noise": false, "darkCurrent": 0, "videoBinning": 8},
            "configuration": {"42": 0, "5": )" +
                                std::to_string(VideoWindow) + R"(},
            "scene": {"kind": "chart", "brightness": 3e5}}]})");
    }
    ProgramResult Run(std::vector<std::string> words, const std::vector<std::string>& more = {}) {
        words.insert(words.end(), {"--simulation", scenario});
        words.insert(words.end(), more.begin(), more.end());
        return RunProgram(words);
    }

    static constexpr std::uint32_t VideoWindow = 2560U << 16 | 12;
    TemporaryFolder folder;
    const std::string scenario = folder.GetPath("folary.json");
};

/// Settings of a mode, and what becomes of its frames.
struct ModeCase {
    const char* name;
    std::vector<std::string> words;
    std::uint32_t width, height;  ///< Of the frame.
    std::uint32_t finishedWidth, finishedHeight;
};
const ModeCase ModeCases[] = {
    {"Full", {}, 2560, 96, 2560, 96},
    {"RowsOfTwo", {"--set", "vertical-binning=2"}, 2560, 48, 1280, 48},
    {"RowsOfThree", {"--set", "vertical-binning=3"}, 2556, 32, 852, 32},
    {"RowsOfFour", {"--set", "vertical-binning=4"}, 2560, 24, 640, 24},
    {"RealTime", {"--set", "camera-mode=rtv"}, 2560, 12, 640, 24},
};

class FolaryModes : public FolaryFrames, public testing::WithParamInterface<ModeCase> {};

TEST_P(FolaryModes, AStoredFrameBecomesTheImageThatAGrabInColourGives) {
    for (const char* format : {"rgb24", "rgb48"}) {
        const std::string mosaic = std::string(format) == "rgb24" ? "bayer8" : "bayer16";
        const std::string raw = folder.GetPath("raw.fits"), grabbed = folder.GetPath("grabbed.png");
        const std::string finished = folder.GetPath("finished.png");
        const ProgramResult stored =
            Run({"grab", "0", "--format", mosaic, "-o", raw}, GetParam().words);
        ASSERT_EQ(0, stored.exitCode) << stored.errors;
        const ProgramResult colour =
            Run({"grab", "0", "--colour", "--format", format, "-o", grabbed}, GetParam().words);
        ASSERT_EQ(0, colour.exitCode) << colour.errors;

        const ProgramResult result = Run({"process", raw, "-o", finished});

        ASSERT_EQ(0, result.exitCode) << result.errors;
        const ReadSamples image = ReadPng(finished);
        EXPECT_EQ(GetParam().finishedWidth, image.width);
        EXPECT_EQ(GetParam().finishedHeight, image.height);
        EXPECT_EQ(ReadPng(grabbed).values, image.values) << format;
    }
}

TEST_P(FolaryModes, TheHeaderTellsTheBinningOfEachImage) {
    const std::string raw = folder.GetPath("raw.fits"), grabbed = folder.GetPath("grabbed.fits");
    const std::string finished = folder.GetPath("finished.fits");
    ASSERT_EQ(0, Run({"grab", "0", "-o", raw}, GetParam().words).exitCode);
    ASSERT_EQ(0, Run({"grab", "0", "--colour", "-o", grabbed}, GetParam().words).exitCode);
    ASSERT_EQ(0, Run({"process", raw, "-o", finished}).exitCode);

    const FitsFile frame(raw);
    EXPECT_EQ(1, ReadFitsNumber(frame.Get(), "XBINNING"));
    const double across = GetParam().width / GetParam().finishedWidth;
    for (const std::string& path : {grabbed, finished}) {
        const FitsFile image(path);
        EXPECT_EQ(across, ReadFitsNumber(image.Get(), "XBINNING"));
        EXPECT_DOUBLE_EQ(across * ReadFitsNumber(frame.Get(), "XPIXSZ"),
                         ReadFitsNumber(image.Get(), "XPIXSZ"));
        if (GetParam().height != GetParam().finishedHeight) continue;
        EXPECT_EQ(96 / GetParam().height, ReadFitsNumber(frame.Get(), "YBINNING"));
        EXPECT_EQ(96 / GetParam().height, ReadFitsNumber(image.Get(), "YBINNING"));
        EXPECT_DOUBLE_EQ(ReadFitsNumber(frame.Get(), "YPIXSZ"),
                         ReadFitsNumber(image.Get(), "YPIXSZ"));
    }
}

TEST_P(FolaryModes, WhiteBalanceTakesRegionsOfTheFinishedImage) {
    const auto last = [&](std::uint32_t beyond) {
        return std::to_string(GetParam().finishedWidth - 16 + beyond) + "," +
               std::to_string(GetParam().finishedHeight - 8) + ",16x8";
    };

    const ProgramResult inside = Run({"white-balance", "0", "--region", last(0)}, GetParam().words);
    const ProgramResult outside =
        Run({"white-balance", "0", "--region", last(1)}, GetParam().words);

    EXPECT_EQ(0, inside.exitCode) << inside.errors;
    EXPECT_EQ(2, outside.exitCode);
    EXPECT_THAT(outside.errors,
                HasSubstr("the image of " + std::to_string(GetParam().finishedWidth) + " x " +
                          std::to_string(GetParam().finishedHeight)));
}

TEST_P(FolaryModes, AutoExposureTakesRegionsOfTheFrame) {
    const auto last = [&](std::uint32_t beyond) {
        return "0," + std::to_string(GetParam().height - 8 + beyond) + ",16x8";
    };

    const ProgramResult inside = Run({"auto-expose", "0", "--region", last(0)}, GetParam().words);
    const ProgramResult outside = Run({"auto-expose", "0", "--region", last(1)}, GetParam().words);

    EXPECT_EQ(0, inside.exitCode) << inside.errors;
    EXPECT_EQ(2, outside.exitCode);
    EXPECT_THAT(outside.errors, HasSubstr("the camera's frame of "));
}

INSTANTIATE_TEST_SUITE_P(Modes, FolaryModes, testing::ValuesIn(ModeCases),
                         [](const testing::TestParamInfo<ModeCase>& tested) {
                             return std::string(tested.param.name);
                         });

}  // namespace
}  // namespace ZentaraTest
