#include "imaging/kernels/avx512_rows.h"

// The column passes. One body makes one output row or two: what the rows that both are made of have
// in common is worked out once.

namespace ZV {

namespace {

constexpr std::int32_t WeightOne = 16384;

/// Vectors that lie wholly inside their rows.
struct WholeVectors {
    static __m512i LoadWords(const void* row, std::size_t at) {
        return _mm512_loadu_si512(static_cast<const std::uint8_t*>(row) + 2 * at);
    }
    static __m512 LoadSingles(const float* row, std::size_t at) {
        return _mm512_loadu_ps(row + at);
    }
    static void StoreBytes(std::uint8_t* row, std::size_t at, __m512i value) {
        _mm512_storeu_si512(row + at, value);
    }
    static void StoreWords(Word* row, std::size_t at, __m512i value) {
        _mm512_storeu_si512(row + at, value);
    }
};

/// The last vectors of rows of `count` samples.
struct LastVectors {
    std::size_t count;

    __m512i LoadWords(const void* row, std::size_t at) const {
        return Load(row, 2 * at, 2 * count);
    }
    __m512 LoadSingles(const float* row, std::size_t at) const {
        return _mm512_castsi512_ps(Load(row, 4 * at, 4 * count));
    }
    void StoreBytes(std::uint8_t* row, std::size_t at, __m512i value) const {
        Store(row, at, count, value);
    }
    void StoreWords(Word* row, std::size_t at, __m512i value) const {
        Store(row, 2 * at, 2 * count, value);
    }
};

struct DwordPlaces {
    std::uint32_t places[16];
};

struct QwordPlaces {
    std::uint64_t places[8];
};

/// Where four vectors of numbers that were packed twice, lane by lane, have their parts.
constexpr DwordPlaces MakeTwicePackedPlaces() {
    DwordPlaces made{};
    for (std::uint32_t place = 0; place < 16; ++place) {
        made.places[place] = 4 * (place % 4) + place / 4;
    }
    return made;
}

/// The same of two vectors that were packed once.
constexpr QwordPlaces MakeOncePackedPlaces() {
    QwordPlaces made{};
    for (std::uint64_t place = 0; place < 8; ++place) {
        made.places[place] = 2 * (place % 4) + place / 4;
    }
    return made;
}

constexpr DwordPlaces TwicePacked = MakeTwicePackedPlaces();
constexpr QwordPlaces OncePacked = MakeOncePackedPlaces();

inline __m512i OrderOncePacked(__m512i packed) {
    return _mm512_permutexvar_epi64(LoadPlaces(&OncePacked), packed);
}

template <std::size_t Rows>
struct RowWeights {
    __m512i doubled[Rows];
};

template <std::size_t Rows>
inline RowWeights<Rows> DoubleWeights(const std::int32_t* weights) {
    RowWeights<Rows> made;
    for (std::size_t row = 0; row < Rows; ++row) {
        made.doubled[row] = _mm512_set1_epi16(static_cast<std::int16_t>(2 * weights[row]));
    }
    return made;
}

// (lower * f + upper * (16384 - f) + half) >> 20 is (upper + 32 + floor(difference * f / 16384))
// >> 6, and the floor is the high word of twice the difference times twice f: the samples, with 6
// fractional bits, are at most 16320, and so all of it fits words.

/// 64 samples of every output row.
template <std::size_t Rows, typename Vectors>
inline void LinearSamples8(Vectors vectors, const std::uint16_t* upper, const std::uint16_t* lower,
                           const RowWeights<Rows>& weights, std::uint8_t* const (&outputs)[Rows],
                           std::size_t at) {
    __m512i rounded[2], differences[2];
    for (std::size_t half = 0; half < 2; ++half) {
        const __m512i from = vectors.LoadWords(upper, at + 32 * half);
        const __m512i to = vectors.LoadWords(lower, at + 32 * half);
        differences[half] = _mm512_slli_epi16(_mm512_sub_epi16(to, from), 1);
        rounded[half] = _mm512_add_epi16(from, _mm512_set1_epi16(32));
    }
    for (std::size_t row = 0; row < Rows; ++row) {
        const __m512i first =
            _mm512_add_epi16(rounded[0], _mm512_mulhi_epi16(differences[0], weights.doubled[row]));
        const __m512i second =
            _mm512_add_epi16(rounded[1], _mm512_mulhi_epi16(differences[1], weights.doubled[row]));
        const __m512i packed =
            _mm512_packus_epi16(_mm512_srli_epi16(first, 6), _mm512_srli_epi16(second, 6));
        vectors.StoreBytes(outputs[row], at, OrderOncePacked(packed));
    }
}

/// 32 samples of every output row.
template <std::size_t Rows, typename Vectors>
inline void LinearSamples16(Vectors vectors, const std::uint16_t* upper, const std::uint16_t* lower,
                            const RowWeights<Rows>& weights, Word* const (&outputs)[Rows],
                            std::size_t at) {
    const __m512i from = vectors.LoadWords(upper, at);
    const __m512i to = vectors.LoadWords(lower, at);
    const WordDifferences differences = SubtractWords(from, to);
    for (std::size_t row = 0; row < Rows; ++row) {
        vectors.StoreWords(outputs[row], at, WeightWords(from, differences, weights.doubled[row]));
    }
}

template <std::size_t Rows>
inline void LinearRows8(const std::uint16_t* upper, const std::uint16_t* lower,
                        const std::int32_t* weights, std::uint8_t* const (&outputs)[Rows],
                        std::size_t count) {
    const RowWeights<Rows> doubled = DoubleWeights<Rows>(weights);
    std::size_t at = 0;
    for (; at + 64 <= count; at += 64) {
        LinearSamples8(WholeVectors{}, upper, lower, doubled, outputs, at);
    }
    if (at < count) LinearSamples8(LastVectors{count}, upper, lower, doubled, outputs, at);
}

template <std::size_t Rows>
inline void LinearRows16(const std::uint16_t* upper, const std::uint16_t* lower,
                         const std::int32_t* weights, Word* const (&outputs)[Rows],
                         std::size_t count) {
    const RowWeights<Rows> doubled = DoubleWeights<Rows>(weights);
    std::size_t at = 0;
    for (; at + 32 <= count; at += 32) {
        LinearSamples16(WholeVectors{}, upper, lower, doubled, outputs, at);
    }
    if (at < count) LinearSamples16(LastVectors{count}, upper, lower, doubled, outputs, at);
}

/// Four rows of samples, and twice the first of them.
struct CubicTerms {
    __m512 doubled, first, second, third;
};

template <typename Vectors>
inline CubicTerms TakeTerms(Vectors vectors, const float* const (&rows)[4], std::size_t at) {
    const __m512 a = vectors.LoadSingles(rows[0], at), c = vectors.LoadSingles(rows[1], at);
    const __m512 d = vectors.LoadSingles(rows[2], at), e = vectors.LoadSingles(rows[3], at);
    const __m512 first = _mm512_sub_ps(c, a);
    const __m512 second = _mm512_sub_ps(_mm512_sub_ps(d, c), first);
    const __m512 twice = _mm512_add_ps(d, d);
    const __m512 third = _mm512_sub_ps(_mm512_add_ps(_mm512_sub_ps(c, twice), e), second);
    return {_mm512_add_ps(a, a), first, second, third};
}

/// Twice the weights: twice the value, rounded alike.
struct DoubledWeights {
    __m512 first, second, third;
};

template <std::size_t Rows>
struct CubicRowWeights {
    DoubledWeights rows[Rows];
};

template <std::size_t Rows>
inline CubicRowWeights<Rows> DoubleWeights(const CubicWeights* weights) {
    CubicRowWeights<Rows> made;
    for (std::size_t row = 0; row < Rows; ++row) {
        made.rows[row] = {_mm512_set1_ps(2 * weights[row].first),
                          _mm512_set1_ps(2 * weights[row].second),
                          _mm512_set1_ps(2 * weights[row].third)};
    }
    return made;
}

// Adding 0.5000001 in double precision and cutting the fraction off rounds halves up, and so it
// does with the three numbers in single precision just below 0.5. Twice these lie up to this far
// below 1. Above 1 numbers lie too far apart to come that close to a whole one; rounded down, the
// sum is then not lifted.
constexpr float Lift = 3 * 0x1p-24F;

/// Twice the value, its fraction cut off downward: 1 more and halved, it is the rounded value.
inline __m512i CubicHalves(const CubicTerms& terms, const DoubledWeights& weights) {
    constexpr int Down = _MM_FROUND_TO_NEG_INF | _MM_FROUND_NO_EXC;
    const __m512 linear = _mm512_add_ps(terms.doubled, _mm512_mul_ps(weights.first, terms.first));
    const __m512 quadratic = _mm512_add_ps(linear, _mm512_mul_ps(weights.second, terms.second));
    const __m512 value = _mm512_add_ps(quadratic, _mm512_mul_ps(weights.third, terms.third));
    return _mm512_cvt_roundps_epi32(_mm512_add_round_ps(value, _mm512_set1_ps(Lift), Down), Down);
}

inline __m512i RoundHalves16(__m512i first, __m512i second) {
    const __m512i one = _mm512_set1_epi16(1);
    return _mm512_srai_epi16(_mm512_adds_epi16(_mm512_packs_epi32(first, second), one), 1);
}

inline __m512i RoundHalves32(__m512i halves) {
    return _mm512_srai_epi32(_mm512_add_epi32(halves, _mm512_set1_epi32(1)), 1);
}

/// 64 samples of every output row.
template <std::size_t Rows, typename Vectors>
inline void CubicSamples8(Vectors vectors, const float* const (&rows)[4],
                          const CubicRowWeights<Rows>& weights,
                          std::uint8_t* const (&outputs)[Rows], std::size_t at) {
    __m512i words[Rows][2];
    for (std::size_t half = 0; half < 2; ++half) {
        const CubicTerms lower = TakeTerms(vectors, rows, at + 32 * half);
        const CubicTerms upper = TakeTerms(vectors, rows, at + 32 * half + 16);
        for (std::size_t row = 0; row < Rows; ++row) {
            words[row][half] = RoundHalves16(CubicHalves(lower, weights.rows[row]),
                                             CubicHalves(upper, weights.rows[row]));
        }
    }
    for (std::size_t row = 0; row < Rows; ++row) {
        const __m512i packed = _mm512_packus_epi16(words[row][0], words[row][1]);
        vectors.StoreBytes(outputs[row], at,
                           _mm512_permutexvar_epi32(LoadPlaces(&TwicePacked), packed));
    }
}

/// 32 samples of every output row.
template <std::size_t Rows, typename Vectors>
inline void CubicSamples16(Vectors vectors, const float* const (&rows)[4],
                           const CubicRowWeights<Rows>& weights, Word* const (&outputs)[Rows],
                           std::size_t at) {
    const CubicTerms lower = TakeTerms(vectors, rows, at);
    const CubicTerms upper = TakeTerms(vectors, rows, at + 16);
    for (std::size_t row = 0; row < Rows; ++row) {
        const __m512i packed =
            _mm512_packus_epi32(RoundHalves32(CubicHalves(lower, weights.rows[row])),
                                RoundHalves32(CubicHalves(upper, weights.rows[row])));
        vectors.StoreWords(outputs[row], at, OrderOncePacked(packed));
    }
}

template <std::size_t Rows>
inline void CubicRows8(const float* const (&rows)[4], const CubicWeights* weights,
                       std::uint8_t* const (&outputs)[Rows], std::size_t count) {
    const CubicRowWeights<Rows> doubled = DoubleWeights<Rows>(weights);
    std::size_t at = 0;
    for (; at + 64 <= count; at += 64) CubicSamples8(WholeVectors{}, rows, doubled, outputs, at);
    if (at < count) CubicSamples8(LastVectors{count}, rows, doubled, outputs, at);
}

template <std::size_t Rows>
inline void CubicRows16(const float* const (&rows)[4], const CubicWeights* weights,
                        Word* const (&outputs)[Rows], std::size_t count) {
    const CubicRowWeights<Rows> doubled = DoubleWeights<Rows>(weights);
    std::size_t at = 0;
    for (; at + 32 <= count; at += 32) CubicSamples16(WholeVectors{}, rows, doubled, outputs, at);
    if (at < count) CubicSamples16(LastVectors{count}, rows, doubled, outputs, at);
}

}  // namespace

void AVX512Rows::LinearColumn8(const std::uint16_t* upper, const std::uint16_t* lower,
                               std::int32_t weight, std::uint8_t* output, std::size_t count) {
    // Twice a whole weight is no signed word.
    if (weight == WeightOne) return LinearColumn8(lower, lower, 0, output, count);
    LinearRows8<1>(upper, lower, &weight, {output}, count);
}

void AVX512Rows::LinearColumnPair8(const std::uint16_t* upper, const std::uint16_t* lower,
                                   const std::int32_t weights[2], std::uint8_t* const outputs[2],
                                   std::size_t count) {
    if (weights[0] != WeightOne && weights[1] != WeightOne) {
        return LinearRows8<2>(upper, lower, weights, {outputs[0], outputs[1]}, count);
    }
    LinearColumn8(upper, lower, weights[0], outputs[0], count);
    LinearColumn8(upper, lower, weights[1], outputs[1], count);
}

void AVX512Rows::LinearColumn16(const std::uint16_t* upper, const std::uint16_t* lower,
                                std::int32_t weight, Word* output, std::size_t count) {
    if (weight == WeightOne) return LinearColumn16(lower, lower, 0, output, count);
    LinearRows16<1>(upper, lower, &weight, {output}, count);
}

void AVX512Rows::LinearColumnPair16(const std::uint16_t* upper, const std::uint16_t* lower,
                                    const std::int32_t weights[2], Word* const outputs[2],
                                    std::size_t count) {
    if (weights[0] != WeightOne && weights[1] != WeightOne) {
        return LinearRows16<2>(upper, lower, weights, {outputs[0], outputs[1]}, count);
    }
    LinearColumn16(upper, lower, weights[0], outputs[0], count);
    LinearColumn16(upper, lower, weights[1], outputs[1], count);
}

void AVX512Rows::CubicColumn8(const float* const rows[4], const CubicWeights& weights,
                              std::uint8_t* output, std::size_t count) {
    CubicRows8<1>({rows[0], rows[1], rows[2], rows[3]}, &weights, {output}, count);
}

void AVX512Rows::CubicColumnPair8(const float* const rows[4], const CubicWeights weights[2],
                                  std::uint8_t* const outputs[2], std::size_t count) {
    CubicRows8<2>({rows[0], rows[1], rows[2], rows[3]}, weights, {outputs[0], outputs[1]}, count);
}

void AVX512Rows::CubicColumn16(const float* const rows[4], const CubicWeights& weights,
                               Word* output, std::size_t count) {
    CubicRows16<1>({rows[0], rows[1], rows[2], rows[3]}, &weights, {output}, count);
}

void AVX512Rows::CubicColumnPair16(const float* const rows[4], const CubicWeights weights[2],
                                   Word* const outputs[2], std::size_t count) {
    CubicRows16<2>({rows[0], rows[1], rows[2], rows[3]}, weights, {outputs[0], outputs[1]}, count);
}

}  // namespace ZV
