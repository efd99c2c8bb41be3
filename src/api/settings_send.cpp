// Sending: the one place where a settings block becomes the state of a camera.
//
// Runs on a client's thread, on the camera's exposure thread behind a finished exposure, or on its
// run loop behind a delivered frame. `queueLock` is held throughout, so queueing waits until the
// settings stand; `sendInProgress` tells the exposure thread to go on without the lock meanwhile.

#include <cstdint>

#include "api/camera_context.h"
#include "api/exported_call.h"
#include "api/format_sets.h"
#include "api/handles.h"
#include "api/register_tweak.h"
#include "api/result_codes.h"
#include "api/settings_block.h"
#include "api/settings_change.h"
#include "api/settings_compare.h"
#include "api/settings_units.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "imaging/image_formats.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

struct Send {
    ZCamera& camera;
    CameraContext& context;
    Zentara_Settings& settings;

    [[nodiscard]] std::uint32_t Get(std::uint32_t key) const {
        return GetSettingsWord(settings, key);
    }
    void Put(std::uint32_t key, std::uint32_t value) const {
        SetSettingsWord(settings, key, value);
    }
};

// ---- Steps ----

template <auto Setter, std::uint32_t Key>
CameraResult SetWord(const Send& send) {
    return (send.camera.*Setter)(send.Get(Key));
}

template <auto Setter, std::uint32_t Key>
CameraResult SetFlag(const Send& send) {
    return (send.camera.*Setter)(send.Get(Key) != 0);
}

template <auto Setter, std::uint32_t Key>
CameraResult SetSigned(const Send& send) {
    return (send.camera.*Setter)(GetSettingsSigned(send.settings, Key));
}

template <auto Setter, std::uint32_t Key>
CameraResult SetWide(const Send& send) {
    return (send.camera.*Setter)(GetSettingsWide(send.settings, Key));
}

template <auto Setter, bool Value>
CameraResult SetTo(const Send& send) {
    return (send.camera.*Setter)(Value);
}

CameraResult SetByteDepth(const Send& send) {
    return send.camera.SetBitDepth(8);
}

CameraResult SetFullDepth(const Send& send) {
    return send.camera.SetBitDepth(send.camera.GetMaxBitDepth());
}

CameraResult SetRegion(const Send& send) {
    return send.camera.SetROI(send.Get(zprmRoiX), send.Get(zprmRoiY), send.Get(zprmRoiWidth),
                              send.Get(zprmRoiHeight));
}

CameraResult ReadRegionBack(const Send& send) {
    send.Put(zprmRoiX, send.camera.GetROIX());
    send.Put(zprmRoiY, send.camera.GetROIY());
    send.Put(zprmRoiWidth, send.camera.GetROIWidth());
    send.Put(zprmRoiHeight, send.camera.GetROIHeight());
    return CameraOk;
}

CameraResult SetReadoutSpeed(const Send& send) {
    return send.camera.SetReadoutFrequency(
        ConvertSpeedIndexToMegahertz(send.Get(zprmReadoutSpeed)));
}

// Kept: the wheel is only ever made active here; its cycle alone stops it.
CameraResult StartWheel(const Send& send) {
    (void)send.camera.SetRGBFilterActive(true);
    (void)send.camera.SetRGBFilterCycle(true);
    (void)send.context.rgbWheel->SetOutputFormat(send.Get(zprmImageFormat));
    return CameraOk;
}

// ---- Conditions ----

bool Unconditionally(const Send&) {
    return true;
}

template <FormatSet Formats>
bool HasFormatOf(const Send& send) {
    return Holds(Formats, send.Get(zprmImageFormat));
}

template <std::uint32_t Mode>
bool HasCameraMode(const Send& send) {
    return send.Get(zprmCameraMode) == Mode;
}

template <auto Capability>
bool Can(const Send& send) {
    return (send.camera.*Capability)();
}

template <auto Capability>
bool Cannot(const Send& send) {
    return !(send.camera.*Capability)();
}

bool IsMonochrome(const Send& send) {
    return send.camera.GetCCDImageFormat() == CameraMono;
}

bool WantsWheel(const Send& send) {
    return IsMonochrome(send) && HasFormatOf<ThreeColourFormats>(send);
}

bool WantsNoWheel(const Send& send) {
    return IsMonochrome(send) && !HasFormatOf<ThreeColourFormats>(send);
}

// ---- The order of the settings ----

