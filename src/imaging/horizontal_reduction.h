#pragma once

#include <cstdint>

namespace ZV {

/// Reduces the width of a mosaic and keeps it a mosaic. Adjacent samples of a row belong to two
/// colours: a group of 2 * `factor` samples gives two, each the truncated mean of the `factor`
/// samples of its colour. Samples at the end of a row that fill no whole group are left out.

/// Columns that are left of a row: 2 for each whole group. 0 for a factor of 0.
[[nodiscard]] std::uint32_t CalculateReducedWidth(std::uint32_t width, std::uint32_t factor);

/// Whether there is a reduction by this factor: 2, 3 and 4.
[[nodiscard]] bool CanReduceWidth(std::uint32_t factor);

/// Reduces `height` rows of `width` samples, each row behind the last without a gap. Samples have
/// 1 or 2 bytes and stand at any address. `reduced` may be `rows`: the rows are reduced in place
/// then. A factor that is none of 2, 3 and 4 reduces nothing. Reentrant.
void ReduceRows(const std::uint8_t* rows, std::uint32_t width, std::uint32_t height,
                std::uint32_t factor, std::uint32_t sampleBytes, std::uint8_t* reduced);

}  // namespace ZV
