#pragma once

#include <cstdint>

#include "hal/platform/wait_outcome.h"

namespace ZV {

/// An open device of the kernel driver.
struct PlatformDevice;

/// Record of one overlapped request, with a manual-reset event of its own. It must live until its
/// request has ended.
struct PlatformOverlapped;

/// One control request; lengths in bytes. Input and output may be one buffer.
struct ControlRequest {
    std::uint32_t code;
    const void* input;
    std::uint32_t inputBytes;
    void* output;
    std::uint32_t outputBytes;
};

enum class ControlOutcome {
    Done,     ///< The driver answered at once.
    Pending,  ///< The driver pended the request; its end comes through the overlapped record.
    Failed,   ///< The last platform error says why.
};

enum class CompletionOutcome {
    Completed,  ///< The request ended well.
    Failed,     ///< The request ended with a failure; the last platform error says which.
    Ended,  ///< The calling thread is to end (EndThread): it must return at once, touching nothing.
    TimedOut,  ///< The limit ran out; the request is still pended.
};

/// Opens the device at `path` for reading and writing, unshared, existing, overlapped. Null on
/// failure.
PlatformDevice* OpenDevice(const char* path);

/// Null is ignored.
void CloseDevice(PlatformDevice* device);

/// True for a device of a real driver, false for a simulated one.
bool IsRealDevice(const PlatformDevice* device);

/// Sends a request and blocks until the driver has answered. True on success; the number of bytes
/// answered goes to `bytes` if that is not null. A thread that is to end takes back a request that
/// a real driver keeps; it fails with 995 then.
bool ControlDevice(PlatformDevice* device, const ControlRequest& request, std::uint32_t* bytes);

/// Sends a request without waiting for its end. `overlapped` must not have a request under way; its
/// event is cleared first. A request that is done at once leaves its event signalled.
ControlOutcome ControlDeviceOverlapped(PlatformDevice* device, const ControlRequest& request,
                                       PlatformOverlapped* overlapped);

/// Waits for the end of the request of `overlapped`, at most `timeoutMs` milliseconds of the wait
/// clock; `WaitForEver` has no limit. Returns at once when no request is under way, with the
/// outcome of the last. A thread that is to end gets `Ended` from every such wait, also when its
/// request is done.
CompletionOutcome WaitForCompletion(PlatformDevice* device, PlatformOverlapped* overlapped,
                                    std::uint64_t timeoutMs);

/// Clears the event of `overlapped`. A later wait without a new request ends at once all the same.
void ClearOverlapped(PlatformOverlapped* overlapped);

/// Asks for the early end of a request that is still pended. Its end has still to be waited for.
void CancelOverlapped(PlatformDevice* device, PlatformOverlapped* overlapped);

/// True from a pended request to its end.
bool IsOverlappedPending(const PlatformOverlapped* overlapped);

/// Null when the system has none to give.
PlatformOverlapped* MakeOverlapped();

/// Requires: no request under way (a record that has one is left alone, not taken from under the
/// driver). Null is ignored.
void DestroyOverlapped(PlatformOverlapped* overlapped);

}  // namespace ZV
