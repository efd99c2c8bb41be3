#include "imaging/kernels/kernel_fixture.h"

#include <algorithm>
#include <cstdlib>

#include "imaging/kernels/kernel_selection.h"
#include "support/rounds.h"

namespace ZV::Testing {

void KernelFormTest::SetUp() {
    if (!ForceKernels(GetParam())) GTEST_SKIP() << "no " << GetParam() << " on this processor";
}

void KernelFormTest::TearDown() {
    (void)ForceKernels("");
}

std::string KernelFormTest::Describe(const std::string& what, KernelSize size) const {
    return what + ", form " + GetParam() + ", size " + std::to_string(size.width) + " x " +
           std::to_string(size.height) + ", ZENTARA_TEST_SEED=" + std::to_string(GetSeed());
}

std::uint32_t KernelFormTest::GetSeed() {
    constexpr std::uint32_t DefaultSeed = 20240917;
    const char* const text = std::getenv("ZENTARA_TEST_SEED");
    if (text == nullptr) return DefaultSeed;
    return static_cast<std::uint32_t>(std::strtoul(text, nullptr, 0));
}

std::vector<KernelSize> MakeKernelSizes(std::mt19937& random) {
    std::vector<KernelSize> sizes;
    for (std::int32_t side = 1; side <= 70; ++side)
        for (const std::int32_t other : {1, 2, 3, 5, 17}) {
            sizes.push_back({side, other});
            if (other == 1 || other == 5 || other == 17) sizes.push_back({other, side});
        }
    for (std::int32_t width = 130; width <= 300; ++width) sizes.push_back({width, 4});
    sizes.push_back({1391, 4});
    sizes.push_back({1392, 5});
    std::shuffle(sizes.begin(), sizes.end(), random);
    sizes.resize(static_cast<std::size_t>(CountKernelRounds(static_cast<int>(sizes.size()))));
    return sizes;
}

int CountKernelRounds(int rounds) {
    const char* const text = std::getenv("ZENTARA_KERNEL_TEST_SHARE");
    const int share = text == nullptr ? 1 : std::max(std::atoi(text), 1);
    return (Test::CountRounds(rounds) + share - 1) / share;
}

}  // namespace ZV::Testing
