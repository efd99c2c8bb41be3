#include "hal/platform/clock.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdlib>

#include "hal/platform/wait_outcome.h"
#include "support/scoped_variable.h"

namespace ZV {
namespace {

using Test::ScopedVariable;

class WaitClock : public testing::Test {
  protected:
    ~WaitClock() override { SetWaitClockDivisor(1); }
};

TEST_F(WaitClock, RunsInRealTimeWithADivisorOfOne) {
    SetWaitClockDivisor(1);

    EXPECT_EQ(GetRealWaitMs(5000), 5000u);
}

TEST_F(WaitClock, RunsFasterByItsDivisor) {
    SetWaitClockDivisor(1000);

    EXPECT_EQ(GetRealWaitMs(5000), 5u);
}

TEST_F(WaitClock, RoundsALimitUpToAtLeastOneMillisecond) {
    SetWaitClockDivisor(1000);

    EXPECT_EQ(GetRealWaitMs(1), 1u);
    EXPECT_EQ(GetRealWaitMs(1001), 2u);
}

TEST_F(WaitClock, LeavesAPollAndAnUnlimitedWaitAsTheyAre) {
    SetWaitClockDivisor(1000);

    EXPECT_EQ(GetRealWaitMs(0), 0u);
    EXPECT_EQ(GetRealWaitMs(WaitForEver), WaitForEver);
}

TEST_F(WaitClock, TakesADivisorOfZeroAsOne) {
    SetWaitClockDivisor(0);

    EXPECT_EQ(GetRealWaitMs(7), 7u);
}

TEST_F(WaitClock, RunsOnFasterByItsDivisor) {
    SetWaitClockDivisor(1000);
    const std::uint64_t before = GetMonotonicMicroseconds();
    const std::uint64_t start = GetWaitClockMs();
    while (GetWaitClockMs() < start + 2000) continue;

    EXPECT_GE(GetMonotonicMicroseconds() - before, 1999u);
    SetWaitClockDivisor(1);
    EXPECT_LE(GetWaitClockMs(), GetMonotonicMicroseconds() / 1000);
}

TEST_F(WaitClock, HoldsLimitsBeyond32Bits) {
    SetWaitClockDivisor(10);

    EXPECT_EQ(GetRealWaitMs(50'000'000'000), 5'000'000'000u);
    EXPECT_EQ(GetRealWaitMs(WaitForEver - 1), (WaitForEver - 1) / 10 + 1);
}

TEST(WaitClockDeathTest, TakesItsDivisorFromItsVariableInANewProcess) {
    testing::FLAGS_gtest_death_test_style = "threadsafe";
    const ScopedVariable variable("ZENTARA_WAIT_DIVISOR", "1000");

    EXPECT_EXIT(std::_Exit(static_cast<int>(GetRealWaitMs(5000))), testing::ExitedWithCode(5), "");
    variable.Set("none");
    EXPECT_EXIT(std::_Exit(static_cast<int>(GetRealWaitMs(100))), testing::ExitedWithCode(100), "");
}

TEST(MonotonicClock, NeverGoesBack) {
    std::uint64_t former = GetMonotonicMicroseconds();
    for (int i = 0; i < 1000; ++i) {
        const std::uint64_t now = GetMonotonicMicroseconds();
        ASSERT_GE(now, former);
        former = now;
    }
}

TEST(SystemTime, CountsTicksOf100NanosecondsSince1601) {
    using std::chrono::system_clock;
    constexpr std::uint64_t SecondsFrom1601To1970 = 11'644'473'600;

    const std::uint64_t before =
        static_cast<std::uint64_t>(system_clock::to_time_t(system_clock::now()));
    const std::uint64_t seconds = GetSystemTimeTicks() / 10'000'000 - SecondsFrom1601To1970;
    const std::uint64_t after =
        static_cast<std::uint64_t>(system_clock::to_time_t(system_clock::now()));

    EXPECT_GE(seconds, before);
    EXPECT_LE(seconds, after);
}

TEST(LocalTimeOfDay, LiesWithinADay) {
    const LocalTime time = GetLocalTime24();

    EXPECT_LT(time.hour, 24);
    EXPECT_LT(time.minute, 60);
    EXPECT_LE(time.second, 60);
    EXPECT_LT(time.millisecond, 1000);
}

}  // namespace
}  // namespace ZV
