#include <cstdlib>

#include "support/environment_variable.h"

namespace ZV::Test {

void SetVariable(const char* name, const char* value) {
    if (value != nullptr) {
        setenv(name, value, 1);
    } else {
        unsetenv(name);
    }
}

}  // namespace ZV::Test
