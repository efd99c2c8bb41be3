#include "image_readers.h"

#include <algorithm>
#include <array>
#include <filesystem>

#include "fits_reader.h"
#include "paths.h"
#include "platform.h"
#include "zentara/zentara.h"

namespace ZentaraProgram {
namespace {

std::string ReadFitsPixels(const std::string& path, Image* image) {
    return ReadFits(path, FitsDemand::Pixels, image);
}

struct ReaderRow {
    ImageKind kind;
    std::string (*read)(const std::string&, Image*);
};
constexpr std::array Readers{
    ReaderRow{ImageKind::Fits, &ReadFitsPixels},
    ReaderRow{ImageKind::Png, &ReadPng},
    ReaderRow{ImageKind::Tiff, &ReadTiff},
};

}  // namespace

std::string ReadImage(const std::string& path, Image* image) {
    const ImageKind kind = GetImageKind(path);
    const auto* reader = std::find_if(Readers.begin(), Readers.end(),
                                      [&](const ReaderRow& row) { return row.kind == kind; });
    if (reader == Readers.end()) return "the ending of the name is none of .fits, .tiff, .png";
    const std::string problem = FindFileProblem(path);
    return problem.empty() ? reader->read(path, image) : problem;
}

std::string FindFileProblem(const std::string& path) {
    std::error_code failure;
    const auto status = std::filesystem::status(MakePath(path), failure);
    if (!std::filesystem::exists(status)) return "there is no such file";
    const bool isFile = std::filesystem::is_regular_file(status) && !IsDevice(path);
    return isFile ? std::string{} : "it is no file";
}

bool CanHold(const std::string& path, std::uint64_t sampleBytes, std::uint64_t ratio) {
    std::error_code failure;
    const std::uint64_t bytes = std::filesystem::file_size(MakePath(path), failure);
    return !failure && sampleBytes / ratio <= bytes;
}

bool PrepareImage(std::uint64_t width, std::uint64_t height, std::uint32_t channels,
                  std::uint32_t bytesPerSample, Image* image) {
    // Eight times the pixels of the largest camera.
    constexpr std::uint64_t GreatestSide = 65535, GreatestPixels = 8 * 4008 * 2672;
    const bool isKnown =
        (channels == 1 || channels == ColourCount) && (bytesPerSample == 1 || bytesPerSample == 2);
    if (!isKnown || width < 1 || height < 1 || width > GreatestSide || height > GreatestSide)
        return false;
    if (width * height > GreatestPixels) return false;
    const bool isDeep = bytesPerSample == 2;
    const std::uint32_t grey = isDeep ? zfmtMono16 : zfmtMono8;
    const std::uint32_t colour = isDeep ? zfmtRGB48 : zfmtRGB24;
    image->layout = FindPixelFormat(channels == 1 ? grey : colour);
    image->width = static_cast<std::uint32_t>(width);
    image->height = static_cast<std::uint32_t>(height);
    image->bytesPerSample = bytesPerSample;
    image->bits = 8 * bytesPerSample;
    image->pixels.assign(width * height * channels * bytesPerSample, 0);
    return true;
}

}  // namespace ZentaraProgram
