#include "sweep/counted_waits.h"

#include <gtest/gtest.h>

#include <thread>

#include "hal/hal.h"
#include "hal/platform/clock.h"

namespace ZV::Test {
namespace {

constexpr std::uint32_t Divisor = 1000;
constexpr std::uint64_t LimitMs = 2000;

class CountedWaits : public testing::Test {
  protected:
    CountedWaits() {
        SetWaitClockDivisor(Divisor);
        (void)HAL_ConditionCreate(&condition);
    }
    ~CountedWaits() override {
        (void)HAL_ConditionDestroy(&condition);
        SetWaitClockDivisor(1);
    }
    /// What a wait adds to the count of the thread that begins it.
    std::uint64_t CountWait(HALStatus expected) {
        const std::uint64_t before = GetBegunWaitsMs();
        EXPECT_EQ(expected, HAL_ConditionTimedWait(condition, LimitMs * 1000));
        return GetBegunWaitsMs() - before;
    }

    HALCondition* condition = nullptr;
};

TEST_F(CountedWaits, HoldTheWholeLimitHoweverFastTheClockRuns) {
    ASSERT_NE(nullptr, condition);
    EXPECT_EQ(LimitMs, CountWait(HALConditionFailed));
}

TEST_F(CountedWaits, HoldNothingOfASignalThatIsThere) {
    ASSERT_EQ(HALOk, HAL_ConditionSignal(condition));
    EXPECT_EQ(0U, CountWait(HALOk));
}

TEST_F(CountedWaits, AreThoseOfTheThreadThatBeginsThem) {
    const std::uint64_t before = GetBegunWaitsMs();
    std::uint64_t ofTheOther = 0;
    std::thread([&] { ofTheOther = CountWait(HALConditionFailed); }).join();

    EXPECT_EQ(LimitMs, ofTheOther);
    EXPECT_EQ(before, GetBegunWaitsMs());
}

}  // namespace
}  // namespace ZV::Test
