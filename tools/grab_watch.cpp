#include "grab_watch.h"

#include "interrupt.h"

namespace ZentaraProgram {
namespace {

constexpr std::chrono::milliseconds Poll{50};

}  // namespace

GrabWatch::GrabWatch(ZentaraHandle handle, double timeoutSeconds,
                     std::optional<Clock::duration> triggerPeriod)
    : camera(handle), limit(timeoutSeconds), period(triggerPeriod), thread([this] { Watch(); }) {}

void GrabWatch::Finish() {
    {
        const std::lock_guard lock(mutex);
        isFinished = true;
    }
    changed.notify_all();
    if (thread.joinable()) thread.join();
}

void GrabWatch::Watch() {
    const Clock::time_point end = Clock::now() + std::chrono::duration_cast<Clock::duration>(limit);
    std::unique_lock lock(mutex);
    while (!changed.wait_for(lock, Poll, [this] { return isFinished; })) {
        const bool isOver = Clock::now() >= end || IsInterrupted();
        lock.unlock();
        if (isOver) {
            hasAborted = true;
            (void)Zentara_Abort(camera);  // The grab's own result tells how it ended.
        } else {
            Trigger();
        }
        lock.lock();
    }
}

void GrabWatch::Trigger() {
    if (!period || Clock::now() < nextTrigger) return;
    // Refused until the grab has begun to wait.
    if (Zentara_Trigger(camera) == zerrNone) nextTrigger = Clock::now() + *period;
}

}  // namespace ZentaraProgram
