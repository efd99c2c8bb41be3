#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <new>
#include <string>

#include "hal/hal.h"
#include "hal/platform/clock.h"
#include "hal/platform/last_error.h"
#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::TestThread;
using Test::WaitUntil;

TEST(HALLifetime, OpensAndClosesWithSuccess) {
    EXPECT_EQ(HAL_Open(), HALOk);
    EXPECT_EQ(HAL_Close(), HALOk);
    EXPECT_EQ(HAL_AdapterOpen(0, nullptr), HALOk);
}

TEST(HALLifetime, FreesMemoryOfTheHAL) {
    EXPECT_EQ(HAL_MemoryFree(std::malloc(32)), HALOk);
    EXPECT_EQ(HAL_MemoryFree(nullptr), HALOk);
}

TEST(HALErrorMessage, IsTheTextOfTheLastErrorWhateverTheStatus) {
    SetLastPlatformError(PlatformErrorAccessDenied);
    const std::string text = HAL_ErrorMessage(HALOk);

    EXPECT_FALSE(text.empty());
    EXPECT_EQ(HAL_ErrorMessage(HALDeviceInUse), text);
    SetLastPlatformError(PlatformErrorBusy);
    EXPECT_NE(HAL_ErrorMessage(HALDeviceInUse), text);
}

TEST(HALErrorMessage, IsEmptyWithoutALastError) {
    SetLastPlatformError(PlatformErrorNone);

    EXPECT_STREQ(HAL_ErrorMessage(HALReadFailed), "");
}

TEST(HALErrorMessage, IsEmptyWithoutATextForTheLastError) {
    SetLastPlatformError(0xFFFFFFFE);

    EXPECT_STREQ(HAL_ErrorMessage(HALReadFailed), "");
    EXPECT_STREQ(HAL_ErrorMessage(HALReadFailed), "") << "the question has an error of its own";
}

TEST(HALErrorMessage, IsTheTextOfTheLastErrorAlsoWhereAThreadAsksForTheFirstTime) {
    SetLastPlatformError(PlatformErrorAccessDenied);
    const std::string expected = HAL_ErrorMessage(HALOk);
    std::string text;

    {
        const TestThread other([&] {
            SetLastPlatformError(PlatformErrorAccessDenied);
            text = HAL_ErrorMessage(HALOk);
        });
    }

    EXPECT_EQ(text, expected);
}

TEST(HALErrorMessage, StaysGoodWhileOtherThreadsAsk) {
    SetLastPlatformError(PlatformErrorAccessDenied);
    const char* text = HAL_ErrorMessage(0);
    const std::string before = text;

    {
        const TestThread other([] {
            SetLastPlatformError(PlatformErrorBusy);
            EXPECT_STRNE(HAL_ErrorMessage(0), "");
        });
    }

    EXPECT_EQ(text, before);
}

/// A limit that would be 0 in 32 bits.
constexpr std::uint64_t JustBeyond32BitsMs = 0x1'0000'0000;

/// A HAL thread that runs until its gate opens.
class HALThreadTest : public testing::Test {
  protected:
    HALThreadTest() { HAL_ConditionCreate(&gate); }
    ~HALThreadTest() override {
        SetWaitClockDivisor(1);
        HAL_ConditionDestroy(&gate);
    }

    static void* Run(void* self) {
        auto* test = static_cast<HALThreadTest*>(self);
        (void)HAL_ConditionWait(test->gate);
        test->hasReturned.store(true);
        return self;
    }

    HALCondition* gate = nullptr;
    HALThread* thread = nullptr;
    std::atomic<bool> hasReturned{false};
};

TEST_F(HALThreadTest, RunsItsEntryWithItsArgument) {
    EXPECT_EQ(HAL_ThreadCreate(Run, this, &thread), HALOk);
    EXPECT_TRUE(IsHALThreadStarted(thread));
    (void)HAL_ConditionSignal(gate);

    EXPECT_EQ(HAL_ThreadCleanup(thread, 5000), HALOk);

    EXPECT_TRUE(hasReturned.load());
}

TEST_F(HALThreadTest, IsLetGoAfterTheLimitAlthoughItStillRuns) {
    SetWaitClockDivisor(1000);
    (void)HAL_ThreadCreate(Run, this, &thread);

    EXPECT_EQ(HAL_ThreadCleanup(thread, 5000), HALOk);

    EXPECT_FALSE(hasReturned.load());
    (void)HAL_ConditionSignal(gate);
    EXPECT_TRUE(WaitUntil([this] { return hasReturned.load(); }));
}

TEST_F(HALThreadTest, IsWaitedForWithALimitBeyond32BitsOfMilliseconds) {
    (void)HAL_ThreadCreate(Run, this, &thread);
    std::atomic<bool> hadReturned{false};
    TestThread waiter([&] {
        waiter.AnnounceWait();
        (void)HAL_ThreadCleanup(thread, JustBeyond32BitsMs);
        hadReturned.store(hasReturned.load());
    });

    ASSERT_TRUE(waiter.WaitUntilAsleep());
    (void)HAL_ConditionSignal(gate);

    EXPECT_TRUE(WaitUntil([&] { return hadReturned.load(); }));
}

