#include "imaging/auto_exposure.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>

#include "imaging/scripted_camera.h"

namespace ZV::Testing {
namespace {

using testing::ElementsAre;

constexpr std::uint64_t Most = std::numeric_limits<std::uint64_t>::max();

/// One image through an awake filter.
class ExposureCorrection : public testing::Test {
  protected:
    ExposureCorrection() { (void)filter.Init(ScriptedCamera::Width, ScriptedCamera::Height); }

    FilterResult Process(ZImageFormatEnum format, const std::vector<std::uint16_t>& samples,
                         std::uint16_t depth = 8) {
        const ZExImage image = camera.MakeFlatImage(format, samples, depth);
        return Process(image);
    }
    FilterResult Process(const ZExImage& image) {
        ZInImageBufferStruct in;
        in.data = image.GetImageData();
        in.imageSize = image.GetImageSize();
        in.width = image.GetWidth();
        in.height = image.GetHeight();
        in.bitDepth = image.GetBitDepth();
        in.imageFormat = image.GetImageFormat();
        in.camera = hasCamera ? &camera : nullptr;
        return filter.Process(&in, nullptr);
    }
    std::uint64_t CorrectMono(std::uint16_t maximum, std::uint64_t exposure = 1000,
                              std::uint16_t depth = 8) {
        camera.exposure = exposure;
        EXPECT_EQ(Process(depth == 8 ? Mono8 : Mono16, {maximum}, depth), FilterDeclined);
        return camera.exposure;
    }
    std::uint64_t CorrectColour(const std::vector<std::uint16_t>& colours,
                                std::uint64_t exposure = 1000, std::uint16_t depth = 8) {
        camera.exposure = exposure;
        EXPECT_EQ(Process(depth == 8 ? RGB24 : RGB48, colours, depth), FilterDeclined);
        return camera.exposure;
    }

