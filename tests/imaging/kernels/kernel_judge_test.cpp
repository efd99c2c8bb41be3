// The judge itself, by cases worked out by hand.

#include "imaging/kernels/kernel_judge.h"

#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <limits>
#include <vector>

namespace ZV::Testing {
namespace {

using Bytes = std::vector<std::uint8_t>;
using Words = std::vector<std::uint16_t>;

/// Enlarges rows that are all alike and gives the first row of the result.
Bytes EnlargeRow(const Bytes& row, std::int32_t rowCount, double factor,
                 std::int32_t interpolation) {
    const auto width = static_cast<std::int32_t>(row.size());
    Bytes source;
    for (std::int32_t y = 0; y < rowCount; ++y) source.insert(source.end(), row.begin(), row.end());
    Bytes output(64, 99);
    EXPECT_EQ(Judge::EnlargePlane8(source.data(), {width, rowCount}, width, {0, 0, width, rowCount},
                                   output.data(), 64, {64, 1}, factor, factor, interpolation),
              KernelOk);
    while (!output.empty() && output.back() == 99) output.pop_back();
    return output;
}

TEST(KernelJudge, PacksSamplesSideBySide) {
    const Bytes red{1, 2, 0, 3, 4, 0};
    const Bytes green{11, 12, 0, 13, 14, 0};
    const Bytes blue{21, 22, 0, 23, 24, 0};
    const void* const planes[] = {red.data(), green.data(), blue.data(), red.data()};
    Bytes three(12);
    Bytes four(16);

    EXPECT_EQ(Judge::PackPlanes8x3(planes, 3, three.data(), 6, {2, 2}), KernelOk);
    EXPECT_EQ(Judge::PackPlanes8x4(planes, 3, four.data(), 8, {2, 2}), KernelOk);

    EXPECT_EQ(three, (Bytes{1, 11, 21, 2, 12, 22, 3, 13, 23, 4, 14, 24}));
    EXPECT_EQ(four, (Bytes{1, 11, 21, 1, 2, 12, 22, 2, 3, 13, 23, 3, 4, 14, 24, 4}));
}

TEST(KernelJudge, AddsUpToTheTopAndShiftsAsUnsigned) {
    Bytes bytes{100, 0, 55, 255};
    const Bytes addend{200, 0, 200, 255};
    Words words{65535, 40000, 1, 0x8001};

    EXPECT_EQ(Judge::AddPlane8(addend.data(), 4, bytes.data(), 4, {4, 1}, 0), KernelOk);
    EXPECT_EQ(Judge::ShiftRightPlane16(1, words.data(), 8, {4, 1}), KernelOk);

    EXPECT_EQ(bytes, (Bytes{255, 0, 255, 255}));
    EXPECT_EQ(words, (Words{32767, 20000, 0, 0x4000}));
    EXPECT_EQ(Judge::ShiftRightPlane16(1000, words.data(), 8, {4, 1}), KernelOk);
    EXPECT_EQ(words, (Words{0, 0, 0, 0}));
}

TEST(KernelJudge, LooksUpWithinTheLevelsAlone) {
    Bytes samples{9, 10, 19, 20, 29, 30, 255};
    const std::int32_t levels[] = {10, 20, 30};
    const std::int32_t values[] = {-7, 300, 77};

    EXPECT_EQ(Judge::LookupInPlace8x1(samples.data(), 7, {7, 1}, values, levels, 3), KernelOk);

    EXPECT_EQ(samples, (Bytes{9, 0, 0, 255, 255, 30, 255}));
}

TEST(KernelJudge, RepeatsAndSkipsSamplesByTheNearestPosition) {
    EXPECT_EQ(EnlargeRow({1, 2, 3}, 1, 2.0, 1), (Bytes{1, 1, 2, 2, 3, 3}));
    // Positions 1/3, 1, 5/3, 7/3, 3 and 11/3.
    EXPECT_EQ(EnlargeRow({1, 2, 3, 4}, 1, 1.5, 1), (Bytes{1, 2, 2, 3, 4, 4}));
    EXPECT_EQ(EnlargeRow({1, 2, 3, 4, 5}, 1, 0.5, 1), (Bytes{2, 4}));
}

TEST(KernelJudge, InterpolatesLinearlyFromTheFirstSampleToTheLast) {
    // 14-bit weights 0, 5461, 10922 and 16384 give 640, 853, 1067 and 1280 in 64ths.
    EXPECT_EQ(EnlargeRow({10, 20}, 2, 2.0, 2), (Bytes{10, 13, 17, 20}));
    // Kept: in an image of one row linear means nearest.
    EXPECT_EQ(EnlargeRow({10, 20}, 1, 2.0, 2), (Bytes{10, 10, 20, 20}));
}

TEST(KernelJudge, InterpolatesDeepSamplesLinearly) {
    const Words source{1000, 2000, 1000, 2000};
    Words output(4);

    EXPECT_EQ(Judge::EnlargePlane16(source.data(), {2, 2}, 4, {0, 0, 2, 2}, output.data(), 8,
                                    {4, 1}, 2.0, 2.0, 2),
              KernelOk);

    EXPECT_EQ(output, (Words{1000, 1333, 1667, 2000}));
}

TEST(KernelJudge, DrawsACubicThroughItsFourSamples) {
    // A straight line, a parabola, and a step whose overshoot is held within the range.
    EXPECT_EQ(EnlargeRow({0, 30, 60, 90}, 4, 2.0, 4), (Bytes{0, 13, 26, 39, 51, 64, 77, 90}));
    EXPECT_EQ(EnlargeRow({0, 10, 40, 90}, 4, 2.0, 4), (Bytes{0, 2, 7, 17, 29, 46, 66, 90}));
    const Bytes step = EnlargeRow({0, 0, 255, 255}, 4, 2.0, 4);
    EXPECT_EQ(step[1], 0);
    EXPECT_EQ(step[6], 255);
}

TEST(KernelJudge, MovesTheFourSamplesInwardAtTheEdges) {
    // Near the left edge the cubic goes through samples 0 to 3; a cubic is met exactly.
    const Bytes cubes{0, 1, 8, 27, 64, 125, 216};
    const Bytes output = EnlargeRow(cubes, 4, 13.0 / 7.0, 4);
    ASSERT_EQ(output.size(), 13U);
    for (std::size_t i = 0; i < output.size(); i += 2) EXPECT_EQ(output[i], cubes[i / 2]);
    EXPECT_EQ(output[1], 0);     // 0.125
    EXPECT_EQ(output[3], 3);     // 3.375
    EXPECT_EQ(output[11], 166);  // 166.375
}

TEST(KernelJudge, NamesResultsThatWouldBeEmpty) {
    const Bytes source(100, 7);
    Bytes output(4);
    const auto reduce = [&](double factor) {
        return Judge::EnlargePlane8(source.data(), {10, 10}, 10, {0, 0, 10, 10}, output.data(), 2,
                                    {2, 2}, factor, factor, 1);
    };

    EXPECT_EQ(reduce(0.04), KernelEmptyResult);
    EXPECT_EQ(reduce(0.06), KernelOk);
    EXPECT_EQ(reduce(std::numeric_limits<double>::quiet_NaN()), KernelBadFactor);
}

}  // namespace
}  // namespace ZV::Testing