TEST_F(HALThreadTest, IsTerminatedWhenItHasEnded) {
    (void)HAL_ThreadCreate(Run, this, &thread);
    (void)HAL_ConditionSignal(gate);
    ASSERT_TRUE(WaitUntil([this] { return hasReturned.load(); }));

    EXPECT_EQ(HAL_ThreadTerminate(thread), HALOk);
}

TEST_F(HALThreadTest, CannotBeTerminatedByItselfAndKeepsItsRecord) {
    struct Own {
        HALThread* thread = nullptr;
        HALCondition* gate;
        HALStatus status = HALOk;
    } own{nullptr, gate, HALOk};
    const HALThreadEntry entry = [](void* argument) -> void* {
        auto* self = static_cast<Own*>(argument);
        (void)HAL_ConditionWait(self->gate);
        self->status = HAL_ThreadTerminate(self->thread);
        return nullptr;
    };
    (void)HAL_ThreadCreate(entry, &own, &own.thread);
    (void)HAL_ConditionSignal(gate);

    EXPECT_EQ(HAL_ThreadCleanup(own.thread, 5000), HALOk);

    EXPECT_EQ(own.status, HALThreadNotTerminated);
}

TEST_F(HALThreadTest, EndsQuietlyWhenTheStandardLibraryThrows) {
    const HALThreadEntry entry = [](void*) -> void* { throw std::bad_alloc(); };
    (void)HAL_ThreadCreate(entry, nullptr, &thread);

    EXPECT_EQ(HAL_ThreadCleanup(thread, 5000), HALOk);
}

TEST_F(HALThreadTest, CannotBeMadeWithoutAnEntryAndIsReportedAsMade) {
    EXPECT_EQ(HAL_ThreadCreate(nullptr, this, &thread), HALOk);

    ASSERT_NE(thread, nullptr);
    EXPECT_FALSE(IsHALThreadStarted(thread));
    EXPECT_EQ(HAL_ThreadCleanup(thread, 5000), HALOk);
}

TEST_F(HALThreadTest, IsNotStartedWithoutAPlaceForItsRecord) {
    (void)HAL_ConditionSignal(gate);

    EXPECT_EQ(HAL_ThreadCreate(Run, this, nullptr), HALOk);

    EXPECT_EQ(HAL_ConditionTimedWait(gate, 0), HALOk) << "nobody has taken the signal";
    EXPECT_FALSE(hasReturned.load());
}

TEST(HALThreadRecord, CountsAsEndedWithoutAThread) {
    EXPECT_FALSE(IsHALThreadStarted(nullptr));
    EXPECT_EQ(HAL_ThreadCleanup(nullptr, 5000), HALOk);
    EXPECT_EQ(HAL_ThreadTerminate(nullptr), HALOk);
}

class HALSemaphoreTest : public testing::Test {
  protected:
    HALSemaphoreTest() { EXPECT_EQ(HAL_SemaphoreCreate(&semaphore), HALOk); }
    ~HALSemaphoreTest() override { EXPECT_EQ(HAL_SemaphoreDestroy(&semaphore), HALOk); }

    HALSemaphore* semaphore = nullptr;
};

TEST_F(HALSemaphoreTest, RaisesItsCountWithoutAPreviousWaitSoThatTwoWaitsPass) {
    EXPECT_EQ(HAL_SemaphoreSignal(semaphore), HALOk);

    EXPECT_EQ(HAL_SemaphoreWait(semaphore), HALOk);
    EXPECT_EQ(HAL_SemaphoreWait(semaphore), HALOk);
}

TEST_F(HALSemaphoreTest, IsSignalledWithSuccessAlsoAtItsMaximum) {
    for (int i = 0; i < 150; ++i) ASSERT_EQ(HAL_SemaphoreSignal(semaphore), HALOk);

    for (int i = 0; i < 100; ++i) ASSERT_EQ(HAL_SemaphoreWait(semaphore), HALOk);
}

TEST_F(HALSemaphoreTest, IsNotRecursive) {
    (void)HAL_SemaphoreWait(semaphore);
    std::atomic<bool> hasPassed{false};
    TestThread second([&] {
        second.AnnounceWait();
        EXPECT_EQ(HAL_SemaphoreWait(semaphore), HALOk);
        hasPassed.store(true);
    });

    ASSERT_TRUE(second.WaitUntilAsleep());
    EXPECT_FALSE(hasPassed.load());
    (void)HAL_SemaphoreSignal(semaphore);

    EXPECT_TRUE(WaitUntil([&] { return hasPassed.load(); }));
}

TEST(HALSemaphoreRecord, IsNulledByItsEndAndThenFailsToBeWaitedFor) {
    HALSemaphore* semaphore = nullptr;
    (void)HAL_SemaphoreCreate(&semaphore);
    ASSERT_NE(semaphore, nullptr);

    EXPECT_EQ(HAL_SemaphoreDestroy(&semaphore), HALOk);

    EXPECT_EQ(semaphore, nullptr);
    EXPECT_EQ(HAL_SemaphoreWait(semaphore), HALSemaphoreFailed);
    EXPECT_EQ(HAL_SemaphoreSignal(semaphore), HALOk);
    EXPECT_EQ(HAL_SemaphoreDestroy(&semaphore), HALOk);
}

