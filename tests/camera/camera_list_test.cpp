#include <gtest/gtest.h>

#include "camera/test_camera.h"
#include "imaging/image_pipeline.h"

namespace ZV::Test {

/// Cameras of a listing; frees what is left of them.
class CameraList {
  public:
    CameraList() = default;
    ~CameraList() {
        (void)ZCamera::FreeCameraList(cameras);
        (void)ZCamera::Shutdown();
    }
    CameraList(const CameraList&) = delete;
    CameraList& operator=(const CameraList&) = delete;

    std::vector<ZCamera*> cameras;
};

constexpr char TwoCameras[] =
    R"({"base": "mono", "timeScale": 0, "cameras": [{}, {"model": "PellanA1"}]})";

TEST(CameraListing, OfAnEmptyBusSucceedsWithNothing) {
    const SimulationWorld world("empty");
    CameraList list;

    EXPECT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));

    EXPECT_TRUE(list.cameras.empty());
}

TEST(CameraListing, MakesSetsUpAndClosesOneObjectForEachCamera) {
    const SimulationWorld world(TwoCameras);
    CameraList list;

    ASSERT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));

    ASSERT_EQ(2u, list.cameras.size());
    EXPECT_STREQ("Solvane A1", list.cameras[0]->GetModelName());
    EXPECT_STREQ("PellanA1", list.cameras[1]->GetModelName());
    for (ZCamera* camera : list.cameras) {
        EXPECT_FALSE(camera->IsCameraOpen());
        EXPECT_EQ(camera->GetCCDWidth(), camera->GetROIWidth());
    }
    EXPECT_EQ(0u, world.GetState(0xFFFFFFFF).openHandles);
}

TEST(CameraListing, AppendsToWhatTheVectorHolds) {
    const SimulationWorld world("mono");
    CameraList list;
    ASSERT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));
    ZCamera* first = list.cameras[0];
    ASSERT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));

    ASSERT_EQ(2u, list.cameras.size());
    EXPECT_EQ(first, list.cameras[0]);
}

TEST(CameraListing, LeavesOutACameraThatSomeoneElseHolds) {
    const SimulationWorld world("held");
    CameraList list;

    EXPECT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));

    ASSERT_EQ(1u, list.cameras.size());
    EXPECT_STREQ("Solvane A1", list.cameras[0]->GetModelName());
}

TEST(CameraListing, LeavesOutACameraThatThisProcessHasOpen) {
    const SimulationWorld world(TwoCameras);
    CameraList list;
    ASSERT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));
    ASSERT_EQ(CameraOk, list.cameras[0]->OpenCamera());
    CameraList again;

    EXPECT_EQ(CameraOk, ZCamera::GetCameraList(again.cameras));

    ASSERT_EQ(1u, again.cameras.size());
    EXPECT_STREQ("PellanA1", again.cameras[0]->GetModelName());
    EXPECT_TRUE(list.cameras[0]->IsCameraOpen());
    EXPECT_EQ(CameraOk, list.cameras[0]->CloseCamera());
    EXPECT_EQ(CameraOk, ZCamera::FreeCameraList(list.cameras));
    EXPECT_EQ(CameraOk, ZCamera::FreeCameraList(again.cameras));
}

class SolvaneA1WithSensor : public testing::TestWithParam<int> {};

TEST_P(SolvaneA1WithSensor, BecomesOneSolvaneB1WhoseDeviceRecordLivesOn) {
    const SimulationWorld world(R"({"base": "model:SolvaneA1", "timeScale": 0,
        "cameras": [{"sensor": {"id": )" +
                                std::to_string(GetParam()) + "}}]}");
    CameraList list;

    ASSERT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));

    ASSERT_EQ(1u, list.cameras.size());
    EXPECT_STREQ("Solvane B1", list.cameras[0]->GetModelName());
    EXPECT_EQ(13u, list.cameras[0]->GetModel());
    EXPECT_EQ(CameraOk, list.cameras[0]->OpenCamera());
    EXPECT_EQ(1u, world.GetState().openHandles);
    EXPECT_EQ(CameraOk, list.cameras[0]->CloseCamera());
}

INSTANTIATE_TEST_SUITE_P(MasqueradedSensors, SolvaneA1WithSensor, testing::Values(46, 53));

TEST(CameraListing, MakesAnUnknownCameraForAnIdWithoutAClass) {
    const SimulationWorld world("model:Unknown");
    CameraList list;

    ASSERT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));

    ASSERT_EQ(1u, list.cameras.size());
    EXPECT_STREQ("Unknown", list.cameras[0]->GetModelName());
}

