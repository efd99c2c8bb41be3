#include "imaging/kernels/avx2_rows.h"

namespace ZV {

namespace {

constexpr std::size_t GroupOutputs = 8;

inline __m256 LoadSingles(const float* row, std::size_t at, std::size_t end) {
    return _mm256_castsi256_ps(Load(row, 4 * at, 4 * end));
}

// Sums of two unsigned words, weighted to 16384, by the multiplication of signed words: the words
// are moved down by 32768 and the sum up by 16384 times as much, together with the half.
constexpr std::int32_t MovedHalf = 32768 * 16384 + 8192;

inline __m256i MoveWordsDown(__m256i words) {
    return _mm256_xor_si256(words, _mm256_set1_epi16(-32768));
}

inline __m256i WeightMovedPairs(__m256i pairs, __m256i weights) {
    const __m256i sum = _mm256_madd_epi16(pairs, weights);
    return _mm256_srli_epi32(_mm256_add_epi32(sum, _mm256_set1_epi32(MovedHalf)), 14);
}

inline __m128i LoadRun(const std::uint8_t* row, std::int32_t base, std::size_t sampleBytes) {
    const std::size_t at = static_cast<std::size_t>(base) * sampleBytes;
    return _mm_loadu_si128(reinterpret_cast<const __m128i*>(row + at));
}

/// Groups `group` and `group` + 1: 16 outputs.
inline void LinearGroups8(const std::uint8_t* row, const LinearPlan& plan, std::size_t group,
                          std::uint16_t* output) {
    const std::int32_t* const bases = plan.bases + group;
    const std::int16_t* const weights = plan.weights + 16 * group;
    const __m256i runs = _mm256_inserti128_si256(_mm256_castsi128_si256(LoadRun(row, bases[0], 1)),
                                                 LoadRun(row, bases[1], 1), 1);
    const __m256i pairs = _mm256_shuffle_epi8(runs, LoadVector(plan.pairs + 16 * group));
    const __m256i none = _mm256_setzero_si256(), half = _mm256_set1_epi32(128);
    const __m256i first = LoadVector(weights), second = LoadVector(weights + 16);
    // Outputs 0 to 3 and 4 to 7 of both groups.
    const __m256i lower = _mm256_madd_epi16(_mm256_unpacklo_epi8(pairs, none),
                                            _mm256_permute2x128_si256(first, second, 0x20));
    const __m256i upper = _mm256_madd_epi16(_mm256_unpackhi_epi8(pairs, none),
                                            _mm256_permute2x128_si256(first, second, 0x31));
    const __m256i words = _mm256_packus_epi32(_mm256_srli_epi32(_mm256_add_epi32(lower, half), 8),
                                              _mm256_srli_epi32(_mm256_add_epi32(upper, half), 8));
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(output + GroupOutputs * group), words);
}

inline __m256i WeightGroup16(const std::uint8_t* row, const LinearPlan& plan, std::size_t group) {
    const __m256i run = _mm256_broadcastsi128_si256(LoadRun(row, plan.bases[group], 2));
    const __m256i pairs =
        _mm256_shuffle_epi8(MoveWordsDown(run), LoadVector(plan.pairs + 32 * group));
    return WeightMovedPairs(pairs, LoadVector(plan.weights + 16 * group));
}

inline void LinearGroups16(const std::uint8_t* row, const LinearPlan& plan, std::size_t group,
                           std::uint16_t* output) {
    const __m256i words =
        _mm256_packus_epi32(WeightGroup16(row, plan, group), WeightGroup16(row, plan, group + 1));
    _mm256_storeu_si256(reinterpret_cast<__m256i*>(output + GroupOutputs * group),
                        SwapMiddle(words));
}

inline __m256i PairWeights(std::int32_t lowerWeight) {
    return _mm256_set1_epi32(lowerWeight << 16 | (16384 - lowerWeight));
}

/// 16 samples, as words, from rows of words up to 16320.
inline __m256i WeightRows8(__m256i upper, __m256i lower, __m256i weights) {
    const __m256i half = _mm256_set1_epi32(0x80000);
    const __m256i first = _mm256_madd_epi16(_mm256_unpacklo_epi16(upper, lower), weights);
    const __m256i second = _mm256_madd_epi16(_mm256_unpackhi_epi16(upper, lower), weights);
    return _mm256_packus_epi32(_mm256_srli_epi32(_mm256_add_epi32(first, half), 20),
                               _mm256_srli_epi32(_mm256_add_epi32(second, half), 20));
}

struct VectorWeights {
    __m256 first, second, third;
};

inline __m256 EvaluateCubic(__m256 a, __m256 c, __m256 d, __m256 e, const VectorWeights& weights) {
    const __m256 first = _mm256_sub_ps(c, a);
    const __m256 second = _mm256_sub_ps(_mm256_sub_ps(d, c), first);
    const __m256 twice = _mm256_add_ps(d, d);
    const __m256 third = _mm256_sub_ps(_mm256_add_ps(_mm256_sub_ps(c, twice), e), second);
    const __m256 linear = _mm256_add_ps(a, _mm256_mul_ps(weights.first, first));
    const __m256 quadratic = _mm256_add_ps(linear, _mm256_mul_ps(weights.second, second));
    return _mm256_add_ps(quadratic, _mm256_mul_ps(weights.third, third));
}

float EvaluateCubic(float a, float c, float d, float e, const CubicWeights& weights) {
    const float first = c - a;
    const float second = d - c - first;
    const float third = c - 2.0F * d + e - second;
    return a + weights.first * first + weights.second * second + weights.third * third;
}

/// One group: 8 outputs. `samples` holds its eight samples.
inline void CubicGroup(__m256i samples, const CubicPlan& plan, std::size_t group, float* output) {
    const std::size_t at = GroupOutputs * group;
    const __m256i one = _mm256_set1_epi32(1);
    const __m256 values = _mm256_cvtepi32_ps(samples);
    const __m256i a = LoadVector(plan.places + at);
    const __m256i c = _mm256_add_epi32(a, one);
    const __m256i d = _mm256_add_epi32(c, one);
    const __m256i e = _mm256_add_epi32(d, one);
    const VectorWeights weights = {_mm256_loadu_ps(plan.first + at),
                                   _mm256_loadu_ps(plan.second + at),
                                   _mm256_loadu_ps(plan.third + at)};
    const __m256 result = EvaluateCubic(
        _mm256_permutevar8x32_ps(values, a), _mm256_permutevar8x32_ps(values, c),
        _mm256_permutevar8x32_ps(values, d), _mm256_permutevar8x32_ps(values, e), weights);
    _mm256_storeu_ps(output + at, result);
}

// Adding 0.5000001 in double precision and cutting the fraction off rounds halves up, and so it
// does with the three numbers in single precision just below 0.5, of which this is the least. Above
// 1 such numbers lie too far apart to come that close to a half.
constexpr float LeastRoundedToOne = 0x1.fffffap-2F;

/// Samples of four rows, rounded and held between 0 and `top`.
inline __m256i CubicSamples(const float* const rows[4], std::size_t at, std::size_t end,
                            const VectorWeights& weights, __m256 top) {
    const __m256 half = _mm256_set1_ps(0.5F);
    const __m256 value =
        EvaluateCubic(LoadSingles(rows[0], at, end), LoadSingles(rows[1], at, end),
                      LoadSingles(rows[2], at, end), LoadSingles(rows[3], at, end), weights);
    const __m256 held = _mm256_min_ps(value, top);
    const __m256 isNearHalf = _mm256_cmp_ps(held, _mm256_set1_ps(LeastRoundedToOne), _CMP_GE_OQ);
    const __m256 lifted = _mm256_max_ps(held, _mm256_and_ps(isNearHalf, half));
    return _mm256_cvttps_epi32(_mm256_add_ps(lifted, half));
}

inline VectorWeights SpreadWeights(const CubicWeights& weights) {
    return {_mm256_set1_ps(weights.first), _mm256_set1_ps(weights.second),
            _mm256_set1_ps(weights.third)};
}

/// 16 samples as words, not in the order of the row.
inline __m256i CubicWords(const float* const rows[4], std::size_t at, std::size_t end,
                          const VectorWeights& weights, __m256 top) {
    return _mm256_packus_epi32(CubicSamples(rows, at, end, weights, top),
                               CubicSamples(rows, at + 8, end, weights, top));
}

}  // namespace

