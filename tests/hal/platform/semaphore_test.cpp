#include "hal/platform/semaphore.h"

#include <gtest/gtest.h>

#include <atomic>

#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::IsAsleep;
using Test::TestThread;
using Test::WaitUntil;

class Semaphore : public testing::Test {
  protected:
    ~Semaphore() override { DestroySemaphore(semaphore); }

    PlatformSemaphore* semaphore = MakeSemaphore();
};

TEST_F(Semaphore, LetsOneTakerPassAtFirst) {
    EXPECT_EQ(TakeSemaphore(semaphore), WaitOutcome::Signalled);
}

TEST_F(Semaphore, HoldsTheSecondTakerUntilAUnitIsGiven) {
    (void)TakeSemaphore(semaphore);
    std::atomic<bool> hasPassed{false};
    TestThread second([&] {
        second.AnnounceWait();
        (void)TakeSemaphore(semaphore);
        hasPassed.store(true);
    });

    ASSERT_TRUE(second.WaitUntilAsleep());
    EXPECT_FALSE(hasPassed.load());
    GiveSemaphore(semaphore);

    EXPECT_TRUE(WaitUntil([&] { return hasPassed.load(); }));
}

TEST_F(Semaphore, HasNoOwnerSoThatAnyThreadMayGive) {
    (void)TakeSemaphore(semaphore);

    {
        const TestThread giver([this] { GiveSemaphore(semaphore); });
    }

    EXPECT_EQ(TakeSemaphore(semaphore), WaitOutcome::Signalled);
}

TEST_F(Semaphore, CountsToOneHundredAndNoFurther) {
    for (int i = 0; i < 200; ++i) GiveSemaphore(semaphore);
    std::atomic<int> taken{0};
    TestThread taker([&] {
        for (int i = 0; i < 101; ++i) {
            (void)TakeSemaphore(semaphore);
            ++taken;
        }
    });

    ASSERT_TRUE(
        WaitUntil([&] { return taken.load() == 100 && IsAsleep(GetThreadId(taker.Get())); }));
    EXPECT_FALSE(taker.HasEnded());
    GiveSemaphore(semaphore);

    EXPECT_TRUE(WaitUntil([&] { return taken.load() == 101; }));
}

TEST_F(Semaphore, LetsNobodyPassTwiceUnderContention) {
    constexpr int Threads = 4;
    constexpr int Rounds = 500;
    int inside = 0;
    int sum = 0;
    const auto work = [&] {
        for (int i = 0; i < Rounds; ++i) {
            (void)TakeSemaphore(semaphore);
            EXPECT_EQ(++inside, 1);
            ++sum;
            --inside;
            GiveSemaphore(semaphore);
        }
    };

    {
        const TestThread threads[Threads] = {TestThread(work), TestThread(work), TestThread(work),
                                             TestThread(work)};
    }

    EXPECT_EQ(sum, Threads * Rounds);
}

TEST(NullSemaphore, FailsToBeTakenAndIgnoresTheRest) {
    EXPECT_EQ(TakeSemaphore(nullptr), WaitOutcome::Failed);
    GiveSemaphore(nullptr);
    DestroySemaphore(nullptr);
}

}  // namespace
}  // namespace ZV
