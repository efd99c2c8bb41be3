#include "imaging/kernels/avx512_rows.h"

namespace ZV {

namespace {

constexpr std::size_t GroupOutputs = 8;

inline __m512 LoadSingles(const float* row, std::size_t at, std::size_t end) {
    return _mm512_castsi512_ps(Load(row, 4 * at, 4 * end));
}

/// The low words of 32 numbers.
inline __m512i NarrowToWords(__m512i first, __m512i second) {
    return _mm512_permutex2var_epi16(first, LoadPlaces(&Places.evenWords), second);
}

// Sums of two unsigned words, weighted to 16384, by the multiplication of signed words: the words
// are moved down by 32768 and the sum up by 16384 times as much, together with the half.
constexpr std::int32_t MovedHalf = 32768 * 16384 + 8192;

inline __m512i MoveWordsDown(__m512i words) {
    return _mm512_xor_si512(words, _mm512_set1_epi16(-32768));
}

inline __m512i WeightMovedPairs(__m512i pairs, __m512i weights) {
    const __m512i sum = _mm512_madd_epi16(pairs, weights);
    return _mm512_srli_epi32(_mm512_add_epi32(sum, _mm512_set1_epi32(MovedHalf)), 14);
}

/// Four 16 byte runs of a row, one for each of the groups from the first of `bases` on.
inline __m512i LoadRuns(const std::uint8_t* row, const std::int32_t* bases,
                        std::size_t sampleBytes) {
    const auto load = [=](std::size_t group) {
        const std::size_t at = static_cast<std::size_t>(bases[group]) * sampleBytes;
        return _mm_loadu_si128(reinterpret_cast<const __m128i*>(row + at));
    };
    const __m512i runs = _mm512_inserti32x4(_mm512_castsi128_si512(load(0)), load(1), 1);
    return _mm512_inserti32x4(_mm512_inserti32x4(runs, load(2), 2), load(3), 3);
}

/// Groups `group` to `group` + 3: 32 outputs.
inline void LinearGroups8(const std::uint8_t* row, const LinearPlan& plan, std::size_t group,
                          std::uint16_t* output) {
    const std::int16_t* const weights = plan.weights + 16 * group;
    const __m512i runs = LoadRuns(row, plan.bases + group, 1);
    const __m512i pairs = _mm512_shuffle_epi8(runs, _mm512_loadu_si512(plan.pairs + 16 * group));
    const __m512i none = _mm512_setzero_si512();
    const __m512i half = _mm512_set1_epi32(128);
    const __m512i near = _mm512_loadu_si512(weights), far = _mm512_loadu_si512(weights + 32);
    // Outputs 0 to 3 and 4 to 7 of every group.
    const __m512i lower =
        _mm512_madd_epi16(_mm512_unpacklo_epi8(pairs, none), _mm512_shuffle_i64x2(near, far, 0x88));
    const __m512i upper =
        _mm512_madd_epi16(_mm512_unpackhi_epi8(pairs, none), _mm512_shuffle_i64x2(near, far, 0xDD));
    const __m512i words = _mm512_packus_epi32(_mm512_srli_epi32(_mm512_add_epi32(lower, half), 8),
                                              _mm512_srli_epi32(_mm512_add_epi32(upper, half), 8));
    _mm512_storeu_si512(output + GroupOutputs * group, words);
}

inline void LinearGroups16(const std::uint8_t* row, const LinearPlan& plan, std::size_t group,
                           std::uint16_t* output) {
    const std::uint8_t* const pairs = plan.pairs + 32 * group;
    const std::int16_t* const weights = plan.weights + 16 * group;
    const __m512i runs = MoveWordsDown(LoadRuns(row, plan.bases + group, 2));
    // Each run stands beside itself for the lower and the upper half of its group.
    const __m512i near = _mm512_shuffle_i64x2(runs, runs, 0x50);
    const __m512i far = _mm512_shuffle_i64x2(runs, runs, 0xFA);
    const __m512i first = WeightMovedPairs(_mm512_shuffle_epi8(near, _mm512_loadu_si512(pairs)),
                                           _mm512_loadu_si512(weights));
    const __m512i second = WeightMovedPairs(
        _mm512_shuffle_epi8(far, _mm512_loadu_si512(pairs + 64)), _mm512_loadu_si512(weights + 32));
    _mm512_storeu_si512(output + GroupOutputs * group, NarrowToWords(first, second));
}

inline __m512i PairWeights(std::int32_t lowerWeight) {
    return _mm512_set1_epi32(lowerWeight << 16 | (16384 - lowerWeight));
}

/// 32 samples, as words, from rows of words up to 16320.
inline __m512i WeightRows8(__m512i upper, __m512i lower, __m512i weights) {
    const __m512i half = _mm512_set1_epi32(0x80000);
    const __m512i first = _mm512_madd_epi16(_mm512_unpacklo_epi16(upper, lower), weights);
    const __m512i second = _mm512_madd_epi16(_mm512_unpackhi_epi16(upper, lower), weights);
    return _mm512_packus_epi32(_mm512_srli_epi32(_mm512_add_epi32(first, half), 20),
                               _mm512_srli_epi32(_mm512_add_epi32(second, half), 20));
}

struct VectorWeights {
    __m512 first, second, third;
};

inline __m512 EvaluateCubic(__m512 a, __m512 c, __m512 d, __m512 e, const VectorWeights& weights) {
    const __m512 first = _mm512_sub_ps(c, a);
    const __m512 second = _mm512_sub_ps(_mm512_sub_ps(d, c), first);
    const __m512 twice = _mm512_add_ps(d, d);
    const __m512 third = _mm512_sub_ps(_mm512_add_ps(_mm512_sub_ps(c, twice), e), second);
    const __m512 linear = _mm512_add_ps(a, _mm512_mul_ps(weights.first, first));
    const __m512 quadratic = _mm512_add_ps(linear, _mm512_mul_ps(weights.second, second));
    return _mm512_add_ps(quadratic, _mm512_mul_ps(weights.third, third));
}

float EvaluateCubic(float a, float c, float d, float e, const CubicWeights& weights) {
    const float first = c - a;
    const float second = d - c - first;
    const float third = c - 2.0F * d + e - second;
    return a + weights.first * first + weights.second * second + weights.third * third;
}

/// Groups `group` and `group` + 1: 16 outputs. `samples` holds the eight samples of each.
inline void CubicGroups(__m512i samples, const CubicPlan& plan, std::size_t group, float* output) {
    const std::size_t at = GroupOutputs * group;
    const __m512i one = _mm512_set1_epi32(1);
    const __m512i upperGroup = _mm512_maskz_set1_epi32(0xFF00, 8);
    const __m512 values = _mm512_cvtepi32_ps(samples);
    const __m512i a = _mm512_add_epi32(_mm512_loadu_si512(plan.places + at), upperGroup);
    const __m512i c = _mm512_add_epi32(a, one);
    const __m512i d = _mm512_add_epi32(c, one);
    const __m512i e = _mm512_add_epi32(d, one);
    const VectorWeights weights = {_mm512_loadu_ps(plan.first + at),
                                   _mm512_loadu_ps(plan.second + at),
                                   _mm512_loadu_ps(plan.third + at)};
    const __m512 result =
        EvaluateCubic(_mm512_permutexvar_ps(a, values), _mm512_permutexvar_ps(c, values),
                      _mm512_permutexvar_ps(d, values), _mm512_permutexvar_ps(e, values), weights);
    _mm512_storeu_ps(output + at, result);
}

inline __m512i LoadRuns8(const std::uint8_t* row, const std::int32_t* bases) {
    const __m128i first = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(row + bases[0]));
    const __m128i second = _mm_loadl_epi64(reinterpret_cast<const __m128i*>(row + bases[1]));
    return _mm512_cvtepu8_epi32(_mm_unpacklo_epi64(first, second));
}

inline __m512i LoadRuns16(const Word* row, const std::int32_t* bases) {
    const __m128i first = _mm_loadu_si128(reinterpret_cast<const __m128i*>(row + bases[0]));
    const __m128i second = _mm_loadu_si128(reinterpret_cast<const __m128i*>(row + bases[1]));
    return _mm512_cvtepu16_epi32(_mm256_inserti128_si256(_mm256_castsi128_si256(first), second, 1));
}

// Adding 0.5000001 in double precision and cutting the fraction off rounds halves up, and so it
// does with the three numbers in single precision just below 0.5, of which this is the least. Above
// 1 such numbers lie too far apart to come that close to a half.
constexpr float LeastRoundedToOne = 0x1.fffffap-2F;

/// Samples of four rows, rounded and held between 0 and `top`.
inline __m512i CubicSamples(const float* const rows[4], std::size_t at, std::size_t end,
                            const VectorWeights& weights, __m512 top) {
    const __m512 half = _mm512_set1_ps(0.5F);
    const __m512 value =
        EvaluateCubic(LoadSingles(rows[0], at, end), LoadSingles(rows[1], at, end),
                      LoadSingles(rows[2], at, end), LoadSingles(rows[3], at, end), weights);
    const __m512 held = _mm512_min_ps(value, top);
    const __mmask16 isNearHalf =
        _mm512_cmp_ps_mask(held, _mm512_set1_ps(LeastRoundedToOne), _CMP_GE_OQ);
    const __m512 lifted = _mm512_mask_max_ps(held, isNearHalf, held, half);
    const __m512i samples = _mm512_cvttps_epi32(_mm512_add_ps(lifted, half));
    return _mm512_max_epi32(samples, _mm512_setzero_si512());
}

inline VectorWeights SpreadWeights(const CubicWeights& weights) {
    return {_mm512_set1_ps(weights.first), _mm512_set1_ps(weights.second),
            _mm512_set1_ps(weights.third)};
}

}  // namespace

