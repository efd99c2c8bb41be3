#pragma once

#include <cstdint>

/// What a sensor's id tells about it. Plain data; library and program share this source.
namespace ZV {

/// Chip name; empty for an id above 77.
const char* GetSensorName(std::uint32_t sensorId);
/// Nanometres; 0 where it is not known.
std::uint16_t GetSensorPixelSize(std::uint32_t sensorId);
/// Electrons; 0 where it is not known.
std::uint32_t GetSensorFullWell(std::uint32_t sensorId);

}  // namespace ZV
