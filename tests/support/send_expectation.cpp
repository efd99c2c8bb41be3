#include "support/send_expectation.h"

#include <algorithm>
#include <cmath>
#include <cstring>

#include "camera/register_map.h"
#include "support/settings_words.h"

namespace ZV::Test {
namespace {

bool IsOneOf(std::uint32_t value, std::initializer_list<std::uint32_t> values) {
    return std::ranges::find(values, value) != values.end();
}

bool IsDeepFormat(std::uint32_t format) {
    return IsOneOf(format, {1, 3, 5, 7, 10});
}

bool IsColourFormat(std::uint32_t format) {
    return format >= 6 && format <= 12;
}

struct Speed {
    std::uint32_t index;
    float megahertz;
};
constexpr Speed Speeds[] = {{0, 20}, {1, 10}, {2, 5}, {3, 2.5}, {7, 40}, {8, 30}};

float GetMegahertz(std::uint32_t index) {
    const auto* speed = std::ranges::find(Speeds, index, &Speed::index);
    return speed == std::end(Speeds) ? 0 : speed->megahertz;
}

std::uint32_t GetSpeedIndex(float megahertz) {
    const auto* speed = std::ranges::find(Speeds, megahertz, &Speed::megahertz);
    return speed == std::end(Speeds) ? 0 : speed->index;
}

/// Words 27 to 32 and 46 and the reserved bytes are not compared.
bool AreDifferent(const Zentara_Settings& left, const Zentara_Settings& right) {
    for (std::uint32_t key = 0; key < 46; ++key) {
        if (key >= 27 && key <= 32) continue;
        if (GetWord(left, key) != GetWord(right, key)) return true;
    }
    for (std::uint32_t key = 0; key < 3; ++key) {
        if (GetSigned(left, key) != GetSigned(right, key)) return true;
    }
    for (std::uint32_t key = 0; key < 4; ++key) {
        if (GetWide(left, key) != GetWide(right, key)) return true;
    }
    return false;
}

class SendExpectation : public ExpectedRegisters {
  public:
    SendExpectation(const CameraContents& contents, const std::vector<std::uint32_t>& before,
                    const Zentara_Settings& sent)
        : ExpectedRegisters(contents), block(sent) {
        shadow = before;
    }

    ExpectedSend Send(const Zentara_Settings& last) {
        MendBlock();
        RunRows();
        if (isRefused) return {zerrDriverFault, writes, shadow, block};
        SetTweak();
        if (AreDifferent(block, last)) Commit();
        ReadBack();
        return {zerrNone, writes, shadow, block};
    }

    ExpectedSend Preflight() {
        MendBlock();
        return {zerrNone, writes, shadow, block};
    }

  private:
    std::uint32_t Word(std::uint32_t key) const { return GetWord(block, key); }
    bool IsOn(std::uint32_t key) const { return Word(key) != 0; }

