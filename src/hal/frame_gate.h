#pragma once

#include <atomic>
#include <cstdint>

#include "hal/hal.h"
#include "hal/platform/event.h"

namespace ZV {

/// Where the camera's run loop waits for frames. Thread-safe; lives as long as the device's record,
/// so that a late call never meets an event that is gone.
class FrameGate {
  public:
    FrameGate();
    ~FrameGate();
    FrameGate(const FrameGate&) = delete;
    FrameGate& operator=(const FrameGate&) = delete;

    /// False when there was no memory for its event: every Wait behind Open fails at once.
    bool IsMade() const { return frameEvent != nullptr; }
    /// The device has been connected: waits block from now on.
    void Open();
    /// The device is being closed: whoever waits goes on, and later waits return at once.
    void Close();
    /// Takes earlier signals back and waits without limit for the next Release. A signal between
    /// the end of one wait and the next call is lost. Returns 0, or 33 when the wait fails.
    HALStatus Wait() { return Wait(nullptr); }
    /// The same, but returns at once when there have been arrivals since. Null is none.
    HALStatus Wait(const FrameArrivals* arrivals);
    void Release();

  private:
    PlatformEvent* const frameEvent;
    std::atomic<bool> isOpen{false};
};

}  // namespace ZV
