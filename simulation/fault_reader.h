#pragma once

#include "simulation/faults.h"
#include "simulation/json_node.h"

namespace ZV::Simulation {

/// Reads an object of a camera's list `faults`.
void ReadFault(const JsonNode& node, FaultDescription* fault);

}  // namespace ZV::Simulation
