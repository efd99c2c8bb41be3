#pragma once

#include <cstdint>

#include "camera/camera_result.h"

namespace ZV {

/// Gain model of an image intensifier: dB is linear in the control value. Normalized gain in
/// millionths, dB in millionths.
struct IntensifierGainModel {
    std::uint32_t significantFigures = 3;
    std::uint32_t dBResolution = 20000;
    std::uint64_t normalizedMin = 0;
    std::uint64_t normalizedMax = 0;
    std::uint32_t dBMin = 0;
    std::uint32_t dBMax = 0;
    std::uint32_t rawMax = 4095;
    std::uint32_t rawMin = 0;
    double slope = 0.015765398;
    double intercept = 33.5092631;
};

/// Fills the ranges from the limits of the control value. CameraGainSetupFailed, with nothing but
/// the limits stored, unless the maximum exceeds the minimum.
[[nodiscard]] CameraResult SetupIntensifierGain(IntensifierGainModel* model, std::uint32_t rawMin,
                                                std::uint32_t rawMax);
std::int32_t ConvertRawTodB(const IntensifierGainModel& model, std::uint32_t raw);
/// Rounds to the significant figures and holds within the limits.
std::uint64_t RoundIntensifierGain(const IntensifierGainModel& model, std::uint64_t normGain);
/// The control value of a normalized gain within the limits, from 0 to 4095. False when it is not
/// finite.
[[nodiscard]] bool ConvertNormToRaw(const IntensifierGainModel& model, std::uint64_t normGain,
                                    std::uint32_t* raw);

}  // namespace ZV