TEST(CameraListing, SucceedsWithACameraOfAnUnknownVersion) {
    const SimulationWorld world(
        R"({"base": "mono", "timeScale": 0, "cameras": [{"versions": {"configuration": "2.12"}}]})");
    CameraList list;

    EXPECT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));

    ASSERT_EQ(1u, list.cameras.size());
    EXPECT_EQ(0u, list.cameras[0]->GetCCDWidth());
}

TEST(CameraListing, FailsAsAWholeAtOneBadCameraAndKeepsWhatCameBefore) {
    const SimulationWorld world(R"({"base": "mono", "timeScale": 0, "cameras": [{},
        {"model": "PellanA1", "faults": [
            {"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE", "count": 0}]},
        {"model": "SolvaneG1"}]})");
    CameraList list;

    EXPECT_EQ(CameraHalFault, ZCamera::GetCameraList(list.cameras));

    EXPECT_EQ(1u, list.cameras.size());
}

TEST(CameraListing, EndsALostCameraAtTheNextListing) {
    const SimulationWorld world(R"({"base": "mono", "timeScale": 0, "cameras": [
        {"faults": [{"kind": "failRequest", "code": "FW_IOCTL_ASYNC_WRITE"}]}]})");
    CameraList list;
    ASSERT_EQ(CameraHalFault, ZCamera::GetCameraList(list.cameras));
    EXPECT_EQ(1u, world.GetState().openHandles) << "the listing lost it open";

    EXPECT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));

    EXPECT_EQ(1u, list.cameras.size());
    EXPECT_EQ(0u, world.GetState().openHandles);
}

TEST(CameraListing, FailsWhenTheDevicesCannotBeListed) {
    const SimulationWorld world(
        R"({"base": "mono", "timeScale": 0, "discoveryFaults": [{"step": 1}]})");
    CameraList list;

    EXPECT_EQ(CameraHalFault, ZCamera::GetCameraList(list.cameras));

    EXPECT_TRUE(list.cameras.empty());
}

TEST(CameraListing, SeesTenCamerasAtMost) {
    const SimulationWorld world(
        R"({"base": "ten", "timeScale": 0, "cameras": [{}, {}, {}, {}, {}, {}, {}, {}, {}, {},
            {"model": "SolvaneA1"}]})");
    CameraList list;

    EXPECT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));

    EXPECT_EQ(10u, list.cameras.size());
}

class TwoListedCameras : public testing::Test {
  protected:
    TwoListedCameras() : world(TwoCameras) {}
    void SetUp() override {
        ASSERT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));
        ASSERT_EQ(2u, list.cameras.size());
    }

    SimulationWorld world;
    CameraList list;
};

TEST_F(TwoListedCameras, AreAllErasedWhenTheyAreClosed) {
    EXPECT_EQ(CameraOk, ZCamera::EraseClosedCamerasFromList(list.cameras));

    EXPECT_TRUE(list.cameras.empty());
}

TEST_F(TwoListedCameras, StayWhenTheFirstIsOpen) {
    ASSERT_EQ(CameraOk, list.cameras[0]->OpenCamera());

    EXPECT_EQ(CameraOk, ZCamera::EraseClosedCamerasFromList(list.cameras));

    EXPECT_EQ(2u, list.cameras.size());
}

TEST_F(TwoListedCameras, LoseTheFirstAloneWhenTheSecondIsOpen) {
    ZCamera* second = list.cameras[1];
    ASSERT_EQ(CameraOk, second->OpenCamera());

    EXPECT_EQ(CameraOk, ZCamera::EraseClosedCamerasFromList(list.cameras));

    ASSERT_EQ(1u, list.cameras.size());
    EXPECT_EQ(second, list.cameras[0]);
}

TEST_F(TwoListedCameras, AreDroppedUndeletedWhenTheListIsErased) {
    std::vector<ZCamera*> kept = list.cameras;

    EXPECT_EQ(CameraOk, ZCamera::EraseCameraList(list.cameras));

    EXPECT_TRUE(list.cameras.empty());
    EXPECT_STREQ("Solvane A1", kept[0]->GetModelName());
    EXPECT_EQ(CameraOk, ZCamera::FreeCameraList(kept));
}

