#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstring>
#include <functional>
#include <memory>
#include <ostream>

#include "camera/bare_camera.h"
#include "camera/camera_factory.h"
#include "hal/control_records.h"
#include "models/dorix_b1.h"
#include "models/dorix_r1.h"
#include "models/folary.h"
#include "models/listed_models.h"
#include "models/metrona.h"
#include "models/pellan_a1.h"
#include "models/pellan_a2.h"
#include "models/pellan_b1.h"
#include "models/solvane_a1.h"
#include "models/solvane_a2.h"
#include "models/solvane_b1.h"
#include "models/solvane_b2.h"
#include "models/solvane_c1.h"
#include "models/solvane_c2.h"
#include "models/solvane_d1.h"
#include "models/solvane_d2.h"
#include "models/solvane_e1.h"
#include "models/solvane_f1.h"
#include "models/solvane_g1.h"
#include "models/solvane_g2.h"
#include "models/solvane_h1.h"
#include "models/solvane_j1.h"
#include "models/solvane_k1.h"
#include "models/tirel_m1.h"
#include "models/tirel_m2.h"
#include "models/unknown.h"

/// What every model says of itself, each in one row.
namespace ZV::Test {

namespace {

using Modes = std::vector<std::uint32_t>;
using Binnings = std::vector<std::uint16_t>;
using Frequencies = std::vector<float>;

/// A model without a bus, seen through the base class.
struct BareModel {
    std::unique_ptr<MorvaneFWCamera> camera;
    std::function<void(const RegisterField&, std::uint32_t)> storeConfiguration;
    std::function<void(const RegisterField&, std::uint32_t)> storeControl;
};

template <typename Model>
BareModel MakeBare() {
    auto made = std::make_unique<BareCamera<Model>>();
    BareCamera<Model>* const bare = made.get();
    return {std::move(made),
            [bare](const RegisterField& field, std::uint32_t value) {
                bare->StoreConfiguration(field, value);
            },
            [bare](const RegisterField& field, std::uint32_t value) {
                bare->StoreControl(field, value);
            }};
}

template <typename Model>
bool IsOfClass(const MorvaneFWCamera* camera) {
    return typeid(*camera) == typeid(Model);
}

/// Boards below and from a firmware version.
struct Boards {
    std::uint32_t firmware, below, from;
};
constexpr Boards Always2{0, 2, 2};
constexpr Boards Always1{0, 1, 1};
constexpr Boards F100{100, 1, 2};
constexpr Boards F6{6, 1, 2};

/// Binning lists with the bit of quadlet 42 and without it.
struct BinningPair {
    Binnings with8, with3;
};
const BinningPair ListA{{1, 2, 4, 8}, {1, 2, 4, 8}};
const BinningPair ListB{{1, 2, 4}, {1, 2, 4}};
const BinningPair ListC{{1, 2, 4, 8}, {1, 2, 4, 3}};  // From firmware 102.
const BinningPair ListD{{1, 2}, {1, 2}};
const BinningPair ListE{{1, 2, 4, 8}, {1, 2}};
const BinningPair ListF{{1, 2, 4, 8}, {1, 2, 3, 4}};
const BinningPair ListG{{1, 2, 4, 8}, {1, 2, 4, 3}};
const BinningPair NoList{};

const Frequencies Base{2.5F, 5.0F, 10.0F, 20.0F};
const Frequencies From10{10.0F, 20.0F};
const Frequencies From5{5.0F, 10.0F, 20.0F};
const Frequencies To30{10.0F, 20.0F, 30.0F};

const Modes Short{0, 1, 2, 3, 4, 5};
const Modes Long{0, 1, 2, 3, 4, 5, 6, 7};
const Modes Two{0, 5};

struct Row {
    std::uint32_t id;
    const char* className;
    BareModel (*make)();
    bool (*isOfClass)(const MorvaneFWCamera*);
    const char* text;
    Boards boards;
    BinningPair binning;
    Frequencies slow, fast;  ///< Readout at 400 and at 800 megabits.
    float slowDefault, fastDefault;
    Modes triggers;
    std::uint32_t tag;
};

void PrintTo(const Row& row, std::ostream* stream) {
    *stream << row.className;
}

#define MODEL(name) #name, &MakeBare < name>, &IsOfClass < name>

const Row Rows[] = {
    {5, MODEL(SolvaneA1), "Solvane A1", F100, ListF, Base, Base, 20, 20, Short, 1},
    {6, MODEL(SolvaneA2), "Solvane A2", F6, ListF, Base, Base, 20, 20, Short, 1},
    {7, MODEL(DorixB1), "Dorix B1", F100, ListF, Base, Base, 20, 20, Short, 1},
    {8, MODEL(Folary), "Folary", Always1, NoList, Base, Base, 20, 20, Two, 1},
    {9, MODEL(SolvaneK1), "Solvane K1", Always2, ListE, Base, Base, 20, 20, Short, 1},
    {10, MODEL(DorixR1), "Dorix R1", Always2, ListD, Base, Base, 20, 20, Short, 1},
    {12, MODEL(SolvaneC1), "Solvane C1", F100, ListA, From10, From10, 20, 20, Short, 1},
    {13, MODEL(SolvaneB1), "Solvane B1", F100, ListA, From10, From10, 20, 20, Short, 1},
    {14, MODEL(PellanA1), "PellanA1", F100, ListC, Base, Base, 20, 20, Short, 1},
    {15, MODEL(SolvaneD1), "Solvane D1", Always2, ListA, From5, From5, 20, 20, Long, 1},
    {16, MODEL(SolvaneF1), "OEM Camera 3", Always2, ListA, Base, Base, 20, 20, Long, 1},
    {18, MODEL(SolvaneC2), "Solvane C2", Always2, ListA, From5, From5, 20, 20, Long, 1},
    {19, MODEL(SolvaneB2), "Solvane B2", Always2, ListA, From5, From5, 20, 20, Long, 1},
    {25, MODEL(PellanB1), "Pellan D1", F100, ListA, {40, 10, 20}, {40, 10, 20}, 40, 40, Long, 0},
    {26, MODEL(SolvaneE1), "Solvane E1", Always2, ListA, From10, To30, 20, 20, Long, 0},
    {27, MODEL(PellanA2), "Pellan A2", Always2, ListB, To30, To30, 20, 20, Long, 0},
    {28, MODEL(SolvaneD2), "Solvane D2", Always2, ListA, To30, To30, 20, 20, Long, 0},
    {29, MODEL(SolvaneG2), "Solvane G2", Always2, ListA, From5, From5, 20, 20, Long, 1},
    {30, MODEL(SolvaneG1), "Solvane G1", Always2, ListA, From5, From5, 20, 20, Long, 1},
    {31, MODEL(TirelM2), "Solvane M2", Always2, ListA, From10, To30, 20, 20, Long, 0},
    {32, MODEL(TirelM1), "Solvane M1", Always2, ListA, From10, From10, 20, 20, Long, 0},
    {33, MODEL(SolvaneH1), "Solvane H1", Always2, ListA, From10, To30, 20, 20, Long, 0},
    {1001, MODEL(SolvaneJ1), "SJT", Always1, ListC, Base, Base, 20, 20, Short, 1},
    {1002, MODEL(Metrona), "MT1", Always2, NoList, {5}, {5}, 5, 5, Short, 1},
    {99, MODEL(Unknown), "Unknown", Always2, ListG, Base, Base, 20, 20, Short, 1},
};

#undef MODEL

Binnings GetBinnings(MorvaneFWCamera& camera) {
    Binnings modes;
    camera.GetSymmetricalBinningModes(modes);
    return modes;
}

}  // namespace

class EachModel : public testing::TestWithParam<Row> {
  protected:
    BareModel bare = GetParam().make();
    MorvaneFWCamera& camera = *bare.camera;
};

TEST_P(EachModel, HasItsName) {
    EXPECT_STREQ(GetParam().text, camera.GetModelName());
}

TEST_P(EachModel, IsMadeFromItsId) {
    HALCamera record{};
    record.kind = 2;
    const std::unique_ptr<MorvaneFWCamera> made(MakeCamera(GetParam().id, record));

    ASSERT_NE(nullptr, made);
    EXPECT_TRUE(GetParam().isOfClass(made.get()));
}

TEST_P(EachModel, TellsItsAnalogBoardByItsFirmware) {
    const Boards& boards = GetParam().boards;
    if (boards.firmware > 0) {
        bare.storeConfiguration(ConfigFirmwareVersion, boards.firmware - 1);
        EXPECT_EQ(boards.below, camera.GetAnalogBoardType());
    }
    bare.storeConfiguration(ConfigFirmwareVersion, boards.firmware);
    EXPECT_EQ(boards.from, camera.GetAnalogBoardType());
}

TEST_P(EachModel, ListsItsSymmetricalBinningModes) {
    bare.storeConfiguration(ConfigFirmwareVersion, 102);
    EXPECT_EQ(GetParam().binning.with3, GetBinnings(camera));
    bare.storeConfiguration(ConfigBinningCode2Is8, 1);
    EXPECT_EQ(GetParam().binning.with8, GetBinnings(camera));
}

TEST_P(EachModel, ListsItsTriggersAndFewerWhileTheFilterWheelCycles) {
    Modes still, cycling;
    camera.GetTriggerModes(still);
    bare.storeControl(ControlFilterCycle, 1);
    camera.GetTriggerModes(cycling);

    EXPECT_EQ(GetParam().triggers, still);
    EXPECT_EQ(Two, cycling);
}

TEST_P(EachModel, ListsItsReadoutFrequenciesOfASlowConnection) {
    Frequencies modes;
    camera.GetReadoutFrequencyModes(modes);

    EXPECT_EQ(GetParam().slow, modes);
    EXPECT_EQ(GetParam().slowDefault, camera.GetReadoutFrequencyDefault());
}

/// Over the bus: 800 megabits.
TEST_P(EachModel, AnswersOnAFastConnectionAndReservesWithItsTag) {
    const ListedModels models(std::string("model:") + GetParam().className);
    auto* const listed = models.GetFirst<MorvaneFWCamera>();
    ASSERT_NE(nullptr, listed);
    EXPECT_TRUE(GetParam().isOfClass(listed));
    EXPECT_EQ(GetParam().id, listed->GetModel());
    EXPECT_EQ(GetParam().id, listed->ReturnMasqueradedModel());

    ASSERT_EQ(CameraOk, listed->OpenCamera());
    Frequencies modes;
    listed->GetReadoutFrequencyModes(modes);
    EXPECT_EQ(GetParam().fast, modes);
    EXPECT_EQ(GetParam().fastDefault, listed->GetReadoutFrequencyDefault());

    EXPECT_EQ(CameraOk, listed->ReallocateBandwidth(1000));
    AllocateResourcesRecord last{};
    for (const TraceRecord& request : models.world.ReadRequests()) {
        if (request.code == FW_IOCTL_ALLOC_RESOURCES)
            std::memcpy(&last, request.input.data(), std::min(sizeof last, request.input.size()));
    }
    EXPECT_EQ(1012u, last.maximumBytesPerFrame);
    EXPECT_EQ(GetParam().tag, last.tagCode);
}

INSTANTIATE_TEST_SUITE_P(Table, EachModel, testing::ValuesIn(Rows),
                         [](const testing::TestParamInfo<Row>& row) {
                             return std::string(row.param.className);
                         });

TEST(Models, AreTwentyFour) {
    EXPECT_EQ(25u, std::size(Rows)) << "and one for all other ids";
}

TEST(Models, OfIdsThatNobodyHasAreUnknown) {
    HALCamera record{};
    record.kind = 2;
    for (const std::uint32_t id :
         {0u, 4u, 11u, 17u, 20u, 21u, 22u, 23u, 24u, 34u, 1000u, 1003u, 0xFFFFu}) {
        const std::unique_ptr<MorvaneFWCamera> made(MakeCamera(id, record));
        EXPECT_TRUE(IsOfClass<Unknown>(made.get())) << id;
    }
}

TEST(Models, OfTheFirmwareListHaveTwoModesBelow102) {
    for (const BareModel& bare : {MakeBare<PellanA1>(), MakeBare<SolvaneJ1>()}) {
        bare.storeConfiguration(ConfigBinningCode2Is8, 1);
        bare.storeConfiguration(ConfigFirmwareVersion, 101);

        EXPECT_EQ((Binnings{1, 2}), GetBinnings(*bare.camera));
    }
}

TEST(Models, WithoutAFilterWheelSaySoThoughTheirSensorIsMonochrome) {
    for (const BareModel& bare : {MakeBare<DorixR1>(), MakeBare<PellanA1>()}) {
        EXPECT_EQ(1, bare.camera->GetCCDImageFormat());
        EXPECT_FALSE(bare.camera->IsRGBFilterSupported());
    }
    EXPECT_TRUE(MakeBare<SolvaneA1>().camera->IsRGBFilterSupported());
}

TEST(Models, OtherThanTheSeparateOnesDoNotBinTheirAxes) {
    for (const Row& row : Rows) {
        const BareModel bare = row.make();
        const std::string name = row.className;
        Binnings horizontal{7}, vertical{7};
        if (name == "Folary" || name == "Metrona") continue;
        bare.camera->GetHorizontalBinningModes(horizontal);
        bare.camera->GetVerticalBinningModes(vertical);

        EXPECT_TRUE(bare.camera->IsSymmetricalBinningSupported()) << name;
        EXPECT_FALSE(bare.camera->IsHorizontalBinningSupported()) << name;
        EXPECT_FALSE(bare.camera->IsVerticalBinningSupported()) << name;
        EXPECT_TRUE(horizontal.empty() && vertical.empty()) << name;
        EXPECT_EQ(CameraNotSupported, bare.camera->SetHorizontalBinning(2)) << name;
        if (name == "SolvaneF1") continue;
        EXPECT_EQ(CameraNotSupported, bare.camera->SetVerticalBinning(2)) << name;
    }
}

TEST(SolvaneA1, IsASolvaneB1WithSensor46Or53AndKeepsItsOwnLists) {
    BareCamera<SolvaneA1> camera;
    camera.StoreConfiguration(ConfigModel, 5);
    for (std::uint32_t sensor = 0; sensor < 80; ++sensor) {
        camera.StoreConfiguration(ConfigSensorModel, sensor);
        const bool isMasked = sensor == 46 || sensor == 53;

        EXPECT_EQ(isMasked ? 13u : 5u, camera.ReturnMasqueradedModel()) << sensor;
        EXPECT_EQ(5u, camera.GetModel());
    }
    camera.StoreConfiguration(ConfigSensorModel, 46);
    EXPECT_EQ((Binnings{1, 2, 3, 4}), GetBinnings(camera));
}

TEST(SolvaneA1, OfSensor53EndsInTheListAsOneSolvaneB1) {
    const ListedModels models(R"({"cameras": [{"model": "SolvaneA1", "sensor": {"id": 53}}]})");

    ASSERT_EQ(1u, models.cameras.size());
    ZCamera& camera = *models.cameras[0];
    EXPECT_STREQ("Solvane B1", camera.GetModelName());
    EXPECT_EQ(13u, camera.GetModel());
    Binnings modes;
    camera.GetSymmetricalBinningModes(modes);
    EXPECT_EQ((Binnings{1, 2, 4, 8}), modes) << "the lists of the class it ended as";
}

TEST(SolvaneB1, AnswersWithItsIdWhateverTheConfigurationSays) {
    BareCamera<SolvaneB1> camera;
    camera.StoreConfiguration(ConfigModel, 19);

    EXPECT_EQ(13u, camera.GetModel());
    EXPECT_EQ(13u, camera.ReturnMasqueradedModel());
}

TEST(SolvaneF1, AcceptsAVerticalBinningAndDoesNothing) {
    BareCamera<SolvaneF1> camera;

    EXPECT_EQ(CameraOk, camera.SetVerticalBinning(77));
    EXPECT_EQ(1, camera.GetVerticalBinningMode());
    EXPECT_FALSE(camera.IsVerticalBinningSupported());
}

TEST(SolvaneF1, HasACloseDelayWhateverTheConfigurationSays) {
    BareCamera<SolvaneF1> camera(MakeVersion(2, 6));

    EXPECT_TRUE(camera.IsShutterCloseDelayAvailable());
    EXPECT_EQ(26208u, camera.GetShutterCloseDelayMax());
    EXPECT_EQ(CameraOk, camera.SetShutterCloseDelay(64));
    EXPECT_EQ(64u, camera.GetShutterCloseDelay());
}

TEST(Unknown, OperatesAndPrintsAMessageForEachOfTwoQuestions) {
    BareCamera<Unknown> camera;
    camera.StoreConfiguration(ConfigSensorWidth, 100);
    testing::internal::CaptureStdout();

    (void)camera.GetAnalogBoardType();
    (void)GetBinnings(camera);
    (void)GetBinnings(camera);

    EXPECT_EQ(
        "GetAnalogBoardType() - unkown camera type being used\n"
        "GetSymmetricalBinningModes() - unkown camera type being used\n"
        "GetSymmetricalBinningModes() - unkown camera type being used\n",
        testing::internal::GetCapturedStdout());
    EXPECT_EQ(CameraOk, camera.SetROI(1, 2, 30, 40));
    EXPECT_EQ(30u, camera.GetROIWidth());
}

}  // namespace ZV::Test