TEST(HALSemaphoreRecord, IsNeitherMadeNorEndedWithoutAPlaceForIt) {
    EXPECT_EQ(HAL_SemaphoreCreate(nullptr), HALOk);
    EXPECT_EQ(HAL_SemaphoreDestroy(nullptr), HALOk);
}

class HALConditionTest : public testing::Test {
  protected:
    HALConditionTest() { EXPECT_EQ(HAL_ConditionCreate(&condition), HALOk); }
    ~HALConditionTest() override {
        SetWaitClockDivisor(1);
        EXPECT_EQ(HAL_ConditionDestroy(&condition), HALOk);
    }

    HALCondition* condition = nullptr;
};

TEST_F(HALConditionTest, PollsBelowOneThousandMicroseconds) {
    EXPECT_EQ(HAL_ConditionTimedWait(condition, 999), HALConditionFailed);
    (void)HAL_ConditionSignal(condition);

    EXPECT_EQ(HAL_ConditionTimedWait(condition, 999), HALOk);
    EXPECT_EQ(HAL_ConditionTimedWait(condition, 0), HALConditionFailed);
}

TEST_F(HALConditionTest, TakesItsLimitInMicrosecondsRoundedDown) {
    const std::uint64_t start = GetMonotonicMicroseconds();

    EXPECT_EQ(HAL_ConditionTimedWait(condition, 20'999), HALConditionFailed);

    const std::uint64_t elapsed = GetMonotonicMicroseconds() - start;
    EXPECT_GE(elapsed, 20'000u);
    EXPECT_LT(elapsed, 10'000'000u);
}

TEST_F(HALConditionTest, ReportsATimeOutAsAFailure) {
    SetWaitClockDivisor(1000);

    EXPECT_EQ(HAL_ConditionTimedWait(condition, 5'000'000), HALConditionFailed);
}

TEST_F(HALConditionTest, WaitsForALimitBeyond32BitsOfMilliseconds) {
    std::atomic<bool> isReleased{false};
    TestThread waiter([&] {
        waiter.AnnounceWait();
        isReleased.store(HAL_ConditionTimedWait(condition, JustBeyond32BitsMs * 1000) == HALOk);
    });

    ASSERT_TRUE(waiter.WaitUntilAsleep());
    (void)HAL_ConditionSignal(condition);

    EXPECT_TRUE(WaitUntil([&] { return isReleased.load(); }));
}

TEST_F(HALConditionTest, KeepsASignalUntilTheNextWaitAlone) {
    EXPECT_EQ(HAL_ConditionSignal(condition), HALOk);
    EXPECT_EQ(HAL_ConditionSignal(condition), HALOk);

    EXPECT_EQ(HAL_ConditionWait(condition), HALOk);
    EXPECT_EQ(HAL_ConditionTimedWait(condition, 0), HALConditionFailed);
}

TEST_F(HALConditionTest, LosesAPendingSignalByAReset) {
    (void)HAL_ConditionSignal(condition);

    EXPECT_EQ(HAL_ConditionReset(condition), HALOk);

    EXPECT_EQ(HAL_ConditionTimedWait(condition, 0), HALConditionFailed);
}

TEST_F(HALConditionTest, ReleasesOneWaiterForEachSignal) {
    std::atomic<int> released{0};
    const auto wait = [&] {
        if (HAL_ConditionWait(condition) == HALOk) ++released;
    };
    const TestThread first(wait);
    const TestThread second(wait);

    (void)HAL_ConditionSignal(condition);
    ASSERT_TRUE(WaitUntil([&] { return first.HasEnded() || second.HasEnded(); }));
    EXPECT_EQ(released.load(), 1);
    (void)HAL_ConditionSignal(condition);

    EXPECT_TRUE(WaitUntil([&] { return released.load() == 2; }));
}

TEST(HALConditionRecord, IsNulledByItsEndAndThenFails) {
    HALCondition* condition = nullptr;
    (void)HAL_ConditionCreate(&condition);
    ASSERT_NE(condition, nullptr);

    EXPECT_EQ(HAL_ConditionDestroy(&condition), HALOk);

    EXPECT_EQ(condition, nullptr);
    EXPECT_EQ(HAL_ConditionWait(condition), HALConditionFailed);
    EXPECT_EQ(HAL_ConditionTimedWait(condition, 0), HALConditionFailed);
    EXPECT_EQ(HAL_ConditionSignal(condition), HALConditionFailed);
    EXPECT_EQ(HAL_ConditionReset(condition), HALOk);
    EXPECT_EQ(HAL_ConditionDestroy(&condition), HALOk);
}

TEST(HALConditionRecord, IsNeitherMadeNorEndedWithoutAPlaceForIt) {
    EXPECT_EQ(HAL_ConditionCreate(nullptr), HALOk);
    EXPECT_EQ(HAL_ConditionDestroy(nullptr), HALOk);
}

}  // namespace
}  // namespace ZV
