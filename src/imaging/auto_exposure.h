#pragma once

#include <atomic>
#include <cstdint>

#include "imaging/image_filter.h"
#include "zentara/zentara.h"

namespace ZV {

/// Finds an exposure that brings the brightest sample near full scale. `Process` declines until it
/// is built.
class ZENTARA_API ZAutoExposure : public ZImageFilter {
  public:
    explicit ZAutoExposure(bool calculateValuesOnAllFrames);
    ~ZAutoExposure() override;

    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override;
    /// The region of measurement becomes the whole sensor. `FilterDone`.
    FilterResult Init(std::uint32_t width, std::uint32_t height) override;
    /// Does nothing. `FilterDone`.
    FilterResult SetOutputFormat(std::uint32_t format) override;

    void SetCalculateValuesOnAllFrames(bool on);

    std::uint32_t GetX() const { return x; }
    std::uint32_t GetY() const { return y; }
    std::uint32_t GetWidth() const { return width; }
    std::uint32_t GetHeight() const { return height; }

  private:
    std::atomic<bool> calculateValuesOnAllFrames;
    std::uint32_t x = 0;
    std::uint32_t y = 0;
    std::uint32_t width = 0;
    std::uint32_t height = 0;
};

}  // namespace ZV
