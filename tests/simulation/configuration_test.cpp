#include "simulation/configuration.h"

#include <gtest/gtest.h>

#include "camera/register_map.h"

namespace ZV::Test {
namespace {

using namespace Simulation;

std::vector<std::uint32_t> Make(const CameraScenario& camera) {
    return MakeConfiguration(camera);
}

std::uint32_t Get(const std::vector<std::uint32_t>& quadlets, const RegisterField& field) {
    return ExtractField(field, quadlets[field.quadlet]);
}

class EachModel : public ::testing::TestWithParam<const char*> {
  protected:
    CameraScenario camera = MakeCamera(*FindModel(GetParam()));
    std::vector<std::uint32_t> quadlets = Make(camera);
};

TEST_P(EachModel, CanBeSetUpByTheLibrary) {
    EXPECT_NE(0u, quadlets[ConfigGainSpan]);
    EXPECT_GE(quadlets[0], MakeVersion(2, 4));
    EXPECT_GT(Get(quadlets, ConfigSensorWidth), 0u);
    EXPECT_GT(Get(quadlets, ConfigSensorHeight), 0u);
    EXPECT_LT(Get(quadlets, ConfigGainMin), Get(quadlets, ConfigGainDefault));
    EXPECT_LT(Get(quadlets, ConfigGainDefault), Get(quadlets, ConfigGainMax));
    EXPECT_GT(Get(quadlets, ConfigRatioGainMin), 0u);
    EXPECT_LT(Get(quadlets, ConfigRatioGainMin), Get(quadlets, ConfigRatioGainDefault));
    EXPECT_LT(Get(quadlets, ConfigRatioGainDefault), Get(quadlets, ConfigRatioGainMax));
    EXPECT_LE(Get(quadlets, ConfigEMGainMin), Get(quadlets, ConfigEMGainDefault));
    EXPECT_LE(Get(quadlets, ConfigEMGainDefault), Get(quadlets, ConfigEMGainMax));
    EXPECT_GT(quadlets[ConfigVClockResolution], 0u);
    EXPECT_EQ(camera.modelId, Get(quadlets, ConfigModel));
    EXPECT_EQ(camera.streamingVersion, Get(quadlets, ConfigStreamingVersion));
}

TEST_P(EachModel, NamesASensorThatHasAName) {
    EXPECT_LT(Get(quadlets, ConfigSensorModel), 78u);
}

TEST_P(EachModel, HasFeaturesOnlyWhereItsControlBlockHasTheRegister) {
    const bool hasFan = Get(quadlets, ConfigFanControl) != 0;
    EXPECT_TRUE(!hasFan || camera.versions.control >= MakeVersion(2, 5));
    const bool needsModern = Get(quadlets, ConfigEMGain) || Get(quadlets, ConfigCloseDelay) ||
                             Get(quadlets, ConfigVClock) || Get(quadlets, ConfigDither);
    EXPECT_TRUE(!needsModern || camera.versions.control >= MakeVersion(2, 7));
}

INSTANTIATE_TEST_SUITE_P(Configuration, EachModel,
                         ::testing::Values("SolvaneA1", "SolvaneA2", "DorixB1", "Folary",
                                           "SolvaneK1", "DorixR1", "SolvaneC1", "SolvaneB1",
                                           "PellanA1", "SolvaneD1", "SolvaneF1", "SolvaneJ1",
                                           "SolvaneC2", "SolvaneB2", "PellanB1", "SolvaneE1",
                                           "PellanA2", "SolvaneD2", "SolvaneG2", "SolvaneG1",
                                           "TirelM2", "TirelM1", "SolvaneH1", "Metrona", "Unknown"),
                         [](const auto& row) { return std::string(row.param); });

TEST(Configuration, TheIntensifiersLimitsDiffer) {
    const auto quadlets = Make(MakeCamera(*FindModel("SolvaneK1")));

    EXPECT_LT(Get(quadlets, ConfigIntensifierMin), Get(quadlets, ConfigIntensifierMax));
}

TEST(Configuration, MetronasControlBlockIsExactly1Point2) {
    EXPECT_EQ(MakeVersion(1, 2), MakeCamera(*FindModel("Metrona")).versions.control);
}

TEST(Configuration, ASerialStandsInBusOrder) {
    CameraScenario camera;
    camera.serial = "ABCDE";
    const auto quadlets = Make(camera);

    EXPECT_EQ(0x41424344u, quadlets[ConfigSerialFirst]);
    EXPECT_EQ(0x45000000u, quadlets[ConfigSerialFirst + 1]);
}

TEST(Configuration, ExposuresAreMicrosecondsInTheFirstGeneration) {
    Scenario scenario;
    ASSERT_TRUE(MakeBuiltInScenario("old", &scenario));

    EXPECT_EQ(10u, Make(scenario.cameras.front())[ConfigMinExposure]);
    EXPECT_EQ(0u, Make(CameraScenario{})[ConfigMinExposure]);
    EXPECT_EQ(10000u, Make(CameraScenario{})[ConfigMinExposureLow]);
}

TEST(Configuration, TheScenariosQuadletsReplaceTheModels) {
    CameraScenario camera;
    camera.configuration[4] = 0xFFFFFFFF;

    EXPECT_EQ(0xFFFFFFFF, Make(camera)[4]);
}

TEST(Scenario, SerialUniqueIdSeedAndPathDifferFromCameraToCamera) {
    Scenario scenario;
    ASSERT_TRUE(MakeBuiltInScenario("ten", &scenario));
    FinishScenario(&scenario);

    for (std::size_t i = 1; i < scenario.cameras.size(); ++i) {
        const CameraScenario &a = scenario.cameras[i - 1], &b = scenario.cameras[i];
        EXPECT_NE(a.serial, b.serial);
        EXPECT_NE(a.uniqueId, b.uniqueId);
        EXPECT_NE(a.seed, b.seed);
        EXPECT_NE(a.path, b.path);
    }
}

TEST(Models, AnIdWithoutARowIsUnknown) {
    EXPECT_STREQ("Unknown", GetModel(4).name);
    EXPECT_STREQ("Metrona", GetModel(1002).name);
    EXPECT_EQ(nullptr, FindModel("Nobody"));
}

}  // namespace
}  // namespace ZV::Test
