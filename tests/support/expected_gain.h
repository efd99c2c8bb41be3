#pragma once

#include <cstdint>

namespace ZV::Test {

enum class GainForm { Curve, Line, Ratio };

/// A camera's gain told once more: boards 1 (a curve), 2 (a line) and 3 (a ratio of control
/// values). Ratios are in millionths, decibels in millionths where the name says so.
struct GainBoard {
    GainForm form = GainForm::Line;
    double span = 0;  ///< dB of the line's 4096 steps.
    std::uint32_t dacMin = 0, dacMax = 0, dacDefault = 0;

    /// dB of a control value over that of the default, and the control value of such a gain.
    std::int64_t GetMicroDb(std::uint32_t dac) const;
    std::uint32_t GetDac(std::int64_t microDb) const;

    std::uint64_t GetRatioMax() const;
    std::uint64_t GetRatioMin() const;
    /// A ratio of three figures within the limits, and of a gain in dB.
    std::uint64_t FitRatio(std::uint64_t ratio) const;
    std::uint64_t FitRatioOf(std::int64_t microDb) const;

  private:
    double GetDecibels(std::uint32_t dac) const;
    double FindDac(double decibels) const;
    std::int64_t GetLimitMicroDb(std::uint32_t dac) const;
};

double ConvertRatioToMicroDb(std::uint64_t millionths);

/// Control value of an intensifier for a ratio in millionths, of limits as the camera has them.
std::uint32_t CalculateIntensifierGain(std::uint64_t millionths, std::uint32_t rawMin,
                                       std::uint32_t rawMax);

}  // namespace ZV::Test
