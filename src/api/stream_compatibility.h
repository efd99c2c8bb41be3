#pragma once

#include "camera/camera.h"
#include "zentara/zentara.h"

namespace ZV {

/// Whether a settings change can wait in the queue of a running stream: false when it would alter
/// the pixel depth, the kind of image, the readout speed or the region of interest. Binning is not
/// compared.
[[nodiscard]] bool IsStreamCompatible(ZCamera& camera, const Zentara_Settings& settings);

}  // namespace ZV
