#include "hal/platform/last_error.h"

#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <thread>

#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::TestThread;

TEST(LastPlatformError, IsWhatWasSetLast) {
    SetLastPlatformError(PlatformErrorBusy);

    EXPECT_EQ(GetLastPlatformError(), PlatformErrorBusy);
}

// Nothing but the other thread comes between the setting and the look: making a thread or waiting
// for it may have an error of its own.
TEST(LastPlatformError, BelongsToItsThread) {
    std::atomic<bool> isOwnSet{false}, isOtherSet{false};
    std::uint32_t ofOtherThread = PlatformErrorBusy;
    std::uint32_t ofOwnThread = PlatformErrorNone;

    {
        const TestThread other([&] {
            while (!isOwnSet) std::this_thread::yield();
            ofOtherThread = GetLastPlatformError();
            SetLastPlatformError(PlatformErrorBadLength);
            isOtherSet = true;
        });
        SetLastPlatformError(PlatformErrorBusy);
        isOwnSet = true;
        while (!isOtherSet) std::this_thread::yield();
        ofOwnThread = GetLastPlatformError();
    }

    EXPECT_EQ(ofOtherThread, PlatformErrorNone);
    EXPECT_EQ(ofOwnThread, PlatformErrorBusy);
}

TEST(PlatformErrorText, StandsForEveryErrorOfTheSeam) {
    constexpr std::uint32_t Errors[] = {PlatformErrorFileNotFound,
                                        PlatformErrorAccessDenied,
                                        PlatformErrorInvalidHandle,
                                        PlatformErrorNotEnoughMemory,
                                        PlatformErrorBadLength,
                                        PlatformErrorGeneralFailure,
                                        PlatformErrorInvalidParameter,
                                        PlatformErrorInsufficientBuffer,
                                        PlatformErrorBusy,
                                        PlatformErrorNoMoreItems,
                                        PlatformErrorNotOwner,
                                        PlatformErrorOperationAborted,
                                        PlatformErrorIoPending,
                                        PlatformErrorDeviceNotConnected,
                                        PlatformErrorNoSystemResources};
    for (const std::uint32_t error : Errors) {
        char text[256] = "";
        EXPECT_TRUE(GetPlatformErrorText(error, text, sizeof text)) << error;
        EXPECT_GT(std::strlen(text), 0u) << error;
    }
}

TEST(PlatformErrorText, IsEmptyForANumberThatTheSystemDoesNotKnow) {
    char text[64] = "before";

    EXPECT_FALSE(GetPlatformErrorText(0xFFFFFFFE, text, sizeof text));
    EXPECT_STREQ(text, "");
}

TEST(PlatformErrorText, LeavesTheLastErrorThatItIsAskedFor) {
    char text[256] = "";

    for (const std::uint32_t error : {PlatformErrorBusy, std::uint32_t{0xFFFFFFFE}}) {
        SetLastPlatformError(error);
        (void)GetPlatformErrorText(error, text, sizeof text);

        EXPECT_EQ(GetLastPlatformError(), error);
    }
}

TEST(PlatformErrorText, IsCutToItsBufferAndTerminated) {
    char text[6] = {'x', 'x', 'x', 'x', 'x', 'x'};

    EXPECT_TRUE(GetPlatformErrorText(PlatformErrorInvalidParameter, text, 4));

    EXPECT_EQ(std::strlen(text), 3u);
    EXPECT_EQ(text[4], 'x');
}

}  // namespace
}  // namespace ZV
