#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "simulation/scenario.h"
#include "zentara/zentara.h"

namespace ZV::Fuzzing {

/// One of each model, the first generation, one with a mosaic and one with a filter wheel.
inline constexpr std::size_t HostileCameraKinds = 28;

/// Pixels of each camera's sensor.
inline constexpr std::uint32_t HostileSensorWidth = 64;
inline constexpr std::uint32_t HostileSensorHeight = 48;

/// Well-made cameras with small sensors, of the kinds that `first`, `first` + 1 and so on name
/// modulo HostileCameraKinds.
std::vector<Simulation::CameraScenario> MakeHostileCameras(std::size_t first, std::size_t count);

/// Loads the library and opens `count` cameras (10 at most) of kinds that are spread over all, for
/// the life of the process. Limited waits pass at once.
std::vector<ZentaraHandle> OpenHostileCameras(std::size_t count);

/// Lets limited waits of the library pass at once.
void HurryWaits();

}  // namespace ZV::Fuzzing
