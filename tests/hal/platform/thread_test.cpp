#include "hal/platform/thread.h"

#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include "hal/platform/clock.h"
#include "hal/platform/event.h"
#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::TestThread;
using Test::WaitUntil;

/// A thread that runs until the test opens its gate.
class GatedThread : public testing::Test {
  protected:
    ~GatedThread() override {
        SetWaitClockDivisor(1);
        (void)SignalEvent(gate);
        EXPECT_TRUE(WaitUntil([this] { return hasReturned.load(); }));
        DestroyEvent(gate);
    }

    static void Run(void* self) {
        auto* test = static_cast<GatedThread*>(self);
        (void)WaitForEvent(test->gate, WaitForEver);
        test->hasReturned.store(true);
    }

    PlatformEvent* gate = MakeEvent(EventReset::Manual);
    std::atomic<bool> hasReturned{false};
};

TEST_F(GatedThread, IsWaitedForUntilItHasEnded) {
    PlatformThread* thread = StartThread(Run, this);
    ASSERT_NE(thread, nullptr);

    (void)SignalEvent(gate);

    EXPECT_EQ(WaitForThread(thread, WaitForEver), WaitOutcome::Signalled);
    EXPECT_TRUE(hasReturned.load());
    EXPECT_EQ(WaitForThread(thread, WaitForEver), WaitOutcome::Signalled);
    CloseThread(thread);
}

TEST_F(GatedThread, IsWaitedForAgainAfterATimeOut) {
    PlatformThread* thread = StartThread(Run, this);

    EXPECT_EQ(WaitForThread(thread, 0), WaitOutcome::TimedOut);
    EXPECT_EQ(WaitForThread(thread, 1), WaitOutcome::TimedOut);
    (void)SignalEvent(gate);

    EXPECT_EQ(WaitForThread(thread, WaitForEver), WaitOutcome::Signalled);
    CloseThread(thread);
}

TEST_F(GatedThread, IsWaitedForOnTheWaitClock) {
    SetWaitClockDivisor(1000);
    PlatformThread* thread = StartThread(Run, this);
    const std::uint64_t start = GetMonotonicMicroseconds();

    EXPECT_EQ(WaitForThread(thread, 60'000), WaitOutcome::TimedOut);

    const std::uint64_t elapsed = GetMonotonicMicroseconds() - start;
    EXPECT_GE(elapsed, 60'000u);
    EXPECT_LT(elapsed, 60'000'000u);
    (void)SignalEvent(gate);
    (void)WaitForThread(thread, WaitForEver);
    CloseThread(thread);
}

TEST_F(GatedThread, IsWaitedForByTwoAtOnce) {
    PlatformThread* thread = StartThread(Run, this);
    const auto wait = [thread] {
        EXPECT_EQ(WaitForThread(thread, WaitForEver), WaitOutcome::Signalled);
    };

    {
        const TestThread first(wait);
        const TestThread second(wait);
        (void)SignalEvent(gate);
    }

    CloseThread(thread);
}

TEST_F(GatedThread, GoesOnByItselfWhenItsHandleIsClosed) {
    PlatformThread* thread = StartThread(Run, this);

    CloseThread(thread);
    EXPECT_FALSE(hasReturned.load());
    (void)SignalEvent(gate);

    EXPECT_TRUE(WaitUntil([this] { return hasReturned.load(); }));
}

TEST_F(GatedThread, HasAnIdentifierThatTellsItFromOthers) {
    PlatformThread* thread = StartThread(Run, this);
    const TestThread other([] {});

    EXPECT_NE(GetThreadId(thread), 0u);
    EXPECT_NE(GetThreadId(thread), GetThreadId(other.Get()));

    (void)SignalEvent(gate);
    (void)WaitForThread(thread, WaitForEver);
    CloseThread(thread);
}

TEST_F(GatedThread, ThatStaysElsewhereIsNotEndedAfterASecondAndStaysTheCallers) {
    PlatformThread* thread = StartThread(Run, this);
    const std::uint64_t start = GetMonotonicMicroseconds();

    EXPECT_FALSE(EndThread(thread));

    EXPECT_GE(GetMonotonicMicroseconds() - start, 1'000'000u);
    EXPECT_FALSE(hasReturned.load());
    (void)SignalEvent(gate);
    EXPECT_EQ(WaitForThread(thread, WaitForEver), WaitOutcome::Signalled);
    EXPECT_TRUE(EndThread(thread));
    CloseThread(thread);
}

TEST(EndedThread, IsEndedAtOnceAndKeepsItsHandle) {
    PlatformThread* thread = StartThread([](void*) {}, nullptr);
    (void)WaitForThread(thread, WaitForEver);

    EXPECT_TRUE(EndThread(thread));
    EXPECT_EQ(WaitForThread(thread, 0), WaitOutcome::Signalled);

    CloseThread(thread);
}

TEST(OwnThread, CannotBeEndedByItself) {
    bool isEnded = true;
    {
        TestThread self([&] {
            while (self.Get() == nullptr) std::this_thread::yield();
            isEnded = EndThread(self.Get());
        });
    }

    EXPECT_FALSE(isEnded);
}

TEST(NullThread, FailsToBeWaitedForAndEnded) {
    EXPECT_EQ(WaitForThread(nullptr, 0), WaitOutcome::Failed);
    EXPECT_FALSE(EndThread(nullptr));
    EXPECT_EQ(GetThreadId(nullptr), 0u);
    CloseThread(nullptr);
}

}  // namespace
}  // namespace ZV
