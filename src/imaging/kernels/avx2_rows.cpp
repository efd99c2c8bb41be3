#include "imaging/kernels/avx2_rows.h"

namespace ZV {

namespace {

using Trio = __m256i[3];
using Quartet = __m256i[4];

/// Bytes that a shuffle takes, or a mask of bytes.
struct Bytes {
    std::uint8_t bytes[32];
};

inline __m256i Get(const Bytes& bytes) {
    return LoadVector(bytes.bytes);
}

/// Every byte at `place` of `period`, counted from the start of each `run` of bytes.
constexpr Bytes MakeMask(std::uint32_t place, std::uint32_t period, std::uint32_t run) {
    Bytes made{};
    for (std::uint32_t byte = 0; byte < 32; ++byte) {
        made.bytes[byte] = byte % run % period == place ? 0xFF : 0;
    }
    return made;
}

// Interleaved channels without shuffles. A vector's length is no multiple of the number of
// channels (four channels are rotated within their pixels first), so that a channel stands at other
// positions in each of the vectors that hold a run of pixels. One blend per vector therefore
// gathers a channel, at every position another sample of it, and one takes it back.

constexpr Bytes SecondOf3 = MakeMask(1, 3, 32), ThirdOf3 = MakeMask(2, 3, 32);
constexpr Bytes SecondOf3InLane = MakeMask(1, 3, 16), ThirdOf3InLane = MakeMask(2, 3, 16);
constexpr Bytes OddBytes = MakeMask(1, 2, 32);

inline __m256i Blend3(__m256i first, __m256i second, __m256i third, __m256i secondMask,
                      __m256i thirdMask) {
    return _mm256_blendv_epi8(_mm256_blendv_epi8(first, second, secondMask), third, thirdMask);
}

/// Turns what one lane of every vector holds, lane by lane, into the order of the row.
inline void StoreLanes3(void* row, std::size_t at, std::size_t end, const Trio& vectors) {
    const __m256i a = vectors[0], b = vectors[1], c = vectors[2];
    Store(row, at, end, _mm256_permute2x128_si256(a, b, 0x20));
    Store(row, at + VectorBytes, end, _mm256_permute2x128_si256(c, a, 0x30));
    Store(row, at + 2 * VectorBytes, end, _mm256_permute2x128_si256(b, c, 0x31));
}

/// Where a plane's samples go, within each lane, before they are blended: byte j takes the sample
/// of the one output in which byte j belongs to the channel.
constexpr Bytes MakePackPlaces8x3(std::uint32_t channel) {
    Bytes made{};
    for (std::uint32_t byte = 0; byte < 32; ++byte) {
        const std::uint32_t place = byte % 16, output = (channel + 2 * place) % 3;
        made.bytes[byte] = static_cast<std::uint8_t>((16 * output + place) / 3);
    }
    return made;
}

constexpr Bytes MakePackPlaces16x3(std::uint32_t channel) {
    Bytes made{};
    for (std::uint32_t byte = 0; byte < 32; ++byte) {
        const std::uint32_t place = byte % 16 / 2, output = (place + 3 - channel) % 3;
        made.bytes[byte] = static_cast<std::uint8_t>((8 * output + place) / 3 * 2 + byte % 2);
    }
    return made;
}

constexpr Bytes PackPlaces8x3[] = {MakePackPlaces8x3(0), MakePackPlaces8x3(1),
                                   MakePackPlaces8x3(2)};
constexpr Bytes PackPlaces16x3[] = {MakePackPlaces16x3(0), MakePackPlaces16x3(1),
                                    MakePackPlaces16x3(2)};

void Pack8x3(const std::uint8_t* const planes[3], std::uint8_t* pixels, std::size_t count) {
    const std::uint8_t *const first = planes[0], *const second = planes[1],
                              *const third = planes[2];
    const __m256i firstPlaces = Get(PackPlaces8x3[0]), secondPlaces = Get(PackPlaces8x3[1]);
    const __m256i thirdPlaces = Get(PackPlaces8x3[2]);
    const __m256i x = Get(SecondOf3InLane), y = Get(ThirdOf3InLane);
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m256i a = _mm256_shuffle_epi8(Load(first, at, count), firstPlaces);
        const __m256i b = _mm256_shuffle_epi8(Load(second, at, count), secondPlaces);
        const __m256i c = _mm256_shuffle_epi8(Load(third, at, count), thirdPlaces);
        const Trio vectors = {Blend3(a, b, c, x, y), Blend3(b, c, a, x, y), Blend3(c, a, b, x, y)};
        StoreLanes3(pixels, 3 * at, 3 * count, vectors);
    }
}

inline __m256i BlendWords3(__m256i first, __m256i second, __m256i third) {
    return _mm256_blend_epi16(_mm256_blend_epi16(first, second, 0x92), third, 0x24);
}

void Pack16x3(const Word* const planes[3], Word* pixels, std::size_t count) {
    const Word *const first = planes[0], *const second = planes[1], *const third = planes[2];
    const __m256i firstPlaces = Get(PackPlaces16x3[0]), secondPlaces = Get(PackPlaces16x3[1]);
    const __m256i thirdPlaces = Get(PackPlaces16x3[2]);
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        const __m256i a = _mm256_shuffle_epi8(Load(first, at, end), firstPlaces);
        const __m256i b = _mm256_shuffle_epi8(Load(second, at, end), secondPlaces);
        const __m256i c = _mm256_shuffle_epi8(Load(third, at, end), thirdPlaces);
        const Trio vectors = {BlendWords3(a, b, c), BlendWords3(c, a, b), BlendWords3(b, c, a)};
        StoreLanes3(pixels, 3 * at, 3 * end, vectors);
    }
}