TEST_F(TwoListedCameras, AreClosedWhenTheListIsFreed) {
    ASSERT_EQ(CameraOk, list.cameras[0]->OpenCamera());
    ASSERT_EQ(CameraOk, list.cameras[1]->OpenCamera());

    EXPECT_EQ(CameraOk, ZCamera::FreeCameraList(list.cameras));

    EXPECT_TRUE(list.cameras.empty());
    EXPECT_EQ(0u, world.GetState(0xFFFFFFFF).openHandles);
}

TEST_F(TwoListedCameras, AreFreedAlsoWhenTheirCloseFails) {
    ASSERT_EQ(CameraOk, list.cameras[0]->OpenCamera());
    ASSERT_TRUE(world.AddFault(
        R"({"kind": "failRequest", "code": "FW_IOCTL_FREE_RESOURCES", "count": 0})"));

    EXPECT_EQ(CameraOk, ZCamera::FreeCameraList(list.cameras));

    EXPECT_EQ(0u, world.GetState().openHandles);
}

TEST(CameraClass, IsInitializedOnce) {
    const SimulationWorld world("mono");
    (void)ZCamera::Shutdown();

    EXPECT_FALSE(ZCamera::IsInitalized());
    EXPECT_EQ(CameraOk, ZCamera::Initialize());
    EXPECT_TRUE(ZCamera::IsInitalized());
    EXPECT_EQ(CameraAlreadyInitialized, ZCamera::Initialize());
    EXPECT_TRUE(ZCamera::IsInitalized());
    EXPECT_EQ(CameraOk, ZCamera::Shutdown());
    EXPECT_FALSE(ZCamera::IsInitalized());
}

TEST(CameraClass, ClosesTheBusLayerOnAShutdownWithoutAnInitialize) {
    const SimulationWorld world("mono");
    {
        CameraList list;
        ASSERT_EQ(CameraOk, ZCamera::GetCameraList(list.cameras));
        ASSERT_GT(world.GetState().requestsServed, 0u);
        ASSERT_EQ(CameraOk, ZCamera::FreeCameraList(list.cameras));
    }

    EXPECT_EQ(CameraOk, ZCamera::Shutdown());

    EXPECT_EQ(0u, world.GetState().requestsServed) << "the bus has ended";
}

TEST(CameraClass, PassesItsTraceSwitchesOnToTheBusLayer) {
    ZCamera::SetShouldOutputReads(true);
    ZCamera::SetShouldOutputWrites(true);
    EXPECT_TRUE(ZCamera::GetShouldOutputReads());
    EXPECT_TRUE(ZCamera::GetShouldOutputWrites());
    EXPECT_EQ(1, GetHalOutputReads());
    EXPECT_EQ(1, GetHalOutputWrites());

    ZCamera::SetShouldOutputReads(false);
    ZCamera::SetShouldOutputWrites(false);

    EXPECT_EQ(0, GetHalOutputReads());
    EXPECT_EQ(0, GetHalOutputWrites());
}

TEST(CameraClass, TurnsTheTraceOfWritesOffWithEachNewCameraAndLeavesThatOfReads) {
    ZCamera::SetShouldOutputReads(true);
    ZCamera::SetShouldOutputWrites(true);

    const TestCamera camera(HALCamera{});

    EXPECT_FALSE(ZCamera::GetShouldOutputWrites());
    EXPECT_EQ(0, GetHalOutputWrites());
    EXPECT_TRUE(ZCamera::GetShouldOutputReads());
    EXPECT_EQ(1, GetHalOutputReads());
    ZCamera::SetShouldOutputReads(false);
}

TEST(CameraClass, MakesPipelinesAndFiltersForEachCamera) {
    TestCamera camera(HALCamera{});

    EXPECT_NE(nullptr, camera.GetImagePipeline());
    EXPECT_NE(nullptr, camera.GetBayerPipeline());
    EXPECT_NE(camera.GetImagePipeline(), camera.GetBayerPipeline());
    EXPECT_NE(nullptr, camera.GetBayerFilter());
    EXPECT_NE(nullptr, camera.GetFYRatioCorrectionFilter());
    EXPECT_EQ(nullptr, camera.GetRefCon());
    EXPECT_FALSE(camera.IsCameraOpen());
    EXPECT_FALSE(camera.DoWeHaveExclusiveAccess());
}

TEST(CameraClass, TakesARecordOfAConnectedDeviceForAnOpenCamera) {
    HALCamera record{};
    record.connected = 1;
    record.kind = 7;  // no back end

    TestCamera camera(record);

    EXPECT_TRUE(camera.IsCameraOpen());
    EXPECT_FALSE(camera.DoWeHaveExclusiveAccess());
}

