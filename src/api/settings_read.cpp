#include <array>

#include "api/camera_context.h"
#include "api/exported_call.h"
#include "api/handles.h"
#include "api/settings_block.h"
#include "api/settings_units.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "imaging/image_formats.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

struct SettingsSource {
    ZCamera& camera;
    CameraContext& context;
};

template <typename Value>
using SettingsReader = Value (*)(const SettingsSource& source);

template <typename Value>
struct SettingsRow {
    std::uint32_t key;
    SettingsReader<Value> read;
};

template <auto Getter>
std::uint32_t Read(const SettingsSource& source) {
    return static_cast<std::uint32_t>((source.camera.*Getter)());
}

template <auto Getter>
std::uint32_t ReadMicroseconds(const SettingsSource& source) {
    return ConvertNanosecondsToMicroseconds((source.camera.*Getter)());
}

template <auto Getter>
std::uint32_t ReadScale(const SettingsSource& source) {
    return ConvertScaleToThousandths((source.context.whiteBalance.get()->*Getter)());
}

template <auto Getter>
std::int32_t ReadSigned(const SettingsSource& source) {
    return (source.camera.*Getter)();
}

template <auto Getter>
std::uint64_t ReadWide(const SettingsSource& source) {
    return (source.camera.*Getter)();
}

std::uint32_t ReadGain(const SettingsSource& source) {
    return source.camera.ConvertNormGaindBToGain(source.camera.GetNormalizedGaindB());
}

std::uint32_t ReadOffset(const SettingsSource& source) {
    return source.camera.ConvertAbsoluteOffsetToOffset(source.camera.GetAbsoluteOffset());
}

std::uint32_t ReadReadoutSpeed(const SettingsSource& source) {
    return ConvertMegahertzToSpeedIndex(source.camera.GetReadoutFrequency());
}

std::uint32_t ReadPostProcessing(const SettingsSource& source) {
    return source.context.postProcessing;
}

std::uint32_t ReadBayerAlgorithm(const SettingsSource& source) {
    return source.context.bayerFilter->GetAlgorithm();
}

std::uint32_t ReadBayerOutputFormat(const SettingsSource& source) {
    return source.context.bayerFilter->GetOutputFormat();
}

// Kept: words 17, 18, 38, 40, 41, 45 and 46 are not read and keep what the client's memory held.
// Word 12 goes by the image format, below.
constexpr std::array Words{
    SettingsRow<std::uint32_t>{zprmGain, ReadGain},
    SettingsRow<std::uint32_t>{zprmOffset, ReadOffset},
    SettingsRow<std::uint32_t>{zprmExposure, ReadMicroseconds<&ZCamera::GetExposure>},
    SettingsRow<std::uint32_t>{zprmBinning, Read<&ZCamera::GetSymmetricalBinningMode>},
    SettingsRow<std::uint32_t>{zprmHorizontalBinning, Read<&ZCamera::GetHorizontalBinningMode>},
    SettingsRow<std::uint32_t>{zprmVerticalBinning, Read<&ZCamera::GetVerticalBinningMode>},
    SettingsRow<std::uint32_t>{zprmReadoutSpeed, ReadReadoutSpeed},
    SettingsRow<std::uint32_t>{zprmTriggerType, Read<&ZCamera::GetTriggerMode>},
    SettingsRow<std::uint32_t>{zprmColorWheel, Read<&ZCamera::GetRGBFilterStartColour>},
    SettingsRow<std::uint32_t>{zprmCoolerActive, Read<&ZCamera::GetCoolerStatus>},
    SettingsRow<std::uint32_t>{zprmExposureRed,
                               ReadMicroseconds<&ZCamera::GetRGBFilterRedExposure>},
    SettingsRow<std::uint32_t>{zprmExposureBlue,
                               ReadMicroseconds<&ZCamera::GetRGBFilterBlueExposure>},
    SettingsRow<std::uint32_t>{zprmRoiX, Read<&ZCamera::GetROIX>},
    SettingsRow<std::uint32_t>{zprmRoiY, Read<&ZCamera::GetROIY>},
    SettingsRow<std::uint32_t>{zprmRoiWidth, Read<&ZCamera::GetROIWidth>},
    SettingsRow<std::uint32_t>{zprmRoiHeight, Read<&ZCamera::GetROIHeight>},
    SettingsRow<std::uint32_t>{zprmDoubleShot, Read<&ZCamera::GetDoubleShotMode>},
    SettingsRow<std::uint32_t>{zprmSyncb, Read<&ZCamera::GetSyncBMode>},
    SettingsRow<std::uint32_t>{zprmMetronaShutterDelay, Read<&ZCamera::GetMetronaShutterDelay>},
    SettingsRow<std::uint32_t>{zprmIntensifierGain, Read<&ZCamera::GetIntensifierGain>},
    SettingsRow<std::uint32_t>{zprmTriggerDelay, Read<&ZCamera::GetTriggerDelay>},
    SettingsRow<std::uint32_t>{zprmCameraMode, Read<&ZCamera::GetRTVMode>},
    SettingsRow<std::uint32_t>{zprmNormalizedGain, Read<&ZCamera::GetNormalizedGain>},
    SettingsRow<std::uint32_t>{zprmNormIntensGaindB,
                               Read<&ZCamera::GetNormalizedIntensifierGaindB>},
    SettingsRow<std::uint32_t>{zprmDoPostProcessing, ReadPostProcessing},
    SettingsRow<std::uint32_t>{zprmPostProcessGainRed, ReadScale<&ZAutoWhiteBalance::GetRedScale>},
    SettingsRow<std::uint32_t>{zprmPostProcessGainGreen,
                               ReadScale<&ZAutoWhiteBalance::GetGreenScale>},
    SettingsRow<std::uint32_t>{zprmPostProcessGainBlue,
                               ReadScale<&ZAutoWhiteBalance::GetBlueScale>},
    SettingsRow<std::uint32_t>{zprmPostProcessBayerAlgorithm, ReadBayerAlgorithm},
    SettingsRow<std::uint32_t>{zprmPostProcessImageFormat, ReadBayerOutputFormat},
    SettingsRow<std::uint32_t>{zprmFan, Read<&ZCamera::GetFanSpeed>},
    SettingsRow<std::uint32_t>{zprmBlackoutMode, Read<&ZCamera::GetBlackoutMode>},
    SettingsRow<std::uint32_t>{zprmHighSensitivityMode, Read<&ZCamera::GetHighSensitivityMode>},
    SettingsRow<std::uint32_t>{zprmReadoutPort, Read<&ZCamera::GetReadoutPort>},
    SettingsRow<std::uint32_t>{zprmEMGain, Read<&ZCamera::GetEMGain>},
    SettingsRow<std::uint32_t>{zprmCloseDelay, Read<&ZCamera::GetShutterCloseDelay>},
    SettingsRow<std::uint32_t>{zprmDither, Read<&ZCamera::GetDitherMode>},
    SettingsRow<std::uint32_t>{zprmHighGainMode, Read<&ZCamera::GetHighGainMode>},
    SettingsRow<std::uint32_t>{zprmVClockPeriod, Read<&ZCamera::GetVClockPeriod>},
};

