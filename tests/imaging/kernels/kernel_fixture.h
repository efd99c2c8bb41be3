#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <random>
#include <string>
#include <vector>

#include "imaging/kernels/kernels.h"

namespace ZV::Testing {

/// A test over one form of the kernels, by name; skipped where the processor lacks it. The form is
/// in force during the test.
class KernelFormTest : public testing::TestWithParam<const char*> {
  protected:
    void SetUp() override;
    void TearDown() override;

    /// For the message of a failure: what was compared, the form, the size and the seed.
    [[nodiscard]] std::string Describe(const std::string& what, KernelSize size) const;

    /// Always the same seed, or what `ZENTARA_TEST_SEED` says.
    std::mt19937 random{GetSeed()};

    static std::uint32_t GetSeed();
};

#define ZENTARA_FOR_ALL_KERNEL_FORMS(suite)                                               \
    INSTANTIATE_TEST_SUITE_P(Forms, suite,                                                \
                             testing::Values("plain", "sse2", "ssse3", "avx2", "avx512"), \
                             [](const auto& form) { return std::string(form.param); })

/// Every width from 1 to 70 in a few heights, every height to 70 in a few widths, and wide rows, in
/// an order of chance; as many of them as a sanitizer or `ZENTARA_KERNEL_TEST_SHARE` (one in so
/// many) leaves time for.
std::vector<KernelSize> MakeKernelSizes(std::mt19937& random);

/// Rounds of tests that choose by chance, cut in the same way.
int CountKernelRounds(int rounds);

}  // namespace ZV::Testing
