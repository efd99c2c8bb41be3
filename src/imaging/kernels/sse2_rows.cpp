// Everything but the row loops of the header is internal: what another file could share with this
// one would be compiled here, for this instruction set, and might be the copy that is linked.

#include "imaging/kernels/sse2_rows.h"

#include <emmintrin.h>

#include <cstddef>
#include <cstdint>

#include "imaging/kernels/row_kernels.h"

namespace ZV {
namespace {

constexpr std::size_t VectorBytes = 16;
constexpr std::size_t VectorWords = 8;
constexpr std::size_t VectorFloats = 4;
constexpr std::size_t GroupOutputs = 8;
constexpr std::int32_t WeightOne = 16384;

inline __m128i Load(const void* from) {
    return _mm_loadu_si128(static_cast<const __m128i*>(from));
}

inline void Store(void* to, __m128i value) {
    _mm_storeu_si128(static_cast<__m128i*>(to), value);
}

inline std::int16_t LoadWord(const void* from) {
    std::int16_t word;
    __builtin_memcpy(&word, from, sizeof word);
    return word;
}

inline std::int32_t LoadDword(const void* from) {
    std::int32_t dword;
    __builtin_memcpy(&dword, from, sizeof dword);
    return dword;
}

// Packing. With the even and the odd samples of the planes A, B, C told apart, as in a0 b0 c0 a1
// b1 c1, three vectors of samples become three vectors of pairs (a0 b0), (c0 a1), (b1 c1), which
// are to be interleaved in turn.

struct Triple {
    __m128i a;
    __m128i b;
    __m128i c;
};

inline Triple PairBytes(const Triple& planes) {
    const __m128i low = _mm_set1_epi16(0x00FF);
    const __m128i high = _mm_set1_epi16(static_cast<std::int16_t>(0xFF00));
    return {_mm_or_si128(_mm_and_si128(planes.a, low), _mm_slli_epi16(planes.b, 8)),
            _mm_or_si128(_mm_and_si128(planes.c, low), _mm_and_si128(planes.a, high)),
            _mm_or_si128(_mm_srli_epi16(planes.b, 8), _mm_and_si128(planes.c, high))};
}

inline Triple PairWords(const Triple& planes) {
    const __m128i low = _mm_set1_epi32(0x0000FFFF);
    const __m128i high = _mm_set1_epi32(static_cast<std::int32_t>(0xFFFF0000));
    return {_mm_or_si128(_mm_and_si128(planes.a, low), _mm_slli_epi32(planes.b, 16)),
            _mm_or_si128(_mm_and_si128(planes.c, low), _mm_and_si128(planes.a, high)),
            _mm_or_si128(_mm_srli_epi32(planes.b, 16), _mm_and_si128(planes.c, high))};
}

template <int Lanes>
inline __m128i TakeLanes(__m128i low, __m128i high) {
    return _mm_castps_si128(_mm_shuffle_ps(_mm_castsi128_ps(low), _mm_castsi128_ps(high), Lanes));
}

inline Triple InterleaveDwords(const Triple& planes) {
    const auto& [a, b, c] = planes;
    const __m128i outer = TakeLanes<_MM_SHUFFLE(3, 1, 2, 0)>(c, a);  // c0 c2 a1 a3
    return {
        TakeLanes<_MM_SHUFFLE(2, 0, 1, 0)>(_mm_unpacklo_epi32(a, b), outer),
        TakeLanes<_MM_SHUFFLE(1, 0, 3, 2)>(_mm_unpacklo_epi32(b, c), _mm_unpackhi_epi32(a, b)),
        TakeLanes<_MM_SHUFFLE(3, 2, 3, 1)>(outer, _mm_unpackhi_epi32(b, c)),
    };
}

template <typename Sample>
inline void StoreTriple(Sample* to, const Triple& value) {
    constexpr std::size_t step = VectorBytes / sizeof(Sample);
    Store(to, value.a);
    Store(to + step, value.b);
    Store(to + 2 * step, value.c);
}

template <std::size_t Planes, typename Sample>
inline void PackOneByOne(const Sample* const* planes, Sample* pixels, std::size_t i,
                         std::size_t count) {
    for (; i < count; ++i) {
        for (std::size_t c = 0; c < Planes; ++c) pixels[Planes * i + c] = planes[c][i];
    }
}

void Pack8x3(const std::uint8_t* const planes[3], std::uint8_t* pixels, std::size_t count) {
    std::size_t i = 0;
    for (; i + VectorBytes <= count; i += VectorBytes) {
        const Triple samples = {Load(planes[0] + i), Load(planes[1] + i), Load(planes[2] + i)};
        StoreTriple(pixels + 3 * i, InterleaveDwords(PairWords(PairBytes(samples))));
    }
    PackOneByOne<3>(planes, pixels, i, count);
}

void Pack16x3(const Word* const planes[3], Word* pixels, std::size_t count) {
    std::size_t i = 0;
    for (; i + VectorWords <= count; i += VectorWords) {
        const Triple samples = {Load(planes[0] + i), Load(planes[1] + i), Load(planes[2] + i)};
        StoreTriple(pixels + 3 * i, InterleaveDwords(PairWords(samples)));
    }
    PackOneByOne<3>(planes, pixels, i, count);
}

// Linear rows. Samples of 16 bits are made signed for the multiplication by 32768 less, which the
// weights, 16384 together, pass on unchanged to the result.

inline __m128i FlipWords(__m128i words) {
    return _mm_xor_si128(words, _mm_set1_epi16(static_cast<std::int16_t>(0x8000)));
}

inline __m128i WeighSigned(__m128i pairs, __m128i weights) {
    const __m128i sum = _mm_madd_epi16(pairs, weights);
    return _mm_srai_epi32(_mm_add_epi32(sum, _mm_set1_epi32(8192)), 14);
}

inline __m128i WeighBytes(__m128i pairs, const std::int16_t* weights) {
    const __m128i sum = _mm_madd_epi16(pairs, Load(weights));
    return _mm_srai_epi32(_mm_add_epi32(sum, _mm_set1_epi32(128)), 8);
}

inline __m128i GatherPairs8(const std::uint8_t* row, const LinearPosition* at) {
    __m128i pairs = _mm_cvtsi32_si128(LoadWord(row + at[0].index));
    pairs = _mm_insert_epi16(pairs, LoadWord(row + at[1].index), 1);
    pairs = _mm_insert_epi16(pairs, LoadWord(row + at[2].index), 2);
    pairs = _mm_insert_epi16(pairs, LoadWord(row + at[3].index), 3);
    pairs = _mm_insert_epi16(pairs, LoadWord(row + at[4].index), 4);
    pairs = _mm_insert_epi16(pairs, LoadWord(row + at[5].index), 5);
    pairs = _mm_insert_epi16(pairs, LoadWord(row + at[6].index), 6);
    return _mm_insert_epi16(pairs, LoadWord(row + at[7].index), 7);
}

inline __m128i JoinDwords(const void* first, const void* second, const void* third,
                          const void* fourth) {
    const __m128i low = _mm_unpacklo_epi32(_mm_cvtsi32_si128(LoadDword(first)),
                                           _mm_cvtsi32_si128(LoadDword(second)));
    const __m128i high = _mm_unpacklo_epi32(_mm_cvtsi32_si128(LoadDword(third)),
                                            _mm_cvtsi32_si128(LoadDword(fourth)));
    return _mm_unpacklo_epi64(low, high);
}

/// The samples of four outputs, a pair of words or four bytes each.
template <typename Sample, typename Position>
inline __m128i GatherDwords(const Sample* row, const Position* at) {
    return JoinDwords(row + at[0].index, row + at[1].index, row + at[2].index, row + at[3].index);
}

void LinearRow8(const std::uint8_t* row, const LinearPlan& plan, std::uint16_t* output) {
    const __m128i zero = _mm_setzero_si128();
    for (std::size_t group = 0; group < plan.groupCount; ++group) {
        const std::size_t i = group * GroupOutputs;
        const __m128i pairs = GatherPairs8(row, plan.positions + i);
        const std::int16_t* weights = plan.weights + 2 * i;
        const __m128i low = WeighBytes(_mm_unpacklo_epi8(pairs, zero), weights);
        const __m128i high = WeighBytes(_mm_unpackhi_epi8(pairs, zero), weights + VectorWords);
        Store(output + i, _mm_packs_epi32(low, high));
    }
    for (std::size_t i = plan.groupCount * GroupOutputs; i < plan.count; ++i) {
        const auto [index, weight] = plan.positions[i];
        const std::int32_t sum = (WeightOne - weight) * row[index] + weight * row[index + 1];
        output[i] = static_cast<std::uint16_t>((sum + 128) >> 8);
    }
}

void LinearRow16(const Word* row, const LinearPlan& plan, std::uint16_t* output) {
    for (std::size_t group = 0; group < plan.groupCount; ++group) {
        const std::size_t i = group * GroupOutputs;
        const LinearPosition* at = plan.positions + i;
        const std::int16_t* weights = plan.weights + 2 * i;
        const __m128i low = WeighSigned(FlipWords(GatherDwords(row, at)), Load(weights));
        const __m128i high =
            WeighSigned(FlipWords(GatherDwords(row, at + 4)), Load(weights + VectorWords));
        Store(output + i, FlipWords(_mm_packs_epi32(low, high)));
    }
    for (std::size_t i = plan.groupCount * GroupOutputs; i < plan.count; ++i) {
        const auto [index, weight] = plan.positions[i];
        const std::int32_t sum =
            (WeightOne - weight) * row[index].value + weight * row[index + 1].value;
        output[i] = static_cast<std::uint16_t>((sum + 8192) >> 14);
    }
}

/// `weights` are those of the upper and of the lower row, in turn.
inline __m128i WeighRows8(__m128i rows, __m128i weights) {
    const __m128i sum = _mm_madd_epi16(rows, weights);
    return _mm_srai_epi32(_mm_add_epi32(sum, _mm_set1_epi32(0x80000)), 20);
}

inline __m128i MixRows8(const std::uint16_t* upper, const std::uint16_t* lower, __m128i weights) {
    const __m128i above = Load(upper);
    const __m128i below = Load(lower);
    return _mm_packs_epi32(WeighRows8(_mm_unpacklo_epi16(above, below), weights),
                           WeighRows8(_mm_unpackhi_epi16(above, below), weights));
}

inline __m128i MixRows16(const std::uint16_t* upper, const std::uint16_t* lower, __m128i weights) {
    const __m128i above = FlipWords(Load(upper));
    const __m128i below = FlipWords(Load(lower));
    const __m128i low = WeighSigned(_mm_unpacklo_epi16(above, below), weights);
    const __m128i high = WeighSigned(_mm_unpackhi_epi16(above, below), weights);
    return FlipWords(_mm_packs_epi32(low, high));
}

inline __m128i JoinRowWeights(std::int32_t weight) {
    return _mm_set1_epi32(weight << 16 | (WeightOne - weight));
}

// Cubic rows. Differences of whole samples are exact in single precision: they are taken of whole
// numbers and converted.

inline __m128 SumTerms(__m128 start, __m128 first, __m128 second, __m128 third, __m128 firstWeight,
                       __m128 secondWeight, __m128 thirdWeight) {
    const __m128 line = _mm_add_ps(start, _mm_mul_ps(firstWeight, first));
    const __m128 parabola = _mm_add_ps(line, _mm_mul_ps(secondWeight, second));
    return _mm_add_ps(parabola, _mm_mul_ps(thirdWeight, third));
}

struct FourSamples {
    __m128i a;
    __m128i c;
    __m128i d;
    __m128i e;
};

inline void StoreCubic(const FourSamples& samples, const CubicPlan& plan, std::size_t i,
                       float* output) {
    const __m128i first = _mm_sub_epi32(samples.c, samples.a);
    const __m128i middle = _mm_sub_epi32(samples.d, samples.c);
    const __m128i last = _mm_sub_epi32(samples.e, samples.d);
    const __m128i second = _mm_sub_epi32(middle, first);
    const __m128i third = _mm_sub_epi32(_mm_sub_epi32(last, middle), second);
    const __m128 value =
        SumTerms(_mm_cvtepi32_ps(samples.a), _mm_cvtepi32_ps(first), _mm_cvtepi32_ps(second),
                 _mm_cvtepi32_ps(third), _mm_loadu_ps(plan.first + i),
                 _mm_loadu_ps(plan.second + i), _mm_loadu_ps(plan.third + i));
    _mm_storeu_ps(output + i, value);
}

inline FourSamples GatherSamples(const std::uint8_t* row, const CubicPosition* at) {
    const __m128i low = _mm_set1_epi32(0xFF);
    const __m128i quads = GatherDwords(row, at);
    return {_mm_and_si128(quads, low), _mm_and_si128(_mm_srli_epi32(quads, 8), low),
            _mm_and_si128(_mm_srli_epi32(quads, 16), low), _mm_srli_epi32(quads, 24)};
}

inline __m128i JoinQwords(const void* first, const void* second) {
    return _mm_unpacklo_epi64(_mm_loadl_epi64(static_cast<const __m128i*>(first)),
                              _mm_loadl_epi64(static_cast<const __m128i*>(second)));
}

inline FourSamples GatherSamples(const Word* row, const CubicPosition* at) {
    const __m128i low = _mm_set1_epi32(0xFFFF);
    const __m128i front = JoinQwords(row + at[0].index, row + at[1].index);
    const __m128i back = JoinQwords(row + at[2].index, row + at[3].index);
    const __m128i ac = TakeLanes<_MM_SHUFFLE(2, 0, 2, 0)>(front, back);
    const __m128i de = TakeLanes<_MM_SHUFFLE(3, 1, 3, 1)>(front, back);
    return {_mm_and_si128(ac, low), _mm_srli_epi32(ac, 16), _mm_and_si128(de, low),
            _mm_srli_epi32(de, 16)};
}

inline float SumTerms(float a, float c, float d, float e, const CubicWeights& weights) {
    const float first = c - a;
    const float second = d - c - first;
    const float third = c - 2 * d + e - second;
    return a + weights.first * first + weights.second * second + weights.third * third;
}

inline float ToSingle(std::uint8_t sample) {
    return sample;
}

inline float ToSingle(Word sample) {
    return sample.value;
}

template <typename Sample>
void CubicRow(const Sample* row, const CubicPlan& plan, float* output) {
    for (std::size_t i = 0; i < plan.groupCount * GroupOutputs; i += VectorFloats) {
        StoreCubic(GatherSamples(row, plan.positions + i), plan, i, output);
    }
    for (std::size_t i = plan.groupCount * GroupOutputs; i < plan.count; ++i) {
        const Sample* from = row + plan.positions[i].index;
        output[i] = SumTerms(ToSingle(from[0]), ToSingle(from[1]), ToSingle(from[2]),
                             ToSingle(from[3]), plan.positions[i].weights);
    }
}

/// Of 0.5000001, added in double precision, a fraction from 0.4999999 upward makes a whole number;
/// of those that single precision has, this is the least.
constexpr float LeastFractionUp = 0x1.FFFFFAp-2F;

/// Four samples of a column pass: 0.5000001 added, the fraction cut off.
inline __m128i RoundSingles(__m128 values) {
    const __m128i whole = _mm_cvttps_epi32(values);
    const __m128 fraction = _mm_sub_ps(values, _mm_cvtepi32_ps(whole));
    const __m128 isUp = _mm_cmpge_ps(fraction, _mm_set1_ps(LeastFractionUp));
    return _mm_sub_epi32(whole, _mm_castps_si128(isUp));
}

inline __m128i MixCubic(const float* const rows[4], std::size_t i, const CubicWeights& weights) {
    const __m128 a = _mm_loadu_ps(rows[0] + i);
    const __m128 c = _mm_loadu_ps(rows[1] + i);
    const __m128 d = _mm_loadu_ps(rows[2] + i);
    const __m128 e = _mm_loadu_ps(rows[3] + i);
    const __m128 first = _mm_sub_ps(c, a);
    const __m128 second = _mm_sub_ps(_mm_sub_ps(d, c), first);
    const __m128 third = _mm_sub_ps(_mm_add_ps(_mm_sub_ps(c, _mm_add_ps(d, d)), e), second);
    return RoundSingles(SumTerms(a, first, second, third, _mm_set1_ps(weights.first),
                                 _mm_set1_ps(weights.second), _mm_set1_ps(weights.third)));
}

/// Eight samples, held within the range of signed words.
inline __m128i MixCubicWords(const float* const rows[4], std::size_t i,
                             const CubicWeights& weights) {
    const __m128i low = MixCubic(rows, i, weights);
    return _mm_packs_epi32(low, MixCubic(rows, i + VectorFloats, weights));
}

/// The sample at `i`, which need not be followed by others.
inline std::int32_t MixCubicOnce(const float* const rows[4], std::size_t i,
                                 const CubicWeights& weights, std::int32_t greatest) {
    const float sum = SumTerms(rows[0][i], rows[1][i], rows[2][i], rows[3][i], weights);
    const std::int32_t whole = _mm_cvttsd_si32(_mm_set_sd(static_cast<double>(sum) + 0.5000001));
    return whole < 0 ? 0 : (whole > greatest ? greatest : whole);
}

void Split16(const Word* row, Word* even, Word* odd, std::size_t count) {
    std::size_t i = 0;
    for (; i + VectorWords <= count; i += VectorWords) {
        const __m128i low = Load(row + 2 * i);
        const __m128i high = Load(row + 2 * i + VectorWords);
        // Made signed, a word passes through the packing unchanged.
        Store(even + i, _mm_packs_epi32(_mm_srai_epi32(_mm_slli_epi32(low, 16), 16),
                                        _mm_srai_epi32(_mm_slli_epi32(high, 16), 16)));
        Store(odd + i, _mm_packs_epi32(_mm_srai_epi32(low, 16), _mm_srai_epi32(high, 16)));
    }
    for (; i < count; ++i) {
        even[i] = row[2 * i];
        odd[i] = row[2 * i + 1];
    }
}

}  // namespace

namespace SSE2Rows {

void Pack8x4(const std::uint8_t* const planes[4], std::uint8_t* pixels, std::size_t count) {
    std::size_t i = 0;
    for (; i + VectorBytes <= count; i += VectorBytes) {
        const __m128i a = Load(planes[0] + i);
        const __m128i b = Load(planes[1] + i);
        const __m128i c = Load(planes[2] + i);
        const __m128i d = Load(planes[3] + i);
        const __m128i abLow = _mm_unpacklo_epi8(a, b);
        const __m128i abHigh = _mm_unpackhi_epi8(a, b);
        const __m128i cdLow = _mm_unpacklo_epi8(c, d);
        const __m128i cdHigh = _mm_unpackhi_epi8(c, d);
        std::uint8_t* to = pixels + 4 * i;
        Store(to, _mm_unpacklo_epi16(abLow, cdLow));
        Store(to + VectorBytes, _mm_unpackhi_epi16(abLow, cdLow));
        Store(to + 2 * VectorBytes, _mm_unpacklo_epi16(abHigh, cdHigh));
        Store(to + 3 * VectorBytes, _mm_unpackhi_epi16(abHigh, cdHigh));
    }
    PackOneByOne<4>(planes, pixels, i, count);
}

void Add8(const std::uint8_t* source, std::uint8_t* samples, std::size_t count) {
    std::size_t i = 0;
    for (; i + VectorBytes <= count; i += VectorBytes) {
        Store(samples + i, _mm_adds_epu8(Load(source + i), Load(samples + i)));
    }
    for (; i < count; ++i) {
        const std::int32_t sum = source[i] + samples[i];
        samples[i] = static_cast<std::uint8_t>(sum > 255 ? 255 : sum);
    }
}

void Add16(const Word* source, Word* samples, std::size_t count) {
    std::size_t i = 0;
    for (; i + VectorWords <= count; i += VectorWords) {
        Store(samples + i, _mm_adds_epu16(Load(source + i), Load(samples + i)));
    }
    for (; i < count; ++i) {
        const std::int32_t sum = source[i].value + samples[i].value;
        samples[i].value = static_cast<std::uint16_t>(sum > 65535 ? 65535 : sum);
    }
}

void ShiftRight8(std::int32_t shift, std::uint8_t* samples, std::size_t count) {
    const __m128i bits = _mm_cvtsi32_si128(shift);
    const __m128i kept = _mm_set1_epi8(static_cast<char>(0xFF >> shift));
    std::size_t i = 0;
    for (; i + VectorBytes <= count; i += VectorBytes) {
        Store(samples + i, _mm_and_si128(_mm_srl_epi16(Load(samples + i), bits), kept));
    }
    for (; i < count; ++i) samples[i] = static_cast<std::uint8_t>(samples[i] >> shift);
}

void ShiftRight16(std::int32_t shift, Word* samples, std::size_t count) {
    const __m128i bits = _mm_cvtsi32_si128(shift);
    std::size_t i = 0;
    for (; i + VectorWords <= count; i += VectorWords) {
        Store(samples + i, _mm_srl_epi16(Load(samples + i), bits));
    }
    for (; i < count; ++i) {
        samples[i].value = static_cast<std::uint16_t>(samples[i].value >> shift);
    }
}

// Without a gather, lookups are one read of a table per sample whatever the vectors do.

void Lookup8x1(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) samples[i] = tables[samples[i]];
}

void Lookup8x3(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count) {
    for (std::uint8_t* const end = samples + 3 * count; samples != end; samples += 3) {
        for (std::size_t c = 0; c < 3; ++c) samples[c] = tables[256 * c + samples[c]];
    }
}

void Lookup8x4(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count) {
    for (std::uint8_t* const end = samples + 4 * count; samples != end; samples += 4) {
        for (std::size_t c = 0; c < 4; ++c) samples[c] = tables[256 * c + samples[c]];
    }
}

void Lookup16x1(const std::uint16_t* tables, Word* samples, std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) samples[i].value = tables[samples[i].value];
}

