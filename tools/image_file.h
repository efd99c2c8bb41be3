#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace ZentaraProgram {

/// An image with all that is known about it, as the writers take it.
struct Image {
    std::vector<std::uint8_t> pixels;  ///< Rows from the top, without padding.
    std::uint32_t width = 0, height = 0;
    std::uint32_t bytesPerSample = 1;  ///< 1, or 2 in host order. One sample a pixel.
    std::uint32_t bits = 8;
    bool isBayer = false;
    std::uint32_t bayerPattern = 0;  ///< 0 RGGB, 1 GRBG, 2 GBRG, 3 BGGR.

    std::string model, serialNumber, software;
    std::string dateObs;  ///< Begin of the exposure, UTC, ISO 8601 without zone.
    double exposureSeconds = 0;
    std::uint32_t binningX = 1, binningY = 1, originX = 0, originY = 0;
    double pixelSizeMicrometres = 0;  ///< Unbinned; 0 when it is not known.
    std::uint32_t gain = 0, offset = 0;
    double gainDecibels = 0;
    std::string format;       ///< "Mono 16-Bit"
    std::string readoutMode;  ///< "20 MHz"
    std::optional<std::int64_t> coolingTargetCelsius;
    bool isPostProcessed = false;
    std::uint32_t frameNumber = 0, frameError = 0;
};

/// Kinds of file, by the ending of the name: .fits .fit .fts, .tiff .tif, .png, .raw.
enum class ImageKind { Fits, Tiff, Png, Raw, Unknown };
ImageKind GetImageKind(const std::string& path);

/// Writes the image. On failure returns the reason and leaves no file; an older file of that name
/// then stays as it was. Empty on success.
std::string WriteImage(const std::string& path, const Image& image);

}  // namespace ZentaraProgram
