#pragma once

#include <array>

#include "imaging/image_formats.h"

namespace ZV {

/// Labels of the formats that a client knows, `Raw8` to `RGB24`, by their numbers.
inline constexpr std::array ImageFormatLabels{
    "Raw 8-Bit",   "Raw 16-Bit",   "Mono 8-Bit",      "Mono 16-Bit",
    "Bayer 8-Bit", "Bayer 16-Bit", "RGB Plane 8-Bit", "RGB Plane 16-Bit",
    "BGR24",       "XRGB32",       "RGB48",           "BGRX32",
    "RGB24",
};
static_assert(ImageFormatLabels.size() == RGBX32);

}  // namespace ZV
