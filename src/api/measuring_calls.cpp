#include "api/measuring_calls.h"

#include "api/camera_context.h"
#include "api/parameter_checks.h"
#include "api/settings_block.h"
#include "diagnostics/log.h"

namespace ZV {

namespace {

constexpr std::uint32_t RegionSideMin = 16;

// Kept: a region that is too small in one direction alone passes.
bool IsTooSmall(std::uint32_t width, std::uint32_t height) {
    return width == 0 || height == 0 || (width < RegionSideMin && height < RegionSideMin);
}

}  // namespace

void LogRegion(const char* function, const MeasuringRequest& request) {
    ZLogMessage(function, "X:%d Y:%d Width:%d Height:%d", request.x, request.y, request.width,
                request.height);
}

ZentaraResult CheckRequest(const MeasuringRequest& request, MeasuringTarget* target) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (request.settings == nullptr) return zerrBadParameter;
    if (!HasSettingsMagic(*request.settings)) return zerrBadSettings;
    ZCamera* const camera = FindBlockCamera(*request.settings);
    CameraContext* const context = camera != nullptr ? GetCameraContext(*camera) : nullptr;
    if (context == nullptr) return zerrBadSettings;
    if (IsTooSmall(request.width, request.height)) return zerrRoiTooSmall;
    *target = {camera, context};
    return zerrNone;
}

void LogExposures(const char* function, ZCamera& camera) {
    ZLogMessage(function, "New red exposure: %l ns", camera.GetRGBFilterRedExposure());
    ZLogMessage(function, "New green exposure: %l ns", camera.GetExposure());
    ZLogMessage(function, "New blue exposure: %l ns", camera.GetRGBFilterBlueExposure());
}

}  // namespace ZV