    ScriptedCamera camera;
    ZAutoExposure filter{true};
    bool hasCamera = true;
};

TEST_F(ExposureCorrection, OfMaximum120TakesTheProportionTo250) {
    EXPECT_EQ(CorrectMono(120), 2083U);
}

TEST_F(ExposureCorrection, OfMaximum100DoublesAndOf101TakesTheProportion) {
    EXPECT_EQ(CorrectMono(100), 2000U);
    EXPECT_EQ(CorrectMono(101), 2475U);
}

TEST_F(ExposureCorrection, OfMaximum50QuadruplesAndOf51Doubles) {
    EXPECT_EQ(CorrectMono(50), 4000U);
    EXPECT_EQ(CorrectMono(51), 2000U);
}

TEST_F(ExposureCorrection, OfMaximum255QuartersAndOf254TakesTheProportion) {
    EXPECT_EQ(CorrectMono(255), 250U);
    EXPECT_EQ(CorrectMono(255, 1003), 250U);
    EXPECT_EQ(CorrectMono(254), 984U);
}

TEST_F(ExposureCorrection, OfMaximum0CountsAs1AndQuadruples) {
    EXPECT_EQ(CorrectMono(0), 4000U);
    EXPECT_EQ(CorrectColour({0, 0, 0}), 4000U);
}

TEST_F(ExposureCorrection, StaysWithinTheLimitsOfTheCamera) {
    camera.minExposure = 600;
    camera.maxExposure = 1500;
    EXPECT_EQ(CorrectMono(120), 1500U);
    EXPECT_EQ(CorrectMono(255), 600U);
    EXPECT_EQ(CorrectColour({120, 1, 1}), 1500U);
    EXPECT_EQ(CorrectColour({255, 1, 1}), 600U);
}

TEST_F(ExposureCorrection, KeptHoldsTheLowerLimitWhereTheLimitsCross) {
    camera.minExposure = 5000;
    camera.maxExposure = 1500;
    EXPECT_EQ(CorrectMono(120), 5000U);
    EXPECT_EQ(CorrectColour({120, 120, 120}), 5000U);
}

TEST_F(ExposureCorrection, KeptWrapsInProductsOf64Bits) {
    camera.maxExposure = Most;
    camera.minExposure = 0;
    const std::uint64_t large = (Most >> 2) + 12345;
    EXPECT_EQ(CorrectMono(10, large), large * 4);
    EXPECT_LT(CorrectMono(10, large), large);
    EXPECT_EQ(CorrectMono(90, (Most >> 1) + 3), 4U);
    EXPECT_EQ(CorrectMono(120, Most / 100), Most / 100 * 250 / 120);
    EXPECT_EQ(CorrectColour({10, 10, 10}, large), large * 4);
    EXPECT_EQ(CorrectColour({120, 10, 10}, Most), Most) << "doubles do not wrap, they are held";
}

TEST_F(ExposureCorrection, OfAMonochromeImageSetsAllThreeExposuresAndCommitsOnce) {
    (void)CorrectMono(100);
    EXPECT_THAT(camera.TakeCalls(),
                ElementsAre("exposure 2000", "red 2000", "blue 2000", "update"));
}

TEST_F(ExposureCorrection, KeptOfAColourImageLeavesTheExposuresOfRedAndBlue) {
    (void)CorrectColour({100, 100, 100});
    EXPECT_THAT(camera.TakeCalls(), ElementsAre("exposure 2000", "update"));
}

TEST_F(ExposureCorrection, OfColourQuartersWhenOneColourIsSaturated) {
    EXPECT_EQ(CorrectColour({255, 30, 30}), 250U);
    EXPECT_EQ(CorrectColour({30, 255, 30}), 250U);
    EXPECT_EQ(CorrectColour({30, 30, 255}), 250U);
}

TEST_F(ExposureCorrection, OfColourGoesByTheBrightestColour) {
    const double share = 0.98F;
    const auto expected = static_cast<std::uint64_t>(256 * share * 1000 / 120);
    EXPECT_EQ(expected, 2090U);
    EXPECT_EQ(CorrectColour({40, 120, 60}), expected);
    EXPECT_EQ(CorrectColour({120, 40, 60}), expected);
    EXPECT_EQ(CorrectColour({40, 60, 120}), expected);
}

TEST_F(ExposureCorrection, OfColourMultipliesByOneStepForAllColoursOnly) {
    EXPECT_EQ(CorrectColour({50, 50, 50}), 4000U);
    EXPECT_EQ(CorrectColour({50, 51, 50}), 2000U);
    EXPECT_EQ(CorrectColour({100, 100, 100}), 2000U);
    EXPECT_EQ(CorrectColour({50, 50, 101}), 2483U);
    EXPECT_EQ(CorrectColour({254, 1, 1}), 987U);
}

TEST_F(ExposureCorrection, KeptTheFactorIsTheDoubleNearestTo098InSinglePrecision) {
    camera.maxExposure = Most;
    const double share = static_cast<double>(0.98F);
    ASSERT_EQ(share, 0.9800000190734863);
    const std::uint64_t exposure = 100000000000;
    const auto expected =
        static_cast<std::uint64_t>(256.0 * share * static_cast<double>(exposure) / 120);

    EXPECT_EQ(CorrectColour({120, 1, 1}, exposure), expected);

    EXPECT_NE(expected, static_cast<std::uint64_t>(256.0 * 0.98 * 1e11 / 120));
}

TEST_F(ExposureCorrection, OfDeeperImagesScalesItsThresholdsWithTheDepth) {
    for (const std::uint32_t bits : {10U, 12U, 16U}) {
        const auto depth = static_cast<std::uint16_t>(bits);
        const auto times = static_cast<std::uint16_t>(1U << (depth - 8));
        const auto scaled = [&](std::uint16_t value) {
            return static_cast<std::uint16_t>(value * times);
        };
        EXPECT_EQ(CorrectMono(scaled(255), 1000, depth), 250U);
        EXPECT_EQ(CorrectMono(static_cast<std::uint16_t>(scaled(255) - 1), 1000, depth),
                  1000ULL * 250 * times / (scaled(255) - 1U));
        EXPECT_EQ(CorrectMono(scaled(50), 1000, depth), 4000U);
        EXPECT_EQ(CorrectMono(static_cast<std::uint16_t>(scaled(50) + 1), 1000, depth), 2000U);
        EXPECT_EQ(CorrectMono(scaled(100), 1000, depth), 2000U);
        EXPECT_EQ(CorrectMono(scaled(120), 1000, depth), 2083U);
        EXPECT_EQ(CorrectColour({1, scaled(255), 1}, 1000, depth), 250U);
        EXPECT_EQ(CorrectColour({scaled(50), 1, 1}, 1000, depth), 4000U);
        EXPECT_EQ(CorrectColour({1, 1, scaled(100)}, 1000, depth), 2000U);
        EXPECT_EQ(CorrectColour({1, scaled(120), 1}, 1000, depth), 2090U);
    }
}

TEST_F(ExposureCorrection, TakesAnyNumberAsADepth) {
    for (const std::uint32_t bits : {0U, 1U, 7U, 9U, 17U, 40U, 64U, 65535U}) {
        const auto depth = static_cast<std::uint16_t>(bits);
        (void)Process(Mono8, {200}, depth);
        (void)Process(RGB24, {200, 10, 10}, depth);
    }
}

TEST_F(ExposureCorrection, MeasuresEveryFormatOfThreeColours) {
    struct Row {
        ZImageFormatEnum format;
        std::vector<std::uint16_t> samples;
    };
    for (const Row& row : {Row{RGBPlane8, {10, 120, 20}}, Row{BGR24, {10, 120, 20}},
                           Row{XRGB32, {255, 10, 120, 20}}, Row{BGRX32, {10, 120, 20, 255}},
                           Row{RGB24, {10, 120, 20}}, Row{RGBX32, {10, 120, 20, 255}}}) {
        camera.exposure = 1000;
        EXPECT_EQ(Process(row.format, row.samples), FilterDeclined);
        EXPECT_EQ(camera.exposure, 2090U) << "format " << row.format;
    }
}

TEST_F(ExposureCorrection, MeasuresMosaicsAsOneChannel) {
    camera.exposure = 1000;
    EXPECT_EQ(Process(Bayer8, {120}), FilterDeclined);
    EXPECT_EQ(camera.exposure, 2083U);
    camera.exposure = 1000;
    EXPECT_EQ(Process(Bayer16, {120 * 16}, 12), FilterDeclined);
    EXPECT_EQ(camera.exposure, 2083U);
}

TEST_F(ExposureCorrection, RefusesARawImageAndLeavesTheCameraAlone) {
    EXPECT_EQ(Process(Raw8, {120}), FilterUnknownFormat);
    EXPECT_EQ(Process(Raw16, {120}), FilterUnknownFormat);
    EXPECT_THAT(camera.TakeCalls(), ElementsAre());
}

TEST_F(ExposureCorrection, DeclinesWithoutDoingAnythingWhileItIsDormant) {
    filter.SetCalculateValuesOnAllFrames(false);
    EXPECT_EQ(Process(Mono8, {120}), FilterDeclined);
    EXPECT_EQ(Process(Raw8, {120}), FilterDeclined);
    EXPECT_THAT(camera.TakeCalls(), ElementsAre());
}

TEST_F(ExposureCorrection, DeclinesAnImageWithoutACamera) {
    hasCamera = false;
    EXPECT_EQ(Process(Mono8, {120}), FilterDeclined);
}

TEST_F(ExposureCorrection, CountsNothingThatLiesBeyondTheImage) {
    camera.exposure = 1000;
    (void)filter.Init(65535, 65535);
    EXPECT_EQ(Process(RGB24, {120, 1, 1}), FilterDeclined);
    EXPECT_EQ(camera.exposure, 2090U);
    ZInImageBufferStruct in;
    in.imageSize = 1000000;
    in.width = in.height = 0xFFFF;
    in.bitDepth = 8;
    in.camera = &camera;
    for (const std::uint32_t format : {2U, 5U, 6U, 7U, 10U, 13U}) {
        in.imageFormat = format;
        camera.exposure = 1000;
        EXPECT_EQ(filter.Process(&in, nullptr), FilterDeclined);
        EXPECT_EQ(camera.exposure, 4000U) << "no data counts as black";
    }
}

/// The whole iteration over a camera whose sample rises with its exposure.
class ExposureSearch : public testing::Test {
  protected:
    ExposureSearch() {
        camera.render = [this](ScriptedCamera&) { return Render(); };
    }

