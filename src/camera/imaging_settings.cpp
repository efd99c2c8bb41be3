#include <algorithm>
#include <cstdint>

#include "camera/morvane_fw_camera.h"
#include "camera/setting_codes.h"

/// Setters that change one field. The pattern: the value that is in place already succeeds without
/// a trace, then the capability, then the range, then the stop step, then shadow and camera.
namespace ZV {

namespace {

constexpr std::uint32_t TriggerModeSoftware = 5;
constexpr std::uint32_t LowHalf = 0xFFFF;

}  // namespace

CameraResult MorvaneFWCamera::ChangeField(const RegisterField& field, std::uint32_t value) {
    TurnOffStreaming();
    return WriteGeometryField(field, value);
}

// The ROI's fields compare the register, not the getter: a model may state its position from
// another corner.
CameraResult MorvaneFWCamera::ChangeROIField(const RegisterField& field, std::uint32_t value,
                                             std::uint32_t greatest, StopStep stopStep) {
    if (value == ReadControlField(field)) return CameraOk;
    if (stopStep == StopStep::Due) TurnOffStreaming();
    return WriteGeometryField(field, std::min(value, greatest));
}

std::uint32_t MorvaneFWCamera::GetGreatestROIWidth() {
    return GetMaxCCDWidthForBinningMode(GetSymmetricalBinningMode());
}

std::uint32_t MorvaneFWCamera::GetGreatestROIHeight() {
    return GetMaxCCDHeightForBinningMode(GetSymmetricalBinningMode());
}

CameraResult MorvaneFWCamera::SetROIX(std::uint32_t x) {
    return ChangeROIField(ControlRoiX, x, ROIUnlimited, StopStep::Due);
}

CameraResult MorvaneFWCamera::SetROIY(std::uint32_t y) {
    return ChangeROIField(ControlRoiY, y, ROIUnlimited, StopStep::Due);
}

CameraResult MorvaneFWCamera::SetROIWidth(std::uint32_t width) {
    return ChangeROIField(ControlRoiWidth, width, GetGreatestROIWidth(), StopStep::Due);
}

CameraResult MorvaneFWCamera::SetROIHeight(std::uint32_t height) {
    return ChangeROIField(ControlRoiHeight, height, GetGreatestROIHeight(), StopStep::Due);
}

CameraResult MorvaneFWCamera::SetROI(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                                     std::uint32_t height) {
    CameraResult result = SetROIX(x);
    if (result == CameraOk) result = SetROIY(y);
    if (result == CameraOk) result = SetROIWidth(width);
    if (result == CameraOk) result = SetROIHeight(height);
    return result;
}

CameraResult MorvaneFWCamera::SetBigEndian(bool isBigEndian) {
    constexpr std::uint32_t LittleEndianBit = 1u << 2;
    constexpr std::uint32_t NeighbourBit = 1u << 1;
    const std::uint32_t former = ReadControl(ControlLittleEndian.quadlet);
    if (isBigEndian == GetBigEndian()) return CameraOk;

    // Kept: `true` drops the bit beside the one meant, so a camera that went to little-endian does
    // not come back.
    const std::uint32_t sent = isBigEndian ? former & ~NeighbourBit : former | LittleEndianBit;
    StoreControl(ControlLittleEndian.quadlet, (former & ~LittleEndianBit) | sent);
    return SendControl(ControlLittleEndian.quadlet, sent);
}

CameraResult MorvaneFWCamera::SetCompression(std::uint32_t compression) {
    if (compression == GetCompression()) return CameraOk;
    return WriteControlField(ControlCompression, compression);
}

CameraResult MorvaneFWCamera::SetOffset(std::int32_t offset) {
    if (offset == GetOffset()) return CameraOk;
    return WriteControlField(ControlOffset, static_cast<std::uint32_t>(offset));
}

CameraResult MorvaneFWCamera::SetAbsoluteOffset(std::int32_t absoluteOffset) {
    return SetOffset(static_cast<std::int32_t>(ConvertAbsoluteOffsetToOffset(absoluteOffset)));
}

CameraResult MorvaneFWCamera::SetCoolerStatus(bool isOn) {
    if (isOn == GetCoolerStatus()) return CameraOk;
    return WriteControlField(ControlCooler, isOn);
}

CameraResult MorvaneFWCamera::SetRGBFilterCycle(bool isOn) {
    if (isOn == GetRGBFilterCycleMode()) return CameraOk;
    return ChangeField(ControlFilterCycle, isOn);
}

CameraResult MorvaneFWCamera::SetRGBFilterActive(bool isOn) {
    return WriteControlField(ControlFilterActive, isOn);
}

CameraResult MorvaneFWCamera::SetTriggerMode(std::uint32_t mode) {
    if (mode == GetTriggerMode()) return CameraOk;
    const TriggerCode code = FindTriggerCode(mode, GetDoubleShotMode());
    std::uint32_t quadlet = ReadControl(ControlTriggerType.quadlet);
    quadlet = InsertField(ControlTriggerType, quadlet, code.type);
    quadlet = InsertField(ControlTriggerPolarity, quadlet, code.polarity);

    const CameraResult result = WriteControl(ControlTriggerType.quadlet, quadlet);
    if (result != CameraOk) return result;
    return mode == TriggerModeSoftware ? Abort() : CameraOk;
}

CameraResult MorvaneFWCamera::SetSyncBMode(std::uint32_t mode) {
    if (mode == GetSyncBMode()) return CameraOk;
    return WriteControlField(ControlSyncB, mode == 1 ? 1 : 0);
}

CameraResult MorvaneFWCamera::SetFanSpeed(std::uint32_t speed) {
    constexpr std::uint32_t GreatestSpeed = 4;
    if (speed == GetFanSpeed()) return CameraOk;
    if (!IsFanControlAvailable()) return CameraNotSupported;
    return WriteControlField(ControlFanSpeed, speed <= GreatestSpeed ? speed : 0);
}

CameraResult MorvaneFWCamera::SetBlackoutMode(bool isOn) {
    if (isOn == GetBlackoutMode()) return CameraOk;
    if (!IsBlackoutModeAvailable()) return CameraNotSupported;
    return WriteControlField(ControlBlackout, isOn);
}

CameraResult MorvaneFWCamera::SetHighSensitivityMode(bool isOn) {
    if (isOn == GetHighSensitivityMode()) return CameraOk;
    if (!IsHighSensitivityModeAvailable()) return CameraNotSupported;
    return WriteControlField(ControlHighSensitivity, isOn);
}

CameraResult MorvaneFWCamera::SetRegulatedCoolingTemp(std::int32_t celsius) {
    if (celsius == GetRegulatedCoolingTemperature()) return CameraOk;
    if (!IsRegulatedCoolingAvailable()) return CameraNotSupported;
    if (celsius < CoolingCelsiusMin || celsius > CoolingCelsiusMax) return CameraBadValue;
    return WriteControlField(ControlTemperature, ConvertCelsiusToCode(celsius));
}

CameraResult MorvaneFWCamera::SetRGBFilterStartColour(std::uint32_t colour) {
    if (colour == GetRGBFilterStartColour()) return CameraOk;
    // Kept: colour 2 counts as 0.
    return WriteControlField(ControlFilterStartColour, colour == 1 || colour == 3 ? colour : 0);
}

CameraResult MorvaneFWCamera::SetShutterCloseDelay(std::uint32_t delay) {
    if (!IsShutterCloseDelayAvailable()) return CameraNotSupported;
    return WriteControlField(ControlCloseDelay, ConvertCloseDelay(delay));
}

CameraResult MorvaneFWCamera::SetDoubleShotMode(bool /*isOn*/) {
    if (!IsDoubleShotSupported()) return CameraOk;
    // Kept: the mode cannot be switched off, and the filter delays in the same quadlet are lost.
    return WriteControl(ControlFilterDelays, 1);
}

CameraResult MorvaneFWCamera::SetChan1CalibrationGain(std::uint32_t gain) {
    if (GetHardwareProfile() < 2) return CameraNotSupported;
    return WriteControlField(ControlCalibrationGain, gain);
}

CameraResult MorvaneFWCamera::SetDither(bool isOn) {
    if (!IsDitherControlAvailable()) return CameraNotSupported;
    return WriteControlField(ControlDither, isOn);
}

CameraResult MorvaneFWCamera::SetHighGainMode(bool /*isOn*/) {
    if (!IsHighGainModeAvailable()) return CameraNotSupported;
    // Kept: the bit is written off whatever is asked for; SetDither on the same quadlet works.
    return WriteControlField(ControlHighGain, 0);
}

CameraResult MorvaneFWCamera::SetVClockPeriod(std::uint32_t nanoseconds) {
    if (!IsVClockControlAvailable()) return CameraNotSupported;
    return WriteControlField(ControlVClock,
                             ConvertVClockPeriod(nanoseconds, GetVClockFrequencyResolution()));
}

CameraResult MorvaneFWCamera::SetEMGain(std::uint32_t gain) {
    if (!IsEMGainAvailable()) return CameraNotSupported;
    if (gain < GetEMGainMin() || gain > GetEMGainMax()) return CameraBadValue;
    return WriteControlField(ControlEMGain, GetEMGainMax() - gain);
}

CameraResult MorvaneFWCamera::SetPSN(std::uint32_t psn) {
    return WriteControlField(ControlPsn, psn);
}

CameraResult MorvaneFWCamera::SetRGBFilterDelays(std::uint32_t delays) {
    return WriteControl(ControlFilterDelays, delays);
}

CameraResult MorvaneFWCamera::WriteTweak(std::uint32_t quadlet, std::uint32_t value) {
    if (!IsTweekingRegisterSupported()) return CameraRefused;
    return WriteControl(quadlet, value & LowHalf);
}

CameraResult MorvaneFWCamera::SetSubCpAd(std::uint32_t value) {
    return WriteTweak(ControlTweakFirst, value);
}

CameraResult MorvaneFWCamera::SetSubAd(std::uint32_t value) {
    return WriteTweak(ControlTweakFirst + 1, value);
}

CameraResult MorvaneFWCamera::SetResetVhAd(std::uint32_t value) {
    return WriteTweak(ControlTweakFirst + 2, value);
}

CameraResult MorvaneFWCamera::SetV1VmAd(std::uint32_t value) {
    return WriteTweak(ControlTweakFirst + 3, value);
}

CameraResult MorvaneFWCamera::SetV2VmAd(std::uint32_t value) {
    return WriteTweak(ControlTweakFirst + 4, value);
}

CameraResult MorvaneFWCamera::SetV3VmAd(std::uint32_t value) {
    return WriteTweak(ControlTweakFirst + 5, value);
}

CameraResult MorvaneFWCamera::SetV4VmAd(std::uint32_t value) {
    return WriteTweak(ControlTweakFirst + 6, value);
}

CameraResult MorvaneFWCamera::SetMiscCtrlAd(std::uint32_t value) {
    if (!IsTweekingRegisterSupported()) return CameraRefused;
    // The camera reports another configuration once the change is taken over.
    if (ReadControl(ControlMiscCtrl) != value) streaming.configStale = true;
    return WriteControl(ControlMiscCtrl, value & LowHalf);
}

}  // namespace ZV