    // Sizes.
    bool IsMono() const { return Config(17, 8, 11) == 0; }
    bool IsBayer() const { return Config(17, 8, 11) == 1; }
    bool HasWheel() const { return IsMono() && facts.hasFilterWheel; }
    bool IsRtv() const { return Is("Folary") && Shadow(2, 2, 2) != 0; }
    bool IsMirrored() const {
        return Is("SolvaneD1") && IsConfigurationAtLeast(2, 1) && Config(41, 0, 15) == 2;
    }
    std::uint32_t GetBinning() const {
        const std::uint32_t code = Shadow(2, 0, 1);
        const bool isEight = IsConfigurationAtLeast(2, 2) && Config(42, 0, 0) != 0;
        if (code == 2) return isEight ? 8 : 3;
        return code == 3 ? 4 : code + 1;
    }
    std::uint32_t GetVerticalBinning() const {
        return Is("Metrona") ? Shadow(2, 8, 15) + 1 : GetBinning();
    }
    std::uint32_t GetHorizontalBinning() const {
        if (Is("Folary")) return 1;
        return Is("Metrona") ? Shadow(2, 16, 23) + 1 : GetBinning();
    }
    static std::uint32_t GetSizeQuadlet(std::uint32_t mode) {
        if (mode == 2) return 5;
        if (mode == 3 || mode == 8) return 6;
        return mode == 4 ? 7 : 4;
    }
    std::uint32_t GetWidthMax(std::uint32_t mode) const {
        const std::uint64_t divisor = std::max(mode, 1u);
        if (IsRtv()) return Config(5, 16, 31);
        if (Is("Folary")) {
            return static_cast<std::uint32_t>(GetSensorWidth() / (2 * divisor) * divisor * 2);
        }
        if (Is("Metrona")) return static_cast<std::uint32_t>(GetSensorWidth() / divisor);
        return Config(GetSizeQuadlet(mode), 16, 31);
    }
    std::uint32_t GetHeightMax(std::uint32_t mode) const {
        if (IsRtv()) return Config(5, 0, 15);
        if (Is("Folary")) return GetSensorHeight() / std::max(mode, 1u) & ~1u;
        if (Is("Metrona")) return std::max(GetSensorHeight() / std::max(mode, 1u), 1u);
        return Config(GetSizeQuadlet(mode), 0, 15);
    }
    std::uint32_t GetX() const {
        if (!IsMirrored()) return Shadow(4, 16, 31);
        if (Shadow(3, 16, 31) == 0) return 0;
        return GetSensorWidth() - Shadow(4, 16, 31) - Shadow(3, 16, 31);
    }
    std::uint32_t GetY() const {
        if (!IsMirrored()) return Shadow(4, 0, 15);
        if (Shadow(3, 0, 15) == 0) return 0;
        return GetSensorHeight() - Shadow(4, 0, 15) - Shadow(3, 0, 15);
    }
    std::uint32_t GetBitDepth() const {
        if (Is("Metrona")) return 16;
        const std::uint32_t code = Shadow(1, 3, 4);
        return code == 0 ? 8 : code == 1 ? GetMaxBitDepth() : code == 2 ? 12 : 14;
    }
    std::uint32_t GetMaxBitDepth() const { return Config(8, 0, 3) + 1; }

    // Before the rows.
    void MendBlock() {
        const bool isVersion0 = !IsConfigurationAtLeast(2, 1) || Config(41, 0, 15) == 0;
        if (isVersion0 && Word(6) == 0 && IsDeepFormat(Word(12))) SetWord(block, 6, 1);
        if (IsBayer()) MakeRegionEven();
        if (Word(24) == 1) EnterRtv();
        LimitRegion();
        LimitExposure(0);
        if (HasWheel()) LimitExposure(1);
        if (HasWheel()) LimitExposure(2);
    }
    void MakeRegionEven() {
        for (const std::uint32_t key : {13u, 14u}) SetWord(block, key, Word(key) & ~1u);
        for (const std::uint32_t key : {15u, 16u}) {
            const bool isOdd = Word(key) % 2 != 0;
            if (isOdd) SetWord(block, key, std::max(Word(key) - 1, 2u));
        }
    }
    void EnterRtv() {
        for (const std::uint32_t key : {3u, 4u, 5u}) SetWord(block, key, 1);
        if (IsRtv()) return;
        SetWord(block, 15, Is("Folary") ? Config(5, 16, 31) : 1);
        SetWord(block, 16, Is("Folary") ? Config(5, 0, 15) : 1);
    }
    void LimitRegion() {
        std::uint32_t vertical = Word(Is("Folary") || Is("Metrona") ? 5 : 3);
        const std::uint32_t horizontal = Word(Is("Metrona") ? 4 : 3);
        const bool isLeft = Word(24) == 0 && IsRtv();
        if (isLeft) {
            SetRtv(false);
            vertical = GetVerticalBinning();
        }
        LimitEdge(14, 16, GetHeightMax(vertical));
        LimitEdge(13, 15, GetWidthMax(horizontal));
        if (isLeft) SetRtv(true);
    }
    void LimitEdge(std::uint32_t position, std::uint32_t size, std::uint32_t limit) {
        if (Word(position) > limit) SetWord(block, position, 0);
        const std::uint64_t end = std::uint64_t{Word(size)} + Word(position);
        if (end > limit) SetWord(block, size, limit - Word(position));
    }
    void LimitExposure(std::uint32_t key) {
        SetWide(block, key, std::clamp(GetWide(block, key), ReadLimit(3, 39), ReadLimit(26, 40)));
    }
    std::uint64_t ReadLimit(std::uint32_t quadlet, std::uint32_t low) const {
        if (camera.configurationVersion < MakeVersion(2, 0)) {
            return std::uint64_t{1000} * Config(quadlet);
        }
        return std::uint64_t{Config(quadlet)} << 32 | Config(low);
    }

