#pragma once

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>

#include "hal/hal.h"
#include "imaging/image_filter.h"
#include "imaging/pixel_buffer.h"
#include "zentara/zentara.h"

namespace ZV {

/// Collects three frames, one of each colour of a filter wheel, and packs them into one image.
///
/// `Process` runs on the streaming thread. `Reset`, `Enable` and `Disable` may be called on any
/// thread; formats and counts are read on any.
class ZENTARA_API ZRGBFilterWheel : public ZImageFilter {
  public:
    explicit ZRGBFilterWheel(std::uint16_t outputFormat);
    ~ZRGBFilterWheel() override;

    /// Takes a frame into the plane of its filter colour, and packs the planes when each holds one.
    ///
    /// A set begins with the camera's start colour and goes on red, green, blue, red; a frame out
    /// of turn is dropped and the set waits. In this order: 9 the semaphore cannot be had;
    /// `FilterDeclined` the camera's wheel does not turn; `FilterNothingYet` out of turn (nothing
    /// stored); `FilterNotInitialised` the frame is larger than the planes (nothing stored);
    /// `FilterNothingYet` the set is not complete; `FilterFailed` the output format is none of 6 to
    /// 12; `FilterNotInitialised` the format reads words and the planes hold fewer than the image
    /// has pixels; `FilterFailed` the image does not fit the output; 9 the semaphore cannot be
    /// given back. A set that could not be packed stays as it is: the next frame in turn tries
    /// again. So does each frame for planes that there was no memory for.
    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override;
    /// Stores the largest size and makes the planes if there are none. `FilterDone`.
    FilterResult Init(std::uint32_t width, std::uint32_t height) override;
    FilterResult SetOutputFormat(std::uint32_t format) override;
    /// Drops a set that is half collected.
    void Reset() override;
    /// Makes the planes of the largest size if there are none.
    void Enable() override;
    /// Drops a set that is half collected and lets the planes go; a later `Enable` makes them anew.
    void Disable() override;
    /// What the finished image takes when this frame would complete the set, else the input's size.
    std::uint32_t GetNeededOutputBufferSize(ZInImageBufferStruct* in) override;

    /// False when its semaphore could not be made: each `Process` then gives 9.
    bool HasSemaphore() const;
    std::uint32_t GetOutputFormat() const;
    bool IsStarted() const { return isStarted.load(std::memory_order_relaxed); }
    /// Frames taken in this set.
    std::uint16_t GetRedCount() const { return GetCount(0); }
    std::uint16_t GetGreenCount() const { return GetCount(1); }
    std::uint16_t GetBlueCount() const { return GetCount(2); }

    /// Makes three planes of 16-bit samples if there are none, and drops a set that was begun
    /// without them. A size of 0, or one that there is no memory for, makes none.
    void AllocateBuffers(std::uint32_t width, std::uint32_t height);
    void FreeBuffers();

  private:
    struct Shot {
        PixelBuffer plane;
        std::atomic<std::uint16_t> count{0};
    };

    std::uint16_t GetCount(std::size_t place) const;
    // The rest wants the semaphore held.
    bool IsInTurn(const ZInImageBufferStruct& in);
    FilterResult Collect(const ZInImageBufferStruct& in, ZOutImageBufferStruct& out);
    FilterResult Store(const ZInImageBufferStruct& in);
    FilterResult Pack(const ZInImageBufferStruct& in, ZOutImageBufferStruct& out) const;
    void DropSet();
    void MakePlanes(std::uint32_t width, std::uint32_t height);
    void MakePlanesOf(std::uint64_t planeBytes);
    void FreePlanes();

    std::atomic<std::uint32_t> outputFormat;
    HALSemaphore* semaphore = nullptr;
    // Guarded by semaphore, as is all below; flag and counts are read without it, too.
    std::atomic<bool> isStarted{false};
    std::uint16_t nextColour = 0;
    std::array<Shot, 3> shots;  // Red, green, blue.
    bool buffersAllocated = false;
    std::uint64_t lackedPlaneBytes = 0;  // Of each, for want of memory when they were to be made.
    std::uint32_t widthMax = 0;
    std::uint32_t heightMax = 0;
};

}  // namespace ZV
