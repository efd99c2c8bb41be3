#include <gtest/gtest.h>

#include <algorithm>
#include <cstdio>
#include <ostream>
#include <string>

#include "camera/test_camera.h"

/// What a camera is written on its first setup, quadlet by quadlet: told here from the order of the
/// default state and the encodings of the settings, not taken from the library.
namespace ZV::Test {

namespace {

// What the simulated cameras report.
constexpr std::uint32_t GainDefault = 600;
constexpr std::uint32_t OffsetDefault = 16;
constexpr std::uint32_t FilterDelays = 0x00ABCDEF;

// Kinds of step that only some models take.
constexpr unsigned FilterWheel = 1u << 0;
constexpr unsigned SyncB = 1u << 1;
constexpr unsigned RegulatedCooling = 1u << 2;
constexpr unsigned Cooler = 1u << 3;
constexpr unsigned CloseDelay = 1u << 4;
constexpr unsigned VClock = 1u << 5;
constexpr unsigned EMGain = 1u << 6;
constexpr unsigned Intensifier = 1u << 7;
constexpr unsigned Tweak = 1u << 8;
constexpr unsigned Microseconds = 1u << 9;  ///< Exposures at control major 1.
constexpr unsigned RatioBoard = 1u << 10;   ///< Gain and offset of board type 3.
constexpr unsigned Fields = 1u << 11;       ///< Binning of the camera of two fields.
constexpr unsigned AlwaysSixteenBits = 1u << 12;
constexpr unsigned ShutterDelay = 1u << 13;

constexpr unsigned Mono = FilterWheel | SyncB;
constexpr unsigned Cooled = Mono | RegulatedCooling | Cooler;

struct ModelRow {
    const char* scenario;
    std::uint32_t width, height;
    std::uint32_t frequencyCode;  ///< Of the fastest rate, or of the model's own default.
    std::uint64_t exposureNs;
    unsigned steps;
};

constexpr std::uint64_t BaseExposure = 16384000;

const ModelRow Models[] = {
    {"model:SolvaneA1", 1392, 1040, 0, BaseExposure, Cooled},
    {"model:SolvaneA2", 1300, 1030, 0, BaseExposure, Cooled},
    {"model:DorixB1", 1392, 1040, 0, BaseExposure, Cooled},
    {"model:Folary", 2560, 1920, 0, 100000000, Fields},
    {"model:SolvaneK1", 1392, 1040, 0, BaseExposure, Cooled | Intensifier},
    {"model:DorixR1", 1300, 1030, 0, BaseExposure, SyncB | RegulatedCooling | Cooler},
    {"model:SolvaneC1", 2048, 2048, 0, BaseExposure, Cooled},
    {"model:SolvaneB1", 1600, 1200, 0, BaseExposure, Cooled},
    {"model:PellanA1", 1392, 1040, 0, BaseExposure, SyncB},
    {"model:SolvaneD1", 2048, 2048, 0, BaseExposure, Cooled},
    {"model:SolvaneF1", 1024, 1024, 0, BaseExposure, Cooled | CloseDelay},
    {"model:SolvaneC2", 2048, 2048, 0, BaseExposure, Cooled},
    {"model:SolvaneB2", 1600, 1200, 0, BaseExposure, Cooled},
    {"model:PellanB1", 2184, 1472, 7, BaseExposure, Mono | VClock | RatioBoard},
    {"model:SolvaneE1", 1392, 1040, 0, BaseExposure, Cooled},
    {"model:PellanA2", 1392, 1040, 0, BaseExposure, SyncB},
    {"model:SolvaneD2", 2048, 2048, 0, BaseExposure, Cooled},
    {"model:SolvaneG2", 1392, 1040, 0, BaseExposure, Cooled},
    {"model:SolvaneG1", 1392, 1040, 0, BaseExposure, Cooled},
    {"model:TirelM2", 2048, 2048, 0, BaseExposure, Cooled | VClock | Tweak},
    {"model:TirelM1", 1600, 1200, 0, BaseExposure, Cooled | VClock | Tweak},
    {"model:SolvaneH1", 1392, 1040, 0, BaseExposure, Cooled},
    {"model:SolvaneJ1", 1300, 1030, 0, BaseExposure, Cooled | EMGain},
    {"model:Metrona", 1024, 58, 2, 100000000,
     Cooled | Microseconds | AlwaysSixteenBits | ShutterDelay},
    {"model:Unknown", 1392, 1040, 0, BaseExposure, Cooled},
    {"old", 1392, 1040, 0, BaseExposure, Mono | Cooler | Microseconds},
};

/// Writes down one setup in the order of its steps.
class ExpectedSetup {
  public:
    explicit ExpectedSetup(const ModelRow& newModel) : model(newModel) {
        if (Has(Tweak)) AddTweakStart();
        AddReadout();
        AddGainAndOffset();
        AddFullROI();
        AddExposures();
        if (Has(Fields)) {
            AddBinningOfFields();
        } else {
            AddBinning();
        }
        AddOptions();
        Control(1, model.frequencyCode << 8 | 1u << 2);  // little-endian pixels
        TakeOver();
    }

