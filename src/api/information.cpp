#include <array>
#include <cstdio>
#include <cstring>

#include "api/camera_context.h"
#include "api/exported_call.h"
#include "api/handles.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "imaging/ex_image.h"
#include "imaging/image_formats.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

struct InfoSource {
    ZCamera& camera;
    CameraContext* context;  // null after a close that failed
};

using InfoAnswer = ZentaraResult (*)(const InfoSource& source, std::uint32_t* value);

template <std::uint32_t Value>
ZentaraResult AnswerConstant(const InfoSource&, std::uint32_t* value) {
    *value = Value;
    return zerrNone;
}

template <auto Getter>
ZentaraResult Answer(const InfoSource& source, std::uint32_t* value) {
    *value = static_cast<std::uint32_t>((source.camera.*Getter)());
    return zerrNone;
}

template <auto Getter>
ZentaraResult AnswerOfIntensifier(const InfoSource& source, std::uint32_t* value) {
    if (!source.camera.IsIntensifierAvailable()) return zerrNotSupported;
    return Answer<Getter>(source, value);
}

// Kept: the value is written on a camera without a trigger delay too.
ZentaraResult AnswerTriggerDelayResolution(const InfoSource& source, std::uint32_t* value) {
    *value = source.camera.GetTriggerDelayResolution();
    return source.camera.IsTriggerDelayAvialable() ? ZentaraResult{zerrNone}
                                                   : ZentaraResult{zerrNotSupported};
}

ZentaraResult AnswerImageSize(const InfoSource& source, std::uint32_t* value) {
    std::uint32_t pixelBytes = GetBytesPerSample(source.camera.GetBitDepth());
    if (source.camera.GetRGBFilterCycleMode()) {
        if (source.context == nullptr) return zerrBadHandle;
        pixelBytes = ZExImage::ImageFormatByteSize(source.context->rgbWheel->GetOutputFormat());
    }
    *value = pixelBytes * source.camera.GetImageWidth() * source.camera.GetImageHeight();
    return zerrNone;
}

// Kept: for a camera that is neither, the value stays untouched and the result is success.
ZentaraResult AnswerCcdType(const InfoSource& source, std::uint32_t* value) {
    const std::uint32_t format = source.camera.GetImageFormat();
    if (format == CameraMono || format == CameraRGBFilter) *value = 0;
    if (format == CameraBayer) *value = 1;
    return zerrNone;
}

ZentaraResult AnswerPostProcessImageSize(const InfoSource& source, std::uint32_t* value) {
    if (source.context == nullptr) return zerrBadHandle;
    *value = static_cast<std::uint32_t>(
        Zentara_CalcImageSize(source.context->bayerFilter->GetOutputFormat(),
                              source.camera.GetROIWidth(), source.camera.GetROIHeight()));
    return zerrNone;
}

ZentaraResult AnswerAsymmetricalBinning(const InfoSource& source, std::uint32_t* value) {
    *value =
        source.camera.IsVerticalBinningSupported() && source.camera.IsHorizontalBinningSupported()
            ? 1
            : 0;
    return zerrNone;
}

struct InfoRow {
    std::uint32_t key;
    InfoAnswer answer;  ///< Null: not implemented.
};

