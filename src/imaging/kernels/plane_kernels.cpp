#include <cstring>

#include "imaging/kernels/image_rows.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/kernels.h"

namespace ZV {

namespace {

template <typename Sample, std::size_t Planes>
using PackRow = void (*)(const Sample* const planes[Planes], Sample* pixels, std::size_t count);

template <typename Sample, std::size_t Planes>
KernelStatus Pack(PackRow<Sample, Planes> packRow, const void* const planes[],
                  std::int32_t planeRowBytes, void* pixels, std::int32_t pixelRowBytes,
                  KernelSize size) {
    if (planes == nullptr || pixels == nullptr) return KernelNullPointer;
    for (std::size_t plane = 0; plane < Planes; ++plane) {
        if (planes[plane] == nullptr) return KernelNullPointer;
    }
    if (IsKernelSizeBad(size)) return KernelBadSize;
    const ImageWalk walk =
        PlanImageWalk(size, IsGapless(planeRowBytes, size.width, sizeof(Sample)) &&
                                IsGapless(pixelRowBytes, size.width, Planes * sizeof(Sample)));
    for (std::int32_t row = 0; row < walk.rows; ++row) {
        const Sample* rows[Planes];
        for (std::size_t plane = 0; plane < Planes; ++plane) {
            rows[plane] = GetImageRow<Sample>(planes[plane], planeRowBytes, row);
        }
        packRow(rows, GetImageRow<Sample>(pixels, pixelRowBytes, row), walk.rowPixels);
    }
    return KernelOk;
}

template <typename Sample>
KernelStatus Add(void (*addRow)(const Sample*, Sample*, std::size_t), const void* source,
                 std::int32_t sourceRowBytes, void* destination, std::int32_t destinationRowBytes,
                 KernelSize size, std::int32_t scale) {
    if (source == nullptr || destination == nullptr) return KernelNullPointer;
    if (IsKernelSizeBad(size) || scale != 0) return KernelBadSize;
    const ImageWalk walk =
        PlanImageWalk(size, IsGapless(sourceRowBytes, size.width, sizeof(Sample)) &&
                                IsGapless(destinationRowBytes, size.width, sizeof(Sample)));
    for (std::int32_t row = 0; row < walk.rows; ++row) {
        addRow(GetImageRow<Sample>(source, sourceRowBytes, row),
               GetImageRow<Sample>(destination, destinationRowBytes, row), walk.rowPixels);
    }
    return KernelOk;
}

template <typename Sample>
KernelStatus ShiftRight(void (*shiftRow)(std::int32_t, Sample*, std::size_t), std::int32_t count,
                        void* plane, std::int32_t rowBytes, KernelSize size) {
    constexpr auto SampleBits = static_cast<std::int32_t>(8 * sizeof(Sample));
    if (plane == nullptr) return KernelNullPointer;
    if (IsKernelSizeBad(size) || count < 0) return KernelBadSize;
    if (rowBytes < 1) return KernelBadStep;
    const ImageWalk walk = PlanImageWalk(size, IsGapless(rowBytes, size.width, sizeof(Sample)));
    for (std::int32_t row = 0; row < walk.rows; ++row) {
        auto* const samples = GetImageRow<Sample>(plane, rowBytes, row);
        if (count < SampleBits) {
            shiftRow(count, samples, walk.rowPixels);
        } else {
            std::memset(samples, 0, walk.rowPixels * sizeof(Sample));
        }
    }
    return KernelOk;
}

}  // namespace

KernelStatus PackPlanes8x4(const void* const planes[4], std::int32_t planeRowBytes, void* pixels,
                           std::int32_t pixelRowBytes, KernelSize size) {
    return Pack<std::uint8_t, 4>(GetRowKernels().pack8x4, planes, planeRowBytes, pixels,
                                 pixelRowBytes, size);
}

KernelStatus PackPlanes8x3(const void* const planes[3], std::int32_t planeRowBytes, void* pixels,
                           std::int32_t pixelRowBytes, KernelSize size) {
    return Pack<std::uint8_t, 3>(GetRowKernels().pack8x3, planes, planeRowBytes, pixels,
                                 pixelRowBytes, size);
}

KernelStatus PackPlanes16x3(const void* const planes[3], std::int32_t planeRowBytes, void* pixels,
                            std::int32_t pixelRowBytes, KernelSize size) {
    return Pack<Word, 3>(GetRowKernels().pack16x3, planes, planeRowBytes, pixels, pixelRowBytes,
                         size);
}

KernelStatus AddPlane8(const void* source, std::int32_t sourceRowBytes, void* destination,
                       std::int32_t destinationRowBytes, KernelSize size, std::int32_t scale) {
    return Add<std::uint8_t>(GetRowKernels().add8, source, sourceRowBytes, destination,
                             destinationRowBytes, size, scale);
}

KernelStatus AddPlane16(const void* source, std::int32_t sourceRowBytes, void* destination,
                        std::int32_t destinationRowBytes, KernelSize size, std::int32_t scale) {
    return Add<Word>(GetRowKernels().add16, source, sourceRowBytes, destination,
                     destinationRowBytes, size, scale);
}

KernelStatus ShiftRightPlane8(std::int32_t count, void* plane, std::int32_t rowBytes,
                              KernelSize size) {
    return ShiftRight<std::uint8_t>(GetRowKernels().shiftRight8, count, plane, rowBytes, size);
}

KernelStatus ShiftRightPlane16(std::int32_t count, void* plane, std::int32_t rowBytes,
                               KernelSize size) {
    return ShiftRight<Word>(GetRowKernels().shiftRight16, count, plane, rowBytes, size);
}

}  // namespace ZV
