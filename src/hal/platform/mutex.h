#pragma once

#include "hal/platform/wait_outcome.h"

namespace ZV {

/// Unnamed mutex with an owner; recursive for its owner.
struct PlatformMutex;

/// Not owned at first. Null when the system has none to give.
PlatformMutex* MakeMutex();

/// Waits without limit. Null is a failed wait. Thread-safe.
WaitOutcome TakeMutex(PlatformMutex* mutex);

/// False when the calling thread does not own the mutex: nothing changes then. Thread-safe.
bool GiveMutex(PlatformMutex* mutex);

/// Null is ignored.
void DestroyMutex(PlatformMutex* mutex);

}  // namespace ZV