void AVX512Rows::Double8(const std::uint8_t* row, std::uint8_t* output, std::size_t count) {
    const __m512i lower = LoadPlaces(&Places.doubledBytes);
    const __m512i upper = _mm512_add_epi8(lower, _mm512_set1_epi8(32));
    const std::size_t sourceEnd = (count + 1) / 2;
    for (std::size_t at = 0; at < sourceEnd; at += VectorBytes) {
        const __m512i samples = Load(row, at, sourceEnd);
        Store(output, 2 * at, count, _mm512_permutexvar_epi8(lower, samples));
        Store(output, 2 * at + VectorBytes, count, _mm512_permutexvar_epi8(upper, samples));
    }
}

void AVX512Rows::Double16(const Word* row, Word* output, std::size_t count) {
    const __m512i lower = LoadPlaces(&Places.doubledWords);
    const __m512i upper = _mm512_add_epi16(lower, _mm512_set1_epi16(16));
    const std::size_t sourceEnd = 2 * ((count + 1) / 2), end = 2 * count;
    for (std::size_t at = 0; at < sourceEnd; at += VectorBytes) {
        const __m512i samples = Load(row, at, sourceEnd);
        Store(output, 2 * at, end, _mm512_permutexvar_epi16(lower, samples));
        Store(output, 2 * at + VectorBytes, end, _mm512_permutexvar_epi16(upper, samples));
    }
}

