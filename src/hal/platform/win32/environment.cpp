#include "hal/platform/environment.h"

#include <windows.h>

namespace ZV {
namespace {

constexpr DWORD ValueBytesMax = 32767;

}  // namespace

// The system is asked, not the runtime: a client with another runtime sets its own copy of the
// variables. Programs here have no privileges beyond those of who starts them.
const char* GetLibraryVariable(const char* name) {
    static thread_local char value[ValueBytesMax + 1];
    const DWORD savedError = GetLastError();
    SetLastError(ERROR_SUCCESS);
    const DWORD length = GetEnvironmentVariableA(name, value, sizeof value);
    const bool isSet = length < sizeof value && (length > 0 || GetLastError() == ERROR_SUCCESS);
    SetLastError(savedError);
    return isSet ? value : nullptr;
}

}  // namespace ZV
