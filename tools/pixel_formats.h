#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>

namespace ZentaraProgram {

/// How the pixels of an image format of the library lie in memory.
struct PixelFormat {
    std::uint32_t format;            ///< One of zfmt...
    const char* name;                ///< As users write it: "rgb24".
    std::uint32_t bytesPerSample;    ///< 1, or 2 in host order.
    std::uint32_t samplesPerPixel;   ///< 1, 3, or 4 with one that says nothing.
    bool isPlanar;                   ///< Three whole planes, one behind the other.
    std::array<std::uint8_t, 3> at;  ///< Places of red, green and blue among a pixel's samples.

    [[nodiscard]] bool IsThreeColour() const { return samplesPerPixel > 1; }
    [[nodiscard]] bool IsDeep() const { return bytesPerSample > 1; }
    [[nodiscard]] std::uint32_t GetBytesPerPixel() const {
        return bytesPerSample * samplesPerPixel;
    }
};

/// All formats, in the order of their numbers.
std::span<const PixelFormat> GetPixelFormats();

/// Null for a number that no format has.
const PixelFormat* FindPixelFormat(std::uint32_t format);

/// By name; case, dashes and blanks do not count. Null for a name that no format has.
const PixelFormat* FindPixelFormat(std::string_view name);

/// "unknown format 'rgb25'; did you mean rgb24?"
std::string DescribeUnknownFormat(std::string_view name);

}  // namespace ZentaraProgram