    ZExImage Render() {
        const double level = static_cast<double>(camera.exposure) * samplesPerNanosecond;
        const auto sample = static_cast<std::uint16_t>(std::min(level, 255.0));
        if (camera.imageFormat == CameraMono) return camera.MakeFlatImage(Mono8, {sample}, 8);
        return camera.MakeFlatImage(RGB24, {sample, static_cast<std::uint16_t>(sample / 2), 1}, 8);
    }
    FilterResult Search() {
        return filter.CalculateExposure(0, 0, 100, 100, static_cast<ZCamera*>(&camera));
    }
    std::vector<std::string> FindCalls(const std::string& kind) {
        std::vector<std::string> found;
        for (const std::string& call : camera.TakeCalls()) {
            if (call.rfind(kind, 0) == 0) found.push_back(call);
        }
        return found;
    }

    ScriptedCamera camera;
    ZAutoExposure filter{false};
    double samplesPerNanosecond = 0.125;
};

TEST_F(ExposureSearch, RunsAt8BitsAndPutsTheDepthBack) {
    camera.bitDepth = 12;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_THAT(FindCalls("depth"), ElementsAre("depth 8", "depth 12"));
}

TEST_F(ExposureSearch, StopsAtOnceWhenTheFirstPassMovesLessThanATenth) {
    camera.exposure = 1920;  // 240 of 255
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.imageCount, 1U);
    EXPECT_EQ(camera.exposure, 2000U);
}

TEST_F(ExposureSearch, GoesOnWhenAPassMovesMoreThanATenth) {
    camera.exposure = 1800;  // 225, which takes a ninth
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.imageCount, 2U);
}

