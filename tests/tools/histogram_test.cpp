#include "tools/histogram.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "tools/colour_image.h"
#include "tools/program.h"

namespace ZentaraTest {
namespace {

using nlohmann::json;
using testing::ElementsAre;
using testing::HasSubstr;
using ZentaraProgram::Histogram;
using ZentaraProgram::Image;
using ZentaraProgram::MakeHistograms;

Image MakeGrey(std::uint32_t bits, const std::vector<std::uint16_t>& samples) {
    Image image;
    image.layout = ZentaraProgram::FindPixelFormat(std::uint32_t{zfmtMono16});
    image.width = static_cast<std::uint32_t>(samples.size());
    image.height = 1;
    image.bytesPerSample = 2;
    image.bits = bits;
    image.pixels.resize(samples.size() * 2);
    std::memcpy(image.pixels.data(), samples.data(), image.pixels.size());
    return image;
}

TEST(Histogram, TellsLeastGreatestMeanMedianAndSaturatedSamples) {
    const auto histograms = MakeHistograms(MakeGrey(12, {7, 9, 4095, 10, 9}));

    ASSERT_EQ(1U, histograms.size());
    const Histogram& grey = histograms.front();
    EXPECT_EQ("grey", grey.name);
    EXPECT_EQ(4096U, grey.counts.size());
    EXPECT_EQ(7U, grey.GetMinimum());
    EXPECT_EQ(4095U, grey.GetMaximum());
    EXPECT_DOUBLE_EQ(826, grey.GetMean());
    EXPECT_EQ(9U, grey.GetMedian());
    EXPECT_EQ(1U, grey.GetSaturated());
}

TEST(Histogram, ASampleAboveTheDepthCountsAsItsGreatestValue) {
    const auto histograms = MakeHistograms(MakeGrey(12, {65535}));

    EXPECT_EQ(1U, histograms.front().GetSaturated());
}

TEST(Histogram, DepthsOutsideOfAllCamerasStillHaveAHistogram) {
    EXPECT_EQ(256U, MakeHistograms(MakeGrey(0, {1})).front().counts.size());
    EXPECT_EQ(65536U, MakeHistograms(MakeGrey(64, {1})).front().counts.size());
}

TEST(Histogram, AMosaicHasTheColoursOfItsPattern) {
    // What a cell of the samples 1, 2 over 3, 4 says of red and blue in each pattern.
    constexpr std::uint32_t Expected[4][2] = {{1, 4}, {2, 3}, {3, 2}, {4, 1}};
    for (std::uint32_t pattern = 0; pattern < 4; ++pattern) {
        Image image = MakeGrey(12, {1, 2, 1, 2, 3, 4, 3, 4});
        image.width = 4;
        image.height = 2;
        image.isBayer = true;
        image.bayerPattern = pattern;

        const auto histograms = MakeHistograms(image);

        ASSERT_EQ(3U, histograms.size());
        EXPECT_EQ(Expected[pattern][0], histograms[0].GetMinimum());
        EXPECT_EQ(2U, histograms[0].samples);
        EXPECT_EQ(4U, histograms[1].samples);
        EXPECT_EQ(Expected[pattern][1], histograms[2].GetMaximum());
    }
}

TEST(Histogram, EveryFormatOfThreeColoursHasItsChannels) {
    for (const ColourCase& row : ColourCases) {
        const auto histograms = MakeHistograms(MakeColourImage(row));

        ASSERT_EQ(3U, histograms.size()) << row.name;
        for (std::size_t colour = 0; colour < 3; ++colour) {
            EXPECT_EQ(15U, histograms[colour].samples) << row.name;
            EXPECT_EQ(GetTestSample(row.bytes, 0, colour), histograms[colour].GetMinimum());
            EXPECT_EQ(GetTestSample(row.bytes, 14, colour), histograms[colour].GetMaximum());
        }
    }
}

TEST(Histogram, ThePictureShowsEachChannelInItsColour) {
    std::vector<Histogram> histograms(3, {"", std::vector<std::uint64_t>(256, 0)});
    histograms[0].counts[0] = 10;
    histograms[1].counts[0] = 10;
    histograms[2].counts[255] = 10;

    const Image picture = DrawPicture(histograms);

    const auto at = [&](std::uint32_t x) { return picture.pixels.data() + std::size_t{x} * 3; };
    EXPECT_THAT(std::vector<int>(at(0), at(1)), ElementsAre(255, 255, 32));
    EXPECT_THAT(std::vector<int>(at(picture.width / 2), at(picture.width / 2 + 1)),
                ElementsAre(32, 32, 32));
    EXPECT_THAT(std::vector<int>(at(picture.width - 1), at(picture.width)),
                ElementsAre(32, 32, 255));
}

TEST(HistogramCommand, ShowsACamerasImageInTheTerminal) {
    const ProgramResult result = RunProgram({"histogram", "0", "--simulation", "mono"});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_THAT(result.output, HasSubstr("grey: "));
    EXPECT_THAT(result.output, HasSubstr("median"));
    EXPECT_THAT(result.output, HasSubstr("█"));
}

TEST(HistogramCommand, ShowsAFileAsItShowsTheCamera) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("a.fits");
    const std::string scenario = folder.GetPath("still.json");
    WriteFile(scenario,
              R"({"base": "colour", "cameras": [{"sensor": {"noise": false, "darkCurrent": 0}}]})");
    ASSERT_EQ(0, RunProgram({"grab", "0", "--simulation", scenario, "-o", path}).exitCode);

