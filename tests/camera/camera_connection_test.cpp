#include <gtest/gtest.h>

#include "camera/test_camera.h"
#include "hal/fw_device_context.h"
#include "hal/platform/clock.h"
#include "imaging/ex_image.h"

namespace ZV::Test {

class OneClosedCamera : public CameraWorld, public testing::Test {
  protected:
    OneClosedCamera() : CameraWorld(SmallCamera) {}
    void SetUp() override { ASSERT_NE(nullptr, camera); }

    std::size_t CountConnected() {
        return TestCamera::m_connectedCameras != nullptr ? TestCamera::m_connectedCameras->size()
                                                         : 0;
    }
};

TEST_F(OneClosedCamera, IsConnectedWhileItIsOpen) {
    ASSERT_EQ(CameraOk, camera->OpenCamera());
    EXPECT_TRUE(camera->IsCameraOpen());
    EXPECT_TRUE(camera->DoWeHaveExclusiveAccess());
    EXPECT_EQ(1u, CountConnected());
    EXPECT_EQ(1, TestCamera::m_numOfConnectedCameras);
    EXPECT_EQ(1u, world.GetState().openHandles);

    EXPECT_EQ(CameraOk, camera->CloseCamera());

    EXPECT_FALSE(camera->IsCameraOpen());
    EXPECT_FALSE(camera->DoWeHaveExclusiveAccess());
    EXPECT_EQ(0u, CountConnected());
    EXPECT_EQ(0, TestCamera::m_numOfConnectedCameras);
    EXPECT_EQ(0u, world.GetState().openHandles);
    EXPECT_EQ(0u, world.GetState().reservedChannels);
}

TEST_F(OneClosedCamera, PrintsALineForAnOverrunAndGoesOn) {
    ASSERT_EQ(CameraOk, camera->OpenCamera());
    const StreamAssembler& assembler = GetFWContext(camera->GetHALCamera())->assembler;
    testing::internal::CaptureStdout();

    assembler.overrun(assembler.context);

    EXPECT_EQ("OverrunCB called\n", testing::internal::GetCapturedStdout());
    EXPECT_EQ(CameraOk, camera->CloseCamera());
}

TEST_F(OneClosedCamera, HasNothingToClose) {
    EXPECT_EQ(CameraOk, camera->CloseCamera());

    EXPECT_EQ(0u, world.ReadRegisterWrites().size());
}

TEST_F(OneClosedCamera, OpensAndClosesManyTimesWithoutAHang) {
    for (int round = 0; round < 50; ++round) {
        ASSERT_EQ(CameraOk, camera->OpenCamera()) << round;
        ASSERT_EQ(CameraOk, camera->CloseCamera()) << round;
        EXPECT_EQ(0, camera->streaming.runLoopsAlive);
        EXPECT_EQ(0, camera->streaming.exposeThreadsAlive);
    }
}

TEST_F(OneClosedCamera, ReturnsTheFailureOfAReservationWithoutBeingOpen) {
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ALLOC_BANDWIDTH"})"));

    EXPECT_EQ(CameraBandwidthFault, camera->OpenCamera());

    EXPECT_FALSE(camera->IsCameraOpen());
    EXPECT_EQ(0u, CountConnected());
    camera.reset();
    EXPECT_EQ(0u, world.GetState().openHandles) << "the end of the object ends what is left";
}

TEST_F(OneClosedCamera, StaysMarkedOpenWhenItsCloseFailsAndCanBeClosedAgain) {
    ASSERT_EQ(CameraOk, camera->OpenCamera());
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_FREE_RESOURCES"})"));

    EXPECT_EQ(CameraHalFault, camera->CloseCamera());
    EXPECT_TRUE(camera->IsCameraOpen());
    EXPECT_TRUE(camera->DoWeHaveExclusiveAccess());
    EXPECT_EQ(1u, CountConnected());

    EXPECT_EQ(CameraOk, camera->CloseCamera());
    EXPECT_FALSE(camera->IsCameraOpen());
    EXPECT_EQ(0u, CountConnected());
    EXPECT_EQ(CameraOk, camera->OpenCamera());
    EXPECT_EQ(CameraOk, camera->CloseCamera());
}

