#pragma once

#include <array>
#include <string_view>

/// Names in FITS headers that the writer and the reader share.
namespace ZentaraProgram {

/// Values of BAYERPAT, by Zentara_Frame.bayerPattern.
inline constexpr std::array<std::string_view, 4> FitsBayerNames{"RGGB", "GRBG", "GBRG", "BGGR"};

/// Scales of post-processing: red, green, blue.
inline constexpr std::array<const char*, 3> FitsScaleKeys{"WBRED", "WBGREEN", "WBBLUE"};

}  // namespace ZentaraProgram
