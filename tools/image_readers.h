#pragma once

#include <cstdint>
#include <string>

#include "image_file.h"

namespace ZentaraProgram {

/// Reads the pixels of a FITS, PNG or TIFF file, by the ending of its name: grey or of three
/// colours, samples of 8 or 16 bits. Palettes and smaller samples of a PNG are spread to 8 bits,
/// and what it says of transparency is left out. Returns the reason of a failure, or an empty text;
/// `image` is to be used on success only.
std::string ReadImage(const std::string& path, Image* image);

std::string ReadPng(const std::string& path, Image* image);
std::string ReadTiff(const std::string& path, Image* image);

/// Why nothing at `path` can be read as a file; an empty text for a file.
std::string FindFileProblem(const std::string& path);

/// Whether a file is long enough for `sampleBytes` bytes of samples, when one byte of it stands for
/// `ratio` of them at most. Asked before there is room for the image.
bool CanHold(const std::string& path, std::uint64_t sampleBytes, std::uint64_t ratio);

/// Bytes of samples that one byte of a deflated stream can stand for, with some to spare.
inline constexpr std::uint64_t DeflateRatio = 1100;

/// Gives an image this size and room for its pixels. False when no camera makes such an image; it
/// is left alone then.
bool PrepareImage(std::uint64_t width, std::uint64_t height, std::uint32_t channels,
                  std::uint32_t bytesPerSample, Image* image);

}  // namespace ZentaraProgram
