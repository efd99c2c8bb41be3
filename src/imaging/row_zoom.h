#pragma once

#include <cstdint>

namespace ZV {

/// Doubling the height of a mosaic, which stays a mosaic of the same pattern. A row's samples stand
/// side by side and rows follow one another without a gap; samples have 1 or 2 bytes and stand at
/// any address. Reentrant.

/// Places the rows of a frame in the doubled one: row 2k goes to row 4k, row 2k + 1 to row 4k + 3;
/// the rows between are left alone. `zoomed` holds 2 * `rowCount` rows. It may begin where `rows`
/// begins, and overlap it in no other way.
void ZoomSpreadRows(const std::uint8_t* rows, std::uint8_t* zoomed, std::uint32_t width,
                    std::uint32_t rowCount, std::uint32_t sampleBytes);

/// Whether ZoomFillRows does anything with a frame of this size.
[[nodiscard]] bool CanZoomFillRows(std::uint32_t width, std::uint32_t height);

/// Computes the rows between from samples of the same colour. `pattern` is that of the frame, as in
/// frame records (0 to 3) or images (5 to 8); every other one counts as 0. Frames of fewer than 5
/// columns or 6 rows are left as they are.
void ZoomFillRows(std::uint32_t pattern, std::uint8_t* data, std::uint32_t width,
                  std::uint32_t height, std::uint32_t sampleBytes);

}  // namespace ZV
