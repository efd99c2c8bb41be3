// Everything but the table is internal: what another file could share with this one would be
// compiled here, for this instruction set, and might be the copy that is linked.

#include <tmmintrin.h>

#include <cstddef>
#include <cstdint>

#include "imaging/kernels/row_kernels.h"
#include "imaging/kernels/sse2_rows.h"

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

inline __m128i LoadHalf(const void* from) {
    return _mm_loadl_epi64(static_cast<const __m128i*>(from));
}

inline void Store(void* to, __m128i value) {
    _mm_storeu_si128(static_cast<__m128i*>(to), value);
}

/// For each byte of a vector the place that it is taken from; a negative one gives 0.
struct Shuffle {
    alignas(VectorBytes) std::int8_t places[VectorBytes];
};

inline __m128i Load(const Shuffle& shuffle) {
    return _mm_load_si128(reinterpret_cast<const __m128i*>(shuffle.places));
}

/// What plane `plane` gives to part `part` of three planes' packed samples.
constexpr Shuffle MakePackShuffle(std::size_t plane, std::size_t part, std::size_t sampleBytes) {
    Shuffle shuffle{};
    for (std::size_t i = 0; i < VectorBytes; ++i) {
        const std::size_t byte = part * VectorBytes + i;
        const std::size_t sample = byte / sampleBytes;
        const std::size_t place = sample / 3 * sampleBytes + byte % sampleBytes;
        shuffle.places[i] = static_cast<std::int8_t>(sample % 3 == plane ? place : 0x80);
    }
    return shuffle;
}

/// The samples of even places, then those of odd ones.
constexpr Shuffle MakeSplitShuffle(std::size_t sampleBytes) {
    Shuffle shuffle{};
    for (std::size_t i = 0; i < VectorBytes / 2; ++i) {
        const std::size_t place = i / sampleBytes * 2 * sampleBytes + i % sampleBytes;
        shuffle.places[i] = static_cast<std::int8_t>(place);
        shuffle.places[i + VectorBytes / 2] = static_cast<std::int8_t>(place + sampleBytes);
    }
    return shuffle;
}

struct PackShuffles {
    Shuffle parts[3][3];  ///< Of each part, one for each plane.
};

constexpr PackShuffles MakePackShuffles(std::size_t sampleBytes) {
    PackShuffles shuffles{};
    for (std::size_t part = 0; part < 3; ++part) {
        for (std::size_t plane = 0; plane < 3; ++plane) {
            shuffles.parts[part][plane] = MakePackShuffle(plane, part, sampleBytes);
        }
    }
    return shuffles;
}

constexpr PackShuffles PackShuffles8 = MakePackShuffles(1);
constexpr PackShuffles PackShuffles16 = MakePackShuffles(2);
constexpr Shuffle SplitShuffle8 = MakeSplitShuffle(1);
constexpr Shuffle SplitShuffle16 = MakeSplitShuffle(2);
/// The lowest byte of each 32 bits, four times.
constexpr Shuffle SpreadShuffle = {{0, 0, 0, 0, 4, 4, 4, 4, 8, 8, 8, 8, 12, 12, 12, 12}};

inline __m128i Take(__m128i bytes, const Shuffle& shuffle) {
    return _mm_shuffle_epi8(bytes, Load(shuffle));
}

inline __m128i PackPart(const Shuffle (&shuffles)[3], __m128i a, __m128i b, __m128i c) {
    return _mm_or_si128(_mm_or_si128(Take(a, shuffles[0]), Take(b, shuffles[1])),
                        Take(c, shuffles[2]));
}

template <const PackShuffles& Shuffles, typename Sample>
void Pack3(const Sample* const planes[3], Sample* pixels, std::size_t count) {
    constexpr std::size_t step = VectorBytes / sizeof(Sample);
    std::size_t i = 0;
    for (; i + step <= count; i += step) {
        const __m128i a = Load(planes[0] + i);
        const __m128i b = Load(planes[1] + i);
        const __m128i c = Load(planes[2] + i);
        Sample* const to = pixels + 3 * i;
        Store(to, PackPart(Shuffles.parts[0], a, b, c));
        Store(to + step, PackPart(Shuffles.parts[1], a, b, c));
        Store(to + 2 * step, PackPart(Shuffles.parts[2], a, b, c));
    }
    for (; i < count; ++i) {
        for (std::size_t c = 0; c < 3; ++c) pixels[3 * i + c] = planes[c][i];
    }
}