    void RunRows() {
        const std::vector<void (SendExpectation::*)()> rows{
            &SendExpectation::SetBitDepth,      &SendExpectation::SetMode,
            &SendExpectation::SetBinning,       &SendExpectation::SetRegion,
            &SendExpectation::SetReadout,       &SendExpectation::SetTrigger,
            &SendExpectation::SetCooler,        &SendExpectation::SetWheel,
            &SendExpectation::SetDoubleShot,    &SendExpectation::SetShutterDelay,
            &SendExpectation::SetGain,          &SendExpectation::SetIntensifier,
            &SendExpectation::SetOffset,        &SendExpectation::SetExposures,
            &SendExpectation::SetSyncB,         &SendExpectation::SetFan,
            &SendExpectation::SetSensitivity,   &SendExpectation::SetCoolingTarget,
            &SendExpectation::SetCloseDelay,    &SendExpectation::SetEMGain,
            &SendExpectation::SetAnalogOptions,
        };
        for (const auto row : rows) {
            (this->*row)();
            if (isRefused) return;
        }
    }

    // Depth, mode and binning.
    void SetBitDepth() {
        const std::uint32_t format = Word(12);
        if (format > 12) return;
        const std::uint32_t depth = IsDeepFormat(format) ? GetMaxBitDepth() : 8;
        LowerFastReadout(GetHorizontalBinning());
        if (depth == GetBitDepth()) return;
        if (IsOneOf(depth, {8, 10, 12, 14, 16})) {
            WriteBits("SetBitDepth", 1, 3, 4, depth == 8 ? 0 : depth == 14 ? 3 : 1);
        }
    }
    void LowerFastReadout(std::uint32_t binning) {
        if (IsTooFast(GetReadoutFrequency(), binning)) SetReadoutFrequency(20);
    }
    void SetMode() {
        if (Is("Folary") && Word(24) <= 1) SetRtv(Word(24) == 1);
    }
    void SetRtv(bool isOn) {
        if (IsRtv() == isOn) return;
        WriteBits("SetRTVMode", 2, 2, 2, isOn);
        if (isOn) {
            SetFolaryBinning(1);
            SetHeight(GetHeightMax(1));
            SetX(0);
            SetWidth(GetWidthMax(1));
        } else {
            SetWidth(GetSensorWidth());
            SetX(0);
            SetHeight(GetSensorHeight());
        }
        SetY(0);
    }
    void SetBinning() {
        if (Is("Folary")) return SetFolaryBinning(IsRtv() ? 1 : Word(5));
        if (!Is("Metrona")) return SetSymmetricalBinning(Word(3));
        SetOneBinning("SetVerticalBinning", 8, Word(5));
        if (!isRefused) SetOneBinning("SetHorizontalBinning", 16, Word(4));
    }
    void SetOneBinning(const char* step, unsigned first, std::uint32_t mode) {
        isRefused = mode < 1 || mode > 64;
        if (!isRefused) ChangeBits(step, 2, first, first + 7, mode - 1);
    }
    void SetFolaryBinning(std::uint32_t mode) {
        const std::uint32_t former = GetBinning();
        if (former == mode) return;
        Store(2, Shadow(2) & ~0xFFFF03u);
        isRefused = !IsOneOf(mode, {1, 2, 3, 4, 8});
        if (isRefused) return;
        constexpr std::uint32_t Codes[] = {0, 0, 0x10101, 0x20202, 0x30303, 0, 0, 0, 0x70702};
        Write("SetSymmetricalBinning", 2, Shadow(2) | Codes[mode]);
        FitRegion(mode, former);
    }
    void SetSymmetricalBinning(std::uint32_t mode) {
        LowerFastReadout(mode);
        const std::uint32_t former = GetBinning();
        if (former == mode) return;
        // Kept: the code is cleared in the shadow even when the mode is refused.
        Store(2, Shadow(2) & ~3u);
        isRefused = !IsOneOf(mode, {1, 2, 3, 4, 8});
        if (isRefused) return;
        const std::uint32_t code = mode == 8 ? 2 : mode - 1;
        Write("SetSymmetricalBinning", 2, Shadow(2) | code);
        FitRegion(mode, former);
    }
    void FitRegion(std::uint32_t mode, std::uint32_t former) {
        if (mode > 1) {
            SetWidth(GetWidthMax(mode));
            SetX(0);
            SetHeight(GetHeightMax(mode));
            SetY(0);
        } else if (former > 1) {
            SetWidth(GetSensorWidth());
            SetHeight(GetSensorHeight());
            SetX(0);
            SetY(0);
        }
    }