void Lookup16x3(const std::uint16_t* tables, Word* samples, std::size_t count) {
    for (Word* const end = samples + 3 * count; samples != end; samples += 3) {
        for (std::size_t c = 0; c < 3; ++c) samples[c].value = tables[65536 * c + samples[c].value];
    }
}

void Double8(const std::uint8_t* row, std::uint8_t* output, std::size_t count) {
    std::size_t i = 0;
    for (; i + 2 * VectorBytes <= count; i += 2 * VectorBytes) {
        const __m128i samples = Load(row + i / 2);
        Store(output + i, _mm_unpacklo_epi8(samples, samples));
        Store(output + i + VectorBytes, _mm_unpackhi_epi8(samples, samples));
    }
    for (; i < count; ++i) output[i] = row[i / 2];
}

void Double16(const Word* row, Word* output, std::size_t count) {
    std::size_t i = 0;
    for (; i + 2 * VectorWords <= count; i += 2 * VectorWords) {
        const __m128i samples = Load(row + i / 2);
        Store(output + i, _mm_unpacklo_epi16(samples, samples));
        Store(output + i + VectorWords, _mm_unpackhi_epi16(samples, samples));
    }
    for (; i < count; ++i) output[i] = row[i / 2];
}

void LinearColumn8(const std::uint16_t* upper, const std::uint16_t* lower, std::int32_t weight,
                   std::uint8_t* output, std::size_t count) {
    const __m128i weights = JoinRowWeights(weight);
    std::size_t i = 0;
    for (; i + VectorBytes <= count; i += VectorBytes) {
        const __m128i low = MixRows8(upper + i, lower + i, weights);
        const __m128i high = MixRows8(upper + i + VectorWords, lower + i + VectorWords, weights);
        Store(output + i, _mm_packus_epi16(low, high));
    }
    for (; i < count; ++i) {
        const std::int32_t sum = lower[i] * weight + upper[i] * (WeightOne - weight);
        output[i] = static_cast<std::uint8_t>((sum + 0x80000) >> 20);
    }
}

