#include <mutex>

#include "api/camera_context.h"
#include "api/exported_call.h"
#include "api/measuring_calls.h"
#include "api/settings_block.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

ZentaraResult AutoExpose(const char* function, const MeasuringRequest& request) {
    LogRegion(function, request);
    MeasuringTarget target;
    const ZentaraResult checked = CheckRequest(request, &target);
    if (checked != zerrNone) return checked;

    const std::lock_guard hold(target.context->measuringMutex);
    ZCamera& camera = *target.camera;
    // Kept: a failed iteration goes on with the exposure that it has left.
    (void)target.context->autoExposure->CalculateExposure(request.x, request.y, request.width,
                                                          request.height, &camera);
    Zentara_Settings* const settings = request.settings;
    const ZentaraResult written =
        Zentara_SetParam64(settings, zprm64Exposure, camera.GetExposure());
    if (written != zerrNone) return written;
    // Kept: a camera without a wheel refuses these two.
    (void)Zentara_SetParam64(settings, zprm64ExposureRed, camera.GetRGBFilterRedExposure());
    (void)Zentara_SetParam64(settings, zprm64ExposureBlue, camera.GetRGBFilterBlueExposure());
    (void)Zentara_SendSettingsToCam(GetSettingsHandle(*settings), settings);
    LogExposures(function, camera);
    return zerrNone;
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_AutoExpose(Zentara_Settings* settings, uint32_t x, uint32_t y, uint32_t width,
                                 uint32_t height) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::AutoExpose(function, {settings, x, y, width, height});
    });
}
