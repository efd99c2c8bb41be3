#pragma once

#include <cstdint>

#include "camera/camera_result.h"
#include "camera/gain_model.h"

/// Arithmetic of the gain: DAC values, normalized gain in millionths of the factory default, and
/// decibels relative to that default in millionths. All functions are pure and reentrant; powers of
/// ten and logarithms have the precision that clients' numbers depend on.
namespace ZV {

inline constexpr std::uint32_t BoardTypeCurve = 1;   ///< Piecewise curve.
inline constexpr std::uint32_t BoardTypeLinear = 2;  ///< dB linear in the DAC value.
inline constexpr std::uint32_t BoardTypeRatio = 3;   ///< And above: gain is a plain ratio.

inline constexpr std::int64_t GainDacFieldMax = 4095;
inline constexpr std::uint32_t NormGainUnity = 1000000;

/// `value` without its fraction, held to [`low`, `high`]. A NaN gives `low`.
std::int64_t TruncateWithin(double value, std::int64_t low, std::int64_t high);
/// Held to what a caller that returns a DAC value unstored can return.
std::uint32_t SaturateDac(std::int64_t dac);

/// False on a board type other than 1 or 2 and when the result is not finite.
[[nodiscard]] bool ConvertDacTodB(const GainModel& model, std::uint32_t dac, std::int32_t* gaindB);
/// False like ConvertDacTodB. `dac` may be negative or beyond the DAC's range; it saturates at the
/// ends of the type.
[[nodiscard]] bool ConvertdBToDac(const GainModel& model, std::int32_t gaindB, std::int64_t* dac);

/// Rounds `normGain` to the significant figures of the model and holds it within the model's
/// limits, in place; then its dB.
std::int32_t ConvertNormTodB(const GainModel& model, std::uint32_t* normGain);
/// Rounded and held within the limits. What 32 bits cannot hold counts as their maximum.
std::uint32_t ConvertdBToNorm(const GainModel& model, std::int32_t gaindB);

/// To the nearest step of the model, halves away from zero, then within its limits.
std::int32_t RoundGaindB(const GainModel& model, std::int32_t gaindB);

/// Step to which a normalized gain of this size is rounded, at least 1.
std::uint64_t GetNormGainStep(std::uint64_t normGain, std::uint32_t significantFigures);
/// To the nearest step, halves up. 0 stays 0.
std::uint64_t RoundNormGain(std::uint64_t normGain, std::uint32_t significantFigures);
/// Down to a step.
std::uint64_t TruncateNormGain(std::uint64_t normGain, std::uint32_t significantFigures);
/// dB of a normalized gain; below 1000 millionths that of 1000.
std::int32_t CalculateNormdB(std::uint64_t normGain);
/// The greatest normalized gain reached from `normGain` by steps down whose dB is not above
/// `maxdB`.
std::uint64_t LowerNormGainTo(std::uint64_t normGain, std::int32_t maxdB,
                              std::uint32_t significantFigures);
/// The least normalized gain reached from `normGain` by steps up whose dB is not below `mindB`; at
/// most `ceiling`.
std::uint64_t RaiseNormGainTo(std::uint64_t normGain, std::int32_t mindB,
                              std::uint32_t significantFigures, std::uint64_t ceiling);

/// Significant figures of a normalized gain that belong to a step in dB.
std::uint32_t CalculateSignificantFigures(std::int32_t dBResolution);
/// Fills the four limits of a model whose other fields are set. CameraGainSetupFailed when a limit
/// of the DAC has no dB.
[[nodiscard]] CameraResult DeriveGainLimits(GainModel* model);

}  // namespace ZV
