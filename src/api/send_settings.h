#pragma once

#include "zentara/zentara.h"

namespace ZV {

/// Applies a settings block to a camera, for everything that is to do so: a settings change with an
/// empty queue, one that follows a finished exposure, and one that follows a delivered frame.
///
/// This is the place where the sending of settings will stand. Until then it returns
/// zerrNotSupported and touches neither camera nor block.
[[nodiscard]] ZentaraResult SendSettings(ZentaraHandle handle, Zentara_Settings* settings);

}  // namespace ZV
