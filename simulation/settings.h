#pragma once

#include <cstdint>
#include <vector>

#include "simulation/scenario.h"
#include "simulation/sensor.h"

namespace ZV::Simulation {

/// Trigger types of the control block.
inline constexpr std::uint32_t TriggerFree = 0;
inline constexpr std::uint32_t TriggerSoftware = 1;

/// What the control registers mean to the camera, from the moment in which it took them over.
struct CameraSettings {
    ExposureSettings exposure;
    std::uint64_t redExposureNs = 0, blueExposureNs = 0;
    std::uint32_t triggerType = TriggerFree;
    std::uint32_t psn = 0;
    bool isCycling = false;         ///< A wheel turns: red, green, blue.
    std::uint32_t startColour = 0;  ///< 0 red, 1 green, 3 blue.
    bool isInterlaced = false;
    std::uint32_t maxPacketBytes = 0;  ///< 0 when the camera is not told.
};

/// Decodes a control block. `control` and `configuration` hold BlockQuadlets values.
CameraSettings DecodeSettings(const CameraScenario& camera,
                              const std::vector<std::uint32_t>& control,
                              const std::vector<std::uint32_t>& configuration);

/// Degrees C of a regulated temperature code.
double ConvertTemperatureCode(std::uint32_t code);

}  // namespace ZV::Simulation