    // The region.
    void SetX(std::uint32_t x) { ChangeBits("SetROIX", 4, 16, 31, x); }
    void SetY(std::uint32_t y) { ChangeBits("SetROIY", 4, 0, 15, y); }
    void SetWidth(std::uint32_t width) {
        if (Shadow(3, 16, 31) == width) return;
        WriteBits("SetROIWidth", 3, 16, 31, std::min(width, GetWidthMax(GetBinning())));
    }
    void SetHeight(std::uint32_t height) {
        if (Shadow(3, 0, 15) == height) return;
        WriteBits("SetROIHeight", 3, 0, 15, std::min(height, GetHeightMax(GetBinning())));
    }
    void SetRegion() {
        std::uint32_t x = Word(13), y = Word(14), width = Word(15), height = Word(16);
        if (Is("Folary")) {
            x &= ~1u;
            y &= ~1u;
            width = NarrowForFolary(width & ~1u, height & ~1u);
            height &= ~1u;
        }
        if (IsMirrored()) {
            isRefused = width == 0 || height == 0;
            if (isRefused) return;
            x = GetSensorWidth() - x - width;
            y = GetSensorHeight() - y - height;
        }
        SetX(x);
        SetY(y);
        SetWidth(width);
        SetHeight(height);
        SetWord(block, 13, GetX());
        SetWord(block, 14, GetY());
        SetWord(block, 15, Shadow(3, 16, 31));
        SetWord(block, 16, Shadow(3, 0, 15));
    }
    std::uint32_t NarrowForFolary(std::uint32_t width, std::uint32_t height) const {
        std::uint32_t chunk = GetVerticalBinning();
        if (IsRtv()) {
            const std::uint32_t sensor = GetSensorWidth();
            chunk = sensor == 2048 ? 3 : sensor == 2560 ? 4 : height & 0xFFFF;
        }
        return chunk != 0 && width / chunk % 2 != 0 ? width - chunk : width;
    }

    // Readout, trigger, cooler and wheel.
    void SetReadout() {
        const float megahertz = GetMegahertz(Word(6));
        const bool isTooFast = IsTooFast(megahertz, GetHorizontalBinning());
        SetReadoutFrequency(isTooFast ? 20 : megahertz);
    }
    void SetReadoutFrequency(float megahertz) {
        if (megahertz == GetReadoutFrequency() || megahertz == 0) return;
        constexpr float Codes[] = {20, 10, 5, 2.5, 25, 30, 35, 40};
        const auto* code = std::ranges::find(Codes, megahertz);
        WriteBits("SetReadoutFrequency", 1, 8, 11, static_cast<std::uint32_t>(code - Codes));
    }
    std::uint32_t GetTriggerMode() const {
        constexpr std::uint32_t Modes[16] = {0, 5, 1, 3, 1, 6};
        const std::uint32_t mode = Modes[Shadow(11, 0, 3)];
        const bool isInverted = mode != 0 && mode != 5 && Shadow(11, 8, 8) != 0;
        return mode + (isInverted ? 1 : 0);
    }
    void SetTrigger() {
        const std::uint32_t mode = Word(7);
        if (mode == GetTriggerMode()) return;
        const std::uint32_t pulse = HasDoubleShot() && Shadow(13, 0, 0) != 0 ? 4 : 2;
        const std::uint32_t codes[] = {0, pulse, pulse | 0x100, 3, 0x103, 1, 5, 0x105};
        const std::uint32_t code = mode > 7 ? 0 : codes[mode];
        Write("SetTriggerMode", 11, (Shadow(11) & ~0x10Fu) | code);
    }
    void SetCooler() {
        if (Config(10, 31, 31) != 0) ChangeBits("SetCoolerStatus", 14, 0, 0, IsOn(9));
    }
    void SetWheel() {
        const std::uint32_t colour = Word(8);
        if (Shadow(12, 8, 9) != colour) {
            WriteBits("SetRGBFilterStartColour", 12, 8, 9, colour == 1 || colour == 3 ? colour : 0);
        }
        if (!IsMono()) return;
        const bool isTurning = IsColourFormat(Word(12));
        if (isTurning) WriteBits("SetRGBFilterActive", 12, 4, 4, 1);
        ChangeBits("SetRGBFilterCycle", 12, 0, 0, isTurning);
    }
    bool HasDoubleShot() const { return IsConfigurationAtLeast(1, 2) && Config(29, 0, 0) != 0; }
    void SetDoubleShot() {
        if (HasDoubleShot()) Write("SetDoubleShotMode", 13, 1);
    }
    void SetShutterDelay() {
        if (!Is("Metrona")) return;
        const std::uint32_t delay = (Word(21) + 49) / 50 * 50;
        if (Shadow(15) == delay || camera.controlVersion != MakeVersion(1, 2)) return;
        Write("SetMetronaShutterDelay", 15, delay);
    }

