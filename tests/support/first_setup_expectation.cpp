#include "support/first_setup_expectation.h"

#include <algorithm>
#include <cmath>

#include "camera/register_map.h"

namespace ZV::Test {
namespace {

enum class Board { One, Two, TwoFromFirmware6, TwoFromFirmware100, ByProfile };

/// What a model does differently during its setup; the others follow the first values.
struct ModelFacts {
    std::string_view name;
    Board board = Board::Two;
    float readoutMHz = 20;
    bool hasFilterWheel = true;  ///< Before a monochrome sensor.
};

constexpr ModelFacts Facts[] = {
    {"SolvaneA1", Board::TwoFromFirmware100},
    {"SolvaneA2", Board::TwoFromFirmware6},
    {"DorixB1", Board::TwoFromFirmware100},
    {"DorixR1", Board::Two, 20, false},
    {"SolvaneK1"},
    {"SolvaneC1", Board::TwoFromFirmware100},
    {"SolvaneB1", Board::TwoFromFirmware100},
    {"PellanA1", Board::TwoFromFirmware100, 20, false},
    {"SolvaneJ1", Board::One},
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
    {"PellanB1", Board::ByProfile, 40},
    {"Metrona", Board::Two, 5},
    {"Folary", Board::One},
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

std::uint32_t TakeBits(std::uint32_t value, unsigned first, unsigned last) {
    return static_cast<std::uint32_t>((std::uint64_t{value} >> first) &
                                      ((std::uint64_t{1} << (last - first + 1)) - 1));
}

/// Decimal step of a value that keeps three figures.
std::uint64_t GetStep(std::uint64_t value) {
    std::uint64_t step = 1;
    for (; value >= 1000; value /= 10) step *= 10;
    return step;
}

double ConvertRatioToMicroDb(std::uint64_t millionths) {
    return 20e6 * std::log10(static_cast<double>(millionths) / 1e6);
}

/// Analog boards 1 (a curve) and 2 (a line).
struct GainBoard {
    bool isCurve = false;
    double span = 0;  ///< dB of the line's 4096 steps.
    std::uint32_t dacMin = 0, dacMax = 0, dacDefault = 0;

    double GetDecibels(std::uint32_t dac) const {
        const double x = dac;
        if (!isCurve) return x * span / 4096;
        if (dac <= 500) return x * 7.518e-6;
        if (dac <= 3500) return (x - 500) * 0.007517812 + 0.003759;
        if (dac <= 4000) return (x - 3500) * 0.016678944 + 22.557195;
        return (x - 4000) * 7.518e-6 + 30.896667;
    }

    double GetDac(double decibels) const {
        if (!isCurve) return decibels * 4096 / span;
        if (decibels <= 0.003759) return decibels / 7.518e-6;
        if (decibels <= 22.557195) return (decibels - 0.003759) / 0.007517812 + 500;
        if (decibels <= 30.896667) return (decibels - 22.557195) / 0.016678944 + 3500;
        if (decibels <= 30.89738121) return (decibels - 30.896667) / 7.518e-6 + 4000;
        return 4095;
    }

    std::int64_t GetMicroDb(std::uint32_t dac) const {
        return static_cast<std::int64_t>((GetDecibels(dac) - GetDecibels(dacDefault)) * 1e6);
    }

    /// A limit of the DAC in hundredths of a dB.
    std::int64_t GetLimitMicroDb(std::uint32_t dac) const {
        return GetMicroDb(dac) / 10000 * 10000;
    }

    std::uint64_t GetRatioMax() const {
        const std::int64_t limit = GetLimitMicroDb(dacMax);
        std::uint64_t ratio = GetRatio(limit);
        const std::uint64_t step = GetStep(ratio);
        ratio = (ratio + step / 2) / step * step;
        while (ConvertRatioToMicroDb(ratio) > static_cast<double>(limit)) ratio -= GetStep(ratio);
        return ratio;
    }

    std::uint64_t GetRatioMin() const {
        const std::int64_t limit = GetLimitMicroDb(dacMin);
        std::uint64_t ratio = GetRatio(limit);
        ratio = ratio / GetStep(ratio) * GetStep(ratio);
        while (ConvertRatioToMicroDb(ratio) < static_cast<double>(limit)) ratio += GetStep(ratio);
        return ratio;
    }

    static std::uint64_t GetRatio(std::int64_t microDb) {
        const float exponent = static_cast<float>(static_cast<double>(microDb) / 1e6) / 20.0f;
        return static_cast<std::uint64_t>(static_cast<double>(std::pow(10.0f, exponent)) * 1e6);
    }
};

constexpr double IntensifierSlope = 0.015765398;
constexpr double IntensifierIntercept = 33.5092631;

/// Control value of an intensifier's least normalised gain.
std::uint32_t CalculateLeastIntensifierGain(std::uint32_t rawMin) {
    const auto lowest =
        static_cast<std::int64_t>((rawMin * IntensifierSlope + IntensifierIntercept) * 1e6);
    const std::int64_t limit = (lowest + 1999) / 2000 * 2000;
    auto ratio =
        static_cast<std::uint64_t>(std::pow(10.0, static_cast<double>(limit) / 1e6 / 20) * 1e6);
    ratio = ratio / GetStep(ratio) * GetStep(ratio);
    while (ConvertRatioToMicroDb(ratio) < static_cast<double>(limit)) ratio += GetStep(ratio);
    const double decibels = std::trunc(ConvertRatioToMicroDb(ratio)) / 1e6;
    return static_cast<std::uint32_t>((decibels - IntensifierIntercept) / IntensifierSlope + 0.5);
}

class FirstSetup {
  public:
    explicit FirstSetup(const CameraContents& contents)
        : camera(contents),
          facts(FindFacts(contents.className)),
          configuration(contents.configuration),
          shadow(FindLength(ControlVersions, contents.controlVersion)) {
        LimitConfiguration();
    }

    ExpectedSetup Run() {
        TakeOverMiscCtrl();
        RunRows();
        if (result.isRefused) return result;
        SetLittleEndian();
        TakeOver("UpdateSettingsOnCamera");
        if (isConfigurationStale) FollowNewSensorSize();
        return result;
    }

  private:
    // The camera as read.
    void LimitConfiguration() {
        configuration.resize(FindLength(ConfigurationVersions, camera.configurationVersion));
    }
    std::uint32_t Config(std::uint32_t quadlet) const {
        return quadlet < configuration.size() ? configuration[quadlet] : 0;
    }
    std::uint32_t Config(std::uint32_t quadlet, unsigned first, unsigned last) const {
        return TakeBits(Config(quadlet), first, last);
    }
    bool IsConfigurationAtLeast(std::uint32_t major, std::uint32_t minor) const {
        return camera.configurationVersion >= MakeVersion(major, minor);
    }
    bool HasFeature(unsigned bit) const {
        return IsConfigurationAtLeast(2, 7) && Config(169, bit, bit) != 0;
    }
    bool HasTweaks() const { return IsConfigurationAtLeast(2, 10); }
    bool Is(std::string_view name) const { return facts.name == name; }
    bool IsMicrosecondControl() const { return (camera.controlVersion >> 16) == 1; }

    // The shadow and the bus.
    std::uint32_t Shadow(std::uint32_t quadlet) const {
        return quadlet < shadow.size() ? shadow[quadlet] : 0;
    }
    std::uint32_t Shadow(std::uint32_t quadlet, unsigned first, unsigned last) const {
        return TakeBits(Shadow(quadlet), first, last);
    }
    void Send(const std::string& step, std::uint32_t quadlet, std::uint32_t value) {
        result.writes.push_back({step, SetupBlock::Control, quadlet, value});
    }
    void Store(std::uint32_t quadlet, std::uint32_t value) {
        if (quadlet < shadow.size()) shadow[quadlet] = value;
    }
    void Write(const std::string& step, std::uint32_t quadlet, std::uint32_t value) {
        Store(quadlet, value);
        Send(step, quadlet, value);
    }
    void WriteBits(const std::string& step, std::uint32_t quadlet, unsigned first, unsigned last,
                   std::uint32_t value) {
        const std::uint32_t mask = TakeBits(0xFFFFFFFF, 0, last - first) << first;
        Write(step, quadlet, (Shadow(quadlet) & ~mask) | ((value << first) & mask));
    }
    /// A setter that sends nothing when the value is there already.
    void ChangeBits(const std::string& step, std::uint32_t quadlet, unsigned first, unsigned last,
                    std::uint32_t value) {
        if (Shadow(quadlet, first, last) == value) return;
        WriteBits(step, quadlet, first, last, value);
    }
    void TakeOver(const std::string& step) {
        result.writes.push_back({step, SetupBlock::Command, 1, 1});
    }

    // Sizes. Only binning modes 1 and 2 occur here.
    std::uint32_t GetSensorWidth() const { return Config(4, 16, 31); }
    std::uint32_t GetSensorHeight() const { return Config(4, 0, 15); }
    std::uint32_t GetBinning() const { return Shadow(2, 0, 1) == 1 ? 2 : 1; }
    std::uint32_t GetWidthMax(std::uint32_t mode) const {
        if (Is("Folary")) return GetSensorWidth() / (2 * mode) * mode * 2;
        if (Is("Metrona")) return GetSensorWidth() / mode;
        return Config(mode == 1 ? 4 : 5, 16, 31);
    }
    std::uint32_t GetHeightMax(std::uint32_t mode) const {
        if (Is("Folary")) return GetSensorHeight() / mode & ~1u;
        if (Is("Metrona")) return std::max(GetSensorHeight() / mode, 1u);
        return Config(mode == 1 ? 4 : 5, 0, 15);
    }
    void SetX(const std::string& step, std::uint32_t x) { ChangeBits(step, 4, 16, 31, x); }
    void SetY(const std::string& step, std::uint32_t y) { ChangeBits(step, 4, 0, 15, y); }
    void SetWidth(const std::string& step, std::uint32_t width) {
        if (Shadow(3, 16, 31) == width) return;
        WriteBits(step, 3, 16, 31, std::min(width, GetWidthMax(GetBinning())));
    }
    void SetHeight(const std::string& step, std::uint32_t height) {
        if (Shadow(3, 0, 15) == height) return;
        WriteBits(step, 3, 0, 15, std::min(height, GetHeightMax(GetBinning())));
    }
    void SetSmallestRoi(const std::string& stage) {
        SetX(stage + "SetROIX(1)", 1);
        SetY(stage + "SetROIY(1)", 1);
        SetHeight(stage + "SetROIHeight(1)", 1);
        SetWidth(stage + "SetROIWidth(1)", 1);
    }
    void SetFullRoi() {
        SetX("SetROIX(0)", 0);
        SetY("SetROIY(0)", 0);
        SetHeight("SetROIHeight(sensor)", GetSensorHeight());
        SetWidth("SetROIWidth(sensor)", GetSensorWidth());
    }
    void FollowNewSensorSize() {
        SetHeight("SetROIHeight(sensor) after the update", GetSensorHeight());
        SetWidth("SetROIWidth(sensor) after the update", GetSensorWidth());
    }

    // Before the rows.
    void TakeOverMiscCtrl() {
        if (!HasTweaks()) return;
        SetSmallestRoi("tweak: ");
        const std::uint32_t value = Config(208, 0, 15);
        isConfigurationStale = Shadow(41) != value;
        Write("SetMiscCtrlAd", 41, value);
        TakeOver("tweak: take over");
        if (camera.configurationAfterTakeOver.empty()) return;
        configuration = camera.configurationAfterTakeOver;
        LimitConfiguration();
    }

    void RunRows() {
        WriteBits("SetPSN", 1, 24, 31, camera.position);
        ChangeBits("SetCompression(0)", 1, 16, 23, 0);
        SetReadoutFrequency("SetReadoutFrequency(default)", facts.readoutMHz);
        SetEightBits();
        SetUnityGain();
        SetDefaultOffset();
        SetTriggerModeZero();
        SetSmallestRoi("");
        SetFullRoi();
        SetExposure("SetExposure(default)", 6,
                    Is("Folary") || Is("Metrona") ? 100'000'000 : 16'384'000);
        Write("SetRGBFilterDelays", 13, Config(9));
        ChangeBits("SetRGBFilterStartColour(0)", 12, 8, 9, 0);
        SetExposure("SetRGBFilterRedExposure", 7, 28'100'000);
        SetExposure("SetRGBFilterBlueExposure", 8, 34'900'000);
        SetBinning("SetSymmetricalBinning(2)", 2);
        SetBinning("SetSymmetricalBinning(1)", 1);
        SetSeparateBinning();
        RunOptionalRows();
    }

    void RunOptionalRows() {
        if (HasFeature(11)) SetVerticalClock();
        if (!Is("Folary")) ChangeBits("SetSyncBMode(1)", 11, 16, 17, 1);
        if (HasFeature(6)) SetEMGain();
        if (result.isRefused) return;
        if (Is("SolvaneK1")) SetLeastIntensifierGain();
        if (HasFeature(3)) SetFullFanSpeed();
        if (facts.hasFilterWheel && Config(17, 8, 11) == 0) {
            WriteBits("SetRGBFilterActive(true)", 12, 4, 4, 1);
        }
        if (HasFeature(8) || Is("SolvaneF1")) SetCloseDelay();
        if (HasFeature(4)) SetLowestTemperature();
        if (result.isRefused) return;
        if (Config(10, 31, 31) != 0) ChangeBits("SetCoolerStatus(true)", 14, 0, 0, 1);
        if (HasTweaks()) SetTweaks();
        if (Is("Metrona")) SetShutterDelays();
    }

    // Quadlet 1.
    bool IsTooFast(float megahertz, std::uint32_t binning) const {
        // Newer control blocks leave the packet size to the bus, which always carries more.
        return megahertz >= 30 && binning == 1 && camera.controlVersion < MakeVersion(2, 3);
    }
    float GetReadoutFrequency() const {
        constexpr float Frequencies[16] = {20, 10, 5, 2.5, 25, 30, 35, 40};
        return Frequencies[Shadow(1, 8, 11)];
    }
    void SetReadoutFrequency(const std::string& step, float megahertz) {
        if (IsTooFast(megahertz, GetBinning())) megahertz = 20;
        if (megahertz == GetReadoutFrequency()) return;
        const std::uint32_t code = megahertz == 40 ? 7 : megahertz == 5 ? 2 : 0;
        WriteBits(step, 1, 8, 11, code);
    }
    void SetEightBits() {
        if (IsTooFast(GetReadoutFrequency(), GetBinning())) {
            SetReadoutFrequency("SetBitDepth(8): slower", 20);
        }
        const bool isEightBits = !Is("Metrona") && Shadow(1, 3, 4) == 0;
        if (!isEightBits) WriteBits("SetBitDepth(8)", 1, 3, 4, 0);
    }
    void SetLittleEndian() {
        const std::uint32_t value = Shadow(1) | 4;
        if ((Shadow(1) & 4) == 0) Write("SetBigEndian(false)", 1, value);
    }

    // Gain and offset.
    bool HasRatioBoard() const {
        const std::uint32_t profile = IsConfigurationAtLeast(2, 9) ? Config(201, 0, 15) : 0;
        return facts.board == Board::ByProfile && profile >= 1 && profile <= 3;
    }
    bool HasCurve() const {
        const std::uint32_t firmware = Config(16, 0, 15);
        if (facts.board == Board::TwoFromFirmware6) return firmware < 6;
        if (facts.board == Board::One || facts.board == Board::Two) {
            return facts.board == Board::One;
        }
        return firmware < 100;
    }
    std::uint32_t GetDacMax() const {
        const std::uint32_t major = camera.configurationVersion >> 16;
        const std::uint32_t minor = camera.configurationVersion & 0xFFFF;
        if (Is("Folary") && major < 3 && minor < 4) return 3171;
        return major >= 2 ? Config(30, 4, 15) : 4095;
    }
    GainBoard MakeGainBoard() const {
        GainBoard board;
        board.isCurve = HasCurve();
        board.span = IsConfigurationAtLeast(2, 4) ? 4096.0 * Config(66) / 1e9
                     : board.isCurve              ? 30.8929
                                                  : 34.1516;
        board.dacMin = IsConfigurationAtLeast(2, 0) ? Config(30, 20, 31) : 0;
        board.dacMax = GetDacMax();
        board.dacDefault = Config(2, 20, 31);
        return board;
    }
    void SetUnityGain() {
        if (HasRatioBoard()) {
            ChangeBits("SetNormalizedGain(unity)", 26, 0, 7, Config(178, 0, 7));
            return;
        }
        const GainBoard board = MakeGainBoard();
        // Kept: without its own board this model takes unity for a millionth, the least gain.
        std::uint64_t ratio = facts.board == Board::ByProfile ? 1 : 1'000'000;
        ratio = std::max(std::min(ratio, board.GetRatioMax()), board.GetRatioMin());
        const auto microDb = static_cast<std::int64_t>(ConvertRatioToMicroDb(ratio));
        if (microDb == board.GetMicroDb(Shadow(5, 20, 31))) return;
        const double decibels =
            board.GetDecibels(board.dacDefault) + static_cast<double>(microDb) / 1e6;
        const auto dac = static_cast<std::int64_t>(board.GetDac(decibels) + 0.5);
        WriteBits("SetNormalizedGain(unity)", 5, 20, 31,
                  static_cast<std::uint32_t>(std::clamp<std::int64_t>(dac, 0, 4095)));
    }
    void SetDefaultOffset() {
        if (HasRatioBoard()) {
            ChangeBits("SetAbsoluteOffset(0)", 28, 2, 15, Config(186, 2, 15));
        } else {
            ChangeBits("SetAbsoluteOffset(0)", 5, 4, 15, Config(2, 4, 15));
        }
    }

    void SetTriggerModeZero() {
        if (Shadow(11, 0, 3) != 0) Write("SetTriggerMode(0)", 11, Shadow(11) & ~0x10Fu);
    }

    /// The lower half of each exposure stands nine quadlets behind the upper one.
    void SetExposure(const std::string& step, std::uint32_t quadlet, std::uint32_t nanoseconds) {
        if (IsMicrosecondControl()) {
            if (Shadow(quadlet) != nanoseconds / 1000) Write(step, quadlet, nanoseconds / 1000);
            return;
        }
        if (Shadow(quadlet) == 0 && Shadow(quadlet + 9) == nanoseconds) return;
        Write(step + " upper", quadlet, 0);
        Write(step + " lower", quadlet + 9, nanoseconds);
    }

    // Binning, the mode 1 or 2.
    void SetBinning(const std::string& step, std::uint32_t mode) {
        if (!Is("Folary") && IsTooFast(GetReadoutFrequency(), mode)) {
            SetReadoutFrequency(step + ": slower", 20);
        }
        const std::uint32_t former = GetBinning();
        if (former == mode) return;
        if (Is("Folary")) {
            const std::uint32_t code = mode == 2 ? 0x10101 : 0;
            Write(step, 2, (Shadow(2) & ~0xFFFF03u) | code);
        } else {
            WriteBits(step, 2, 0, 1, mode - 1);
        }
        FitRoi(step, mode, former);
    }
    void FitRoi(const std::string& step, std::uint32_t mode, std::uint32_t former) {
        if (mode > 1) {
            SetWidth(step + ": width", GetWidthMax(mode));
            SetX(step + ": x", 0);
            SetHeight(step + ": height", GetHeightMax(mode));
            SetY(step + ": y", 0);
        } else if (former > 1) {
            SetWidth(step + ": width", GetSensorWidth());
            SetHeight(step + ": height", GetSensorHeight());
            SetX(step + ": x", 0);
            SetY(step + ": y", 0);
        }
    }
    void SetSeparateBinning() {
        if (Is("Metrona")) {
            ChangeBits("SetHorizontalBinning(1)", 2, 16, 23, 0);
            ChangeBits("SetVerticalBinning(1)", 2, 8, 15, 0);
        }
        if (Is("Folary")) SetBinning("SetVerticalBinning(1)", 1);
        if (Is("Folary") && Config(29, 1, 1) != 0) ChangeBits("SetRTVMode(false)", 2, 2, 2, 0);
    }

    // What only some cameras have.
    void SetVerticalClock() {
        const double frequency = static_cast<float>(Config(200)) / 1'000'000.0f;
        std::uint32_t count = 0;
        if (frequency != 0) {
            const double period = std::trunc(Config(197, 0, 15) / frequency * 1000);
            count = static_cast<std::uint32_t>(period / 1000 * frequency);
        }
        WriteBits("SetVClockPeriod(default)", 31, 0, 15, count);
    }
    void SetEMGain() {
        const std::uint32_t most = Config(193, 0, 15), value = Config(176, 0, 15);
        result.isRefused = value < Config(192, 0, 15) || value > most;
        if (!result.isRefused) WriteBits("SetEMGain(default)", 24, 0, 15, most - value);
    }
    void SetLeastIntensifierGain() {
        WriteBits("SetNormalizedIntensifierGain(least)", 18, 4, 15,
                  CalculateLeastIntensifierGain(Config(34, 20, 31)));
    }
    void SetFullFanSpeed() {
        const std::uint32_t speed = Shadow(22, 16, 31);
        const bool isSlowed = speed >= 1 && speed <= 3;
        if (isSlowed) WriteBits("SetFanSpeed(4)", 22, 16, 31, 4);
    }
    void SetCloseDelay() {
        const auto delay = static_cast<std::uint32_t>(Config(177, 0, 15) * 6.4);
        WriteBits("SetShutterCloseDelay(default)", 25, 0, 15,
                  static_cast<std::uint32_t>(delay / 6.4));
    }
    static std::int32_t ReadCelsius(std::uint32_t code) {
        const auto celsius = static_cast<std::int32_t>(
            static_cast<double>(static_cast<float>(code) * 0.025634765625f) - 55.0);
        return celsius < -55 || celsius > 50 ? 0 : celsius;
    }
    void SetLowestTemperature() {
        const std::uint32_t lowest = IsConfigurationAtLeast(2, 7) ? Config(167, 0, 15) : 0;
        const std::int32_t celsius = ReadCelsius(lowest);
        if (celsius == ReadCelsius(Shadow(14, 16, 31))) return;
        result.isRefused = celsius < -55 || celsius > 49;
        if (result.isRefused) return;
        const double code = static_cast<double>(static_cast<float>(celsius + 55) * 39.0095253f);
        WriteBits("SetRegulatedCoolingTemp(lowest)", 14, 16, 31,
                  static_cast<std::uint32_t>(code - 0.5));
    }
    void SetTweaks() {
        Write("SetSubCpAd", 34, Config(202, 0, 15));
        Write("SetSubAd", 35, TakeBits(Config(69) / 1000, 0, 15));
        Write("SetResetVhAd", 36, Config(203, 0, 15));
        Write("SetV1VmAd", 37, Config(204, 0, 15));
        Write("SetV2VmAd", 38, Config(205, 0, 15));
        Write("SetV3VmAd", 39, Config(206, 0, 15));
        Write("SetV4VmAd", 40, Config(207, 0, 15));
    }
    void SetShutterDelays() {
        SetShutterDelay("SetMetronaShutterDelay(1)", 50);
        if (!result.isRefused) SetShutterDelay("SetMetronaShutterDelay(0)", 0);
    }
    void SetShutterDelay(const std::string& step, std::uint32_t delay) {
        if (Shadow(15) == delay) return;
        result.isRefused = camera.controlVersion != MakeVersion(1, 2);
        if (!result.isRefused) Write(step, 15, delay);
    }

    const CameraContents& camera;  // borrowed from the caller, until the end of Run
    const ModelFacts& facts;
    std::vector<std::uint32_t> configuration;
    std::vector<std::uint32_t> shadow;
    bool isConfigurationStale = false;
    ExpectedSetup result;
};

}  // namespace

ExpectedSetup CalculateFirstSetup(const CameraContents& camera) {
    return FirstSetup(camera).Run();
}

}  // namespace ZV::Test
