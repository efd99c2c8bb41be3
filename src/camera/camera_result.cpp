#include "camera/camera_result.h"

#include <cstdio>

#include "hal/hal.h"

namespace ZV {

CameraResult TranslateHalStatus(std::uint32_t status) {
    if (status == HALBandwidthNotAllocated) return CameraBandwidthFault;
    if (status == HALUnknownFault) return CameraUnknownFault;
    return CameraHalFault;
}

CameraResult ReportHalStatus(std::uint32_t status) {
    std::fputs(HAL_ErrorMessage(status), stdout);
    return TranslateHalStatus(status);
}

}  // namespace ZV
