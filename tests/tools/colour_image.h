#pragma once

#include <png.h>

#include <array>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "tools/image_file.h"
#include "zentara/zentara.h"

namespace ZentaraTest {

/// Samples of an image as red, green, blue of each pixel; of a grey one as they are.
struct ReadSamples {
    std::uint32_t width = 0, height = 0, channels = 0, bits = 0;
    std::vector<std::uint16_t> values;

    [[nodiscard]] std::uint16_t At(std::uint32_t x, std::uint32_t y, std::uint32_t channel) const {
        return values[(std::size_t{y} * width + x) * channels + channel];
    }
};

/// Reads a PNG as it stands in the file, without a view to its gamma.
inline ReadSamples ReadPng(const std::string& path) {
    ReadSamples samples;
    std::FILE* file = std::fopen(path.c_str(), "rb");
    if (file == nullptr) return samples;
    png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    png_init_io(png, file);
    png_read_png(png, info, PNG_TRANSFORM_SWAP_ENDIAN, nullptr);
    samples.width = png_get_image_width(png, info);
    samples.height = png_get_image_height(png, info);
    samples.channels = png_get_channels(png, info);
    samples.bits = png_get_bit_depth(png, info);
    const png_bytepp rows = png_get_rows(png, info);
    const std::size_t rowSamples = std::size_t{samples.width} * samples.channels;
    for (std::uint32_t y = 0; y < samples.height; ++y) {
        for (std::size_t i = 0; i < rowSamples; ++i) {
            std::uint16_t value = rows[y][i];
            if (samples.bits == 16) std::memcpy(&value, rows[y] + 2 * i, 2);
            samples.values.push_back(value);
        }
    }
    png_destroy_read_struct(&png, &info, nullptr);
    std::fclose(file);
    return samples;
}

/// Where the samples of a pixel lie in a format, told anew: planes by their number of pixels.
struct ColourCase {
    std::uint32_t format;
    const char* name;
    std::uint32_t bytes, samplesPerPixel;
    std::array<int, 3> at;
    bool isPlanar;
};
inline constexpr std::array ColourCases{
    ColourCase{zfmtRGBPlane8, "RGBPlane8", 1, 3, {0, 1, 2}, true},
    ColourCase{zfmtRGBPlane16, "RGBPlane16", 2, 3, {0, 1, 2}, true},
    ColourCase{zfmtBGR24, "BGR24", 1, 3, {2, 1, 0}, false},
    ColourCase{zfmtXRGB32, "XRGB32", 1, 4, {1, 2, 3}, false},
    ColourCase{zfmtRGB48, "RGB48", 2, 3, {0, 1, 2}, false},
    ColourCase{zfmtBGRX32, "BGRX32", 1, 4, {2, 1, 0}, false},
    ColourCase{zfmtRGB24, "RGB24", 1, 3, {0, 1, 2}, false},
};

/// The sample of a small image: different for each place and colour.
inline std::uint16_t GetTestSample(std::uint32_t bytes, std::size_t pixel, std::size_t colour) {
    const std::size_t value = 7 * pixel + 70 * colour + 1;
    return static_cast<std::uint16_t>(bytes == 2 ? value * 201 : value);
}

/// An image of 5 x 3 pixels in the format of a case; the fourth samples are 255.
inline ZentaraProgram::Image MakeColourImage(const ColourCase& row) {
    ZentaraProgram::Image image;
    image.layout = ZentaraProgram::FindPixelFormat(row.format);
    image.width = 5;
    image.height = 3;
    image.bytesPerSample = row.bytes;
    image.bits = 8 * row.bytes;
    image.dateObs = "2026-01-01T00:00:00.000";
    const std::size_t pixels = std::size_t{image.width} * image.height;
    image.pixels.assign(pixels * row.samplesPerPixel * row.bytes, 255);
    for (std::size_t pixel = 0; pixel < pixels; ++pixel) {
        for (std::size_t colour = 0; colour < 3; ++colour) {
            const auto place = static_cast<std::size_t>(row.at[colour]);
            const std::size_t at =
                row.isPlanar ? place * pixels + pixel : pixel * row.samplesPerPixel + place;
            const std::uint16_t value = GetTestSample(row.bytes, pixel, colour);
            const auto low = static_cast<std::uint8_t>(value);
            if (row.bytes == 1) image.pixels[at] = low;
            if (row.bytes == 2) std::memcpy(image.pixels.data() + 2 * at, &value, 2);
        }
    }
    return image;
}

}  // namespace ZentaraTest
