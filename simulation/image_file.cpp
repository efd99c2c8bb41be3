#include "simulation/image_file.h"

#include <fitsio.h>
#include <png.h>
#include <tiffio.h>

#include <algorithm>
#include <array>
#include <cstdarg>
#include <cstdio>
#include <cstring>

#include "simulation/regular_file.h"

namespace ZV::Simulation {
namespace {

constexpr std::uint64_t PixelCountMax = std::uint64_t{1} << 25;
constexpr std::size_t SignatureBytes = 6;
/// Bytes that one compressed byte can stand for.
constexpr std::uint64_t DeflateRatio = 1100;

/// Pixels that a file can hold which has `pixelBits` bits for each, and of which one byte stands
/// for `ratio` bytes of samples at most.
std::uint64_t CountPixelsHeld(const std::string& path, std::uint64_t ratio,
                              std::uint64_t pixelBits) {
    constexpr std::uint64_t BitsPerByte = 8;
    const std::uint64_t bytes = MeasureRegularFile(path).value_or(0);
    return pixelBits == 0 ? 0 : bytes * ratio * BitsPerByte / pixelBits;
}

/// Takes over the size and makes room, which a file that holds fewer pixels gets none of. False
/// with `reason`.
bool Allocate(ImageFile* image, std::uint64_t width, std::uint64_t height, std::uint32_t channels,
              std::uint64_t pixelsHeld, std::string* reason) {
    if (width == 0 || height == 0 || width > PixelCountMax || height > PixelCountMax / width) {
        *reason = "its size is not supported";
        return false;
    }
    if (width * height > pixelsHeld) {
        *reason = "it is shorter than its header says";
        return false;
    }
    image->width = static_cast<std::uint32_t>(width);
    image->height = static_cast<std::uint32_t>(height);
    image->channels = channels;
    image->levels.resize(width * height * channels);
    return true;
}

bool ReadPng(const std::string& path, ImageFile* image, std::string* reason) {
    png_image png = {};
    png.version = PNG_IMAGE_VERSION;
    bool isRead = png_image_begin_read_from_file(&png, path.c_str()) != 0;
    const std::uint64_t held = CountPixelsHeld(path, DeflateRatio, /*pixelBits=*/1);
    if (isRead && !Allocate(image, png.width, png.height, 3, held, reason)) {
        png_image_free(&png);
        return false;
    }
    std::vector<png_uint_16> samples(image->levels.size());
    if (isRead) {
        png.format = PNG_FORMAT_LINEAR_RGB;
        isRead = png_image_finish_read(&png, nullptr, samples.data(), 0, nullptr) != 0;
    }
    if (!isRead) *reason = png.message;
    png_image_free(&png);
    std::transform(samples.begin(), samples.end(), image->levels.begin(),
                   [](png_uint_16 sample) { return static_cast<float>(sample) / 65535.0F; });
    return isRead;
}

int KeepTiffMessage(TIFF*, void* reason, const char*, const char* format, va_list arguments) {
    std::array<char, 256> text{};
    (void)std::vsnprintf(text.data(), text.size(), format, arguments);
    *static_cast<std::string*>(reason) = text.data();
    return 1;
}

int DropTiffMessage(TIFF*, void*, const char*, const char*, va_list) {
    return 1;
}

TIFF* OpenTiff(const std::string& path, std::string* reason) {
    TIFFOpenOptions* options = TIFFOpenOptionsAlloc();
    if (options == nullptr) return nullptr;
    TIFFOpenOptionsSetErrorHandlerExtR(options, KeepTiffMessage, reason);
    TIFFOpenOptionsSetWarningHandlerExtR(options, DropTiffMessage, nullptr);
    // Without a memory map, which a file that is cut meanwhile breaks.
    TIFF* file = TIFFOpenExt(path.c_str(), "rm", options);
    TIFFOpenOptionsFree(options);
    return file;
}

/// Bytes that one byte of a strip can stand for.
struct TiffRatio {
    std::uint16_t compression;
    std::uint64_t ratio;
};
constexpr TiffRatio TiffRatios[] = {
    {COMPRESSION_NONE, 1},
    {COMPRESSION_PACKBITS, 128},
    {COMPRESSION_LZW, 4096},
    {COMPRESSION_DEFLATE, DeflateRatio},
    {COMPRESSION_ADOBE_DEFLATE, DeflateRatio},
};
constexpr std::uint64_t TiffRatioOfOthers = 65536;

std::uint64_t GetTiffRatio(std::uint16_t compression) {
    for (const TiffRatio& row : TiffRatios) {
        if (row.compression == compression) return row.ratio;
    }
    return TiffRatioOfOthers;
}

struct TiffLayout {
    std::uint32_t width = 0, height = 0;
    std::uint16_t bits = 1, samples = 1, planar = 1, photometric = 0, sampleFormat = 1;
    std::uint16_t compression = COMPRESSION_NONE;