TEST_F(OneClosedCamera, EndsItsThreadsAndItsDeviceWhenItIsDeletedOpen) {
    TestClient client;
    ASSERT_EQ(CameraOk, camera->Ready());
    ASSERT_EQ(CameraOk, camera->StartStreamingImages(TestClient::ReceiveImage,
                                                     TestClient::ExposeDone, false, &client));
    ASSERT_TRUE(WaitUntil([&] { return client.GetImageCount() > 3; }));

    camera.reset();

    EXPECT_EQ(0u, world.GetState().openHandles);
    EXPECT_EQ(0u, CountConnected());
    const RegisterWrite last = world.ReadRegisterWrites().back();
    EXPECT_EQ(StreamAddress + 4, last.address);
    EXPECT_EQ(1u, last.values[0] & 1u) << "switched on at the start; no request of its own since";
}

TEST_F(OneClosedCamera, EndsItsThreadsWhenItIsDeletedAfterAFailedClose) {
    TestClient client;
    ASSERT_EQ(CameraOk, camera->Ready());
    ASSERT_EQ(CameraOk, camera->StartStreamingImages(TestClient::ReceiveImage,
                                                     TestClient::ExposeDone, false, &client));
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_STOP"})"));
    ASSERT_EQ(CameraHalFault, camera->CloseCamera());
    EXPECT_TRUE(camera->IsCameraOpen());

    camera.reset();

    EXPECT_EQ(0u, world.GetState().openHandles);
}

TEST_F(OneClosedCamera, WaitsAtItsCloseForAClientInItsCallback) {
    TestClient client;
    client.isBlocked = true;
    ASSERT_EQ(CameraOk, camera->Ready());
    ASSERT_EQ(CameraOk,
              camera->StartStreamingImages(TestClient::ReceiveImage, nullptr, false, &client));
    ASSERT_TRUE(WaitUntil([&] { return client.isInCallback.load(); }));
    std::atomic<bool> isClosed{false};

    std::thread closer([&] {
        EXPECT_EQ(CameraOk, camera->CloseCamera());
        isClosed = true;
    });
    ASSERT_TRUE(WaitUntil([&] { return !camera->streaming.runLoopActive; }));
    ASSERT_TRUE(WaitUntil([&] { return !camera->IsCameraStreaming(); }));
    EXPECT_FALSE(isClosed);
    client.isBlocked = false;
    closer.join();

    EXPECT_TRUE(isClosed);
}

/// A client whose exposure callbacks, or the first one alone, stay inside until the test lets them
/// go.
struct SlowClient {
    std::atomic<std::uint32_t> begun{0}, ended{0};
    std::atomic<bool> mayLeave{false}, isAlwaysSlow{false};

    static void* ExposeDone(void* refCon) {
        auto& client = *static_cast<SlowClient*>(refCon);
        if (client.begun.fetch_add(1) == 0 || client.isAlwaysSlow) {
            EXPECT_TRUE(WaitUntil([&] { return client.mayLeave.load(); }));
        }
        ++client.ended;
        return nullptr;
    }
};

class OneSlowClient : public OneClosedCamera {
  protected:
    void SetUp() override {
        OneClosedCamera::SetUp();
        ASSERT_EQ(CameraOk, camera->OpenCamera());
        EndExposure();
        ASSERT_TRUE(WaitUntil([&] { return client.begun == 1; }));
        SetWaitClockDivisor(1000);
        EXPECT_EQ(CameraOk, camera->CloseCamera()) << "waits five seconds, and not for ever";
        SetWaitClockDivisor(1);
    }
    void EndExposure() {
        camera->streaming.callbacks.Set({nullptr, SlowClient::ExposeDone, &client});
        ASSERT_EQ(HALOk, HAL_ConditionSignal(camera->streaming.exposeDoneCondition));
    }

