#include "models/pellan_b1.h"

#include <gtest/gtest.h>

#include "camera/bare_camera.h"
#include "camera/gain_conversion.h"
#include "models/listed_models.h"

namespace ZV::Test {

namespace {

/// Gain 16 to 255 with a default of 64, offset 10 to 16383 with a default of 100.
struct RatioCamera : BareCamera<PellanB1> {
    RatioCamera() {
        StoreConfiguration(201, 2);
        StoreConfiguration(178, 0xFF40);
        StoreConfiguration(179, 0xFF10);
        StoreConfiguration(180, 0xFFFF);
        StoreConfiguration(186, 100u << 2 | 3);
        StoreConfiguration(187, 10u << 2 | 3);
        StoreConfiguration(188, 16383u << 2 | 3);
        EXPECT_EQ(CameraOk, SetupNormalizedGain());
    }
};

/// Without a hardware profile the gain stands where it does on other cameras.
struct LinearCamera : BareCamera<PellanB1> {
    LinearCamera() {
        StoreConfiguration(2, 600u << 20 | 16u << 4);
        StoreConfiguration(30, 4095u << 4);
        StoreConfiguration(31, 4095u << 4);
        StoreConfiguration(66, 8337793);
        StoreConfiguration(ConfigFirmwareVersion, 100);
        EXPECT_EQ(CameraOk, SetupNormalizedGain());
    }
};

}  // namespace

TEST(PellanB1, HasABoardOfType3WithAHardwareProfile) {
    BareCamera<PellanB1> camera;
    for (const std::uint32_t profile : {1u, 2u, 3u}) {
        camera.StoreConfiguration(201, profile);
        EXPECT_EQ(3u, camera.GetAnalogBoardType());
    }
    camera.StoreConfiguration(201, 4);
    EXPECT_EQ(1u, camera.GetAnalogBoardType()) << "firmware 0";
    camera.StoreConfiguration(ConfigFirmwareVersion, 100);
    EXPECT_EQ(2u, camera.GetAnalogBoardType());
}

TEST(PellanB1, HasADacRangeOf128OnItsRatioBoardOnly) {
    EXPECT_EQ(128u, RatioCamera().GetGainDACRange());
    EXPECT_EQ(4096u, LinearCamera().GetGainDACRange());
}

TEST(PellanB1, HasReadoutPort1AndIgnoresAnother) {
    RatioCamera camera;

    EXPECT_EQ(1, camera.GetReadoutPort());
    EXPECT_EQ(CameraOk, camera.SetReadoutPort(2));
    EXPECT_EQ(1, camera.GetReadoutPort());
    EXPECT_FALSE(camera.IsReadoutPortSupported());
}

TEST(PellanB1, ReadsGainAndOffsetElsewhereOnItsRatioBoard) {
    RatioCamera camera;
    camera.StoreControl(26, 0xFF80);
    camera.StoreControl(28, 200u << 2 | 3);

    EXPECT_EQ(64u, camera.GetGainDefault());
    EXPECT_EQ(16u, camera.GetGainMin());
    EXPECT_EQ(255u, camera.GetGainMax());
    EXPECT_EQ(128u, camera.GetGain());
    EXPECT_EQ(100, camera.GetOffsetDefault());
    EXPECT_EQ(10, camera.GetOffsetMin());
    EXPECT_EQ(16383, camera.GetOffsetMax());
    EXPECT_EQ(200, camera.GetOffset());
    EXPECT_EQ(100, camera.GetAbsoluteOffset());
}

TEST(PellanB1, ChangesTheFieldsOfItsRatioBoardAlone) {
    RatioCamera camera;
    camera.StoreControl(26, 0xFF00);
    camera.StoreControl(28, 0xFFFF0003);

    EXPECT_EQ(CameraOk, camera.SetGain(0x181));
    EXPECT_EQ(CameraOk, camera.SetOffset(0x4001));

    EXPECT_EQ(0xFF81u, camera.ReadControl(26)) << "8 bits";
    EXPECT_EQ(0xFFFF0007u, camera.ReadControl(28)) << "14 bits";
}

TEST(PellanB1, StatesPlainRatiosOnItsRatioBoard) {
    RatioCamera camera;
    EXPECT_EQ(CameraOk, camera.SetGain(64));
    EXPECT_EQ(1u, camera.GetNormalizedGain());
    EXPECT_EQ(CameraOk, camera.SetGain(191));
    EXPECT_EQ(2u, camera.GetNormalizedGain()) << "truncated";

    EXPECT_DOUBLE_EQ(0.25, camera.GetNormalizedGainMin());
    EXPECT_DOUBLE_EQ(255 / 64.0, camera.GetNormalizedGainMax());
}

TEST(PellanB1, ReadsEveryGainAsTheLeastIndBOnItsRatioBoard) {
    RatioCamera camera;
    const std::int32_t least = CalculateNormdB(camera.gainModel.normGainMin);
    for (const std::uint32_t gain : {16u, 64u, 255u}) {
        EXPECT_EQ(CameraOk, camera.SetGain(gain));
        EXPECT_EQ(least, camera.GetNormalizedGaindB());
    }
    EXPECT_EQ(least, camera.GetNormalizedGaindBMin());
    EXPECT_EQ(least, camera.GetNormalizedGaindBMax());
}

TEST(PellanB1, SetsARatioInMillionthsOnItsRatioBoard) {
    RatioCamera camera;
    EXPECT_EQ(CameraOk, camera.SetNormalizedGain(2000000));
    EXPECT_EQ(128u, camera.GetGain());
    EXPECT_EQ(CameraOk, camera.SetNormalizedGain(1999999));
    EXPECT_EQ(127u, camera.GetGain()) << "truncated";
    EXPECT_EQ(CameraOk, camera.SetNormalizedGaindB(0));
    EXPECT_EQ(64u, camera.GetGain());
    EXPECT_EQ(CameraOk, camera.SetNormalizedGaindB(6000000));
    EXPECT_EQ(128u, camera.GetGain()) << "6 dB are 2.00";
}

TEST(PellanB1, SetsTheLeastGainForItsOwnReadingOnItsRatioBoard) {
    RatioCamera camera;
    EXPECT_EQ(CameraOk, camera.SetGain(128));

    EXPECT_EQ(CameraOk, camera.SetNormalizedGaindB(camera.GetNormalizedGaindB()));

    EXPECT_EQ(16u, camera.GetGain());
}

TEST(PellanB1, UsesTheOrdinaryRegistersWithoutItsRatioBoard) {
    LinearCamera camera;

    EXPECT_EQ(600u, camera.GetGainDefault());
    EXPECT_EQ(0u, camera.GetGainMin());
    EXPECT_EQ(4095u, camera.GetGainMax());
    EXPECT_EQ(16, camera.GetOffsetDefault());
    EXPECT_EQ(0, camera.GetOffsetMin());
    EXPECT_EQ(4095, camera.GetOffsetMax());
    EXPECT_EQ(CameraOk, camera.SetOffset(77));
    EXPECT_EQ(77, camera.GetOffset());
    EXPECT_EQ(77u << 4, camera.ReadControl(5));
    EXPECT_EQ(CameraOk, camera.SetGain(1234));
    EXPECT_EQ(1234u, camera.GetGain());
    EXPECT_EQ(1234u << 20 | 77u << 4, camera.ReadControl(5));
    EXPECT_EQ(camera.gainModel.gaindBMin, camera.GetNormalizedGaindBMin());
    EXPECT_EQ(camera.gainModel.gaindBMax, camera.GetNormalizedGaindBMax());
    EXPECT_DOUBLE_EQ(camera.gainModel.normGainMax / 1e6, camera.GetNormalizedGainMax());
}

TEST(PellanB1, SetsTheLeastGainForUnityWithoutItsRatioBoard) {
    LinearCamera camera;
    EXPECT_EQ(CameraOk, camera.SetGain(1234));

    EXPECT_EQ(CameraOk, camera.SetNormalizedGain(1000000));

    EXPECT_EQ(camera.gainModel.normGainMin, camera.GetNormalizedGain());
}

TEST(PellanB1, TakesdBForAGainWithoutItsRatioBoard) {
    LinearCamera camera;
    for (const std::int32_t gaindB : {10000000, 0, -5000000, -2147483647 - 1}) {
        EXPECT_EQ(CameraOk, camera.SetGain(1234));

        EXPECT_EQ(CameraOk, camera.SetNormalizedGaindB(gaindB));

        EXPECT_EQ(camera.gainModel.normGainMin, camera.GetNormalizedGain()) << gaindB;
    }
}

TEST(PellanB1, HasAPacketSizeOfItsOwn) {
    const ListedModels models("model:PellanB1");
    auto* const camera = models.GetFirst<PellanB1>();
    ASSERT_NE(nullptr, camera);
    ASSERT_EQ(CameraOk, camera->OpenCamera());
    ASSERT_EQ(40.0F, camera->GetReadoutFrequency());

    EXPECT_EQ(4660, camera->CalculateRequiredPacketSize(true)) << "9004 * 40 / 78 + 40, up";
    EXPECT_EQ(CameraOk, camera->SetBitDepth(16));
    EXPECT_EQ(9276, camera->CalculateRequiredPacketSize(false)) << "18008 * 40 / 78 + 40, up";
    EXPECT_EQ(9044, camera->CalculateRequiredPacketSize(true));
    EXPECT_EQ(8180, camera->CalculateRequiredPacketSize(1, 16, 40.0F)) << "the ordinary rule";
}

TEST(PellanB1, EndsAListingWhenALimitOfItsGainIs0) {
    const ListedModels models(R"({"cameras": [{"model": "PellanB1",
        "configuration": {"179": 0}}]})");

    EXPECT_EQ(CameraGainSetupFailed, models.result);
    EXPECT_TRUE(models.cameras.empty());
}

}  // namespace ZV::Test
