// Images of more bytes, samples and levels than 32 bits can count, over memory that is hardly
// there.

#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <vector>

#include "imaging/kernels/image_rows.h"
#include "imaging/kernels/kernel_fixture.h"
#include "imaging/kernels/kernels.h"
#include "support/rounds.h"
#include "support/sparse_memory.h"

namespace ZV::Testing {
namespace {

using Test::IsSanitized;
using Test::RepeatedMemory;
using Test::SparseMemory;

constexpr std::int32_t Lowest = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t Highest = std::numeric_limits<std::int32_t>::max();

/// A factor by which the longest row gives `count` samples, yet is so little below a whole number
/// that the last position lies behind the row's end, beyond 32 bits.
double FindFactorJustBelow(std::int32_t count) {
    return (count - 9e-8) / Highest;
}

class KernelExtents : public KernelFormTest {};

/// Enlarges four times one row of `Highest` samples, zeros between its ends.
template <typename Sample, typename Enlarge>
std::vector<Sample> EnlargeLongestRow(Enlarge enlarge, const SparseMemory& row, std::int32_t count,
                                      std::int32_t interpolation) {
    auto* const samples = reinterpret_cast<Sample*>(row.GetData());
    samples[0] = 10;
    samples[Highest - 1] = 200;
    std::vector<Sample> output(20 * 8, 99);
    EXPECT_EQ(enlarge(samples, {Highest, 4}, 0, {0, 0, Highest, 4}, output.data(),
                      20 * static_cast<std::int32_t>(sizeof(Sample)), {20, 8},
                      FindFactorJustBelow(count), 2.0, interpolation),
              KernelOk);
    return output;
}

/// The ends of the row at the ends of the result, nothing behind it.
template <typename Sample>
std::vector<Sample> ExpectEnds(std::size_t count) {
    std::vector<Sample> output(20 * 8, 99);
    for (std::size_t y = 0; y < 8; ++y)
        for (std::size_t x = 0; x < count; ++x) output[20 * y + x] = 0;
    for (std::size_t y = 0; y < 8; ++y) {
        output[20 * y] = 10;
        output[20 * y + count - 1] = 200;
    }
    return output;
}

TEST_P(KernelExtents, TheLongestRowEndsOnItsLastSample) {
    const SparseMemory row(2 * std::size_t{Highest});
    if (!row.IsMapped()) GTEST_SKIP() << "no room for so long a row";
    for (const std::int32_t interpolation : {InterpolateLinear, InterpolateCubic})
        for (const std::int32_t count : {2, 16}) {
            const auto width = static_cast<std::size_t>(count);
            EXPECT_EQ(EnlargeLongestRow<std::uint16_t>(EnlargePlane16, row, count, interpolation),
                      ExpectEnds<std::uint16_t>(width))
                << interpolation;
            std::memset(row.GetData(), 0, 2);
        }
}

TEST_P(KernelExtents, TheLongestRowOfBytesEndsOnItsLastSample) {
    const SparseMemory row(std::size_t{Highest});
    if (!row.IsMapped()) GTEST_SKIP() << "no room for so long a row";
    for (const std::int32_t interpolation : {InterpolateLinear, InterpolateCubic})
        for (const std::int32_t count : {2, 16}) {
            const auto width = static_cast<std::size_t>(count);
            EXPECT_EQ(EnlargeLongestRow<std::uint8_t>(EnlargePlane8, row, count, interpolation),
                      ExpectEnds<std::uint8_t>(width))
                << interpolation;
        }
}

TEST_P(KernelExtents, TheMostRowsEndOnTheLastOne) {
    const std::array<std::uint8_t, 4> row{77, 77, 77, 77};
    for (const std::int32_t interpolation : {InterpolateLinear, InterpolateCubic})
        for (const std::int32_t count : {2, 16}) {
            std::vector<std::uint8_t> output(8 * 20, 99);

            EXPECT_EQ(EnlargePlane8(row.data(), {4, Highest}, 0, {0, 0, 4, Highest}, output.data(),
                                    8, {8, 20}, 2.0, FindFactorJustBelow(count), interpolation),
                      KernelOk);

            std::vector<std::uint8_t> expected(8 * 20, 99);
            std::memset(expected.data(), 77, 8 * static_cast<std::size_t>(count));
            EXPECT_EQ(output, expected) << interpolation;
        }
}

TEST_P(KernelExtents, RowsOfALookupMayHaveTheMostLevels) {
    constexpr std::size_t TableBytes = sizeof(std::int32_t) * std::size_t{Highest};
    const SparseMemory values(TableBytes);
    const SparseMemory levels(TableBytes);
    if (!values.IsMapped() || !levels.IsMapped()) GTEST_SKIP() << "no room for so many levels";
    reinterpret_cast<std::int32_t*>(values.GetData())[Highest - 2] = 77;
    reinterpret_cast<std::int32_t*>(levels.GetData())[Highest - 1] = 1000;
    std::array<std::uint16_t, 4> samples{0, 999, 1000, 65535};

    EXPECT_EQ(LookupInPlace16x1(samples.data(), 8, {4, 1},
                                reinterpret_cast<const std::int32_t*>(values.GetData()),
                                reinterpret_cast<const std::int32_t*>(levels.GetData()), Highest),
              KernelOk);

    EXPECT_EQ(samples, (std::array<std::uint16_t, 4>{77, 77, 1000, 65535}));
}

/// Adds and packs one row three times into rows that lie as far apart as a row length can tell.
void FillDistantRows(std::uint8_t* first, std::int32_t rowBytes) {
    const std::array<std::uint8_t, 3> source{1, 2, 3};
    const void* const planes[] = {source.data(), source.data(), source.data()};

    ASSERT_EQ(PackPlanes8x3(planes, 0, first, rowBytes, {3, 3}), KernelOk);
    ASSERT_EQ(AddPlane8(source.data(), 0, first, rowBytes, {3, 3}, 0), KernelOk);
}

void ExpectDistantRows(const std::uint8_t* first, std::int64_t rowBytes) {
    constexpr std::array<std::uint8_t, 10> Row{2, 3, 4, 2, 2, 2, 3, 3, 3, 0};
    for (std::int64_t y = 0; y < 3; ++y)
        EXPECT_EQ(std::memcmp(first + rowBytes * y, Row.data(), Row.size()), 0) << y;
}

TEST_P(KernelExtents, RowsMayLieBeyondWhat32BitsReach) {
    const SparseMemory image(2 * (std::size_t{Highest} + 1) + 64);
    if (!image.IsMapped()) GTEST_SKIP() << "no room for rows so far apart";

    FillDistantRows(image.GetData(), Highest);

    ExpectDistantRows(image.GetData(), Highest);
}

TEST_P(KernelExtents, RowsMayLieBeyondWhat32BitsReachTheOtherWay) {
    const SparseMemory image(2 * (std::size_t{Highest} + 1) + 64);
    if (!image.IsMapped()) GTEST_SKIP() << "no room for rows so far apart";
    std::uint8_t* const first = image.GetData() + 2 * (std::size_t{Highest} + 1);

    FillDistantRows(first, Lowest);

    ExpectDistantRows(first, Lowest);
}

ZENTARA_FOR_ALL_KERNEL_FORMS(KernelExtents);

TEST(ImageWalk, TakesARowLengthForGaplessByAllOfItsBytes) {
    EXPECT_TRUE(IsGapless(12, 3, 4));
    EXPECT_FALSE(IsGapless(11, 3, 4));
    // What the low 32 bits of the row's bytes say.
    EXPECT_FALSE(IsGapless(0, 1 << 30, 4));
    EXPECT_FALSE(IsGapless(Lowest, 1 << 29, 4));
    EXPECT_FALSE(IsGapless(4, (1 << 30) + 1, 4));
}

TEST(ImageWalk, CountsThePixelsOfOneLongRowInFull) {
    const ImageWalk walk = PlanImageWalk({Highest, Highest}, true);

    EXPECT_EQ(walk.rows, 1);
    EXPECT_EQ(walk.rowPixels, std::size_t{Highest} * Highest);
    EXPECT_EQ(PlanImageWalk({Highest, 7}, false).rows, 7);
    EXPECT_EQ(PlanImageWalk({Highest, 7}, false).rowPixels, std::size_t{Highest});
}

TEST(GaplessImage, OfMoreThanTwoGigabytesIsWalkedToItsEnd) {
    // Some seconds of work on an emulated processor or under a sanitizer, which see nothing new.
    if (IsSanitized || std::getenv("ZENTARA_KERNEL_TEST_SHARE") != nullptr)
        GTEST_SKIP() << "too much work for this run";
    constexpr KernelSize Size{1 << 16, (1 << 15) + 1};
    constexpr std::size_t Bytes = std::size_t{Size.width} * Size.height;
    constexpr std::size_t BlockBytes = 1 << 26;
    const SparseMemory source(Bytes);
    const RepeatedMemory sums(BlockBytes, Bytes);
    if (!source.IsMapped() || !sums.IsMapped()) GTEST_SKIP() << "no room for so large an image";
    for (const std::size_t place : {std::size_t{0}, std::size_t{1} << 31, Bytes - 1})
        source.GetData()[place] = 1;

    ASSERT_EQ(AddPlane8(source.GetData(), Size.width, sums.GetData(), Size.width, Size, 0),
              KernelOk);

    EXPECT_EQ(sums.GetData()[0], 2);
    EXPECT_EQ(sums.GetData()[1], 0);
    EXPECT_EQ(sums.GetData()[(Bytes - 1) % BlockBytes], 1);
}

}  // namespace
}  // namespace ZV::Testing
