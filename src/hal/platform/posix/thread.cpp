#include "hal/platform/thread.h"

#include <pthread.h>
#include <sched.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <new>

#include "hal/platform/last_error.h"
#include "hal/platform/limited_wait.h"
#include "hal/platform/posix/system_error.h"
#include "hal/platform/thread_end.h"

// A thread's record belongs to two: to the caller until CloseThread, and to the thread until it has
// returned from its entry; the last to let go frees it. `mutex` guards the states of the two. A
// waiter joins the system's thread as well, so that no code of the library runs on it any more.

namespace ZV {

struct PlatformThread {
    PlatformThread(PlatformThreadEntry threadEntry, void* threadArgument)
        : entry(threadEntry), argument(threadArgument) {}

    const PlatformThreadEntry entry;
    void* const argument;
    std::atomic<int> ownerCount{2};
    ThreadEnd end;
    std::mutex mutex;
    std::condition_variable changed;
    pthread_t handle{};     // guarded by mutex
    std::uint32_t id = 0;   // guarded by mutex until the start has returned, constant from then on
    bool hasEnded = false;  // guarded by mutex
    bool isJoined = false;  // guarded by mutex
};

namespace {

constexpr int RoundRobinPriority = 1;
/// Real time: a thread that is on its way out needs it however fast the waits run.
constexpr std::chrono::seconds Grace{1};

thread_local PlatformThread* ownThread = nullptr;

void ReleaseRecord(PlatformThread* thread) {
    if (thread->ownerCount.fetch_sub(1, std::memory_order_acq_rel) == 1) delete thread;
}

void PublishId(PlatformThread* thread) {
    const std::lock_guard guard(thread->mutex);
    thread->id = static_cast<std::uint32_t>(gettid());
    thread->changed.notify_all();
}

void PublishEnd(PlatformThread* thread) {
    const std::lock_guard guard(thread->mutex);
    thread->hasEnded = true;
    thread->changed.notify_all();
}

void* RunThread(void* argument) {
    auto* thread = static_cast<PlatformThread*>(argument);
    ownThread = thread;
    PublishId(thread);
    thread->entry(thread->argument);
    ownThread = nullptr;
    PublishEnd(thread);
    ReleaseRecord(thread);
    return nullptr;
}

/// Requires: the mutex held, and the thread ended, so that this takes no more than its last steps.
void JoinOnce(PlatformThread* thread) {
    if (!thread->isJoined) pthread_join(thread->handle, nullptr);
    thread->isJoined = true;
}

}  // namespace

PlatformThread* StartThread(PlatformThreadEntry entry, void* argument) {
    auto* thread = new (std::nothrow) PlatformThread(entry, argument);
    if (thread == nullptr) {
        SetLastPlatformError(PlatformErrorNotEnoughMemory);
        return nullptr;
    }
    std::unique_lock lock(thread->mutex);
    if (const int error = pthread_create(&thread->handle, nullptr, RunThread, thread); error != 0) {
        SetLastPlatformErrorFromErrno(error);
        lock.unlock();
        delete thread;
        return nullptr;
    }
    thread->changed.wait(lock, [thread] { return thread->id != 0; });
    return thread;
}

std::uint32_t GetThreadId(const PlatformThread* thread) {
    return thread != nullptr ? thread->id : 0;
}

WaitOutcome WaitForThread(PlatformThread* thread, std::uint64_t timeoutMs) {
    if (thread == nullptr) {
        SetLastPlatformError(PlatformErrorInvalidHandle);
        return WaitOutcome::Failed;
    }
    std::unique_lock lock(thread->mutex);
    const auto hasEnded = [thread] { return thread->hasEnded; };
    if (!WaitForLimit(thread->changed, lock, timeoutMs, hasEnded)) return WaitOutcome::TimedOut;
    JoinOnce(thread);
    return WaitOutcome::Signalled;
}

bool EndThread(PlatformThread* thread) {
    if (thread == nullptr || thread == ownThread) {
        SetLastPlatformError(PlatformErrorInvalidHandle);
        return false;
    }
    thread->end.Request();
    std::unique_lock lock(thread->mutex);
    if (!thread->changed.wait_for(lock, Grace, [thread] { return thread->hasEnded; })) {
        SetLastPlatformError(PlatformErrorBusy);
        return false;
    }
    JoinOnce(thread);
    return true;
}

void CloseThread(PlatformThread* thread) {
    if (thread == nullptr) return;
    {
        const std::lock_guard guard(thread->mutex);
        if (thread->hasEnded) {
            JoinOnce(thread);
        } else {
            pthread_detach(thread->handle);
        }
    }
    ReleaseRecord(thread);
}

void RaiseOwnThreadPriority(bool servesRealDevice) {
    if (!servesRealDevice) return;
    const sched_param parameters{RoundRobinPriority};
    // Refused to most users: not an error, and nothing else is tried.
    (void)sched_setscheduler(0, SCHED_RR | SCHED_RESET_ON_FORK, &parameters);
}

void RaiseProcessPriority(bool) {}

void LowerProcessPriority(bool) {}

ThreadEnd* GetOwnThreadEnd() {
    return ownThread != nullptr ? &ownThread->end : nullptr;
}

}  // namespace ZV
