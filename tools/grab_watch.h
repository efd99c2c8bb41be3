#pragma once

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <thread>

#include "zentara/zentara.h"

namespace ZentaraProgram {

/// Looks after a call that takes images, from a thread of its own. It gives a camera in the mode of
/// the software trigger one after the other. A call that gets no image it ends: after the time-out
/// or an interrupt it aborts again and again until the call has come back, since an abort that
/// comes before the wait is lost.
class GrabWatch {
  public:
    GrabWatch(ZentaraHandle handle, double timeoutSeconds, bool givesTriggers);
    ~GrabWatch() { Finish(); }
    GrabWatch(const GrabWatch&) = delete;
    GrabWatch& operator=(const GrabWatch&) = delete;

    /// Called when the call has come back.
    void Finish();
    /// Known when the watch has finished.
    [[nodiscard]] bool HasAborted() const { return hasAborted; }

  private:
    void Watch();

    ZentaraHandle camera;
    std::chrono::duration<double> limit;
    const bool triggers;
    std::mutex mutex;
    std::condition_variable changed;
    bool isFinished = false;  // guarded by mutex
    bool hasAborted = false;  // the watch's thread, then whoever has joined it
    std::thread thread;
};

}  // namespace ZentaraProgram