void LinearColumn16(const std::uint16_t* upper, const std::uint16_t* lower, std::int32_t weight,
                    Word* output, std::size_t count) {
    const __m128i weights = JoinRowWeights(weight);
    std::size_t i = 0;
    for (; i + VectorWords <= count; i += VectorWords) {
        Store(output + i, MixRows16(upper + i, lower + i, weights));
    }
    for (; i < count; ++i) {
        const std::int32_t sum = lower[i] * weight + upper[i] * (WeightOne - weight);
        output[i].value = static_cast<std::uint16_t>((sum + 8192) >> 14);
    }
}

void CubicColumn8(const float* const rows[4], const CubicWeights& weights, std::uint8_t* output,
                  std::size_t count) {
    std::size_t i = 0;
    for (; i + VectorBytes <= count; i += VectorBytes) {
        const __m128i low = MixCubicWords(rows, i, weights);
        Store(output + i, _mm_packus_epi16(low, MixCubicWords(rows, i + VectorWords, weights)));
    }
    for (; i < count; ++i) {
        output[i] = static_cast<std::uint8_t>(MixCubicOnce(rows, i, weights, 255));
    }
}

void CubicColumn16(const float* const rows[4], const CubicWeights& weights, Word* output,
                   std::size_t count) {
    // Packed as signed words, which holds them within 0 to 65535.
    const __m128i middle = _mm_set1_epi32(32768);
    std::size_t i = 0;
    for (; i + VectorWords <= count; i += VectorWords) {
        const __m128i low = _mm_sub_epi32(MixCubic(rows, i, weights), middle);
        const __m128i high = _mm_sub_epi32(MixCubic(rows, i + VectorFloats, weights), middle);
        Store(output + i, FlipWords(_mm_packs_epi32(low, high)));
    }
    for (; i < count; ++i) {
        output[i].value = static_cast<std::uint16_t>(MixCubicOnce(rows, i, weights, 65535));
    }
}

