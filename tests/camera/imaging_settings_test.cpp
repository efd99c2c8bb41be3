#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>

#include "camera/bare_camera.h"
#include "camera/test_camera.h"
#include "support/wait_until.h"

namespace ZV::Test {

namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;

using ControlWrites = std::vector<std::pair<std::uint32_t, std::uint32_t>>;

/// Everything that the configuration can offer, on blocks of the latest versions.
constexpr std::string_view FullCamera = R"({"base": "mono", "timeScale": 0, "cameras": [{
    "sensor": {"width": 64, "height": 48},
    "versions": {"configuration": "2.11", "control": "2.8"},
    "configuration": {"29": 1, "169": 65535, "192": 5, "193": 1023, "196": 3, "201": 2}}]})";
constexpr std::string_view EarlyCamera = R"({"base": "mono", "timeScale": 0, "cameras": [{
    "sensor": {"width": 64, "height": 48},
    "versions": {"configuration": "1.2", "control": "1.2"}}]})";

}  // namespace

/// A camera that is open and set up, all writes of the setup taken.
class ReadyCamera : public CameraWorld, public testing::Test {
  protected:
    explicit ReadyCamera(std::string_view scenario) : CameraWorld(scenario) {}
    void SetUp() override {
        ASSERT_NE(nullptr, camera);
        ASSERT_EQ(CameraOk, camera->Ready());
        (void)TakeWrites();
    }
    // The client goes before the camera: no thread may still call it then.
    void TearDown() override {
        if (camera != nullptr) (void)camera->CloseCamera();
    }
    /// Writes to the control block as quadlet and value; others fail the test.
    ControlWrites TakeControlWrites() {
        ControlWrites writes;
        for (const RegisterWrite& write : TakeWrites()) {
            EXPECT_EQ(1u, write.values.size());
            EXPECT_GE(write.address, ControlAddress);
            EXPECT_LT(write.address, CommandAddress);
            writes.emplace_back((write.address - ControlAddress) / 4, write.values[0]);
        }
        return writes;
    }
    void StartStreaming() {
        ASSERT_EQ(CameraOk,
                  camera->StartStreamingImages(TestClient::ReceiveImage, nullptr, false, &client));
        (void)TakeWrites();
    }
    bool FailNextWrite() {
        return world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE"})");
    }

    TestClient client;
};

class FullReadyCamera : public ReadyCamera {
  protected:
    FullReadyCamera() : ReadyCamera(FullCamera) {}
};
class EarlyReadyCamera : public ReadyCamera {
  protected:
    EarlyReadyCamera() : ReadyCamera(EarlyCamera) {}
};
class ModernReadyCamera : public ReadyCamera {
  protected:
    ModernReadyCamera() : ReadyCamera(SmallCamera) {}
};

struct SetterCase {
    const char* name;
    std::function<CameraResult(MorvaneFWCamera&)> set;
    std::uint32_t quadlet, before, after;
    bool stopsStream = false;
    bool isRepeated = false;  ///< Written again for a value that is in place.
};

/// For the tables: each row on a camera without a bus, its quadlet first set to `before`.
class EachSetter : public testing::TestWithParam<SetterCase> {
  protected:
    EachSetter() {
        camera.StoreConfiguration(4, 2000u << 16 | 1000);
        camera.StoreConfiguration(29, 1);
        camera.StoreConfiguration(169, 0xFFFFFFFF);
        camera.StoreConfiguration(192, 5);
        camera.StoreConfiguration(193, 1023);
        camera.StoreConfiguration(200, 40000000);
        camera.StoreConfiguration(201, 2);
        camera.StoreConfiguration(8, 15);
        camera.StoreControl(GetParam().quadlet, GetParam().before);
    }
    BareBase camera;
};

TEST_P(EachSetter, ChangesItsBitsAlone) {
    EXPECT_EQ(CameraOk, GetParam().set(camera));

    EXPECT_EQ(GetParam().after, camera.ReadControl(GetParam().quadlet));
}

TEST_P(EachSetter, StopsAStreamOnlyWhereItMust) {
    camera.streaming.isStreaming = true;

    EXPECT_EQ(CameraOk, GetParam().set(camera));

    EXPECT_EQ(!GetParam().stopsStream, camera.streaming.isStreaming);
    EXPECT_EQ(GetParam().stopsStream, camera.streaming.restartAfterUpdate);
}

