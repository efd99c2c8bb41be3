#pragma once

#include <cstddef>
#include <cstdint>

#include "zentara/zentara.h"

namespace ZV {

/// Sets of image formats; bit n stands for format n.
using FormatSet = std::uint32_t;

template <std::size_t Count>
constexpr FormatSet MakeFormatSet(const std::uint32_t (&formats)[Count]) {
    FormatSet set = 0;
    for (const std::uint32_t format : formats) set |= FormatSet{1} << format;
    return set;
}

constexpr bool Holds(FormatSet set, std::uint32_t format) {
    return format < 32 && ((set >> format) & 1) != 0;
}

/// Formats for which the camera sends 16-bit samples, and those for which it sends bytes.
inline constexpr FormatSet DeepFormats =
    MakeFormatSet({zfmtRaw16, zfmtMono16, zfmtBayer16, zfmtRGBPlane16, zfmtRGB48});
inline constexpr FormatSet ByteFormats = MakeFormatSet(
    {zfmtRaw8, zfmtMono8, zfmtBayer8, zfmtRGBPlane8, zfmtBGR24, zfmtXRGB32, zfmtBGRX32, zfmtRGB24});

inline constexpr FormatSet ThreeColourFormats = MakeFormatSet(
    {zfmtRGBPlane8, zfmtRGBPlane16, zfmtBGR24, zfmtXRGB32, zfmtRGB48, zfmtBGRX32, zfmtRGB24});
inline constexpr FormatSet RawAndMonoFormats =
    MakeFormatSet({zfmtRaw8, zfmtRaw16, zfmtMono8, zfmtMono16});

}  // namespace ZV
