#include <fitsio.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "tools/colour_image.h"
#include "tools/fits_file.h"
#include "tools/fits_verdict.h"
#include "tools/image_readers.h"
#include "tools/image_samples.h"
#include "tools/program.h"

namespace ZentaraTest {
namespace {

using nlohmann::json;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr const char* StillColour =
    R"({"base": "colour", "cameras": [{"sensor": {"noise": false, "darkCurrent": 0}}]})";

/// A folder with a scenario whose camera sends the same mosaic each time.
class Process : public testing::Test {
  protected:
    Process() { WriteFile(scenario, StillColour); }

    std::string Grab(const char* name, std::vector<std::string> words,
                     const std::string& simulation) {
        const std::string path = folder.GetPath(name);
        std::vector<std::string> all{"grab", "0", "--simulation", simulation, "-o", path};
        all.insert(all.end(), words.begin(), words.end());
        const ProgramResult result = RunProgram(all);
        EXPECT_EQ(0, result.exitCode) << result.errors;
        return path;
    }
    std::string Grab(const char* name, std::vector<std::string> words) {
        return Grab(name, std::move(words), scenario);
    }
    ProgramResult Run(const std::string& file, const char* output, std::vector<std::string> words) {
        std::vector<std::string> all{"process", file, "-o", folder.GetPath(output)};
        all.insert(all.end(), words.begin(), words.end());
        return RunProgram(all);
    }
    void SetNumber(const std::string& path, const char* key, double value) {
        fitsfile* file = nullptr;
        int status = 0;
        fits_open_diskfile(&file, path.c_str(), READWRITE, &status);
        fits_update_key_dbl(file, key, value, -15, nullptr, &status);
        fits_close_file(file, &status);
        EXPECT_EQ(0, status);
    }

