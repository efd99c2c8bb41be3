#include "hal/platform/console.h"

namespace ZV {

// A process that has a terminal has it as its standard output already, and its title is the user's.
void PrepareLogConsole(const char*) {}

}  // namespace ZV
