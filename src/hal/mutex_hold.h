#pragma once

#include "hal/platform/mutex.h"

namespace ZV {

/// Holds a mutex of the seam for a scope. A mutex that is not there is not held.
class MutexHold {
  public:
    explicit MutexHold(PlatformMutex* heldMutex)
        : mutex(TakeMutex(heldMutex) == WaitOutcome::Signalled ? heldMutex : nullptr) {}
    ~MutexHold() {
        if (mutex != nullptr) (void)GiveMutex(mutex);
    }
    MutexHold(const MutexHold&) = delete;
    MutexHold& operator=(const MutexHold&) = delete;

  private:
    PlatformMutex* const mutex;
};

}  // namespace ZV