void Pack8x4(const std::uint8_t* const planes[4], std::uint8_t* pixels, std::size_t count) {
    const std::uint8_t *const first = planes[0], *const second = planes[1],
                              *const third = planes[2], *const fourth = planes[3];
    const std::size_t end = 4 * count;
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m256i a = Load(first, at, count), b = Load(second, at, count);
        const __m256i c = Load(third, at, count), d = Load(fourth, at, count);
        const __m256i lowAB = _mm256_unpacklo_epi8(a, b), highAB = _mm256_unpackhi_epi8(a, b);
        const __m256i lowCD = _mm256_unpacklo_epi8(c, d), highCD = _mm256_unpackhi_epi8(c, d);
        const __m256i w = _mm256_unpacklo_epi16(lowAB, lowCD);
        const __m256i x = _mm256_unpackhi_epi16(lowAB, lowCD);
        const __m256i y = _mm256_unpacklo_epi16(highAB, highCD);
        const __m256i z = _mm256_unpackhi_epi16(highAB, highCD);
        Store(pixels, 4 * at, end, _mm256_permute2x128_si256(w, x, 0x20));
        Store(pixels, 4 * at + VectorBytes, end, _mm256_permute2x128_si256(y, z, 0x20));
        Store(pixels, 4 * at + 2 * VectorBytes, end, _mm256_permute2x128_si256(w, x, 0x31));
        Store(pixels, 4 * at + 3 * VectorBytes, end, _mm256_permute2x128_si256(y, z, 0x31));
    }
}

void Add8(const std::uint8_t* source, std::uint8_t* samples, std::size_t count) {
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m256i sum = _mm256_adds_epu8(Load(samples, at, count), Load(source, at, count));
        Store(samples, at, count, sum);
    }
}

void Add16(const Word* source, Word* samples, std::size_t count) {
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        const __m256i sum = _mm256_adds_epu16(Load(samples, at, end), Load(source, at, end));
        Store(samples, at, end, sum);
    }
}

void ShiftRight8(std::int32_t shift, std::uint8_t* samples, std::size_t count) {
    const __m128i bits = _mm_cvtsi32_si128(shift);
    const __m256i kept = _mm256_set1_epi8(static_cast<char>(0xFF >> shift));
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m256i shifted = _mm256_srl_epi16(Load(samples, at, count), bits);
        Store(samples, at, count, _mm256_and_si256(shifted, kept));
    }
}

void ShiftRight16(std::int32_t shift, Word* samples, std::size_t count) {
    const __m128i bits = _mm_cvtsi32_si128(shift);
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        Store(samples, at, end, _mm256_srl_epi16(Load(samples, at, end), bits));
    }
}

/// A channel's 256 entries in rows of sixteen, each row but the first of either half exclusive-ored
/// with the one before: all rows up to a sample's own together give its entry.
struct Table8 {
    Bytes rows[16];
};

inline void MakeTable8(const std::uint8_t* table, Table8& made) {
    __m128i previous = _mm_setzero_si128();
    for (std::size_t row = 0; row < 16; ++row) {
        const __m128i entries = _mm_loadu_si128(reinterpret_cast<const __m128i*>(table + 16 * row));
        const __m128i change = row == 8 ? entries : _mm_xor_si128(entries, previous);
        _mm256_storeu_si256(reinterpret_cast<__m256i*>(made.rows[row].bytes),
                            _mm256_broadcastsi128_si256(change));
        previous = entries;
    }
}

