#pragma once

#include <string>

#include "simulation/scenario.h"

namespace ZV::Simulation {

/// Reads a built-in scenario by name, `model:NAME`, or a JSON file by its path, and checks all of
/// it. False with the reason and its place (line and column, or JSON pointer) in `message`. The
/// format stands in docs/simulation.md.
bool LoadScenario(const std::string& name, Scenario* scenario, std::string* message);

/// Reads one fault, an object as in the list `faults` of a camera.
bool ReadFault(const std::string& json, FaultDescription* fault, std::string* message);

}  // namespace ZV::Simulation
