#include <tiffio.h>

#include <array>
#include <string>

#include "image_readers.h"
#include "platform.h"

namespace ZentaraProgram {
namespace {

std::uint16_t ReadShort(TIFF* file, std::uint32_t tag) {
    std::uint16_t value = 0;
    return TIFFGetFieldDefaulted(file, tag, &value) == 1 ? value : std::uint16_t{0};
}

std::uint32_t ReadLong(TIFF* file, std::uint32_t tag) {
    std::uint32_t value = 0;
    return TIFFGetField(file, tag, &value) == 1 ? value : 0;
}

bool ReadRows(TIFF* file, Image* image) {
    const std::size_t rowBytes = image->pixels.size() / image->height;
    for (std::uint32_t row = 0; row < image->height; ++row) {
        if (TIFFReadScanline(file, image->pixels.data() + rowBytes * row, row, 0) != 1)
            return false;
    }
    return true;
}

/// Bytes of samples that one byte of a strip can stand for.
struct CompressionRow {
    std::uint16_t compression;
    std::uint64_t ratio;
};
constexpr std::array Compressions{
    CompressionRow{COMPRESSION_NONE, 1},
    CompressionRow{COMPRESSION_PACKBITS, 128},
    CompressionRow{COMPRESSION_LZW, 4096},
    CompressionRow{COMPRESSION_DEFLATE, DeflateRatio},
    CompressionRow{COMPRESSION_ADOBE_DEFLATE, DeflateRatio},
};

std::uint64_t GetRatio(std::uint16_t compression) {
    constexpr std::uint64_t RatioOfOthers = 65536;
    for (const CompressionRow& row : Compressions) {
        if (row.compression == compression) return row.ratio;
    }
    return RatioOfOthers;
}

std::string ReadOpened(TIFF* file, const std::string& path, Image* image) {
    constexpr std::uint32_t BitsPerByte = 8;
    const std::uint32_t channels = ReadShort(file, TIFFTAG_SAMPLESPERPIXEL);
    const std::uint32_t bits = ReadShort(file, TIFFTAG_BITSPERSAMPLE);
    const std::uint32_t meaning = channels == 1 ? PHOTOMETRIC_MINISBLACK : PHOTOMETRIC_RGB;
    std::uint16_t photometric = 0;
    const bool isLight =
        TIFFGetField(file, TIFFTAG_PHOTOMETRIC, &photometric) == 1 && photometric == meaning;
    const bool isPlain = isLight && TIFFIsTiled(file) == 0 && bits % BitsPerByte == 0 &&
                         ReadShort(file, TIFFTAG_SAMPLEFORMAT) == SAMPLEFORMAT_UINT &&
                         ReadShort(file, TIFFTAG_PLANARCONFIG) == PLANARCONFIG_CONTIG;
    const std::uint32_t width = ReadLong(file, TIFFTAG_IMAGEWIDTH);
    const std::uint32_t height = ReadLong(file, TIFFTAG_IMAGELENGTH);
    const std::uint64_t ratio = GetRatio(ReadShort(file, TIFFTAG_COMPRESSION));
    if (isPlain && !CanHold(path, std::uint64_t{width} * height, ratio))
        return "the file is shorter than its header says";
    if (!isPlain || !PrepareImage(width, height, channels, bits / BitsPerByte, image))
        return "it holds no image of a camera";
    const auto rowBytes = static_cast<tmsize_t>(image->pixels.size() / image->height);
    if (TIFFScanlineSize(file) != rowBytes) return "its rows are damaged";
    return ReadRows(file, image) ? "" : "its pixels are damaged";
}

}  // namespace

std::string ReadTiff(const std::string& path, Image* image) {
    TIFFSetErrorHandler(nullptr);
    TIFFSetWarningHandler(nullptr);
    TIFF* file = TIFFOpen(GetNarrowPath(path).c_str(),
                          "rm");  // Without a memory map, which a cut file breaks.
    if (file == nullptr) return "it is no TIFF file, or damaged";
    std::string problem = ReadOpened(file, path, image);
    TIFFClose(file);
    return problem;
}

}  // namespace ZentaraProgram