struct SendStep {
    bool (*applies)(const Send& send);
    CameraResult (*apply)(const Send& send);
    bool isChecked;  ///< A failure ends the send.
};

constexpr auto CyclesFilters = Can<&ZCamera::GetRGBFilterCycleMode>;
constexpr auto CyclesNoFilters = Cannot<&ZCamera::GetRGBFilterCycleMode>;

constexpr SendStep SendSteps[] = {
    {HasFormatOf<ByteFormats>, SetByteDepth, false},
    {HasFormatOf<DeepFormats>, SetFullDepth, false},
    {HasCameraMode<zmodeStandard>, SetTo<&ZCamera::SetRTVMode, false>, false},
    {HasCameraMode<zmodeRealTimeVideo>, SetTo<&ZCamera::SetRTVMode, true>, false},
    {Can<&ZCamera::IsVerticalBinningSupported>,
     SetWord<&ZCamera::SetVerticalBinning, zprmVerticalBinning>, true},
    {Cannot<&ZCamera::IsVerticalBinningSupported>,
     SetWord<&ZCamera::SetSymmetricalBinning, zprmBinning>, true},
    {Can<&ZCamera::IsHorizontalBinningSupported>,
     SetWord<&ZCamera::SetHorizontalBinning, zprmHorizontalBinning>, true},
    {Unconditionally, SetRegion, true},
    {Unconditionally, ReadRegionBack, true},
    {Unconditionally, SetReadoutSpeed, true},
    {Unconditionally, SetWord<&ZCamera::SetTriggerMode, zprmTriggerType>, true},
    {Can<&ZCamera::IsCoolerAvailable>, SetFlag<&ZCamera::SetCoolerStatus, zprmCoolerActive>, true},
    {Unconditionally, SetWord<&ZCamera::SetRGBFilterStartColour, zprmColorWheel>, false},
    {WantsWheel, StartWheel, false},
    {WantsNoWheel, SetTo<&ZCamera::SetRGBFilterCycle, false>, false},
    {Unconditionally, SetFlag<&ZCamera::SetDoubleShotMode, zprmDoubleShot>, true},
    {Unconditionally, SetWord<&ZCamera::SetMetronaShutterDelay, zprmMetronaShutterDelay>, true},
    {Unconditionally, SetSigned<&ZCamera::SetNormalizedGaindB, zprmS32NormalizedGaindB>, true},
    {Unconditionally, SetWide<&ZCamera::SetNormalizedIntensifierGain, zprm64NormIntensGain>, true},
    {Unconditionally, SetSigned<&ZCamera::SetAbsoluteOffset, zprmS32AbsoluteOffset>, true},
    {Unconditionally, SetWide<&ZCamera::SetExposure, zprm64Exposure>, true},
    {CyclesFilters, SetWide<&ZCamera::SetRGBFilterRedExposure, zprm64ExposureRed>, true},
    {CyclesFilters, SetWide<&ZCamera::SetRGBFilterBlueExposure, zprm64ExposureBlue>, true},
    {CyclesNoFilters, SetWide<&ZCamera::SetRGBFilterRedExposure, zprm64Exposure>, true},
    {CyclesNoFilters, SetWide<&ZCamera::SetRGBFilterBlueExposure, zprm64Exposure>, true},
    {Unconditionally, SetWord<&ZCamera::SetSyncBMode, zprmSyncb>, true},
    {Unconditionally, SetWord<&ZCamera::SetFanSpeed, zprmFan>, true},
    {Unconditionally, SetFlag<&ZCamera::SetBlackoutMode, zprmBlackoutMode>, true},
    {Unconditionally, SetFlag<&ZCamera::SetHighSensitivityMode, zprmHighSensitivityMode>, true},
    {Unconditionally, SetWord<&ZCamera::SetReadoutPort, zprmReadoutPort>, true},
    {Unconditionally, SetSigned<&ZCamera::SetRegulatedCoolingTemp, zprmS32RegulatedCoolingTemp>,
     true},
    {Unconditionally, SetWord<&ZCamera::SetShutterCloseDelay, zprmCloseDelay>, true},
    {Unconditionally, SetWord<&ZCamera::SetEMGain, zprmEMGain>, true},
    {Unconditionally, SetFlag<&ZCamera::SetDither, zprmDither>, true},
    {Unconditionally, SetFlag<&ZCamera::SetHighGainMode, zprmHighGainMode>, true},
    {Unconditionally, SetWord<&ZCamera::SetVClockPeriod, zprmVClockPeriod>, true},
};

