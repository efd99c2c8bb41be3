#include <gtest/gtest.h>

#include <map>
#include <memory>
#include <string>

#include "support/expect_zerr.h"
#include "support/first_setup_expectation.h"
#include "support/peeked_camera.h"
#include "support/simulation_world.h"
#include "zentara/zentara.h"

// The registers that the first listing writes to a camera, in their order, against a list that is
// calculated from the camera's configuration without the library.
namespace ZV::Test {
namespace {

struct SetupCase {
    const char* name;
    const char* className;  ///< Of the object that ends in the list.
    std::string scenario;
};

void PrintTo(const SetupCase& setup, std::ostream* stream) {
    *stream << setup.name;
}

std::string NameCase(const testing::TestParamInfo<SetupCase>& info) {
    return info.param.name;
}

/// A loaded library over a camera that stands on its bus, not listed yet.
class UnlistedCamera {
  public:
    explicit UnlistedCamera(const SetupCase& setup, std::uint32_t position = 0)
        : world(setup.scenario),
          isLoaded(Zentara_LoadDriver() == zerrNone),
          isStarted(world.Start()),
          registers(world, setup.className, position),
          contents(registers.ReadContents()) {}
    ~UnlistedCamera() {
        if (isLoaded) Zentara_ReleaseDriver();
    }
    UnlistedCamera(const UnlistedCamera&) = delete;
    UnlistedCamera& operator=(const UnlistedCamera&) = delete;

    bool IsReady() const { return isLoaded && isStarted; }
    const PeekedCamera& GetRegisters() const { return registers; }

    /// Number of cameras in the list.
    std::uint32_t List(ZentaraResult expected = zerrNone) const {
        Zentara_CamListItem items[16];
        std::uint32_t length = 16;
        EXPECT_ZERR(expected, Zentara_ListCameras(items, &length));
        return length;
    }

    ExpectedSetup CalculateSetup() const {
        CameraContents calculated = contents;
        calculated.configurationAfterTakeOver = registers.ReadConfiguration();
        return CalculateFirstSetup(calculated);
    }

