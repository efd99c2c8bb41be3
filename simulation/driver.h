#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "hal/platform/kernel_driver.h"
#include "simulation/world.h"

namespace ZV::Simulation {

/// The driver's table of operations. No operation throws.
const KernelDriver& GetDriverTable();

/// The world that is running; null while there is none.
std::shared_ptr<World> GetWorld();

/// Copies as much of `text` as fits, terminated. Does nothing without a buffer.
void CopyMessage(const std::string& text, char* message, std::uint32_t messageBytes);

}  // namespace ZV::Simulation
