#include <immintrin.h>

#include "imaging/kernels/row_kernels.h"

// Nothing here but intrinsics and functions of its own: an inline function shared with other files
// could carry these instructions to an older processor.

namespace ZV {

namespace {

constexpr std::size_t VectorBytes = 64;
constexpr std::size_t GroupOutputs = 8;

using Quartet = __m512i[4];

/// Bytes `at` to `at` + 63 of a row; 0 from `end` on, where nothing is read.
inline __m512i Load(const void* row, std::size_t at, std::size_t end) {
    const auto* const bytes = static_cast<const std::uint8_t*>(row);
    if (at + VectorBytes <= end) return _mm512_loadu_si512(bytes + at);
    if (at >= end) return _mm512_setzero_si512();
    return _mm512_maskz_loadu_epi8(~0ULL >> (VectorBytes - (end - at)), bytes + at);
}

inline void Store(void* row, std::size_t at, std::size_t end, __m512i value) {
    auto* const bytes = static_cast<std::uint8_t*>(row);
    if (at + VectorBytes <= end) {
        _mm512_storeu_si512(bytes + at, value);
    } else if (at < end) {
        _mm512_mask_storeu_epi8(bytes + at, ~0ULL >> (VectorBytes - (end - at)), value);
    }
}

inline __m512 LoadSingles(const float* row, std::size_t at, std::size_t end) {
    return _mm512_castsi512_ps(Load(row, 4 * at, 4 * end));
}

struct BytePlaces {
    std::uint8_t places[64];
};

struct WordPlaces {
    std::uint16_t places[32];
};

struct Offsets {
    std::int32_t offsets[16];
};

inline __m512i LoadPlaces(const void* places) {
    return _mm512_loadu_si512(places);
}

// Interleaved channels without shuffles. A vector's length is no multiple of the number of
// channels (four channels are rotated within their pixels first), so that a channel stands at other
// positions in each of the vectors that hold a run of pixels. One blend per vector therefore
// gathers a channel, at every position another sample of it, and one takes it back.

constexpr __mmask64 SecondByteOf3 = 0x2492492492492492;
constexpr __mmask64 ThirdByteOf3 = 0x4924924924924924;
constexpr __mmask32 SecondWordOf3 = 0x92492492;
constexpr __mmask32 ThirdWordOf3 = 0x24924924;
constexpr __mmask64 SecondByteOf4 = 0x2222222222222222;
constexpr __mmask64 ThirdByteOf4 = 0x4444444444444444;
constexpr __mmask64 FourthByteOf4 = 0x8888888888888888;

inline __m512i BlendBytes3(__m512i first, __m512i second, __m512i third) {
    return _mm512_mask_mov_epi8(_mm512_mask_mov_epi8(first, SecondByteOf3, second), ThirdByteOf3,
                                third);
}

inline __m512i BlendWords3(__m512i first, __m512i second, __m512i third) {
    return _mm512_mask_mov_epi16(_mm512_mask_mov_epi16(first, SecondWordOf3, second), ThirdWordOf3,
                                 third);
}

inline __m512i BlendBytes4(__m512i first, __m512i second, __m512i third, __m512i fourth) {
    return _mm512_mask_mov_epi8(
        _mm512_mask_mov_epi8(_mm512_mask_mov_epi8(first, SecondByteOf4, second), ThirdByteOf4,
                             third),
        FourthByteOf4, fourth);
}

/// From the vectors of a run of pixels, each rotated by its number, to the channels or back.
inline void ExchangeChannels4(Quartet& vectors) {
    const __m512i a = vectors[0], b = vectors[1], c = vectors[2], d = vectors[3];
    vectors[0] = BlendBytes4(a, b, c, d);
    vectors[1] = BlendBytes4(d, a, b, c);
    vectors[2] = BlendBytes4(c, d, a, b);
    vectors[3] = BlendBytes4(b, c, d, a);
}

/// Where a plane's samples go before they are blended: byte j takes the sample of the one output
/// vector in which byte j belongs to the channel.
constexpr BytePlaces MakePackPlaces8x3(std::uint32_t channel) {
    BytePlaces made{};
    for (std::uint32_t byte = 0; byte < 64; ++byte) {
        const std::uint32_t vector = (channel + 2 * byte) % 3;
        made.places[byte] = static_cast<std::uint8_t>((64 * vector + byte) / 3);
    }
    return made;
}

constexpr WordPlaces MakePackPlaces16x3(std::uint32_t channel) {
    WordPlaces made{};
    for (std::uint32_t word = 0; word < 32; ++word) {
        const std::uint32_t vector = (word + 3 - channel) % 3;
        made.places[word] = static_cast<std::uint16_t>((32 * vector + word) / 3);
    }
    return made;
}

constexpr BytePlaces MakePackPlaces8x4(std::uint32_t channel) {
    BytePlaces made{};
    for (std::uint32_t byte = 0; byte < 64; ++byte) {
        const std::uint32_t vector = (byte + 4 - channel) % 4;
        made.places[byte] = static_cast<std::uint8_t>(16 * vector + byte / 4);
    }
    return made;
}

constexpr BytePlaces PackPlaces8x3[] = {MakePackPlaces8x3(0), MakePackPlaces8x3(1),
                                        MakePackPlaces8x3(2)};
constexpr WordPlaces PackPlaces16x3[] = {MakePackPlaces16x3(0), MakePackPlaces16x3(1),
                                         MakePackPlaces16x3(2)};
constexpr BytePlaces PackPlaces8x4[] = {MakePackPlaces8x4(0), MakePackPlaces8x4(1),
                                        MakePackPlaces8x4(2), MakePackPlaces8x4(3)};

void Pack8x3(const std::uint8_t* const planes[3], std::uint8_t* pixels, std::size_t count) {
    const std::uint8_t *const first = planes[0], *const second = planes[1],
                              *const third = planes[2];
    const __m512i firstPlaces = LoadPlaces(&PackPlaces8x3[0]);
    const __m512i secondPlaces = LoadPlaces(&PackPlaces8x3[1]);
    const __m512i thirdPlaces = LoadPlaces(&PackPlaces8x3[2]);
    const std::size_t end = 3 * count;
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m512i a = _mm512_permutexvar_epi8(firstPlaces, Load(first, at, count));
        const __m512i b = _mm512_permutexvar_epi8(secondPlaces, Load(second, at, count));
        const __m512i c = _mm512_permutexvar_epi8(thirdPlaces, Load(third, at, count));
        Store(pixels, 3 * at, end, BlendBytes3(a, b, c));
        Store(pixels, 3 * at + VectorBytes, end, BlendBytes3(b, c, a));
        Store(pixels, 3 * at + 2 * VectorBytes, end, BlendBytes3(c, a, b));
    }
}

void Pack8x4(const std::uint8_t* const planes[4], std::uint8_t* pixels, std::size_t count) {
    const std::uint8_t *const first = planes[0], *const second = planes[1],
                              *const third = planes[2], *const fourth = planes[3];
    const __m512i firstPlaces = LoadPlaces(&PackPlaces8x4[0]);
    const __m512i secondPlaces = LoadPlaces(&PackPlaces8x4[1]);
    const __m512i thirdPlaces = LoadPlaces(&PackPlaces8x4[2]);
    const __m512i fourthPlaces = LoadPlaces(&PackPlaces8x4[3]);
    const std::size_t end = 4 * count;
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        Quartet vectors = {_mm512_permutexvar_epi8(firstPlaces, Load(first, at, count)),
                           _mm512_permutexvar_epi8(secondPlaces, Load(second, at, count)),
                           _mm512_permutexvar_epi8(thirdPlaces, Load(third, at, count)),
                           _mm512_permutexvar_epi8(fourthPlaces, Load(fourth, at, count))};
        ExchangeChannels4(vectors);
        Store(pixels, 4 * at, end, vectors[0]);
        Store(pixels, 4 * at + VectorBytes, end, _mm512_ror_epi32(vectors[1], 8));
        Store(pixels, 4 * at + 2 * VectorBytes, end, _mm512_ror_epi32(vectors[2], 16));
        Store(pixels, 4 * at + 3 * VectorBytes, end, _mm512_ror_epi32(vectors[3], 24));
    }
}

