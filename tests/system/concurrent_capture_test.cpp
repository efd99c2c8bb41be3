#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

#include "support/flat_camera.h"

namespace ZV::Test {
namespace {

class ConcurrentCapture : public OpenedCamera {
  protected:
    /// Ends every wait for an image until `hasEnded`.
    bool AbortUntil(const std::atomic<bool>& hasEnded) {
        return WaitUntil(
            [&] {
                EXPECT_ZERR(zerrNone, Zentara_Abort(handle));
                return hasEnded.load();
            },
            std::chrono::seconds(20));
    }
};

TEST_F(ConcurrentCapture, TwoClientsMaySwitchTheStreamWhileAThirdGrabs) {
    constexpr int Rounds = 40;
    ClientFrame frame(GetImageBytes());
    std::atomic<bool> isOver{false};
    std::atomic<bool> hasEnded{false};
    std::thread grabbing([&] {
        while (!isOver) {
            // A grab whose stream another client has switched off waits until the abort.
            const ZentaraResult result = Zentara_GrabFrame(handle, frame.Get());
            EXPECT_TRUE(result == zerrNone || result == zerrDriverFault) << result;
        }
        hasEnded = true;
    });
    std::vector<std::thread> switching;
    for (std::uint32_t first = 0; first < 2; ++first) {
        switching.emplace_back([&, first] {
            for (std::uint32_t round = 0; round < Rounds; ++round) {
                EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, (first + round) % 2));
            }
        });
    }

    for (std::thread& client : switching) client.join();
    isOver = true;
    EXPECT_TRUE(AbortUntil(hasEnded));
    grabbing.join();

    EXPECT_ZERR(zerrNone, Zentara_SetStreaming(handle, 0));
    EXPECT_TRUE(frame.IsGuardIntact());
    EXPECT_EQ(0u, world.GetState().attachedBuffers);
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get())) << "the camera works on";
}

}  // namespace
}  // namespace ZV::Test
