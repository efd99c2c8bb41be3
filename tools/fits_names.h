#pragma once

#include <array>
#include <filesystem>
#include <string>
#include <string_view>
#include <system_error>

#include "paths.h"
#include "platform.h"

/// What the writer and the reader of FITS files share.
namespace ZentaraProgram {

/// Values of BAYERPAT, by Zentara_Frame.bayerPattern.
inline constexpr std::array<std::string_view, 4> FitsBayerNames{"RGGB", "GRBG", "GBRG", "BGGR"};

/// Scales of post-processing: red, green, blue.
inline constexpr std::array<const char*, 3> FitsScaleKeys{"WBRED", "WBGREEN", "WBBLUE"};

/// A path as the library of the format takes it literally: in one that is not absolute it expands a
/// tilde and leaves blanks out. Empty when there is no current folder.
inline std::string GetLiteralPath(const std::string& path) {
    std::error_code failure;
    return GetNarrowPath(GetPathText(std::filesystem::absolute(MakePath(path), failure)));
}

}  // namespace ZentaraProgram