using Camera = MorvaneFWCamera;

INSTANTIATE_TEST_SUITE_P(
    Table, EachSetter,
    testing::Values(
        SetterCase{"RoiX", [](Camera& c) { return c.SetROIX(0x1234); }, 4, 0x99990077, 0x12340077,
                   true},
        SetterCase{"RoiXOf17Bits", [](Camera& c) { return c.SetROIX(0x12345); }, 4, 0, 0x23450000,
                   true},
        SetterCase{"RoiY", [](Camera& c) { return c.SetROIY(0x1234); }, 4, 0x99990077, 0x99991234,
                   true},
        SetterCase{"RoiWidth", [](Camera& c) { return c.SetROIWidth(1999); }, 3, 0x00010002,
                   1999u << 16 | 2, true},
        SetterCase{"RoiWidthCut", [](Camera& c) { return c.SetROIWidth(100000); }, 3, 0x00010002,
                   2000u << 16 | 2, true},
        SetterCase{"RoiHeight", [](Camera& c) { return c.SetROIHeight(5); }, 3, 0x00010002,
                   0x00010005, true},
        SetterCase{"RoiHeightCut", [](Camera& c) { return c.SetROIHeight(0xFFFFFFFF); }, 3,
                   0x00010002, 0x00010000 | 1000, true},
        SetterCase{"Compression", [](Camera& c) { return c.SetCompression(0x1AB); }, 1, 0x11220044,
                   0x11AB0044},
        SetterCase{"Offset", [](Camera& c) { return c.SetOffset(0x123); }, 5, 0xABC0000F,
                   0xABC0123F},
        SetterCase{"OffsetOf13Bits", [](Camera& c) { return c.SetOffset(-1); }, 5, 0xABC0000F,
                   0xABC0FFFF},
        SetterCase{"CoolerOn", [](Camera& c) { return c.SetCoolerStatus(true); }, 14, 0x10000002,
                   0x10000003},
        SetterCase{"CoolerOff", [](Camera& c) { return c.SetCoolerStatus(false); }, 14, 0x10000003,
                   0x10000002},
        SetterCase{"FilterCycle", [](Camera& c) { return c.SetRGBFilterCycle(true); }, 12, 0x310,
                   0x311, true},
        SetterCase{"FilterActive", [](Camera& c) { return c.SetRGBFilterActive(true); }, 12, 0x301,
                   0x311},
        SetterCase{"FilterInactive", [](Camera& c) { return c.SetRGBFilterActive(false); }, 12,
                   0x311, 0x301},
        SetterCase{"SyncB1", [](Camera& c) { return c.SetSyncBMode(1); }, 11, 0x20103, 0x10103},
        SetterCase{"SyncB0", [](Camera& c) { return c.SetSyncBMode(0); }, 11, 0x30103, 0x103},
        SetterCase{"SyncBOther", [](Camera& c) { return c.SetSyncBMode(7); }, 11, 0x10103, 0x103},
        SetterCase{"Fan1", [](Camera& c) { return c.SetFanSpeed(1); }, 22, 0x55, 0x10055},
        SetterCase{"Fan4", [](Camera& c) { return c.SetFanSpeed(4); }, 22, 0x20055, 0x40055},
        SetterCase{"FanOther", [](Camera& c) { return c.SetFanSpeed(9); }, 22, 0x20055, 0x55},
        SetterCase{"Blackout", [](Camera& c) { return c.SetBlackoutMode(true); }, 21, 0xF1, 0xF3},
        SetterCase{"HighSensitivity", [](Camera& c) { return c.SetHighSensitivityMode(true); }, 21,
                   0xF2, 0xF3},
        SetterCase{"Temperature", [](Camera& c) { return c.SetRegulatedCoolingTemp(-40); }, 14,
                   0x00000001, 584u << 16 | 1},
        SetterCase{"StartColour1", [](Camera& c) { return c.SetRGBFilterStartColour(1); }, 12,
                   0x311, 0x111},
        SetterCase{"StartColour3", [](Camera& c) { return c.SetRGBFilterStartColour(3); }, 12,
                   0x011, 0x311},
        SetterCase{"StartColour2Writes0", [](Camera& c) { return c.SetRGBFilterStartColour(2); },
                   12, 0x311, 0x011},
        SetterCase{"CloseDelay", [](Camera& c) { return c.SetShutterCloseDelay(640); }, 25,
                   0x00070009, 0x00070064},
        SetterCase{"CalibrationGain", [](Camera& c) { return c.SetChan1CalibrationGain(0x1AB); },
                   32, 0xFF00, 0xFFAB},
        SetterCase{"DitherOn", [](Camera& c) { return c.SetDither(true); }, 30, 0x10, 0x11},
        SetterCase{"DitherOff", [](Camera& c) { return c.SetDither(false); }, 30, 0x13, 0x12},
        SetterCase{"HighGainIsAlwaysWrittenOff", [](Camera& c) { return c.SetHighGainMode(true); },
                   30, 0x13, 0x11},
        SetterCase{"HighGainOff", [](Camera& c) { return c.SetHighGainMode(false); }, 30, 0x13,
                   0x11},
        SetterCase{"VClock", [](Camera& c) { return c.SetVClockPeriod(2000); }, 31, 0x50000,
                   0x50050},
        SetterCase{"EMGainIsStoredFlipped", [](Camera& c) { return c.SetEMGain(1000); }, 24,
                   0x70000, 0x70017},
        SetterCase{"Psn", [](Camera& c) { return c.SetPSN(0x1AB); }, 1, 0x11223344, 0xAB223344},
        SetterCase{"FilterDelays", [](Camera& c) { return c.SetRGBFilterDelays(0xABCD1234); }, 13,
                   7, 0xABCD1234},
        SetterCase{"SubCp", [](Camera& c) { return c.SetSubCpAd(0x12345); }, 34, 0xFFFFFFFF,
                   0x2345},
        SetterCase{"Sub", [](Camera& c) { return c.SetSubAd(0x12345); }, 35, 0xFFFFFFFF, 0x2345},
        SetterCase{"ResetVh", [](Camera& c) { return c.SetResetVhAd(0x12345); }, 36, 0xFFFFFFFF,
                   0x2345},
        SetterCase{"V1", [](Camera& c) { return c.SetV1VmAd(0x12345); }, 37, 0xFFFFFFFF, 0x2345},
        SetterCase{"V2", [](Camera& c) { return c.SetV2VmAd(0x12345); }, 38, 0xFFFFFFFF, 0x2345},
        SetterCase{"V3", [](Camera& c) { return c.SetV3VmAd(0x12345); }, 39, 0xFFFFFFFF, 0x2345},
        SetterCase{"V4", [](Camera& c) { return c.SetV4VmAd(0x12345); }, 40, 0xFFFFFFFF, 0x2345},
        SetterCase{"MiscCtrl", [](Camera& c) { return c.SetMiscCtrlAd(0x12345); }, 41, 3, 0x2345},
        SetterCase{"DoubleShotOn", [](Camera& c) { return c.SetDoubleShotMode(true); }, 13,
                   0xABCD1234, 1},
        SetterCase{"DoubleShotCannotBeSwitchedOff",
                   [](Camera& c) { return c.SetDoubleShotMode(false); }, 13, 0xABCD1234, 1},
        SetterCase{"Frequency", [](Camera& c) { return c.SetReadoutFrequency(2.5F); }, 1,
                   0x11220044, 0x11220344, true},
        SetterCase{"BitDepth12IsCode1", [](Camera& c) { return c.SetBitDepth(12); }, 1, 0x11220004,
                   0x1122000C, true},
        SetterCase{"BitDepth14", [](Camera& c) { return c.SetBitDepth(14); }, 1, 0x11220004,
                   0x1122001C, true},
        SetterCase{"Trigger2", [](Camera& c) { return c.SetTriggerMode(2); }, 11, 0x10001, 0x10102},
        SetterCase{"TriggerAbove7", [](Camera& c) { return c.SetTriggerMode(8); }, 11, 0x10102,
                   0x10000}),
    [](const testing::TestParamInfo<SetterCase>& row) { return std::string(row.param.name); });