TEST(CameraClass, HasCopiesThatOwnNothing) {
    CameraWorld one(SmallCamera);
    ASSERT_EQ(CameraOk, one.camera->Ready());
    int client = 0;
    one.camera->SetRefCon(&client);
    {
        TestCamera copy(*one.camera);
        EXPECT_EQ(&client, copy.GetRefCon());
        EXPECT_EQ(nullptr, copy.GetImagePipeline());
        EXPECT_EQ(0u, copy.GetCCDWidth());
        EXPECT_FALSE(copy.IsCameraOpen());
    }

    EXPECT_EQ(64u, one.camera->GetCCDWidth());
    EXPECT_EQ(1u, one.world.GetState().openHandles);
}

TEST(CameraDefaults, AreThoseOfACameraWithoutAModelsKnowledge) {
    TestCamera camera(HALCamera{});
    std::vector<std::uint16_t> modes = {1, 2};

    EXPECT_EQ(1u, camera.GetNormalizedGainDefault());
    EXPECT_EQ(1u, camera.GetROIMaxWidthForRTVMode());
    EXPECT_EQ(1u, camera.GetROIMaxHeightForRTVMode());
    EXPECT_EQ(0u, camera.GetNormalizedIntensifierGain());
    EXPECT_EQ(0u, camera.GetNormalizedIntensifierGainMin());
    EXPECT_EQ(0u, camera.GetNormalizedIntensifierGainMax());
    EXPECT_EQ(0u, camera.GetNormalizedIntensifierGaindBResolution());
    EXPECT_EQ(0u, camera.GetNormalizedIntensifierGainSignificantFigures());
    EXPECT_EQ(0u, camera.GetNormalizedIntensifierGaindB());
    EXPECT_EQ(0, camera.GetNormalizedIntensifierGaindBMin());
    EXPECT_EQ(0, camera.GetNormalizedIntensifierGaindBMax());
    EXPECT_EQ(0u, camera.GetIntensifierGain());
    EXPECT_EQ(0u, camera.GetIntensifierGainMin());
    EXPECT_EQ(0u, camera.GetIntensifierGainMax());
    EXPECT_EQ(0, camera.GetAbsoluteOffsetDefault());
    EXPECT_EQ(0u, camera.GetMetronaShutterDelay());
    EXPECT_EQ(0u, camera.GetReadoutPort());
    EXPECT_EQ(CameraOk, camera.SetupNormalizedIntensifiedGain());
    EXPECT_EQ(CameraNotSupported, camera.SetHorizontalBinning(1));
    EXPECT_EQ(CameraNotSupported, camera.SetVerticalBinning(1));
    EXPECT_EQ(CameraNotSupported, camera.SetRTVMode(false));
    EXPECT_EQ(CameraNotSupported, camera.SetReadoutPort(1));
    EXPECT_EQ(CameraNotSupported, camera.SetMetronaShutterDelay(1));
    EXPECT_EQ(CameraNotSupported, camera.SetNormalizedIntensifierGain(1));
    EXPECT_TRUE(camera.IsSymmetricalBinningSupported());
    EXPECT_TRUE(camera.IsSyncBSupported());
    EXPECT_FALSE(camera.IsRTVModeSupported());
    EXPECT_FALSE(camera.IsHorizontalBinningSupported());
    EXPECT_FALSE(camera.IsVerticalBinningSupported());
    EXPECT_FALSE(camera.IsIntensifierAvailable());
    EXPECT_FALSE(camera.IsTriggerDelayAvialable());
    EXPECT_FALSE(camera.IsReadoutPortSupported());
    EXPECT_FALSE(camera.IsMetronaShutterDelaySupported());
    EXPECT_FALSE(camera.MorvaneFWCamera::DoesSupportExternalBuffers());
    EXPECT_FALSE(camera.GetRTVMode());
    EXPECT_EQ(16384000u, camera.GetDefaultExposure());
    camera.GetHorizontalBinningModes(modes);
    EXPECT_TRUE(modes.empty());
    modes = {1, 2};
    camera.GetVerticalBinningModes(modes);
    EXPECT_TRUE(modes.empty());
}

TEST(HalStatus, IsTranslatedByOneTable) {
    EXPECT_EQ(7, TranslateHalStatus(24));
    EXPECT_EQ(25, TranslateHalStatus(39));
    for (const std::uint32_t status : {6u, 17u, 18u, 19u, 28u, 29u, 31u, 37u, 997u, 12345u}) {
        EXPECT_EQ(9, TranslateHalStatus(status)) << status;
    }
}

}  // namespace ZV::Test
