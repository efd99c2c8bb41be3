#include "hal/platform/win32/handle_wait.h"

#include <algorithm>

#include "hal/platform/clock.h"
#include "hal/platform/wait_outcome.h"

namespace ZV {

DWORD WaitForHandles(DWORD count, const HANDLE* handles, std::uint64_t timeoutMs,
                     std::uint64_t sliceMsMax) {
    if (timeoutMs == WaitForEver) return WaitForMultipleObjects(count, handles, FALSE, INFINITE);
    std::uint64_t remainingMs = GetRealWaitMs(timeoutMs);
    for (;;) {
        const std::uint64_t sliceMs = std::min(remainingMs, sliceMsMax);
        const DWORD result =
            WaitForMultipleObjects(count, handles, FALSE, static_cast<DWORD>(sliceMs));
        remainingMs -= sliceMs;
        if (result != WAIT_TIMEOUT || remainingMs == 0) return result;
    }
}

}  // namespace ZV