    TemporaryFolder folder;
    const std::string scenario = folder.GetPath("still.json");
};

TEST_F(Process, AStoredFrameBecomesTheImageThatAGrabInColourGives) {
    const std::vector<std::vector<std::string>> cases{
        {},
        {"--bayer", "fast"},
        {"--bayer", "bicubic", "--format", "bgr24"},
        {"--set", "post-process-gain-red=0.5x"},
    };
    const std::string raw = Grab("raw.fits", {});
    for (std::vector<std::string> words : cases) {
        words.insert(words.end(), {"--simulation", scenario});
        const ProgramResult result = Run(raw, "finished.png", words);
        ASSERT_EQ(0, result.exitCode) << result.errors;
        words.resize(words.size() - 2);
        words.emplace_back("--colour");
        const std::string grabbed = Grab("grabbed.png", words);

        EXPECT_EQ(ReadPng(grabbed).values, ReadPng(folder.GetPath("finished.png")).values)
            << words.front();
    }
}

TEST_F(Process, ADeepFrameBecomesADeepImage) {
    const std::string raw = Grab("raw.fits", {"--format", "bayer16"});

    const ProgramResult result = Run(raw, "finished.png", {"--simulation", scenario, "--json"});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_EQ("rgb48", json::parse(result.output)["format"]);
    const ReadSamples image = ReadPng(folder.GetPath("finished.png"));
    EXPECT_EQ(16U, image.bits);
    EXPECT_EQ(ReadPng(Grab("grabbed.png", {"--format", "rgb48"})).values, image.values);
}

TEST_F(Process, TheGainsThatWereMeasuredForAFrameGoWithIt) {
    const std::string raw = Grab("raw.fits", {"--white-balance"});
    const std::string balanced = Grab("grabbed.png", {"--colour", "--white-balance"});

    ASSERT_EQ(0, Run(raw, "finished.png", {"--simulation", scenario}).exitCode);

    EXPECT_EQ(ReadPng(balanced).values, ReadPng(folder.GetPath("finished.png")).values);
}

TEST_F(Process, AFinishedFitsFileKeepsWhatTheFrameTold) {
    const std::string raw = Grab("raw.fits", {"--set", "exposure=20ms"});

    ASSERT_EQ(0, Run(raw, "finished.fits", {"--simulation", scenario}).exitCode);

    const FitsFile before(raw), after(folder.GetPath("finished.fits"));
    EXPECT_EQ(3, ReadFitsNumber(after.Get(), "NAXIS3"));
    EXPECT_EQ(12, ReadFitsNumber(after.Get(), "PIXFORM"));
    for (const char* key : {"EXPTIME", "GAIN", "FRAMENUM", "XPIXSZ", "WBRED", "WBBLUE"})
        EXPECT_EQ(ReadFitsNumber(before.Get(), key), ReadFitsNumber(after.Get(), key)) << key;
    for (const char* key : {"DATE-OBS", "INSTRUME", "SERIALNO", "READOUTM"})
        EXPECT_EQ(ReadFitsText(before.Get(), key), ReadFitsText(after.Get(), key)) << key;
    EXPECT_EQ("RGB24", ReadFitsText(after.Get(), "IMGFORM"));
    EXPECT_TRUE(IsFitsGood(folder.GetPath("finished.fits")));
}

TEST_F(Process, AFrameOfAStreamIsProcessedToo) {
    const ProgramResult stream = RunProgram({"stream", "0", "--simulation", scenario, "--count",
                                             "1", "-o", folder.GetPath("night.fits")});
    ASSERT_TRUE(stream.exitCode == 0 || stream.exitCode == 6) << stream.errors;

    const ProgramResult result =
        Run(folder.GetPath("night-000001.fits"), "finished.tiff", {"--simulation", scenario});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    std::vector<std::uint8_t> scratch;
    ZentaraProgram::Image image;
    ASSERT_EQ("", ZentaraProgram::ReadImage(folder.GetPath("finished.tiff"), &image));
    const auto samples = ZentaraProgram::GetPixelSamples(image, &scratch);
    const std::vector<std::uint16_t> values(samples.begin(), samples.end());
    EXPECT_EQ(ReadPng(Grab("grabbed.png", {"--colour"})).values, values);
}

TEST_F(Process, FramesOfAllKindsOfCamerasAreTaken) {
    for (const char* simulation : {"wheel", "metrona", "old", "intensified", "rotated"}) {
        for (const char* format : {"raw8", "raw16", "mono8", "mono16"}) {
            const std::string path = folder.GetPath("raw.fits"), copy = folder.GetPath("copy.fits");
            const ProgramResult grab = RunProgram(
                {"grab", "0", "--simulation", simulation, "--format", format, "-o", path});
            if (grab.exitCode == 2) continue;  // Not every camera has every format.
            ASSERT_EQ(0, grab.exitCode) << simulation << format << grab.errors;

            const ProgramResult result =
                RunProgram({"process", path, "--simulation", simulation, "-o", copy});

            ASSERT_EQ(0, result.exitCode) << simulation << format << result.errors;
            EXPECT_EQ(FitsFile(path).ReadPixels(), FitsFile(copy).ReadPixels()) << simulation;
        }
    }
}

TEST_F(Process, AFrameOfTheLargestCameraIsFinished) {
    const std::string raw = Grab("raw.fits", {}, "large");

    const ProgramResult result = Run(raw, "finished.raw", {"--simulation", "large"});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_EQ(std::size_t{4008} * 2672 * 3, ReadFile(folder.GetPath("finished.raw")).size());
}

TEST_F(Process, WhatElseIsSetDoesNotMatter) {
    const std::string raw = Grab("raw.fits", {});
    const std::vector<std::string> plain{"--simulation", scenario};
    ASSERT_EQ(0, Run(raw, "plain.png", plain).exitCode);

    const ProgramResult result = Run(raw, "set.png",
                                     {"--simulation", scenario, "--set", "do-post-processing=off",
                                      "--set", "image-format=bayer16", "--set", "exposure=1s"});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_EQ(ReadPng(folder.GetPath("plain.png")).values,
              ReadPng(folder.GetPath("set.png")).values);
}

TEST_F(Process, AnotherFormatThanThatOfTheCommandIsWrongUse) {
    const std::string raw = Grab("raw.fits", {});

    const ProgramResult result = Run(raw, "never.png",
                                     {"--simulation", scenario, "--format", "rgb24", "--set",
                                      "post-process-image-format=bgr24"});

    EXPECT_EQ(2, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("but --set asks for"));
}

TEST_F(Process, AGainOfTheCommandLineTakesThePlaceOfABadOneOfTheFile) {
    const std::string raw = Grab("raw.fits", {});
    SetNumber(raw, "WBRED", 0);

    const ProgramResult result =
        Run(raw, "finished.png", {"--simulation", scenario, "--set", "post-process-gain-red=1x"});

    EXPECT_EQ(0, result.exitCode) << result.errors;
}

TEST_F(Process, AFrameWithoutAMosaicIsCopied) {
    const std::string raw = Grab("raw.fits", {}, "mono");

    const ProgramResult result = Run(raw, "copy.fits", {"--simulation", "mono"});

    ASSERT_EQ(0, result.exitCode) << result.errors;
    EXPECT_EQ(FitsFile(raw).ReadPixels(), FitsFile(folder.GetPath("copy.fits")).ReadPixels());
}

TEST_F(Process, AnotherModelIsTold) {
    WriteFile(folder.GetPath("small.json"), R"({"base": "colour", "cameras": [{"model": "DorixR1",
        "sensor": {"width": 64, "height": 48}}]})");
    const std::string raw = Grab("raw.fits", {}, folder.GetPath("small.json"));

    const ProgramResult result = Run(raw, "finished.png", {"--simulation", scenario});

    EXPECT_EQ(0, result.exitCode) << result.errors;
    EXPECT_THAT(result.errors, HasSubstr("processed as one of a"));
}

