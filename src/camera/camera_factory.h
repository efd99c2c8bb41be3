#pragma once

#include <cstdint>

#include "hal/hal.h"

namespace ZV {

class MorvaneFWCamera;

/// Makes the camera class of `model` over `record`, which is copied; `Unknown` for an id without a
/// class of its own. The caller owns the object. Null when there is no memory.
MorvaneFWCamera* MakeCamera(std::uint32_t model, const HALCamera& record);

}  // namespace ZV
