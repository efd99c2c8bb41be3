#pragma once

#include <immintrin.h>

#include <cstddef>
#include <cstdint>

#include "imaging/kernels/row_kernels.h"

// For the sources of the AVX-512 form alone. Nothing in them but intrinsics and static functions:
// an inline function shared with other files could carry these instructions to an older processor.

namespace ZV {

static constexpr std::size_t VectorBytes = 64;

/// Bytes `at` to `at` + 63 of a row; 0 from `end` on, where nothing is read.
static inline __m512i Load(const void* row, std::size_t at, std::size_t end) {
    const auto* const bytes = static_cast<const std::uint8_t*>(row);
    if (at + VectorBytes <= end) return _mm512_loadu_si512(bytes + at);
    if (at >= end) return _mm512_setzero_si512();
    return _mm512_maskz_loadu_epi8(~0ULL >> (VectorBytes - (end - at)), bytes + at);
}

static inline void Store(void* row, std::size_t at, std::size_t end, __m512i value) {
    auto* const bytes = static_cast<std::uint8_t*>(row);
    if (at + VectorBytes <= end) {
        _mm512_storeu_si512(bytes + at, value);
    } else if (at < end) {
        _mm512_mask_storeu_epi8(bytes + at, ~0ULL >> (VectorBytes - (end - at)), value);
    }
}

struct BytePlaces {
    std::uint8_t places[64];
};

struct WordPlaces {
    std::uint16_t places[32];
};

static inline __m512i LoadPlaces(const void* places) {
    return _mm512_loadu_si512(places);
}

/// Places of the even samples of two vectors, of the odd ones, and of doubled samples.
struct SamplePlaces {
    BytePlaces evenBytes, oddBytes, doubledBytes;
    WordPlaces evenWords, oddWords, doubledWords;
};

static constexpr SamplePlaces MakeSamplePlaces() {
    SamplePlaces made{};
    for (std::uint32_t place = 0; place < 64; ++place) {
        made.evenBytes.places[place] = static_cast<std::uint8_t>(2 * place);
        made.oddBytes.places[place] = static_cast<std::uint8_t>(2 * place + 1);
        made.doubledBytes.places[place] = static_cast<std::uint8_t>(place / 2);
    }
    for (std::uint32_t place = 0; place < 32; ++place) {
        made.evenWords.places[place] = static_cast<std::uint16_t>(2 * place);
        made.oddWords.places[place] = static_cast<std::uint16_t>(2 * place + 1);
        made.doubledWords.places[place] = static_cast<std::uint16_t>(place / 2);
    }
    return made;
}

static constexpr SamplePlaces Places = MakeSamplePlaces();

// The difference of two unsigned words may be 65536 more or less than the word that is left of it.
// The rounded product of that word and a weight f, a multiplication of signed words, is then too
// small or too great by 4 * f: the word is negative and should not be, or the reverse.

/// Differences of words, and what tells where they are not their words.
struct WordDifferences {
    __m512i words;
    __mmask32 isNegative, isFalling;
};

static inline WordDifferences SubtractWords(__m512i from, __m512i to) {
    const __m512i words = _mm512_sub_epi16(to, from);
    return {words, _mm512_movepi16_mask(words), _mm512_cmplt_epu16_mask(to, from)};
}

/// (from * (16384 - f) + to * f + 8192) >> 14; `doubled` is twice f, which is below 16384.
static inline __m512i WeightWords(__m512i from, const WordDifferences& differences,
                                  __m512i doubled) {
    const __m512i fourfold = _mm512_add_epi16(doubled, doubled);
    const __m512i share = _mm512_mulhrs_epi16(differences.words, doubled);
    const __m512i sum = _mm512_add_epi16(from, share);
    const __m512i lifted = _mm512_mask_add_epi16(sum, differences.isNegative, sum, fourfold);
    return _mm512_mask_sub_epi16(lifted, differences.isFalling, lifted, fourfold);
}

/// The loops that enlarge; contracts are those of the fields of RowKernels.
namespace AVX512Rows {

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

}  // namespace AVX512Rows

}  // namespace ZV