/// Kept: a feature this model lacks counts as success, so one settings block fits all.
ZentaraResult ApplySettings(const Send& send) {
    for (const SendStep& step : SendSteps) {
        if (!step.applies(send)) continue;
        const ZentaraResult result = TranslateCameraResult(step.apply(send));
        if (step.isChecked && result != zerrNone) return result;
    }
    return zerrNone;
}

// ---- What the library keeps for itself ----

void SetBayerAlgorithm(const Send& send) {
    switch (send.Get(zprmPostProcessBayerAlgorithm)) {
        case zbayerAverage:
            (void)send.context.bayerFilter->SetAlgorithm(zbayerAverage);
            break;
        case zbayerFast:
            (void)send.context.bayerFilter->SetAlgorithm(zbayerFast);
            break;
        // Kept: the two bicubic choices are one algorithm, and a block read back holds the latter.
        case zbayerBicubic:
        case zbayerBicubicFaster:
            (void)send.context.bayerFilter->SetAlgorithm(zbayerBicubicFaster);
            break;
        default:
            break;
    }
}

float ConvertThousandthsToScale(std::uint32_t thousandths) {
    return static_cast<float>(thousandths) / 1000.0F;
}

void ApplyPostProcessing(const Send& send) {
    CameraContext& context = send.context;
    context.postProcessing = send.Get(zprmDoPostProcessing) != 0 ? 1 : 0;
    context.whiteBalance->SetScales(ConvertThousandthsToScale(send.Get(zprmPostProcessGainRed)),
                                    ConvertThousandthsToScale(send.Get(zprmPostProcessGainGreen)),
                                    ConvertThousandthsToScale(send.Get(zprmPostProcessGainBlue)));
    (void)context.bayerFilter->SetOutputFormat(send.Get(zprmPostProcessImageFormat));
    SetBayerAlgorithm(send);
}

// ---- The end ----

/// Commits what has changed. A stream that a setter had to stop is started again by the commit.
void CommitSettings(const Send& send, bool wasStreaming, const Zentara_Settings& former) {
    const bool hasStopped = wasStreaming && !send.camera.IsCameraStreaming();
    if (!hasStopped && !DoSettingsDiffer(former, send.settings)) return;
    (void)send.camera.UpdateSettingsOnCamera();  // Kept: the send has succeeded all the same.
}

void ReadBack(const Send& send) {
    (void)ReadRegionBack(send);
    send.Put(zprmBinning, send.camera.GetSymmetricalBinningMode());
    send.Put(zprmVerticalBinning, send.camera.GetVerticalBinningMode());
    send.Put(zprmHorizontalBinning, send.camera.GetHorizontalBinningMode());
    send.Put(zprmReadoutSpeed, ConvertMegahertzToSpeedIndex(send.camera.GetReadoutFrequency()));
}

ZentaraResult SendLocked(const char* function, const Send& send, ZentaraHandle handle) {
    const SemaphoreHold queueing(*send.context.queueLock);
    const SettingsChange change(send.camera);
    // Kept: a send that fails leaves the flag set until one succeeds.
    send.context.sendInProgress = 1;
    const bool wasStreaming = send.camera.IsCameraStreaming();
    (void)Zentara_PreflightSettings(handle, &send.settings);  // what it mended counts
    const ZentaraResult result = ApplySettings(send);
    if (result != zerrNone) return result;
    ApplyPostProcessing(send);
    ApplyRegisterTweak(send.camera, send.Get(zprmRegisterTweak));
    const Zentara_Settings former = GetLastSettings(send.context);
    CommitSettings(send, wasStreaming, former);
    ReadBack(send);
    ZLogSettingsChanged(function, former, send.settings);
    SetLastSettings(send.context, send.settings);
    send.context.sendInProgress = 0;
    return zerrNone;
}

ZentaraResult SendSettings(const char* function, ZentaraHandle handle, Zentara_Settings* settings) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (settings == nullptr || !HasSettingsMagic(*settings)) return zerrBadSettings;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    CameraContext* const context = GetCameraContext(*camera);
    if (context == nullptr) return zerrBadHandle;
    return SendLocked(function, {*camera, *context, *settings}, handle);
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_SendSettingsToCam(ZentaraHandle handle, Zentara_Settings* settings) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::SendSettings(function, handle, settings);
    });
}
