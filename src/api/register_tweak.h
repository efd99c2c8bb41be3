#pragma once

#include <cstdint>

#include "camera/camera.h"

namespace ZV {

/// Adjusts an analogue register of the camera: the top four bits of `tweak` select it, the low 16
/// give the value. Unknown selectors, 0 among them, and cameras without the registers do nothing;
/// results are dropped.
void ApplyRegisterTweak(ZCamera& camera, std::uint32_t tweak);

}  // namespace ZV
