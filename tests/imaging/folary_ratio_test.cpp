#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <tuple>
#include <vector>

#include "camera/bare_camera.h"
#include "imaging/folary_ratio_correction.h"
#include "imaging/horizontal_reduction.h"
#include "imaging/image_fixture.h"
#include "imaging/image_pipeline.h"
#include "models/folary.h"
#include "support/ratio_judge.h"

namespace ZV::Testing {
namespace {

using Test::JudgeReduction;
using Test::JudgeZoomFill;
using Test::JudgeZoomSpread;
using Samples = std::vector<std::uint32_t>;

constexpr std::uint8_t Untouched = 0xA5;
constexpr std::size_t GuardBytes = 48;

class RatioCamera : public ZV::Test::BareCamera<Folary> {
  public:
    std::uint32_t GetModel() override { return model; }
    std::uint32_t GetCCDWidth() override { return sensorWidth; }

    std::uint32_t model = zmodelFolary;
    std::uint32_t sensorWidth = 2560;
};

Bytes Spell(const Samples& samples, std::uint32_t sampleBytes) {
    Bytes bytes(samples.size() * sampleBytes);
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const auto word = static_cast<std::uint16_t>(samples[i]);
        bytes[i * sampleBytes] = static_cast<std::uint8_t>(samples[i]);
        if (sampleBytes == 2) std::memcpy(&bytes[2 * i], &word, 2);
    }
    return bytes;
}

Samples MakeRandom(std::size_t count, std::uint32_t sampleBytes, std::uint32_t seed) {
    std::mt19937 random(seed);
    Samples samples(count);
    for (std::uint32_t& sample : samples) {
        sample = static_cast<std::uint32_t>(random() & (sampleBytes == 1 ? 0xFF : 0xFFFF));
    }
    return samples;
}

/// What a reduced mosaic is before its rows between are computed, over an output of zeros: what is
/// not spread holds the rows as they were reduced, and zeros behind them.
Samples JudgeVideoSpread(const Samples& reduced, std::uint32_t width) {
    Samples spread = JudgeZoomSpread(reduced, width, 0);
    for (std::size_t i = 0; i < reduced.size(); ++i) {
        const std::size_t row = i / width % 4;
        if (row == 1 || row == 2) spread[i] = reduced[i];
    }
    return spread;
}

class FolaryRatio : public testing::Test {
  protected:
    void Give(const Samples& samples, std::uint32_t width, std::uint32_t height,
              std::uint32_t bitDepth = 8) {
        frame = Spell(samples, bitDepth == 8 ? 1 : 2);
        output.assign(2 * frame.size() + GuardBytes, Untouched);
        in = {};
        in.data = frame.data();
        in.imageSize = static_cast<std::uint32_t>(frame.size());
        in.width = width;
        in.height = height;
        in.bitDepth = bitDepth;
        in.colourPattern = PatternRGGB;
        in.imageFormat = bitDepth == 8 ? Bayer8 : Bayer16;
        in.symmetricalBinningMode = 1;
        in.camera = &camera;
        out = {};
        out.data = output.data();
    }
    FilterResult Process() { return filter.Process(&in, &out); }
    Bytes GetOutput() const {
        return {output.begin(), output.begin() + static_cast<std::ptrdiff_t>(out.imageSize)};
    }
    bool IsUntouched(std::size_t from = 0) const {
        return std::all_of(output.begin() + static_cast<std::ptrdiff_t>(from), output.end(),
                           [](std::uint8_t byte) { return byte == Untouched; });
    }

