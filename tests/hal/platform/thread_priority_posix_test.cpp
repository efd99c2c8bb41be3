#include <gtest/gtest.h>
#include <sched.h>
#include <sys/resource.h>

#include "hal/platform/thread.h"
#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::TestThread;

struct Scheduling {
    int policy = -1;
    int priority = -1;
    bool operator==(const Scheduling&) const = default;
};

Scheduling ReadOwnScheduling() {
    sched_param parameters{};
    sched_getparam(0, &parameters);
    return {sched_getscheduler(0), parameters.sched_priority};
}

TEST(ThreadPriority, IsRoundRobinOneForARealDeviceOrLeftAloneWhereTheSystemRefuses) {
    Scheduling before, after;
    bool isAllowed = false;
    {
        const TestThread probe([&] {
            const sched_param parameters{1};
            isAllowed = sched_setscheduler(0, SCHED_RR | SCHED_RESET_ON_FORK, &parameters) == 0;
        });
    }
    {
        const TestThread thread([&] {
            before = ReadOwnScheduling();
            RaiseOwnThreadPriority(true);
            after = ReadOwnScheduling();
        });
    }

    const Scheduling raised{SCHED_RR | SCHED_RESET_ON_FORK, 1};
    EXPECT_EQ(after, isAllowed ? raised : before);
}

TEST(ThreadPriority, IsLeftAloneForASimulatedDevice) {
    Scheduling before, after;
    {
        const TestThread thread([&] {
            before = ReadOwnScheduling();
            RaiseOwnThreadPriority(false);
            after = ReadOwnScheduling();
        });
    }

    EXPECT_EQ(after, before);
}

TEST(ProcessPriority, IsLeftAlone) {
    const int before = getpriority(PRIO_PROCESS, 0);

    RaiseProcessPriority(true);
    EXPECT_EQ(getpriority(PRIO_PROCESS, 0), before);
    LowerProcessPriority(true);

    EXPECT_EQ(getpriority(PRIO_PROCESS, 0), before);
}

}  // namespace
}  // namespace ZV
