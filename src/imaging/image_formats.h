#pragma once

#include <cstdint>

namespace ZV {

/// Pixel layout of a buffer. Samples of 16 bits are words of host order.
enum ZImageFormatEnum : std::uint32_t {
    Raw8 = 0,  ///< Camera words.
    Raw16 = 1,
    Mono8 = 2,
    Mono16 = 3,
    Bayer8 = 4,  ///< Colour mosaic.
    Bayer16 = 5,
    RGBPlane8 = 6,  ///< Three whole planes in the order R, G, B.
    RGBPlane16 = 7,
    BGR24 = 8,    ///< Bytes B, G, R per pixel.
    XRGB32 = 9,   ///< Bytes X, R, G, B per pixel. Filters write 255 to X.
    RGB48 = 10,   ///< 16-bit words R, G, B per pixel.
    BGRX32 = 11,  ///< Bytes B, G, R, X per pixel.
    RGB24 = 12,   ///< Bytes R, G, B per pixel.
    /// Bytes R, G, B, X per pixel. It exists inside the filters only: the exported helpers do not
    /// know it.
    RGBX32 = 13,
};

/// What a camera's sensor delivers.
enum ZCameraImageFormatEnum : std::uint16_t {
    CameraMono = 1,
    CameraBayer = 2,
    CameraRGBFilter = 3,  ///< Monochrome behind a filter wheel: one colour per frame.
};

/// What the first pixel of a frame is: the colour of the whole frame, or the cell of a mosaic. 2
/// and 4 are unused.
enum ZColourPatternEnum : std::uint16_t {
    PatternRed = 0,
    PatternGreen = 1,
    PatternBlue = 3,
    PatternRGGB = 5,  ///< Row 0 R G, row 1 G B.
    PatternGRBG = 6,
    PatternGBRG = 7,
    PatternBGGR = 8,
};

// The tests of the flat interface. Each is false for a format that it does not know.
[[nodiscard]] bool Is16Bit(std::uint32_t format);
[[nodiscard]] bool Is3Colour(std::uint32_t format);  ///< `RGBPlane8` to `RGB24`.
[[nodiscard]] bool IsBayer(std::uint32_t format);
[[nodiscard]] bool IsColour(std::uint32_t format);      ///< Mosaics and `Is3Colour`.
[[nodiscard]] bool IsMonochrome(std::uint32_t format);  ///< Not the raw formats.

/// The filters' own test for three colours, which takes `RGBX32` in: wider than `Is3Colour` on
/// purpose.
[[nodiscard]] bool IsFilterThreeColour(std::uint32_t format);

/// Bytes of an image, the product taken in 64 bits; 0 for a format above `RGB24`.
[[nodiscard]] std::uint64_t CalculateImageSize(std::uint32_t format, std::uint32_t width,
                                               std::uint32_t height);

/// Bytes per pixel of a three-colour format; 0 for every other one.
[[nodiscard]] std::uint32_t GetThreeColourPixelBytes(std::uint32_t format);

/// Text for the log; "Unknown image format" from `RGBX32` upward.
[[nodiscard]] const char* GetImageFormatLabel(std::uint32_t format);

/// Whole bytes that a sample of `bitDepth` bits takes.
[[nodiscard]] std::uint32_t GetBytesPerSample(std::uint32_t bitDepth);

/// A frame record's mosaic, 0 to 3, as `PatternRGGB` to `PatternBGGR`; 0 for anything else.
[[nodiscard]] std::uint32_t ConvertFrameMosaicToColourPattern(std::uint32_t mosaic);

}  // namespace ZV
