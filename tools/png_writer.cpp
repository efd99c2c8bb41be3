#include <png.h>

#include <bit>
#include <cerrno>
#include <csetjmp>
#include <cstdio>
#include <string>
#include <vector>

#include "image_samples.h"
#include "image_writers.h"
#include "platform.h"

namespace ZentaraProgram {
namespace {

void FailQuietly(png_structp png, png_const_charp) {
    png_longjmp(png, 1);
}
void IgnoreWarning(png_structp, png_const_charp) {}

/// libpng leaves by longjmp: no object with a destructor lives in this frame.
bool WriteRows(png_structp png, png_infop info, std::FILE* file, const Image& image,
               const std::uint8_t* samples) {
    if (setjmp(png_jmpbuf(png)) != 0) return false;
    const bool isColour = image.GetChannels() > 1;
    png_init_io(png, file);
    png_set_compression_level(png, 3);
    png_set_IHDR(png, info, image.width, image.height, static_cast<int>(8 * image.bytesPerSample),
                 isColour ? PNG_COLOR_TYPE_RGB : PNG_COLOR_TYPE_GRAY, PNG_INTERLACE_NONE,
                 PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
    // Samples are proportional to light; a viewer that is not told takes them for darker ones.
    if (isColour && !image.isDrawing) png_set_gAMA(png, info, 1.0);
    png_write_info(png, info);
    if (image.bytesPerSample == 2 && std::endian::native == std::endian::little) png_set_swap(png);
    const std::size_t rowBytes =
        std::size_t{image.width} * image.GetChannels() * image.bytesPerSample;
    for (std::uint32_t row = 0; row < image.height; ++row) {
        png_write_row(png, samples + rowBytes * row);
    }
    png_write_end(png, info);
    return true;
}

}  // namespace

std::string WritePng(const std::string& path, const Image& image) {
    std::vector<std::uint8_t> scratch;
    const std::uint8_t* samples = GetPixelSamples(image, &scratch).data();
    errno = 0;
    std::FILE* file = OpenFile(path, "wb");
    if (file == nullptr) return DescribeFileFailure();
    png_structp png =
        png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, &FailQuietly, &IgnoreWarning);
    png_infop info = png == nullptr ? nullptr : png_create_info_struct(png);
    const bool isWritten = info != nullptr && WriteRows(png, info, file, image, samples);
    png_destroy_write_struct(&png, &info);
    const bool isClosed = std::fclose(file) == 0;
    return isWritten && isClosed ? std::string{} : DescribeFileFailure();
}

}  // namespace ZentaraProgram