template <const Shuffle& SplitShuffle, typename Sample>
void Split(const Sample* row, Sample* even, Sample* odd, std::size_t count) {
    constexpr std::size_t step = VectorBytes / sizeof(Sample);
    std::size_t i = 0;
    for (; i + step <= count; i += step) {
        const __m128i low = Take(Load(row + 2 * i), SplitShuffle);
        const __m128i high = Take(Load(row + 2 * i + step), SplitShuffle);
        Store(even + i, _mm_unpacklo_epi64(low, high));
        Store(odd + i, _mm_unpackhi_epi64(low, high));
    }
    for (; i < count; ++i) {
        even[i] = row[2 * i];
        odd[i] = row[2 * i + 1];
    }
}

inline __m128i WeighBytes(__m128i pairs, const std::int16_t* weights) {
    const __m128i sum = _mm_madd_epi16(pairs, Load(weights));
    return _mm_srai_epi32(_mm_add_epi32(sum, _mm_set1_epi32(128)), 8);
}

void LinearRow8(const std::uint8_t* row, const LinearPlan& plan, std::uint16_t* output) {
    const __m128i zero = _mm_setzero_si128();
    for (std::size_t group = 0; group < plan.groupCount; ++group) {
        const std::size_t i = group * GroupOutputs;
        const __m128i pairs =
            _mm_shuffle_epi8(Load(row + plan.bases[group]), Load(plan.pairs + 2 * i));
        const std::int16_t* const weights = plan.weights + 2 * i;
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

// Samples of 16 bits are made signed for the multiplication by 32768 less, which the weights, 16384
// together, pass on unchanged to the result.

inline __m128i FlipWords(__m128i words) {
    return _mm_xor_si128(words, _mm_set1_epi16(static_cast<std::int16_t>(0x8000)));
}

inline __m128i WeighWords(__m128i words, const std::uint8_t* pairs, const std::int16_t* weights) {
    const __m128i sum = _mm_madd_epi16(_mm_shuffle_epi8(words, Load(pairs)), Load(weights));
    return _mm_srai_epi32(_mm_add_epi32(sum, _mm_set1_epi32(8192)), 14);
}

void LinearRow16(const Word* row, const LinearPlan& plan, std::uint16_t* output) {
    for (std::size_t group = 0; group < plan.groupCount; ++group) {
        const std::size_t i = group * GroupOutputs;
        const __m128i words = FlipWords(Load(row + plan.bases[group]));
        const std::uint8_t* const pairs = plan.pairs + 4 * i;
        const std::int16_t* const weights = plan.weights + 2 * i;
        const __m128i low = WeighWords(words, pairs, weights);
        const __m128i high = WeighWords(words, pairs + VectorBytes, weights + VectorWords);
        Store(output + i, FlipWords(_mm_packs_epi32(low, high)));
    }
    for (std::size_t i = plan.groupCount * GroupOutputs; i < plan.count; ++i) {
        const auto [index, weight] = plan.positions[i];
        const std::int32_t sum =
            (WeightOne - weight) * row[index].value + weight * row[index + 1].value;
        output[i] = static_cast<std::uint16_t>((sum + 8192) >> 14);
    }
}

/// The first of four samples and their differences, of four outputs. Differences of whole samples
/// are exact in single precision: they are taken of whole numbers and converted.
struct Differences {
    __m128i start;
    __m128i first;
    __m128i second;
    __m128i third;
};

inline void StoreCubic(const Differences& differences, const CubicPlan& plan, std::size_t i,
                       float* output) {
    const __m128 first = _mm_cvtepi32_ps(differences.first);
    const __m128 second = _mm_cvtepi32_ps(differences.second);
    const __m128 third = _mm_cvtepi32_ps(differences.third);
    __m128 value = _mm_cvtepi32_ps(differences.start);
    value = _mm_add_ps(value, _mm_mul_ps(_mm_loadu_ps(plan.first + i), first));
    value = _mm_add_ps(value, _mm_mul_ps(_mm_loadu_ps(plan.second + i), second));
    value = _mm_add_ps(value, _mm_mul_ps(_mm_loadu_ps(plan.third + i), third));
    _mm_storeu_ps(output + i, value);
}

/// Places of the four bytes that begin where each output's first sample begins.
inline __m128i PlaceBytes(const std::int32_t* places) {
    return _mm_add_epi8(Take(Load(places), SpreadShuffle), _mm_set1_epi32(0x03020100));
}

constexpr std::int32_t JoinFactors(std::int32_t a, std::int32_t c, std::int32_t d, std::int32_t e) {
    return (a & 0xFF) | (c & 0xFF) << 8 | (d & 0xFF) << 16 | (e & 0xFF) << 24;
}

/// Of each output's four bytes the sum by the factors, the first one lowest.
inline __m128i SumBytes(__m128i bytes, std::int32_t factors) {
    const __m128i pairSums = _mm_maddubs_epi16(bytes, _mm_set1_epi32(factors));
    return _mm_madd_epi16(pairSums, _mm_set1_epi16(1));
}

/// `group` begins the eight samples among which the outputs' samples have their places.
inline Differences TakeDifferences(const std::uint8_t* group, const std::int32_t* places) {
    const __m128i bytes = _mm_shuffle_epi8(LoadHalf(group), PlaceBytes(places));
    return {_mm_and_si128(bytes, _mm_set1_epi32(0xFF)), SumBytes(bytes, JoinFactors(-1, 1, 0, 0)),
            SumBytes(bytes, JoinFactors(1, -2, 1, 0)), SumBytes(bytes, JoinFactors(-1, 3, -3, 1))};
}

inline Differences TakeDifferences(const Word* group, const std::int32_t* places) {
    const __m128i words = Load(group);
    const __m128i low = _mm_set1_epi32(0xFFFF);
    const __m128i spread = Take(Load(places), SpreadShuffle);
    const __m128i at = _mm_add_epi8(_mm_add_epi8(spread, spread), _mm_set1_epi32(0x03020100));
    const __m128i ac = _mm_shuffle_epi8(words, at);
    const __m128i de = _mm_shuffle_epi8(words, _mm_add_epi8(at, _mm_set1_epi8(4)));
    const __m128i a = _mm_and_si128(ac, low);
    const __m128i c = _mm_srli_epi32(ac, 16);
    const __m128i d = _mm_and_si128(de, low);
    const __m128i e = _mm_srli_epi32(de, 16);
    const __m128i first = _mm_sub_epi32(c, a);
    const __m128i middle = _mm_sub_epi32(d, c);
    const __m128i second = _mm_sub_epi32(middle, first);
    const __m128i last = _mm_sub_epi32(_mm_sub_epi32(e, d), middle);
    return {a, first, second, _mm_sub_epi32(last, second)};
}

inline float ToSingle(std::uint8_t sample) {
    return sample;
}

inline float ToSingle(Word sample) {
    return sample.value;
}

template <typename Sample>
float MixOnce(const Sample* from, const CubicWeights& weights) {
    const float a = ToSingle(from[0]);
    const float c = ToSingle(from[1]);
    const float d = ToSingle(from[2]);
    const float first = c - a;
    const float second = d - c - first;
    const float third = c - 2 * d + ToSingle(from[3]) - second;
    return a + weights.first * first + weights.second * second + weights.third * third;
}

template <typename Sample>
void CubicRow(const Sample* row, const CubicPlan& plan, float* output) {
    for (std::size_t group = 0; group < plan.groupCount; ++group) {
        const Sample* const samples = row + plan.bases[group];
        const std::size_t i = group * GroupOutputs;
        const std::size_t next = i + VectorFloats;
        StoreCubic(TakeDifferences(samples, plan.places + i), plan, i, output);
        StoreCubic(TakeDifferences(samples, plan.places + next), plan, next, output);
    }
    for (std::size_t i = plan.groupCount * GroupOutputs; i < plan.count; ++i) {
        const auto& [index, weights] = plan.positions[i];
        output[i] = MixOnce(row + index, weights);
    }
}

}  // namespace

const RowKernels SSSE3RowKernels = {
    .name = "ssse3",
    .pack8x3 = Pack3<PackShuffles8, std::uint8_t>,
    .pack8x4 = SSE2Rows::Pack8x4,
    .pack16x3 = Pack3<PackShuffles16, Word>,
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
    .split8 = Split<SplitShuffle8, std::uint8_t>,
    .split16 = Split<SplitShuffle16, Word>,
    .addHalves8 = SSE2Rows::AddHalves8,
    .addHalves16 = SSE2Rows::AddHalves16,
};

}  // namespace ZV
