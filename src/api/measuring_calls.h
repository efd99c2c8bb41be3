#pragma once

#include <cstdint>

#include "camera/camera.h"
#include "zentara/zentara.h"

namespace ZV {

struct CameraContext;

/// What white balance and auto exposure are asked for, in pixels of the image.
struct MeasuringRequest {
    Zentara_Settings* settings;
    std::uint32_t x;
    std::uint32_t y;
    std::uint32_t width;
    std::uint32_t height;
};

/// The camera of a request that has passed the tests, and its context.
struct MeasuringTarget {
    ZCamera* camera = nullptr;
    CameraContext* context = nullptr;
};

void LogRegion(const char* function, const MeasuringRequest& request);

/// zerrNotLoaded, zerrBadParameter, zerrBadSettings, zerrRoiTooSmall, in this order; `target` is
/// filled on success alone.
[[nodiscard]] ZentaraResult CheckRequest(const MeasuringRequest& request, MeasuringTarget* target);

/// The exposures of red, green and blue that the camera is set to.
void LogExposures(const char* function, ZCamera& camera);

}  // namespace ZV
