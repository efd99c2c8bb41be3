#include <cstdint>
#include <optional>

#include "camera/morvane_fw_camera.h"
#include "camera/setting_codes.h"

/// Frequency, depth and binning: what decides how fast a frame leaves the sensor.
namespace ZV {

namespace {

constexpr float FastReadout = 30.0F;
constexpr float LoweredReadout = 20.0F;
constexpr std::uint16_t FastPacketBytes = 4096;

}  // namespace

bool MorvaneFWCamera::IsTooFastForBus(float megahertz, std::uint32_t binning) {
    return megahertz >= FastReadout && binning == 1 && GetFastestPacketSize() <= FastPacketBytes;
}

CameraResult MorvaneFWCamera::LowerFrequencyForBus(float megahertz, std::uint32_t binning) {
    return IsTooFastForBus(megahertz, binning) ? SetReadoutFrequency(LoweredReadout) : CameraOk;
}

CameraResult MorvaneFWCamera::AdjustSettingsForMaxPacketSize(std::uint32_t binning,
                                                             std::uint16_t /*bitDepth*/,
                                                             float* megahertz) {
    if (!IsTooFastForBus(*megahertz, binning)) return CameraOk;
    const CameraResult result = SetReadoutFrequency(LoweredReadout);
    *megahertz = LoweredReadout;
    return result;
}

CameraResult MorvaneFWCamera::SetReadoutFrequency(float megahertz) {
    float wanted = megahertz;
    const CameraResult result =
        AdjustSettingsForMaxPacketSize(GetHorizontalBinningMode(), 0, &wanted);
    if (result != CameraOk) return result;
    if (wanted == GetReadoutFrequency()) return CameraOk;
    const std::optional<std::uint32_t> code = FindFrequencyCode(wanted);
    return code ? ChangeField(ControlReadoutFrequency, *code) : CameraOk;
}

CameraResult MorvaneFWCamera::SetBitDepth(std::uint32_t bits) {
    const CameraResult result =
        LowerFrequencyForBus(GetReadoutFrequency(), GetHorizontalBinningMode());
    if (result != CameraOk) return result;
    if (bits == GetBitDepth()) return CameraOk;
    const std::optional<std::uint32_t> code = FindBitDepthCode(bits);
    return code ? ChangeField(ControlBitDepth, *code) : CameraOk;
}

CameraResult MorvaneFWCamera::SetSymmetricalBinning(std::uint32_t mode) {
    CameraResult result = LowerFrequencyForBus(GetReadoutFrequency(), mode);
    if (result != CameraOk) return result;
    const std::uint32_t formerMode = GetSymmetricalBinningMode();
    if (mode == formerMode) return CameraOk;
    result = StopAndTakeStreamLock();
    if (result != CameraOk) return result;
    result = WriteBinning(mode);
    if (result != CameraBadValue) FitROIToBinning(mode, formerMode);
    (void)GiveLock(streaming.streamLock);  // Printed; the settings are made.
    return result;
}

/// A stream that another thread has started before the lock was taken is stopped as well: its
/// frames would get the new size and the pixels of the old one.
CameraResult MorvaneFWCamera::StopAndTakeStreamLock() {
    for (;;) {
        TurnOffStreaming();
        CameraResult result = TakeLock(streaming.streamLock);
        if (result != CameraOk) return result;
        if (!streaming.isStreaming || streaming.restartAfterUpdate) return CameraOk;
        result = GiveLock(streaming.streamLock);
        if (result != CameraOk) return result;
    }
}

CameraResult MorvaneFWCamera::WriteBinning(std::uint32_t mode) {
    const std::optional<std::uint32_t> code = FindBinningCode(mode);
    if (!code) {
        // Kept: a refused mode leaves the shadow at mode 1 while the camera bins as before.
        StoreControl(ControlBinning.quadlet,
                     InsertField(ControlBinning, ReadControl(ControlBinning.quadlet), 0));
        return CameraBadValue;
    }
    const CameraResult result = WriteGeometryField(ControlBinning, *code);
    // Kept: a write that fails gives the lock here and once more at the end.
    if (result != CameraOk) (void)GiveLock(streaming.streamLock);
    return result;
}

// The results are dropped: the binning stands, and each step says on its own what it could not do.
// The stop step is done, and none of these may stop a stream: they run under `streamLock`, for
// which a stop waits.
void MorvaneFWCamera::FitROIToBinning(std::uint32_t mode, std::uint32_t formerMode) {
    const auto put = [this](const RegisterField& field, std::uint32_t value,
                            std::uint32_t greatest) {
        (void)ChangeROIField(field, value, greatest, StopStep::Done);
    };
    if (mode > 1) {
        put(ControlRoiWidth, GetMaxCCDWidthForBinningMode(mode), GetGreatestROIWidth());
        put(ControlRoiX, 0, ROIUnlimited);
        put(ControlRoiHeight, GetMaxCCDHeightForBinningMode(mode), GetGreatestROIHeight());
        put(ControlRoiY, 0, ROIUnlimited);
    } else if (formerMode > 1) {
        put(ControlRoiWidth, GetCCDWidth(), GetGreatestROIWidth());
        put(ControlRoiHeight, GetCCDHeight(), GetGreatestROIHeight());
        put(ControlRoiX, 0, ROIUnlimited);
        put(ControlRoiY, 0, ROIUnlimited);
    }
}

}  // namespace ZV