TEST_F(Process, AFrameLargerThanTheSensorIsRefused) {
    const std::string raw = Grab("raw.fits", {});
    const std::string small = folder.GetPath("small.json");
    WriteFile(small, R"({"base": "colour", "cameras": [{"sensor": {"width": 64, "height": 48}}]})");

    const ProgramResult result = Run(raw, "never.png", {"--simulation", small});

    EXPECT_EQ(1, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("more than the sensor"));
    EXPECT_THAT(result.output, IsEmpty());
}

TEST_F(Process, ColoursOfAFrameWithoutAMosaicAreRefused) {
    const std::string raw = Grab("raw.fits", {}, "mono");

    const ProgramResult result =
        Run(raw, "never.png", {"--simulation", scenario, "--format", "rgb24"});

    EXPECT_EQ(2, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("no mosaic"));
}

TEST_F(Process, AFormatOfAnotherDepthIsRefused) {
    const std::string raw = Grab("raw.fits", {});
    for (const char* format : {"rgb48", "bayer8", "mono16"}) {
        const ProgramResult result =
            Run(raw, "never.png", {"--simulation", scenario, "--format", format});

        EXPECT_EQ(2, result.exitCode) << format;
        EXPECT_THAT(result.errors, HasSubstr(format));
    }
}

TEST_F(Process, AFrameThatIsFinishedIsRefused) {
    const std::string finished = Grab("finished.fits", {"--colour"});

    const ProgramResult result = Run(finished, "never.png", {"--simulation", scenario});

    EXPECT_EQ(2, result.exitCode);
    EXPECT_THAT(result.errors, HasSubstr("three colours"));
}

TEST_F(Process, GainsOfAFileThatNoCameraHasAreToldWithTheFile) {
    const std::string raw = Grab("raw.fits", {});
    for (const double gain : {0.0, -1.0, 1e300}) {
        SetNumber(raw, "WBRED", gain);

        const ProgramResult result = Run(raw, "never.png", {"--simulation", scenario});

        EXPECT_EQ(2, result.exitCode) << gain;
        EXPECT_THAT(result.errors, HasSubstr(raw + ": post-process-gain-red")) << gain;
    }
}

TEST_F(Process, AFileThatIsNoFrameIsNamedWithTheReason) {
    const std::string text = folder.GetPath("text.fits");
    WriteFile(text, "no image");
    const std::string picture = Grab("picture.png", {});

    for (const std::string& file : {text, picture, folder.GetPath("missing.fits")}) {
        const ProgramResult result = Run(file, "never.png", {"--simulation", scenario});

        EXPECT_EQ(1, result.exitCode);
        EXPECT_THAT(result.errors, HasSubstr(file + ": "));
    }
}

TEST_F(Process, WithoutACameraThereIsNoModelToProcessBy) {
    const std::string raw = Grab("raw.fits", {});

    EXPECT_EQ(3, Run(raw, "never.png", {"--simulation", "empty"}).exitCode);
    EXPECT_EQ(3, Run(raw, "never.png", {"--simulation", "colour", "--camera", "1"}).exitCode);
}

TEST_F(Process, AnOutputOfNoKnownKindIsWrongUse) {
    EXPECT_EQ(2, Run("a.fits", "image.jpg", {"--simulation", scenario}).exitCode);
}

}  // namespace
}  // namespace ZentaraTest