void Pack16x3(const Word* const planes[3], Word* pixels, std::size_t count) {
    const Word *const first = planes[0], *const second = planes[1], *const third = planes[2];
    const __m512i firstPlaces = LoadPlaces(&PackPlaces16x3[0]);
    const __m512i secondPlaces = LoadPlaces(&PackPlaces16x3[1]);
    const __m512i thirdPlaces = LoadPlaces(&PackPlaces16x3[2]);
    const std::size_t planeEnd = 2 * count, end = 6 * count;
    for (std::size_t at = 0; at < planeEnd; at += VectorBytes) {
        const __m512i a = _mm512_permutexvar_epi16(firstPlaces, Load(first, at, planeEnd));
        const __m512i b = _mm512_permutexvar_epi16(secondPlaces, Load(second, at, planeEnd));
        const __m512i c = _mm512_permutexvar_epi16(thirdPlaces, Load(third, at, planeEnd));
        Store(pixels, 3 * at, end, BlendWords3(a, b, c));
        Store(pixels, 3 * at + VectorBytes, end, BlendWords3(c, a, b));
        Store(pixels, 3 * at + 2 * VectorBytes, end, BlendWords3(b, c, a));
    }
}

void Add8(const std::uint8_t* source, std::uint8_t* samples, std::size_t count) {
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m512i sum = _mm512_adds_epu8(Load(samples, at, count), Load(source, at, count));
        Store(samples, at, count, sum);
    }
}

