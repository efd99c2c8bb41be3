#include "imaging/kernels/avx512_rows.h"

namespace ZV {

namespace {

using Quartet = __m512i[4];

// Interleaved channels without shuffles. A vector's length is no multiple of the number of
// channels (four channels are rotated within their pixels first), so that a channel stands at other
// positions in each of the vectors that hold a run of pixels. One blend per vector therefore
// gathers a channel, at every position another sample of it, and one takes it back.

constexpr __mmask64 SecondByteOf3 = 0x2492492492492492;
constexpr __mmask64 ThirdByteOf3 = 0x4924924924924924;
constexpr __mmask32 SecondWordOf3 = 0x92492492;
constexpr __mmask32 ThirdWordOf3 = 0x24924924;
constexpr __mmask64 OddBytes = 0xAAAAAAAAAAAAAAAA;
constexpr __mmask32 OddWords = 0xAAAAAAAA;

inline __m512i BlendBytes3(__m512i first, __m512i second, __m512i third) {
    return _mm512_mask_mov_epi8(_mm512_mask_mov_epi8(first, SecondByteOf3, second), ThirdByteOf3,
                                third);
}

inline __m512i BlendWords3(__m512i first, __m512i second, __m512i third) {
    return _mm512_mask_mov_epi16(_mm512_mask_mov_epi16(first, SecondWordOf3, second), ThirdWordOf3,
                                 third);
}

/// From the vectors of a run of pixels, each rotated by its number, to the channels or back.
inline void ExchangeChannels4(Quartet& vectors) {
    const __m512i a = vectors[0], b = vectors[1], c = vectors[2], d = vectors[3];
    const __m512i ab = _mm512_mask_mov_epi8(a, OddBytes, b);
    const __m512i bc = _mm512_mask_mov_epi8(b, OddBytes, c);
    const __m512i cd = _mm512_mask_mov_epi8(c, OddBytes, d);
    const __m512i da = _mm512_mask_mov_epi8(d, OddBytes, a);
    vectors[0] = _mm512_mask_mov_epi16(ab, OddWords, cd);
    vectors[1] = _mm512_mask_mov_epi16(da, OddWords, bc);
    vectors[2] = _mm512_mask_mov_epi16(cd, OddWords, ab);
    vectors[3] = _mm512_mask_mov_epi16(bc, OddWords, da);
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

struct Offsets {
    std::int32_t offsets[16];
};

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

/// Bytes up to the next address that vectors are best written at: here each of them would touch two
/// lines of the cache, and the loops that write two rows feel it.
inline std::size_t CountToLine(const void* row, std::size_t end) {
    const std::size_t count = (~reinterpret_cast<std::uintptr_t>(row) + 1) % VectorBytes;
    return count < end ? count : end;
}

/// Bytes `at` to `at` + 63 of both rows, up to `end`.
inline void SplitBytes(const std::uint8_t* row, std::uint8_t* even, std::uint8_t* odd,
                       std::size_t at, std::size_t end) {
    const __m512i first = Load(row, 2 * at, 2 * end);
    const __m512i second = Load(row, 2 * at + VectorBytes, 2 * end);
    const __m512i evens = _mm512_permutex2var_epi8(first, LoadPlaces(&Places.evenBytes), second);
    const __m512i odds = _mm512_permutex2var_epi8(first, LoadPlaces(&Places.oddBytes), second);
    Store(even, at, end, evens);
    Store(odd, at, end, odds);
}

void Split8(const std::uint8_t* row, std::uint8_t* even, std::uint8_t* odd, std::size_t count) {
    std::size_t at = CountToLine(even, count);
    SplitBytes(row, even, odd, 0, at);
    for (; at < count; at += VectorBytes) SplitBytes(row, even, odd, at, count);
}

inline void SplitWords(const Word* row, Word* even, Word* odd, std::size_t at, std::size_t end) {
    const __m512i first = Load(row, 2 * at, 2 * end);
    const __m512i second = Load(row, 2 * at + VectorBytes, 2 * end);
    const __m512i evens = _mm512_permutex2var_epi16(first, LoadPlaces(&Places.evenWords), second);
    const __m512i odds = _mm512_permutex2var_epi16(first, LoadPlaces(&Places.oddWords), second);
    Store(even, at, end, evens);
    Store(odd, at, end, odds);
}

void Split16(const Word* row, Word* even, Word* odd, std::size_t count) {
    const std::size_t end = 2 * count;
    // At an odd address no vector of words begins with a line.
    std::size_t at = CountToLine(even, end) & ~std::size_t{1};
    SplitWords(row, even, odd, 0, at);
    for (; at < end; at += VectorBytes) SplitWords(row, even, odd, at, end);
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
    .double8 = AVX512Rows::Double8,
    .double16 = AVX512Rows::Double16,
    .linearRow8 = AVX512Rows::LinearRow8,
    .linearColumn8 = AVX512Rows::LinearColumn8,
    .linearColumnPair8 = AVX512Rows::LinearColumnPair8,
    .linearRow16 = AVX512Rows::LinearRow16,
    .linearColumn16 = AVX512Rows::LinearColumn16,
    .linearColumnPair16 = AVX512Rows::LinearColumnPair16,
    .cubicRow8 = AVX512Rows::CubicRow8,
    .cubicRow16 = AVX512Rows::CubicRow16,
    .cubicColumn8 = AVX512Rows::CubicColumn8,
    .cubicColumnPair8 = AVX512Rows::CubicColumnPair8,
    .cubicColumn16 = AVX512Rows::CubicColumn16,
    .cubicColumnPair16 = AVX512Rows::CubicColumnPair16,
    .split8 = Split8,
    .split16 = Split16,
    .addHalves8 = AddHalves8,
    .addHalves16 = AddHalves16,
};

}  // namespace ZV