void Split8(const std::uint8_t* row, std::uint8_t* even, std::uint8_t* odd, std::size_t count) {
    const __m128i lowByte = _mm_set1_epi16(0x00FF);
    std::size_t i = 0;
    for (; i + VectorBytes <= count; i += VectorBytes) {
        const __m128i low = Load(row + 2 * i);
        const __m128i high = Load(row + 2 * i + VectorBytes);
        Store(even + i,
              _mm_packus_epi16(_mm_and_si128(low, lowByte), _mm_and_si128(high, lowByte)));
        Store(odd + i, _mm_packus_epi16(_mm_srli_epi16(low, 8), _mm_srli_epi16(high, 8)));
    }
    for (; i < count; ++i) {
        even[i] = row[2 * i];
        odd[i] = row[2 * i + 1];
    }
}

// The average that rounds up is the sum of the halves once both samples are even.

void AddHalves8(const std::uint8_t* first, const std::uint8_t* second, std::uint8_t* output,
                std::size_t count) {
    const __m128i even = _mm_set1_epi8(static_cast<char>(0xFE));
    std::size_t i = 0;
    for (; i + VectorBytes <= count; i += VectorBytes) {
        Store(output + i, _mm_avg_epu8(_mm_and_si128(Load(first + i), even),
                                       _mm_and_si128(Load(second + i), even)));
    }
    for (; i < count; ++i) {
        output[i] = static_cast<std::uint8_t>((first[i] >> 1) + (second[i] >> 1));
    }
}

