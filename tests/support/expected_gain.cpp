#include "support/expected_gain.h"

#include <algorithm>
#include <cmath>

namespace ZV::Test {
namespace {

/// Decimal step of a value that keeps three figures.
std::uint64_t GetStep(std::uint64_t value) {
    std::uint64_t step = 1;
    for (; value >= 1000; value /= 10) step *= 10;
    return step;
}

std::uint64_t RoundDown(std::uint64_t value) {
    return value / GetStep(value) * GetStep(value);
}

std::uint64_t RoundToNearest(std::uint64_t value) {
    const std::uint64_t step = GetStep(value);
    return (value + step / 2) / step * step;
}

/// Single precision, as the camera's gain is converted; beyond 32 bits the greatest word.
std::uint64_t GetRatio(std::int64_t microDb) {
    const float exponent = static_cast<float>(static_cast<double>(microDb) / 1e6) / 20.0f;
    const double ratio = static_cast<double>(std::pow(10.0f, exponent)) * 1e6;
    return static_cast<std::uint64_t>(std::min(ratio, 4294967295.0));
}

/// The greatest ratio below a limit in dB, and the least above one.
std::uint64_t StepDown(std::uint64_t ratio, std::int64_t limit) {
    while (ConvertRatioToMicroDb(ratio) > static_cast<double>(limit)) ratio -= GetStep(ratio);
    return ratio;
}
std::uint64_t StepUp(std::uint64_t ratio, std::int64_t limit) {
    while (ConvertRatioToMicroDb(ratio) < static_cast<double>(limit)) ratio += GetStep(ratio);
    return ratio;
}

constexpr double IntensifierSlope = 0.015765398;
constexpr double IntensifierIntercept = 33.5092631;
constexpr std::int64_t IntensifierMicroDbStep = 2000;

std::int64_t GetIntensifierMicroDb(std::uint32_t raw) {
    return static_cast<std::int64_t>((raw * IntensifierSlope + IntensifierIntercept) * 1e6);
}

std::uint64_t GetIntensifierRatio(std::int64_t microDb) {
    const double ratio = std::pow(10.0, static_cast<double>(microDb) / 1e6 / 20) * 1e6;
    return RoundDown(static_cast<std::uint64_t>(ratio));
}

}  // namespace

double ConvertRatioToMicroDb(std::uint64_t millionths) {
    return 20e6 * std::log10(static_cast<double>(millionths) / 1e6);
}

double GainBoard::GetDecibels(std::uint32_t dac) const {
    const double x = dac;
    if (form == GainForm::Line) return x * span / 4096;
    if (form == GainForm::Ratio) return 20 * std::log10(x / dacDefault);
    if (dac <= 500) return x * 7.518e-6;
    if (dac <= 3500) return (x - 500) * 0.007517812 + 0.003759;
    if (dac <= 4000) return (x - 3500) * 0.016678944 + 22.557195;
    return (x - 4000) * 7.518e-6 + 30.896667;
}

double GainBoard::FindDac(double decibels) const {
    if (form == GainForm::Line) return decibels * 4096 / span;
    if (decibels <= 0.003759) return decibels / 7.518e-6;
    if (decibels <= 22.557195) return (decibels - 0.003759) / 0.007517812 + 500;
    if (decibels <= 30.896667) return (decibels - 22.557195) / 0.016678944 + 3500;
    if (decibels <= 30.89738121) return (decibels - 30.896667) / 7.518e-6 + 4000;
    return 4095;
}

std::int64_t GainBoard::GetMicroDb(std::uint32_t dac) const {
    if (form == GainForm::Ratio) return static_cast<std::int64_t>(GetDecibels(dac) * 1e6);
    return static_cast<std::int64_t>((GetDecibels(dac) - GetDecibels(dacDefault)) * 1e6);
}

std::uint32_t GainBoard::GetDac(std::int64_t microDb) const {
    const double decibels = GetDecibels(dacDefault) + static_cast<double>(microDb) / 1e6;
    const auto dac = static_cast<std::int64_t>(FindDac(decibels) + 0.5);
    return static_cast<std::uint32_t>(std::clamp<std::int64_t>(dac, 0, 4095));
}

std::int64_t GainBoard::GetLimitMicroDb(std::uint32_t dac) const {
    constexpr std::int64_t MicroDbStep = 10000;
    return GetMicroDb(dac) / MicroDbStep * MicroDbStep;
}

std::uint64_t GainBoard::GetRatioMax() const {
    const std::int64_t limit = GetLimitMicroDb(dacMax);
    return StepDown(RoundToNearest(GetRatio(limit)), limit);
}

std::uint64_t GainBoard::GetRatioMin() const {
    const std::int64_t limit = GetLimitMicroDb(dacMin);
    return StepUp(RoundDown(GetRatio(limit)), limit);
}

std::uint64_t GainBoard::FitRatio(std::uint64_t ratio) const {
    return std::max(std::min(RoundToNearest(ratio), GetRatioMax()), GetRatioMin());
}

std::uint64_t GainBoard::FitRatioOf(std::int64_t microDb) const {
    return FitRatio(GetRatio(microDb));
}

std::uint32_t CalculateIntensifierGain(std::uint64_t millionths, std::uint32_t rawMin,
                                       std::uint32_t rawMax) {
    constexpr std::int64_t Step = IntensifierMicroDbStep;
    const std::int64_t least = (GetIntensifierMicroDb(rawMin) + Step - 1) / Step * Step;
    const std::int64_t greatest = GetIntensifierMicroDb(rawMax) / Step * Step;
    const std::uint64_t ratioMin = StepUp(GetIntensifierRatio(least), least);
    const std::uint64_t ratioMax = StepDown(GetIntensifierRatio(greatest), greatest);
    const std::uint64_t ratio = std::max(std::min(RoundToNearest(millionths), ratioMax), ratioMin);
    const double decibels = std::trunc(ConvertRatioToMicroDb(ratio)) / 1e6;
    return static_cast<std::uint32_t>((decibels - IntensifierIntercept) / IntensifierSlope + 0.5);
}

}  // namespace ZV::Test