inline __m256i Map8(const Table8& table, __m256i samples) {
    // A shuffle gives 0 where bit 7 is set: as soon as the steps have gone beyond a sample's row.
    const __m256i step = _mm256_set1_epi8(16);
    __m256i places = _mm256_and_si256(samples, _mm256_set1_epi8(0x7F));
    __m256i lower = _mm256_shuffle_epi8(Get(table.rows[0]), places);
    __m256i upper = _mm256_shuffle_epi8(Get(table.rows[8]), places);
    for (std::size_t row = 1; row < 8; ++row) {
        places = _mm256_subs_epi8(places, step);
        lower = _mm256_xor_si256(lower, _mm256_shuffle_epi8(Get(table.rows[row]), places));
        upper = _mm256_xor_si256(upper, _mm256_shuffle_epi8(Get(table.rows[row + 8]), places));
    }
    return _mm256_blendv_epi8(lower, upper, samples);
}

void Lookup8x1(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count) {
    Table8 table;
    MakeTable8(tables, table);
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        Store(samples, at, count, Map8(table, Load(samples, at, count)));
    }
}

void Lookup8x3(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count) {
    Table8 first, second, third;
    MakeTable8(tables, first);
    MakeTable8(tables + 256, second);
    MakeTable8(tables + 512, third);
    const __m256i x = Get(SecondOf3), y = Get(ThirdOf3);
    const std::size_t end = 3 * count;
    for (std::size_t at = 0; at < end; at += 3 * VectorBytes) {
        const __m256i a = Load(samples, at, end);
        const __m256i b = Load(samples, at + VectorBytes, end);
        const __m256i c = Load(samples, at + 2 * VectorBytes, end);
        const __m256i d = Map8(first, Blend3(a, b, c, x, y));
        const __m256i e = Map8(second, Blend3(c, a, b, x, y));
        const __m256i f = Map8(third, Blend3(b, c, a, x, y));
        Store(samples, at, end, Blend3(d, e, f, x, y));
        Store(samples, at + VectorBytes, end, Blend3(f, d, e, x, y));
        Store(samples, at + 2 * VectorBytes, end, Blend3(e, f, d, x, y));
    }
}

/// Where bytes come from that are rotated within their pixels of four, upward by `count`.
constexpr Bytes MakeRotation(std::uint32_t count) {
    Bytes made{};
    for (std::uint32_t byte = 0; byte < 32; ++byte) {
        made.bytes[byte] = static_cast<std::uint8_t>(byte % 16 / 4 * 4 + (byte + 4 - count) % 4);
    }
    return made;
}

constexpr Bytes Rotations[] = {MakeRotation(1), MakeRotation(2), MakeRotation(3)};

inline __m256i Rotate(__m256i pixels, std::size_t count) {
    return count == 0 ? pixels : _mm256_shuffle_epi8(pixels, Get(Rotations[count - 1]));
}

/// From the vectors of a run of pixels, each rotated by its number, to the channels or back.
inline void ExchangeChannels4(Quartet& vectors) {
    const __m256i odd = Get(OddBytes);
    const __m256i a = vectors[0], b = vectors[1], c = vectors[2], d = vectors[3];
    const __m256i ab = _mm256_blendv_epi8(a, b, odd), bc = _mm256_blendv_epi8(b, c, odd);
    const __m256i cd = _mm256_blendv_epi8(c, d, odd), da = _mm256_blendv_epi8(d, a, odd);
    vectors[0] = _mm256_blend_epi16(ab, cd, 0xAA);
    vectors[1] = _mm256_blend_epi16(da, bc, 0xAA);
    vectors[2] = _mm256_blend_epi16(cd, ab, 0xAA);
    vectors[3] = _mm256_blend_epi16(bc, da, 0xAA);
}

void Lookup8x4(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count) {
    Table8 channels[4];
    for (std::size_t channel = 0; channel < 4; ++channel) {
        MakeTable8(tables + 256 * channel, channels[channel]);
    }
    const std::size_t end = 4 * count;
    for (std::size_t at = 0; at < end; at += 4 * VectorBytes) {
        Quartet vectors;
        for (std::size_t index = 0; index < 4; ++index) {
            vectors[index] = Rotate(Load(samples, at + VectorBytes * index, end), index);
        }
        ExchangeChannels4(vectors);
        for (std::size_t index = 0; index < 4; ++index) {
            vectors[index] = Map8(channels[index], vectors[index]);
        }
        ExchangeChannels4(vectors);
        for (std::size_t index = 0; index < 4; ++index) {
            const __m256i pixels = Rotate(vectors[index], (4 - index) % 4);
            Store(samples, at + VectorBytes * index, end, pixels);
        }
    }
}

