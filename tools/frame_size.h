#pragma once

#include <cstdint>

#include "driver.h"
#include "settings_block.h"

namespace ZentaraProgram {

struct Size {
    std::uint32_t width = 0, height = 0;

    bool operator==(const Size&) const = default;
};

/// Of the frames that an open camera sends.
Size GetFrameSize(const Camera& camera);

/// Of the images that become of these frames. The Folary's lose columns to post-processing where
/// rows are binned, and in real-time video gain rows as well.
Size GetFinishedSize(const Camera& camera, const SettingsBlock& settings);

}  // namespace ZentaraProgram