    std::vector<RegisterWrite> writes;

  private:
    bool Has(unsigned steps) const { return (model.steps & steps) != 0; }
    void Control(std::uint32_t quadlet, std::uint32_t value) {
        writes.push_back({ControlAddress + 4 * quadlet, {value}, 0});
    }
    void TakeOver() { writes.push_back({CommandAddress + 4, {1}, 0}); }
    void Size(std::uint32_t width, std::uint32_t height) { Control(3, width << 16 | height); }

    void AddOnePixelROI() {
        Control(4, 0x00010000);
        Control(4, 0x00010001);
        Control(3, 0x00000001);
        Control(3, 0x00010001);
    }
    void AddTweakStart() {
        AddOnePixelROI();
        Control(41, 4);
        TakeOver();
    }
    void AddReadout() {
        Control(1, 0);  // parameter set number: the camera's index
        if (model.frequencyCode != 0) Control(1, model.frequencyCode << 8);
        // A camera that always says 16 is set to 8 bits, which it has already.
        if (Has(AlwaysSixteenBits)) Control(1, model.frequencyCode << 8);
    }
    void AddGainAndOffset() {
        if (Has(RatioBoard)) {
            Control(26, 64);
            Control(28, 64u << 2);
            return;
        }
        Control(5, GainDefault << 20);
        Control(5, GainDefault << 20 | OffsetDefault << 4);
    }
    void AddFullROI() {
        if (!Has(Tweak)) AddOnePixelROI();  // else it stands so already
        Control(4, 0x00000001);
        Control(4, 0x00000000);
        Size(1, model.height);
        Size(model.width, model.height);
    }
    void AddExposure(std::uint32_t quadlet, std::uint32_t lowQuadlet, std::uint64_t exposureNs) {
        if (Has(Microseconds)) {
            Control(quadlet, static_cast<std::uint32_t>(exposureNs / 1000));
            return;
        }
        Control(quadlet, static_cast<std::uint32_t>(exposureNs >> 32));
        Control(lowQuadlet, static_cast<std::uint32_t>(exposureNs));
    }
    void AddExposures() {
        AddExposure(6, 15, model.exposureNs);
        Control(13, FilterDelays);
        AddExposure(7, 16, 28100000);
        AddExposure(8, 17, 34900000);
    }
    void AddBinning() {
        Control(2, 1);
        Size(model.width / 2, model.height);
        Size(model.width / 2, model.height / 2);
        Control(2, 0);
        Size(model.width, model.height / 2);
        Size(model.width, model.height);
    }
    /// The width of a mode is counted in pairs of pixels and stays.
    void AddBinningOfFields() {
        Control(2, 0x00010101);
        Size(model.width, model.height / 2);
        Control(2, 0);
        Size(model.width, model.height);
    }
    void AddOptions() {
        if (Has(VClock)) Control(31, 80);
        if (Has(SyncB)) Control(11, 1u << 16);
        if (Has(EMGain)) Control(24, 1023 - 10);
        if (Has(Intensifier)) Control(18, 100u << 4);
        // The fan reads as full already, so that it is not written.
        if (Has(FilterWheel)) Control(12, 1u << 4);
        if (Has(CloseDelay)) Control(25, 100);
        // -40 degrees: (15 * 39.0095253) - 0.5 = 584.64.
        const std::uint32_t temperature = Has(RegulatedCooling) ? 584u << 16 : 0;
        if (Has(RegulatedCooling)) Control(14, temperature);
        if (Has(Cooler)) Control(14, temperature | 1);
        if (Has(Tweak)) AddTweakDefaults();
        if (Has(ShutterDelay)) {
            Control(15, 50);
            Control(15, 0);
        }
    }
    void AddTweakDefaults() {
        const std::uint32_t defaults[] = {100, 40, 110, 120, 130, 140, 150};
        for (std::uint32_t dac = 0; dac < std::size(defaults); ++dac) {
            Control(34 + dac, defaults[dac]);
        }
    }

