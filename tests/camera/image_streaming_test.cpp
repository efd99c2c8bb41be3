#include <gtest/gtest.h>

#include <atomic>
#include <cstdint>

#include "camera/test_camera.h"
#include "hal/platform/clock.h"
#include "imaging/ex_image.h"

namespace ZV::Test {

/// The reference of the callback with this number; it counts those who came to the wrong one.
struct NumberedReference {
    int number;
    std::atomic<std::uint32_t> calls{0}, wrongCalls{0};
};

template <int Number>
void* ReceiveNumbered(ZImageReceivedCallbackStruct* record) {
    auto& reference = *static_cast<NumberedReference*>(record->refCon);
    ++(reference.number == Number ? reference.calls : reference.wrongCalls);
    ZCamera::FreeImage(record->image);
    return nullptr;
}

class OneStreamingCamera : public CameraWorld, public testing::Test {
  protected:
    OneStreamingCamera() : CameraWorld(SmallCamera) {}
    void SetUp() override {
        ASSERT_NE(nullptr, camera);
        ASSERT_EQ(CameraOk, camera->Ready());
    }
    void TearDown() override {
        EXPECT_EQ(CameraOk, camera->CloseCamera());
        EXPECT_EQ(0u, world.GetState().openHandles);
        EXPECT_EQ(0u, world.GetState().reservedBandwidths);
    }

    CameraResult Start() {
        return camera->StartStreamingImages(TestClient::ReceiveImage, TestClient::ExposeDone, false,
                                            &client);
    }
    bool AwaitMoreImages(TestClient& of, std::uint32_t count = 2) {
        const std::uint32_t before = of.GetImageCount();
        return WaitUntil([&] { return of.GetImageCount() >= before + count; });
    }

    NumberedReference first{1}, second{2};
    TestClient client;
    TestClient other;  // lasts until the close, as whatever a stream writes to must
};

TEST_F(OneStreamingCamera, StreamsImagesUntilItIsStopped) {
    ASSERT_EQ(CameraOk, Start());
    EXPECT_TRUE(camera->IsCameraStreaming());
    EXPECT_TRUE(AwaitMoreImages(client, 5));
    EXPECT_TRUE(WaitUntil([&] { return client.GetExposeCount() > 0; }));

    EXPECT_EQ(CameraOk, camera->StopStreamingImages());

    EXPECT_FALSE(camera->IsCameraStreaming());
    EXPECT_TRUE(WaitUntil([&] { return !client.isInCallback; }));
    for (const TestClient::Delivery& delivery : client.GetDeliveries()) {
        EXPECT_TRUE(delivery.hasImage);
        EXPECT_EQ(64u * 48u, delivery.size);
    }
}

TEST_F(OneStreamingCamera, KeepsTheFirstCallbackWhenItIsStartedASecondTime) {
    ASSERT_EQ(CameraOk, Start());

    EXPECT_EQ(CameraOk,
              camera->StartStreamingImages(TestClient::ReceiveImage, nullptr, false, &other));

    EXPECT_TRUE(AwaitMoreImages(client));
    EXPECT_EQ(0u, other.GetImageCount());
}

TEST_F(OneStreamingCamera, CallsEachCallbackWithItsOwnReferenceWhileAClientReplacesThem) {
    ASSERT_EQ(CameraOk, camera->StartStreamingImages(ReceiveNumbered<1>, nullptr, false, &first));

    const auto replace = [&](int rounds) {
        for (int i = 0; i < rounds; ++i) {
            camera->SetStreamingCallback(ReceiveNumbered<2>, &second);
            camera->SetStreamingCallback(ReceiveNumbered<1>, &first);
        }
    };
    EXPECT_TRUE(WaitUntil([&] {
        replace(500);
        return first.calls + second.calls >= 200;
    }));

    EXPECT_EQ(0u, first.wrongCalls + second.wrongCalls);
}

TEST_F(OneStreamingCamera, TakesANewParameterSetNumberForEachStart) {
    const std::uint32_t before = camera->GetPSN();

    for (std::uint32_t start = 1; start <= 3; ++start) {
        ASSERT_EQ(CameraOk, Start());
        EXPECT_EQ((before + start) & 0xFF, camera->GetPSN());
        EXPECT_TRUE(AwaitMoreImages(client, 1));
        ASSERT_EQ(CameraOk, camera->StopStreamingImages());
    }
}

TEST_F(OneStreamingCamera, WrapsTheParameterSetNumberAfter255) {
    ASSERT_EQ(CameraOk, camera->SetPSN(255));

    ASSERT_EQ(CameraOk, Start());

    EXPECT_EQ(0u, camera->GetPSN());
    EXPECT_TRUE(AwaitMoreImages(client));
}

TEST_F(OneStreamingCamera, WritesItsStartAndStopInOrder) {
    (void)TakeWrites();

    ASSERT_EQ(CameraOk, Start());
    ASSERT_EQ(CameraOk, camera->StopStreamingImages());

    const std::vector<RegisterWrite> writes = TakeWrites();
    ASSERT_EQ(6u, writes.size());
    EXPECT_EQ(ControlAddress + 80, writes[0].address) << "packet size";
    EXPECT_EQ(CommandAddress + 4, writes[1].address) << "take over";
    EXPECT_EQ(ControlAddress + 4, writes[2].address) << "parameter set number";
    EXPECT_EQ(CommandAddress + 4, writes[3].address) << "take over";
    EXPECT_EQ(StreamAddress + 4, writes[4].address) << "stream switch";
    EXPECT_EQ(1u, writes[4].values[0] & 1u);
    EXPECT_EQ((RegisterWrite{StreamAddress + 4, {0}, 0}), writes[5]) << "switched off last";
}

TEST_F(OneStreamingCamera, CarriesOnWhenTheParameterSetNumberCannotBeWritten) {
    ASSERT_TRUE(world.AddFault(
        R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "address": "0xD0002004"})"));

    EXPECT_EQ(CameraOk, Start());

    EXPECT_TRUE(camera->IsCameraStreaming());
}

TEST_F(OneStreamingCamera, StaysMarkedAsStreamingWhenTheStartFailsAtTheStreamSwitch) {
    ASSERT_TRUE(world.AddFault(
        R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "address": "0xD0005004"})"));

    EXPECT_EQ(CameraHalFault, Start());

    EXPECT_TRUE(camera->IsCameraStreaming());
    EXPECT_EQ(CameraOk, Start()) << "streaming is already on";
    SetWaitClockDivisor(1000);  // no packets come, so that the stop waits its five seconds
    EXPECT_EQ(CameraOk, camera->StopStreamingImages());
    SetWaitClockDivisor(1);
    EXPECT_FALSE(camera->IsCameraStreaming());
}

TEST_F(OneStreamingCamera, GivesTheLockThatAFailedStopHasNotTaken) {
    ASSERT_EQ(CameraOk, Start());
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_STOP"})"));

    EXPECT_NE(CameraOk, camera->StopStreamingImages());

    HALSemaphore* const lock = camera->streaming.streamLock;
    EXPECT_EQ(HALOk, HAL_SemaphoreWait(lock));
    EXPECT_EQ(HALOk, HAL_SemaphoreWait(lock)) << "kept: one more than there should be";
    EXPECT_EQ(HALOk, HAL_SemaphoreSignal(lock));
    EXPECT_EQ(HALOk, HAL_SemaphoreSignal(lock));
    EXPECT_EQ(CameraOk, camera->StopStreamingImages());
}