void Add16(const Word* source, Word* samples, std::size_t count) {
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        const __m512i sum = _mm512_adds_epu16(Load(samples, at, end), Load(source, at, end));
        Store(samples, at, end, sum);
    }
}

void ShiftRight8(std::int32_t shift, std::uint8_t* samples, std::size_t count) {
    const __m128i bits = _mm_cvtsi32_si128(shift);
    const __m512i kept = _mm512_set1_epi8(static_cast<char>(0xFF >> shift));
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m512i shifted = _mm512_srl_epi16(Load(samples, at, count), bits);
        Store(samples, at, count, _mm512_and_si512(shifted, kept));
    }
}

void ShiftRight16(std::int32_t shift, Word* samples, std::size_t count) {
    const __m128i bits = _mm_cvtsi32_si128(shift);
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        Store(samples, at, end, _mm512_srl_epi16(Load(samples, at, end), bits));
    }
}

/// The 256 entries of one channel.
struct Table8 {
    __m512i quarters[4];
};

inline Table8 LoadTable8(const std::uint8_t* table) {
    return {{_mm512_loadu_si512(table), _mm512_loadu_si512(table + 64),
             _mm512_loadu_si512(table + 128), _mm512_loadu_si512(table + 192)}};
}

inline __m512i Map8(const Table8& table, __m512i samples) {
    const __m512i low = _mm512_permutex2var_epi8(table.quarters[0], samples, table.quarters[1]);
    const __m512i high = _mm512_permutex2var_epi8(table.quarters[2], samples, table.quarters[3]);
    return _mm512_mask_blend_epi8(_mm512_movepi8_mask(samples), low, high);
}

void Lookup8x1(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count) {
    const Table8 table = LoadTable8(tables);
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        Store(samples, at, count, Map8(table, Load(samples, at, count)));
    }
}

void Lookup8x3(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count) {
    const Table8 first = LoadTable8(tables);
    const Table8 second = LoadTable8(tables + 256);
    const Table8 third = LoadTable8(tables + 512);
    const std::size_t end = 3 * count;
    for (std::size_t at = 0; at < end; at += 3 * VectorBytes) {
        const __m512i a = Load(samples, at, end);
        const __m512i b = Load(samples, at + VectorBytes, end);
        const __m512i c = Load(samples, at + 2 * VectorBytes, end);
        const __m512i x = Map8(first, BlendBytes3(a, c, b));
        const __m512i y = Map8(second, BlendBytes3(b, a, c));
        const __m512i z = Map8(third, BlendBytes3(c, b, a));
        Store(samples, at, end, BlendBytes3(x, y, z));
        Store(samples, at + VectorBytes, end, BlendBytes3(y, z, x));
        Store(samples, at + 2 * VectorBytes, end, BlendBytes3(z, x, y));
    }
}

void Lookup8x4(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count) {
    const Table8 first = LoadTable8(tables);
    const Table8 second = LoadTable8(tables + 256);
    const Table8 third = LoadTable8(tables + 512);
    const Table8 fourth = LoadTable8(tables + 768);
    const std::size_t end = 4 * count;
    for (std::size_t at = 0; at < end; at += 4 * VectorBytes) {
        Quartet vectors = {Load(samples, at, end),
                           _mm512_rol_epi32(Load(samples, at + VectorBytes, end), 8),
                           _mm512_rol_epi32(Load(samples, at + 2 * VectorBytes, end), 16),
                           _mm512_rol_epi32(Load(samples, at + 3 * VectorBytes, end), 24)};
        ExchangeChannels4(vectors);
        vectors[0] = Map8(first, vectors[0]);
        vectors[1] = Map8(second, vectors[1]);
        vectors[2] = Map8(third, vectors[2]);
        vectors[3] = Map8(fourth, vectors[3]);
        ExchangeChannels4(vectors);
        Store(samples, at, end, vectors[0]);
        Store(samples, at + VectorBytes, end, _mm512_ror_epi32(vectors[1], 8));
        Store(samples, at + 2 * VectorBytes, end, _mm512_ror_epi32(vectors[2], 16));
        Store(samples, at + 3 * VectorBytes, end, _mm512_ror_epi32(vectors[3], 24));
    }
}

