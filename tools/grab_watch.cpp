#include "grab_watch.h"

#include "interrupt.h"

namespace ZentaraProgram {
namespace {

using Clock = std::chrono::steady_clock;

}  // namespace

GrabWatch::GrabWatch(ZentaraHandle handle, double timeoutSeconds, bool givesTriggers)
    : camera(handle), limit(timeoutSeconds), triggers(givesTriggers), thread([this] { Watch(); }) {}

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
    while (!changed.wait_for(lock, InterruptPoll, [this] { return isFinished; })) {
        const bool isOver = Clock::now() >= end || IsInterrupted();
        lock.unlock();
        if (isOver) {
            hasAborted = true;
            (void)Zentara_Abort(camera);  // The grab's own result tells how it ended.
        } else if (triggers) {
            (void)Zentara_Trigger(camera);  // Refused until the call has begun to wait.
        }
        lock.lock();
    }
}

}  // namespace ZentaraProgram