void AVX512Rows::LinearRow8(const std::uint8_t* row, const LinearPlan& plan,
                            std::uint16_t* output) {
    std::size_t done = 0;
    if (plan.groupCount >= 4) {
        for (; done + 4 <= plan.groupCount; done += 4) LinearGroups8(row, plan, done, output);
        LinearGroups8(row, plan, plan.groupCount - 4, output);
        done = GroupOutputs * plan.groupCount;
    }
    for (; done < plan.count; ++done) {
        const std::uint8_t* const pair = row + plan.positions[done].index;
        const std::int32_t weight = plan.positions[done].weight;
        const std::int32_t sum = (16384 - weight) * pair[0] + weight * pair[1] + 128;
        output[done] = static_cast<std::uint16_t>(sum >> 8);
    }
}

void AVX512Rows::LinearRow16(const Word* row, const LinearPlan& plan, std::uint16_t* output) {
    const auto* const bytes = reinterpret_cast<const std::uint8_t*>(row);
    std::size_t done = 0;
    if (plan.groupCount >= 4) {
        for (; done + 4 <= plan.groupCount; done += 4) LinearGroups16(bytes, plan, done, output);
        LinearGroups16(bytes, plan, plan.groupCount - 4, output);
        done = GroupOutputs * plan.groupCount;
    }
    for (; done < plan.count; ++done) {
        const Word* const pair = row + plan.positions[done].index;
        const std::int32_t weight = plan.positions[done].weight;
        const std::int32_t sum = (16384 - weight) * pair[0].value + weight * pair[1].value + 8192;
        output[done] = static_cast<std::uint16_t>(sum >> 14);
    }
}