TEST_F(ExposureSearch, KeptATenthIsTheDoubleNearestTo01InSinglePrecision) {
    // Images are black: the limits alone decide where the exposure goes.
    samplesPerNanosecond = 0;
    camera.minExposure = camera.maxExposure = 1100;
    camera.exposure = 1000;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.imageCount, 1U) << "a tenth itself is small";

    camera.minExposure = camera.maxExposure = 1100000001;
    camera.exposure = 1000000000;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.imageCount, 2U) << "100000001 <= 100000001.49: more than a tenth, and small";

    camera.minExposure = camera.maxExposure = 1100000002;
    camera.exposure = 1000000000;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.imageCount, 4U) << "100000002 is more";
}

TEST_F(ExposureSearch, StopsAfterOnePassAtTheUpperLimitInTheDark) {
    samplesPerNanosecond = 0;
    camera.exposure = camera.maxExposure = 5000;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.imageCount, 1U);
    EXPECT_EQ(camera.exposure, 5000U);
}

TEST_F(ExposureSearch, QuartersASaturatedExposurePassByPass) {
    camera.exposure = 2000 * 64;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_THAT(FindCalls("exposure"),
                ElementsAre("exposure 32000", "exposure 8000", "exposure 2000", "exposure 2000"));
}

TEST_F(ExposureSearch, QuartersDownToTheLimitOfTheCamera) {
    samplesPerNanosecond = 1e9;
    camera.minExposure = 30;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_THAT(FindCalls("exposure"),
                ElementsAre("exposure 250", "exposure 62", "exposure 30", "exposure 30"));
}

