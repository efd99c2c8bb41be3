#include "camera/morvane_fw_camera.h"

/// What a camera answers where only a model knows better.
namespace ZV {

namespace {

constexpr std::uint64_t DefaultExposureNs = 0xFA0000;
constexpr std::uint16_t DefaultTagCode = 1;

}  // namespace

std::uint32_t MorvaneFWCamera::GetNormalizedGainDefault() {
    return 1;
}
std::uint32_t MorvaneFWCamera::GetROIMaxWidthForRTVMode() {
    return 1;
}
std::uint32_t MorvaneFWCamera::GetROIMaxHeightForRTVMode() {
    return 1;
}

std::uint64_t MorvaneFWCamera::GetNormalizedIntensifierGain() {
    return 0;
}
std::uint64_t MorvaneFWCamera::GetNormalizedIntensifierGainMin() {
    return 0;
}
std::uint64_t MorvaneFWCamera::GetNormalizedIntensifierGainMax() {
    return 0;
}
std::uint16_t MorvaneFWCamera::GetNormalizedIntensifierGaindBResolution() {
    return 0;
}
std::uint16_t MorvaneFWCamera::GetNormalizedIntensifierGainSignificantFigures() {
    return 0;
}
std::uint32_t MorvaneFWCamera::GetNormalizedIntensifierGaindB() {
    return 0;
}
std::int32_t MorvaneFWCamera::GetNormalizedIntensifierGaindBMin() {
    return 0;
}
std::int32_t MorvaneFWCamera::GetNormalizedIntensifierGaindBMax() {
    return 0;
}
std::uint32_t MorvaneFWCamera::GetIntensifierGain() {
    return 0;
}
std::uint32_t MorvaneFWCamera::GetIntensifierGainMin() {
    return 0;
}
std::uint32_t MorvaneFWCamera::GetIntensifierGainMax() {
    return 0;
}
std::int32_t MorvaneFWCamera::GetAbsoluteOffsetDefault() {
    return 0;
}
std::uint32_t MorvaneFWCamera::GetMetronaShutterDelay() {
    return 0;
}
std::uint16_t MorvaneFWCamera::GetReadoutPort() {
    return 0;
}
CameraResult MorvaneFWCamera::SetupNormalizedIntensifiedGain() {
    return CameraOk;
}

CameraResult MorvaneFWCamera::SetHorizontalBinning(std::uint32_t) {
    return CameraNotSupported;
}
CameraResult MorvaneFWCamera::SetVerticalBinning(std::uint32_t) {
    return CameraNotSupported;
}
CameraResult MorvaneFWCamera::SetRTVMode(bool) {
    return CameraNotSupported;
}
CameraResult MorvaneFWCamera::SetReadoutPort(std::uint32_t) {
    return CameraNotSupported;
}
CameraResult MorvaneFWCamera::SetMetronaShutterDelay(std::uint32_t) {
    return CameraNotSupported;
}
CameraResult MorvaneFWCamera::SetNormalizedIntensifierGain(std::uint64_t) {
    return CameraNotSupported;
}

bool MorvaneFWCamera::IsSymmetricalBinningSupported() {
    return true;
}
bool MorvaneFWCamera::IsSyncBSupported() {
    return true;
}
bool MorvaneFWCamera::IsRTVModeSupported() {
    return false;
}
bool MorvaneFWCamera::IsHorizontalBinningSupported() {
    return false;
}
bool MorvaneFWCamera::IsVerticalBinningSupported() {
    return false;
}
bool MorvaneFWCamera::IsIntensifierAvailable() {
    return false;
}
bool MorvaneFWCamera::IsTriggerDelayAvialable() {
    return false;
}
bool MorvaneFWCamera::IsReadoutPortSupported() {
    return false;
}
bool MorvaneFWCamera::IsMetronaShutterDelaySupported() {
    return false;
}
bool MorvaneFWCamera::DoesSupportExternalBuffers() {
    return false;
}
bool MorvaneFWCamera::IsInterlaced() {
    return false;
}
bool MorvaneFWCamera::GetRTVMode() {
    return false;
}

std::uint16_t MorvaneFWCamera::GetHorizontalBinningMode() {
    return GetSymmetricalBinningMode();
}
std::uint16_t MorvaneFWCamera::GetVerticalBinningMode() {
    return GetSymmetricalBinningMode();
}
std::uint32_t MorvaneFWCamera::GetROIMaxWidthForBinningMode(std::uint32_t mode) {
    return GetMaxCCDWidthForBinningMode(mode);
}
std::uint32_t MorvaneFWCamera::GetROIMaxHeightForBinningMode(std::uint32_t mode) {
    return GetMaxCCDHeightForBinningMode(mode);
}
std::uint16_t MorvaneFWCamera::GetDistanceBetweenPixels() {
    return GetPixelSize();
}
float MorvaneFWCamera::GetReadoutFrequencyDefault() {
    return GetReadoutFrequencyMax();
}
void MorvaneFWCamera::GetHorizontalBinningModes(std::vector<std::uint16_t>& modes) {
    EraseVector(modes);
}
void MorvaneFWCamera::GetVerticalBinningModes(std::vector<std::uint16_t>& modes) {
    EraseVector(modes);
}

std::uint16_t MorvaneFWCamera::GetTagCode() {
    return DefaultTagCode;
}
std::uint64_t MorvaneFWCamera::GetDefaultExposure() {
    return DefaultExposureNs;
}

}  // namespace ZV