// Plain loads: processors that guard gathers against leaks lose more by them than others gain.
void Lookup16x1(const std::uint16_t* tables, Word* samples, std::size_t count) {
    for (std::size_t index = 0; index < count; ++index) {
        samples[index].value = tables[samples[index].value];
    }
}

void Lookup16x3(const std::uint16_t* tables, Word* samples, std::size_t count) {
    const std::uint16_t *const second = tables + 65536, *const third = tables + 131072;
    for (Word* const end = samples + 3 * count; samples != end; samples += 3) {
        samples[0].value = tables[samples[0].value];
        samples[1].value = second[samples[1].value];
        samples[2].value = third[samples[2].value];
    }
}

void Split8(const std::uint8_t* row, std::uint8_t* even, std::uint8_t* odd, std::size_t count) {
    const __m256i low = _mm256_set1_epi16(0xFF);
    const std::size_t rowEnd = 2 * count;
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m256i a = Load(row, 2 * at, rowEnd);
        const __m256i b = Load(row, 2 * at + VectorBytes, rowEnd);
        const __m256i evens =
            _mm256_packus_epi16(_mm256_and_si256(a, low), _mm256_and_si256(b, low));
        const __m256i odds = _mm256_packus_epi16(_mm256_srli_epi16(a, 8), _mm256_srli_epi16(b, 8));
        Store(even, at, count, SwapMiddle(evens));
        Store(odd, at, count, SwapMiddle(odds));
    }
}

void Split16(const Word* row, Word* even, Word* odd, std::size_t count) {
    const __m256i low = _mm256_set1_epi32(0xFFFF);
    const std::size_t end = 2 * count, rowEnd = 4 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        const __m256i a = Load(row, 2 * at, rowEnd);
        const __m256i b = Load(row, 2 * at + VectorBytes, rowEnd);
        const __m256i evens =
            _mm256_packus_epi32(_mm256_and_si256(a, low), _mm256_and_si256(b, low));
        const __m256i odds =
            _mm256_packus_epi32(_mm256_srli_epi32(a, 16), _mm256_srli_epi32(b, 16));
        Store(even, at, end, SwapMiddle(evens));
        Store(odd, at, end, SwapMiddle(odds));
    }
}

void AddHalves8(const std::uint8_t* first, const std::uint8_t* second, std::uint8_t* output,
                std::size_t count) {
    const __m256i kept = _mm256_set1_epi8(0x7F);
    for (std::size_t at = 0; at < count; at += VectorBytes) {
        const __m256i a = _mm256_srli_epi16(Load(first, at, count), 1);
        const __m256i b = _mm256_srli_epi16(Load(second, at, count), 1);
        Store(output, at, count,
              _mm256_add_epi8(_mm256_and_si256(a, kept), _mm256_and_si256(b, kept)));
    }
}

void AddHalves16(const Word* first, const Word* second, Word* output, std::size_t count) {
    const std::size_t end = 2 * count;
    for (std::size_t at = 0; at < end; at += VectorBytes) {
        const __m256i a = _mm256_srli_epi16(Load(first, at, end), 1);
        const __m256i b = _mm256_srli_epi16(Load(second, at, end), 1);
        Store(output, at, end, _mm256_add_epi16(a, b));
    }
}

}  // namespace

const RowKernels AVX2RowKernels{
    .name = "avx2",
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
    .double8 = AVX2Rows::Double8,
    .double16 = AVX2Rows::Double16,
    .linearRow8 = AVX2Rows::LinearRow8,
    .linearColumn8 = AVX2Rows::LinearColumn8,
    .linearColumnPair8 = AVX2Rows::LinearColumnPair8,
    .linearRow16 = AVX2Rows::LinearRow16,
    .linearColumn16 = AVX2Rows::LinearColumn16,
    .linearColumnPair16 = AVX2Rows::LinearColumnPair16,
    .cubicRow8 = AVX2Rows::CubicRow8,
    .cubicRow16 = AVX2Rows::CubicRow16,
    .cubicColumn8 = AVX2Rows::CubicColumn8,
    .cubicColumnPair8 = AVX2Rows::CubicColumnPair8,
    .cubicColumn16 = AVX2Rows::CubicColumn16,
    .cubicColumnPair16 = AVX2Rows::CubicColumnPair16,
    .split8 = Split8,
    .split16 = Split16,
    .addHalves8 = AddHalves8,
    .addHalves16 = AddHalves16,
};

}  // namespace ZV