// What is in place already.

TEST_F(FullReadyCamera, SendsNothingAndKeepsStreamingForValuesThatAreInPlace) {
    StartStreaming();

    EXPECT_EQ(CameraOk, camera->SetROI(camera->GetROIX(), camera->GetROIY(), camera->GetROIWidth(),
                                       camera->GetROIHeight()));
    EXPECT_EQ(CameraOk, camera->SetCompression(camera->GetCompression()));
    EXPECT_EQ(CameraOk, camera->SetReadoutFrequency(camera->GetReadoutFrequency()));
    EXPECT_EQ(CameraOk, camera->SetBitDepth(camera->GetBitDepth()));
    EXPECT_EQ(CameraOk, camera->SetExposure(camera->GetExposure()));
    EXPECT_EQ(CameraOk, camera->SetRGBFilterRedExposure(camera->GetRGBFilterRedExposure()));
    EXPECT_EQ(CameraOk, camera->SetRGBFilterBlueExposure(camera->GetRGBFilterBlueExposure()));
    EXPECT_EQ(CameraOk, camera->SetNormalizedGaindB(camera->GetNormalizedGaindB()));
    EXPECT_EQ(CameraOk, camera->SetOffset(camera->GetOffset()));
    EXPECT_EQ(CameraOk, camera->SetAbsoluteOffset(camera->GetAbsoluteOffset()));
    EXPECT_EQ(CameraOk, camera->SetCoolerStatus(camera->GetCoolerStatus()));
    EXPECT_EQ(CameraOk, camera->SetSymmetricalBinning(camera->GetSymmetricalBinningMode()));
    EXPECT_EQ(CameraOk, camera->SetRGBFilterCycle(camera->GetRGBFilterCycleMode()));
    EXPECT_EQ(CameraOk, camera->SetTriggerMode(camera->GetTriggerMode()));
    EXPECT_EQ(CameraOk, camera->SetSyncBMode(camera->GetSyncBMode()));
    EXPECT_EQ(CameraOk, camera->SetFanSpeed(camera->GetFanSpeed()));
    EXPECT_EQ(CameraOk, camera->SetBlackoutMode(camera->GetBlackoutMode()));
    EXPECT_EQ(CameraOk, camera->SetHighSensitivityMode(camera->GetHighSensitivityMode()));
    EXPECT_EQ(CameraOk, camera->SetRegulatedCoolingTemp(camera->GetRegulatedCoolingTemperature()));
    EXPECT_EQ(CameraOk, camera->SetRGBFilterStartColour(camera->GetRGBFilterStartColour()));
    EXPECT_EQ(CameraOk, camera->SetBigEndian(camera->GetBigEndian()));

    EXPECT_THAT(TakeWrites(), IsEmpty());
    EXPECT_TRUE(camera->IsCameraStreaming());
    EXPECT_FALSE(camera->streaming.restartAfterUpdate);
}