void AVX2Rows::Double8(const std::uint8_t* row, std::uint8_t* output, std::size_t count) {
    const std::size_t rowEnd = (count + 1) / 2;
    for (std::size_t at = 0; at < rowEnd; at += VectorBytes) {
        const __m256i samples = SwapMiddle(Load(row, at, rowEnd));
        Store(output, 2 * at, count, _mm256_unpacklo_epi8(samples, samples));
        Store(output, 2 * at + VectorBytes, count, _mm256_unpackhi_epi8(samples, samples));
    }
}

void AVX2Rows::Double16(const Word* row, Word* output, std::size_t count) {
    const std::size_t rowEnd = 2 * ((count + 1) / 2), end = 2 * count;
    for (std::size_t at = 0; at < rowEnd; at += VectorBytes) {
        const __m256i samples = SwapMiddle(Load(row, at, rowEnd));
        Store(output, 2 * at, end, _mm256_unpacklo_epi16(samples, samples));
        Store(output, 2 * at + VectorBytes, end, _mm256_unpackhi_epi16(samples, samples));
    }
}

void AVX2Rows::LinearRow8(const std::uint8_t* row, const LinearPlan& plan, std::uint16_t* output) {
    std::size_t done = 0;
    if (plan.groupCount >= 2) {
        for (; done + 2 <= plan.groupCount; done += 2) LinearGroups8(row, plan, done, output);
        LinearGroups8(row, plan, plan.groupCount - 2, output);
        done = GroupOutputs * plan.groupCount;
    }
    for (; done < plan.count; ++done) {
        const std::uint8_t* const pair = row + plan.positions[done].index;
        const std::int32_t weight = plan.positions[done].weight;
        const std::int32_t sum = (16384 - weight) * pair[0] + weight * pair[1] + 128;
        output[done] = static_cast<std::uint16_t>(sum >> 8);
    }
}

