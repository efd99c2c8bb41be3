#pragma once

#include <atomic>

namespace ZV {

/// Leaf mutex for state of the process: needs no constructor at load and no destructor at the end
/// on any platform, so that a process may end at any moment. Lockable by std::lock_guard; not
/// recursive. Waiters sleep.
class StaticMutex {
  public:
    constexpr StaticMutex() = default;
    StaticMutex(const StaticMutex&) = delete;
    StaticMutex& operator=(const StaticMutex&) = delete;

    void lock() {
        while (isTaken.exchange(true, std::memory_order_acquire)) {
            isTaken.wait(true, std::memory_order_relaxed);
        }
    }
    void unlock() {
        isTaken.store(false, std::memory_order_release);
        isTaken.notify_one();
    }

  private:
    std::atomic<bool> isTaken{false};
};

}  // namespace ZV
