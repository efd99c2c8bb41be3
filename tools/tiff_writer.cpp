#include <tiffio.h>

#include <algorithm>
#include <cerrno>
#include <string>
#include <vector>

#include "image_samples.h"
#include "image_writers.h"
#include "platform.h"

namespace ZentaraProgram {
namespace {

constexpr std::size_t StripBytes = std::size_t{1} << 20;

std::size_t GetRowBytes(const Image& image) {
    return std::size_t{image.width} * image.GetChannels() * image.bytesPerSample;
}

void SetTags(TIFF* file, const Image& image, std::uint32_t rowsPerStrip) {
    const std::uint32_t channels = image.GetChannels();
    TIFFSetField(file, TIFFTAG_IMAGEWIDTH, image.width);
    TIFFSetField(file, TIFFTAG_IMAGELENGTH, image.height);
    TIFFSetField(file, TIFFTAG_BITSPERSAMPLE, static_cast<int>(8 * image.bytesPerSample));
    TIFFSetField(file, TIFFTAG_SAMPLESPERPIXEL, static_cast<int>(channels));
    TIFFSetField(file, TIFFTAG_PHOTOMETRIC,
                 channels > 1 ? PHOTOMETRIC_RGB : PHOTOMETRIC_MINISBLACK);
    TIFFSetField(file, TIFFTAG_PLANARCONFIG, PLANARCONFIG_CONTIG);
    TIFFSetField(file, TIFFTAG_COMPRESSION, COMPRESSION_NONE);
    TIFFSetField(file, TIFFTAG_ROWSPERSTRIP, rowsPerStrip);
    TIFFSetField(file, TIFFTAG_SOFTWARE, image.software.c_str());
    TIFFSetField(file, TIFFTAG_MODEL, image.model.c_str());
}

bool WriteStrips(TIFF* file, const Image& image, std::uint32_t rowsPerStrip) {
    const std::size_t rowBytes = GetRowBytes(image);
    std::vector<std::uint8_t> scratch;
    // libtiff does not write to its argument, although it takes a pointer to non-const.
    auto* pixels = const_cast<std::uint8_t*>(GetPixelSamples(image, &scratch).data());
    for (std::uint32_t row = 0, strip = 0; row < image.height; row += rowsPerStrip, ++strip) {
        const std::size_t bytes = rowBytes * std::min(rowsPerStrip, image.height - row);
        if (TIFFWriteEncodedStrip(file, strip, pixels + rowBytes * row,
                                  static_cast<tmsize_t>(bytes)) < 0) {
            return false;
        }
    }
    return true;
}

}  // namespace

std::string WriteTiff(const std::string& path, const Image& image) {
    TIFFSetErrorHandler(nullptr);
    TIFFSetWarningHandler(nullptr);
    errno = 0;
    TIFF* file = TIFFOpen(GetNarrowPath(path).c_str(), "w");
    if (file == nullptr) return DescribeFileFailure();
    const std::size_t rowBytes = std::max<std::size_t>(1, GetRowBytes(image));
    const auto rowsPerStrip =
        static_cast<std::uint32_t>(std::max<std::size_t>(1, StripBytes / rowBytes));
    SetTags(file, image, rowsPerStrip);
    const bool isWritten = WriteStrips(file, image, rowsPerStrip) && TIFFFlush(file) == 1;
    TIFFClose(file);
    return isWritten ? std::string{} : DescribeFileFailure();
}

}  // namespace ZentaraProgram
