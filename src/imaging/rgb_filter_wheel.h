#pragma once

#include <atomic>
#include <cstdint>

#include "hal/hal.h"
#include "imaging/image_filter.h"
#include "imaging/pixel_buffer.h"
#include "zentara/zentara.h"

namespace ZV {

/// Collects the three colours of a filter wheel into one image. `Process` declines until it is
/// built.
///
/// `Reset` may be called on any thread; formats and counts are read on any.
class ZENTARA_API ZRGBFilterWheel : public ZImageFilter {
  public:
    explicit ZRGBFilterWheel(std::uint16_t outputFormat);
    ~ZRGBFilterWheel() override;

    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override;
    /// Stores the largest size and makes the planes if there are none. `FilterDone`.
    FilterResult Init(std::uint32_t width, std::uint32_t height) override;
    FilterResult SetOutputFormat(std::uint32_t format) override;
    /// Drops a set that is half collected.
    void Reset() override;
    void Enable() override;
    /// Drops a set that is half collected and lets the planes go; a later `Enable` makes them anew.
    void Disable() override;
    /// What the finished image takes when this frame would complete the set, else the input's size.
    std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in) override;

    std::uint32_t GetOutputFormat() const;
    bool IsStarted() const { return isStarted.load(std::memory_order_relaxed); }
    std::uint16_t GetRedCount() const { return redCount.load(std::memory_order_relaxed); }
    std::uint16_t GetGreenCount() const { return greenCount.load(std::memory_order_relaxed); }
    std::uint16_t GetBlueCount() const { return blueCount.load(std::memory_order_relaxed); }

    /// Makes three planes of 16-bit samples if there are none.
    void AllocateBuffers(std::uint32_t width, std::uint32_t height);
    void FreeBuffers();

  private:
    bool WouldComplete(std::uint32_t filterColour) const;

    std::atomic<std::uint32_t> outputFormat;
    std::atomic<bool> isStarted{false};  // guarded by semaphore, as are the counts and planes
    std::atomic<std::uint16_t> redCount{0};
    std::atomic<std::uint16_t> greenCount{0};
    std::atomic<std::uint16_t> blueCount{0};
    PixelBuffer redPlane;
    PixelBuffer greenPlane;
    PixelBuffer bluePlane;
    bool buffersAllocated = false;
    HALSemaphore* semaphore = nullptr;
    std::uint32_t widthMax = 0;
    std::uint32_t heightMax = 0;
};

}  // namespace ZV