    explicit TiffLayout(TIFF* file) {
        TIFFGetField(file, TIFFTAG_IMAGEWIDTH, &width);
        TIFFGetField(file, TIFFTAG_IMAGELENGTH, &height);
        TIFFGetFieldDefaulted(file, TIFFTAG_BITSPERSAMPLE, &bits);
        TIFFGetFieldDefaulted(file, TIFFTAG_SAMPLESPERPIXEL, &samples);
        TIFFGetFieldDefaulted(file, TIFFTAG_PLANARCONFIG, &planar);
        TIFFGetFieldDefaulted(file, TIFFTAG_SAMPLEFORMAT, &sampleFormat);
        TIFFGetFieldDefaulted(file, TIFFTAG_COMPRESSION, &compression);
        TIFFGetField(file, TIFFTAG_PHOTOMETRIC, &photometric);
    }

    std::uint64_t CountPixelsIn(const std::string& path) const {
        return CountPixelsHeld(path, GetTiffRatio(compression), std::uint64_t{bits} * samples);
    }

    std::uint32_t GetChannels() const { return photometric == PHOTOMETRIC_RGB ? 3 : 1; }

    bool IsPlainScanlines(TIFF* file) const {
        const bool isKnownLight =
            photometric == PHOTOMETRIC_RGB || photometric == PHOTOMETRIC_MINISBLACK;
        return isKnownLight && (bits == 8 || bits == 16) && samples >= GetChannels() &&
               planar == PLANARCONFIG_CONTIG && sampleFormat == SAMPLEFORMAT_UINT &&
               TIFFIsTiled(file) == 0;
    }
};

bool ReadTiffScanlines(TIFF* file, const TiffLayout& layout, ImageFile* image) {
    const std::size_t sampleBytes = layout.bits / 8U;
    const std::size_t lineBytes = std::size_t{layout.width} * layout.samples * sampleBytes;
    std::vector<std::uint8_t> line(
        std::max(lineBytes, static_cast<std::size_t>(TIFFScanlineSize(file))));
    const double white = layout.bits == 8 ? 255 : 65535;
    float* level = image->levels.data();
    for (std::uint32_t y = 0; y < layout.height; ++y) {
        if (TIFFReadScanline(file, line.data(), y, 0) < 0) return false;
        for (std::uint32_t x = 0; x < layout.width; ++x) {
            for (std::uint32_t channel = 0; channel < image->channels; ++channel) {
                const std::size_t index = std::size_t{x} * layout.samples + channel;
                std::uint16_t sample = 0;
                std::memcpy(&sample, line.data() + index * sampleBytes, sampleBytes);
                *level++ = static_cast<float>(sample / white);
            }
        }
    }
    return true;
}

bool ReadTiffConverted(TIFF* file, ImageFile* image) {
    std::vector<std::uint32_t> pixels(std::size_t{image->width} * image->height);
    if (TIFFReadRGBAImageOriented(file, image->width, image->height, pixels.data(),
                                  ORIENTATION_TOPLEFT, 1) == 0) {
        return false;
    }
    float* level = image->levels.data();
    for (const std::uint32_t pixel : pixels) {
        *level++ = static_cast<float>(TIFFGetR(pixel)) / 255.0F;
        *level++ = static_cast<float>(TIFFGetG(pixel)) / 255.0F;
        *level++ = static_cast<float>(TIFFGetB(pixel)) / 255.0F;
    }
    return true;
}

bool ReadTiff(const std::string& path, ImageFile* image, std::string* reason) {
    TIFF* file = OpenTiff(path, reason);
    if (file == nullptr) return false;
    const TiffLayout layout(file);
    const bool isPlain = layout.IsPlainScanlines(file);
    const bool isRead =
        Allocate(image, layout.width, layout.height, isPlain ? layout.GetChannels() : 3,
                 layout.CountPixelsIn(path), reason) &&
        (isPlain ? ReadTiffScanlines(file, layout, image) : ReadTiffConverted(file, image));
    TIFFClose(file);
    return isRead;
}

/// Planes one after the other become pixels of side by side channels, scaled to the greatest value.
void TakeFitsPlanes(const std::vector<float>& values, ImageFile* image) {
    float greatest = 0;
    for (const float value : values) {
        if (value > greatest) greatest = value;
    }
    if (!(greatest > 0)) return;
    const std::size_t pixelCount = std::size_t{image->width} * image->height;
    for (std::size_t index = 0; index < values.size(); ++index) {
        const std::size_t channel = index / pixelCount;
        const std::size_t pixel = index % pixelCount;
        const float value = values[index];
        image->levels[pixel * image->channels + channel] = value > 0 ? value / greatest : 0;
    }
}

bool ReadFitsImage(fitsfile* file, std::uint64_t pixelsHeld, ImageFile* image, std::string* reason,
                   int* status) {
    std::array<LONGLONG, 3> sizes = {0, 0, 0};
    int axes = 0;
    fits_get_img_dim(file, &axes, status);
    if (axes == 0) {
        int kind = 0;
        fits_movrel_hdu(file, 1, &kind, status);
        fits_get_img_dim(file, &axes, status);
    }
    fits_get_img_sizell(file, static_cast<int>(sizes.size()), sizes.data(), status);
    if (*status != 0) return false;
    const std::uint32_t channels = axes == 3 && sizes[2] == 3 ? 3 : 1;
    if (axes < 2 || sizes[0] < 0 || sizes[1] < 0) {
        *reason = "it holds no image of two axes";
        return false;
    }
    if (!Allocate(image, static_cast<std::uint64_t>(sizes[0]), static_cast<std::uint64_t>(sizes[1]),
                  channels, pixelsHeld, reason)) {
        return false;
    }
    std::vector<float> values(image->levels.size());
    float undefined = 0;
    fits_read_img(file, TFLOAT, 1, static_cast<LONGLONG>(values.size()), &undefined, values.data(),
                  nullptr, status);
    if (*status != 0) return false;
    TakeFitsPlanes(values, image);
    return true;
}

bool ReadFits(const std::string& path, ImageFile* image, std::string* reason) {
    fitsfile* file = nullptr;
    int status = 0;
    fits_open_diskfile(&file, path.c_str(), READONLY, &status);
    const std::uint64_t held = CountPixelsHeld(path, DeflateRatio, /*pixelBits=*/8);
    const bool isRead = status == 0 && ReadFitsImage(file, held, image, reason, &status);
    if (status != 0) {
        std::array<char, FLEN_STATUS> text{};
        fits_get_errstatus(status, text.data());
        *reason = text.data();
    }
    fits_clear_errmsg();
    int closeStatus = 0;
    if (file != nullptr) fits_close_file(file, &closeStatus);
    return isRead;
}

struct ImageReader {
    std::array<std::uint8_t, SignatureBytes> signature;
    std::size_t signatureBytes;
    bool (*read)(const std::string&, ImageFile*, std::string*);
};

constexpr ImageReader ImageReaders[] = {
    {{0x89, 'P', 'N', 'G'}, 4, ReadPng}, {{'I', 'I', 42, 0}, 4, ReadTiff},
    {{'M', 'M', 0, 42}, 4, ReadTiff},    {{'I', 'I', 43, 0}, 4, ReadTiff},
    {{'M', 'M', 0, 43}, 4, ReadTiff},    {{'S', 'I', 'M', 'P', 'L', 'E'}, 6, ReadFits},
};

const ImageReader* FindReader(const std::string& path, std::string* reason) {
    std::FILE* file = MeasureRegularFile(path) ? std::fopen(path.c_str(), "rb") : nullptr;
    if (file == nullptr) {
        *reason = "it cannot be opened";
        return nullptr;
    }
    std::array<std::uint8_t, SignatureBytes> start{};
    const std::size_t count = std::fread(start.data(), 1, start.size(), file);
    (void)std::fclose(file);
    for (const ImageReader& reader : ImageReaders) {
        if (count >= reader.signatureBytes &&
            std::memcmp(start.data(), reader.signature.data(), reader.signatureBytes) == 0) {
            return &reader;
        }
    }
    *reason = "it is neither a PNG nor a TIFF nor a FITS file";
    return nullptr;
}

}  // namespace

bool ReadImageFile(const std::string& path, ImageFile* image, std::string* message) {
    std::string reason = "it cannot be read";
    const ImageReader* reader = FindReader(path, &reason);
    if (reader != nullptr && reader->read(path, image, &reason)) return true;
    *message = "image file \"" + path + "\": " + reason;
    return false;
}

}  // namespace ZV::Simulation
