#pragma once

#include <cstddef>
#include <cstdint>

#include "imaging/kernels/kernels.h"

namespace ZV {

[[nodiscard]] inline bool IsKernelSizeBad(KernelSize size) {
    return size.width < 1 || size.height < 1;
}

/// The start of a row of an image whose rows are `rowBytes` apart.
template <typename Sample>
[[nodiscard]] Sample* GetImageRow(void* image, std::int32_t rowBytes, std::int64_t row) {
    return reinterpret_cast<Sample*>(static_cast<std::byte*>(image) + rowBytes * row);
}
template <typename Sample>
[[nodiscard]] const Sample* GetImageRow(const void* image, std::int32_t rowBytes,
                                        std::int64_t row) {
    return reinterpret_cast<const Sample*>(static_cast<const std::byte*>(image) + rowBytes * row);
}

/// How a loop walks an image: row by row, or as one long row where no row leaves a gap.
struct ImageWalk {
    std::int32_t rows;
    std::size_t rowPixels;
};

[[nodiscard]] inline ImageWalk PlanImageWalk(KernelSize size, bool isGapless) {
    const auto width = static_cast<std::size_t>(size.width);
    if (!isGapless) return {size.height, width};
    return {1, width * static_cast<std::size_t>(size.height)};
}

/// Whether rows of `width` pixels follow each other without a gap.
[[nodiscard]] inline bool IsGapless(std::int32_t rowBytes, std::int32_t width,
                                    std::size_t pixelBytes) {
    return rowBytes == width * static_cast<std::int64_t>(pixelBytes);
}

}  // namespace ZV
