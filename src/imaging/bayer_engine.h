#pragma once

#include <cstdint>

#include "imaging/image_filter.h"
#include "imaging/kernels/enlarge_rows.h"
#include "imaging/kernels/kernels.h"
#include "imaging/pixel_buffer.h"

namespace ZV {

/// A mosaic as the engine reads it: `height` rows of `width` samples without gaps. Of `bytes` none
/// beyond is read; samples that are not there count as 0.
struct BayerMosaic {
    const std::uint8_t* data = nullptr;
    std::uint64_t bytes = 0;
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    std::uint32_t colourPattern = 0;  ///< Anything but 6 to 8 counts as `PatternRGGB`.
};

/// Where the engine leaves an image. `capacity` is of bytes; 0: vouched for by its owner.
struct BayerTarget {
    std::uint8_t* data = nullptr;
    std::uint64_t capacity = 0;
    std::uint32_t format = 0;  ///< `ZImageFormatEnum`.
};

/// Splits a mosaic into quarter planes, averages the greens as (g1 >> 1) + (g2 >> 1), enlarges each
/// colour by two and packs them. Each sample is the one of the pixel kernels one after the other
/// over whole planes (kernels.h), whose interpolation falls to a simpler one for small planes as
/// theirs does. The work is done row by row, so that what is in use stays in the cache.
///
/// The last column and row of an odd size have no part in it: those of the image repeat their
/// neighbours. A mosaic of a single row or column has no cell, and its image is black.
class BayerEngine {
  public:
    /// Bytes of the image that the engine for samples of 1 or 2 bytes makes of a mosaic of this
    /// size: 0 for no pixels, and where it refuses the format or the size.
    [[nodiscard]] static std::uint64_t MeasureImage(std::uint32_t width, std::uint32_t height,
                                                    std::uint32_t format, std::size_t sampleBytes);

    /// Makes the scratch of frames up to this width, so that none is made for them later. Without
    /// memory the first frame tries again.
    void Reserve(std::uint32_t width);

    /// Makes an image of one byte per sample: formats 6, 8, 9, 11, 12 and 13.
    ///
    /// `*outputBytes` is set when `FilterDone` comes back; a side of 0 gives 0 bytes. Nothing is
    /// written otherwise: `FilterUnusableFormat`; `FilterFailed` for a null `outputBytes`, missing
    /// data, an image above 32 bits and one above the capacity; `FilterNotInitialised` without
    /// memory. Memory is taken only when the size of the frames, their depth or the interpolation
    /// change, and where the mosaic overlaps the image.
    [[nodiscard]] FilterResult Run8(const BayerMosaic& mosaic, KernelInterpolation interpolation,
                                    const BayerTarget& target, std::uint32_t* outputBytes);

    /// The same of two bytes per sample: formats 7 and 10.
    [[nodiscard]] FilterResult Run16(const BayerMosaic& mosaic, KernelInterpolation interpolation,
                                     const BayerTarget& target, std::uint32_t* outputBytes);

  private:
    /// What the positions in force were made for.
    struct PositionsKey {
        std::int32_t columns = 0;  // of a quarter plane
        std::int32_t rows = 0;
        KernelInterpolation interpolation = InterpolateNearest;
        std::size_t sampleBytes = 0;

        bool operator==(const PositionsKey&) const = default;
    };

    template <typename Sample>
    FilterResult Run(const BayerMosaic& mosaic, KernelInterpolation interpolation,
                     const BayerTarget& target, std::uint32_t* outputBytes);
    template <typename Sample>
    void MakeImage(const BayerMosaic& mosaic, const BayerTarget& target);
    [[nodiscard]] bool Prepare(const BayerMosaic& mosaic, KernelInterpolation interpolation,
                               std::size_t sampleBytes);
    [[nodiscard]] bool MakePositions(const PositionsKey& wanted);

    PixelBuffer scratch;
    PositionsKey key;
    LinearPositions linearColumns;
    LinearPositions linearRows;
    CubicPositions cubicColumns;
    CubicPositions cubicRows;
};

}  // namespace ZV
