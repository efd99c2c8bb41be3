#pragma once

#include "hal/platform/kernel_driver.h"

namespace ZV {

/// Loads the simulation's module by its fixed name from the folder of the image that holds this
/// code and asks it for its driver. The module stays loaded. Null when it is not there or does not
/// know this version of the table.
const KernelDriver* LoadSimulationDriver();

}  // namespace ZV
