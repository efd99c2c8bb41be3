#include "hal/platform/device.h"

#include <windows.h>

#include <atomic>
#include <new>

#include "hal/platform/driver_device.h"
#include "hal/platform/last_error.h"
#include "hal/platform/simulation_module.h"
#include "hal/platform/win32/handle_wait.h"

// The system ends a request by writing its record and then setting its event, perhaps a while later
// and from another thread. A record is therefore free for the next request only when the event has
// been seen: an event that came late would end the wait for that one.

namespace ZV {

struct PlatformDevice {
    bool isReal;
    HANDLE handle;
    DriverDevice simulated;
};

struct PlatformOverlapped {
    /// A request to a simulated device.
    DriverRequest simulated;
    /// A request to a real one: under way from a pended request to the wait that saw its event.
    OVERLAPPED system{};
    HANDLE event = nullptr;
    std::atomic<bool> isUnderWay{false};
    DWORD error = ERROR_SUCCESS;
    std::atomic<bool> isLastReal{false};
};

namespace {

bool OpenRealDevice(const char* path, PlatformDevice* device) {
    device->isReal = true;
    device->handle = CreateFileA(path, GENERIC_READ | GENERIC_WRITE, 0, nullptr, OPEN_EXISTING,
                                 FILE_FLAG_OVERLAPPED | FILE_ATTRIBUTE_NORMAL, nullptr);
    return device->handle != INVALID_HANDLE_VALUE;
}

bool SendRequest(HANDLE device, const ControlRequest& request, OVERLAPPED* overlapped) {
    DWORD bytes = 0;
    return DeviceIoControl(device, request.code, const_cast<void*>(request.input),
                           request.inputBytes, request.output, request.outputBytes, &bytes,
                           overlapped) != FALSE;
}

/// Waits for the end of a request. A thread that is to end takes it back first: the record and the
/// buffers are its own, and a driver may keep the request for ever.
bool FinishRealRequest(HANDLE device, OVERLAPPED* overlapped, DWORD* answered) {
    const HANDLE handles[] = {overlapped->hEvent, GetOwnEndEvent()};
    const DWORD count = handles[1] != nullptr ? 2 : 1;
    const DWORD result = WaitForMultipleObjects(count, handles, FALSE, INFINITE);
    if (result == WAIT_OBJECT_0 + 1) CancelIoEx(device, overlapped);
    return GetOverlappedResult(device, overlapped, answered, TRUE) != FALSE;
}

/// The handle was opened for overlapped requests, so that this one needs a record and an event as
/// well.
bool ControlRealDevice(HANDLE device, const ControlRequest& request, std::uint32_t* bytes) {
    OVERLAPPED overlapped{};
    overlapped.hEvent = CreateEventA(nullptr, TRUE, FALSE, nullptr);
    if (overlapped.hEvent == nullptr) return false;
    DWORD answered = 0;
    const bool isSent =
        SendRequest(device, request, &overlapped) || GetLastError() == ERROR_IO_PENDING;
    const bool isDone = isSent && FinishRealRequest(device, &overlapped, &answered);
    const DWORD error = GetLastError();
    CloseHandle(overlapped.hEvent);
    if (bytes != nullptr) *bytes = answered;
    if (!isDone) SetLastError(error);
    return isDone;
}

ControlOutcome ControlRealDeviceOverlapped(HANDLE device, const ControlRequest& request,
                                           PlatformOverlapped* overlapped) {
    if (overlapped->isUnderWay.load()) {
        SetLastError(ERROR_BUSY);
        return ControlOutcome::Failed;
    }
    ResetEvent(overlapped->event);
    overlapped->system = OVERLAPPED{};
    overlapped->system.hEvent = overlapped->event;
    overlapped->isLastReal.store(true);
    const bool isDone = SendRequest(device, request, &overlapped->system);
    overlapped->error = isDone ? ERROR_SUCCESS : GetLastError();
    const bool isPended = overlapped->error == ERROR_IO_PENDING;
    overlapped->isUnderWay.store(isPended);
    if (isPended) return ControlOutcome::Pending;
    return isDone ? ControlOutcome::Done : ControlOutcome::Failed;
}

/// The end of the thread stands first, so that it wins over a request that is done.
CompletionOutcome WaitForRealEvent(PlatformOverlapped* overlapped, std::uint64_t timeoutMs) {
    HANDLE handles[2];
    DWORD count = 0;
    if (HANDLE endEvent = GetOwnEndEvent(); endEvent != nullptr) handles[count++] = endEvent;
    handles[count++] = overlapped->event;
    const DWORD result = WaitForHandles(count, handles, timeoutMs);
    if (result == WAIT_TIMEOUT) return CompletionOutcome::TimedOut;
    if (result == WAIT_OBJECT_0 + count - 1) return CompletionOutcome::Completed;
    return result == WAIT_OBJECT_0 ? CompletionOutcome::Ended : CompletionOutcome::Failed;
}

/// An event that came before its record was written is not this request's.
CompletionOutcome WaitForRealRequest(PlatformOverlapped* overlapped, std::uint64_t timeoutMs) {
    for (;;) {
        const CompletionOutcome outcome = WaitForRealEvent(overlapped, timeoutMs);
        if (outcome != CompletionOutcome::Completed) return outcome;
        if (HasOverlappedIoCompleted(&overlapped->system)) return outcome;
        ResetEvent(overlapped->event);
        // The request's own event may have come in between; its record was written before.
        if (HasOverlappedIoCompleted(&overlapped->system)) return outcome;
    }
}

bool IsOwnEndRequested() {
    HANDLE endEvent = GetOwnEndEvent();
    return endEvent != nullptr && WaitForSingleObject(endEvent, 0) == WAIT_OBJECT_0;
}

CompletionOutcome TakeRealOutcome(PlatformDevice* device, PlatformOverlapped* overlapped) {
    if (overlapped->isUnderWay.load()) {
        DWORD bytes = 0;
        const BOOL isGood = GetOverlappedResult(device->handle, &overlapped->system, &bytes, FALSE);
        overlapped->error = isGood ? ERROR_SUCCESS : GetLastError();
        overlapped->isUnderWay.store(false);
    }
    if (overlapped->error == ERROR_SUCCESS) return CompletionOutcome::Completed;
    SetLastError(overlapped->error);
    return CompletionOutcome::Failed;
}

}  // namespace

PlatformDevice* OpenDevice(const char* path) {
    auto* device = new (std::nothrow) PlatformDevice{};
    if (device == nullptr) {
        SetLastError(ERROR_NOT_ENOUGH_MEMORY);
        return nullptr;
    }
    bool isSimulated = false;
    const KernelDriver* driver = GetSelectedSimulation(&isSimulated);
    const bool isOpen = isSimulated ? OpenDriverDevice(driver, path, &device->simulated)
                                    : OpenRealDevice(path, device);
    if (isOpen) return device;
    const DWORD error = GetLastError();
    delete device;
    SetLastError(error);
    return nullptr;
}

void CloseDevice(PlatformDevice* device) {
    if (device == nullptr) return;
    if (device->isReal) {
        CloseHandle(device->handle);
    } else {
        CloseDriverDevice(device->simulated);
    }
    delete device;
}

bool IsRealDevice(const PlatformDevice* device) {
    return device != nullptr && device->isReal;
}

bool ControlDevice(PlatformDevice* device, const ControlRequest& request, std::uint32_t* bytes) {
    return device->isReal ? ControlRealDevice(device->handle, request, bytes)
                          : ControlDriverDevice(device->simulated, request, bytes);
}

ControlOutcome ControlDeviceOverlapped(PlatformDevice* device, const ControlRequest& request,
                                       PlatformOverlapped* overlapped) {
    if (device->isReal) return ControlRealDeviceOverlapped(device->handle, request, overlapped);
    overlapped->isLastReal.store(false);
    return ControlDriverDeviceOverlapped(device->simulated, request, &overlapped->simulated);
}

CompletionOutcome WaitForCompletion(PlatformDevice* device, PlatformOverlapped* overlapped,
                                    std::uint64_t timeoutMs) {
    if (!overlapped->isLastReal.load()) {
        return WaitForDriverRequest(&overlapped->simulated, timeoutMs);
    }
    if (IsOwnEndRequested()) return CompletionOutcome::Ended;
    if (overlapped->isUnderWay.load()) {
        const CompletionOutcome outcome = WaitForRealRequest(overlapped, timeoutMs);
        if (outcome != CompletionOutcome::Completed) return outcome;
    }
    return TakeRealOutcome(device, overlapped);
}

void ClearOverlapped(PlatformOverlapped* overlapped) {
    // The event of a request under way is still to be seen.
    if (!overlapped->isUnderWay.load()) ResetEvent(overlapped->event);
}

void CancelOverlapped(PlatformDevice* device, PlatformOverlapped* overlapped) {
    if (!device->isReal) {
        CancelDriverRequest(device->simulated, &overlapped->simulated);
    } else if (IsOverlappedPending(overlapped)) {
        CancelIoEx(device->handle, &overlapped->system);
    }
}

bool IsOverlappedPending(const PlatformOverlapped* overlapped) {
    if (!overlapped->isLastReal.load()) return IsDriverRequestPending(overlapped->simulated);
    return overlapped->isUnderWay.load() && !HasOverlappedIoCompleted(&overlapped->system);
}

PlatformOverlapped* MakeOverlapped() {
    auto* overlapped = new (std::nothrow) PlatformOverlapped;
    if (overlapped == nullptr) {
        SetLastError(ERROR_NOT_ENOUGH_MEMORY);
        return nullptr;
    }
    overlapped->event = CreateEventA(nullptr, TRUE, FALSE, nullptr);
    if (overlapped->event != nullptr) return overlapped;
    delete overlapped;
    SetLastError(ERROR_NO_SYSTEM_RESOURCES);
    return nullptr;
}

void DestroyOverlapped(PlatformOverlapped* overlapped) {
    if (overlapped == nullptr || IsOverlappedPending(overlapped)) return;
    CloseHandle(overlapped->event);
    delete overlapped;
}

}  // namespace ZV
