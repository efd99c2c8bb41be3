#pragma once

#include <array>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "pixel_formats.h"

namespace ZentaraProgram {

inline constexpr std::size_t ColourCount = 3;

/// Words of a frame record that post-processing reads, and that no other part of an image tells.
struct FrameWords {
    std::uint32_t binning = 1;   ///< Binning mode of the camera, by its code.
    std::uint32_t realTime = 0;  ///< 1 for a frame of the real-time mode.
    std::uint32_t pattern = 0;   ///< Colour pattern, or colour of the wheel, as the camera has it.
};

/// An image with all that is known about it, as the writers take it.
struct Image {
    /// As the library delivered them: rows from the top, without padding, in the order of `layout`.
    std::vector<std::uint8_t> pixels;
    const PixelFormat* layout = FindPixelFormat(std::uint32_t{0});  ///< Never null.
    std::uint32_t width = 0, height = 0;
    std::uint32_t bytesPerSample = 1;  ///< 1, or 2 in host order.
    std::uint32_t bits = 8;
    bool isDrawing = false;  ///< Made for the eye: its samples are not proportional to light.
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
    std::array<double, ColourCount> scales{1, 1, 1};  ///< Red, green, blue of post-processing.
    std::uint32_t frameNumber = 0, frameError = 0;
    FrameWords words;

    /// Planes of a file: 1, or 3 of an image of three colours.
    [[nodiscard]] std::uint32_t GetChannels() const { return layout->IsThreeColour() ? 3 : 1; }
};

/// Kinds of file, by the ending of the name: .fits .fit .fts, .tiff .tif, .png, .raw.
enum class ImageKind { Fits, Tiff, Png, Raw, Unknown };
ImageKind GetImageKind(const std::string& path);

/// Writes the image: FITS with three planes, TIFF and PNG with pixels of red, green and blue where
/// it has three colours, .raw as it was delivered. On failure returns the reason and leaves no
/// file; an older file of that name then stays as it was. Empty on success.
std::string WriteImage(const std::string& path, const Image& image);

}  // namespace ZentaraProgram
