#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <limits>
#include <memory>
#include <random>

#include "imaging/auto_white_balance.h"
#include "imaging/scripted_camera.h"

namespace ZV::Testing {

inline constexpr float Infinity = std::numeric_limits<float>::infinity();
inline constexpr float NotANumber = std::numeric_limits<float>::quiet_NaN();

inline bool IsOfWords(std::uint32_t format) {
    return format == RGBPlane16 || format == RGB48;
}

inline std::uint32_t CountPixelBytes(std::uint32_t format) {
    return ZExImage::ImageFormatByteSize(format);
}

inline Bytes MakeRandomBytes(std::size_t count, std::uint32_t seed) {
    std::mt19937 random(seed);
    Bytes bytes(count);
    for (std::uint8_t& byte : bytes) byte = static_cast<std::uint8_t>(random());
    // The top sample values are the special ones.
    for (std::size_t index = 0; index + 2 <= count; index += 14) {
        bytes[index] = bytes[index + 1] = 255;
    }
    return bytes;
}

/// The image of an output in a pipeline, followed by bytes that nobody may touch.
class Balancing {
  public:
    static constexpr std::size_t GuardBytes = 64;

    Balancing(const Bytes& pixels, std::uint32_t width, std::uint32_t height, std::uint32_t format)
        : bytes(pixels) {
        bytes.insert(bytes.end(), GuardBytes, 0xA5);
        in.data = nullptr;  // Not looked at: the image stands at the output.
        in.imageSize = static_cast<std::uint32_t>(pixels.size());
        in.width = width;
        in.height = height;
        in.bitDepth = IsOfWords(format) ? 12 : 8;
        in.imageFormat = format;
        in.camera = &camera;
        out.data = bytes.data();
        out.imageFormat = format;
        out.dataCapacity = pixels.size();
        camera.imageFormat = CameraBayer;
    }

    FilterResult Run(ZAutoWhiteBalance& filter) { return filter.Process(&in, &out); }
    Bytes GetPixels() const { return {bytes.begin(), bytes.end() - GuardBytes}; }
    bool IsGuardIntact() const {
        return std::all_of(bytes.end() - GuardBytes, bytes.end(),
                           [](std::uint8_t byte) { return byte == 0xA5; });
    }

    ScriptedCamera camera;
    ZInImageBufferStruct in;
    ZOutImageBufferStruct out;

  private:
    Bytes bytes;
};

class WhiteBalance : public testing::Test {
  protected:
    void SetScales(float red, float green, float blue) {
        filter->SetRedScale(red);
        filter->SetGreenScale(green);
        filter->SetBlueScale(blue);
    }

    std::unique_ptr<ZAutoWhiteBalance> filter = std::make_unique<ZAutoWhiteBalance>(false);
};

}  // namespace ZV::Testing
