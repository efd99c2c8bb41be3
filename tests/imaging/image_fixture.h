#pragma once

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "imaging/ex_image.h"

namespace ZV::Testing {

using Bytes = std::vector<std::uint8_t>;

/// What a test says about an image; everything else is of no account to it.
struct ImageTraits {
    std::uint32_t width = 4;
    std::uint32_t height = 2;
    std::uint16_t bitDepth = 8;
    ZImageFormatEnum format = Mono8;
    ZColourPatternEnum pattern = PatternRGGB;
    std::uint16_t binning = 1;
    bool isRTV = false;
    void* camera = nullptr;
};

inline ZExImage MakeImageOver(std::uint8_t* data, std::uint32_t size, const ImageTraits& traits,
                              bool ownsBuffer) {
    return {data,
            size,
            traits.width,
            traits.height,
            traits.bitDepth,
            1000,
            1.0,
            traits.format,
            CameraMono,
            traits.pattern,
            0,
            false,
            1,
            0,
            traits.binning,
            traits.isRTV,
            0,
            0,
            traits.camera,
            ownsBuffer};
}

/// An image that owns a copy of the bytes.
inline ZExImage MakeImage(const Bytes& pixels, const ImageTraits& traits = {}) {
    auto* data = static_cast<std::uint8_t*>(std::malloc(pixels.size()));
    std::memcpy(data, pixels.data(), pixels.size());
    return MakeImageOver(data, static_cast<std::uint32_t>(pixels.size()), traits, true);
}

inline Bytes GetPixels(const ZExImage& image) {
    return {image.GetImageData(), image.GetImageData() + image.GetImageSize()};
}

inline Bytes Ramp(std::size_t count) {
    Bytes bytes(count);
    for (std::size_t index = 0; index < count; ++index) {
        bytes[index] = static_cast<std::uint8_t>(index + 1);
    }
    return bytes;
}

}  // namespace ZV::Testing