TEST_F(ExposureSearch, EndsWithTheTenthPassWithoutAFailure) {
    samplesPerNanosecond = 0;
    camera.maxExposure = Most;
    camera.exposure = 3;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.imageCount, 10U);
    EXPECT_EQ(camera.exposure, 3ULL << 20);
}

TEST_F(ExposureSearch, KeepsTheDifferenceOfAFallingExposureSigned) {
    camera.exposure = 2032;  // 254: falls by 32, less than a tenth
    camera.imageFormat = CameraMono;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.exposure, 2000U);
    EXPECT_EQ(camera.imageCount, 1U) << "an unsigned difference would be huge";
}

TEST_F(ExposureSearch, OnColourFindsTheExposureOfTheBrightestColour) {
    camera.imageFormat = CameraBayer;
    camera.exposure = 100;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_NEAR(static_cast<double>(camera.exposure), 250.88 / samplesPerNanosecond, 20);
}

TEST_F(ExposureSearch, CutsItsRegionToTheImageForGood) {
    EXPECT_EQ(filter.CalculateExposure(2, 3, 100, 2, static_cast<ZCamera*>(&camera)), FilterDone);
    EXPECT_EQ(filter.GetX(), 2U);
    EXPECT_EQ(filter.GetY(), 3U);
    EXPECT_EQ(filter.GetWidth(), ScriptedCamera::Width);
    EXPECT_EQ(filter.GetHeight(), 2U);
}

TEST_F(ExposureSearch, KeptCutsItsRegionToTheImageBeforeThePipelineMakesItSmaller) {
    camera.imageFormat = CameraBayer;
    camera.exposure = 2007;
    camera.probe.onProcessOutput = [](ZInImageBufferStruct* in, ZOutImageBufferStruct* out) {
        out->width = in->width / 2;
        out->height = in->height / 2;
        out->imageFormat = RGB24;
        out->imageSize = out->width * out->height * 3;
        std::fill_n(out->data, out->imageSize, std::uint8_t{250});
    };
    camera.probe.result = FilterDone;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.imageCount, 1U);
    EXPECT_EQ(filter.GetWidth(), ScriptedCamera::Width);
    EXPECT_EQ(filter.GetHeight(), ScriptedCamera::Height);
}

TEST_F(ExposureSearch, LeavesTheFilterDormantAsItWas) {
    EXPECT_EQ(Search(), FilterDone);
    ZInImageBufferStruct in;
    in.camera = &camera;
    in.imageFormat = Raw8;
    EXPECT_EQ(filter.Process(&in, nullptr), FilterDeclined) << "dormant, or it would be refused";
}

TEST_F(ExposureSearch, HoldsACyclingWheelAtGreenAndMovesItsColoursByTheLastStepAlone) {
    camera.imageFormat = CameraRGBFilter;
    camera.doesCycle = true;
    camera.startColour = PatternBlue;
    camera.redExposure = 5000;
    camera.blueExposure = 60;
    camera.exposure = 1920;
    camera.bitDepth = 16;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_THAT(
        camera.TakeCalls(),
        ElementsAre("depth 8", "update", "start 1", "cycle 0", "update", "image", "exposure 2007",
                    "update", "depth 16", "red 5087", "blue 147", "start 3", "cycle 1", "update"));
}

TEST_F(ExposureSearch, LeavesAWheelThatStandsAlone) {
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_THAT(FindCalls("start"), ElementsAre());
    EXPECT_THAT(FindCalls("cycle"), ElementsAre());
}

