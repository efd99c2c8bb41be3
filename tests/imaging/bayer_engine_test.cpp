#include "imaging/bayer_engine.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <string>
#include <vector>

#include "imaging/bayer_road.h"
#include "imaging/kernels/kernel_judge.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/pixel_buffer.h"

namespace ZV::Testing {
namespace {

constexpr std::uint8_t Untouched = 0xA5;
constexpr std::size_t GuardBytes = 64;

constexpr const char* Forms[] = {"plain", "sse2", "ssse3", "avx2", "avx512"};
constexpr std::uint32_t ByteFormats[] = {RGBPlane8, BGR24, XRGB32, BGRX32, RGB24, RGBX32};
constexpr std::uint32_t WordFormats[] = {RGBPlane16, RGB48};
constexpr KernelInterpolation Interpolations[] = {InterpolateNearest, InterpolateLinear,
                                                  InterpolateCubic};

constexpr PlaneKernels JudgeOfBytes{Judge::ShiftRightPlane8, Judge::AddPlane8, Judge::EnlargePlane8,
                                    Judge::PackPlanes8x3, Judge::PackPlanes8x4};
constexpr PlaneKernels JudgeOfWords{Judge::ShiftRightPlane16, Judge::AddPlane16,
                                    Judge::EnlargePlane16, Judge::PackPlanes16x3, nullptr};

constexpr PlaneKernels KernelsOfBytes{ShiftRightPlane8, AddPlane8, EnlargePlane8, PackPlanes8x3,
                                      PackPlanes8x4};
constexpr PlaneKernels KernelsOfWords{ShiftRightPlane16, AddPlane16, EnlargePlane16, PackPlanes16x3,
                                      nullptr};

struct Size {
    std::uint32_t width, height;
};

std::vector<Size> ListSizes() {
    std::vector<Size> sizes;
    for (std::uint32_t side = 2; side <= 41; ++side) {
        sizes.push_back({side, 10});
        sizes.push_back({10, side});
        sizes.push_back({side, 43 - side});
        sizes.push_back({side, side});
    }
    sizes.insert(sizes.end(), {{1030, 6}, {2051, 9}, {4, 301}, {130, 67}});
    return sizes;
}

std::vector<std::uint8_t> MakeSamples(std::size_t bytes, std::uint32_t seed) {
    std::mt19937 random(seed);
    std::vector<std::uint8_t> samples(bytes);
    // Extremes side by side take the cubic form out of the samples' range.
    for (std::uint8_t& sample : samples) {
        const auto word = static_cast<std::uint32_t>(random());
        sample = word % 4 == 0 ? 255 : word % 4 == 1 ? 0 : static_cast<std::uint8_t>(word >> 8);
    }
    return samples;
}

/// An image with guard bytes on both sides.
struct GuardedImage {
    explicit GuardedImage(std::size_t imageBytes)
        : bytes(imageBytes), memory(imageBytes + 2 * GuardBytes, Untouched) {}

    std::uint8_t* GetData() { return memory.data() + GuardBytes; }
    bool IsGuardIntact() const {
        const auto isUntouched = [](std::uint8_t value) { return value == Untouched; };
        return std::all_of(memory.begin(), memory.begin() + GuardBytes, isUntouched) &&
               std::all_of(memory.end() - GuardBytes, memory.end(), isUntouched);
    }
    std::vector<std::uint8_t> GetImage() const {
        return {memory.begin() + GuardBytes, memory.end() - GuardBytes};
    }

    std::size_t bytes;
    std::vector<std::uint8_t> memory;
};

/// One form of the kernels for the life of the object.
class ForcedKernels {
  public:
    explicit ForcedKernels(const char* form) : isThere(ForceKernels(form)) {}
    ~ForcedKernels() { (void)ForceKernels(""); }
    ForcedKernels(const ForcedKernels&) = delete;
    ForcedKernels& operator=(const ForcedKernels&) = delete;