  private:
    SimulationWorld world;
    bool isLoaded, isStarted;
    PeekedCamera registers;
    CameraContents contents;
};

/// The writes of `times` setups, one after the other.
testing::AssertionResult AreAsExpected(const UnlistedCamera& camera, std::size_t times = 1) {
    const std::vector<ExpectedWrite> once = camera.CalculateSetup().writes;
    std::vector<ExpectedWrite> expected;
    for (; times > 0; --times) expected.insert(expected.end(), once.begin(), once.end());
    return camera.GetRegisters().HasWritten(expected);
}

class FirstSetup : public testing::TestWithParam<SetupCase> {};

SetupCase MakeModelCase(const char* className) {
    return {className, className, std::string("model:") + className};
}

std::string MakeScenario(const std::string& base, const std::string& camera) {
    return R"({"base": ")" + base + R"(", "cameras": [)" + camera + "]}";
}

SetupCase MakeConfigurationCase(const char* name, const std::string& version) {
    return {name, "SolvaneA1",
            MakeScenario("mono", R"({"versions": {"configuration": ")" + version + R"("}})")};
}

SetupCase MakeControlCase(const char* name, const char* className, const std::string& version) {
    return {name, className,
            MakeScenario(std::string("model:") + className,
                         R"({"versions": {"control": ")" + version + R"("}})")};
}

SetupCase MakeCase(const char* name, const char* className, const std::string& camera) {
    return {name, className, MakeScenario(std::string("model:") + className, camera)};
}

TEST_P(FirstSetup, WritesTheseRegistersInThisOrderAndNoOthers) {
    const UnlistedCamera camera(GetParam());
    ASSERT_TRUE(camera.IsReady());

    EXPECT_EQ(1u, camera.List());

    EXPECT_FALSE(camera.CalculateSetup().isRefused);
    EXPECT_TRUE(AreAsExpected(camera));
}

TEST_P(FirstSetup, LeavesTheCameraAtTheLastValueOfEachRegister) {
    const UnlistedCamera camera(GetParam());
    ASSERT_TRUE(camera.IsReady());

    camera.List();

    std::map<std::uint32_t, std::uint32_t> last;
    for (const ExpectedWrite& write : camera.CalculateSetup().writes) {
        if (write.block != SetupBlock::Control) continue;
        last[camera.GetRegisters().GetAddress(write)] = write.value;
    }
    for (const auto& [address, value] : last) {
        EXPECT_EQ(value, camera.GetRegisters().Peek(address))
            << camera.GetRegisters().DescribeAddress(address);
    }
}

INSTANTIATE_TEST_SUITE_P(Of, FirstSetup,
                         testing::Values(MakeModelCase("SolvaneA1"), MakeModelCase("SolvaneA2"),
                                         MakeModelCase("DorixB1"), MakeModelCase("Folary"),
                                         MakeModelCase("SolvaneK1"), MakeModelCase("DorixR1"),
                                         MakeModelCase("SolvaneC1"), MakeModelCase("SolvaneB1"),
                                         MakeModelCase("PellanA1"), MakeModelCase("SolvaneD1"),
                                         MakeModelCase("SolvaneF1"), MakeModelCase("SolvaneC2"),
                                         MakeModelCase("SolvaneB2"), MakeModelCase("PellanB1"),
                                         MakeModelCase("SolvaneE1"), MakeModelCase("PellanA2"),
                                         MakeModelCase("SolvaneD2"), MakeModelCase("SolvaneG2"),
                                         MakeModelCase("SolvaneG1"), MakeModelCase("TirelM2"),
                                         MakeModelCase("TirelM1"), MakeModelCase("SolvaneH1"),
                                         MakeModelCase("SolvaneJ1"), MakeModelCase("Metrona"),
                                         MakeModelCase("Unknown")),
                         NameCase);

INSTANTIATE_TEST_SUITE_P(
    WithConfiguration, FirstSetup,
    testing::Values(MakeConfigurationCase("V1_1", "1.1"), MakeConfigurationCase("V2_1", "2.1"),
                    MakeConfigurationCase("V2_4", "2.4"), MakeConfigurationCase("V2_7", "2.7"),
                    MakeConfigurationCase("V2_9", "2.9"), MakeConfigurationCase("V2_10", "2.10"),
                    MakeConfigurationCase("V2_11", "2.11"),
                    MakeConfigurationCase("OfNoKnownVersion", "2.12")),
    NameCase);

// What a control block is too short for is written with a value formed from 0, each time.
INSTANTIATE_TEST_SUITE_P(
    WithControl, FirstSetup,
    testing::Values(SetupCase{"OfTheFirstGeneration", "SolvaneA1", "old"},
                    MakeControlCase("V1_1", "SolvaneA1", "1.1"),
                    MakeControlCase("V2_2AndItsFrequencyGuard", "PellanB1", "2.2"),
                    MakeControlCase("V2_3AndAFrequencyOf40", "PellanB1", "2.3"),
                    MakeControlCase("TooShortForTheRatioBoard", "PellanB1", "2.6"),
                    MakeControlCase("TooShortForTheCloseDelay", "SolvaneF1", "2.5"),
                    MakeControlCase("TooShortForTheTweaks", "TirelM1", "2.7"),
                    MakeControlCase("TooShortForTheIntensifier", "SolvaneK1", "1.2"),
                    MakeControlCase("OfNoKnownVersion", "SolvaneG2", "2.9"),
                    MakeControlCase("OfNoKnownVersionAndTweaks", "TirelM2", "2.9")),
    NameCase);

INSTANTIATE_TEST_SUITE_P(
    When, FirstSetup,
    testing::Values(
        MakeCase("PellanB1HasNoHardwareProfile", "PellanB1", R"({"configuration": {"201": 0}})"),
        MakeCase("PellanB1HasAnUnknownHardwareProfile", "PellanB1",
                 R"({"configuration": {"201": 4}})"),
        MakeCase("PellanB1HasAnOldAnalogBoard", "PellanB1",
                 R"({"configuration": {"201": 0}, "firmwareVersion": 99})"),
        MakeCase("TheAnalogBoardIsOld", "SolvaneC1", R"({"firmwareVersion": 99})"),
        MakeCase("TheAnalogBoardOfSolvaneA2IsOld", "SolvaneA2", R"({"firmwareVersion": 5})"),
        MakeCase("TheDefaultGainIsZero", "SolvaneG1", R"({"configuration": {"2": "0x00000100"}})"),
        MakeCase("FolaryIsOfConfiguration2_3", "Folary",
                 R"({"versions": {"configuration": "2.3"}})"),
        MakeCase("TheSensorOfFolaryIsOdd", "Folary",
                 R"({"sensor": {"width": 641, "height": 481}})"),
        MakeCase("AWheelModelHasAMosaic", "SolvaneG1", R"({"sensor": {"colour": "bayer"}})"),
        MakeCase("TheFilterWheelHasDelays", "SolvaneG2",
                 R"({"configuration": {"9": "0x00ABCDEF"}})"),
        MakeCase("ItsFeaturesAreAllThere", "SolvaneG1", R"({"configuration": {"169": "0x1F5E"}})"),
        MakeCase("TheVerticalClockHasNoResolution", "TirelM1", R"({"configuration": {"200": 0}})"),
        MakeCase("MiscCtrlIsZero", "TirelM1", R"({"configuration": {"208": 0}})"),
        MakeCase("MiscCtrlChangesTheSensor", "TirelM1",
                 R"({"alternate": {"controlQuadlet": 41, "value": 4,
                                   "configuration": {"4": "0x032004B0", "5": "0x01900258"}}})"),
        SetupCase{"SolvaneA1IsASolvaneB1", "SolvaneB1",
                  MakeScenario("mono", R"({"sensor": {"id": 46}})")}),
    NameCase);

