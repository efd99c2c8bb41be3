#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <thread>

#include "camera/bare_camera.h"
#include "camera/test_camera.h"
#include "hal/platform/clock.h"
#include "imaging/ex_image.h"

namespace ZV::Test {
namespace {

constexpr std::uint64_t WaitBase = 5000000000;

/// A camera without a device that exposes as a test says.
class AnyExposure : public AnyBoard {
  public:
    using AnyBoard::AnyBoard;
    std::uint64_t GetExposure() override { return 1000; }
    std::uint64_t GetRGBFilterRedExposure() override { return 20000; }
    std::uint64_t GetRGBFilterBlueExposure() override { return 300000; }
    bool GetRGBFilterCycleMode() override { return cyclesFilters; }
    bool IsInterlaced() override { return isInterlaced; }
    using MorvaneFWCamera::CalculateOneImageWait;

    bool cyclesFilters = false, isInterlaced = false;
};

TEST(OneImageWait, IsFiveSecondsAndTwoExposures) {
    BareCamera<AnyExposure> camera;

    EXPECT_EQ(WaitBase + 2 * 1000, camera.CalculateOneImageWait());
}

TEST(OneImageWait, IsFiveSecondsAndThreeExposuresOfAnInterlacedCamera) {
    BareCamera<AnyExposure> camera;
    camera.isInterlaced = true;

    EXPECT_EQ(WaitBase + 3 * 1000, camera.CalculateOneImageWait());
}

TEST(OneImageWait, IsFiveSecondsAndTheThreeExposuresOfACyclingWheel) {
    BareCamera<AnyExposure> camera;
    camera.cyclesFilters = true;
    camera.isInterlaced = true;

    EXPECT_EQ(WaitBase + 1000 + 20000 + 300000, camera.CalculateOneImageWait());
}

/// Images come only for a trigger, and five seconds pass in no time.
class OneImageThatDoesNotCome : public CameraWorld, public testing::Test {
  protected:
    OneImageThatDoesNotCome() : CameraWorld(SmallCamera) {}
    void SetUp() override {
        ASSERT_NE(nullptr, camera);
        ASSERT_EQ(CameraOk, camera->Ready());
        ASSERT_EQ(CameraOk, camera->SetTriggerMode(5));
        ASSERT_EQ(CameraOk, camera->UpdateSettingsOnCamera());
    }
    void TearDown() override {
        SetWaitClockDivisor(1);
        EXPECT_EQ(CameraOk, camera->CloseCamera());
    }
    CameraResult WaitInVain() {
        // Kept: the limit stands in nanoseconds and is waited for in microseconds.
        SetWaitClockDivisor(1000000);
        ZExImage* image = nullptr;
        const CameraResult result = camera->GetOneImage(&image);
        SetWaitClockDivisor(1);
        EXPECT_EQ(nullptr, image);
        return result;
    }
    bool HoldsOneImage() {
        const std::lock_guard hold(camera->streaming.oneImageMutex);
        return camera->streaming.oneImage != nullptr;
    }

    TestClient client;
};

TEST_F(OneImageThatDoesNotCome, LeavesTheNextImageOfTheStreamToTheSingleImageCallback) {
    ASSERT_EQ(CameraOk,
              camera->StartStreamingImages(TestClient::ReceiveImage, nullptr, false, &client));

    EXPECT_NE(CameraOk, WaitInVain());
    ASSERT_EQ(CameraOk, camera->SoftwareTrigger());

    EXPECT_TRUE(WaitUntil([&] { return HoldsOneImage(); }));
    EXPECT_EQ(0u, client.GetImageCount());
}

TEST_F(OneImageThatDoesNotCome, LeavesTheStreamOnThatItHasStarted) {
    EXPECT_NE(CameraOk, WaitInVain());

    EXPECT_TRUE(camera->IsCameraStreaming());
}

TEST_F(OneImageThatDoesNotCome, LeavesNothingOfALateImageToTheNextCall) {
    ASSERT_EQ(CameraOk,
              camera->StartStreamingImages(TestClient::ReceiveImage, nullptr, false, &client));
    ASSERT_NE(CameraOk, WaitInVain());
    ASSERT_EQ(CameraOk, camera->SoftwareTrigger());
    ASSERT_TRUE(WaitUntil([&] { return HoldsOneImage(); }));

    EXPECT_NE(CameraOk, WaitInVain()) << "the late image's signal is taken back";

    EXPECT_FALSE(HoldsOneImage());
}

/// Late images pour in on another thread while one image after the other is asked for. Whatever
/// the call makes of them, a signal never stands without its image.
TEST_F(OneImageThatDoesNotCome, ALateImageNeverLeavesItsSignalWithoutItself) {
    constexpr int Rounds = 300;
    ASSERT_EQ(CameraOk,
              camera->StartStreamingImages(TestClient::ReceiveImage, nullptr, false, &client));
    ASSERT_NE(CameraOk, WaitInVain());
    const StreamCallbacks single = camera->streaming.callbacks.Get();
    ASSERT_NE(static_cast<void*>(&client), single.refCon);
    std::atomic<bool> isOver{false};
    std::thread late([&] {
        while (!isOver) {
            auto* const pixels = static_cast<std::uint8_t*>(std::malloc(16));
            ZImageReceivedCallbackStruct record{
                new ZExImage(pixels, 16, 4, 4, 8, 1000, 1.0, Mono8, CameraMono, PatternRed, 0,
                             false, 5, 0, 1, false, 1, 0, nullptr, true),
                single.refCon, 0};
            (void)single.image(&record);
        }
    });

    for (int round = 0; round < Rounds; ++round) {
        ZExImage* image = nullptr;
        EXPECT_EQ(CameraOk, camera->GetOneImage(&image)) << round;
        EXPECT_NE(nullptr, image) << round;
        ZCamera::FreeImage(image);
    }

    isOver = true;
    late.join();
}

}  // namespace
}  // namespace ZV::Test
