#include "hal/platform/debug_output.h"

#include <windows.h>

namespace ZV {

void WriteDebuggerOutput(const char* text) {
    if (text == nullptr) return;
    const DWORD savedError = GetLastError();
    OutputDebugStringA(text);
    SetLastError(savedError);
}

}  // namespace ZV
