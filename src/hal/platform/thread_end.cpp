#include "hal/platform/thread_end.h"

namespace ZV {

void ThreadEnd::Request() {
    isRequested.store(true, std::memory_order_relaxed);
    const std::lock_guard guard(mutex);
    if (waitMutex == nullptr) return;
    // Between the look at the flag and the sleep the waiter holds this mutex: no wake is lost.
    { const std::lock_guard waitGuard(*waitMutex); }
    condition->notify_all();
}

void ThreadEnd::BeginWait(std::mutex* newWaitMutex, std::condition_variable* newCondition) {
    const std::lock_guard guard(mutex);
    waitMutex = newWaitMutex;
    condition = newCondition;
}

void ThreadEnd::EndWait() {
    const std::lock_guard guard(mutex);
    waitMutex = nullptr;
    condition = nullptr;
}

void ThreadEnd::Hold() {
    const std::lock_guard guard(mutex);
    ++holdCount;
}

void ThreadEnd::LetGo() {
    const std::lock_guard guard(mutex);
    --holdCount;
}

std::unique_lock<std::mutex> ThreadEnd::LockUnlessHeld() {
    std::unique_lock lock(mutex);
    if (holdCount != 0) lock.unlock();
    return lock;
}

ThreadHold::ThreadHold() : end(GetOwnThreadEnd()) {
    if (end != nullptr) end->Hold();
}

ThreadHold::~ThreadHold() {
    if (end != nullptr) end->LetGo();
}

}  // namespace ZV
