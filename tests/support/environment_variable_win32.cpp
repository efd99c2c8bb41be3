#include <windows.h>

#include <cstdlib>

#include "support/environment_variable.h"

namespace ZV::Test {

// The runtime keeps a copy of its own, which cannot hold a variable that is empty; the system can.
void SetVariable(const char* name, const char* value) {
    _putenv_s(name, value != nullptr ? value : "");
    SetEnvironmentVariableA(name, value);
}

}  // namespace ZV::Test
