#pragma once

#include <cstdint>

#include "hal/platform/wait_outcome.h"

namespace ZV {

/// Unnamed event, clear at first.
struct PlatformEvent;

enum class EventReset {
    Automatic,  ///< One signal releases one waiter; without a waiter it stays until the next wait.
    Manual,     ///< A signal releases every waiter until the event is cleared.
};

/// Null when the system has none to give.
PlatformEvent* MakeEvent(EventReset reset);

/// False when the system refuses, or for null. Thread-safe.
bool SignalEvent(PlatformEvent* event);

/// Takes a pending signal back. Null is ignored. Thread-safe.
void ClearEvent(PlatformEvent* event);

/// Waits at most `timeoutMs` milliseconds of the wait clock (clock.h), or without limit for
/// `WaitForEver`. Limits beyond 32 bits are waited for in slices. Null is a failed wait.
/// Thread-safe.
WaitOutcome WaitForEvent(PlatformEvent* event, std::uint64_t timeoutMs);

/// False when the close fails; the event is then still there. Null succeeds.
bool DestroyEvent(PlatformEvent* event);

}  // namespace ZV