constexpr __mmask32 OddWords = 0xAAAAAAAA;

/// Maps 32 samples; the offsets are those of the tables of the even and of the odd samples. Only
/// the low half of what is gathered counts.
inline __m512i Map16(const std::uint16_t* tables, __m512i samples, __m512i evenOffsets,
                     __m512i oddOffsets) {
    const __m512i even = _mm512_and_si512(samples, _mm512_set1_epi32(0xFFFF));
    const __m512i odd = _mm512_srli_epi32(samples, 16);
    const __m512i evenValues =
        _mm512_i32gather_epi32(_mm512_add_epi32(even, evenOffsets), tables, 2);
    const __m512i oddValues = _mm512_i32gather_epi32(_mm512_add_epi32(odd, oddOffsets), tables, 2);
    return _mm512_mask_blend_epi16(OddWords, evenValues, _mm512_slli_epi32(oddValues, 16));
}

void Lookup16x1(const std::uint16_t* tables, Word* samples, std::size_t count) {
    const __m512i none = _mm512_setzero_si512();
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        Store(samples, at, end, Map16(tables, Load(samples, at, end), none, none));
    }
}

/// The tables' offsets of every second word from `word` on, counted from a pixel's start.
constexpr Offsets MakeTableOffsets(std::int32_t word) {
    Offsets made{};
    for (std::int32_t index = 0; index < 16; ++index) {
        made.offsets[index] = 65536 * ((word + 2 * index) % 3);
    }
    return made;
}

constexpr Offsets TableOffsets[] = {MakeTableOffsets(0), MakeTableOffsets(1), MakeTableOffsets(2)};

void Lookup16x3(const std::uint16_t* tables, Word* samples, std::size_t count) {
    const __m512i fromFirst = LoadPlaces(&TableOffsets[0]);
    const __m512i fromSecond = LoadPlaces(&TableOffsets[1]);
    const __m512i fromThird = LoadPlaces(&TableOffsets[2]);
    const std::size_t end = 6 * count;
    for (std::size_t at = 0; at < end; at += 3 * VectorBytes) {
        const __m512i a = Load(samples, at, end);
        const __m512i b = Load(samples, at + VectorBytes, end);
        const __m512i c = Load(samples, at + 2 * VectorBytes, end);
        Store(samples, at, end, Map16(tables, a, fromFirst, fromSecond));
        Store(samples, at + VectorBytes, end, Map16(tables, b, fromThird, fromFirst));
        Store(samples, at + 2 * VectorBytes, end, Map16(tables, c, fromSecond, fromThird));
    }
}

/// Places of the even samples of two vectors, of the odd ones, and of doubled samples.
struct SamplePlaces {
    BytePlaces evenBytes, oddBytes, doubledBytes;
    WordPlaces evenWords, oddWords, doubledWords;
};