TEST_F(FullReadyCamera, WritesAgainWhatHasNoComparison) {
    EXPECT_EQ(CameraOk, camera->SetRGBFilterActive(true));
    EXPECT_EQ(CameraOk, camera->SetShutterCloseDelay(640));
    EXPECT_EQ(CameraOk, camera->SetChan1CalibrationGain(1));
    EXPECT_EQ(CameraOk, camera->SetDither(true));
    EXPECT_EQ(CameraOk, camera->SetVClockPeriod(2000));
    EXPECT_EQ(CameraOk, camera->SetEMGain(23));
    EXPECT_EQ(CameraOk, camera->SetSubAd(40));
    const ControlWrites first = TakeControlWrites();
    EXPECT_EQ(CameraOk, camera->SetRGBFilterActive(true));
    EXPECT_EQ(CameraOk, camera->SetShutterCloseDelay(640));
    EXPECT_EQ(CameraOk, camera->SetChan1CalibrationGain(1));
    EXPECT_EQ(CameraOk, camera->SetDither(true));
    EXPECT_EQ(CameraOk, camera->SetVClockPeriod(2000));
    EXPECT_EQ(CameraOk, camera->SetEMGain(23));
    EXPECT_EQ(CameraOk, camera->SetSubAd(40));

    EXPECT_EQ(7u, first.size());
    EXPECT_EQ(first, TakeControlWrites());
}