TEST_F(OneStreamingCamera, ReturnsAFailedTakeOverAndDoesNotStream) {
    ASSERT_TRUE(world.AddFault(
        R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "address": "0xD0003004",
            "request": 2})"));

    EXPECT_EQ(CameraHalFault, Start());

    EXPECT_FALSE(camera->IsCameraStreaming());
    EXPECT_EQ(CameraOk, Start());
}

TEST_F(OneStreamingCamera, FailsAStartWithoutBandwidthAs7) {
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ALLOC_BANDWIDTH"})"));

    EXPECT_EQ(CameraBandwidthFault, Start());

    EXPECT_FALSE(camera->IsCameraStreaming());
}

TEST_F(OneStreamingCamera, RefusesASoftwareTriggerWhileItDoesNotStreamEvenInItsMode) {
    EXPECT_EQ(CameraNotStreaming, camera->SoftwareTrigger());
    ASSERT_EQ(CameraOk, camera->SetTriggerMode(5));

    EXPECT_EQ(CameraNotStreaming, camera->SoftwareTrigger());
}

TEST_F(OneStreamingCamera, RefusesASoftwareTriggerInAnotherMode) {
    ASSERT_EQ(CameraOk, Start());

    EXPECT_EQ(CameraNotSoftwareTriggered, camera->SoftwareTrigger());
}

TEST_F(OneStreamingCamera, TakesOneImageForEachSoftwareTrigger) {
    ASSERT_EQ(CameraOk, camera->SetTriggerMode(5));
    ASSERT_EQ(CameraOk, camera->UpdateSettingsOnCamera());
    ASSERT_EQ(CameraOk, Start());

    for (std::uint32_t trigger = 1; trigger <= 3; ++trigger) {
        ASSERT_EQ(CameraOk, camera->SoftwareTrigger());
        EXPECT_TRUE(WaitUntil([&] { return client.GetImageCount() == trigger; })) << trigger;
    }
}

TEST_F(OneStreamingCamera, MakesFramesUnderWayFailWhenTheROIChanges) {
    ASSERT_EQ(CameraOk, Start());
    ASSERT_TRUE(AwaitMoreImages(client));

    ASSERT_EQ(CameraOk, camera->SetROIWidth(32));
    EXPECT_FALSE(camera->IsCameraStreaming());
    ASSERT_EQ(CameraOk, camera->UpdateSettingsOnCamera());

    EXPECT_TRUE(camera->IsCameraStreaming());
    ASSERT_TRUE(AwaitMoreImages(client, 3));
    for (const TestClient::Delivery& delivery : client.GetDeliveries()) {
        EXPECT_EQ(delivery.size, delivery.width * delivery.height);
    }
    EXPECT_EQ(32u, client.GetDeliveries().back().width);
}

