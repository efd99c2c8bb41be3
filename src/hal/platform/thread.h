#pragma once

#include <cstdint>

#include "hal/platform/wait_outcome.h"

namespace ZV {

/// A running or ended thread of the operating system.
struct PlatformThread;

using PlatformThreadEntry = void (*)(void* argument);

/// Starts a thread with default stack and security. Null when the system has none to give.
PlatformThread* StartThread(PlatformThreadEntry entry, void* argument);

/// System identifier of `thread`.
std::uint32_t GetThreadId(const PlatformThread* thread);

/// Waits until `thread` has ended, at most `timeoutMs` milliseconds of the wait clock (clock.h).
/// May be called again after a time-out. Thread-safe.
WaitOutcome WaitForThread(PlatformThread* thread, std::uint64_t timeoutMs);

/// Ends `thread` by asking: raises its end flag and wakes its wait for an overlapped request, which
/// then returns `CompletionOutcome::Ended` (device.h), and waits until the thread has returned from
/// its entry. One that has not after a second of real time, since it sits in a client's callback,
/// is killed on Windows and lives on elsewhere; in a simulated driver it lives on everywhere.
/// Returns false when it could not be ended; the thread is then still the caller's, has its end
/// flag raised for good and may be waited for or ended again.
bool EndThread(PlatformThread* thread);

/// Gives up the thread's handle. A thread that still runs goes on by itself and frees what it
/// holds.
void CloseThread(PlatformThread* thread);

/// Raises the calling thread to time-critical priority when it serves a real device; over simulated
/// devices nothing changes. What the system refuses is not an error.
void RaiseOwnThreadPriority(bool servesRealDevice);

/// Raises the process to the realtime class and lowers it to the normal one. Only where a real
/// device is served, and on Windows alone: elsewhere the class is left as it is.
void RaiseProcessPriority(bool servesRealDevice);
void LowerProcessPriority(bool servesRealDevice);

}  // namespace ZV