    const bool isThere;
};

FilterResult RunEngine(BayerEngine& engine, std::size_t sampleBytes, const BayerMosaic& mosaic,
                       KernelInterpolation interpolation, const BayerTarget& target,
                       std::uint32_t* bytes) {
    return sampleBytes == 1 ? engine.Run8(mosaic, interpolation, target, bytes)
                            : engine.Run16(mosaic, interpolation, target, bytes);
}

class BayerEngineInEveryForm : public testing::TestWithParam<const char*> {
  protected:
    BayerEngineInEveryForm() : forced(GetParam()) {}

    void SetUp() override {
        if (!forced.isThere) GTEST_SKIP() << "not of this processor";
    }

    void ExpectAsByTheRoad(const BayerMosaic& mosaic, std::size_t sampleBytes,
                           KernelInterpolation interpolation, std::uint32_t format) {
        const BayerRoad road(sampleBytes == 1 ? JudgeOfBytes : JudgeOfWords, sampleBytes);
        const auto expected = road.Run(mosaic, interpolation, format);
        const BayerRoad ownRoad(sampleBytes == 1 ? KernelsOfBytes : KernelsOfWords, sampleBytes);
        ASSERT_TRUE(expected == ownRoad.Run(mosaic, interpolation, format));
        GuardedImage image(expected.size());
        std::uint32_t bytes = 0;
        const FilterResult result = RunEngine(engine, sampleBytes, mosaic, interpolation,
                                              {image.GetData(), expected.size(), format}, &bytes);
        const std::string what =
            std::to_string(mosaic.width) + " x " + std::to_string(mosaic.height) + ", pattern " +
            std::to_string(mosaic.colourPattern) + ", format " + std::to_string(format) +
            ", interpolation " + std::to_string(interpolation);
        ASSERT_EQ(result, FilterDone) << what;
        ASSERT_EQ(bytes, expected.size()) << what;
        ASSERT_TRUE(image.IsGuardIntact()) << what;
        const auto made = image.GetImage();
        const auto difference = std::mismatch(expected.begin(), expected.end(), made.begin());
        ASSERT_EQ(difference.first, expected.end())
            << what << ", byte " << difference.first - expected.begin() << " is "
            << int{*difference.second} << " for " << int{*difference.first};
    }

