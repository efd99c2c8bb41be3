#include <cstdint>

#include "camera/morvane_fw_camera.h"
#include "camera/setting_codes.h"

namespace ZV {

namespace {

// Kept: with exposures in microseconds the filter wheel's lose what 32 bits of nanoseconds cannot
// hold, so 5 s becomes 705 ms.
std::uint32_t ConvertFilterExposure(std::uint64_t nanoseconds) {
    return ConvertToMicroseconds(static_cast<std::uint32_t>(nanoseconds));
}

}  // namespace

CameraResult MorvaneFWCamera::WriteExposure(std::uint32_t quadlet, std::uint32_t lowQuadlet,
                                            std::uint64_t nanoseconds, std::uint32_t microseconds) {
    if (registers.control.major == 1) return WriteControl(quadlet, microseconds);
    const CameraResult result =
        WriteControl(quadlet, static_cast<std::uint32_t>(nanoseconds >> 32));
    if (result != CameraOk) return result;
    return WriteControl(lowQuadlet, static_cast<std::uint32_t>(nanoseconds));
}

CameraResult MorvaneFWCamera::SetExposure(std::uint64_t nanoseconds) {
    if (nanoseconds == GetExposure()) return CameraOk;
    return WriteExposure(ControlExposure, ControlExposureLow, nanoseconds,
                         ConvertToMicroseconds(nanoseconds));
}

CameraResult MorvaneFWCamera::SetRGBFilterRedExposure(std::uint64_t nanoseconds) {
    if (nanoseconds == GetRGBFilterRedExposure()) return CameraOk;
    return WriteExposure(ControlRedExposure, ControlRedExposureLow, nanoseconds,
                         ConvertFilterExposure(nanoseconds));
}

CameraResult MorvaneFWCamera::SetRGBFilterBlueExposure(std::uint64_t nanoseconds) {
    if (nanoseconds == GetRGBFilterBlueExposure()) return CameraOk;
    return WriteExposure(ControlBlueExposure, ControlBlueExposureLow, nanoseconds,
                         ConvertFilterExposure(nanoseconds));
}

}  // namespace ZV
