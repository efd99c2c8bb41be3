#pragma once

#include <cstdint>

#include "imaging/ex_image.h"
#include "imaging/image_filter.h"
#include "imaging/region_measure.h"

namespace ZV {

class ZCamera;

/// One image from a camera, to be measured. Goes back to the camera class at the end, whatever the
/// way out.
class MeasuringImage {
  public:
    explicit MeasuringImage(ZCamera& measured) : camera(measured) {}
    ~MeasuringImage();
    MeasuringImage(const MeasuringImage&) = delete;
    MeasuringImage& operator=(const MeasuringImage&) = delete;

    /// Waits for an image of the camera; the camera's result.
    [[nodiscard]] FilterResult Grab();

    /// Runs the camera's Bayer pipeline over the image. `FilterDone` also where it declines the
    /// image. While it runs, a finished format that does not fit the depth of the image gives way
    /// to `RGB24`, or `RGB48` above 8 bits; afterwards the format in force is back.
    [[nodiscard]] FilterResult Interpolate();

    /// Cuts a region's width and height, not its origin, to those of the image.
    void CutRegion(MeasuredRegion* region) const;

    [[nodiscard]] const ZExImage& Get() const { return *image; }
    [[nodiscard]] MeasuredImage Describe() const;

  private:
    ZCamera& camera;            // borrowed for the life of this object
    ZExImage* image = nullptr;  // owned
};

/// Bytes of an image that may be read, whatever its record says.
[[nodiscard]] std::uint32_t CountReadableBytes(const ZExImage& image);

/// A number of nanoseconds from a calculation: truncated, held at 0 and at the greatest; 0 for
/// something that is no number.
[[nodiscard]] std::uint64_t TruncateToNanoseconds(double nanoseconds);

}  // namespace ZV
