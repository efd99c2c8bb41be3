#include "simulation/settings.h"

#include <gtest/gtest.h>

#include "camera/register_map.h"
#include "simulation/configuration.h"

namespace ZV::Test {
namespace {

using namespace Simulation;

class Registers {
  public:
    explicit Registers(const char* model) : camera(MakeCamera(*FindModel(model))) {}
    explicit Registers(const CameraScenario& scenario) : camera(scenario) {}

    Registers& Set(const RegisterField& field, std::uint32_t value) {
        control[field.quadlet] = InsertField(field, control[field.quadlet], value);
        return *this;
    }
    Registers& SetRoi(std::uint32_t x, std::uint32_t y, std::uint32_t width, std::uint32_t height) {
        control[3] = width << 16 | height;
        control[4] = x << 16 | y;
        return *this;
    }
    CameraSettings Decode() const {
        return DecodeSettings(camera, control, MakeConfiguration(camera));
    }

    CameraScenario camera;
    std::vector<std::uint32_t> control = std::vector<std::uint32_t>(BlockQuadlets);
};

TEST(Settings, TheRegionIsTakenAsItStandsAtBinning1) {
    const ExposureSettings exposure =
        Registers("SolvaneA1").SetRoi(10, 20, 300, 200).Decode().exposure;

    EXPECT_EQ(10u, exposure.roiX);
    EXPECT_EQ(20u, exposure.roiY);
    EXPECT_EQ(300u, exposure.width);
    EXPECT_EQ(200u, exposure.height);
    EXPECT_EQ(1u, exposure.binningX);
}

TEST(Settings, ABinnedImageIsNoLargerThanItsMode) {
    const ExposureSettings exposure =
        Registers("SolvaneA1").SetRoi(0, 0, 1392, 1040).Set(ControlBinning, 1).Decode().exposure;

    EXPECT_EQ(2u, exposure.binningX);
    EXPECT_EQ(2u, exposure.binningY);
    EXPECT_EQ(696u, exposure.width);
    EXPECT_EQ(520u, exposure.height);
}

TEST(Settings, BinningCode2IsMode8OrMode3ByTheConfiguration) {
    EXPECT_EQ(8u, Registers("SolvaneA1").Set(ControlBinning, 2).Decode().exposure.binningX);
    EXPECT_EQ(3u, Registers("DorixB1").Set(ControlBinning, 2).Decode().exposure.binningX);
    EXPECT_EQ(4u, Registers("DorixB1").Set(ControlBinning, 3).Decode().exposure.binningX);
}

TEST(Settings, MetronaBinsEachAxisByItself) {
    const ExposureSettings exposure = Registers("Metrona")
                                          .SetRoi(0, 0, 1024, 58)
                                          .Set(ControlVerticalBinningMinusOne, 63)
                                          .Set(ControlHorizontalBinningMinusOne, 1)
                                          .Decode()
                                          .exposure;

    EXPECT_EQ(2u, exposure.binningX);
    EXPECT_EQ(64u, exposure.binningY);
    EXPECT_EQ(512u, exposure.width);
    EXPECT_EQ(1u, exposure.height);
    EXPECT_EQ(16u, exposure.bitDepth);
}

TEST(Settings, FolaryBinsRowsAloneAndSendsTwoFieldsOutsideRealTimeVideo) {
    Registers registers("Folary");
    registers.SetRoi(0, 0, 2560, 1920).Set(ControlBinning, 1);
    registers.Set(ControlVerticalBinningMinusOne, 1).Set(ControlHorizontalBinningMinusOne, 1);

    EXPECT_EQ(1u, registers.Decode().exposure.binningX);
    EXPECT_EQ(2u, registers.Decode().exposure.binningY);
    EXPECT_EQ(2560u, registers.Decode().exposure.width);
    EXPECT_EQ(960u, registers.Decode().exposure.height);
    EXPECT_TRUE(registers.Decode().isInterlaced);
    EXPECT_FALSE(registers.Set(ControlRtvMode, 1).Decode().isInterlaced);
}

TEST(Settings, RealTimeVideoOfFolaryAddsTheRowsThatTheScenarioSays) {
    Registers registers("Folary");
    registers.camera.sensor.videoBinning = 8;
    registers.SetRoi(0, 0, 2560, 240);

    EXPECT_EQ(1u, registers.Decode().exposure.binningY);
    EXPECT_EQ(8u, registers.Set(ControlRtvMode, 1).Decode().exposure.binningY);
    EXPECT_EQ(1u, registers.Decode().exposure.binningX);
    EXPECT_EQ(2560u, registers.Decode().exposure.width);
    EXPECT_EQ(240u, registers.Decode().exposure.height);
}

TEST(Settings, TheDepthCodesAre8TheMaximum12And14) {
    Registers registers("SolvaneH1");

    EXPECT_EQ(8u, registers.Set(ControlBitDepth, 0).Decode().exposure.bitDepth);
    EXPECT_EQ(16u, registers.Set(ControlBitDepth, 1).Decode().exposure.bitDepth);
    EXPECT_EQ(12u, registers.Set(ControlBitDepth, 2).Decode().exposure.bitDepth);
    EXPECT_EQ(14u, registers.Set(ControlBitDepth, 3).Decode().exposure.bitDepth);
}

TEST(Settings, SamplesAreBigEndianUntilToldOtherwise) {
    EXPECT_TRUE(Registers("SolvaneA1").Decode().exposure.isBigEndian);
    EXPECT_FALSE(Registers("SolvaneA1").Set(ControlLittleEndian, 1).Decode().exposure.isBigEndian);
}

TEST(Settings, ExposuresAreMicrosecondsAtControlMajor1) {
    Registers modern("SolvaneA1"), first("Metrona");
    modern.control[6] = first.control[6] = 2;
    modern.control[15] = first.control[15] = 5;

    EXPECT_EQ((2ull << 32) + 5, modern.Decode().exposure.exposureNs);
    EXPECT_EQ(2000u, first.Decode().exposure.exposureNs);
}

TEST(Settings, TheDefaultGainIs0DbOnEachBoard) {
    CameraScenario old = MakeCamera(*FindModel("SolvaneA1"));
    old.firmwareVersion = 90;

    for (const CameraScenario& camera : {old, MakeCamera(*FindModel("SolvaneA1"))}) {
        Registers registers(camera);
        EXPECT_DOUBLE_EQ(0, registers.Set(ControlGain, 600).Decode().exposure.gainDb);
        EXPECT_LT(registers.Set(ControlGain, 0).Decode().exposure.gainDb, 0);
        EXPECT_GT(registers.Set(ControlGain, 4095).Decode().exposure.gainDb, 20);
    }
    Registers ratio("PellanB1");
    EXPECT_DOUBLE_EQ(0, ratio.Set(ControlRatioGain, 64).Decode().exposure.gainDb);
    EXPECT_NEAR(6.02, ratio.Set(ControlRatioGain, 128).Decode().exposure.gainDb, 0.01);
}

TEST(Settings, TheIntensifierAddsItsGainAboveItsMinimum) {
    Registers registers("SolvaneK1");
    registers.Set(ControlGain, 600);

    EXPECT_DOUBLE_EQ(0, registers.Set(ControlIntensifierGain, 100).Decode().exposure.gainDb);
    EXPECT_NEAR(15.77, registers.Set(ControlIntensifierGain, 1100).Decode().exposure.gainDb, 0.01);
}

TEST(Settings, TheOriginOfATurnedImageCountsFromTheFarCorner) {
    const ExposureSettings exposure =
        Registers("SolvaneD1").SetRoi(100, 50, 500, 400).Decode().exposure;

    EXPECT_TRUE(exposure.isRotated);
    EXPECT_EQ(2048u - 100 - 500, exposure.roiX);
    EXPECT_EQ(2048u - 50 - 400, exposure.roiY);
}

TEST(Settings, APacketSizeIsToldFromControlVersion2Point3) {
    CameraScenario old = MakeCamera(*FindModel("SolvaneA1"));
    old.versions.control = MakeVersion(2, 2);

    EXPECT_EQ(300u, Registers("SolvaneA1").Set(ControlMaxPacketSize, 300).Decode().maxPacketBytes);
    EXPECT_EQ(0u, Registers(old).Set(ControlMaxPacketSize, 300).Decode().maxPacketBytes);
}

TEST(Settings, OnlyAMonochromeSensorHasAWheel) {
    EXPECT_TRUE(Registers("SolvaneA1").Set(ControlFilterCycle, 1).Decode().isCycling);
    EXPECT_FALSE(Registers("PellanA1").Set(ControlFilterCycle, 1).Decode().isCycling);
}

TEST(Settings, NonsenseInEachRegisterIsDecoded) {
    for (const char* model :
         {"SolvaneA1", "Folary", "Metrona", "PellanB1", "SolvaneD1", "SolvaneK1"}) {
        Registers registers(model);
        registers.control.assign(BlockQuadlets, 0xFFFFFFFF);
        const std::vector<std::uint32_t> ones(BlockQuadlets, 0xFFFFFFFF), zeros(BlockQuadlets);
        (void)DecodeSettings(registers.camera, registers.control, ones);
        (void)DecodeSettings(registers.camera, registers.control, zeros);
    }
}

}  // namespace
}  // namespace ZV::Test
