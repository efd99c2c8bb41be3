#pragma once

#include <cstdint>
#include <vector>

namespace ZV::Test {

/// The pixel ratio's arithmetic once more, from its definition and sample by sample. It shares no
/// code with the library, so that both can be held against each other.

/// What the rows between are in a doubled mosaic, in place of what stands there.
std::vector<std::uint32_t> JudgeZoomFill(const std::vector<std::uint32_t>& samples,
                                         std::uint32_t width, std::uint32_t height,
                                         std::uint32_t pattern);

/// A mosaic in rows of twice the number: row 2k in row 4k, row 2k + 1 in row 4k + 3; `other` in the
/// rows between.
std::vector<std::uint32_t> JudgeZoomSpread(const std::vector<std::uint32_t>& samples,
                                           std::uint32_t width, std::uint32_t other);

/// A mosaic whose rows are reduced by 2, 3 or 4.
std::vector<std::uint32_t> JudgeReduction(const std::vector<std::uint32_t>& samples,
                                          std::uint32_t width, std::uint32_t factor);

}  // namespace ZV::Test
