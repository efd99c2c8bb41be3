#include "models/pellan_b1.h"

#include <algorithm>
#include <array>

#include "camera/gain_conversion.h"
#include "camera/packet_size.h"
#include "camera/setting_codes.h"
#include "models/model_traits.h"

namespace ZV {

namespace {

constexpr std::array ReadoutModes{40.0F, 10.0F, 20.0F};
constexpr std::uint32_t RatioDacRange = 128;

}  // namespace

PellanB1::~PellanB1() = default;

void PellanB1::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendModes(BinningTo8, modes);
}

// Kept: the name is that of another model.
const char* PellanB1::GetModelName() {
    return "Pellan D1";
}

std::uint32_t PellanB1::GetAnalogBoardType() {
    if (GetHardwareProfile() != 0) return BoardTypeRatio;
    return FindBoardType(GetFirmwareVersion(), UsualLinearFirmware);
}

bool PellanB1::IsRatioBoard() {
    return GetAnalogBoardType() == BoardTypeRatio;
}

void PellanB1::GetReadoutFrequencyModes(std::vector<float>& modes) {
    AppendModes(ReadoutModes, modes);
}

void PellanB1::GetTriggerModes(std::vector<std::uint32_t>& modes) {
    AppendTriggerModes(LastTriggerMode, GetRGBFilterCycleMode(), modes);
}

std::uint16_t PellanB1::GetReadoutPort() {
    return 1;
}

CameraResult PellanB1::SetReadoutPort(std::uint32_t /*port*/) {
    return CameraOk;
}

std::uint16_t PellanB1::GetTagCode() {
    return 0;
}

std::uint16_t PellanB1::CalculateRequiredPacketSize(bool clamp) {
    const BusConnection bus = ReadBusConnection();
    const ReadoutLoad load{GetHorizontalBinningMode(), static_cast<std::uint16_t>(GetBitDepth()),
                           GetReadoutFrequency()};
    const std::uint16_t size = CalculateUncutPacketSize(load, bus);
    return clamp ? std::min(size, bus.fastestBytes) : size;
}

std::uint32_t PellanB1::GetGainDACRange() {
    return IsRatioBoard() ? RatioDacRange : MorvaneFWCamera::GetGainDACRange();
}

std::uint32_t PellanB1::GetGain() {
    return IsRatioBoard() ? ReadControlField(ControlRatioGain) : MorvaneFWCamera::GetGain();
}

std::uint32_t PellanB1::GetGainDefault() {
    return IsRatioBoard() ? ReadConfigurationField(ConfigRatioGainDefault)
                          : MorvaneFWCamera::GetGainDefault();
}

std::uint32_t PellanB1::GetGainMin() {
    return IsRatioBoard() ? ReadConfigurationField(ConfigRatioGainMin)
                          : MorvaneFWCamera::GetGainMin();
}

std::uint32_t PellanB1::GetGainMax() {
    return IsRatioBoard() ? ReadConfigurationField(ConfigRatioGainMax)
                          : MorvaneFWCamera::GetGainMax();
}

/// 0 for a default of 0.
double PellanB1::DivideByDefault(std::uint32_t gain) {
    const std::uint32_t defaultGain = GetGainDefault();
    return defaultGain == 0 ? 0 : static_cast<double>(gain) / defaultGain;
}

std::uint32_t PellanB1::GetNormalizedGain() {
    if (!IsRatioBoard()) return MorvaneFWCamera::GetNormalizedGain();
    return static_cast<std::uint32_t>(DivideByDefault(GetGain()));
}

double PellanB1::GetNormalizedGainMin() {
    return IsRatioBoard() ? DivideByDefault(GetGainMin()) : MorvaneFWCamera::GetNormalizedGainMin();
}

double PellanB1::GetNormalizedGainMax() {
    return IsRatioBoard() ? DivideByDefault(GetGainMax()) : MorvaneFWCamera::GetNormalizedGainMax();
}

// Kept: the plain ratio goes into a conversion that counts in millionths, so every gain reads as
// the least.
std::int32_t PellanB1::ConvertRatioTodB(double ratio) {
    auto normGain = static_cast<std::uint32_t>(ratio);
    return ConvertNormTodB(gainModel, &normGain);
}

std::int32_t PellanB1::GetNormalizedGaindB() {
    return IsRatioBoard() ? ConvertRatioTodB(GetNormalizedGain())
                          : MorvaneFWCamera::GetNormalizedGaindB();
}

std::int32_t PellanB1::GetNormalizedGaindBMin() {
    return IsRatioBoard() ? ConvertRatioTodB(GetNormalizedGainMin())
                          : MorvaneFWCamera::GetNormalizedGaindBMin();
}

std::int32_t PellanB1::GetNormalizedGaindBMax() {
    return IsRatioBoard() ? ConvertRatioTodB(GetNormalizedGainMax())
                          : MorvaneFWCamera::GetNormalizedGaindBMax();
}

CameraResult PellanB1::SetGain(std::uint32_t gain) {
    if (!IsRatioBoard()) return MorvaneFWCamera::SetGain(gain);
    if (gain == GetGain()) return CameraOk;
    return WriteControlField(ControlRatioGain, gain);
}

CameraResult PellanB1::SetNormalizedGain(std::uint32_t normGain) {
    // Kept: without the ratio board the value loses its factor of a million, and the least gain is
    // set.
    if (!IsRatioBoard()) return MorvaneFWCamera::SetNormalizedGain(normGain / NormGainUnity);
    const std::uint64_t gain = static_cast<std::uint64_t>(GetGainDefault()) * normGain;
    return SetGain(static_cast<std::uint32_t>(gain / NormGainUnity));
}

CameraResult PellanB1::SetNormalizedGaindB(std::int32_t gaindB) {
    if (IsRatioBoard()) return SetNormalizedGain(ConvertdBToNorm(gainModel, gaindB));
    // Kept: as in SetNormalizedGain, with dB taken for a gain.
    const auto normGain = static_cast<std::uint32_t>(std::max(gaindB, 0)) / NormGainUnity;
    return MorvaneFWCamera::SetNormalizedGain(normGain);
}

std::int32_t PellanB1::GetOffset() {
    if (!IsRatioBoard()) return MorvaneFWCamera::GetOffset();
    return static_cast<std::int32_t>(ReadControlField(ControlRatioOffset));
}

std::int32_t PellanB1::GetOffsetDefault() {
    if (!IsRatioBoard()) return MorvaneFWCamera::GetOffsetDefault();
    return static_cast<std::int32_t>(ReadConfigurationField(ConfigRatioOffsetDefault));
}

std::int32_t PellanB1::GetOffsetMin() {
    if (!IsRatioBoard()) return MorvaneFWCamera::GetOffsetMin();
    return static_cast<std::int32_t>(ReadConfigurationField(ConfigRatioOffsetMin));
}

std::int32_t PellanB1::GetOffsetMax() {
    if (!IsRatioBoard()) return MorvaneFWCamera::GetOffsetMax();
    return static_cast<std::int32_t>(ReadConfigurationField(ConfigRatioOffsetMax));
}

CameraResult PellanB1::SetOffset(std::int32_t offset) {
    if (!IsRatioBoard()) return MorvaneFWCamera::SetOffset(offset);
    if (offset == GetOffset()) return CameraOk;
    return WriteControlField(ControlRatioOffset, static_cast<std::uint32_t>(offset));
}

}  // namespace ZV
