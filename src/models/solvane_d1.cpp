#include "models/solvane_d1.h"

#include "camera/gain_conversion.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

namespace {

constexpr std::uint16_t TurnedStreamingVersion = 2;

/// The position counted from the other side; it wraps in 32 bits.
std::uint32_t Mirror(std::uint32_t sensor, std::uint32_t position, std::uint32_t size) {
    return sensor - position - size;
}

}  // namespace

SolvaneD1::~SolvaneD1() = default;

void SolvaneD1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

const char* SolvaneD1::GetModelName() {
    return "Solvane D1";
}

std::uint32_t SolvaneD1::GetAnalogBoardType() {
    return BoardTypeLinear;
}

void SolvaneD1::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(Readout5To20, modes);
}

void SolvaneD1::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

bool SolvaneD1::IsTurned() {
    return GetStreamingVersion() == TurnedStreamingVersion;
}

std::uint32_t SolvaneD1::GetROIX() {
    const std::uint32_t x = MorvaneFWCamera::GetROIX();
    if (!IsTurned()) return x;
    const std::uint32_t width = GetROIWidth();
    return width == 0 ? 0 : Mirror(GetCCDWidth(), x, width);
}

std::uint32_t SolvaneD1::GetROIY() {
    const std::uint32_t y = MorvaneFWCamera::GetROIY();
    if (!IsTurned()) return y;
    const std::uint32_t height = GetROIHeight();
    return height == 0 ? 0 : Mirror(GetCCDHeight(), y, height);
}

CameraResult SolvaneD1::SetROI(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                               std::uint32_t height) {
    if (!IsTurned()) return MorvaneFWCamera::SetROI(x, y, width, height);
    if (width == 0 || height == 0) return CameraBadValue;
    // Kept: the mirror is that of the unbinned sensor at any binning mode.
    return MorvaneFWCamera::SetROI(Mirror(GetCCDWidth(), x, width),
                                   Mirror(GetCCDHeight(), y, height), width, height);
}

}  // namespace ZV
