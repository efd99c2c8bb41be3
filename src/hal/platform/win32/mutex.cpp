#include "hal/platform/mutex.h"

#include <windows.h>

#include <new>

namespace ZV {

struct PlatformMutex {
    HANDLE handle;
};

PlatformMutex* MakeMutex() {
    HANDLE handle = CreateMutexA(nullptr, FALSE, nullptr);
    if (handle == nullptr) return nullptr;
    auto* mutex = new (std::nothrow) PlatformMutex{handle};
    if (mutex != nullptr) return mutex;
    CloseHandle(handle);
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return nullptr;
}

WaitOutcome TakeMutex(PlatformMutex* mutex) {
    if (mutex == nullptr) {
        SetLastError(ERROR_INVALID_HANDLE);
        return WaitOutcome::Failed;
    }
    const DWORD result = WaitForSingleObject(mutex->handle, INFINITE);
    // A mutex whose owner has ended without a release goes to the next taker.
    const bool isTaken = result == WAIT_OBJECT_0 || result == WAIT_ABANDONED;
    return isTaken ? WaitOutcome::Signalled : WaitOutcome::Failed;
}

bool GiveMutex(PlatformMutex* mutex) {
    if (mutex != nullptr) return ReleaseMutex(mutex->handle) != FALSE;
    SetLastError(ERROR_INVALID_HANDLE);
    return false;
}

void DestroyMutex(PlatformMutex* mutex) {
    if (mutex == nullptr) return;
    CloseHandle(mutex->handle);
    delete mutex;
}

}  // namespace ZV
