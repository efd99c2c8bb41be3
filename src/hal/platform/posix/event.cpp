#include "hal/platform/event.h"

#include <condition_variable>
#include <mutex>
#include <new>

#include "hal/platform/last_error.h"
#include "hal/platform/limited_wait.h"

// A signal releases who waits at its moment: clearing the event right after it takes nothing back
// from them, and two signals in a row release two waiters of an automatic event, however late they
// run. So a signal of an automatic event is handed to waiters by count, and stays in the event only
// while nobody waits; one of a manual event releases all who waited before its round, and nobody
// who comes after it was cleared.

namespace ZV {

struct PlatformEvent {
    explicit PlatformEvent(EventReset resetKind) : reset(resetKind) {}

    const EventReset reset;
    std::mutex mutex;
    std::condition_variable released;
    bool isSignalled = false;        // guarded by mutex
    std::uint64_t waiterCount = 0;   // guarded by mutex; released ones that have not run yet count
    std::uint64_t releaseCount = 0;  // guarded by mutex; waiters that are to run
    std::uint64_t round = 0;         // guarded by mutex; signals of a manual event so far
};

namespace {

void ReleaseOne(PlatformEvent* event) {
    if (event->waiterCount == event->releaseCount) {
        event->isSignalled = true;
        return;
    }
    ++event->releaseCount;
    event->released.notify_one();
}

void ReleaseAll(PlatformEvent* event) {
    event->isSignalled = true;
    ++event->round;
    event->released.notify_all();
}

bool WaitForRound(PlatformEvent* event, std::unique_lock<std::mutex>& lock,
                  std::uint64_t timeoutMs) {
    const std::uint64_t ownRound = event->round;
    return WaitForLimit(event->released, lock, timeoutMs,
                        [event, ownRound] { return event->round != ownRound; });
}

bool WaitForRelease(PlatformEvent* event, std::unique_lock<std::mutex>& lock,
                    std::uint64_t timeoutMs) {
    ++event->waiterCount;
    const bool isReleased =
        WaitForLimit(event->released, lock, timeoutMs, [event] { return event->releaseCount > 0; });
    --event->waiterCount;
    if (isReleased) --event->releaseCount;
    return isReleased;
}

}  // namespace

PlatformEvent* MakeEvent(EventReset reset) {
    auto* event = new (std::nothrow) PlatformEvent(reset);
    if (event == nullptr) SetLastPlatformError(PlatformErrorNotEnoughMemory);
    return event;
}

bool SignalEvent(PlatformEvent* event) {
    if (event == nullptr) {
        SetLastPlatformError(PlatformErrorInvalidHandle);
        return false;
    }
    // Notified under the mutex: whoever is released may destroy the event at once.
    const std::lock_guard guard(event->mutex);
    if (event->reset == EventReset::Automatic) {
        ReleaseOne(event);
    } else {
        ReleaseAll(event);
    }
    return true;
}

void ClearEvent(PlatformEvent* event) {
    if (event == nullptr) return;
    const std::lock_guard guard(event->mutex);
    event->isSignalled = false;
}

WaitOutcome WaitForEvent(PlatformEvent* event, std::uint64_t timeoutMs) {
    if (event == nullptr) {
        SetLastPlatformError(PlatformErrorInvalidHandle);
        return WaitOutcome::Failed;
    }
    std::unique_lock lock(event->mutex);
    if (event->isSignalled) {
        if (event->reset == EventReset::Automatic) event->isSignalled = false;
        return WaitOutcome::Signalled;
    }
    const bool isReleased = event->reset == EventReset::Manual
                                ? WaitForRound(event, lock, timeoutMs)
                                : WaitForRelease(event, lock, timeoutMs);
    return isReleased ? WaitOutcome::Signalled : WaitOutcome::TimedOut;
}

bool DestroyEvent(PlatformEvent* event) {
    delete event;
    return true;
}

}  // namespace ZV
