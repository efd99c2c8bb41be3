#include "simulation/models.h"

namespace ZV::Simulation {
namespace {

// Bits of configuration quadlet 169.
constexpr std::uint32_t FeatureSensitivity = 0x006;
constexpr std::uint32_t FeatureFan = 0x008;
constexpr std::uint32_t FeatureCooling = 0x010;
constexpr std::uint32_t FeatureEMGain = 0x040;
constexpr std::uint32_t FeatureCloseDelay = 0x100;
constexpr std::uint32_t FeatureDither = 0x200;
constexpr std::uint32_t FeatureHighGain = 0x400;
constexpr std::uint32_t FeatureVClock = 0x800;
constexpr std::uint32_t FeatureDualChannel = 0x1000;
constexpr std::uint32_t Cooled = FeatureFan | FeatureCooling;

constexpr std::uint32_t Modern = VersionModernConfiguration;
constexpr std::uint32_t Tweak = VersionTweakConfiguration;
constexpr std::uint32_t Control28 = VersionModernControl;
// The shutter delay of this model is written to control blocks of exactly this version.
constexpr std::uint32_t Control12 = MakeVersion(1, 2);

constexpr std::uint8_t Mono = 0;
constexpr std::uint8_t Bayer = 1;

// Columns: id, name, sensor, width, height, depth, colour, configuration, control, streaming
// version, board, tag, binning code 2 is mode 8, features.
constexpr ModelRow Models[] = {
    {5, "SolvaneA1", 6, 1392, 1040, 12, Mono, Modern, Control28, 1, 2, 1, true, Cooled},
    {6, "SolvaneA2", 4, 1300, 1030, 12, Mono, Modern, Control28, 1, 2, 1, true, Cooled},
    {7, "DorixB1", 8, 1392, 1040, 12, Mono, Modern, Control28, 1, 2, 1, false, Cooled},
    {8, "Folary", 12, 2560, 1920, 12, Bayer, Modern, Control28, 1, 1, 1, true, 0},
    {9, "SolvaneK1", 6, 1392, 1040, 12, Mono, Modern, Control28, 1, 2, 1, true, Cooled},
    {10, "DorixR1", 5, 1300, 1030, 12, Bayer, Modern, Control28, 1, 2, 1, true, Cooled},
    {12, "SolvaneC1", 21, 2048, 2048, 12, Mono, Modern, Control28, 1, 2, 1, true, Cooled},
    {13, "SolvaneB1", 58, 1600, 1200, 12, Mono, Modern, Control28, 1, 2, 1, true, Cooled},
    {14, "PellanA1", 9, 1392, 1040, 12, Bayer, Modern, Control28, 1, 2, 1, true, 0},
    {15, "SolvaneD1", 69, 2048, 2048, 14, Mono, Modern, Control28, 2, 2, 1, true, Cooled},
    {16, "SolvaneF1", 15, 1024, 1024, 14, Mono, Modern, Control28, 1, 2, 1, true,
     Cooled | FeatureCloseDelay},
    {18, "SolvaneC2", 69, 2048, 2048, 14, Mono, Modern, Control28, 1, 2, 1, true, Cooled},
    {19, "SolvaneB2", 58, 1600, 1200, 14, Mono, Modern, Control28, 1, 2, 1, true, Cooled},
    {25, "PellanB1", 76, 2184, 1472, 16, Mono, Modern, Control28, 1, 3, 0, true,
     FeatureDither | FeatureHighGain | FeatureVClock | FeatureDualChannel},
    {26, "SolvaneE1", 6, 1392, 1040, 14, Mono, Modern, Control28, 1, 2, 0, true, Cooled},
    {27, "PellanA2", 7, 1392, 1040, 14, Bayer, Modern, Control28, 1, 2, 0, false, 0},
    {28, "SolvaneD2", 69, 2048, 2048, 14, Mono, Modern, Control28, 1, 2, 0, true, Cooled},
    {29, "SolvaneG2", 6, 1392, 1040, 14, Mono, Modern, Control28, 1, 2, 1, true,
     Cooled | FeatureSensitivity},
    {30, "SolvaneG1", 8, 1392, 1040, 14, Mono, Modern, Control28, 1, 2, 1, true,
     Cooled | FeatureSensitivity},
    {31, "TirelM2", 69, 2048, 2048, 14, Mono, Tweak, Control28, 1, 2, 0, true,
     Cooled | FeatureVClock},
    {32, "TirelM1", 58, 1600, 1200, 14, Mono, Tweak, Control28, 1, 2, 0, true,
     Cooled | FeatureVClock},
    {33, "SolvaneH1", 6, 1392, 1040, 16, Mono, Modern, Control28, 1, 2, 0, true, Cooled},
    {1001, "SolvaneJ1", 4, 1300, 1030, 12, Mono, Modern, Control28, 1, 1, 1, true,
     Cooled | FeatureEMGain},
    {1002, "Metrona", 11, 1024, 58, 16, Mono, Modern, Control12, 1, 2, 1, true, FeatureCooling},
    {99, "Unknown", 6, 1392, 1040, 12, Mono, Modern, Control28, 1, 2, 1, true, Cooled},
};

}  // namespace

const ModelRow* FindModel(std::string_view name) {
    for (const ModelRow& row : Models) {
        if (name == row.name) return &row;
    }
    return nullptr;
}

const ModelRow& GetModel(std::uint32_t id) {
    for (const ModelRow& row : Models) {
        if (id == row.id) return row;
    }
    return *FindModel("Unknown");
}

}  // namespace ZV::Simulation
