#pragma once

#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <mutex>

namespace ZV {

/// How EndThread reaches a thread that waits for an overlapped request: the record of one thread,
/// raised by another. Only the waits that register here are cut short.
///
/// Locks: `mutex` before the mutex of the wait. A wait stays registered while it is being woken, so
/// what it waits on cannot go away under the waker.
class ThreadEnd {
  public:
    /// Raises the flag for good and wakes the registered wait. Thread-safe.
    void Request();

    bool IsRequested() const { return isRequested.load(std::memory_order_relaxed); }

    /// Registers the owner's wait on `condition` under `waitMutex`, which must not be held. The
    /// wait's predicate must look at IsRequested.
    void BeginWait(std::mutex* waitMutex, std::condition_variable* condition);
    void EndWait();

    /// While it is held, the thread must not be killed.
    void Hold();
    void LetGo();
    /// Keeps the thread from being held until the lock goes. Owns nothing when it is held already.
    std::unique_lock<std::mutex> LockUnlessHeld();

  private:
    std::mutex mutex;
    std::uint32_t holdCount = 0;  // guarded by mutex
    std::atomic<bool> isRequested{false};
    std::mutex* waitMutex = nullptr;               // guarded by mutex
    std::condition_variable* condition = nullptr;  // guarded by mutex
};

/// The record of the calling thread, or null for a thread that StartThread did not start.
ThreadEnd* GetOwnThreadEnd();

/// Holds the calling thread for its life: others reach what is on its stack.
class ThreadHold {
  public:
    ThreadHold();
    ~ThreadHold();
    ThreadHold(const ThreadHold&) = delete;
    ThreadHold& operator=(const ThreadHold&) = delete;

  private:
    ThreadEnd* end;  // borrowed from the thread's record, for its life
};

}  // namespace ZV
