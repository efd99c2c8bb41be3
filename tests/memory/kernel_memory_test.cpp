#include <gtest/gtest.h>

#include <algorithm>
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
            return failing - 1;
        }
        EXPECT_EQ(status, KernelNoMemory) << failing;
    }
}

TEST(KernelMemory, EnlargingWithoutScratchWritesNothing) {
    SelectKernels();
    const std::vector<std::uint16_t> source(20 * 20, 3);
    for (const std::int32_t code : {InterpolateNearest, InterpolateLinear, InterpolateCubic}) {
        std::vector<std::uint16_t> output(40 * 40, 7);
        const auto enlarge = [&] {
            EXPECT_TRUE(
                std::all_of(output.begin(), output.end(), [](auto word) { return word == 7; }));
            return EnlargePlane16(source.data(), {20, 20}, 40, {0, 0, 20, 20}, output.data(), 80,
                                  {40, 40}, 2.0, 2.0, code);
        };

        EXPECT_GE(ExpectNoMemoryForEachAllocation(enlarge), 2) << code;
        EXPECT_EQ(output.back(), 3) << code;
    }
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

}  // namespace
}  // namespace ZV
