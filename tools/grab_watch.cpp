#include "grab_watch.h"

#include "interrupt.h"

namespace ZentaraProgram {
namespace {

using Clock = std::chrono::steady_clock;
constexpr std::chrono::milliseconds Poll{50};

}  // namespace

GrabWatch::GrabWatch(ZentaraHandle handle, double timeoutSeconds, TriggerHelp triggerHelp)
    : camera(handle), limit(timeoutSeconds), help(triggerHelp), thread([this] { Watch(); }) {}

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
    if (help == TriggerHelp::None) return;
    // Refused until the grab has begun to wait.
    const bool isTriggered = Zentara_Trigger(camera) == zerrNone;
    if (isTriggered && help == TriggerHelp::Once) help = TriggerHelp::None;
}

}  // namespace ZentaraProgram