    const ModelRow& model;
};

std::string Describe(const RegisterWrite& write) {
    char text[64];
    const bool isControl = write.address < CommandAddress;
    std::snprintf(text, sizeof text, "%s %u = %08x", isControl ? "control" : "command",
                  (write.address - (isControl ? ControlAddress : CommandAddress)) / 4,
                  write.values.empty() ? 0 : write.values[0]);
    return text;
}

std::vector<std::string> Describe(const std::vector<RegisterWrite>& writes) {
    std::vector<std::string> lines;
    for (const RegisterWrite& write : writes) lines.push_back(Describe(write));
    return lines;
}

std::string MakeScenario(const ModelRow& model) {
    return std::string(R"({"base": ")") + model.scenario +
           R"(", "timeScale": 0, "cameras": [{"configuration": {"9": )" +
           std::to_string(FilterDelays) + "}}]}";
}

std::string GetModelTestName(const testing::TestParamInfo<ModelRow>& row) {
    const std::string name = row.param.scenario;
    const std::size_t colon = name.find(':');
    return colon == std::string::npos ? name : name.substr(colon + 1);
}

void PrintTo(const ModelRow& row, std::ostream* out) {
    *out << row.scenario;
}

class FirstSetup : public testing::TestWithParam<ModelRow> {};

}  // namespace

TEST_P(FirstSetup, WritesExactlyTheDefaultStateInItsOrder) {
    const SimulationWorld world(MakeScenario(GetParam()));
    std::vector<ZCamera*> cameras;
    testing::internal::CaptureStdout();  // one model speaks

    const CameraResult result = ZCamera::GetCameraList(cameras);

    (void)testing::internal::GetCapturedStdout();
    EXPECT_EQ(CameraOk, result);
    EXPECT_EQ(1u, cameras.size());
    const std::vector<RegisterWrite> writes = world.ReadRegisterWrites();
    EXPECT_EQ(Describe(ExpectedSetup(GetParam()).writes), Describe(writes));
    EXPECT_EQ(ExpectedSetup(GetParam()).writes, writes);
    (void)ZCamera::FreeCameraList(cameras);
}

TEST(TweakedSetup, ReadsTheConfigurationAgainBehindMiscCtrlAndAtTheTakeOver) {
    const SimulationWorld world("model:TirelM1");
    std::vector<ZCamera*> cameras;

    ASSERT_EQ(CameraOk, ZCamera::GetCameraList(cameras));

    std::uint64_t shortest = ~std::uint64_t{0};
    std::size_t wholeReads = 0;
    for (const TraceRecord& request : world.ReadRequests()) {
        if (request.name == "FW_IOCTL_ASYNC_READ")
            shortest = std::min(shortest, request.outputBytes);
    }
    for (const TraceRecord& request : world.ReadRequests()) {
        if (request.name != "FW_IOCTL_ASYNC_READ") continue;
        wholeReads += request.outputBytes == shortest + 4 * (210 - 1) ? 1 : 0;
    }
    EXPECT_EQ(3u, wholeReads) << "once when listed, once behind MiscCtrl, once at the end";
    (void)ZCamera::FreeCameraList(cameras);
}

INSTANTIATE_TEST_SUITE_P(EveryModel, FirstSetup, testing::ValuesIn(Models), GetModelTestName);

}  // namespace ZV::Test