void AVX2Rows::LinearRow16(const Word* row, const LinearPlan& plan, std::uint16_t* output) {
    const auto* const bytes = reinterpret_cast<const std::uint8_t*>(row);
    std::size_t done = 0;
    if (plan.groupCount >= 2) {
        for (; done + 2 <= plan.groupCount; done += 2) LinearGroups16(bytes, plan, done, output);
        LinearGroups16(bytes, plan, plan.groupCount - 2, output);
        done = GroupOutputs * plan.groupCount;
    }
    for (; done < plan.count; ++done) {
        const Word* const pair = row + plan.positions[done].index;
        const std::int32_t weight = plan.positions[done].weight;
        const std::int32_t sum = (16384 - weight) * pair[0].value + weight * pair[1].value + 8192;
        output[done] = static_cast<std::uint16_t>(sum >> 14);
    }
}

void AVX2Rows::LinearColumn8(const std::uint16_t* upper, const std::uint16_t* lower,
                             std::int32_t weight, std::uint8_t* output, std::size_t count) {
    const __m256i weights = PairWeights(weight);
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += 2 * VectorBytes) {
        const std::size_t next = at + VectorBytes;
        const __m256i first = WeightRows8(Load(upper, at, end), Load(lower, at, end), weights);
        const __m256i second = WeightRows8(Load(upper, next, end), Load(lower, next, end), weights);
        Store(output, at / 2, count, SwapMiddle(_mm256_packus_epi16(first, second)));
    }
}

void AVX2Rows::LinearColumn16(const std::uint16_t* upper, const std::uint16_t* lower,
                              std::int32_t weight, Word* output, std::size_t count) {
    const __m256i weights = PairWeights(weight);
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        const __m256i a = MoveWordsDown(Load(upper, at, end));
        const __m256i b = MoveWordsDown(Load(lower, at, end));
        const __m256i first = WeightMovedPairs(_mm256_unpacklo_epi16(a, b), weights);
        const __m256i second = WeightMovedPairs(_mm256_unpackhi_epi16(a, b), weights);
        Store(output, at, end, _mm256_packus_epi32(first, second));
    }
}