constexpr std::array InfoRows{
    InfoRow{zinfCameraType, Answer<&ZCamera::GetModel>},
    InfoRow{zinfSerialNumber, AnswerConstant<0>},
    InfoRow{zinfHardwareVersion, Answer<&ZCamera::GetHardwareVersion>},
    InfoRow{zinfFirmwareVersion, Answer<&ZCamera::GetFirmwareVersion>},
    InfoRow{zinfCcd, Answer<&ZCamera::GetCCDModel>},
    InfoRow{zinfBitDepth, Answer<&ZCamera::GetMaxBitDepth>},
    InfoRow{zinfCooled, Answer<&ZCamera::IsCoolerAvailable>},
    InfoRow{zinfReserved7, AnswerConstant<0>},
    InfoRow{zinfImageWidth, Answer<&ZCamera::GetROIWidth>},
    InfoRow{zinfImageHeight, Answer<&ZCamera::GetROIHeight>},
    InfoRow{zinfImageSize, AnswerImageSize},
    InfoRow{zinfCcdType, AnswerCcdType},
    InfoRow{zinfCcdWidth, Answer<&ZCamera::GetCCDWidth>},
    InfoRow{zinfCcdHeight, Answer<&ZCamera::GetCCDHeight>},
    InfoRow{zinfFirmwareBuild, Answer<&ZCamera::GetFirmwareBuildNumber>},
    InfoRow{zinfUniqueId, Answer<&ZCamera::GetUniqueID>},
    InfoRow{zinfIsModelB, AnswerConstant<1>},
    InfoRow{zinfIntensifierModel, AnswerOfIntensifier<&ZCamera::GetIntensifierModel>},
    InfoRow{zinfExposureRes, Answer<&ZCamera::GetExposureResolution>},
    InfoRow{zinfTriggerDelayRes, AnswerTriggerDelayResolution},
    InfoRow{zinfStreamVersion, Answer<&ZCamera::GetStreamingVersion>},
    InfoRow{zinfNormGainSigFigs, Answer<&ZCamera::GetNormalizedGainSignificantFigures>},
    InfoRow{zinfNormGaindBRes, Answer<&ZCamera::GetNormalizedGaindBResolution>},
    InfoRow{zinfNormITGainSigFigs,
            AnswerOfIntensifier<&ZCamera::GetNormalizedIntensifierGainSignificantFigures>},
    InfoRow{zinfNormITGaindBRes,
            AnswerOfIntensifier<&ZCamera::GetNormalizedIntensifierGaindBResolution>},
    InfoRow{zinfRegulatedCooling, Answer<&ZCamera::IsRegulatedCoolingAvailable>},
    InfoRow{zinfRegulatedCoolingLock, Answer<&ZCamera::GetRegulatedCoolingTemperatureLock>},
    InfoRow{zinfReserved27, nullptr},
    InfoRow{zinfReserved28, nullptr},
    InfoRow{zinfFanControl, Answer<&ZCamera::IsFanControlAvailable>},
    InfoRow{zinfHighSensitivityMode, Answer<&ZCamera::IsHighSensitivityModeAvailable>},
    InfoRow{zinfBlackoutMode, Answer<&ZCamera::IsBlackoutModeAvailable>},
    InfoRow{zinfPostProcessImageSize, AnswerPostProcessImageSize},
    InfoRow{zinfAsymmetricalBinning, AnswerAsymmetricalBinning},
    InfoRow{zinfEMGain, Answer<&ZCamera::IsEMGainAvailable>},
    InfoRow{zinfReserved35, nullptr},
    InfoRow{zinfCloseDelay, Answer<&ZCamera::IsShutterCloseDelayAvailable>},
    InfoRow{zinfColorWheelSupported, Answer<&ZCamera::IsRGBFilterSupported>},
    InfoRow{zinfReserved2, Answer<&ZCamera::IsDitherControlAvailable>},
    InfoRow{zinfReserved3, Answer<&ZCamera::IsHighGainModeAvailable>},
    InfoRow{zinfReserved4, Answer<&ZCamera::IsVClockControlAvailable>},
};

constexpr bool AreRowsInOrder() {
    for (std::uint32_t index = 0; index < InfoRows.size(); ++index) {
        if (InfoRows[index].key != index) return false;
    }
    return true;
}
static_assert(AreRowsInOrder());

InfoAnswer FindAnswer(std::uint32_t key) {
    return key < InfoRows.size() ? InfoRows[key].answer : nullptr;
}

ZentaraResult GetInfo(const char* function, ZentaraHandle handle, std::uint32_t key,
                      std::uint32_t* value) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (value == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    const InfoAnswer answer = FindAnswer(key);
    if (answer == nullptr) {
        std::printf("Zentara_GetInfo not implemented for key %d\n", static_cast<std::int32_t>(key));
        *value = 0;
        return zerrNotSupported;
    }
    const ZentaraResult result = answer({*camera, GetCameraContext(*camera)}, value);
    if (result == zerrNone) ZentaraDebugOutputGetInfo(key, *value);
    return result;
}

ZentaraResult CopyText(const char* source, char* text, std::uint32_t length) {
    const std::size_t bytes = std::strlen(source) + 1;
    if (length < bytes) return zerrBadParameter;
    std::memcpy(text, source, bytes);
    return zerrNone;
}

ZentaraResult GetSerialString(const char* function, ZentaraHandle handle, char* text,
                              std::uint32_t length) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (text == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    if (!IsOpen(camera)) return zerrBadHandle;
    const ZentaraResult result = CopyText(camera->GetSerialNumberString(), text, length);
    if (result == zerrNone) ZLogMessage(function, "Serial: %s", text);
    return result;
}

ZentaraResult GetCameraModelString(const char* function, ZentaraHandle handle, char* text,
                                   std::uint32_t length) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (text == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    const ZentaraResult result = CopyText(camera->GetModelName(), text, length);
    if (result == zerrNone) ZLogMessage(function, "Camera model: %s", text);
    return result;
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_GetInfo(ZentaraHandle handle, uint32_t key, uint32_t* value) {
    constexpr const char* Function = "Zentara_GetInfo";
    ZV::ZLogEnterInfo(Function, key);
    const ZentaraResult result =
        ZV::Guarded([&] { return ZV::GetInfo(Function, handle, key, value); });
    ZV::ZLogLeave(Function, static_cast<std::uint16_t>(result));
    return result;
}

ZentaraResult Zentara_GetSerialString(ZentaraHandle handle, char* text, uint32_t length) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::GetSerialString(function, handle, text, length);
    });
}

ZentaraResult Zentara_GetCameraModelString(ZentaraHandle handle, char* text, uint32_t length) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::GetCameraModelString(function, handle, text, length);
    });
}
