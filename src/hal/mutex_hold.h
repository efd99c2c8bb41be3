#pragma once

#include "hal/platform/mutex.h"

namespace ZV {

/// Holds a mutex of the seam for a scope. Null is not held, and leaves the last platform error
/// alone.
class MutexHold {
  public:
    explicit MutexHold(PlatformMutex* heldMutex) : mutex(Take(heldMutex) ? heldMutex : nullptr) {}
    ~MutexHold() {
        if (mutex != nullptr) (void)GiveMutex(mutex);
    }
    MutexHold(const MutexHold&) = delete;
    MutexHold& operator=(const MutexHold&) = delete;

  private:
    static bool Take(PlatformMutex* wanted) {
        return wanted != nullptr && TakeMutex(wanted) == WaitOutcome::Signalled;
    }

    PlatformMutex* const mutex;
};

}  // namespace ZV