constexpr std::array SignedWords{
    SettingsRow<std::int32_t>{zprmS32NormalizedGaindB, ReadSigned<&ZCamera::GetNormalizedGaindB>},
    SettingsRow<std::int32_t>{zprmS32AbsoluteOffset, ReadSigned<&ZCamera::GetAbsoluteOffset>},
    SettingsRow<std::int32_t>{zprmS32RegulatedCoolingTemp,
                              ReadSigned<&ZCamera::GetRegulatedCoolingTemperature>},
};

constexpr std::array WideWords{
    SettingsRow<std::uint64_t>{zprm64Exposure, ReadWide<&ZCamera::GetExposure>},
    SettingsRow<std::uint64_t>{zprm64ExposureRed, ReadWide<&ZCamera::GetRGBFilterRedExposure>},
    SettingsRow<std::uint64_t>{zprm64ExposureBlue, ReadWide<&ZCamera::GetRGBFilterBlueExposure>},
    SettingsRow<std::uint64_t>{zprm64NormIntensGain,
                               ReadWide<&ZCamera::GetNormalizedIntensifierGain>},
};

/// Kept: the camera's own format reads back, never a raw one, and for a camera without a format the
/// word stays as it is.
void ReadImageFormat(const SettingsSource& source, Zentara_Settings& settings) {
    const bool isByteDeep = source.camera.GetBitDepth() == 8;
    switch (source.camera.GetImageFormat()) {
        case CameraMono:
            SetSettingsWord(settings, zprmImageFormat, isByteDeep ? zfmtMono8 : zfmtMono16);
            break;
        case CameraBayer:
            SetSettingsWord(settings, zprmImageFormat, isByteDeep ? zfmtBayer8 : zfmtBayer16);
            break;
        case CameraRGBFilter:
            SetSettingsWord(settings, zprmImageFormat, source.context.rgbWheel->GetOutputFormat());
            break;
        default:
            break;
    }
}

void FillSettings(const SettingsSource& source, ZentaraHandle handle, Zentara_Settings& settings) {
    SetSettingsSize(settings);
    for (const auto& row : Words) SetSettingsWord(settings, row.key, row.read(source));
    for (const auto& row : SignedWords) SetSettingsSigned(settings, row.key, row.read(source));
    for (const auto& row : WideWords) SetSettingsWide(settings, row.key, row.read(source));
    ReadImageFormat(source, settings);
    SetSettingsHandle(settings, handle);
    SetSettingsMagic(settings);
}

ZentaraResult ReadSettings(const char* function, ZentaraHandle handle, Zentara_Settings* settings) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (settings == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    CameraContext* const context = GetCameraContext(*camera);
    if (context == nullptr) return zerrBadHandle;
    FillSettings({*camera, *context}, handle, *settings);
    SetLastSettings(*context, *settings);
    ZLogSettingsBlock(function, *settings);
    return zerrNone;
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_ReadSettingsFromCam(ZentaraHandle handle, Zentara_Settings* settings) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::ReadSettings(function, handle, settings);
    });
}