    bool TakeSignal() {
        return HAL_ConditionTimedWait(camera->streaming.exposeDoneCondition, 0) == HALOk;
    }

    SlowClient client;
};

TEST_F(OneSlowClient, ACameraIsClosedUnderAnExposureCallbackThatLasts) {
    EXPECT_FALSE(camera->IsCameraOpen());
    EXPECT_EQ(0u, world.GetState().openHandles);
    EXPECT_EQ(0u, client.ended);
    EXPECT_TRUE(camera->HasLivingThreads());

    client.mayLeave = true;

    EXPECT_TRUE(WaitUntil([&] { return !camera->HasLivingThreads(); }));
    EXPECT_EQ(1u, client.ended);
}

TEST_F(OneSlowClient, ACameraOpenedAgainHasOneExposeThreadWhenTheOldCallbackReturns) {
    ASSERT_EQ(CameraOk, camera->OpenCamera());
    EndExposure();
    EXPECT_TRUE(WaitUntil([&] { return client.ended == 1; })) << "beside the old one";
    EXPECT_EQ(2, camera->streaming.exposeThreadsAlive);

    client.mayLeave = true;

    EXPECT_TRUE(WaitUntil([&] { return camera->streaming.exposeThreadsAlive == 1; }));
    EndExposure();
    EXPECT_TRUE(WaitUntil([&] { return client.ended == 3; }));
    EXPECT_EQ(CameraOk, camera->CloseCamera());
    EXPECT_FALSE(camera->HasLivingThreads());
}

TEST_F(OneSlowClient, ACameraOpenedAgainTellsOfNoExposureThatOnlyItsCloseHasSignalled) {
    client.isAlwaysSlow = true;
    camera->streaming.callbacks.Set({nullptr, SlowClient::ExposeDone, &client});

    ASSERT_EQ(CameraOk, camera->OpenCamera());

    // A signal that was left is still there, or the thread has taken it to the callback, where it
    // stays: then it is the exposure's own that is still there.
    EXPECT_FALSE(TakeSignal());
    EndExposure();
    ASSERT_TRUE(WaitUntil([&] { return client.begun == 2; }));
    EXPECT_FALSE(TakeSignal());
    client.mayLeave = true;
    EXPECT_TRUE(WaitUntil([&] { return client.ended == 2; }));
    EXPECT_EQ(CameraOk, camera->CloseCamera());
}

TEST_F(OneSlowClient, ACameraDeletedUnderAnExposureCallbackWaitsForIt) {
    ASSERT_EQ(CameraOk, camera->OpenCamera());
    std::atomic<bool> isDeleted{false};
    std::thread deleting([&] {
        camera.reset();
        isDeleted = true;
    });
    EXPECT_FALSE(WaitUntil([&] { return isDeleted.load(); }, std::chrono::milliseconds(50)));

    client.mayLeave = true;
    deleting.join();

    EXPECT_EQ(1u, client.ended);
}

/// A client whose exposure callback starts the stream again behind the stop of a close, as a change
/// of settings may that is made at an exposure's end.
struct LateStarter {
    TestCamera& camera;
    TestClient& client;
    std::atomic<bool> isInside{false};
    CameraResult started = CameraRefused;

    static void* ExposeDone(void* refCon) {
        auto& self = *static_cast<LateStarter*>(refCon);
        if (self.isInside.exchange(true)) return nullptr;
        EXPECT_TRUE(WaitUntil([&] { return !self.camera.IsCameraStreaming(); }));
        self.started = self.camera.StartStreamingImages(TestClient::ReceiveImage, nullptr, false,
                                                        &self.client);
        return nullptr;
    }
};

