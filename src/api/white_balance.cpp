#include <mutex>

#include "api/camera_context.h"
#include "api/exported_call.h"
#include "api/measuring_calls.h"
#include "api/result_codes.h"
#include "api/settings_block.h"
#include "api/settings_units.h"
#include "diagnostics/log.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

struct Gain {
    std::uint32_t key;
    float (ZAutoWhiteBalance::*get)() const;
};

constexpr Gain Gains[] = {
    {zprmPostProcessGainRed, &ZAutoWhiteBalance::GetRedScale},
    {zprmPostProcessGainGreen, &ZAutoWhiteBalance::GetGreenScale},
    {zprmPostProcessGainBlue, &ZAutoWhiteBalance::GetBlueScale},
};

struct Exposure {
    std::uint32_t key;
    std::uint64_t (ZCamera::*get)();
};

constexpr Exposure Exposures[] = {
    {zprm64ExposureRed, &ZCamera::GetRGBFilterRedExposure},
    {zprm64Exposure, &ZCamera::GetExposure},
    {zprm64ExposureBlue, &ZCamera::GetRGBFilterBlueExposure},
};

void LogRequest(const char* function, const MeasuringRequest& request) {
    LogRegion(function, request);
    // The records come before the tests, so the block may be missing.
    const std::uint32_t format =
        request.settings != nullptr ? GetSettingsWord(*request.settings, zprmPostProcessImageFormat)
                                    : 0;
    ZLogMessage(function, "Output image format:%d", format);
}

ZentaraResult WriteGains(Zentara_Settings* settings, const ZAutoWhiteBalance& balance) {
    for (const Gain& gain : Gains) {
        const std::uint32_t thousandths = ConvertScaleToThousandths((balance.*gain.get)());
        const ZentaraResult written = Zentara_SetParam(settings, gain.key, thousandths);
        if (written != zerrNone) return written;
    }
    return zerrNone;
}

void LogGains(const char* function, const ZAutoWhiteBalance& balance) {
    ZLogMessage(function, "New red gain: %d", ConvertScaleToThousandths(balance.GetRedScale()));
    ZLogMessage(function, "New green gain: %d", ConvertScaleToThousandths(balance.GetGreenScale()));
    ZLogMessage(function, "New blue gain: %d", ConvertScaleToThousandths(balance.GetBlueScale()));
}

ZentaraResult WriteExposures(Zentara_Settings* settings, ZCamera& camera) {
    for (const Exposure& exposure : Exposures) {
        const ZentaraResult written =
            Zentara_SetParam64(settings, exposure.key, (camera.*exposure.get)());
        if (written != zerrNone) return written;
    }
    return zerrNone;
}

bool HasWheel(ZentaraHandle handle) {
    std::uint32_t answer = 0;
    return Zentara_GetInfo(handle, zinfColorWheelSupported, &answer) == zerrNone && answer != 0;
}

ZentaraResult WhiteBalance(const char* function, const MeasuringRequest& request) {
    LogRequest(function, request);
    MeasuringTarget target;
    const ZentaraResult checked = CheckRequest(request, &target);
    if (checked != zerrNone) return checked;
    Zentara_Settings* const settings = request.settings;
    if (Zentara_isColor(GetSettingsWord(*settings, zprmPostProcessImageFormat)) == 0) {
        ZLogMessage(function,
                    "Post processing image format is not colour so returning success without white "
                    "balancing");
        return zerrNone;
    }

    const std::lock_guard hold(target.context->measuringMutex);
    ZAutoWhiteBalance& balance = *target.context->whiteBalance;
    const ZentaraResult measured = TranslateCameraResult(
        balance.Preprocess(request.x, request.y, request.width, request.height, target.camera));
    if (measured != zerrNone) return measured;
    const ZentaraResult gained = WriteGains(settings, balance);
    if (gained != zerrNone) return gained;
    LogGains(function, balance);

    const ZentaraHandle handle = GetSettingsHandle(*settings);
    if (HasWheel(handle)) {
        const ZentaraResult exposed = WriteExposures(settings, *target.camera);
        if (exposed != zerrNone) return exposed;
        LogExposures(function, *target.camera);
    }
    (void)Zentara_SendSettingsToCam(handle, settings);  // Kept: its result is not looked at.
    return zerrNone;
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_WhiteBalance(Zentara_Settings* settings, uint32_t x, uint32_t y,
                                   uint32_t width, uint32_t height) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::WhiteBalance(function, {settings, x, y, width, height});
    });
}
