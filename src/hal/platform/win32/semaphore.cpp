#include "hal/platform/semaphore.h"

#include <windows.h>

#include <cstdint>
#include <new>

namespace ZV {
namespace {

constexpr std::int32_t CountInitial = 1;
constexpr std::int32_t CountMax = 100;

}  // namespace

struct PlatformSemaphore {
    HANDLE handle;
};

PlatformSemaphore* MakeSemaphore() {
    HANDLE handle = CreateSemaphoreA(nullptr, CountInitial, CountMax, nullptr);
    if (handle == nullptr) return nullptr;
    auto* semaphore = new (std::nothrow) PlatformSemaphore{handle};
    if (semaphore != nullptr) return semaphore;
    CloseHandle(handle);
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return nullptr;
}

WaitOutcome TakeSemaphore(PlatformSemaphore* semaphore) {
    if (semaphore == nullptr) {
        SetLastError(ERROR_INVALID_HANDLE);
        return WaitOutcome::Failed;
    }
    const DWORD result = WaitForSingleObject(semaphore->handle, INFINITE);
    return result == WAIT_OBJECT_0 ? WaitOutcome::Signalled : WaitOutcome::Failed;
}

void GiveSemaphore(PlatformSemaphore* semaphore) {
    if (semaphore != nullptr) ReleaseSemaphore(semaphore->handle, 1, nullptr);
}

void DestroySemaphore(PlatformSemaphore* semaphore) {
    if (semaphore == nullptr) return;
    CloseHandle(semaphore->handle);
    delete semaphore;
}

}  // namespace ZV
