#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include "camera/bare_camera.h"
#include "camera/packet_size.h"
#include "camera/test_camera.h"

namespace ZV::Test {

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;

constexpr std::uint32_t Code20MHz = 0;
constexpr std::uint32_t Code40MHz = 7;

/// Without a bus a control block below 2.3 cannot carry fast readouts, and one from it on neither:
/// a connection that is not there has packets of 0 bytes.
struct BinningCamera : BareBase {
    explicit BinningCamera(std::uint32_t controlVersion = MakeVersion(2, 8))
        : BareBase(MakeVersion(2, 11), controlVersion) {
        StoreConfiguration(4, 1000u << 16 | 800);
        StoreConfiguration(5, 500u << 16 | 400);
        StoreConfiguration(6, 125u << 16 | 100);
        StoreConfiguration(7, 250u << 16 | 200);
        StoreConfiguration(42, 1);
        StoreControl(3, 600u << 16 | 300);
        StoreControl(4, 10u << 16 | 20);
    }
};

}  // namespace

TEST(SymmetricalBinning, WritesItsCodeAndFitsTheRoi) {
    struct Row {
        std::uint32_t mode, code, width, height;
    };
    for (const Row& row : {Row{2, 1, 500, 400}, Row{4, 3, 250, 200}, Row{8, 2, 125, 100}}) {
        BinningCamera camera;
        camera.StoreControl(2, 0xFF04);

        EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(row.mode));

        EXPECT_EQ(0xFF04u | row.code, camera.ReadControl(2));
        EXPECT_EQ(row.mode, camera.GetSymmetricalBinningMode());
        EXPECT_EQ(row.width << 16 | row.height, camera.ReadControl(3));
        EXPECT_EQ(0u, camera.ReadControl(4));
    }
}

TEST(SymmetricalBinning, OpensTheRoiToTheSensorBehindABinnedMode) {
    BinningCamera camera;
    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(4));
    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(1));

    EXPECT_EQ(0u, camera.ReadControl(2));
    EXPECT_EQ(1000u << 16 | 800, camera.ReadControl(3));
    EXPECT_EQ(0u, camera.ReadControl(4));
}

TEST(SymmetricalBinning, RefusesAModeWithStreamingAlreadyStoppedAndTheCodeCleared) {
    for (const std::uint32_t mode : {0u, 5u, 6u, 7u, 9u, 0xFFFFFFFFu}) {
        BinningCamera camera;
        EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(2));
        camera.streaming.isStreaming = true;

        EXPECT_EQ(CameraBadValue, camera.SetSymmetricalBinning(mode));

        EXPECT_FALSE(camera.streaming.isStreaming);
        EXPECT_TRUE(camera.streaming.restartAfterUpdate);
        EXPECT_EQ(1, camera.GetSymmetricalBinningMode());
        EXPECT_EQ(500u << 16 | 400, camera.ReadControl(3)) << "the ROI stays";
        EXPECT_EQ(CameraOk, camera.UpdateSettingsOnCamera()) << "the lock has been given";
    }
}

/// Stands for a flag that rises while the setter has the lock; no real start gets so far.
struct StreamShowsUnderTheLock : BinningCamera {
    std::uint32_t GetMaxCCDWidthForBinningMode(std::uint32_t mode) override {
        streaming.isStreaming = true;
        return BinningCamera::GetMaxCCDWidthForBinningMode(mode);
    }
};

TEST(SymmetricalBinning, StopsNoStreamWhileItHoldsTheLockForWhichAStopWaits) {
    StreamShowsUnderTheLock camera;
    std::atomic<bool> hasReturned{false};
    CameraResult result = CameraBadValue;

    std::thread setter([&] {
        result = camera.SetSymmetricalBinning(2);
        hasReturned = true;
    });
    const bool isInTime = WaitUntil([&] { return hasReturned.load(); });
    // A setter that waits for the lock it holds gets it from here, so that the test ends.
    if (!isInTime) (void)HAL_SemaphoreSignal(camera.streaming.streamLock);
    setter.join();

    EXPECT_TRUE(isInTime);
    EXPECT_EQ(CameraOk, result);
    EXPECT_TRUE(camera.streaming.isStreaming);
    EXPECT_FALSE(camera.streaming.restartAfterUpdate);
    EXPECT_EQ(500u << 16 | 400, camera.ReadControl(3));
    EXPECT_EQ(0u, camera.ReadControl(4));
}

/// Tells when the setter is about to run its stop step.
struct StopStepIsNear : BinningCamera {
    std::uint16_t GetSymmetricalBinningMode() override {
        isNear = true;
        return BinningCamera::GetSymmetricalBinningMode();
    }
    std::atomic<bool> isNear{false};
};

