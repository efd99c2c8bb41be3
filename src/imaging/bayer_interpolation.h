#pragma once

#include <array>
#include <atomic>
#include <cstdint>

#include "imaging/image_filter.h"
#include "imaging/pixel_buffer.h"
#include "zentara/zentara.h"

namespace ZV {

/// Turns a mosaic into three colours. `Process` declines until it is built.
class ZENTARA_API ZBayerInterpolation : public ZImageFilter {
  public:
    /// Algorithms 1 (linear), 2 (nearest) and 4 (cubic); the output is a `ZImageFormatEnum`.
    ZBayerInterpolation(std::uint16_t algorithm, std::uint16_t outputFormat);
    ~ZBayerInterpolation() override;

    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override;
    /// Makes the scratch planes for a sensor of this size anew. `FilterDone` also without memory:
    /// the planes are missing then.
    FilterResult Init(std::uint32_t width, std::uint32_t height) override;
    FilterResult SetOutputFormat(std::uint32_t format) override;
    /// A mosaic needs its bytes times those of an output pixel, taken in 32 bits; any other input
    /// its own.
    std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in) override;

    std::uint16_t GetAlgorithm() const;
    /// Not checked. `FilterDone`.
    FilterResult SetAlgorithm(std::uint16_t newAlgorithm);
    std::uint32_t GetOutputFormat() const;
    bool IsInitialised() const { return isInitialised; }

  private:
    std::atomic<std::uint16_t> algorithm;
    std::atomic<std::uint32_t> outputFormat;
    bool isInitialised = false;
    PixelBuffer redPlane;
    PixelBuffer bluePlane;
    PixelBuffer greenPlane;
    PixelBuffer alphaPlane;
    std::array<PixelBuffer, 4> quarterPlanes;
    std::uint32_t width = 0;
    std::uint32_t height = 0;
};

}  // namespace ZV
