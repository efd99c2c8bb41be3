#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <string>

#include "tools/colour_image.h"

namespace ZentaraTest {

inline constexpr std::uint32_t ChartColumns = 6, ChartRows = 4;

/// Levels of the chart's patches in thousandths, as docs/simulation-optics.md tells them.
inline constexpr std::array<std::array<std::array<int, 3>, ChartColumns>, ChartRows> ChartLevels{{
    {{{170, 85, 58},
      {540, 300, 225},
      {120, 195, 335},
      {100, 150, 55},
      {230, 215, 430},
      {140, 505, 410}}},
    {{{690, 200, 30},
      {70, 105, 375},
      {530, 95, 120},
      {110, 45, 140},
      {340, 495, 50},
      {740, 360, 25}}},
    {{{30, 50, 280}, {60, 290, 65}, {420, 35, 40}, {800, 570, 15}, {490, 90, 300}, {20, 230, 360}}},
    {{{900, 900, 900},
      {590, 590, 590},
      {360, 360, 360},
      {190, 190, 190},
      {90, 90, 90},
      {30, 30, 30}}},
}};

/// Light of a camera before the chart, in the units of docs/simulation-optics.md.
struct ChartLight {
    double brightness = 4e5, exposureSeconds = 0.016384, fullWell = 10000;
    std::array<double, 3> light{1, 1, 1};
    std::uint32_t bits = 8;

    [[nodiscard]] double GetTop() const { return std::exp2(bits) - 1; }
    /// The black level of a camera's first offset, 16 of 4095.
    [[nodiscard]] double GetBlack() const { return 16 * GetTop() / 4095; }
    /// The sample before the white balance.
    [[nodiscard]] double GetSample(std::uint32_t column, std::uint32_t row, std::size_t c) const {
        const double electrons =
            ChartLevels[row][column][c] / 1000.0 * brightness * light[c] * exposureSeconds;
        return std::min(electrons * GetTop() / fullWell + GetBlack(), GetTop());
    }
    /// The mean over the whole chart, or over its row of greys.
    [[nodiscard]] double GetMean(std::size_t c, bool isOfGreys) const {
        double sum = 0;
        const std::uint32_t first = isOfGreys ? ChartRows - 1 : 0;
        for (std::uint32_t row = first; row < ChartRows; ++row) {
            for (std::uint32_t column = 0; column < ChartColumns; ++column)
                sum += GetSample(column, row, c);
        }
        return sum / ((ChartRows - first) * ChartColumns);
    }
};

/// The mean of a patch's middle, away from its edges.
inline double MeasurePatch(const ReadSamples& image, std::uint32_t column, std::uint32_t row,
                           std::uint32_t channel) {
    constexpr std::uint32_t Side = 64;
    const std::uint32_t left = image.width * (2 * column + 1) / (2 * ChartColumns) - Side / 2;
    const std::uint32_t top = image.height * (2 * row + 1) / (2 * ChartRows) - Side / 2;
    double sum = 0;
    for (std::uint32_t y = 0; y < Side; ++y) {
        for (std::uint32_t x = 0; x < Side; ++x) sum += image.At(left + x, top + y, channel);
    }
    return sum / (Side * Side);
}

/// How far a measured gain may be away from that of the scene, as a share: the means of the white
/// balance lose their fraction, up to one step each. A thousandth more for the gains' own steps.
inline double GetGainShare(const ChartLight& light, bool isOfGreys) {
    double least = light.GetTop();
    for (std::size_t c = 0; c < 3; ++c) least = std::min(least, light.GetMean(c, isOfGreys));
    return 1 / least + 0.001;
}

/// Compares every patch with the scene, each colour times its gain, which may be away by a share.
/// Noise goes out of a mean over 4096 pixels. What stays: a sample is rounded (half a step at
/// most), the two greens lose half a step on their way to the mean and the table of the white
/// balance another.
inline void ExpectPatches(const ReadSamples& image, const ChartLight& light,
                          const std::array<double, 3>& gains, double share = 0.001) {
    constexpr double Steps = 2;
    ASSERT_EQ(3U, image.channels);
    ASSERT_EQ(1392U, image.width);
    ASSERT_EQ(1040U, image.height);
    for (std::uint32_t row = 0; row < ChartRows; ++row) {
        for (std::uint32_t column = 0; column < ChartColumns; ++column) {
            for (std::uint32_t c = 0; c < 3; ++c) {
                const double expected =
                    std::min(light.GetSample(column, row, c) * gains[c], light.GetTop());
                EXPECT_NEAR(expected, MeasurePatch(image, column, row, c), Steps + expected * share)
                    << "row " << row << " column " << column << " colour " << c;
            }
        }
    }
}

}  // namespace ZentaraTest