    // Gain, offset and exposure.
    void SetGain() {
        const std::int32_t microDb = GetSigned(block, 0);
        const GainBoard board = MakeGainBoard();
        if (HasRatioBoard()) return SetRatioGain(board, microDb);
        if (facts.board != GainBoardKind::ByProfile) return SetBoardGain(board, microDb);
        // Kept: without its own board this model takes the dB for a ratio in millionths.
        const auto ratio = static_cast<std::uint64_t>(std::max(microDb / 1'000'000, 0));
        SetBoardGain(board,
                     static_cast<std::int64_t>(ConvertRatioToMicroDb(board.FitRatio(ratio))));
    }
    void SetBoardGain(const GainBoard& board, std::int64_t microDb) {
        if (microDb == board.GetMicroDb(Shadow(5, 20, 31))) return;
        WriteBits("SetNormalizedGaindB", 5, 20, 31, board.GetDac(microDb));
    }
    void SetRatioGain(const GainBoard& board, std::int64_t microDb) {
        const std::uint64_t gain =
            std::uint64_t{board.dacDefault} * board.FitRatioOf(microDb) / 1'000'000;
        if (Shadow(26, 0, 7) == gain) return;
        WriteBits("SetNormalizedGaindB", 26, 0, 7, static_cast<std::uint32_t>(gain));
    }
    void SetIntensifier() {
        if (!Is("SolvaneK1")) return;
        WriteBits(
            "SetNormalizedIntensifierGain", 18, 4, 15,
            CalculateIntensifierGain(GetWide(block, 3), Config(34, 20, 31), Config(34, 4, 15)));
    }
    void SetOffset() {
        const bool isWide = HasRatioBoard();
        const std::uint32_t quadlet = isWide ? 28 : 5;
        const unsigned first = isWide ? 2 : 4;
        const std::uint32_t initial = isWide ? Config(186, 2, 15) : Config(2, 4, 15);
        ChangeBits("SetAbsoluteOffset", quadlet, first, 15,
                   static_cast<std::uint32_t>(GetSigned(block, 1)) + initial);
    }
    void SetExposures() {
        const bool isTurning = Shadow(12, 0, 0) != 0;
        const std::uint64_t exposure = GetWide(block, 0);
        SetExposure("SetExposure", 6, exposure, exposure);
        const std::uint64_t red = isTurning ? GetWide(block, 1) : exposure;
        const std::uint64_t blue = isTurning ? GetWide(block, 2) : exposure;
        // Kept: in microseconds only the low 32 bits of a filter's exposure count.
        SetExposure("SetRGBFilterRedExposure", 7, red, red & 0xFFFFFFFF);
        SetExposure("SetRGBFilterBlueExposure", 8, blue, blue & 0xFFFFFFFF);
    }
    void SetExposure(const std::string& step, std::uint32_t quadlet, std::uint64_t nanoseconds,
                     std::uint64_t rounded) {
        if (IsMicrosecondControl()) {
            if (std::uint64_t{1000} * Shadow(quadlet) == nanoseconds) return;
            const std::uint64_t micros = std::clamp<std::uint64_t>(rounded / 1000, 1, 0xFFFFFFFF);
            Write(step, quadlet, static_cast<std::uint32_t>(micros));
            return;
        }
        const auto upper = static_cast<std::uint32_t>(nanoseconds >> 32);
        const auto lower = static_cast<std::uint32_t>(nanoseconds);
        if (Shadow(quadlet) == upper && Shadow(quadlet + 9) == lower) return;
        Write(step + " upper", quadlet, upper);
        Write(step + " lower", quadlet + 9, lower);
    }

