#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include "image_file.h"

namespace ZentaraProgram {

/// The samples of an image as files want them, in rows from the top without padding: those of one
/// sample a pixel as they are, others as red, green, blue. `scratch` holds what had to be put in
/// order; the result points into it or into the image.
std::span<const std::uint8_t> GetPixelSamples(const Image& image,
                                              std::vector<std::uint8_t>* scratch);

/// The same as whole planes, red, green and blue one behind the other.
std::span<const std::uint8_t> GetPlaneSamples(const Image& image,
                                              std::vector<std::uint8_t>* scratch);

}  // namespace ZentaraProgram
