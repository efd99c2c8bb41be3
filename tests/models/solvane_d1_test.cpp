#include "models/solvane_d1.h"

#include <gtest/gtest.h>

#include "camera/bare_camera.h"

namespace ZV::Test {

namespace {

struct TurnedCamera : BareCamera<SolvaneD1> {
    explicit TurnedCamera(std::uint32_t streamingVersion = 2) {
        StoreConfiguration(4, 2048u << 16 | 2000);
        StoreConfiguration(ConfigStreamingVersion, streamingVersion);
        StoreControl(3, 2048u << 16 | 2000);
    }
};

}  // namespace

TEST(SolvaneD1, StatesItsRoiFromTheFarCornerInStreamingVersion2) {
    TurnedCamera camera;

    EXPECT_EQ(CameraOk, camera.SetROI(100, 200, 500, 300));

    EXPECT_EQ(1448u << 16 | 1500, camera.ReadControl(4));
    EXPECT_EQ(500u << 16 | 300, camera.ReadControl(3));
    EXPECT_EQ(100u, camera.GetROIX());
    EXPECT_EQ(200u, camera.GetROIY());
}

TEST(SolvaneD1, IsNotTurnedInOtherStreamingVersions) {
    for (const std::uint32_t version : {0u, 1u, 3u}) {
        TurnedCamera camera(version);

        EXPECT_EQ(CameraOk, camera.SetROI(100, 200, 500, 300));

        EXPECT_EQ(100u << 16 | 200, camera.ReadControl(4));
        EXPECT_EQ(100u, camera.GetROIX());
        EXPECT_EQ(CameraOk, camera.SetROI(0, 0, 0, 0)) << "the base takes it";
    }
}

TEST(SolvaneD1, ComparesTheRegisterAndNotItsMirror) {
    TurnedCamera camera;
    EXPECT_EQ(CameraOk, camera.SetROI(100, 0, 500, 2000));
    ASSERT_EQ(1448u, camera.ReadControlField(ControlRoiX));

    EXPECT_EQ(CameraOk, camera.SetROI(1448, 0, 500, 2000));

    EXPECT_EQ(100u, camera.ReadControlField(ControlRoiX));
    EXPECT_EQ(1448u, camera.GetROIX());
}

TEST(SolvaneD1, RefusesASizeOf0AndReads0Then) {
    TurnedCamera camera;
    EXPECT_EQ(CameraBadValue, camera.SetROI(0, 0, 0, 10));
    EXPECT_EQ(CameraBadValue, camera.SetROI(0, 0, 10, 0));
    EXPECT_EQ(2048u << 16 | 2000, camera.ReadControl(3));

    camera.StoreControl(3, 0);
    EXPECT_EQ(0u, camera.GetROIX());
    EXPECT_EQ(0u, camera.GetROIY());
}

TEST(SolvaneD1, WrapsARoiBeyondItsSensor) {
    TurnedCamera camera;

    EXPECT_EQ(CameraOk, camera.SetROI(2000, 0, 100, 2000));

    EXPECT_EQ(0xFFCCu, camera.ReadControlField(ControlRoiX)) << "the low 16 bits of -52";
    EXPECT_EQ(static_cast<std::uint32_t>(2048 - 0xFFCC - 100), camera.GetROIX());
}

TEST(SolvaneD1, MirrorsOnTheUnbinnedSensorWhileBinning) {
    TurnedCamera camera;
    camera.StoreConfiguration(5, 1024u << 16 | 1000);
    EXPECT_EQ(CameraOk, camera.SetSymmetricalBinning(2));

    EXPECT_EQ(CameraOk, camera.SetROI(0, 0, 1024, 1000));

    EXPECT_EQ(1024u << 16 | 1000, camera.ReadControl(4));
}

TEST(SolvaneD1, StopsAStreamForAnOffCentreRoiOnlyOnce) {
    TurnedCamera camera;
    EXPECT_EQ(CameraOk, camera.SetROI(100, 200, 500, 300));
    camera.streaming.isStreaming = true;

    EXPECT_EQ(CameraOk, camera.SetROI(100, 200, 500, 300));

    EXPECT_TRUE(camera.streaming.isStreaming);
    camera.streaming.isStreaming = false;
}

}  // namespace ZV::Test
