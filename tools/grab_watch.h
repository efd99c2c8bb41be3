#pragma once

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <optional>
#include <thread>

#include "zentara/zentara.h"

namespace ZentaraProgram {

/// Looks after a grab from a thread of its own. It gives the trigger that a camera in the mode of
/// the software trigger waits for, and gives it again: the stream of a grab takes a trigger a
/// little before the camera does, and that one is lost. A grab that gets no image it ends: after
/// the time-out or an interrupt it aborts again and again until the grab has come back, since an
/// abort that comes before the wait is lost.
class GrabWatch {
  public:
    using Clock = std::chrono::steady_clock;

    /// Triggers each time that `triggerPeriod` has passed since the last one; without it, never.
    GrabWatch(ZentaraHandle handle, double timeoutSeconds,
              std::optional<Clock::duration> triggerPeriod);
    ~GrabWatch() { Finish(); }
    GrabWatch(const GrabWatch&) = delete;
    GrabWatch& operator=(const GrabWatch&) = delete;

    /// Called when the grab has come back.
    void Finish();
    /// Known when the watch has finished.
    [[nodiscard]] bool HasAborted() const { return hasAborted; }

  private:
    void Watch();
    void Trigger();

    ZentaraHandle camera;
    std::chrono::duration<double> limit;
    std::optional<Clock::duration> period;
    Clock::time_point nextTrigger = Clock::now();  // the watch's thread alone
    std::mutex mutex;
    std::condition_variable changed;
    bool isFinished = false;  // guarded by mutex
    bool hasAborted = false;  // the watch's thread, then whoever has joined it
    std::thread thread;
};

}  // namespace ZentaraProgram