TEST_F(FullReadyCamera, WritesASetPointAboveZeroOnEachCallSinceItReadsOneLower) {
    EXPECT_EQ(CameraOk, camera->SetRegulatedCoolingTemp(20));
    EXPECT_EQ(CameraOk, camera->SetRegulatedCoolingTemp(20));

    EXPECT_EQ(2u, TakeControlWrites().size());
    EXPECT_EQ(19, camera->GetRegulatedCoolingTemperature());
}

TEST_F(FullReadyCamera, CutsAWidthThatIsTooLargeAndWritesItThoughItIsInPlace) {
    EXPECT_EQ(CameraOk, camera->SetROIWidth(100000));

    EXPECT_THAT(TakeControlWrites(), ElementsAre(Pair(3, 64u << 16 | 48)));
    EXPECT_EQ(64u, camera->GetROIWidth());
}

// Capabilities and ranges.

TEST(Setters, RefuseFeaturesThatAreAbsent) {
    BareBase camera(MakeVersion(2, 6));

    EXPECT_EQ(CameraNotSupported, camera.SetFanSpeed(1));
    EXPECT_EQ(CameraOk, camera.SetFanSpeed(4)) << "what an absent fan reads";
    EXPECT_EQ(CameraNotSupported, camera.SetBlackoutMode(true));
    EXPECT_EQ(CameraOk, camera.SetBlackoutMode(false));
    EXPECT_EQ(CameraNotSupported, camera.SetHighSensitivityMode(true));
    EXPECT_EQ(CameraNotSupported, camera.SetRegulatedCoolingTemp(10));
    EXPECT_EQ(CameraNotSupported, camera.SetRegulatedCoolingTemp(100)) << "before the range";
    EXPECT_EQ(CameraNotSupported, camera.SetShutterCloseDelay(0));
    EXPECT_EQ(CameraNotSupported, camera.SetChan1CalibrationGain(0));
    EXPECT_EQ(CameraNotSupported, camera.SetDither(false));
    EXPECT_EQ(CameraNotSupported, camera.SetHighGainMode(false));
    EXPECT_EQ(CameraNotSupported, camera.SetVClockPeriod(0));
    EXPECT_EQ(CameraNotSupported, camera.SetEMGain(0));
    EXPECT_EQ(CameraRefused, camera.SetSubCpAd(0));
    EXPECT_EQ(CameraRefused, camera.SetSubAd(0));
    EXPECT_EQ(CameraRefused, camera.SetResetVhAd(0));
    EXPECT_EQ(CameraRefused, camera.SetV1VmAd(0));
    EXPECT_EQ(CameraRefused, camera.SetV2VmAd(0));
    EXPECT_EQ(CameraRefused, camera.SetV3VmAd(0));
    EXPECT_EQ(CameraRefused, camera.SetV4VmAd(0));
    EXPECT_EQ(CameraRefused, camera.SetMiscCtrlAd(0));
    EXPECT_EQ(CameraOk, camera.SetDoubleShotMode(true)) << "unlike the others";
}

TEST_F(FullReadyCamera, RefusesASetPointOf50ThoughAReadingOf50IsPossible) {
    EXPECT_EQ(CameraBadValue, camera->SetRegulatedCoolingTemp(50));
    EXPECT_EQ(CameraBadValue, camera->SetRegulatedCoolingTemp(-56));
    EXPECT_THAT(TakeWrites(), IsEmpty());

    EXPECT_EQ(CameraOk, camera->SetRegulatedCoolingTemp(49));
    EXPECT_EQ(CameraOk, camera->SetRegulatedCoolingTemp(-55));
    EXPECT_EQ(2u, TakeControlWrites().size());
}

TEST_F(FullReadyCamera, RefusesAnEMGainOutsideItsLimits) {
    EXPECT_EQ(CameraBadValue, camera->SetEMGain(4));
    EXPECT_EQ(CameraBadValue, camera->SetEMGain(1024));
    EXPECT_THAT(TakeWrites(), IsEmpty());
    EXPECT_EQ(CameraOk, camera->SetEMGain(5));

    EXPECT_THAT(TakeControlWrites(), ElementsAre(Pair(24, 1018)));
    EXPECT_EQ(5u, camera->GetEMGain());
}