void AVX512Rows::LinearColumn8(const std::uint16_t* upper, const std::uint16_t* lower,
                               std::int32_t weight, std::uint8_t* output, std::size_t count) {
    const __m512i weights = PairWeights(weight);
    const __m512i evenBytes = LoadPlaces(&Places.evenBytes);
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += 2 * VectorBytes) {
        const __m512i first = WeightRows8(Load(upper, at, end), Load(lower, at, end), weights);
        const __m512i second = WeightRows8(Load(upper, at + VectorBytes, end),
                                           Load(lower, at + VectorBytes, end), weights);
        Store(output, at / 2, count, _mm512_permutex2var_epi8(first, evenBytes, second));
    }
}

void AVX512Rows::LinearColumn16(const std::uint16_t* upper, const std::uint16_t* lower,
                                std::int32_t weight, Word* output, std::size_t count) {
    const __m512i weights = PairWeights(weight);
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        const __m512i a = MoveWordsDown(Load(upper, at, end));
        const __m512i b = MoveWordsDown(Load(lower, at, end));
        const __m512i first = WeightMovedPairs(_mm512_unpacklo_epi16(a, b), weights);
        const __m512i second = WeightMovedPairs(_mm512_unpackhi_epi16(a, b), weights);
        Store(output, at, end, _mm512_packus_epi32(first, second));
    }
}

void AVX512Rows::CubicRow8(const std::uint8_t* row, const CubicPlan& plan, float* output) {
    std::size_t done = 0;
    if (plan.groupCount >= 2) {
        for (; done + 2 <= plan.groupCount; done += 2) {
            CubicGroups(LoadRuns8(row, plan.bases + done), plan, done, output);
        }
        const std::size_t last = plan.groupCount - 2;
        CubicGroups(LoadRuns8(row, plan.bases + last), plan, last, output);
        done = GroupOutputs * plan.groupCount;
    }
    for (; done < plan.count; ++done) {
        const std::uint8_t* const four = row + plan.positions[done].index;
        output[done] =
            EvaluateCubic(four[0], four[1], four[2], four[3], plan.positions[done].weights);
    }
}

void AVX512Rows::CubicRow16(const Word* row, const CubicPlan& plan, float* output) {
    std::size_t done = 0;
    if (plan.groupCount >= 2) {
        for (; done + 2 <= plan.groupCount; done += 2) {
            CubicGroups(LoadRuns16(row, plan.bases + done), plan, done, output);
        }
        const std::size_t last = plan.groupCount - 2;
        CubicGroups(LoadRuns16(row, plan.bases + last), plan, last, output);
        done = GroupOutputs * plan.groupCount;
    }
    for (; done < plan.count; ++done) {
        const Word* const four = row + plan.positions[done].index;
        output[done] = EvaluateCubic(four[0].value, four[1].value, four[2].value, four[3].value,
                                     plan.positions[done].weights);
    }
}

void AVX512Rows::CubicColumn8(const float* const rows[4], const CubicWeights& weights,
                              std::uint8_t* output, std::size_t count) {
    const VectorWeights spread = SpreadWeights(weights);
    const __m512 top = _mm512_set1_ps(255.0F);
    const __m512i evenBytes = LoadPlaces(&Places.evenBytes);
    for (std::size_t at = 0; at < count; at += 64) {
        const __m512i a = CubicSamples(rows, at, count, spread, top);
        const __m512i b = CubicSamples(rows, at + 16, count, spread, top);
        const __m512i c = CubicSamples(rows, at + 32, count, spread, top);
        const __m512i d = CubicSamples(rows, at + 48, count, spread, top);
        Store(output, at, count,
              _mm512_permutex2var_epi8(NarrowToWords(a, b), evenBytes, NarrowToWords(c, d)));
    }
}

void AVX512Rows::CubicColumn16(const float* const rows[4], const CubicWeights& weights,
                               Word* output, std::size_t count) {
    const VectorWeights spread = SpreadWeights(weights);
    const __m512 top = _mm512_set1_ps(65535.0F);
    for (std::size_t at = 0; at < count; at += 32) {
        const __m512i a = CubicSamples(rows, at, count, spread, top);
        const __m512i b = CubicSamples(rows, at + 16, count, spread, top);
        Store(output, 2 * at, 2 * count, NarrowToWords(a, b));
    }
}

}  // namespace ZV
