#include "hal/platform/mutex.h"

#include <gtest/gtest.h>

#include <atomic>

#include "hal/platform/last_error.h"
#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::TestThread;
using Test::WaitUntil;

class Mutex : public testing::Test {
  protected:
    ~Mutex() override { DestroyMutex(mutex); }

    PlatformMutex* mutex = MakeMutex();
};

TEST_F(Mutex, IsNotOwnedAtFirst) {
    EXPECT_FALSE(GiveMutex(mutex));
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorNotOwner);
}

TEST_F(Mutex, RefusesAReleaseByAThreadThatDoesNotOwnIt) {
    (void)TakeMutex(mutex);
    bool isGiven = true;
    {
        const TestThread stranger([&] { isGiven = GiveMutex(mutex); });
    }

    EXPECT_FALSE(isGiven);
    EXPECT_TRUE(GiveMutex(mutex));
}

TEST_F(Mutex, HoldsOthersUntilItsOwnerGivesItAsOftenAsItTookIt) {
    (void)TakeMutex(mutex);
    (void)TakeMutex(mutex);
    std::atomic<bool> hasPassed{false};
    TestThread other([&] {
        other.AnnounceWait();
        (void)TakeMutex(mutex);
        hasPassed.store(true);
        (void)GiveMutex(mutex);
    });

    ASSERT_TRUE(other.WaitUntilAsleep());
    EXPECT_TRUE(GiveMutex(mutex));
    EXPECT_FALSE(hasPassed.load());
    EXPECT_TRUE(GiveMutex(mutex));

    EXPECT_TRUE(WaitUntil([&] { return hasPassed.load(); }));
    EXPECT_FALSE(GiveMutex(mutex));
}

TEST_F(Mutex, GoesToTheNextTakerWhenItsOwnerHasEnded) {
    {
        const TestThread owner([&] { (void)TakeMutex(mutex); });
    }

    EXPECT_EQ(TakeMutex(mutex), WaitOutcome::Signalled);
    EXPECT_TRUE(GiveMutex(mutex));
    EXPECT_FALSE(GiveMutex(mutex));
    EXPECT_EQ(TakeMutex(mutex), WaitOutcome::Signalled);
    EXPECT_TRUE(GiveMutex(mutex));
}

TEST(NullMutex, FailsToBeTakenAndGiven) {
    EXPECT_EQ(TakeMutex(nullptr), WaitOutcome::Failed);
    EXPECT_FALSE(GiveMutex(nullptr));
    DestroyMutex(nullptr);
}

}  // namespace
}  // namespace ZV