    const ProgramResult camera = RunProgram({"histogram", "0", "--simulation", scenario, "--json"});
    const ProgramResult file = RunProgram({"histogram", path, "--json"});

    ASSERT_EQ(0, camera.exitCode) << camera.errors;
    EXPECT_EQ(camera.output, file.output);
    const json channels = json::parse(file.output)["channels"];
    ASSERT_EQ(3U, channels.size());
    EXPECT_EQ("green", channels[1]["name"]);
    EXPECT_EQ(1392 * 1040 / 2, channels[1]["samples"]);
    EXPECT_EQ(256U, channels[1]["bins"].size());
}

TEST(HistogramCommand, ShowsEveryKindOfFileAlike) {
    const TemporaryFolder folder;
    const std::string raw = folder.GetPath("raw.fits");
    ASSERT_EQ(0, RunProgram({"grab", "0", "--simulation", "colour", "-o", raw}).exitCode);
    std::vector<std::string> outputs;
    for (const char* name : {"a.fits", "a.png", "a.tiff"}) {
        const std::string path = folder.GetPath(name);
        ASSERT_EQ(0, RunProgram({"process", raw, "-o", path, "--simulation", "colour"}).exitCode);
        outputs.push_back(RunProgram({"histogram", path, "--json"}).output);
    }

    EXPECT_THAT(outputs.front(), HasSubstr("\"green\""));
    EXPECT_EQ(outputs[0], outputs[1]);
    EXPECT_EQ(outputs[0], outputs[2]);
}

TEST(HistogramCommand, DrawsAPicture) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("a.png");

    const ProgramResult result =
        RunProgram({"histogram", "0", "--simulation", "colour", "--png", path});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    const ReadSamples picture = ReadPng(path);
    EXPECT_EQ(3U, picture.channels);
    EXPECT_EQ(8U, picture.bits);
    EXPECT_EQ(768U, picture.width);
    // Each channel has a fullest bin, whose bar reaches the top.
    for (std::uint32_t channel = 0; channel < 3; ++channel) {
        std::uint32_t full = 0;
        for (std::uint32_t x = 0; x < picture.width; ++x)
            full += picture.At(x, 0, channel) == 255 ? 1 : 0;
        EXPECT_GE(full, 3U) << channel;
        EXPECT_LT(full, picture.width / 4) << channel;
    }
}

TEST(HistogramCommand, ANumberThatNoCameraHasIsToldAsSuch) {
    for (const char* number : {"7", "99999999999", "99999999999999999999999"}) {
        const ProgramResult result = RunProgram({"histogram", number, "--simulation", "mono"});

        EXPECT_EQ(3, result.exitCode) << number;
        EXPECT_THAT(result.errors, HasSubstr(std::string("there is no camera ") + number));
    }
}

TEST(HistogramCommand, ADamagedFrameIsShownAndToldWithCode6) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("a.fits"), scenario = folder.GetPath("lossy.json");
    WriteFile(scenario, R"({"base": "mono", "cameras": [{"sensor": {"width": 640, "height": 480},
        "faults": [{"kind": "losePacket", "count": 0, "packet": 3}]}]})");
    ASSERT_EQ(6, RunProgram({"grab", "0", "--simulation", scenario, "-o", path}).exitCode);

    const ProgramResult camera = RunProgram({"histogram", "0", "--simulation", scenario});
    const ProgramResult file = RunProgram({"histogram", path});
    const ProgramResult processed =
        RunProgram({"process", path, "--simulation", "mono", "-o", folder.GetPath("b.fits")});

    for (const ProgramResult& result : {camera, file, processed}) {
        EXPECT_EQ(6, result.exitCode) << result.errors;
        EXPECT_THAT(result.errors, HasSubstr("the frame is damaged"));
        EXPECT_THAT(result.output, testing::Not(testing::IsEmpty()));
    }
}

TEST(HistogramCommand, WrongUseAndBadFilesAreTold) {
    const TemporaryFolder folder;
    const std::string path = folder.GetPath("a.fits");
    WriteFile(path, "SIMPLE  = nothing of the kind");

    const ProgramResult bad = RunProgram({"histogram", path});
    const ProgramResult missing = RunProgram({"histogram", folder.GetPath("b.fits")});
    const ProgramResult jpeg = RunProgram({"histogram", "0", "--png", "a.jpg"});
    const ProgramResult settings = RunProgram({"histogram", path, "--set", "gain-db=1"});

    EXPECT_EQ(1, bad.exitCode);
    EXPECT_THAT(bad.errors, HasSubstr(path));
    EXPECT_EQ(1, missing.exitCode);
    EXPECT_THAT(missing.errors, HasSubstr("no such file"));
    EXPECT_EQ(2, jpeg.exitCode);
    EXPECT_EQ(2, settings.exitCode);
}

}  // namespace
}  // namespace ZentaraTest
