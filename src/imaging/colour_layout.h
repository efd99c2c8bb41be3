#pragma once

#include <cstdint>

namespace ZV {

/// Where the samples of each colour stand in an image of three colours.
struct ColourLayout {
    /// Position of each colour's first sample: within a pixel, or the number of its plane.
    std::uint8_t red;
    std::uint8_t green;
    std::uint8_t blue;
    std::uint8_t step;  ///< Samples from one pixel to the next; 1 for planes.
    std::uint8_t sampleBytes;

    [[nodiscard]] constexpr bool IsPlanar() const { return step == 1; }
    [[nodiscard]] constexpr std::uint32_t GetPixelBytes() const {
        return (IsPlanar() ? 3U : step) * sampleBytes;
    }
};

/// Null for a format that the filters do not take for three colours.
[[nodiscard]] const ColourLayout* FindColourLayout(std::uint32_t format);

}  // namespace ZV
