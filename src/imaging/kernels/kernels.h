#pragma once

#include <cstdint>

namespace ZV {

/// The pixel kernels of the filters. They know nothing of cameras: they see pointers, row lengths
/// in bytes, sizes in samples and rectangles. All are reentrant and go through the form in force
/// (kernel_selection.h); all forms give the same samples.
///
/// A row length is a signed number of bytes from one row's start to the next. Nothing needs to be
/// aligned. 16-bit samples are words of host order. Arguments are tested in the order in which each
/// kernel names its results, before anything is written.

enum KernelStatus : std::int32_t {
    KernelOk = 0,
    KernelNoOverlap = 29,    ///< The source rectangle lies outside the source image.
    KernelBadSize = -6,      ///< A size is below 1, or a rectangle's origin is negative.
    KernelNullPointer = -8,  ///< A pointer is null.
    KernelNoMemory = -9,     ///< Scratch could not be allocated.
    KernelBadStep = -14,     ///< A row length is below 1.
    KernelBadInterpolation = -22,
    KernelBadFactor = -23,     ///< A factor is not above 0.
    KernelBadLevels = -106,    ///< Fewer than 2 levels.
    KernelEmptyResult = -201,  ///< The destination would be empty.
};

struct KernelSize {
    std::int32_t width;
    std::int32_t height;
};

struct KernelRect {
    std::int32_t x;
    std::int32_t y;
    std::int32_t width;
    std::int32_t height;
};

enum KernelInterpolation : std::int32_t {
    InterpolateNearest = 1,
    InterpolateLinear = 2,
    InterpolateCubic = 4,
    InterpolateLanczos = 16,  ///< Taken for images below 8 samples alone, where it means cubic.
};

/// Sample i of every row of the planes goes to pixel i, side by side.
/// KernelNullPointer, KernelBadSize.
KernelStatus PackPlanes8x4(const void* const planes[4], std::int32_t planeRowBytes, void* pixels,
                           std::int32_t pixelRowBytes, KernelSize size);
KernelStatus PackPlanes8x3(const void* const planes[3], std::int32_t planeRowBytes, void* pixels,
                           std::int32_t pixelRowBytes, KernelSize size);
KernelStatus PackPlanes16x3(const void* const planes[3], std::int32_t planeRowBytes, void* pixels,
                            std::int32_t pixelRowBytes, KernelSize size);

/// Enlarges `sourceRect`, cut to the image, by the two factors. Samples of the destination beyond
/// the result stay untouched. The interpolation falls to one that the source is large enough for:
/// 16 to 4 below 8 samples in a direction, 4 to 2 below 4, 2 to 1 below 2.
/// KernelNullPointer, KernelBadSize (source size, then rectangle), KernelNoOverlap, KernelBadSize
/// (destination), KernelBadFactor, KernelBadInterpolation, KernelEmptyResult, KernelNoMemory.
KernelStatus EnlargePlane8(const void* source, KernelSize sourceSize, std::int32_t sourceRowBytes,
                           KernelRect sourceRect, void* destination,
                           std::int32_t destinationRowBytes, KernelSize destinationSize,
                           double xFactor, double yFactor, std::int32_t interpolation);
KernelStatus EnlargePlane16(const void* source, KernelSize sourceSize, std::int32_t sourceRowBytes,
                            KernelRect sourceRect, void* destination,
                            std::int32_t destinationRowBytes, KernelSize destinationSize,
                            double xFactor, double yFactor, std::int32_t interpolation);

/// Adds the source to the destination, held at the greatest sample. A scale other than 0 is not
/// there. KernelNullPointer, KernelBadSize (a scale too). Row lengths are not tested.
KernelStatus AddPlane8(const void* source, std::int32_t sourceRowBytes, void* destination,
                       std::int32_t destinationRowBytes, KernelSize size, std::int32_t scale);
KernelStatus AddPlane16(const void* source, std::int32_t sourceRowBytes, void* destination,
                        std::int32_t destinationRowBytes, KernelSize size, std::int32_t scale);

/// Shifts every sample right as an unsigned number; 0 from a count beyond the samples' width.
/// KernelNullPointer, KernelBadSize (a negative count too), KernelBadStep.
KernelStatus ShiftRightPlane8(std::int32_t count, void* plane, std::int32_t rowBytes,
                              KernelSize size);
KernelStatus ShiftRightPlane16(std::int32_t count, void* plane, std::int32_t rowBytes,
                               KernelSize size);

/// Maps the samples of interleaved channels in place, each channel by its own tables of `counts[c]`
/// entries: a sample from levels[k] up to but not including levels[k + 1] becomes values[k], held
/// within the samples' range. Samples below the first level and from the last one upward stay. Of
/// repeated levels the last counts; levels beyond the samples' range are cut; falling levels give
/// some sample in range.
/// KernelNullPointer (each channel's tables too), KernelBadSize, KernelBadStep, KernelBadLevels;
/// for 16-bit images of more than 6400 pixels KernelNoMemory.
KernelStatus LookupInPlace8x4(void* image, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* const values[4],
                              const std::int32_t* const levels[4], const std::int32_t counts[4]);
KernelStatus LookupInPlace8x3(void* image, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* const values[3],
                              const std::int32_t* const levels[3], const std::int32_t counts[3]);
KernelStatus LookupInPlace8x1(void* plane, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* values, const std::int32_t* levels,
                              std::int32_t count);
KernelStatus LookupInPlace16x3(void* image, std::int32_t rowBytes, KernelSize size,
                               const std::int32_t* const values[3],
                               const std::int32_t* const levels[3], const std::int32_t counts[3]);
KernelStatus LookupInPlace16x1(void* plane, std::int32_t rowBytes, KernelSize size,
                               const std::int32_t* values, const std::int32_t* levels,
                               std::int32_t count);

}  // namespace ZV