TEST(SymmetricalBinning, StopsAStreamThatAnotherClientStartsBehindItsStopStep) {
    for (int round = 0; round < 50; ++round) {
        StopStepIsNear camera;
        CameraResult result = CameraBadValue;
        // Another start has the lock; the setter waits for it behind its stop step.
        ASSERT_EQ(HALOk, HAL_SemaphoreWait(camera.streaming.streamLock));
        std::thread setter([&] { result = camera.SetSymmetricalBinning(2); });
        EXPECT_TRUE(WaitUntil([&] { return camera.isNear.load(); }));
        camera.streaming.isStreaming = true;
        EXPECT_EQ(HALOk, HAL_SemaphoreSignal(camera.streaming.streamLock));
        setter.join();

        EXPECT_EQ(CameraOk, result);
        EXPECT_FALSE(camera.streaming.isStreaming);
        EXPECT_TRUE(camera.streaming.restartAfterUpdate);
        EXPECT_EQ(500u << 16 | 400, camera.ReadControl(3));
    }
}

TEST(SymmetricalBinning, WritesWidthXHeightYWhenItBinsAndSizeBeforePositionWhenItEnds) {
    CameraWorld world(SmallCamera);
    ASSERT_EQ(CameraOk, world.camera->Ready());
    ASSERT_EQ(CameraOk, world.camera->SetROI(3, 5, 32, 16));
    (void)world.TakeWrites();

    ASSERT_EQ(CameraOk, world.camera->SetSymmetricalBinning(2));
    EXPECT_THAT(world.TakeWrites(),
                ElementsAre(RegisterWrite{ControlAddress + 8, {1}, 0},
                            RegisterWrite{ControlAddress + 16, {5}, 0},
                            RegisterWrite{ControlAddress + 12, {32u << 16 | 24}, 0},
                            RegisterWrite{ControlAddress + 16, {0}, 0}))
        << "a width in place is not written";

    ASSERT_EQ(CameraOk, world.camera->SetROI(3, 5, 16, 8));
    (void)world.TakeWrites();
    ASSERT_EQ(CameraOk, world.camera->SetSymmetricalBinning(1));
    EXPECT_THAT(world.TakeWrites(),
                ElementsAre(RegisterWrite{ControlAddress + 8, {0}, 0},
                            RegisterWrite{ControlAddress + 12, {64u << 16 | 8}, 0},
                            RegisterWrite{ControlAddress + 12, {64u << 16 | 48}, 0},
                            RegisterWrite{ControlAddress + 16, {5}, 0},
                            RegisterWrite{ControlAddress + 16, {0}, 0}));
}

TEST(SymmetricalBinning, SendsNothingForAModeThatItRefuses) {
    CameraWorld world(SmallCamera);
    ASSERT_EQ(CameraOk, world.camera->Ready());
    ASSERT_EQ(CameraOk, world.camera->SetSymmetricalBinning(2));
    (void)world.TakeWrites();

    EXPECT_EQ(CameraBadValue, world.camera->SetSymmetricalBinning(5));

    EXPECT_THAT(world.TakeWrites(), IsEmpty());
    EXPECT_EQ(1u, world.world.Peek(ControlAddress + 8)) << "the camera bins as before";
}

TEST(SymmetricalBinning, GoesOnAfterAFailedWriteAndGivesItsLockTwice) {
    CameraWorld world(SmallCamera);
    ASSERT_EQ(CameraOk, world.camera->Ready());
    (void)world.TakeWrites();
    ASSERT_TRUE(world.world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE"})"));

    EXPECT_EQ(CameraHalFault, world.camera->SetSymmetricalBinning(2));

    EXPECT_EQ(3u, world.TakeWrites().size()) << "binning, width, height; x and y are 0";
    HALSemaphore* const lock = world.camera->streaming.streamLock;
    EXPECT_EQ(HALOk, HAL_SemaphoreWait(lock));
    EXPECT_EQ(HALOk, HAL_SemaphoreWait(lock)) << "kept: one more than there should be";
    EXPECT_EQ(HALOk, HAL_SemaphoreSignal(lock));
}

TEST(ReadoutFrequency, OutsideTheTableChangesNothing) {
    BinningCamera camera;
    camera.StoreControl(ControlReadoutFrequency, 2);
    camera.streaming.isStreaming = true;

    for (const float megahertz : {0.0F, 7.0F, 19.9F, -1.0F})
        EXPECT_EQ(CameraOk, camera.SetReadoutFrequency(megahertz));

    EXPECT_EQ(5.0F, camera.GetReadoutFrequency());
    EXPECT_TRUE(camera.streaming.isStreaming);
    camera.streaming.isStreaming = false;
}

TEST(BitDepth, OutsideTheTableChangesNothing) {
    BinningCamera camera;
    camera.StoreControl(ControlBitDepth, 3);
    camera.streaming.isStreaming = true;

    for (const std::uint32_t bits : {0u, 9u, 11u, 13u, 15u, 17u})
        EXPECT_EQ(CameraOk, camera.SetBitDepth(bits));

    EXPECT_EQ(14u, camera.GetBitDepth());
    EXPECT_TRUE(camera.streaming.isStreaming);
    camera.streaming.isStreaming = false;
}

