#include "hal/platform/win32/handle_wait.h"

#include <gtest/gtest.h>

namespace ZV::Test {
namespace {

constexpr std::uint64_t ShortMs = 50;
constexpr std::uint64_t LongMs = 60000;

/// A handle that is signalled after a short while.
class HandleWait : public testing::Test {
  protected:
    HandleWait() {
        LARGE_INTEGER due;
        due.QuadPart = -static_cast<LONGLONG>(ShortMs) * 10000;
        EXPECT_TRUE(SetWaitableTimer(timer, &due, 0, nullptr, nullptr, FALSE));
    }
    ~HandleWait() override {
        CloseHandle(timer);
        CloseHandle(event);
    }

    HANDLE timer = CreateWaitableTimerA(nullptr, TRUE, nullptr);
    HANDLE event = CreateEventA(nullptr, TRUE, FALSE, nullptr);
};

TEST_F(HandleWait, OfSeveralSlicesLastsAsLongAsAllOfThem) {
    const ULONGLONG start = GetTickCount64();

    EXPECT_EQ(DWORD{WAIT_TIMEOUT}, WaitForHandles(1, &event, 2 * ShortMs, /*sliceMsMax=*/7));

    // The count of ticks moves in steps.
    EXPECT_GE(GetTickCount64() - start, 2 * ShortMs - 20);
}

TEST_F(HandleWait, SeesASignalInALaterSlice) {
    EXPECT_EQ(DWORD{WAIT_OBJECT_0}, WaitForHandles(1, &timer, LongMs, /*sliceMsMax=*/3));
}

TEST_F(HandleWait, BeyondThirtyTwoBitsOfMillisecondsIsNotCut) {
    EXPECT_EQ(DWORD{WAIT_OBJECT_0}, WaitForHandles(1, &timer, std::uint64_t{1} << 32));
}

}  // namespace
}  // namespace ZV::Test
