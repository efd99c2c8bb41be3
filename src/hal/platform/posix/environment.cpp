#include "hal/platform/environment.h"

#include <cstdlib>

namespace ZV {

const char* GetLibraryVariable(const char* name) {
    return secure_getenv(name);
}

}  // namespace ZV