void AddHalves16(const Word* first, const Word* second, Word* output, std::size_t count) {
    std::size_t i = 0;
    for (; i + VectorWords <= count; i += VectorWords) {
        Store(output + i, _mm_add_epi16(_mm_srli_epi16(Load(first + i), 1),
                                        _mm_srli_epi16(Load(second + i), 1)));
    }
    for (; i < count; ++i) {
        output[i].value =
            static_cast<std::uint16_t>((first[i].value >> 1) + (second[i].value >> 1));
    }
}

}  // namespace SSE2Rows

const RowKernels SSE2RowKernels = {
    .name = "sse2",
    .pack8x3 = Pack8x3,
    .pack8x4 = SSE2Rows::Pack8x4,
    .pack16x3 = Pack16x3,
    .add8 = SSE2Rows::Add8,
    .add16 = SSE2Rows::Add16,
    .shiftRight8 = SSE2Rows::ShiftRight8,
    .shiftRight16 = SSE2Rows::ShiftRight16,
    .lookup8x1 = SSE2Rows::Lookup8x1,
    .lookup8x3 = SSE2Rows::Lookup8x3,
    .lookup8x4 = SSE2Rows::Lookup8x4,
    .lookup16x1 = SSE2Rows::Lookup16x1,
    .lookup16x3 = SSE2Rows::Lookup16x3,
    .double8 = SSE2Rows::Double8,
    .double16 = SSE2Rows::Double16,
    .linearRow8 = LinearRow8,
    .linearColumn8 = SSE2Rows::LinearColumn8,
    .linearColumnPair8 = SSE2Rows::LinearColumnPair8,
    .linearRow16 = LinearRow16,
    .linearColumn16 = SSE2Rows::LinearColumn16,
    .linearColumnPair16 = SSE2Rows::LinearColumnPair16,
    .cubicRow8 = CubicRow<std::uint8_t>,
    .cubicRow16 = CubicRow<Word>,
    .cubicColumn8 = SSE2Rows::CubicColumn8,
    .cubicColumnPair8 = SSE2Rows::CubicColumnPair8,
    .cubicColumn16 = SSE2Rows::CubicColumn16,
    .cubicColumnPair16 = SSE2Rows::CubicColumnPair16,
    .split8 = SSE2Rows::Split8,
    .split16 = Split16,
    .addHalves8 = SSE2Rows::AddHalves8,
    .addHalves16 = SSE2Rows::AddHalves16,
};

}  // namespace ZV