TEST_F(FullReadyCamera, ReadsDoubleShotTriggersAsTheirPlainModes) {
    EXPECT_EQ(CameraOk, camera->SetDoubleShotMode(true));
    EXPECT_EQ(CameraOk, camera->SetTriggerMode(1));
    EXPECT_EQ(1u, camera->GetTriggerMode());
    EXPECT_EQ(CameraOk, camera->SetTriggerMode(2));
    EXPECT_EQ(2u, camera->GetTriggerMode());

    EXPECT_THAT(TakeControlWrites(),
                ElementsAre(Pair(13, 1), Pair(11, 0x10004), Pair(11, 0x10104)));
}

TEST_F(FullReadyCamera, LosesDoubleShotToTheFilterDelaysAndTheOtherWayRound) {
    EXPECT_EQ(CameraOk, camera->SetRGBFilterDelays(0x00100020));
    EXPECT_FALSE(camera->GetDoubleShotMode());
    EXPECT_EQ(CameraOk, camera->SetDoubleShotMode(false));

    EXPECT_TRUE(camera->GetDoubleShotMode());
    EXPECT_EQ(1u, camera->ReadControl(13));
}

TEST_F(FullReadyCamera, AbortsAWaitWhenTheSoftwareTriggerIsChosen) {
    StartStreaming();

    EXPECT_EQ(CameraOk, camera->SetTriggerMode(5));

    // A frame of the free run may still be on its way, which is the one that is refused.
    EXPECT_TRUE(WaitUntil([&] {
        return camera->streaming.abortPending || camera->GetStreamCounters().refused.Get() == 1;
    }));
    EXPECT_TRUE(camera->IsCameraStreaming());
}

TEST_F(FullReadyCamera, DoesNotAbortWhenTheTriggerCannotBeWritten) {
    ASSERT_TRUE(FailNextWrite());

    EXPECT_EQ(CameraHalFault, camera->SetTriggerMode(5));

    EXPECT_FALSE(camera->streaming.abortPending);
}

TEST_F(FullReadyCamera, KeepsTheShadowThatAFailedWriteHasChanged) {
    ASSERT_TRUE(FailNextWrite());

    EXPECT_EQ(CameraHalFault, camera->SetCompression(7));

    EXPECT_EQ(7u, camera->GetCompression());
    EXPECT_EQ(CameraOk, camera->SetCompression(7));
    EXPECT_EQ(1u, TakeControlWrites().size()) << "the second call sends nothing";
    EXPECT_EQ(0u, ExtractField(ControlCompression, world.Peek(ControlAddress + 4)));
}

TEST_F(FullReadyCamera, EndsARoiAtItsFirstFailure) {
    ASSERT_TRUE(FailNextWrite());

    EXPECT_EQ(CameraHalFault, camera->SetROI(2, 3, 20, 10));

    EXPECT_THAT(TakeControlWrites(), ElementsAre(Pair(4, 2u << 16)));
}

TEST_F(FullReadyCamera, SetsARoiByXThenYThenWidthThenHeight) {
    EXPECT_EQ(CameraOk, camera->SetROI(2, 3, 20, 10));

    EXPECT_THAT(TakeControlWrites(), ElementsAre(Pair(4, 2u << 16), Pair(4, 2u << 16 | 3),
                                                 Pair(3, 20u << 16 | 48), Pair(3, 20u << 16 | 10)));
}

TEST_F(FullReadyCamera, MarksTheConfigurationAsStaleOnlyWhenMiscCtrlChanges) {
    const std::uint32_t present = camera->ReadControl(41);
    EXPECT_EQ(CameraOk, camera->SetMiscCtrlAd(present));
    EXPECT_FALSE(camera->streaming.configStale);

    EXPECT_EQ(CameraOk, camera->SetMiscCtrlAd(present + 8));
    EXPECT_TRUE(camera->streaming.configStale);
    EXPECT_THAT(TakeControlWrites(), ElementsAre(Pair(41, present), Pair(41, present + 8)));
}

