#pragma once

#include <atomic>
#include <chrono>
#include <thread>

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
        // No std::atomic::wait: where the system cannot wait for a word, the standard library keeps
        // condition variables for it and destroys them at the end of the process, which hangs when
        // the system has killed a thread within one.
        while (isTaken.exchange(true, std::memory_order_acquire)) {
            std::this_thread::sleep_for(std::chrono::microseconds(100));
        }
    }
    void unlock() { isTaken.store(false, std::memory_order_release); }

  private:
    std::atomic<bool> isTaken{false};
};

}  // namespace ZV
