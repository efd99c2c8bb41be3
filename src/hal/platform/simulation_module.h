#pragma once

#include "hal/platform/kernel_driver.h"

namespace ZV {

/// The simulated driver while `ZENTARA_SIMULATION` is set, else null. Reads the variable anew at
/// each call and begins or goes on with the bus that it names; the module is loaded by its fixed
/// name from the folder of the image that holds this code, from nowhere else, and never unloaded. A
/// refused scenario writes its message to the debugger output and gives a driver whose list is
/// empty.
///
/// Sets `*isSelected` when the variable is set, also when the module cannot be loaded: real devices
/// are then not looked for.
const KernelDriver* SelectSimulation(bool* isSelected);

/// What the last SelectSimulation answered, without a look at the variable: devices are opened
/// where they were listed. Before the first it answers as if the variable were unset.
const KernelDriver* GetSelectedSimulation(bool* isSelected);

/// Ends the simulated bus, if there is one. What was selected before no longer is.
void EndSimulation();

}  // namespace ZV