TEST_F(FullReadyCamera, NeverComesBackFromLittleEndian) {
    ASSERT_FALSE(camera->GetBigEndian());
    camera->StoreControl(1, camera->ReadControl(1) | 2);
    const std::uint32_t before = camera->ReadControl(1);

    EXPECT_EQ(CameraOk, camera->SetBigEndian(true));

    EXPECT_THAT(TakeControlWrites(), ElementsAre(Pair(1, before & ~2u))) << "bit 2 still set";
    EXPECT_EQ(before, camera->ReadControl(1)) << "the shadow keeps bit 1";
    EXPECT_FALSE(camera->GetBigEndian());
}

TEST(Setters, OfQuadletsBeyondTheBlockSendWhatTheyFormFrom0AndReadBack0) {
    CameraWorld world(R"({"base": "mono", "timeScale": 0, "cameras": [{
        "sensor": {"width": 64, "height": 48}, "versions": {"control": "2.4"}}]})");
    ASSERT_EQ(CameraOk, world.camera->Ready());
    (void)world.TakeWrites();

    EXPECT_EQ(CameraOk, world.camera->SetFanSpeed(2));
    EXPECT_EQ(CameraOk, world.camera->SetFanSpeed(2));

    const RegisterWrite fan{ControlAddress + 4 * 22, {2u << 16}, 0};
    EXPECT_THAT(world.TakeWrites(), ElementsAre(fan, fan));
    EXPECT_EQ(4u, world.camera->GetFanSpeed());
}

// Exposures.

TEST_F(ModernReadyCamera, WritesAnExposureUpperHalfFirst) {
    EXPECT_EQ(CameraOk, camera->SetExposure(5ull << 32 | 7));
    EXPECT_EQ(CameraOk, camera->SetRGBFilterRedExposure(8ull << 32 | 9));
    EXPECT_EQ(CameraOk, camera->SetRGBFilterBlueExposure(10));

    EXPECT_THAT(TakeControlWrites(), ElementsAre(Pair(6, 5), Pair(15, 7), Pair(7, 8), Pair(16, 9),
                                                 Pair(8, 0), Pair(17, 10)));
    EXPECT_EQ(5ull << 32 | 7, camera->GetExposure());
    EXPECT_EQ(8ull << 32 | 9, camera->GetRGBFilterRedExposure());
    EXPECT_EQ(10u, camera->GetRGBFilterBlueExposure());
}

TEST_F(ModernReadyCamera, EndsAnExposureAtItsFirstFailure) {
    ASSERT_TRUE(FailNextWrite());

    EXPECT_EQ(CameraHalFault, camera->SetExposure(7));

    EXPECT_THAT(TakeControlWrites(), ElementsAre(Pair(6, 0)));
}

TEST_F(EarlyReadyCamera, WritesAnExposureInMicrosecondsFrom1ToTheGreatest) {
    EXPECT_EQ(CameraOk, camera->SetExposure(12345678));
    EXPECT_EQ(CameraOk, camera->SetExposure(0));
    EXPECT_EQ(CameraOk, camera->SetExposure(UINT64_MAX));

    EXPECT_THAT(TakeControlWrites(), ElementsAre(Pair(6, 12345), Pair(6, 1), Pair(6, 0xFFFFFFFF)));
    EXPECT_EQ(0xFFFFFFFFull * 1000, camera->GetExposure());
}

TEST_F(EarlyReadyCamera, WritesAnOddNanosecondValueAtEveryCall) {
    EXPECT_EQ(CameraOk, camera->SetExposure(12345678));
    EXPECT_EQ(CameraOk, camera->SetExposure(12345678));

    EXPECT_EQ(2u, TakeControlWrites().size());
    EXPECT_EQ(12345000u, camera->GetExposure());
}

TEST_F(EarlyReadyCamera, CutsFilterExposuresTo32BitsOfNanoseconds) {
    EXPECT_EQ(CameraOk, camera->SetRGBFilterRedExposure(5000000000));
    EXPECT_EQ(CameraOk, camera->SetRGBFilterBlueExposure(1ull << 32));

    EXPECT_THAT(TakeControlWrites(), ElementsAre(Pair(7, 705032), Pair(8, 1)));
}

// Streaming and the take-over.

