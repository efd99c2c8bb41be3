#include "imaging/kernels/avx512_rows.h"

namespace ZV {

namespace {

constexpr std::size_t GroupOutputs = 8;
constexpr std::size_t RunOutputs = 32;

/// Whether the run's samples and outputs all lie inside their rows.
inline bool IsWhole(const LinearPlan& plan, std::size_t run, std::size_t sampleBytes) {
    const auto base = static_cast<std::size_t>(plan.runBases[run]);
    return (base * sampleBytes) + VectorBytes <= plan.sourceCount * sampleBytes &&
           RunOutputs * (run + 1) <= plan.count;
}

inline const std::uint8_t* FindRun(const void* row, const LinearPlan& plan, std::size_t run,
                                   std::size_t sampleBytes) {
    const auto base = static_cast<std::size_t>(plan.runBases[run]);
    return static_cast<const std::uint8_t*>(row) + base * sampleBytes;
}

inline __m512i LoadLastRun(const void* row, const LinearPlan& plan, std::size_t run,
                           std::size_t sampleBytes) {
    const auto base = static_cast<std::size_t>(plan.runBases[run]);
    return Load(row, base * sampleBytes, plan.sourceCount * sampleBytes);
}

/// 64 times the first sample and 64 times the difference, weighted by words with 15 fractional
/// bits, which round as 8 bits less of the product would.
inline __m512i WeightRun8(__m512i samples, const LinearRun& run) {
    const __m512i pairs = _mm512_permutexvar_epi8(LoadPlaces(run.places), samples);
    const __m512i first = _mm512_maddubs_epi16(pairs, _mm512_set1_epi16(0x0040));
    const __m512i difference =
        _mm512_maddubs_epi16(pairs, _mm512_set1_epi16(static_cast<std::int16_t>(0x40C0)));
    const __m512i weights = _mm512_load_si512(run.doubledWeights);
    return _mm512_add_epi16(first, _mm512_mulhrs_epi16(difference, weights));
}

inline __m512i WeightRun16(__m512i samples, const LinearRun& run) {
    const __m512i places = LoadPlaces(run.places);
    const __m512i next = _mm512_add_epi16(places, _mm512_set1_epi16(1));
    const __m512i first = _mm512_permutexvar_epi16(places, samples);
    const WordDifferences differences =
        SubtractWords(first, _mm512_permutexvar_epi16(next, samples));
    return WeightWords(first, differences, _mm512_load_si512(run.doubledWeights));
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

void AVX512Rows::LinearRow8(const std::uint8_t* row, const LinearPlan& linearPlan,
                            std::uint16_t* output) {
    const LinearPlan plan = linearPlan;  // A copy: the stores might alias the plan.
    std::size_t run = 0;
    for (; run < plan.runCount && IsWhole(plan, run, 1); ++run) {
        const __m512i samples = _mm512_loadu_si512(FindRun(row, plan, run, 1));
        _mm512_storeu_si512(output + RunOutputs * run, WeightRun8(samples, plan.runs[run]));
    }
    for (; run < plan.runCount; ++run) {
        const __m512i samples = LoadLastRun(row, plan, run, 1);
        Store(output, 2 * RunOutputs * run, 2 * plan.count, WeightRun8(samples, plan.runs[run]));
    }
    if (plan.runCount != 0) return;
    for (std::size_t index = 0; index < plan.count; ++index) {
        const std::uint8_t* const pair = row + plan.positions[index].index;
        const std::int32_t weight = plan.positions[index].weight;
        const std::int32_t sum = (16384 - weight) * pair[0] + weight * pair[1] + 128;
        output[index] = static_cast<std::uint16_t>(sum >> 8);
    }
}

void AVX512Rows::LinearRow16(const Word* row, const LinearPlan& linearPlan, std::uint16_t* output) {
    const LinearPlan plan = linearPlan;  // A copy: the stores might alias the plan.
    std::size_t run = 0;
    for (; run < plan.runCount && IsWhole(plan, run, 2); ++run) {
        const __m512i samples = _mm512_loadu_si512(FindRun(row, plan, run, 2));
        _mm512_storeu_si512(output + RunOutputs * run, WeightRun16(samples, plan.runs[run]));
    }
    for (; run < plan.runCount; ++run) {
        const __m512i samples = LoadLastRun(row, plan, run, 2);
        Store(output, 2 * RunOutputs * run, 2 * plan.count, WeightRun16(samples, plan.runs[run]));
    }
    if (plan.runCount != 0) return;
    for (std::size_t index = 0; index < plan.count; ++index) {
        const Word* const pair = row + plan.positions[index].index;
        const std::int32_t weight = plan.positions[index].weight;
        const std::int32_t sum = (16384 - weight) * pair[0].value + weight * pair[1].value + 8192;
        output[index] = static_cast<std::uint16_t>(sum >> 14);
    }
}

void AVX512Rows::CubicRow8(const std::uint8_t* row, const CubicPlan& cubicPlan, float* output) {
    const CubicPlan plan = cubicPlan;  // As above.
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

void AVX512Rows::CubicRow16(const Word* row, const CubicPlan& cubicPlan, float* output) {
    const CubicPlan plan = cubicPlan;  // As above.
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

}  // namespace ZV