TEST_F(OneStreamingCamera, DeliversTheFrameThatStayedBehindFirstAfterTheNextStart) {
    client.isBlocked = true;
    ASSERT_EQ(CameraOk, Start());
    ASSERT_TRUE(WaitUntil([&] { return client.isInCallback.load(); }));
    ASSERT_TRUE(WaitUntil([&] { return camera->streaming.frameQueue.GetCount() == 2; }));
    ASSERT_EQ(CameraOk, camera->StopStreamingImages());
    ASSERT_EQ(1u, camera->streaming.frameQueue.GetCount());
    client.isBlocked = false;
    ASSERT_TRUE(WaitUntil([&] { return client.GetImageCount() == 1; }));

    ASSERT_EQ(CameraOk,
              camera->StartStreamingImages(TestClient::ReceiveImage, nullptr, false, &other));

    ASSERT_TRUE(AwaitMoreImages(other, 2));
}

TEST_F(OneStreamingCamera, RaisesTheParameterSetNumberToIgnoreAFrame) {
    const std::uint32_t before = camera->GetPSN();

    EXPECT_EQ(CameraOk, camera->IgnoreNextFrame());

    EXPECT_EQ(before + 1, camera->GetPSN());
}

TEST_F(OneStreamingCamera, ClosesWhileItStreams) {
    ASSERT_EQ(CameraOk, Start());
    ASSERT_TRUE(AwaitMoreImages(client));

    EXPECT_EQ(CameraOk, camera->CloseCamera());

    EXPECT_FALSE(camera->IsCameraStreaming());
    EXPECT_EQ(0u, world.GetState().pendedRequests);
    ASSERT_EQ(CameraOk, camera->OpenCamera());
}

TEST_F(OneStreamingCamera, TakesOneImageAndStopsAgain) {
    ZExImage* image = nullptr;

    ASSERT_EQ(CameraOk, camera->GetOneImage(&image));

    ASSERT_NE(nullptr, image);
    EXPECT_EQ(64u, image->GetWidth());
    EXPECT_FALSE(camera->IsCameraStreaming());
    ZCamera::FreeImage(image);
}

TEST_F(OneStreamingCamera, TakesManySingleImagesWithoutMissingOne) {
    for (int shot = 0; shot < 20; ++shot) {
        ZExImage* image = nullptr;
        ASSERT_EQ(CameraOk, camera->GetOneImage(&image)) << shot;
        ZCamera::FreeImage(image);
    }
}

TEST_F(OneStreamingCamera, TakesOneImageFromAStreamWithoutStoppingIt) {
    ASSERT_EQ(CameraOk, Start());
    ASSERT_TRUE(AwaitMoreImages(client));
    ZExImage* image = nullptr;

    ASSERT_EQ(CameraOk, camera->GetOneImage(&image));

    ASSERT_NE(nullptr, image);
    ZCamera::FreeImage(image);
    EXPECT_TRUE(camera->IsCameraStreaming());
    EXPECT_TRUE(AwaitMoreImages(client)) << "the client's callback is back";
}

TEST_F(OneStreamingCamera, GivesTheClientNoFrameWhileASingleImageIsWaitedFor) {
    ASSERT_EQ(CameraOk, camera->SetTriggerMode(5));
    ASSERT_EQ(CameraOk, camera->UpdateSettingsOnCamera());
    ASSERT_EQ(CameraOk, Start());
    ZExImage* image = nullptr;
    std::thread taker([&] { EXPECT_EQ(CameraOk, camera->GetOneImage(&image)); });
    ASSERT_TRUE(WaitUntil(
        [&] { return camera->streaming.callbacks.Get().refCon != static_cast<void*>(&client); }));

    EXPECT_EQ(CameraOk, camera->SoftwareTrigger());
    taker.join();

    EXPECT_NE(nullptr, image);
    EXPECT_EQ(0u, client.GetImageCount());
    ZCamera::FreeImage(image);
}

TEST_F(OneStreamingCamera, EndsTheWaitForASingleImageByAnAbortWithoutAnImage) {
    ASSERT_EQ(CameraOk, camera->SetTriggerMode(5));
    ASSERT_EQ(CameraOk, camera->UpdateSettingsOnCamera());
    ASSERT_EQ(CameraOk, camera->Abort());
    ZExImage* image = nullptr;
    CameraResult result = CameraOk;
    std::thread taker([&] { result = camera->GetOneImage(&image); });
    ASSERT_TRUE(WaitUntil([&] { return camera->IsCameraStreaming(); }));

    EXPECT_EQ(CameraOk, camera->Abort());
    taker.join();

    EXPECT_EQ(CameraNoImage, result);
    EXPECT_EQ(nullptr, image);
    EXPECT_FALSE(camera->IsCameraStreaming());
}

}  // namespace ZV::Test
