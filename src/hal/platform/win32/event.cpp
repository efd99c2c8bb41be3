#include "hal/platform/event.h"

#include <windows.h>

#include <new>

#include "hal/platform/win32/handle_wait.h"

namespace ZV {

struct PlatformEvent {
    HANDLE handle;
};

PlatformEvent* MakeEvent(EventReset reset) {
    HANDLE handle = CreateEventA(nullptr, reset == EventReset::Manual, FALSE, nullptr);
    if (handle == nullptr) return nullptr;
    auto* event = new (std::nothrow) PlatformEvent{handle};
    if (event != nullptr) return event;
    CloseHandle(handle);
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return nullptr;
}

bool SignalEvent(PlatformEvent* event) {
    if (event != nullptr) return SetEvent(event->handle) != FALSE;
    SetLastError(ERROR_INVALID_HANDLE);
    return false;
}

void ClearEvent(PlatformEvent* event) {
    if (event != nullptr) ResetEvent(event->handle);
}

WaitOutcome WaitForEvent(PlatformEvent* event, std::uint64_t timeoutMs) {
    if (event == nullptr) {
        SetLastError(ERROR_INVALID_HANDLE);
        return WaitOutcome::Failed;
    }
    const DWORD result = WaitForHandles(1, &event->handle, timeoutMs);
    if (result == WAIT_OBJECT_0) return WaitOutcome::Signalled;
    return result == WAIT_TIMEOUT ? WaitOutcome::TimedOut : WaitOutcome::Failed;
}

bool DestroyEvent(PlatformEvent* event) {
    if (event == nullptr) return true;
    if (!CloseHandle(event->handle)) return false;
    delete event;
    return true;
}

}  // namespace ZV