    RatioCamera camera;
    ZFolaryRatioCorrection filter{0};
    Bytes frame, output;
    ZInImageBufferStruct in;
    ZOutImageBufferStruct out;
};

// ---- What is declined ----

TEST_F(FolaryRatio, DeclinesEveryOtherModelEvenInRealTimeVideo) {
    Give(Samples(96, 1), 24, 4);
    camera.model = zmodelPellanA1;
    for (const bool isRTV : {false, true}) {
        in.isRTV = isRTV;
        for (const std::uint32_t binning : {0U, 1U, 2U}) {
            in.symmetricalBinningMode = binning;
            EXPECT_EQ(FilterDeclined, Process());
        }
    }
    in.camera = nullptr;
    EXPECT_EQ(FilterDeclined, Process());
    EXPECT_TRUE(IsUntouched());
}

TEST_F(FolaryRatio, DeclinesAFrameThatIsNeitherBinnedNorRealTimeVideo) {
    Give(Samples(96, 1), 24, 4);
    EXPECT_EQ(FilterDeclined, Process());
    EXPECT_TRUE(IsUntouched());
}

TEST_F(FolaryRatio, DeclinesRealTimeVideoOfASensorOfAnotherWidth) {
    Give(Samples(96, 1), 24, 4);
    in.isRTV = true;
    for (const std::uint32_t width : {0U, 1U, 2047U, 2559U, 4008U}) {
        camera.sensorWidth = width;
        EXPECT_EQ(FilterDeclined, Process());
    }
    EXPECT_TRUE(IsUntouched());
}

// ---- Across ----

class Reduction : public FolaryRatio,
                  public testing::WithParamInterface<std::tuple<std::uint32_t, std::uint32_t>> {};

TEST_P(Reduction, GivesTheTruncatedMeansOfEachColourForEveryWidth) {
    const auto [factor, bitDepth] = GetParam();
    const std::uint32_t sampleBytes = bitDepth == 8 ? 1 : 2;
    for (std::uint32_t width = 1; width <= 80; ++width) {
        for (const std::uint32_t height : {1U, 2U, 5U}) {
            const Samples samples =
                MakeRandom(std::size_t{width} * height, sampleBytes, width * 10 + height);
            Give(samples, width, height, bitDepth);
            in.symmetricalBinningMode = factor;
            const Bytes before = frame;

            ASSERT_EQ(FilterDone, Process());

            const Samples expected = JudgeReduction(samples, width, factor);
            ASSERT_EQ(expected.size() / height, out.width);
            ASSERT_EQ(height, out.height);
            ASSERT_EQ(expected.size() * sampleBytes, out.imageSize);
            ASSERT_EQ(in.imageFormat, out.imageFormat);
            ASSERT_EQ(Spell(expected, sampleBytes), GetOutput()) << width << " x " << height;
            ASSERT_TRUE(IsUntouched(out.imageSize)) << width << " x " << height;
            ASSERT_EQ(before, frame);
        }
    }
}

TEST_P(Reduction, HoldsForTheGreatestSamplesAndAtOddAddressesAndInPlace) {
    const auto [factor, bitDepth] = GetParam();
    const std::uint32_t sampleBytes = bitDepth == 8 ? 1 : 2;
    constexpr std::uint32_t Width = 100, Height = 3;
    for (const bool isRandom : {false, true}) {
        const Samples samples = isRandom ? MakeRandom(Width * Height, sampleBytes, factor)
                                         : Samples(Width * Height, sampleBytes == 1 ? 255 : 65535);
        Bytes bytes = Spell(samples, sampleBytes);
        bytes.insert(bytes.begin(), Untouched);

        ReduceRows(bytes.data() + 1, Width, Height, factor, sampleBytes, bytes.data() + 1);

        const Bytes expected = Spell(JudgeReduction(samples, Width, factor), sampleBytes);
        EXPECT_EQ(0, std::memcmp(expected.data(), bytes.data() + 1, expected.size()));
        EXPECT_EQ(Untouched, bytes[0]);
    }
}

INSTANTIATE_TEST_SUITE_P(Factors, Reduction,
                         testing::Combine(testing::Values(2U, 3U, 4U), testing::Values(8U, 16U)),
                         [](const auto& test) {
                             return "By" + std::to_string(std::get<0>(test.param)) + "Of" +
                                    std::to_string(std::get<1>(test.param)) + "Bits";
                         });

TEST_F(FolaryRatio, DropsTheSamplesOfARowThatFillNoGroup) {
    Give(Samples(2000, 9), 1000, 2);
    in.symmetricalBinningMode = 3;
    ASSERT_EQ(FilterDone, Process());
    EXPECT_EQ(332U, out.width);
    EXPECT_EQ(664U, out.imageSize);
}

TEST_F(FolaryRatio, DropsTheHalfOfAMean) {
    Give({1, 0, 2, 0}, 4, 1);
    in.symmetricalBinningMode = 2;
    ASSERT_EQ(FilterDone, Process());
    EXPECT_EQ((Bytes{1, 0}), GetOutput());
}

TEST_F(FolaryRatio, KeptEveryDepthButEightIsOfWords) {
    for (const std::uint32_t depth : {0U, 1U, 7U, 9U, 12U, 16U, 64U}) {
        Give(MakeRandom(32, 2, depth), 8, 4, 16);
        in.bitDepth = depth;
        in.symmetricalBinningMode = 2;
        ASSERT_EQ(FilterDone, Process());
        EXPECT_EQ(32U, out.imageSize) << depth;
    }
}

TEST_F(FolaryRatio, KeptTheImageFormatIsNotLookedAt) {
    for (const std::uint32_t format : {0U, 2U, 12U, 99U}) {
        Give(Samples(32, 3), 8, 4);
        in.imageFormat = format;
        in.symmetricalBinningMode = 2;
        EXPECT_EQ(FilterDone, Process());
        EXPECT_EQ(format, out.imageFormat);
    }
}

TEST_F(FolaryRatio, KeptABinningOf0SetsTheFormatAloneAndLeavesTheSizeAsItCame) {
    Give(Samples(32, 3), 8, 4);
    in.symmetricalBinningMode = 0;
    out.width = 11;
    out.height = 12;
    out.imageSize = 13;

    EXPECT_EQ(FilterDone, Process());

    EXPECT_EQ(std::uint32_t{Bayer8}, out.imageFormat);
    EXPECT_EQ(11U, out.width);
    EXPECT_EQ(12U, out.height);
    EXPECT_EQ(13U, out.imageSize);
    EXPECT_TRUE(IsUntouched());
}

TEST_F(FolaryRatio, KeptAFactorWithoutAReductionGivesTheSizeAndNoSamples) {
    for (const std::uint32_t factor : {5U, 7U, 8U, 65535U, 0x80000000U, 0xFFFFFFFFU}) {
        Give(Samples(800, 3), 200, 4);
        in.symmetricalBinningMode = factor;
        EXPECT_EQ(FilterDone, Process());
        EXPECT_EQ(factor < 100 ? (200 - 200 % (2 * factor)) / factor : 0, out.width);
        EXPECT_EQ(4U, out.height);
        EXPECT_EQ(out.width * 4, out.imageSize);
        EXPECT_TRUE(IsUntouched());
    }
}

TEST_F(FolaryRatio, AFrameNarrowerThanAGroupHasNoColumnsLeft) {
    Give(Samples(35, 3), 7, 5);
    in.symmetricalBinningMode = 4;
    EXPECT_EQ(FilterDone, Process());
    EXPECT_EQ(0U, out.width);
    EXPECT_EQ(5U, out.height);
    EXPECT_EQ(0U, out.imageSize);
    in.isRTV = true;
    EXPECT_EQ(FilterDone, Process());
    EXPECT_EQ(0U, out.width);
    EXPECT_EQ(10U, out.height);
    EXPECT_EQ(0U, out.imageSize);
    EXPECT_TRUE(IsUntouched());
}

// ---- Real-time video ----

struct Video {
    std::uint32_t sensorWidth;
    std::uint32_t factor;
};

class RealTimeVideo : public FolaryRatio,
                      public testing::WithParamInterface<std::tuple<Video, std::uint32_t>> {
  protected:
    /// Step by step as it is defined, over an output of zeros.
    static Bytes Expect(const Samples& samples, std::uint32_t width, std::uint32_t height,
                        std::uint32_t pattern) {
        const std::uint32_t factor = std::get<0>(GetParam()).factor;
        const std::uint32_t sampleBytes = std::get<1>(GetParam()) == 8 ? 1 : 2;
        const std::uint32_t reducedWidth = CalculateReducedWidth(width, factor);
        const std::uint32_t mosaic =
            pattern >= PatternRGGB && pattern <= PatternBGGR ? pattern : std::uint32_t{PatternRGGB};
        const Samples spread =
            JudgeVideoSpread(JudgeReduction(samples, width, factor), reducedWidth);
        return Spell(JudgeZoomFill(spread, reducedWidth, 2 * height, mosaic), sampleBytes);
    }
};

TEST_P(RealTimeVideo, IsReducedAcrossAndDoubledDownForEverySizeAndPattern) {
    const auto [video, bitDepth] = GetParam();
    const std::uint32_t sampleBytes = bitDepth == 8 ? 1 : 2;
    camera.sensorWidth = video.sensorWidth;
    for (std::uint32_t pattern = 0; pattern <= 9; ++pattern) {
        for (std::uint32_t width = 1; width <= 60; width += pattern == 5 ? 1 : 7) {
            for (std::uint32_t height = 1; height <= 9; ++height) {
                const Samples samples =
                    MakeRandom(std::size_t{width} * height, sampleBytes, width * 100 + height);
                Give(samples, width, height, bitDepth);
                in.isRTV = true;
                in.symmetricalBinningMode = width % 5;  // not looked at
                in.colourPattern = pattern;

                ASSERT_EQ(FilterDone, Process());

                ASSERT_EQ(CalculateReducedWidth(width, video.factor), out.width);
                ASSERT_EQ(2 * height, out.height);
                ASSERT_EQ(out.width * out.height * sampleBytes, out.imageSize);
                ASSERT_EQ(in.imageFormat, out.imageFormat);
                ASSERT_EQ(Expect(samples, width, height, pattern), GetOutput())
                    << width << " x " << height << ", pattern " << pattern;
                ASSERT_TRUE(IsUntouched(out.imageSize)) << width << " x " << height;
            }
        }
    }
}

TEST_P(RealTimeVideo, KeptEveryPatternThatIsNoMosaicsIsCorrectedAsRGGB) {
    const auto [video, bitDepth] = GetParam();
    camera.sensorWidth = video.sensorWidth;
    const Samples samples = MakeRandom(std::size_t{60} * 8, bitDepth == 8 ? 1 : 2, 6);
    const auto correct = [&, depth = bitDepth](std::uint32_t pattern) {
        Give(samples, 60, 8, depth);
        in.isRTV = true;
        in.colourPattern = pattern;
        EXPECT_EQ(FilterDone, Process());
        return GetOutput();
    };
    const Bytes expected = correct(PatternRGGB);
    for (const std::uint32_t pattern : {0U, 1U, 2U, 3U, 4U, 9U, 0x10006U, 0xFFFFFFFFU}) {
        EXPECT_EQ(expected, correct(pattern)) << pattern;
    }
    EXPECT_NE(expected, correct(PatternGRBG));
    EXPECT_NE(expected, correct(PatternGBRG));
}

TEST_P(RealTimeVideo, MayBeCorrectedInPlace) {
    const auto [video, bitDepth] = GetParam();
    camera.sensorWidth = video.sensorWidth;
    for (const std::uint32_t height : {2U, 5U, 6U}) {
        const Samples samples = MakeRandom(std::size_t{50} * height, bitDepth == 8 ? 1 : 2, 3);
        Give(samples, 50, height, bitDepth);
        in.isRTV = true;
        out.data = frame.data();
        out.dataCapacity = frame.size();

        ASSERT_EQ(FilterDone, Process());

        const Bytes expected = Expect(samples, 50, height, in.colourPattern);
        EXPECT_EQ(expected,
                  Bytes(frame.begin(), frame.begin() + static_cast<std::ptrdiff_t>(out.imageSize)));
    }
}

INSTANTIATE_TEST_SUITE_P(Sensors, RealTimeVideo,
                         testing::Combine(testing::Values(Video{2048, 3}, Video{2560, 4}),
                                          testing::Values(8U, 12U)),
                         [](const auto& test) {
                             return "Of" + std::to_string(std::get<0>(test.param).sensorWidth) +
                                    "In" + std::to_string(std::get<1>(test.param)) + "Bits";
                         });

TEST_F(FolaryRatio, RealTimeVideoOfWordsHasTheSizeOfBothFieldsInWords) {
    camera.sensorWidth = 2048;
    Give(Samples(600, 3), 60, 10, 16);
    in.isRTV = true;
    ASSERT_EQ(FilterDone, Process());
    EXPECT_EQ(20U, out.width);
    EXPECT_EQ(2U * 2 * 10 * 20, out.imageSize);
}

TEST_F(FolaryRatio, RowsOfASmallFrameThatAreNotComputedHoldTheStepBeforeOrNothing) {
    Give(MakeRandom(16 * 2, 1, 1), 16, 2);
    in.isRTV = true;
    ASSERT_EQ(FilterDone, Process());
    ASSERT_EQ(4U, out.width);
    const Bytes zoomed = GetOutput();
    EXPECT_EQ(Bytes(zoomed.begin() + 12, zoomed.end()),
              Bytes(zoomed.begin() + 4, zoomed.begin() + 8))
        << "the second row, where it stood and where it belongs";
    EXPECT_EQ(Bytes(4), Bytes(zoomed.begin() + 8, zoomed.begin() + 12));
}

class TallOrWideVideo : public FolaryRatio {
  protected:
    static constexpr std::uint32_t Factor = 4;  // of the fixture's camera

