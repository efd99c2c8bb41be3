#pragma once

#include "zentara/zentara.h"

namespace ZV {

/// Whether two blocks ask for different states of the camera. What the library keeps for itself
/// (post-processing, words 27 to 32), the register tweak (word 46) and everything beside the
/// parameters does not count.
[[nodiscard]] bool DoSettingsDiffer(const Zentara_Settings& former,
                                    const Zentara_Settings& present);

}  // namespace ZV
