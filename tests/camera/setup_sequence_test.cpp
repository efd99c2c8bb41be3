#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <vector>

#include "camera/test_camera.h"

namespace ZV::Test {

TEST(TweakedSetup, ReadsTheConfigurationAgainBehindMiscCtrlAndAtTheTakeOver) {
    const SimulationWorld world("model:TirelM1");
    std::vector<ZCamera*> cameras;

    ASSERT_EQ(CameraOk, ZCamera::GetCameraList(cameras));

    std::uint64_t shortest = ~std::uint64_t{0};
    std::size_t wholeReads = 0;
    for (const TraceRecord& request : world.ReadRequests()) {
        if (request.name == "FW_IOCTL_ASYNC_READ")
            shortest = std::min(shortest, request.outputBytes);
    }
    for (const TraceRecord& request : world.ReadRequests()) {
        if (request.name != "FW_IOCTL_ASYNC_READ") continue;
        wholeReads += request.outputBytes == shortest + 4 * (210 - 1) ? 1 : 0;
    }
    EXPECT_EQ(3u, wholeReads) << "once when listed, once behind MiscCtrl, once at the end";
    (void)ZCamera::FreeCameraList(cameras);
}

}  // namespace ZV::Test
