#include <gtest/gtest.h>

#include <string>

#include "api/failing_memory.h"
#include "camera/camera_result.h"
#include "hal/hal.h"
#include "hal/platform/last_error.h"
#include "imaging/rgb_filter_wheel.h"

namespace ZV::Test {
namespace {

TEST(WheelWithoutMemory, ForItsSemaphoreFailsEachFrameAndMayStillBeReset) {
    FailAllocation(1);
    ZRGBFilterWheel wheel(zfmtRGB24);
    EXPECT_EQ(0U, EndFailingAllocation());
    ZInImageBufferStruct in;
    ZOutImageBufferStruct out;

    EXPECT_EQ(CameraHalFault, wheel.Process(&in, &out));
    EXPECT_EQ(FilterDone, wheel.Init(4, 4));
    wheel.Reset();
    wheel.Disable();
    wheel.Enable();
    EXPECT_EQ(CameraHalFault, wheel.Process(&in, &out));
}

TEST(WheelWithoutMemory, ForItsSemaphorePrintsTheTextOfTheLastErrorForEachFrame) {
    FailAllocation(1);
    ZRGBFilterWheel wheel(zfmtRGB24);
    ASSERT_EQ(0U, EndFailingAllocation());
    ZInImageBufferStruct in;
    ZOutImageBufferStruct out;
    SetLastPlatformError(PlatformErrorAccessDenied);
    const std::string text = HAL_ErrorMessage(HALSemaphoreFailed);
    ASSERT_FALSE(text.empty());
    testing::internal::CaptureStdout();
    // To capture makes a file, which may change the last error.
    SetLastPlatformError(PlatformErrorAccessDenied);

    const FilterResult first = wheel.Process(&in, &out);
    const FilterResult second = wheel.Process(&in, &out);

    EXPECT_EQ(text + text, testing::internal::GetCapturedStdout());
    EXPECT_EQ(CameraHalFault, first);
    EXPECT_EQ(CameraHalFault, second);
}

}  // namespace
}  // namespace ZV::Test
