#pragma once

#include <cstdint>
#include <optional>

namespace ZV {

/// Conversions between a camera's values and those of a settings block.

/// Divides by 1000; 0 becomes 1, and 0xFFFFFFFF or more becomes 0xFFFFFFFF.
[[nodiscard]] std::uint32_t ConvertNanosecondsToMicroseconds(std::uint64_t nanoseconds);
[[nodiscard]] std::uint64_t ConvertMicrosecondsToNanoseconds(std::uint32_t microseconds);

/// Readout speed index of a frequency; 0, the index of 20 MHz, for a frequency without one.
[[nodiscard]] std::uint32_t ConvertMegahertzToSpeedIndex(float megahertz);
/// Nothing for a frequency without an index.
[[nodiscard]] std::optional<std::uint32_t> FindSpeedIndex(float megahertz);
/// 0.0 for an index without a frequency.
[[nodiscard]] float ConvertSpeedIndexToMegahertz(std::uint32_t index);

/// A colour scale times 1000, the product taken in single precision and truncated. Scales that do
/// not fit are held at 0 and 0xFFFFFFFF.
[[nodiscard]] std::uint32_t ConvertScaleToThousandths(float scale);

}  // namespace ZV