TEST(BitDepth, Of12ReadsBackAsTheGreatest) {
    BinningCamera camera;
    camera.StoreConfiguration(ConfigMaxBitDepthMinusOne, 15);

    EXPECT_EQ(CameraOk, camera.SetBitDepth(12));

    EXPECT_EQ(16u, camera.GetBitDepth());
}

// The frequency guard.

class FrequencyGuard : public testing::Test {
  protected:
    BinningCamera camera{MakeVersion(2, 2)};
};

TEST_F(FrequencyGuard, TurnsAFastFrequencyInto20MHzAtFullResolution) {
    camera.StoreControl(ControlReadoutFrequency, 1);

    EXPECT_EQ(CameraOk, camera.SetReadoutFrequency(40.0F));

    EXPECT_EQ(20.0F, camera.GetReadoutFrequency());
}

TEST_F(FrequencyGuard, LetsAFastFrequencyPassWhileBinning) {
    camera.StoreControl(ControlBinning, 1);

    EXPECT_EQ(CameraOk, camera.SetReadoutFrequency(30.0F));

    EXPECT_EQ(30.0F, camera.GetReadoutFrequency());
}

TEST_F(FrequencyGuard, LetsFrequenciesBelow30MHzPass) {
    EXPECT_EQ(CameraOk, camera.SetReadoutFrequency(25.0F));

    EXPECT_EQ(25.0F, camera.GetReadoutFrequency());
}

TEST_F(FrequencyGuard, LowersTheFrequencyBeforeABitDepthIsSet) {
    camera.StoreControl(ControlReadoutFrequency, Code40MHz);

    EXPECT_EQ(CameraOk, camera.SetBitDepth(8)) << "the depth itself is in place";

    EXPECT_EQ(Code20MHz, camera.ReadControlField(ControlReadoutFrequency));
}

TEST_F(FrequencyGuard, LowersTheFrequencyBeforeBinningEndsAndNotBeforeItBegins) {
    camera.StoreControl(ControlBinning, 1);
    camera.StoreControl(ControlReadoutFrequency, Code40MHz);

    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(4));
    EXPECT_EQ(40.0F, camera.GetReadoutFrequency());
    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(1));

    EXPECT_EQ(20.0F, camera.GetReadoutFrequency());
}

TEST_F(FrequencyGuard, AdjustsTheFrequencyOfACaller) {
    float fast = 30.0F, slow = 25.0F, binned = 30.0F;
    camera.StoreControl(ControlReadoutFrequency, Code40MHz);

    EXPECT_EQ(CameraOk, camera.AdjustSettingsForMaxPacketSize(1, 8, &slow));
    EXPECT_EQ(CameraOk, camera.AdjustSettingsForMaxPacketSize(2, 8, &binned));
    EXPECT_EQ(40.0F, camera.GetReadoutFrequency());
    EXPECT_EQ(CameraOk, camera.AdjustSettingsForMaxPacketSize(1, 8, &fast));

    EXPECT_EQ(25.0F, slow);
    EXPECT_EQ(30.0F, binned);
    EXPECT_EQ(20.0F, fast);
    EXPECT_EQ(20.0F, camera.GetReadoutFrequency());
}

TEST(FrequencyGuardOnABus, FiresOnlyBelowControl23AtEitherSpeed) {
    struct Row {
        const char* speed;
        const char* control;
        float megahertz;
    };
    for (const Row& row : {Row{"400", "2.2", 20.0F}, Row{"800", "2.2", 20.0F},
                           Row{"400", "2.3", 40.0F}, Row{"800", "2.8", 40.0F}}) {
        CameraWorld world(
            std::string(R"({"base": "mono", "timeScale": 0, "cameras": [{"speed": )") + row.speed +
            R"(, "sensor": {"width": 64, "height": 48},
                          "versions": {"control": ")" +
            row.control + "\"}}]}");
        ASSERT_EQ(CameraOk, world.camera->Ready());

        EXPECT_EQ(CameraOk, world.camera->SetReadoutFrequency(40.0F));

        EXPECT_EQ(row.megahertz, world.camera->GetReadoutFrequency())
            << row.speed << " " << row.control;
    }
}

TEST(FrequencyGuardOnABus, EndsASetterWhoseLoweringFails) {
    CameraWorld world(R"({"base": "mono", "timeScale": 0, "cameras": [{
        "sensor": {"width": 64, "height": 48}, "versions": {"control": "2.2"}}]})");
    ASSERT_EQ(CameraOk, world.camera->Ready());
    (void)world.TakeWrites();
    const std::uint32_t fast =
        InsertField(ControlReadoutFrequency, world.camera->ReadControl(1), Code40MHz);
    world.camera->StoreControl(1, fast);
    ASSERT_TRUE(world.world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE"})"));

    EXPECT_EQ(CameraHalFault, world.camera->SetBitDepth(16));

    EXPECT_EQ(1u, world.TakeWrites().size());
    EXPECT_EQ(8u, world.camera->GetBitDepth());
}

}  // namespace ZV::Test
