#include "hal/platform/thread.h"

#include <gtest/gtest.h>
#include <windows.h>

#include <atomic>

#include "hal/platform/mutex.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

/// A thread that sits where nobody can ask it to end, as in a client's callback.
class ThreadThatStays : public testing::Test {
  protected:
    ThreadThatStays() {
        thread = StartThread(
            [](void* self) {
                auto& test = *static_cast<ThreadThatStays*>(self);
                if (test.mutex != nullptr) (void)TakeMutex(test.mutex);
                test.isThere = true;
                WaitForSingleObject(test.gate, INFINITE);
                test.hasPassed = true;
            },
            this);
    }
    ~ThreadThatStays() override {
        CloseThread(thread);
        DestroyMutex(mutex);
        CloseHandle(gate);
    }

    HANDLE gate = CreateEventA(nullptr, TRUE, FALSE, nullptr);
    PlatformMutex* mutex = MakeMutex();
    std::atomic<bool> isThere{false};
    std::atomic<bool> hasPassed{false};
    PlatformThread* thread;
};

TEST_F(ThreadThatStays, IsKilledAfterASecond) {
    ASSERT_TRUE(WaitUntil([&] { return isThere.load(); }));
    const ULONGLONG start = GetTickCount64();

    EXPECT_TRUE(EndThread(thread));

    EXPECT_GE(GetTickCount64() - start, 900u);
    EXPECT_EQ(WaitForThread(thread, 0), WaitOutcome::Signalled);
    SetEvent(gate);
    EXPECT_FALSE(hasPassed);
}

TEST_F(ThreadThatStays, LeavesItsMutexToTheNextTakerWhenItIsKilled) {
    ASSERT_TRUE(WaitUntil([&] { return isThere.load(); }));

    EXPECT_TRUE(EndThread(thread));

    EXPECT_EQ(TakeMutex(mutex), WaitOutcome::Signalled);
    EXPECT_TRUE(GiveMutex(mutex));
}

TEST_F(ThreadThatStays, LeavesNoHandleBehindWhenItHasEnded) {
    ASSERT_TRUE(WaitUntil([&] { return isThere.load(); }));
    SetEvent(gate);
    ASSERT_EQ(WaitForThread(thread, 10000), WaitOutcome::Signalled);
    DWORD before = 0, after = 0;
    const PlatformThreadEntry entry = [](void*) {};
    GetProcessHandleCount(GetCurrentProcess(), &before);

    for (int i = 0; i < 20; ++i) {
        PlatformThread* other = StartThread(entry, nullptr);
        ASSERT_EQ(WaitForThread(other, 10000), WaitOutcome::Signalled);
        CloseThread(other);
    }

    GetProcessHandleCount(GetCurrentProcess(), &after);
    EXPECT_LE(after, before + 2);
}

struct Priorities {
    int before = 0, after = 0;
};

Priorities RaiseInThread(bool servesRealDevice) {
    struct Work {
        bool servesRealDevice;
        Priorities priorities;
    } work{servesRealDevice, {}};
    PlatformThread* thread = StartThread(
        [](void* argument) {
            auto& given = *static_cast<Work*>(argument);
            given.priorities.before = GetThreadPriority(GetCurrentThread());
            RaiseOwnThreadPriority(given.servesRealDevice);
            given.priorities.after = GetThreadPriority(GetCurrentThread());
        },
        &work);
    EXPECT_EQ(WaitForThread(thread, 10000), WaitOutcome::Signalled);
    CloseThread(thread);
    return work.priorities;
}

TEST(ThreadPriority, IsTimeCriticalForARealDeviceAndLeftAloneOverTheSimulation) {
    EXPECT_EQ(RaiseInThread(true).after, THREAD_PRIORITY_TIME_CRITICAL);

    const Priorities simulated = RaiseInThread(false);
    EXPECT_EQ(simulated.after, simulated.before);
}

TEST(ProcessPriority, IsRaisedAndLoweredForARealDeviceAlone) {
    const DWORD before = GetPriorityClass(GetCurrentProcess());

    RaiseProcessPriority(false);
    EXPECT_EQ(GetPriorityClass(GetCurrentProcess()), before);

    RaiseProcessPriority(true);
    const DWORD raised = GetPriorityClass(GetCurrentProcess());
    LowerProcessPriority(true);

    // The system gives the high class to a process without the privilege of the realtime one.
    EXPECT_TRUE(raised == REALTIME_PRIORITY_CLASS || raised == HIGH_PRIORITY_CLASS) << raised;
    EXPECT_EQ(GetPriorityClass(GetCurrentProcess()), DWORD{NORMAL_PRIORITY_CLASS});
}

TEST(ProcessPriority, KeptIsTakenFromOneLoopByTheEndOfAnothersWork) {
    RaiseProcessPriority(true);
    RaiseProcessPriority(true);

    LowerProcessPriority(true);
    EXPECT_EQ(GetPriorityClass(GetCurrentProcess()), DWORD{NORMAL_PRIORITY_CLASS});

    LowerProcessPriority(true);
    EXPECT_EQ(GetPriorityClass(GetCurrentProcess()), DWORD{NORMAL_PRIORITY_CLASS});
}

}  // namespace
}  // namespace ZV::Test
