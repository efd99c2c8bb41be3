#pragma once

#include <cstdint>

#include "imaging/kernels/kernels.h"

/// The pixel kernels a second time, sample by sample and slowly, for comparison: nothing is shared
/// with the library's but the types. Arguments and results are those of kernels.h. Where the
/// library is free to choose (lookups with falling levels) the judge gives one of the allowed
/// results.
namespace ZV::Testing::Judge {

KernelStatus PackPlanes8x4(const void* const planes[4], std::int32_t planeRowBytes, void* pixels,
                           std::int32_t pixelRowBytes, KernelSize size);
KernelStatus PackPlanes8x3(const void* const planes[3], std::int32_t planeRowBytes, void* pixels,
                           std::int32_t pixelRowBytes, KernelSize size);
KernelStatus PackPlanes16x3(const void* const planes[3], std::int32_t planeRowBytes, void* pixels,
                            std::int32_t pixelRowBytes, KernelSize size);

KernelStatus EnlargePlane8(const void* source, KernelSize sourceSize, std::int32_t sourceRowBytes,
                           KernelRect sourceRect, void* destination,
                           std::int32_t destinationRowBytes, KernelSize destinationSize,
                           double xFactor, double yFactor, std::int32_t interpolation);
KernelStatus EnlargePlane16(const void* source, KernelSize sourceSize, std::int32_t sourceRowBytes,
                            KernelRect sourceRect, void* destination,
                            std::int32_t destinationRowBytes, KernelSize destinationSize,
                            double xFactor, double yFactor, std::int32_t interpolation);

KernelStatus AddPlane8(const void* source, std::int32_t sourceRowBytes, void* destination,
                       std::int32_t destinationRowBytes, KernelSize size, std::int32_t scale);
KernelStatus AddPlane16(const void* source, std::int32_t sourceRowBytes, void* destination,
                        std::int32_t destinationRowBytes, KernelSize size, std::int32_t scale);

KernelStatus ShiftRightPlane8(std::int32_t count, void* plane, std::int32_t rowBytes,
                              KernelSize size);
KernelStatus ShiftRightPlane16(std::int32_t count, void* plane, std::int32_t rowBytes,
                               KernelSize size);

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

}  // namespace ZV::Testing::Judge
