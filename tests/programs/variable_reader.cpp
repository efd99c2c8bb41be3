#include <cstdio>

#include "hal/platform/environment.h"

// Prints what the library takes a variable for: `variable-reader NAME`. Needs no library of ours,
// so that any user can run a copy of it.
int main(int count, char** arguments) {
    if (count != 2) return 2;
    const char* value = ZV::GetLibraryVariable(arguments[1]);
    std::puts(value != nullptr ? value : "(none)");
    return value != nullptr ? 1 : 0;
}
