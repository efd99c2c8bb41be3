#include <gtest/gtest.h>

#include "api/failing_memory.h"
#include "camera/camera_result.h"
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

}  // namespace
}  // namespace ZV::Test
