#pragma once

#include <cstdint>
#include <vector>

#include "simulation/scenario.h"

namespace ZV::Simulation {

/// Quadlets of memory behind each register block, whatever its version says.
inline constexpr std::uint32_t BlockQuadlets = 256;

/// Contents of a camera's configuration block: BlockQuadlets host-order values, consistent for its
/// model and laid out for its version, with the scenario's own quadlets on top.
std::vector<std::uint32_t> MakeConfiguration(const CameraScenario& camera);

}  // namespace ZV::Simulation
