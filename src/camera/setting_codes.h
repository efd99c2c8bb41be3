#pragma once

#include <cstdint>
#include <optional>
#include <vector>

/// Codes by which the registers state a setting, and their conversions. Pure functions.
namespace ZV {

/// MHz of a readout frequency code; 0.0 for a code of no meaning.
float ConvertCodeToFrequency(std::uint32_t code);
/// By exact comparison.
std::optional<std::uint32_t> FindFrequencyCode(float megahertz);

/// Codes for 8, 10, 12, 14 and 16 bits; nothing for any other depth.
std::optional<std::uint32_t> FindBitDepthCode(std::uint32_t bits);

/// Codes for the symmetrical modes 1, 2, 3, 4 and 8; nothing for any other mode.
std::optional<std::uint32_t> FindBinningCode(std::uint32_t mode);
/// `isCode2Mode8` as the camera states it.
std::uint16_t ConvertCodeToBinning(std::uint32_t code, bool isCode2Mode8);

/// Trigger type and polarity.
struct TriggerCode {
    std::uint32_t type;
    std::uint32_t polarity;
};
/// Type 0 for mode 0 and for a mode above 7.
TriggerCode FindTriggerCode(std::uint32_t mode, bool isDoubleShot);
/// 0 for a type of no meaning.
std::uint32_t FindTriggerMode(TriggerCode code);
/// Appends the modes 0 to `lastMode`, or 0 and 5 while the filter wheel turns by itself.
void AppendTriggerModes(std::uint32_t lastMode, bool isFilterCycling,
                        std::vector<std::uint32_t>& modes);

inline constexpr std::int32_t CoolingCelsiusMin = -55;
/// The greatest set point; a reading of one more is possible.
inline constexpr std::int32_t CoolingCelsiusMax = 49;
inline constexpr std::int32_t CoolingReadingMax = 50;
/// Degrees C of a temperature code; 0 outside -55 to 50.
std::int32_t ConvertTemperatureCode(std::uint32_t code);
/// For -55 to 49 degrees C.
std::uint32_t ConvertCelsiusToCode(std::int32_t celsius);

/// Nanoseconds of a vertical clock count; 0 for a resolution of 0.
std::uint32_t ConvertVClockCount(std::uint32_t count, std::uint32_t resolution);
/// Low 16 bits of the count; 0 for a resolution of 0.
std::uint32_t ConvertVClockPeriod(std::uint32_t nanoseconds, std::uint32_t resolution);

/// The shutter close delay counts in steps of 6.4.
std::uint32_t ConvertCloseDelayCode(std::uint32_t code);
std::uint32_t ConvertCloseDelay(std::uint32_t delay);

/// Whole microseconds, from 1 to 0xFFFFFFFF.
std::uint32_t ConvertToMicroseconds(std::uint64_t nanoseconds);

}  // namespace ZV