    /// Corrects random samples. Only a frame of `fillWidth` x `fillHeight` is computed, from the
    /// first sample on.
    void ExpectFilledAs(std::uint32_t width, std::uint32_t height, std::uint32_t bitDepth,
                        std::uint32_t fillWidth, std::uint32_t fillHeight) {
        const std::uint32_t sampleBytes = bitDepth == 8 ? 1 : 2;
        const Samples samples = MakeRandom(std::size_t{width} * height, sampleBytes, bitDepth);
        Give(samples, width, height, bitDepth);
        in.isRTV = true;

        ASSERT_EQ(FilterDone, Process());

        const std::uint32_t reducedWidth = width / Factor;
        ASSERT_EQ(reducedWidth, out.width);
        ASSERT_EQ(2 * height, out.height);
        Samples expected = JudgeVideoSpread(JudgeReduction(samples, width, Factor), reducedWidth);
        const auto filledEnd = expected.begin() + fillWidth * fillHeight;
        const Samples filled =
            JudgeZoomFill(Samples(expected.begin(), filledEnd), fillWidth, fillHeight, PatternRGGB);
        std::copy(filled.begin(), filled.end(), expected.begin());
        EXPECT_TRUE(Spell(expected, sampleBytes) == GetOutput());
        EXPECT_TRUE(IsUntouched(out.imageSize));
    }
};

TEST_F(TallOrWideVideo, KeptTheHeightTravelsAs16BitsAndTheRowsBehindItAreNotComputed) {
    ExpectFilledAs(40, 32772, 8, 10, 8);  // twice the height is 65536 + 8
    ExpectFilledAs(40, 32772, 12, 10, 8);
    EXPECT_EQ(65544U, out.height);
}

TEST_F(TallOrWideVideo, KeptTheWidthTravelsAs16BitsAndTheSamplesAreFilledAsRowsOfTheRest) {
    ExpectFilledAs(4 * (65536 + 6), 4, 8, 6, 8);
    ExpectFilledAs(4 * (65536 + 6), 4, 12, 6, 8);
    EXPECT_EQ(65542U, out.width);
}

// ---- Bad input ----

TEST_F(FolaryRatio, AFrameWithFewerBytesThanItsSizeAsksForIsNotRead) {
    struct Lie {
        std::uint32_t width, height, bitDepth;
    };
    for (const Lie& lie : {Lie{8, 5, 8}, Lie{8, 4, 16}, Lie{0xFFFFFFFF, 0xFFFFFFFF, 16},
                           Lie{0xFFFFFFFF, 1, 8}, Lie{1, 0xFFFFFFFF, 8}}) {
        for (const bool isRTV : {false, true}) {
            Give(Samples(32, 3), 8, 4);
            in.width = lie.width;
            in.height = lie.height;
            in.bitDepth = lie.bitDepth;
            in.symmetricalBinningMode = 2;
            in.isRTV = isRTV;
            EXPECT_EQ(FilterFailed, Process());
            EXPECT_TRUE(IsUntouched());
        }
    }
    Give(Samples(32, 3), 8, 4);
    in.data = nullptr;
    in.symmetricalBinningMode = 2;
    EXPECT_EQ(FilterFailed, Process());
}

TEST_F(FolaryRatio, AnOutputThatDoesNotHoldTheResultIsNotWritten) {
    Give(Samples(160, 3), 16, 10);
    in.symmetricalBinningMode = 2;
    out.dataCapacity = 79;
    EXPECT_EQ(FilterFailed, Process());
    in.isRTV = true;
    EXPECT_EQ(FilterFailed, Process());
    EXPECT_TRUE(IsUntouched());
    out.dataCapacity = 80;
    EXPECT_EQ(FilterDone, Process());
    EXPECT_TRUE(IsUntouched(80));
}

TEST_F(FolaryRatio, IsMeasuredAsItWillBeMadeWithoutAByteWritten) {
    Give(MakeRandom(48 * 8, 1, 5), 48, 8);
    for (const bool isRTV : {false, true}) {
        for (const std::uint32_t binning : {0U, 1U, 2U, 3U, 4U, 5U, 49U, 0xFFFFFFFFU}) {
            for (const std::uint32_t size : {48U * 8, 48U * 8 - 1}) {
                in.isRTV = isRTV;
                in.symmetricalBinningMode = binning;
                in.imageSize = size;
                out.imageSize = 7;
                out.width = 9;
                out.height = 11;
                const Bytes before = output;

                const RatioOutcome outcome = filter.Measure(in, out);

                EXPECT_EQ(before, output);
                EXPECT_EQ(outcome.result, Process()) << binning << (isRTV ? ", video" : "");
                if (outcome.result != FilterDone) continue;
                EXPECT_EQ(outcome.bytes, out.imageSize);
                EXPECT_EQ(outcome.width, out.width);
                EXPECT_EQ(outcome.height, out.height);
            }
        }
    }
}

TEST_F(FolaryRatio, AFrameWithoutPixelsIsCorrectedToNothing) {
    Give({}, 0, 0);
    in.data = nullptr;
    for (const bool isRTV : {false, true}) {
        in.isRTV = isRTV;
        in.symmetricalBinningMode = 2;
        EXPECT_EQ(FilterDone, Process());
        EXPECT_EQ(0U, out.imageSize);
    }
}

// ---- In a pipeline ----

TEST_F(FolaryRatio, ShrinksTheImageOfItsPipeline) {
    ZImagePipeline pipeline;
    pipeline.Setup(40, 10);
    pipeline.AddFilter(&filter);
    const Samples samples = MakeRandom(400, 1, 4);
    ZExImage image = MakeImage(Spell(samples, 1), {.width = 40,
                                                   .height = 10,
                                                   .format = Bayer8,
                                                   .binning = 3,
                                                   .camera = static_cast<ZCamera*>(&camera)});
    bool isComplete = false;

    ASSERT_EQ(FilterDone, pipeline.ProcessImage(&image, &isComplete));

    EXPECT_TRUE(isComplete);
    EXPECT_EQ(12U, image.GetWidth());
    EXPECT_EQ(10U, image.GetHeight());
    EXPECT_EQ(std::uint32_t{Bayer8}, image.GetImageFormat());
    EXPECT_EQ(Spell(JudgeReduction(samples, 40, 3), 1), GetPixels(image));
}

}  // namespace
}  // namespace ZV::Testing
