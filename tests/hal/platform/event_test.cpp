#include "hal/platform/event.h"

#include <gtest/gtest.h>

#include <atomic>
#include <memory>

#include "hal/platform/clock.h"
#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::TestThread;
using Test::WaitUntil;

constexpr std::uint64_t WaitingLimitMs = 10'000;

/// An event and threads that wait for it once each.
class EventTest : public testing::Test {
  protected:
    explicit EventTest(EventReset reset) : event(MakeEvent(reset)) {}
    ~EventTest() override {
        waiters[0].reset();
        waiters[1].reset();
        EXPECT_TRUE(DestroyEvent(event));
    }

    /// Starts two waiters, and returns once both sleep.
    [[nodiscard]] bool StartTwoWaiters() {
        for (auto& waiter : waiters) {
            waiter = std::make_unique<TestThread>([this, &waiter] {
                if (!WaitUntil([this] { return isStarted.load(); })) return;
                waiter->AnnounceWait();
                if (WaitForEvent(event, WaitingLimitMs) == WaitOutcome::Signalled) ++released;
            });
        }
        isStarted.store(true);
        return waiters[0]->WaitUntilAsleep() && waiters[1]->WaitUntilAsleep();
    }

    PlatformEvent* event;
    std::atomic<int> released{0};
    std::atomic<bool> isStarted{false};
    std::unique_ptr<TestThread> waiters[2];
};

class AutomaticEvent : public EventTest {
  protected:
    AutomaticEvent() : EventTest(EventReset::Automatic) {}
};

class ManualEvent : public EventTest {
  protected:
    ManualEvent() : EventTest(EventReset::Manual) {}
};

TEST_F(AutomaticEvent, IsClearAtFirst) {
    EXPECT_EQ(WaitForEvent(event, 0), WaitOutcome::TimedOut);
}

TEST_F(AutomaticEvent, KeepsASignalForTheNextWaitAlone) {
    EXPECT_TRUE(SignalEvent(event));

    EXPECT_EQ(WaitForEvent(event, WaitForEver), WaitOutcome::Signalled);
    EXPECT_EQ(WaitForEvent(event, 0), WaitOutcome::TimedOut);
}

TEST_F(AutomaticEvent, KeepsOneSignalHoweverManyCame) {
    for (int i = 0; i < 3; ++i) EXPECT_TRUE(SignalEvent(event));

    EXPECT_EQ(WaitForEvent(event, 0), WaitOutcome::Signalled);
    EXPECT_EQ(WaitForEvent(event, 0), WaitOutcome::TimedOut);
}

TEST_F(AutomaticEvent, TakesAPendingSignalBack) {
    EXPECT_TRUE(SignalEvent(event));

    ClearEvent(event);

    EXPECT_EQ(WaitForEvent(event, 0), WaitOutcome::TimedOut);
}

TEST_F(AutomaticEvent, ReleasesOneOfTwoWaitersForEachSignal) {
    ASSERT_TRUE(StartTwoWaiters());

    EXPECT_TRUE(SignalEvent(event));
    ASSERT_TRUE(WaitUntil([this] { return waiters[0]->HasEnded() || waiters[1]->HasEnded(); }));
    EXPECT_EQ(released.load(), 1);
    EXPECT_NE(waiters[0]->HasEnded(), waiters[1]->HasEnded());
    EXPECT_TRUE(SignalEvent(event));

    EXPECT_TRUE(WaitUntil([this] { return released.load() == 2; }));
    EXPECT_EQ(WaitForEvent(event, 0), WaitOutcome::TimedOut);
}

TEST_F(AutomaticEvent, ReleasesTwoWaitersForTwoSignalsInARow) {
    ASSERT_TRUE(StartTwoWaiters());

    EXPECT_TRUE(SignalEvent(event));
    EXPECT_TRUE(SignalEvent(event));

    EXPECT_TRUE(WaitUntil([this] { return released.load() == 2; }));
}

TEST_F(AutomaticEvent, TakesNothingBackFromAWaiterThatWasReleased) {
    ASSERT_TRUE(StartTwoWaiters());

    EXPECT_TRUE(SignalEvent(event));
    ClearEvent(event);

    EXPECT_TRUE(WaitUntil([this] { return released.load() == 1; }));
    EXPECT_TRUE(SignalEvent(event));
}

TEST_F(AutomaticEvent, TimesOutAfterItsLimitOnTheWaitClock) {
    SetWaitClockDivisor(1000);

    EXPECT_EQ(WaitForEvent(event, 5000), WaitOutcome::TimedOut);

    SetWaitClockDivisor(1);
}

TEST_F(AutomaticEvent, WaitsOutALimitOfMoreYearsThanAClockCounts) {
    std::atomic<bool> isReleased{false};
    TestThread patient([&] {
        patient.AnnounceWait();
        isReleased.store(WaitForEvent(event, WaitForEver - 1) == WaitOutcome::Signalled);
    });

    ASSERT_TRUE(patient.WaitUntilAsleep());
    EXPECT_TRUE(SignalEvent(event));

    EXPECT_TRUE(WaitUntil([&] { return isReleased.load(); }));
}

TEST_F(AutomaticEvent, WaitsOutALimitThatWouldBeNoneIn32Bits) {
    std::atomic<bool> isReleased{false};
    TestThread patient([&] {
        patient.AnnounceWait();
        isReleased.store(WaitForEvent(event, 0x1'0000'0000) == WaitOutcome::Signalled);
    });

    ASSERT_TRUE(patient.WaitUntilAsleep());
    EXPECT_TRUE(SignalEvent(event));

    EXPECT_TRUE(WaitUntil([&] { return isReleased.load(); }));
}

TEST_F(ManualEvent, ReleasesEveryWaiterAndStaysSignalled) {
    ASSERT_TRUE(StartTwoWaiters());

    EXPECT_TRUE(SignalEvent(event));

    EXPECT_TRUE(WaitUntil([this] { return released.load() == 2; }));
    EXPECT_EQ(WaitForEvent(event, 0), WaitOutcome::Signalled);
    EXPECT_EQ(WaitForEvent(event, 0), WaitOutcome::Signalled);
}

TEST_F(ManualEvent, ReleasesItsWaitersAlsoWhenItIsClearedAtOnce) {
    ASSERT_TRUE(StartTwoWaiters());

    EXPECT_TRUE(SignalEvent(event));
    ClearEvent(event);

    EXPECT_TRUE(WaitUntil([this] { return released.load() == 2; }));
    EXPECT_EQ(WaitForEvent(event, 0), WaitOutcome::TimedOut);
}

TEST_F(ManualEvent, GivesNobodyWhoComesAfterItWasClearedTheReleaseOfAnother) {
    ASSERT_TRUE(StartTwoWaiters());

    EXPECT_TRUE(SignalEvent(event));
    ClearEvent(event);
    // The two have been released, and most likely have not run yet.
    EXPECT_EQ(WaitForEvent(event, 0), WaitOutcome::TimedOut);

    EXPECT_TRUE(WaitUntil([this] { return released.load() == 2; }));
}

TEST(NullEvent, FailsToBeWaitedForAndSignalled) {
    EXPECT_EQ(WaitForEvent(nullptr, 0), WaitOutcome::Failed);
    EXPECT_FALSE(SignalEvent(nullptr));
    ClearEvent(nullptr);
    EXPECT_TRUE(DestroyEvent(nullptr));
}

}  // namespace
}  // namespace ZV
