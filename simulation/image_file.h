#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace ZV::Simulation {

/// An image in linear light, 0 to 1, rows from the top.
struct ImageFile {
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    std::uint32_t channels = 0;  ///< 1, or 3 for red, green and blue of each pixel side by side.
    std::vector<float> levels;
};

/// Reads a PNG (8-bit samples are taken as sRGB, 16-bit ones as linear, unless the file tells its
/// gamma), a TIFF (linear; layouts other than strips of 8 or 16 bits come in 8 bits) or a FITS
/// image (the first one of the file, in the file's row order; its greatest value is 1, what is
/// negative or undefined is 0; three planes are red, green and blue). The kind is told by the
/// file's first bytes. False with `message`, which names the path; images above 2 to the power 25
/// pixels, or of more than the file can hold, are refused before there is room for them.
bool ReadImageFile(const std::string& path, ImageFile* image, std::string* message);

}  // namespace ZV::Simulation
