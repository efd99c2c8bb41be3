#pragma once

#include "hal/hal.h"

namespace ZV {

/// A HAL semaphore of one unit in an object. Not recursive, without an owner: any thread may give
/// it.
///
/// No operation returns a failure; each prints a line on standard output and the caller goes on.
class ZENTARA_API ZSemaphore {
  public:
    ZSemaphore();
    ~ZSemaphore();
    ZSemaphore(const ZSemaphore&) = delete;
    ZSemaphore& operator=(const ZSemaphore&) = delete;

    /// False when there was no memory for it, which the constructor does not tell: nothing is ever
    /// held then, and every Wait prints.
    bool IsMade() const;

    /// Takes the unit, waiting without limit.
    void Wait();
    /// Gives it back.
    void Signal();

  private:
    HALSemaphore* semaphore = nullptr;
};

/// Holds a semaphore from construction to destruction.
class SemaphoreHold {
  public:
    explicit SemaphoreHold(ZSemaphore& taken) : semaphore(taken) { semaphore.Wait(); }
    ~SemaphoreHold() { semaphore.Signal(); }
    SemaphoreHold(const SemaphoreHold&) = delete;
    SemaphoreHold& operator=(const SemaphoreHold&) = delete;

  private:
    ZSemaphore& semaphore;
};

}  // namespace ZV
