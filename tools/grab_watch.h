#pragma once

#include <chrono>
#include <condition_variable>
#include <mutex>
#include <thread>

#include "zentara/zentara.h"

namespace ZentaraProgram {

/// What a camera in the mode of the software trigger is given by a watch: EachImage where the grab
/// takes more than one exposure.
enum class TriggerHelp { None, Once, EachImage };

/// Looks after a grab from a thread of its own. It gives the trigger that a camera in the mode of
/// the software trigger waits for. A grab that gets no image it ends: after the time-out or an
/// interrupt it aborts again and again until the grab has come back, since an abort that comes
/// before the wait is lost.
class GrabWatch {
  public:
    GrabWatch(ZentaraHandle handle, double timeoutSeconds, TriggerHelp triggerHelp);
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
    TriggerHelp help;  // the watch's thread alone
    std::mutex mutex;
    std::condition_variable changed;
    bool isFinished = false;  // guarded by mutex
    bool hasAborted = false;  // the watch's thread, then whoever has joined it
    std::thread thread;
};

}  // namespace ZentaraProgram
