#pragma once

#include <immintrin.h>

#include <cstddef>
#include <cstdint>

#include "imaging/kernels/row_kernels.h"

// For the sources of the AVX2 form alone. Nothing in them but intrinsics and static functions: an
// inline function shared with other files could carry these instructions to an older processor.

namespace ZV {

static constexpr std::size_t VectorBytes = 32;

static inline __m256i LoadVector(const void* from) {
    return _mm256_loadu_si256(static_cast<const __m256i*>(from));
}

static inline void CopyBytes(const std::uint8_t* from, std::uint8_t* to, std::size_t count) {
    for (std::size_t byte = 0; byte < count; ++byte) to[byte] = from[byte];
}

/// Bytes `at` to `at` + 31 of a row; 0 from `end` on, where nothing is read.
static inline __m256i Load(const void* row, std::size_t at, std::size_t end) {
    const auto* const bytes = static_cast<const std::uint8_t*>(row);
    if (at + VectorBytes <= end) return LoadVector(bytes + at);
    if (at >= end) return _mm256_setzero_si256();
    std::uint8_t rest[VectorBytes] = {};
    CopyBytes(bytes + at, rest, end - at);
    return LoadVector(rest);
}

static inline void Store(void* row, std::size_t at, std::size_t end, __m256i value) {
    auto* const bytes = static_cast<std::uint8_t*>(row);
    if (at + VectorBytes <= end) {
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(bytes + at), value);
    } else if (at < end) {
        std::uint8_t rest[VectorBytes];
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(rest), value);
        CopyBytes(rest, bytes + at, end - at);
    }
}

/// Puts the middle quarters of a vector in each other's place: what has been packed or will be
/// unpacked lane by lane stands in the order of the row.
static inline __m256i SwapMiddle(__m256i vector) {
    return _mm256_permute4x64_epi64(vector, 0xD8);
}

/// The loops that enlarge; contracts are those of the fields of RowKernels.
namespace AVX2Rows {

void Double8(const std::uint8_t* row, std::uint8_t* output, std::size_t count);
void Double16(const Word* row, Word* output, std::size_t count);

void LinearRow8(const std::uint8_t* row, const LinearPlan& plan, std::uint16_t* output);
void LinearColumn8(const std::uint16_t* upper, const std::uint16_t* lower, std::int32_t weight,
                   std::uint8_t* output, std::size_t count);
void LinearColumnPair8(const std::uint16_t* upper, const std::uint16_t* lower,
                       const std::int32_t weights[2], std::uint8_t* const outputs[2],
                       std::size_t count);
void LinearRow16(const Word* row, const LinearPlan& plan, std::uint16_t* output);
void LinearColumn16(const std::uint16_t* upper, const std::uint16_t* lower, std::int32_t weight,
                    Word* output, std::size_t count);
void LinearColumnPair16(const std::uint16_t* upper, const std::uint16_t* lower,
                        const std::int32_t weights[2], Word* const outputs[2], std::size_t count);

void CubicRow8(const std::uint8_t* row, const CubicPlan& plan, float* output);
void CubicRow16(const Word* row, const CubicPlan& plan, float* output);
void CubicColumn8(const float* const rows[4], const CubicWeights& weights, std::uint8_t* output,
                  std::size_t count);
void CubicColumn16(const float* const rows[4], const CubicWeights& weights, Word* output,
                   std::size_t count);
void CubicColumnPair8(const float* const rows[4], const CubicWeights weights[2],
                      std::uint8_t* const outputs[2], std::size_t count);
void CubicColumnPair16(const float* const rows[4], const CubicWeights weights[2],
                       Word* const outputs[2], std::size_t count);

}  // namespace AVX2Rows

}  // namespace ZV
