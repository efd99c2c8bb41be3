// Where the column pass of the cubic goes up to the next whole number: forms may find the place
// without double precision, but not another place. Four equal rows pass their value on unchanged.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <string>
#include <vector>

#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/row_kernels.h"

namespace ZV {
namespace {

constexpr std::array FormNames{"plain", "sse2", "ssse3", "avx2", "avx512"};
constexpr CubicWeights Weights{1.25F, 0.15625F, -0.0390625F};

std::int32_t RoundDouble(float value, double greatest) {
    return static_cast<std::int32_t>(
        std::clamp(static_cast<double>(value) + 0.5000001, 0.0, greatest));
}

/// Every number of single precision around the place between `whole` and the next one.
void AddNeighbours(std::int32_t whole, std::vector<float>& values) {
    constexpr std::int32_t Reach = 8;
    float value = static_cast<float>(whole + 0.5);
    for (std::int32_t i = 0; i < Reach; ++i) value = std::nextafter(value, -1.0F);
    for (std::int32_t i = 0; i <= 2 * Reach; ++i, value = std::nextafter(value, 1e9F)) {
        values.push_back(value);
    }
}

std::vector<float> MakeValues(std::int32_t greatest) {
    std::vector<float> values{-1e6F, -300.0F, -1.5F, -1.0F, -0.6F, -0.5F, -0.1F, -0.0F, 1e-30F};
    for (std::int32_t whole = -2; whole <= greatest + 2; ++whole) {
        values.push_back(static_cast<float>(whole));
        AddNeighbours(whole, values);
    }
    values.push_back(1e6F);
    return values;
}

class CubicRounding : public testing::TestWithParam<const char*> {
  protected:
    void SetUp() override {
        form = FindRowKernels(GetParam());
        if (form == nullptr) GTEST_SKIP() << "the processor lacks this form";
    }

    const RowKernels* form = nullptr;
};

TEST_P(CubicRounding, BytesGoUpWhereDoublePrecisionDoes) {
    const std::vector<float> values = MakeValues(255);
    const float* const rows[] = {values.data(), values.data(), values.data(), values.data()};
    std::vector<std::uint8_t> output(values.size());

    form->cubicColumn8(rows, Weights, output.data(), values.size());

    for (std::size_t i = 0; i < values.size(); ++i) {
        ASSERT_EQ(RoundDouble(values[i], 255), output[i]) << values[i] << " at " << i;
    }
}

TEST_P(CubicRounding, WordsGoUpWhereDoublePrecisionDoes) {
    const std::vector<float> values = MakeValues(65535);
    const float* const rows[] = {values.data(), values.data(), values.data(), values.data()};
    std::vector<Word> output(values.size());

    form->cubicColumn16(rows, Weights, output.data(), values.size());

    for (std::size_t i = 0; i < values.size(); ++i) {
        ASSERT_EQ(RoundDouble(values[i], 65535), output[i].value) << values[i] << " at " << i;
    }
}

INSTANTIATE_TEST_SUITE_P(Forms, CubicRounding, testing::ValuesIn(FormNames),
                         [](const auto& form) { return std::string(form.param); });

}  // namespace
}  // namespace ZV
