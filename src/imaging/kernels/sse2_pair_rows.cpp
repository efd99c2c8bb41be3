#include "imaging/kernels/sse2_rows.h"

// Two output rows, one after the other.

namespace ZV {

void SSE2Rows::LinearColumnPair8(const std::uint16_t* upper, const std::uint16_t* lower,
                                 const std::int32_t weights[2], std::uint8_t* const outputs[2],
                                 std::size_t count) {
    LinearColumn8(upper, lower, weights[0], outputs[0], count);
    LinearColumn8(upper, lower, weights[1], outputs[1], count);
}

void SSE2Rows::LinearColumnPair16(const std::uint16_t* upper, const std::uint16_t* lower,
                                  const std::int32_t weights[2], Word* const outputs[2],
                                  std::size_t count) {
    LinearColumn16(upper, lower, weights[0], outputs[0], count);
    LinearColumn16(upper, lower, weights[1], outputs[1], count);
}

void SSE2Rows::CubicColumnPair8(const float* const rows[4], const CubicWeights weights[2],
                                std::uint8_t* const outputs[2], std::size_t count) {
    CubicColumn8(rows, weights[0], outputs[0], count);
    CubicColumn8(rows, weights[1], outputs[1], count);
}

void SSE2Rows::CubicColumnPair16(const float* const rows[4], const CubicWeights weights[2],
                                 Word* const outputs[2], std::size_t count) {
    CubicColumn16(rows, weights[0], outputs[0], count);
    CubicColumn16(rows, weights[1], outputs[1], count);
}

}  // namespace ZV