TEST_F(ModernReadyCamera, StopsAndStartsOnceForABatchOfSettings) {
    StartStreaming();

    EXPECT_EQ(CameraOk, camera->SetROI(0, 0, 32, 24));
    EXPECT_EQ(CameraOk, camera->SetBitDepth(16));
    EXPECT_FALSE(camera->IsCameraStreaming());
    EXPECT_TRUE(camera->streaming.restartAfterUpdate);
    EXPECT_EQ(CameraOk, camera->UpdateSettingsOnCamera());

    EXPECT_TRUE(camera->IsCameraStreaming());
    EXPECT_FALSE(camera->streaming.restartAfterUpdate);
    std::size_t switches = 0;
    for (const RegisterWrite& write : TakeWrites()) switches += write.address == StreamAddress + 4;
    EXPECT_EQ(2u, switches) << "one off, one on";
    EXPECT_TRUE(WaitUntil([&] { return client.GetImageCount() > 0; })) << "the callback is kept";
}

TEST_F(ModernReadyCamera, LeavesStreamingOffAfterOneSetterAlone) {
    StartStreaming();

    EXPECT_EQ(CameraOk, camera->SetROIX(1));

    EXPECT_FALSE(camera->IsCameraStreaming());
}

TEST_F(ModernReadyCamera, DoesNotStartAStreamThatNobodyHadStarted) {
    EXPECT_EQ(CameraOk, camera->SetROIX(1));
    EXPECT_EQ(CameraOk, camera->UpdateSettingsOnCamera());

    EXPECT_FALSE(camera->IsCameraStreaming());
}

TEST_F(ModernReadyCamera, TakesSettingsOverWithOneCommand) {
    EXPECT_EQ(CameraOk, camera->UpdateSettingsOnCamera());

    EXPECT_THAT(TakeWrites(), ElementsAre(RegisterWrite{CommandAddress + 4, {1}, 0}));
}

TEST_F(ModernReadyCamera, DoesNotRestartAndGivesItsLocksWhenTheCommandFails) {
    StartStreaming();
    EXPECT_EQ(CameraOk, camera->SetROIX(1));
    ASSERT_TRUE(FailNextWrite());

    EXPECT_EQ(CameraHalFault, camera->UpdateSettingsOnCamera());
    EXPECT_FALSE(camera->IsCameraStreaming());
    EXPECT_TRUE(camera->streaming.restartAfterUpdate);

    EXPECT_EQ(CameraOk, camera->UpdateSettingsOnCamera());
    EXPECT_TRUE(camera->IsCameraStreaming());
}

TEST_F(ModernReadyCamera, IgnoresFramesThatWereUnderWayAtTheTakeOver) {
    camera->streaming.isStreaming = true;
    tStFrameInfo* frame = camera->PrivatePeekNewFrame();
    ASSERT_NE(nullptr, frame);

    EXPECT_EQ(CameraOk, camera->UpdateSettingsOnCamera());

    EXPECT_FALSE(frame->valid);
    camera->streaming.isStreaming = false;
}

TEST_F(FullReadyCamera, ReadsAStaleConfigurationAgainAndFitsTheRoi) {
    EXPECT_EQ(CameraOk, camera->SetMiscCtrlAd(8));
    ASSERT_TRUE(world.Poke(ConfigurationAddress + 4 * 4, 32u << 16 | 24));
    (void)TakeWrites();

    EXPECT_EQ(CameraOk, camera->UpdateSettingsOnCamera());

    EXPECT_EQ(32u, camera->GetCCDWidth());
    EXPECT_FALSE(camera->streaming.configStale);
    EXPECT_THAT(TakeWrites(), ElementsAre(RegisterWrite{CommandAddress + 4, {1}, 0},
                                          RegisterWrite{ControlAddress + 12, {64u << 16 | 24}, 0},
                                          RegisterWrite{ControlAddress + 12, {32u << 16 | 24}, 0}));
}

TEST_F(FullReadyCamera, StaysStaleWhenTheConfigurationCannotBeRead) {
    EXPECT_EQ(CameraOk, camera->SetMiscCtrlAd(8));
    ASSERT_TRUE(world.AddFault(R"({"kind": "failRequest", "code": "FW_IOCTL_ASYNC_READ"})"));

    EXPECT_EQ(CameraHalFault, camera->UpdateSettingsOnCamera());

    EXPECT_TRUE(camera->streaming.configStale);
}

}  // namespace ZV::Test
