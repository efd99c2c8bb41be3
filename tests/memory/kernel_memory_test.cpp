#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/kernels.h"
#include "memory/failing_allocator.h"

namespace ZV {
namespace {

using Test::BeginAllocations;
using Test::EndAllocations;

/// Refuses one allocation of the call after the other, until one goes through. Returns the number
/// that it needs.
template <typename Call>
std::int64_t ExpectNoMemoryForEachAllocation(const Call& call) {
    for (std::int64_t failing = 1;; ++failing) {
        BeginAllocations(failing);
        const KernelStatus status = call();
        if (!EndAllocations()) {
            EXPECT_EQ(status, KernelOk);
            Test::PrintRefusals();
            return failing - 1;
        }
        EXPECT_EQ(status, KernelNoMemory) << failing;
    }
}

struct EnlargeScratch {
    std::int32_t interpolation;
    std::int64_t allocations;
};

/// Nearest takes the columns' and the rows' indices; the others the rows in use, and for columns
/// and rows each the positions and three arrays of their plan, a linear plan two more for its runs.
constexpr EnlargeScratch EnlargeScratches[] = {
    {InterpolateNearest, 2},
    {InterpolateLinear, 13},
    {InterpolateCubic, 9},
};

template <typename Sample, typename Enlarge>
void ExpectNothingWrittenWithoutScratch(Enlarge enlarge) {
    constexpr auto SampleBytes = static_cast<std::int32_t>(sizeof(Sample));
    SelectKernels();
    const std::vector<Sample> source(20 * 20, 3);
    for (const EnlargeScratch& scratch : EnlargeScratches) {
        std::vector<Sample> output(40 * 40, 7);
        const auto call = [&] {
            EXPECT_TRUE(
                std::all_of(output.begin(), output.end(), [](Sample it) { return it == 7; }));
            return enlarge(source.data(), {20, 20}, 20 * SampleBytes, {0, 0, 20, 20}, output.data(),
                           40 * SampleBytes, {40, 40}, 2.0, 2.0, scratch.interpolation);
        };

        EXPECT_EQ(ExpectNoMemoryForEachAllocation(call), scratch.allocations)
            << scratch.interpolation;
        EXPECT_EQ(output.back(), 3) << scratch.interpolation;
    }
}

TEST(KernelMemory, EnlargingWithoutScratchWritesNothing) {
    ExpectNothingWrittenWithoutScratch<std::uint8_t>(EnlargePlane8);
}

TEST(KernelMemory, DeepEnlargingWithoutScratchWritesNothing) {
    ExpectNothingWrittenWithoutScratch<std::uint16_t>(EnlargePlane16);
}

TEST(KernelMemory, ALargeDeepLookupWithoutItsTableChangesNothing) {
    SelectKernels();
    const std::int32_t values[] = {9, 9};
    const std::int32_t levels[] = {0, 65535};
    std::vector<std::uint16_t> samples(6401, 5);
    const auto lookUp = [&] {
        EXPECT_EQ(samples.front(), 5);
        return LookupInPlace16x1(samples.data(), 2 * 6401, {6401, 1}, values, levels, 2);
    };

    EXPECT_EQ(ExpectNoMemoryForEachAllocation(lookUp), 1);
    EXPECT_EQ(samples.back(), 9);
}

TEST(KernelMemory, ALargeDeepColourLookupTakesItsThreeTablesAsOneBlock) {
    SelectKernels();
    const std::int32_t numbers[] = {9, 9};
    const std::int32_t levels[] = {0, 65535};
    const std::int32_t* const values[] = {numbers, numbers, numbers};
    const std::int32_t* const channelLevels[] = {levels, levels, levels};
    const std::int32_t counts[] = {2, 2, 2};
    std::vector<std::uint16_t> samples(3 * 6401, 5);
    const auto lookUp = [&] {
        EXPECT_EQ(samples.front(), 5);
        return LookupInPlace16x3(samples.data(), 6 * 6401, {6401, 1}, values, channelLevels,
                                 counts);
    };

    EXPECT_EQ(ExpectNoMemoryForEachAllocation(lookUp), 1);
    EXPECT_EQ(samples.back(), 9);
}

TEST(KernelMemory, ALookupOfBytesOrOfFewDeepPixelsTakesNoMemory) {
    SelectKernels();
    const std::int32_t values[] = {9, 9};
    const std::int32_t levels[] = {0, 100};
    std::vector<std::uint8_t> bytes(6401, 5);
    std::vector<std::uint16_t> words(6400, 5);

    EXPECT_EQ(ExpectNoMemoryForEachAllocation([&] {
                  return LookupInPlace8x1(bytes.data(), 6401, {6401, 1}, values, levels, 2);
              }),
              0);
    EXPECT_EQ(ExpectNoMemoryForEachAllocation([&] {
                  return LookupInPlace16x1(words.data(), 2 * 6400, {6400, 1}, values, levels, 2);
              }),
              0);
}

}  // namespace
}  // namespace ZV
