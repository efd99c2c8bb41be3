#pragma once

#include "hal/platform/wait_outcome.h"

namespace ZV {

/// Unnamed counting semaphore with an initial count of 1 and a maximum of 100. No owner, not
/// recursive.
struct PlatformSemaphore;

/// Null when the system has none to give.
PlatformSemaphore* MakeSemaphore();

/// Takes one unit, waiting without limit. Null is a failed wait. Thread-safe.
WaitOutcome TakeSemaphore(PlatformSemaphore* semaphore);

/// Gives one unit back; at the maximum nothing changes. Thread-safe.
void GiveSemaphore(PlatformSemaphore* semaphore);

/// Null is ignored. Nobody may wait.
void DestroySemaphore(PlatformSemaphore* semaphore);

}  // namespace ZV