    ForcedKernels forced;
    BayerEngine engine;
};

TEST_P(BayerEngineInEveryForm, MakesTheSamplesOfTheKernelsOverWholePlanes) {
    // Sizes of a family take turns with the patterns and the formats of both depths.
    std::uint32_t turn = 0;
    for (const Size& size : ListSizes()) {
        const std::size_t samples = std::size_t{size.width} * size.height;
        const std::uint32_t pattern = 5 + turn / 6 % 4;
        for (const std::size_t sampleBytes : {1, 2}) {
            // One byte off, so that nothing is aligned by luck.
            const auto memory = MakeSamples(samples * sampleBytes + 1, turn);
            const BayerMosaic mosaic{memory.data() + 1, samples * sampleBytes, size.width,
                                     size.height, pattern};
            const std::uint32_t format =
                sampleBytes == 1 ? ByteFormats[turn % 6] : WordFormats[turn % 2];
            for (const KernelInterpolation interpolation : Interpolations) {
                ASSERT_NO_FATAL_FAILURE(
                    ExpectAsByTheRoad(mosaic, sampleBytes, interpolation, format));
            }
        }
        ++turn;
    }
}

TEST_P(BayerEngineInEveryForm, TakesEveryPatternIntoEveryFormat) {
    for (const Size& size : {Size{38, 22}, Size{39, 23}, Size{5, 4}, Size{2, 2}, Size{1031, 8}}) {
        const std::size_t samples = std::size_t{size.width} * size.height;
        const auto memory = MakeSamples(samples * 2, size.width);
        for (const std::uint32_t pattern : {5, 6, 7, 8, 0, 3, 4, 9, 1000}) {
            for (const KernelInterpolation interpolation : Interpolations) {
                const BayerMosaic bytes{memory.data(), samples, size.width, size.height, pattern};
                for (const std::uint32_t format : ByteFormats) {
                    ASSERT_NO_FATAL_FAILURE(ExpectAsByTheRoad(bytes, 1, interpolation, format));
                }
                BayerMosaic words = bytes;
                words.bytes = samples * 2;
                for (const std::uint32_t format : WordFormats) {
                    ASSERT_NO_FATAL_FAILURE(ExpectAsByTheRoad(words, 2, interpolation, format));
                }
            }
        }
    }
}

TEST_P(BayerEngineInEveryForm, CountsSamplesThatAreNotThereAsZero) {
    const auto memory = MakeSamples(30 * 20 * 2, 3);
    for (const std::uint64_t bytes : {0, 1, 29, 30, 31, 300, 599, 600}) {
        // The rest lies beyond the end of a block, where a checker sees a read.
        const std::vector<std::uint8_t> held(memory.begin(),
                                             memory.begin() + static_cast<std::ptrdiff_t>(bytes));
        const BayerMosaic mosaic{held.empty() ? memory.data() : held.data(), bytes, 30, 20, 5};
        for (const KernelInterpolation interpolation : Interpolations) {
            ASSERT_NO_FATAL_FAILURE(ExpectAsByTheRoad(mosaic, 1, interpolation, RGB24));
            ASSERT_NO_FATAL_FAILURE(ExpectAsByTheRoad(mosaic, 2, interpolation, RGB48));
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Forms, BayerEngineInEveryForm, testing::ValuesIn(Forms),
                         [](const auto& form) { return std::string(form.param); });

TEST(BayerEngine, HalvesEachGreenBeforeItAddsThem) {
    const std::uint8_t mosaic[] = {10, 255, 255, 20};
    std::uint8_t image[12];
    std::uint32_t bytes = 0;
    BayerEngine engine;

    EXPECT_EQ(engine.Run8({mosaic, 4, 2, 2, 5}, InterpolateLinear, {image, 12, RGB24}, &bytes),
              FilterDone);

    EXPECT_EQ(image[0], 10);
    EXPECT_EQ(image[1], 254) << "127 and 127";
    EXPECT_EQ(image[2], 20);
}

TEST(BayerEngine, RepeatsTheNeighbourInTheLastColumnAndRowOfAnOddSize) {
    const std::uint8_t mosaic[] = {10, 20, 99, 40, 50, 98, 97, 96, 95};
    std::uint8_t image[27];
    std::uint32_t bytes = 0;
    BayerEngine engine;

    EXPECT_EQ(engine.Run8({mosaic, 9, 3, 3, 5}, InterpolateCubic, {image, 27, RGB24}, &bytes),
              FilterDone);

    EXPECT_EQ(bytes, 27U);
    for (std::size_t pixel = 0; pixel < 9; ++pixel) {
        EXPECT_EQ(image[3 * pixel], 10);
        EXPECT_EQ(image[3 * pixel + 1], 30);
        EXPECT_EQ(image[3 * pixel + 2], 50);
    }
}

TEST(BayerEngine, MakesABlackImageOfASingleRowOrColumn) {
    const auto memory = MakeSamples(3000, 1);
    BayerEngine engine;
    for (const Size& size : {Size{1, 1}, Size{1, 9}, Size{1500, 1}, Size{3, 1}}) {
        const std::size_t pixels = std::size_t{size.width} * size.height;
        GuardedImage image(4 * pixels);
        std::uint32_t bytes = 0;
        EXPECT_EQ(engine.Run8({memory.data(), pixels, size.width, size.height, 5},
                              InterpolateLinear, {image.GetData(), 4 * pixels, XRGB32}, &bytes),
                  FilterDone);
        EXPECT_EQ(bytes, 4 * pixels);
        EXPECT_TRUE(image.IsGuardIntact());
        const auto made = image.GetImage();
        for (std::size_t i = 0; i < made.size(); ++i) ASSERT_EQ(made[i], i % 4 == 0 ? 255 : 0);
    }
}

TEST(BayerEngine, NeedsNoScratchOfTheFramesWidthForABlackImage) {
    constexpr std::uint32_t Width = 20'000'000;  // Whose rows would ask for more than a gigabyte.
    PixelBuffer image;
    ASSERT_TRUE(image.Allocate(std::uint64_t{3} * Width));
    const std::uint8_t sample = 77;
    std::uint32_t bytes = 0;
    BayerEngine engine;

    EXPECT_EQ(engine.Run8({&sample, 1, Width, 1, 5}, InterpolateCubic,
                          {image.GetData(), image.GetBytes(), RGB24}, &bytes),
              FilterDone);

    EXPECT_EQ(bytes, 3 * Width);
}

TEST(BayerEngine, ReadsNothingOfAMosaicOfNoBytesInsideItsImage) {
    std::vector<std::uint8_t> image(3 * 8 * 6, Untouched);
    std::uint32_t bytes = 0;
    BayerEngine engine;

    EXPECT_EQ(engine.Run8({image.data() + 5, 0, 8, 6, 5}, InterpolateLinear,
                          {image.data(), image.size(), RGB24}, &bytes),
              FilterDone);

    EXPECT_EQ(bytes, image.size());
    EXPECT_EQ(image, std::vector<std::uint8_t>(image.size()));
}

TEST(BayerEngine, MeasuresTheImageThatItMakesAndNothingForOneThatItRefuses) {
    EXPECT_EQ(BayerEngine::MeasureImage(31, 23, RGBPlane8, 1), 3U * 31 * 23);
    EXPECT_EQ(BayerEngine::MeasureImage(31, 23, BGRX32, 1), 4U * 31 * 23);
    EXPECT_EQ(BayerEngine::MeasureImage(31, 23, RGB48, 2), 6U * 31 * 23);
    EXPECT_EQ(BayerEngine::MeasureImage(0, 23, RGB24, 1), 0U);
    EXPECT_EQ(BayerEngine::MeasureImage(31, 23, RGB48, 1), 0U) << "of the other engine";
    EXPECT_EQ(BayerEngine::MeasureImage(31, 23, Mono8, 1), 0U);
    EXPECT_EQ(BayerEngine::MeasureImage(0x55555555, 1, RGB24, 1), 0xFFFFFFFFU);
    EXPECT_EQ(BayerEngine::MeasureImage(0x55555556, 1, RGB24, 1), 0U) << "above 32 bits";
    EXPECT_EQ(BayerEngine::MeasureImage(0xFFFFFFFF, 0xFFFFFFFF, RGBX32, 1), 0U);
}

TEST(BayerEngine, MakesAnEmptyImageOfAnEmptyMosaic) {
    BayerEngine engine;
    for (const Size& size : {Size{0, 0}, Size{0, 7}, Size{7, 0}, Size{0xFFFFFFFF, 0}}) {
        std::uint32_t bytes = 99;
        EXPECT_EQ(engine.Run8({nullptr, 0, size.width, size.height, 5}, InterpolateLinear,
                              {nullptr, 0, RGB24}, &bytes),
                  FilterDone);
        EXPECT_EQ(bytes, 0U);
    }
}

TEST(BayerEngine, RefusesWhatItCannotReadOrWriteAndLeavesTheImageAlone) {
    const auto memory = MakeSamples(64, 1);
    const BayerMosaic mosaic{memory.data(), 64, 8, 8, 5};
    GuardedImage image(192);
    std::uint32_t bytes = 99;
    BayerEngine engine;
    const BayerTarget target{image.GetData(), 192, RGB24};

    const auto run = [&](const BayerMosaic& from, const BayerTarget& to) {
        return engine.Run8(from, InterpolateLinear, to, &bytes);
    };
    EXPECT_EQ(run({nullptr, 64, 8, 8, 5}, target), FilterFailed);
    EXPECT_EQ(run(mosaic, {nullptr, 192, RGB24}), FilterFailed);
    EXPECT_EQ(run(mosaic, {image.GetData(), 191, RGB24}), FilterFailed);
    EXPECT_EQ(run({memory.data(), 64, 0xFFFFFFFF, 0xFFFFFFFF, 5}, target), FilterFailed);
    EXPECT_EQ(run({memory.data(), 64, 65536, 65536, 5}, target), FilterFailed);
    EXPECT_EQ(run({memory.data(), 64, 65535, 65535, 5}, {image.GetData(), 0, RGB24}), FilterFailed)
        << "above 32 bits";
    EXPECT_EQ(engine.Run8(mosaic, InterpolateLinear, target, nullptr), FilterFailed);
    for (const std::uint32_t format : {0U, 5U, 7U, 10U, 14U, 0xFFFFFFFFU}) {
        EXPECT_EQ(run(mosaic, {image.GetData(), 192, format}), FilterUnusableFormat);
    }
    for (const std::uint32_t format : {0U, 6U, 8U, 9U, 11U, 12U, 13U}) {
        EXPECT_EQ(engine.Run16(mosaic, InterpolateLinear, {image.GetData(), 192, format}, &bytes),
                  FilterUnusableFormat);
    }

    EXPECT_EQ(bytes, 99U);
    EXPECT_EQ(image.GetImage(), std::vector<std::uint8_t>(192, Untouched));
}

TEST(BayerEngine, TakesFramesOf65535SamplesAndMoreInADirection) {
    BayerEngine engine;
    for (const Size& size : {Size{65535, 3}, Size{65536, 2}, Size{70000, 4}, Size{2, 65535},
                             Size{3, 65536}, Size{4, 131071}}) {
        const std::size_t samples = std::size_t{size.width} * size.height;
        const auto memory = MakeSamples(samples, size.width);
        const BayerMosaic mosaic{memory.data(), samples, size.width, size.height, 6};
        const auto expected = BayerRoad(JudgeOfBytes, 1).Run(mosaic, InterpolateLinear, RGB24);
        std::vector<std::uint8_t> image(expected.size());
        std::uint32_t bytes = 0;
        EXPECT_EQ(
            engine.Run8(mosaic, InterpolateLinear, {image.data(), image.size(), RGB24}, &bytes),
            FilterDone);
        EXPECT_TRUE(image == expected) << size.width << " x " << size.height;
    }
}

TEST(BayerEngine, MayWriteItsImageOverTheMosaic) {
    const std::size_t samples = 31 * 24;
    const auto memory = MakeSamples(samples, 9);
    const BayerMosaic mosaic{memory.data(), samples, 31, 24, 7};
    BayerEngine engine;
    for (const KernelInterpolation interpolation : Interpolations) {
        const auto expected = BayerRoad(JudgeOfBytes, 1).Run(mosaic, interpolation, BGR24);
        for (const std::size_t offset : {std::size_t{0}, std::size_t{5}, expected.size() - 10}) {
            std::vector<std::uint8_t> both(expected.size() + samples);
            std::copy(memory.begin(), memory.end(),
                      both.begin() + static_cast<std::ptrdiff_t>(offset));
            BayerMosaic within = mosaic;
            within.data = both.data() + offset;
            std::uint32_t bytes = 0;
            EXPECT_EQ(engine.Run8(within, interpolation, {both.data(), both.size(), BGR24}, &bytes),
                      FilterDone);
            both.resize(expected.size());
            EXPECT_EQ(both, expected);
        }
    }
}

TEST(BayerEngine, TakesACodeThatTheKernelsRefuseAsLinear) {
    const auto memory = MakeSamples(20 * 20, 2);
    const BayerMosaic mosaic{memory.data(), 400, 20, 20, 5};
    const auto expected = BayerRoad(JudgeOfBytes, 1).Run(mosaic, InterpolateLinear, RGB24);
    BayerEngine engine;
    for (const int code : {0, 3, 5, 16, 77, -1}) {
        std::vector<std::uint8_t> image(expected.size());
        std::uint32_t bytes = 0;
        EXPECT_EQ(engine.Run8(mosaic, static_cast<KernelInterpolation>(code),
                              {image.data(), image.size(), RGB24}, &bytes),
                  FilterDone);
        EXPECT_EQ(image, expected) << code;
    }
}

}  // namespace
}  // namespace ZV::Testing