TEST_F(ExposureSearch, HoldsAColourOfTheWheelAt0) {
    camera.doesCycle = true;
    camera.redExposure = 2;
    camera.exposure = 2040;
    camera.minExposure = 1000;
    samplesPerNanosecond = 1;
    camera.maxExposure = 2040;
    // Saturated from 2040 to the limit, where it stays: the last step, which counts alone, is 0.
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.exposure, 1000U);
    EXPECT_EQ(camera.redExposure, 2U);

    samplesPerNanosecond = 0.125;
    camera.minExposure = 1;
    camera.maxExposure = 10000;
    camera.exposure = 2032;  // 254: falls by 32 or so, and that is the last step
    camera.redExposure = 2;
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_EQ(camera.redExposure, 0U);
}

/// A wheel that cycles at 12 bits, in the dark, until something fails at a pass.
class FailingWheel : public ExposureSearch {
  protected:
    FailingWheel() {
        samplesPerNanosecond = 0;
        camera.imageFormat = CameraRGBFilter;
        camera.bitDepth = 12;
        camera.doesCycle = true;
        camera.startColour = PatternBlue;
        camera.redExposure = 77;
        (void)camera.GetBayerFilter()->SetOutputFormat(RGB48);
    }
    void ExpectAbandoned(std::uint32_t pass) {
        EXPECT_EQ(camera.imageCount, pass);
        EXPECT_EQ(camera.bitDepth, 8U);
        EXPECT_FALSE(camera.doesCycle);
        EXPECT_EQ(camera.startColour, PatternGreen);
        EXPECT_EQ(camera.redExposure, 77U);
        EXPECT_EQ(camera.exposure, std::uint64_t{1000} << 2 * (pass - 1));
        EXPECT_EQ(camera.GetBayerFilter()->GetOutputFormat(), RGB48) << "the format in force";
        ZInImageBufferStruct in;
        in.camera = &camera;
        EXPECT_EQ(filter.Process(&in, nullptr), FilterUnknownFormat) << "awake";
    }
};

class FailedExposureSearch : public FailingWheel,
                             public testing::WithParamInterface<std::uint32_t> {};

TEST_P(FailedExposureSearch, KeptLeavesTheCameraAt8BitsTheWheelAtGreenAndTheFilterAwake) {
    camera.failingImage = GetParam();
    camera.imageFailure = CameraUnknownFault;

    EXPECT_EQ(Search(), CameraUnknownFault);

    ExpectAbandoned(GetParam());
}

TEST_P(FailedExposureSearch, KeptLeavesTheSameBehindWhenThePipelineFails) {
    camera.probe.onProcess = [this](ZInImageBufferStruct*) {
        if (camera.imageCount == GetParam()) camera.probe.result = FilterNotInitialised;
    };

    EXPECT_EQ(Search(), FilterNotInitialised);

    ExpectAbandoned(GetParam());
}

TEST_P(FailedExposureSearch, KeptLeavesTheSameBehindWhenAnImageCannotBeMeasured) {
    camera.render = [this](ScriptedCamera& self) {
        return self.imageCount == GetParam() ? self.MakeFlatImage(Raw8, {1}, 8) : Render();
    };

    EXPECT_EQ(Search(), FilterUnknownFormat);

    ExpectAbandoned(GetParam());
}

INSTANTIATE_TEST_SUITE_P(AtEachPass, FailedExposureSearch, testing::Range(1U, 11U));

TEST_F(ExposureSearch, LetsTheBayerFilterMakeA8BitFormatAndPutsTheOneInForceBack) {
    camera.imageFormat = CameraBayer;
    camera.exposure = 2007;
    (void)camera.GetBayerFilter()->SetOutputFormat(RGB48);
    EXPECT_EQ(Search(), FilterDone);
    EXPECT_THAT(camera.probe.formats, ElementsAre(RGB24));
    EXPECT_EQ(camera.GetBayerFilter()->GetOutputFormat(), RGB48);
}

TEST_F(ExposureSearch, RefusesToGoWithoutACamera) {
    EXPECT_EQ(filter.CalculateExposure(0, 0, 10, 10, nullptr), FilterFailed);
}

}  // namespace
}  // namespace ZV::Testing
