#include <png.h>

#include <bit>
#include <csetjmp>
#include <cstdio>
#include <string>

#include "image_readers.h"
#include "platform.h"

namespace ZentaraProgram {
namespace {

void FailQuietly(png_structp png, png_const_charp) {
    png_longjmp(png, 1);
}
void IgnoreWarning(png_structp, png_const_charp) {}

struct PngFile {
    const std::string& path;
    std::FILE* stream;
};

/// What a PNG is read as: samples of whole bytes, grey or of three colours.
void SetTransformations(png_structp png) {
    png_set_expand(png);
    png_set_strip_alpha(png);
    if (std::endian::native == std::endian::little) png_set_swap(png);
}

/// libpng leaves by longjmp: no object with a destructor lives in this frame.
bool ReadHeader(png_structp png, png_infop info, std::FILE* file, bool* isInterlaced) {
    constexpr png_uint_32 GreatestSide = 65535;
    if (setjmp(png_jmpbuf(png)) != 0) return false;
    png_set_user_limits(png, GreatestSide, GreatestSide);
    png_init_io(png, file);
    png_read_info(png, info);
    *isInterlaced = png_get_interlace_type(png, info) != PNG_INTERLACE_NONE;
    SetTransformations(png);
    png_read_update_info(png, info);
    return true;
}

bool ReadRows(png_structp png, std::uint8_t* pixels, std::size_t rowBytes, std::uint32_t rows) {
    if (setjmp(png_jmpbuf(png)) != 0) return false;
    for (std::uint32_t row = 0; row < rows; ++row)
        png_read_row(png, pixels + rowBytes * row, nullptr);
    return true;
}

std::string ReadOpened(png_structp png, png_infop info, const PngFile& file, Image* image) {
    constexpr std::uint64_t PixelsPerByte = 8;  // at most, of a palette of two
    bool isInterlaced = false;
    if (!ReadHeader(png, info, file.stream, &isInterlaced)) return "it is no PNG file, or damaged";
    if (isInterlaced) return "it is interlaced";
    const std::uint32_t channels = png_get_channels(png, info);
    const std::uint32_t bytes = png_get_bit_depth(png, info) == 16 ? 2 : 1;
    const std::uint32_t width = png_get_image_width(png, info);
    const std::uint32_t height = png_get_image_height(png, info);
    if (!CanHold(file.path, std::uint64_t{width} * height / PixelsPerByte, DeflateRatio))
        return "the file is shorter than its header says";
    if (!PrepareImage(width, height, channels, bytes, image))
        return "it holds no image of a camera";
    const std::size_t rowBytes = png_get_rowbytes(png, info);
    if (rowBytes != std::size_t{width} * channels * bytes) return "its rows are damaged";
    return ReadRows(png, image->pixels.data(), rowBytes, height) ? "" : "its pixels are damaged";
}

}  // namespace

std::string ReadPng(const std::string& path, Image* image) {
    std::FILE* file = OpenFile(path, "rb");
    if (file == nullptr) return "it cannot be opened";
    png_structp png =
        png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, &FailQuietly, &IgnoreWarning);
    png_infop info = png == nullptr ? nullptr : png_create_info_struct(png);
    std::string problem =
        info == nullptr ? "there is no memory for it" : ReadOpened(png, info, {path, file}, image);
    png_destroy_read_struct(&png, &info, nullptr);
    (void)std::fclose(file);  // It was only read.
    return problem;
}

}  // namespace ZentaraProgram