constexpr SamplePlaces MakeSamplePlaces() {
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

constexpr SamplePlaces Places = MakeSamplePlaces();

void Double8(const std::uint8_t* row, std::uint8_t* output, std::size_t count) {
    const __m512i lower = LoadPlaces(&Places.doubledBytes);
    const __m512i upper = _mm512_add_epi8(lower, _mm512_set1_epi8(32));
    const std::size_t sourceEnd = (count + 1) / 2;
    for (std::size_t at = 0; at < sourceEnd; at += VectorBytes) {
        const __m512i samples = Load(row, at, sourceEnd);
        Store(output, 2 * at, count, _mm512_permutexvar_epi8(lower, samples));
        Store(output, 2 * at + VectorBytes, count, _mm512_permutexvar_epi8(upper, samples));
    }
}

void Double16(const Word* row, Word* output, std::size_t count) {
    const __m512i lower = LoadPlaces(&Places.doubledWords);
    const __m512i upper = _mm512_add_epi16(lower, _mm512_set1_epi16(16));
    const std::size_t sourceEnd = 2 * ((count + 1) / 2), end = 2 * count;
    for (std::size_t at = 0; at < sourceEnd; at += VectorBytes) {
        const __m512i samples = Load(row, at, sourceEnd);
        Store(output, 2 * at, end, _mm512_permutexvar_epi16(lower, samples));
        Store(output, 2 * at + VectorBytes, end, _mm512_permutexvar_epi16(upper, samples));
    }
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

void LinearRow8(const std::uint8_t* row, const LinearPlan& plan, std::uint16_t* output) {
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

void LinearRow16(const Word* row, const LinearPlan& plan, std::uint16_t* output) {
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

void LinearColumn8(const std::uint16_t* upper, const std::uint16_t* lower, std::int32_t weight,
                   std::uint8_t* output, std::size_t count) {
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

void LinearColumn16(const std::uint16_t* upper, const std::uint16_t* lower, std::int32_t weight,
                    Word* output, std::size_t count) {
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

void CubicRow8(const std::uint8_t* row, const CubicPlan& plan, float* output) {
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

void CubicRow16(const Word* row, const CubicPlan& plan, float* output) {
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

void CubicColumn8(const float* const rows[4], const CubicWeights& weights, std::uint8_t* output,
                  std::size_t count) {
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

void CubicColumn16(const float* const rows[4], const CubicWeights& weights, Word* output,
                   std::size_t count) {
    const VectorWeights spread = SpreadWeights(weights);
    const __m512 top = _mm512_set1_ps(65535.0F);
    for (std::size_t at = 0; at < count; at += 32) {
        const __m512i a = CubicSamples(rows, at, count, spread, top);
        const __m512i b = CubicSamples(rows, at + 16, count, spread, top);
        Store(output, 2 * at, 2 * count, NarrowToWords(a, b));
    }
}

void Split8(const std::uint8_t* row, std::uint8_t* even, std::uint8_t* odd, std::size_t count) {
    const __m512i evenBytes = LoadPlaces(&Places.evenBytes);
    const __m512i oddBytes = LoadPlaces(&Places.oddBytes);
    const std::size_t rowEnd = 2 * count;
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m512i first = Load(row, 2 * at, rowEnd);
        const __m512i second = Load(row, 2 * at + VectorBytes, rowEnd);
        Store(even, at, count, _mm512_permutex2var_epi8(first, evenBytes, second));
        Store(odd, at, count, _mm512_permutex2var_epi8(first, oddBytes, second));
    }
}

void Split16(const Word* row, Word* even, Word* odd, std::size_t count) {
    const __m512i evenWords = LoadPlaces(&Places.evenWords);
    const __m512i oddWords = LoadPlaces(&Places.oddWords);
    const std::size_t end = 2 * count, rowEnd = 4 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        const __m512i first = Load(row, 2 * at, rowEnd);
        const __m512i second = Load(row, 2 * at + VectorBytes, rowEnd);
        Store(even, at, end, _mm512_permutex2var_epi16(first, evenWords, second));
        Store(odd, at, end, _mm512_permutex2var_epi16(first, oddWords, second));
    }
}

void AddHalves8(const std::uint8_t* first, const std::uint8_t* second, std::uint8_t* output,
                std::size_t count) {
    const __m512i kept = _mm512_set1_epi8(0x7F);
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m512i a = _mm512_srli_epi16(Load(first, at, count), 1);
        const __m512i b = _mm512_srli_epi16(Load(second, at, count), 1);
        Store(output, at, count,
              _mm512_add_epi8(_mm512_and_si512(a, kept), _mm512_and_si512(b, kept)));
    }
}

void AddHalves16(const Word* first, const Word* second, Word* output, std::size_t count) {
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        const __m512i a = _mm512_srli_epi16(Load(first, at, end), 1);
        const __m512i b = _mm512_srli_epi16(Load(second, at, end), 1);
        Store(output, at, end, _mm512_add_epi16(a, b));
    }
}

}  // namespace

const RowKernels AVX512RowKernels{
    .name = "avx512",
    .pack8x3 = Pack8x3,
    .pack8x4 = Pack8x4,
    .pack16x3 = Pack16x3,
    .add8 = Add8,
    .add16 = Add16,
    .shiftRight8 = ShiftRight8,
    .shiftRight16 = ShiftRight16,
    .lookup8x1 = Lookup8x1,
    .lookup8x3 = Lookup8x3,
    .lookup8x4 = Lookup8x4,
    .lookup16x1 = Lookup16x1,
    .lookup16x3 = Lookup16x3,
    .double8 = Double8,
    .double16 = Double16,
    .linearRow8 = LinearRow8,
    .linearColumn8 = LinearColumn8,
    .linearRow16 = LinearRow16,
    .linearColumn16 = LinearColumn16,
    .cubicRow8 = CubicRow8,
    .cubicRow16 = CubicRow16,
    .cubicColumn8 = CubicColumn8,
    .cubicColumn16 = CubicColumn16,
    .split8 = Split8,
    .split16 = Split16,
    .addHalves8 = AddHalves8,
    .addHalves16 = AddHalves16,
};

}  // namespace ZV
