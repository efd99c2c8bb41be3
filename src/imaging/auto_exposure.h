#pragma once

#include <atomic>
#include <cstdint>

#include "imaging/image_filter.h"
#include "imaging/region_measure.h"
#include "zentara/zentara.h"

namespace ZV {

class MeasuringImage;

/// Finds an exposure that brings the brightest sample of a region near full scale, by taking images
/// and correcting the exposure in steps. A filter by class, it stands in no pipeline.
///
/// One thread at a time.
class ZENTARA_API ZAutoExposure : public ZImageFilter {
  public:
    static constexpr std::uint32_t PassesMax = 10;

    explicit ZAutoExposure(bool calculateValuesOnAllFrames);
    ~ZAutoExposure() override;

    /// Measures the input over the region, without changing it, and corrects the exposure of its
    /// camera by one step. `out` is not used. `FilterDeclined` when that is done, and without doing
    /// anything while the filter is dormant or the input has no camera; `FilterUnknownFormat` for a
    /// raw image.
    FilterResult Process(ZInImageBufferStruct* in, ZOutImageBufferStruct* out) override;
    /// The region of measurement becomes the whole sensor. `FilterDone`.
    FilterResult Init(std::uint32_t width, std::uint32_t height) override;
    /// Does nothing. `FilterDone`.
    FilterResult SetOutputFormat(std::uint32_t format) override;

    /// Wakes `Process`, or puts it to sleep.
    void SetCalculateValuesOnAllFrames(bool on);

    /// Takes images of 8 bits from the camera and corrects the exposure after each, until it moves
    /// by no more than a tenth, at most `PassesMax` times; running out of passes is no failure. A
    /// wheel that cycles is held at green meanwhile, and its red and blue exposures take the last
    /// step of the green one. The bit depth and the wheel's start colour are put back.
    ///
    /// The first failure ends it and leaves the camera as it is then: at 8 bits, the wheel at
    /// green, and this filter awake.
    ///
    /// `width` and `height` are cut, for good, to those of the image as the camera gives it, which
    /// the pipeline may then make smaller; `x` and `y` are not cut. Of an image of one colour the
    /// region is a run of `width` * `height` consecutive samples; otherwise rows that are too long
    /// go on into those that follow, and `RGBPlane16` gives every second row. What lies beyond the
    /// image does not count. Goes over the bus, on the caller's thread; let no settings be sent
    /// meanwhile.
    FilterResult CalculateExposure(std::uint32_t x, std::uint32_t y, std::uint32_t width,
                                   std::uint32_t height, ZCamera* camera);

    /// The region of measurement, in pixels.
    std::uint32_t GetX() const { return region.x; }
    std::uint32_t GetY() const { return region.y; }
    std::uint32_t GetWidth() const { return region.width; }
    std::uint32_t GetHeight() const { return region.height; }

  private:
    /// Nanoseconds before and after a pass.
    struct Step {
        std::uint64_t before = 0;
        std::uint64_t after = 0;

        [[nodiscard]] double GetDifference() const;
        [[nodiscard]] bool IsSmall() const;
    };

    FilterResult Iterate(ZCamera& camera, Step* step);
    FilterResult RunPass(ZCamera& camera, MeasuringImage& image);
    FilterResult AutoExposeMono(ZCamera& camera, std::uint32_t bitDepth, std::uint32_t maximum);
    FilterResult AutoExposeRGB(ZCamera& camera, std::uint32_t bitDepth, ColourValues maxima);

    std::atomic<bool> calculateValuesOnAllFrames;
    MeasuredRegion region;
};

}  // namespace ZV