    // Options.
    void SetSyncB() {
        if (Shadow(11, 16, 17) == Word(20)) return;
        WriteBits("SetSyncBMode", 11, 16, 17, Word(20) == 1);
    }
    void SetFan() {
        if (!HasFeature(3)) return;
        const std::uint32_t code = Shadow(22, 16, 31);
        const std::uint32_t present = code >= 1 && code <= 3 ? code : 4;
        if (present == Word(33)) return;
        WriteBits("SetFanSpeed", 22, 16, 31, Word(33) <= 4 ? Word(33) : 0);
    }
    void SetSensitivity() {
        if (HasFeature(2)) ChangeBits("SetBlackoutMode", 21, 1, 1, IsOn(34));
        if (HasFeature(1)) ChangeBits("SetHighSensitivityMode", 21, 0, 0, IsOn(35));
    }
    void SetCoolingTarget() {
        const std::int32_t celsius = GetSigned(block, 2);
        if (!HasFeature(4) || celsius == ReadCelsius(Shadow(14, 16, 31))) return;
        isRefused = celsius < -55 || celsius > 49;
        if (isRefused) return;
        const double code = static_cast<double>(static_cast<float>(celsius + 55) * 39.0095253f);
        WriteBits("SetRegulatedCoolingTemp", 14, 16, 31, static_cast<std::uint32_t>(code - 0.5));
    }
    void SetCloseDelay() {
        if (!HasFeature(8) && !Is("SolvaneF1")) return;
        WriteBits("SetShutterCloseDelay", 25, 0, 15, static_cast<std::uint32_t>(Word(39) / 6.4));
    }
    void SetEMGain() {
        if (!HasFeature(6)) return;
        const std::uint32_t most = Config(193, 0, 15);
        isRefused = Word(37) < Config(192, 0, 15) || Word(37) > most;
        if (!isRefused) WriteBits("SetEMGain", 24, 0, 15, most - Word(37));
    }
    void SetAnalogOptions() {
        if (HasFeature(9)) WriteBits("SetDither", 30, 0, 0, IsOn(42));
        // Kept: high gain can only be switched off.
        if (HasFeature(10)) WriteBits("SetHighGainMode", 30, 1, 1, 0);
        if (!HasFeature(11)) return;
        const double frequency = static_cast<float>(Config(200)) / 1'000'000.0f;
        const auto count = static_cast<std::uint64_t>(Word(44) / 1000.0 * frequency);
        WriteBits("SetVClockPeriod", 31, 0, 15, static_cast<std::uint32_t>(count & 0xFFFF));
    }

    // After the rows.
    void SetTweak() {
        const std::uint32_t selector = Word(46) >> 28, value = Word(46) & 0xFFFF;
        if (!HasTweaks() || selector < 1 || selector > 8) return;
        constexpr std::uint32_t MiscCtrl = 8;
        if (selector == MiscCtrl) {
            isConfigurationStale = Shadow(41) != value;
            return Write("SetMiscCtrlAd", 41, value);
        }
        Write("tweak", 33 + selector, (selector == 1 ? value * 1000 : value) & 0xFFFF);
    }
    void Commit() {
        TakeOver("UpdateSettingsOnCamera");
        if (!isConfigurationStale) return;
        ReadConfigurationAgain();
        SetHeight(GetSensorHeight());
        SetWidth(GetSensorWidth());
    }
    void ReadBack() {
        SetWord(block, 13, GetX());
        SetWord(block, 14, GetY());
        SetWord(block, 15, Shadow(3, 16, 31));
        SetWord(block, 16, Shadow(3, 0, 15));
        SetWord(block, 3, GetBinning());
        SetWord(block, 5, GetVerticalBinning());
        SetWord(block, 4, GetHorizontalBinning());
        SetWord(block, 6, GetSpeedIndex(GetReadoutFrequency()));
    }

    Zentara_Settings block;
    bool isRefused = false;  ///< A row failed, and the send ended with it.
    bool isConfigurationStale = false;
};

}  // namespace

ExpectedSend CalculateSend(const CameraContents& camera, const std::vector<std::uint32_t>& shadow,
                           const Zentara_Settings& block, const Zentara_Settings& last) {
    return SendExpectation(camera, shadow, block).Send(last);
}

ExpectedSend CalculatePreflight(const CameraContents& camera,
                                const std::vector<std::uint32_t>& shadow,
                                const Zentara_Settings& block) {
    return SendExpectation(camera, shadow, block).Preflight();
}

}  // namespace ZV::Test
