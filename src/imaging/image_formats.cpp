#include "imaging/image_formats.h"

#include <array>

#include "imaging/image_format_labels.h"

namespace ZV {
namespace {

struct FormatRow {
    ZImageFormatEnum format;
    std::uint8_t imagePixelBytes;   // As the size of an image counts.
    std::uint8_t filterPixelBytes;  // As a filter asks for its output; three-colour formats only.
    bool is16Bit;
};

// Kept: the last row has a size for the filters, but none for a client.
constexpr std::array FormatRows{
    FormatRow{Raw8, 1, 0, false},      FormatRow{Raw16, 2, 0, true},
    FormatRow{Mono8, 1, 0, false},     FormatRow{Mono16, 2, 0, true},
    FormatRow{Bayer8, 1, 0, false},    FormatRow{Bayer16, 2, 0, true},
    FormatRow{RGBPlane8, 3, 3, false}, FormatRow{RGBPlane16, 6, 6, true},
    FormatRow{BGR24, 3, 3, false},     FormatRow{XRGB32, 4, 4, false},
    FormatRow{RGB48, 6, 6, true},      FormatRow{BGRX32, 4, 4, false},
    FormatRow{RGB24, 3, 3, false},     FormatRow{RGBX32, 0, 4, false},
};

constexpr FormatRow UnknownRow{RGBX32, 0, 0, false};

constexpr char UnknownLabel[] = "Unknown image format";

constexpr const FormatRow& FindRow(std::uint32_t format) {
    return format < FormatRows.size() ? FormatRows[format] : UnknownRow;
}

constexpr bool AreRowsInOrder() {
    for (std::uint32_t index = 0; index < FormatRows.size(); ++index) {
        if (FormatRows[index].format != index) return false;
    }
    return true;
}
static_assert(AreRowsInOrder());

}  // namespace

bool Is16Bit(std::uint32_t format) {
    return FindRow(format).is16Bit;
}

bool Is3Colour(std::uint32_t format) {
    return format >= RGBPlane8 && format <= RGB24;
}

bool IsBayer(std::uint32_t format) {
    return format == Bayer8 || format == Bayer16;
}

bool IsColour(std::uint32_t format) {
    return IsBayer(format) || Is3Colour(format);
}

bool IsMonochrome(std::uint32_t format) {
    return format == Mono8 || format == Mono16;
}

bool IsFilterThreeColour(std::uint32_t format) {
    return format >= RGBPlane8 && format <= RGBX32;
}

std::uint64_t CalculateImageSize(std::uint32_t format, std::uint32_t width, std::uint32_t height) {
    return std::uint64_t{width} * height * FindRow(format).imagePixelBytes;
}

std::uint32_t GetThreeColourPixelBytes(std::uint32_t format) {
    return FindRow(format).filterPixelBytes;
}

const char* GetImageFormatLabel(std::uint32_t format) {
    return format < ImageFormatLabels.size() ? ImageFormatLabels[format] : UnknownLabel;
}

std::uint32_t GetBytesPerSample(std::uint32_t bitDepth) {
    return bitDepth / 8 + (bitDepth % 8 != 0 ? 1 : 0);
}

std::uint32_t ConvertFrameMosaicToColourPattern(std::uint32_t mosaic) {
    return mosaic <= 3 ? mosaic + PatternRGGB : 0;
}

}  // namespace ZV