TEST(FirstSetupOfSeveral, GivesEachCameraItsPositionAsParameterSetNumber) {
    for (std::uint32_t position = 0; position < 10; ++position) {
        const UnlistedCamera camera({"ten", "SolvaneA1", "ten"}, position);
        ASSERT_TRUE(camera.IsReady());

        EXPECT_EQ(10u, camera.List());

        EXPECT_TRUE(AreAsExpected(camera)) << "camera " << position;
    }
}

TEST(FirstSetupOfSeveral, ASecondListingDoesTheSameOnceMore) {
    const UnlistedCamera camera(MakeModelCase("SolvaneG2"));
    ASSERT_TRUE(camera.IsReady());

    camera.List();
    camera.List();

    EXPECT_TRUE(AreAsExpected(camera, 2));
}

TEST(FirstSetupRefused, MetronaWithAnotherControlVersionEndsAtItsShutterDelayWithoutAnError) {
    const UnlistedCamera camera(MakeControlCase("", "Metrona", "2.8"));
    ASSERT_TRUE(camera.IsReady());

    EXPECT_EQ(0u, camera.List());

    EXPECT_TRUE(camera.CalculateSetup().isRefused);
    EXPECT_TRUE(AreAsExpected(camera));
}

TEST(FirstSetupRefused, AnEMGainDefaultBeyondItsLimitEndsTheSetupAndTheListing) {
    const UnlistedCamera camera(MakeCase("", "SolvaneJ1", R"({"configuration": {"176": 1024}})"));
    ASSERT_TRUE(camera.IsReady());

    EXPECT_EQ(0u, camera.List(zerrDriverFault));

    EXPECT_TRUE(camera.CalculateSetup().isRefused);
    EXPECT_TRUE(AreAsExpected(camera));
}

}  // namespace
}  // namespace ZV::Test
