#include "support/expected_registers.h"

#include <algorithm>

#include "camera/register_map.h"

namespace ZV::Test {
namespace {

constexpr ModelFacts Facts[] = {
    {"SolvaneA1", GainBoardKind::TwoFromFirmware100},
    {"SolvaneA2", GainBoardKind::TwoFromFirmware6},
    {"DorixB1", GainBoardKind::TwoFromFirmware100},
    {"DorixR1", GainBoardKind::Two, 20, false},
    {"SolvaneK1"},
    {"SolvaneC1", GainBoardKind::TwoFromFirmware100},
    {"SolvaneB1", GainBoardKind::TwoFromFirmware100},
    {"PellanA1", GainBoardKind::TwoFromFirmware100, 20, false},
    {"SolvaneJ1", GainBoardKind::One},
    {"SolvaneD1"},
    {"SolvaneF1"},
    {"SolvaneC2"},
    {"SolvaneB2"},
    {"SolvaneG1"},
    {"SolvaneG2"},
    {"PellanA2"},
    {"SolvaneD2"},
    {"SolvaneE1"},
    {"SolvaneH1"},
    {"TirelM2"},
    {"TirelM1"},
    {"PellanB1", GainBoardKind::ByProfile, 40},
    {"Metrona", GainBoardKind::Two, 5},
    {"Folary", GainBoardKind::One},
    {"Unknown"},
};

const ModelFacts& FindFacts(std::string_view name) {
    return *std::ranges::find(Facts, name, &ModelFacts::name);
}

std::uint32_t FindLength(const regVersionEntry* table, std::uint32_t version) {
    for (; table->major != 0; ++table) {
        if (MakeVersion(table->major, table->minor) == version) return table->length;
    }
    return 0;
}

}  // namespace

std::uint32_t TakeBits(std::uint32_t value, unsigned first, unsigned last) {
    return static_cast<std::uint32_t>((std::uint64_t{value} >> first) &
                                      ((std::uint64_t{1} << (last - first + 1)) - 1));
}

ExpectedRegisters::ExpectedRegisters(const CameraContents& contents)
    : shadow(FindLength(ControlVersions, contents.controlVersion)),
      camera(contents),
      facts(FindFacts(contents.className)),
      configuration(contents.configuration) {
    LimitConfiguration();
}

void ExpectedRegisters::LimitConfiguration() {
    configuration.resize(FindLength(ConfigurationVersions, camera.configurationVersion));
}

void ExpectedRegisters::ReadConfigurationAgain() {
    if (camera.configurationAfterTakeOver.empty()) return;
    configuration = camera.configurationAfterTakeOver;
    LimitConfiguration();
}

std::uint32_t ExpectedRegisters::Config(std::uint32_t quadlet) const {
    return quadlet < configuration.size() ? configuration[quadlet] : 0;
}

std::uint32_t ExpectedRegisters::Config(std::uint32_t quadlet, unsigned first,
                                        unsigned last) const {
    return TakeBits(Config(quadlet), first, last);
}

bool ExpectedRegisters::IsConfigurationAtLeast(std::uint32_t major, std::uint32_t minor) const {
    return camera.configurationVersion >= MakeVersion(major, minor);
}

bool ExpectedRegisters::HasFeature(unsigned bit) const {
    return IsConfigurationAtLeast(2, 7) && Config(169, bit, bit) != 0;
}

bool ExpectedRegisters::HasRatioBoard() const {
    const std::uint32_t profile = IsConfigurationAtLeast(2, 9) ? Config(201, 0, 15) : 0;
    return facts.board == GainBoardKind::ByProfile && profile >= 1 && profile <= 3;
}

bool ExpectedRegisters::HasCurve() const {
    const std::uint32_t firmware = Config(16, 0, 15);
    if (facts.board == GainBoardKind::TwoFromFirmware6) return firmware < 6;
    if (facts.board == GainBoardKind::One || facts.board == GainBoardKind::Two) {
        return facts.board == GainBoardKind::One;
    }
    return firmware < 100;
}

std::uint32_t ExpectedRegisters::GetDacMax() const {
    const std::uint32_t major = camera.configurationVersion >> 16;
    const std::uint32_t minor = camera.configurationVersion & 0xFFFF;
    if (Is("Folary") && major < 3 && minor < 4) return 3171;
    return major >= 2 ? Config(30, 4, 15) : 4095;
}

GainBoard ExpectedRegisters::MakeGainBoard() const {
    GainBoard board;
    if (HasRatioBoard()) {
        board.form = GainForm::Ratio;
        board.dacMin = Config(179, 0, 7);
        board.dacMax = Config(180, 0, 7);
        board.dacDefault = Config(178, 0, 7);
        return board;
    }
    board.form = HasCurve() ? GainForm::Curve : GainForm::Line;
    board.span = IsConfigurationAtLeast(2, 4) ? 4096.0 * Config(66) / 1e9
                 : HasCurve()                 ? 30.8929
                                              : 34.1516;
    board.dacMin = IsConfigurationAtLeast(2, 0) ? Config(30, 20, 31) : 0;
    board.dacMax = GetDacMax();
    board.dacDefault = Config(2, 20, 31);
    return board;
}

std::uint32_t ExpectedRegisters::Shadow(std::uint32_t quadlet) const {
    return quadlet < shadow.size() ? shadow[quadlet] : 0;
}

std::uint32_t ExpectedRegisters::Shadow(std::uint32_t quadlet, unsigned first,
                                        unsigned last) const {
    return TakeBits(Shadow(quadlet), first, last);
}

void ExpectedRegisters::Store(std::uint32_t quadlet, std::uint32_t value) {
    if (quadlet < shadow.size()) shadow[quadlet] = value;
}

void ExpectedRegisters::Write(const std::string& step, std::uint32_t quadlet, std::uint32_t value) {
    Store(quadlet, value);
    writes.push_back({step, SetupBlock::Control, quadlet, value});
}

void ExpectedRegisters::WriteBits(const std::string& step, std::uint32_t quadlet, unsigned first,
                                  unsigned last, std::uint32_t value) {
    const std::uint32_t mask = TakeBits(0xFFFFFFFF, 0, last - first) << first;
    Write(step, quadlet, (Shadow(quadlet) & ~mask) | ((value << first) & mask));
}

void ExpectedRegisters::ChangeBits(const std::string& step, std::uint32_t quadlet, unsigned first,
                                   unsigned last, std::uint32_t value) {
    if (Shadow(quadlet, first, last) == value) return;
    WriteBits(step, quadlet, first, last, value);
}

void ExpectedRegisters::TakeOver(const std::string& step) {
    writes.push_back({step, SetupBlock::Command, 1, 1});
}

float ExpectedRegisters::GetReadoutFrequency() const {
    constexpr float Frequencies[16] = {20, 10, 5, 2.5, 25, 30, 35, 40};
    return Frequencies[Shadow(1, 8, 11)];
}

bool ExpectedRegisters::IsTooFast(float megahertz, std::uint32_t binning) const {
    // Newer control blocks leave the packet size to the bus, which always carries more.
    return megahertz >= 30 && binning == 1 && camera.controlVersion < MakeVersion(2, 3);
}

std::int32_t ExpectedRegisters::ReadCelsius(std::uint32_t code) {
    const auto celsius = static_cast<std::int32_t>(
        static_cast<double>(static_cast<float>(code) * 0.025634765625f) - 55.0);
    return celsius < -55 || celsius > 50 ? 0 : celsius;
}

}  // namespace ZV::Test