void AVX2Rows::CubicRow8(const std::uint8_t* row, const CubicPlan& plan, float* output) {
    for (std::size_t group = 0; group < plan.groupCount; ++group) {
        const __m128i run =
            _mm_loadl_epi64(reinterpret_cast<const __m128i*>(row + plan.bases[group]));
        CubicGroup(_mm256_cvtepu8_epi32(run), plan, group, output);
    }
    for (std::size_t index = GroupOutputs * plan.groupCount; index < plan.count; ++index) {
        const std::uint8_t* const four = row + plan.positions[index].index;
        output[index] =
            EvaluateCubic(four[0], four[1], four[2], four[3], plan.positions[index].weights);
    }
}

void AVX2Rows::CubicRow16(const Word* row, const CubicPlan& plan, float* output) {
    for (std::size_t group = 0; group < plan.groupCount; ++group) {
        const __m128i run =
            _mm_loadu_si128(reinterpret_cast<const __m128i*>(row + plan.bases[group]));
        CubicGroup(_mm256_cvtepu16_epi32(run), plan, group, output);
    }
    for (std::size_t index = GroupOutputs * plan.groupCount; index < plan.count; ++index) {
        const Word* const four = row + plan.positions[index].index;
        output[index] = EvaluateCubic(four[0].value, four[1].value, four[2].value, four[3].value,
                                      plan.positions[index].weights);
    }
}

void AVX2Rows::CubicColumn8(const float* const rows[4], const CubicWeights& weights,
                            std::uint8_t* output, std::size_t count) {
    const VectorWeights spread = SpreadWeights(weights);
    const __m256 top = _mm256_set1_ps(255.0F);
    const __m256i order = _mm256_setr_epi32(0, 4, 1, 5, 2, 6, 3, 7);
    for (std::size_t at = 0; at < count; at += 32) {
        const __m256i samples = _mm256_packus_epi16(CubicWords(rows, at, count, spread, top),
                                                    CubicWords(rows, at + 16, count, spread, top));
        Store(output, at, count, _mm256_permutevar8x32_epi32(samples, order));
    }
}

void AVX2Rows::CubicColumn16(const float* const rows[4], const CubicWeights& weights, Word* output,
                             std::size_t count) {
    const VectorWeights spread = SpreadWeights(weights);
    const __m256 top = _mm256_set1_ps(65535.0F);
    for (std::size_t at = 0; at < count; at += 16) {
        const __m256i samples = CubicWords(rows, at, count, spread, top);
        Store(output, 2 * at, 2 * count, SwapMiddle(samples));
    }
}

void AVX2Rows::LinearColumnPair8(const std::uint16_t* upper, const std::uint16_t* lower,
                                 const std::int32_t weights[2], std::uint8_t* const outputs[2],
                                 std::size_t count) {
    LinearColumn8(upper, lower, weights[0], outputs[0], count);
    LinearColumn8(upper, lower, weights[1], outputs[1], count);
}

void AVX2Rows::LinearColumnPair16(const std::uint16_t* upper, const std::uint16_t* lower,
                                  const std::int32_t weights[2], Word* const outputs[2],
                                  std::size_t count) {
    LinearColumn16(upper, lower, weights[0], outputs[0], count);
    LinearColumn16(upper, lower, weights[1], outputs[1], count);
}

void AVX2Rows::CubicColumnPair8(const float* const rows[4], const CubicWeights weights[2],
                                std::uint8_t* const outputs[2], std::size_t count) {
    CubicColumn8(rows, weights[0], outputs[0], count);
    CubicColumn8(rows, weights[1], outputs[1], count);
}

void AVX2Rows::CubicColumnPair16(const float* const rows[4], const CubicWeights weights[2],
                                 Word* const outputs[2], std::size_t count) {
    CubicColumn16(rows, weights[0], outputs[0], count);
    CubicColumn16(rows, weights[1], outputs[1], count);
}

}  // namespace ZV
