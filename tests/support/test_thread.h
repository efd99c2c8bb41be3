#pragma once

#include <atomic>
#include <cstdint>
#include <functional>
#include <utility>

#include "hal/platform/thread.h"
#include "support/system_threads.h"
#include "support/wait_until.h"

namespace ZV::Test {

/// A thread of the seam that runs a function; the destructor waits for its end.
class TestThread {
  public:
    explicit TestThread(std::function<void()> threadBody) : body(std::move(threadBody)) {
        thread.store(StartThread(Run, this));
    }
    ~TestThread() {
        (void)WaitForThread(thread, WaitForEver);
        CloseThread(thread);
    }
    TestThread(const TestThread&) = delete;
    TestThread& operator=(const TestThread&) = delete;

    /// Null to the thread itself while it is being started.
    PlatformThread* Get() const { return thread.load(); }
    bool HasEnded() const { return WaitForThread(thread, 0) == WaitOutcome::Signalled; }

    /// To be called before a wait that blocks at once.
    void AnnounceWait() { isAnnounced.store(true); }
    /// True once the thread sleeps in the wait that it has announced.
    [[nodiscard]] bool WaitUntilAsleep() const {
        return WaitUntil([this] { return isAnnounced.load() && IsAsleep(GetThreadId(thread)); });
    }

  private:
    static void Run(void* argument) { static_cast<TestThread*>(argument)->body(); }

    std::function<void()> body;
    std::atomic<bool> isAnnounced{false};
    std::atomic<PlatformThread*> thread{nullptr};
};

}  // namespace ZV::Test
