#include "support/first_setup_expectation.h"

#include <algorithm>
#include <cmath>

#include "camera/register_map.h"

namespace ZV::Test {
namespace {

class FirstSetup : public ExpectedRegisters {
  public:
    using ExpectedRegisters::ExpectedRegisters;

    ExpectedSetup Run() {
        TakeOverMiscCtrl();
        RunRows();
        if (!isRefused) Finish();
        return {writes, shadow, isRefused};
    }

  private:
    void Finish() {
        SetLittleEndian();
        TakeOver("UpdateSettingsOnCamera");
        if (isConfigurationStale) FollowNewSensorSize();
    }

    // Sizes. Only binning modes 1 and 2 occur here.
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
        ReadConfigurationAgain();
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
        if (isRefused) return;
        if (Is("SolvaneK1")) SetLeastIntensifierGain();
        if (HasFeature(3)) SetFullFanSpeed();
        if (facts.hasFilterWheel && Config(17, 8, 11) == 0) {
            WriteBits("SetRGBFilterActive(true)", 12, 4, 4, 1);
        }
        if (HasFeature(8) || Is("SolvaneF1")) SetCloseDelay();
        if (HasFeature(4)) SetLowestTemperature();
        if (isRefused) return;
        if (Config(10, 31, 31) != 0) ChangeBits("SetCoolerStatus(true)", 14, 0, 0, 1);
        if (HasTweaks()) SetTweaks();
        if (Is("Metrona")) SetShutterDelays();
    }

    // Quadlet 1.
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
    void SetUnityGain() {
        if (HasRatioBoard()) {
            ChangeBits("SetNormalizedGain(unity)", 26, 0, 7, Config(178, 0, 7));
            return;
        }
        const GainBoard board = MakeGainBoard();
        // Kept: without its own board this model takes unity for a millionth, the least gain.
        const std::uint64_t ratio =
            board.FitRatio(facts.board == GainBoardKind::ByProfile ? 1 : 1'000'000);
        const auto microDb = static_cast<std::int64_t>(ConvertRatioToMicroDb(ratio));
        if (microDb == board.GetMicroDb(Shadow(5, 20, 31))) return;
        WriteBits("SetNormalizedGain(unity)", 5, 20, 31, board.GetDac(microDb));
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
        isRefused = value < Config(192, 0, 15) || value > most;
        if (!isRefused) WriteBits("SetEMGain(default)", 24, 0, 15, most - value);
    }
    void SetLeastIntensifierGain() {
        WriteBits("SetNormalizedIntensifierGain(least)", 18, 4, 15,
                  CalculateIntensifierGain(0, Config(34, 20, 31), Config(34, 4, 15)));
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
    void SetLowestTemperature() {
        const std::uint32_t lowest = IsConfigurationAtLeast(2, 7) ? Config(167, 0, 15) : 0;
        const std::int32_t celsius = ReadCelsius(lowest);
        if (celsius == ReadCelsius(Shadow(14, 16, 31))) return;
        isRefused = celsius < -55 || celsius > 49;
        if (isRefused) return;
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
        if (!isRefused) SetShutterDelay("SetMetronaShutterDelay(0)", 0);
    }
    void SetShutterDelay(const std::string& step, std::uint32_t delay) {
        if (Shadow(15) == delay) return;
        isRefused = camera.controlVersion != MakeVersion(1, 2);
        if (!isRefused) Write(step, 15, delay);
    }

    bool isConfigurationStale = false;
    bool isRefused = false;  ///< A step failed, and the setup ended with it.
};

}  // namespace

ExpectedSetup CalculateFirstSetup(const CameraContents& camera) {
    return FirstSetup(camera).Run();
}

}  // namespace ZV::Test
