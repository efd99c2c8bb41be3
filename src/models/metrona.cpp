#include "models/metrona.h"

#include <algorithm>

#include "camera/gain_conversion.h"

namespace ZV {

namespace {

constexpr std::uint16_t GreatestBinning = 64;
constexpr std::uint64_t DefaultExposureNs = 100000000;
constexpr std::uint32_t DelayStep = 50;

void AppendAxisModes(std::vector<std::uint16_t>& modes) {
    for (std::uint16_t mode = 1; mode <= GreatestBinning; ++mode) modes.push_back(mode);
}

}  // namespace

Metrona::~Metrona() = default;

const char* Metrona::GetModelName() {
    return "MT1";
}

std::uint32_t Metrona::GetAnalogBoardType() {
    return BoardTypeLinear;
}

std::uint32_t Metrona::GetBitDepth() {
    return 16;
}

std::uint64_t Metrona::GetDefaultExposure() {
    return DefaultExposureNs;
}

void Metrona::GetReadoutFrequencyModes(std::vector<float>& modes) {
    modes.push_back(5.0F);
}

void Metrona::GetSymmetricalBinningModes(std::vector<std::uint16_t>& modes) {
    EraseVector(modes);
}

void Metrona::GetHorizontalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendAxisModes(modes);
}

void Metrona::GetVerticalBinningModes(std::vector<std::uint16_t>& modes) {
    AppendAxisModes(modes);
}

bool Metrona::IsSymmetricalBinningSupported() {
    return false;
}

bool Metrona::IsHorizontalBinningSupported() {
    return true;
}

bool Metrona::IsVerticalBinningSupported() {
    return true;
}

std::uint16_t Metrona::GetHorizontalBinningMode() {
    return static_cast<std::uint16_t>(ReadControlField(ControlHorizontalBinningMinusOne) + 1);
}

std::uint16_t Metrona::GetVerticalBinningMode() {
    return static_cast<std::uint16_t>(ReadControlField(ControlVerticalBinningMinusOne) + 1);
}

CameraResult Metrona::SetHorizontalBinning(std::uint32_t mode) {
    if (mode == GetHorizontalBinningMode()) return CameraOk;
    return SetAxisBinning(ControlHorizontalBinningMinusOne, mode);
}

CameraResult Metrona::SetVerticalBinning(std::uint32_t mode) {
    if (mode == GetVerticalBinningMode()) return CameraOk;
    return SetAxisBinning(ControlVerticalBinningMinusOne, mode);
}

CameraResult Metrona::SetAxisBinning(const RegisterField& field, std::uint32_t mode) {
    if (mode < 1 || mode > GreatestBinning) return CameraBadValue;
    return WriteGeometryField(field, mode - 1);
}

std::uint32_t Metrona::GetMaxCCDWidthForBinningMode(std::uint32_t mode) {
    return GetCCDWidth() / std::max(mode, 1u);
}

std::uint32_t Metrona::GetMaxCCDHeightForBinningMode(std::uint32_t mode) {
    return std::max(GetCCDHeight() / std::max(mode, 1u), 1u);
}

std::uint32_t Metrona::GetImageWidth() {
    const std::uint16_t mode = GetHorizontalBinningMode();
    if (mode < 2) return GetROIWidth();
    return std::min(GetROIWidth(), GetMaxCCDWidthForBinningMode(mode));
}

std::uint32_t Metrona::GetImageHeight() {
    const std::uint16_t mode = GetVerticalBinningMode();
    if (mode < 2) return GetROIHeight();
    return std::min(GetROIHeight(), GetMaxCCDHeightForBinningMode(mode));
}

std::uint32_t Metrona::GetMetronaShutterDelay() {
    return ReadControl(ControlMetronaDelay);
}

CameraResult Metrona::SetMetronaShutterDelay(std::uint32_t delay) {
    const std::uint32_t rounded = (delay + (DelayStep - 1)) / DelayStep * DelayStep;
    if (rounded == GetMetronaShutterDelay()) return CameraOk;
    if (GetControlVersion() != MakeVersion(1, 2)) return CameraNotSupported;
    return WriteControl(ControlMetronaDelay, rounded);
}

bool Metrona::IsMetronaShutterDelaySupported() {
    return true;
}

}  // namespace ZV