TEST_F(OneClosedCamera, IsNotLeftStreamingByAStartBehindTheStopOfItsClose) {
    for (const bool failsToStop : {false, true}) {
        TestClient client;
        LateStarter starter{*camera, client};
        ASSERT_EQ(CameraOk, camera->Ready());
        camera->streaming.callbacks.Set({nullptr, LateStarter::ExposeDone, &starter});
        camera->streaming.isStreaming = true;  // for the callback to see the close's stop
        ASSERT_EQ(HALOk, HAL_ConditionSignal(camera->streaming.exposeDoneCondition));
        ASSERT_TRUE(WaitUntil([&] { return starter.isInside.load(); }));
        if (failsToStop) {
            // Nothing runs at the close's own stop, so that the late one meets the fault.
            ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_STOP"})"));
        }

        ASSERT_EQ(CameraOk, camera->CloseCamera());

        EXPECT_EQ(CameraOk, starter.started);
        EXPECT_FALSE(camera->IsCameraStreaming());
        EXPECT_EQ(0u, world.GetState().attachedBuffers);
        if (!failsToStop) {
            EXPECT_EQ(0u, world.GetState().isStreaming);
        }
        ASSERT_EQ(CameraOk, camera->OpenCamera());
        ASSERT_EQ(CameraOk,
                  camera->StartStreamingImages(TestClient::ReceiveImage, nullptr, false, &client));
        EXPECT_TRUE(WaitUntil([&] { return client.GetImageCount() >= 2; }));
        ASSERT_EQ(CameraOk, camera->CloseCamera());
    }
}

TEST(CameraTakenByAnother, ReadsAsOpenAndIsRefused) {
    CameraWorld one(
        R"({"base": "mono", "timeScale": 0, "cameras": [{"held": {"from": 2, "to": 2}}]})");
    ASSERT_NE(nullptr, one.camera);

    EXPECT_EQ(CameraRefused, one.camera->OpenCamera());

    EXPECT_TRUE(one.camera->IsCameraOpen());
    EXPECT_FALSE(one.camera->DoWeHaveExclusiveAccess());
}

TEST(CameraTakenByAnother, TakesNothingOutOfTheConnectedListAtItsClose) {
    CameraWorld mine(SmallCamera);
    ASSERT_EQ(CameraOk, mine.camera->OpenCamera());
    HALCamera record{};  // no device behind it
    record.connected = 1;
    record.kind = 7;
    TestCamera taken(record);
    ASSERT_TRUE(taken.IsCameraOpen());

    EXPECT_EQ(CameraOk, taken.CloseCamera());

    EXPECT_FALSE(taken.IsCameraOpen());
    EXPECT_EQ(1, TestCamera::m_numOfConnectedCameras);
    EXPECT_EQ(CameraOk, mine.camera->CloseCamera());
}

TEST(CameraTakenByAnother, CanBeOpenedOnceItIsFreeAgain) {
    CameraWorld one(
        R"({"base": "mono", "timeScale": 0, "cameras": [{"held": {"from": 2, "to": 2}}]})");
    ASSERT_EQ(CameraRefused, one.camera->OpenCamera());
    ASSERT_EQ(CameraOk, one.camera->CloseCamera());
    EXPECT_FALSE(one.camera->IsCameraOpen());

    EXPECT_EQ(CameraOk, one.camera->OpenCamera());

    EXPECT_TRUE(one.camera->DoWeHaveExclusiveAccess());
    EXPECT_EQ(CameraOk, one.camera->CloseCamera());
}

TEST(UnpluggedCamera, CanStillBeStoppedClosedAndDeleted) {
    CameraWorld one(SmallCamera);
    TestClient client;
    ASSERT_EQ(CameraOk, one.camera->Ready());
    ASSERT_EQ(CameraOk,
              one.camera->StartStreamingImages(TestClient::ReceiveImage, nullptr, false, &client));
    ASSERT_TRUE(WaitUntil([&] { return client.GetImageCount() > 0; }));

    ASSERT_TRUE(one.world.Unplug());

    (void)one.camera->CloseCamera();  // whatever it says, it ends
    one.camera.reset();
    EXPECT_EQ(0u, one.world.GetState().openHandles);
}

}  // namespace ZV::Test
