#pragma once

#include <cstdint>

#include "imaging/image_filter.h"

namespace ZV {

/// An image to be measured. What lies beyond `bytes`, or beyond its width and height, is never
/// read.
struct MeasuredImage {
    const std::uint8_t* data = nullptr;  ///< Null counts as no bytes.
    std::uint64_t bytes = 0;
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    std::uint32_t format = 0;  ///< `ZImageFormatEnum`.
};

/// In pixels. Nothing is cut to the image: a row of the region that is too long goes on into the
/// rows that follow.
struct MeasuredRegion {
    std::uint32_t x = 0;
    std::uint32_t y = 0;
    std::uint32_t width = 0;
    std::uint32_t height = 0;
};

struct ColourValues {
    std::uint32_t red = 0;
    std::uint32_t green = 0;
    std::uint32_t blue = 0;
};

/// Mean of each colour over the region, truncated. Samples beyond the image count as 0.
/// A region without pixels gives `FilterDone` and leaves `means` alone. `FilterUnknownFormat` for
/// an image that has not three colours. Kept: in `RGBPlane16` the walk takes every second row.
[[nodiscard]] FilterResult MeasureColourMeans(const MeasuredImage& image,
                                              const MeasuredRegion& region, ColourValues* means);

/// Greatest sample of each colour over the region, by the walk of the means; 0 for a region without
/// samples inside the image. `FilterUnknownFormat` as there.
[[nodiscard]] FilterResult MeasureColourMaxima(const MeasuredImage& image,
                                               const MeasuredRegion& region, ColourValues* maxima);

/// Greatest sample of a monochrome or mosaic image. Kept: not the region's rows, but as many
/// samples as it has pixels, one after another from its first pixel on. 0 for none inside the
/// image. `FilterUnknownFormat` for any other image.
[[nodiscard]] FilterResult MeasureMonoMaximum(const MeasuredImage& image,
                                              const MeasuredRegion& region, std::uint32_t* maximum);

}  // namespace ZV
