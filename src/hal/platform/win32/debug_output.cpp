#include "hal/platform/debug_output.h"

#include <windows.h>

namespace ZV {

void WriteDebuggerOutput(const char* text) {
    if (text != nullptr) OutputDebugStringA(text);
}

}  // namespace ZV
