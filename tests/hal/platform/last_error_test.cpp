#include "hal/platform/last_error.h"

#include <gtest/gtest.h>

#include <cstring>

#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::TestThread;

TEST(LastPlatformError, IsWhatWasSetLast) {
    SetLastPlatformError(PlatformErrorBusy);

    EXPECT_EQ(GetLastPlatformError(), PlatformErrorBusy);
}

TEST(LastPlatformError, BelongsToItsThread) {
    SetLastPlatformError(PlatformErrorBusy);
    std::uint32_t ofOtherThread = PlatformErrorBusy;

    {
        const TestThread other([&ofOtherThread] {
            ofOtherThread = GetLastPlatformError();
            SetLastPlatformError(PlatformErrorBadLength);
        });
    }

    EXPECT_EQ(ofOtherThread, PlatformErrorNone);
    EXPECT_EQ(GetLastPlatformError(), PlatformErrorBusy);
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

TEST(PlatformErrorText, IsCutToItsBufferAndTerminated) {
    char text[6] = {'x', 'x', 'x', 'x', 'x', 'x'};

    EXPECT_TRUE(GetPlatformErrorText(PlatformErrorInvalidParameter, text, 4));

    EXPECT_EQ(std::strlen(text), 3u);
    EXPECT_EQ(text[4], 'x');
}

}  // namespace
}  // namespace ZV
