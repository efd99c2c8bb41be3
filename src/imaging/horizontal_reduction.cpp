#include "imaging/horizontal_reduction.h"

#include <emmintrin.h>

#include <bit>
#include <cstddef>
#include <cstring>

namespace ZV {
namespace {

// Samples are worked on several to a register, the first in the lowest bits.
static_assert(std::endian::native == std::endian::little);

template <typename Value>
Value Load(const std::uint8_t* bytes) {
    Value value;
    std::memcpy(&value, bytes, sizeof value);
    return value;
}

template <typename Value>
void Store(std::uint8_t* bytes, Value value) {
    std::memcpy(bytes, &value, sizeof value);
}

/// Groups one by one, as the arithmetic is told.
template <typename Sample, std::uint32_t Factor>
void ReduceGroups(const std::uint8_t* row, std::uint8_t* reduced, std::size_t groups) {
    for (std::size_t group = 0; group < groups; ++group) {
        std::uint32_t sums[2] = {};
        for (std::size_t sample = 0; sample < 2 * Factor; ++sample) {
            sums[sample % 2] += Load<Sample>(row + sample * sizeof(Sample));
        }
        Store(reduced, static_cast<Sample>(sums[0] / Factor));
        Store(reduced + sizeof(Sample), static_cast<Sample>(sums[1] / Factor));
        row += 2 * Factor * sizeof(Sample);
        reduced += 2 * sizeof(Sample);
    }
}

// All of a group, or of a block of groups, is read before any of it is written, so that a row may
// be reduced in place.

/// The first words of the groups of both blocks.
__m128i TakeFirstWords(__m128i lower, __m128i upper) {
    return _mm_packs_epi32(_mm_srai_epi32(_mm_slli_epi32(lower, 16), 16),
                           _mm_srai_epi32(_mm_slli_epi32(upper, 16), 16));
}

__m128i TakeSecondWords(__m128i lower, __m128i upper) {
    return _mm_packs_epi32(_mm_srai_epi32(lower, 16), _mm_srai_epi32(upper, 16));
}

/// Eight groups of four bytes.
void HalveBlock(const std::uint8_t* row, std::uint8_t* reduced) {
    const __m128i lower = _mm_loadu_si128(reinterpret_cast<const __m128i*>(row));
    const __m128i upper = _mm_loadu_si128(reinterpret_cast<const __m128i*>(row + 16));
    const __m128i first = TakeFirstWords(lower, upper);
    const __m128i second = TakeSecondWords(lower, upper);
    const __m128i differences =
        _mm_and_si128(_mm_srli_epi16(_mm_xor_si128(first, second), 1), _mm_set1_epi8(0x7F));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(reduced),
                     _mm_adds_epu8(_mm_and_si128(first, second), differences));
}

// This one and the next take what they can and leave the last groups of a row to ReduceGroups.

void HalveBytes(const std::uint8_t* row, std::uint8_t* reduced, std::size_t groups) {
    for (; groups >= 8; groups -= 8) {
        HalveBlock(row, reduced);
        row += 32;
        reduced += 16;
    }
    constexpr std::uint64_t HalfMask = 0x00007F7F00007F7F;
    for (; groups >= 2; groups -= 2) {
        const auto first = Load<std::uint64_t>(row);
        const std::uint64_t second = first >> 16;
        const std::uint64_t means = (first & second) + (((first ^ second) >> 1) & HalfMask);
        Store(reduced, static_cast<std::uint32_t>((means & 0xFFFF) | (means >> 16 & 0xFFFF0000)));
        row += 8;
        reduced += 4;
    }
    ReduceGroups<std::uint8_t, 2>(row, reduced, groups);
}

void ThirdBytes(const std::uint8_t* row, std::uint8_t* reduced, std::size_t groups) {
    constexpr std::uint64_t ColourMask = 0x000000FF00FF00FF;
    constexpr std::uint64_t SumFactor = 0x0000000100010001;  // The sum stands in bits 32 to 47.
    for (; groups >= 2; --groups) {  // The last would be read beyond its end.
        const auto bytes = Load<std::uint64_t>(row);
        const std::uint64_t first = (bytes & ColourMask) * SumFactor >> 32 & 0xFFFF;
        const std::uint64_t second = (bytes >> 8 & ColourMask) * SumFactor >> 32 & 0xFFFF;
        Store(reduced, static_cast<std::uint16_t>(first / 3 | (second / 3) << 8));
        row += 6;
        reduced += 2;
    }
    ReduceGroups<std::uint8_t, 3>(row, reduced, groups);
}

void QuarterBytes(const std::uint8_t* row, std::uint8_t* reduced, std::size_t groups) {
    constexpr std::uint64_t ColourMask = 0x00FF00FF00FF00FF;
    constexpr std::uint64_t SumFactor = 0x0001000100010001;  // The sum stands in the upper bits.
    for (; groups != 0; --groups) {
        const auto bytes = Load<std::uint64_t>(row);
        const std::uint64_t first = (bytes & ColourMask) * SumFactor >> 50;
        const std::uint64_t second = (bytes >> 8 & ColourMask) * SumFactor >> 50;
        Store(reduced, static_cast<std::uint16_t>(first | second << 8));
        row += 8;
        reduced += 2;
    }
}

void HalveWords(const std::uint8_t* row, std::uint8_t* reduced, std::size_t groups) {
    for (; groups != 0; --groups) {
        const auto first = Load<std::uint32_t>(row);
        const auto second = Load<std::uint32_t>(row + 4);
        Store(reduced, (first & second) + ((first ^ second) >> 1 & 0x7FFF7FFF));
        row += 8;
        reduced += 4;
    }
}

/// One sample of each colour, with room for sums.
std::uint64_t LoadPair(const std::uint8_t* bytes) {
    const std::uint64_t pair = Load<std::uint32_t>(bytes);
    return (pair | pair << 16) & 0x0000FFFF0000FFFF;
}

template <std::uint32_t Factor>
void ReduceWords(const std::uint8_t* row, std::uint8_t* reduced, std::size_t groups) {
    for (; groups != 0; --groups) {
        std::uint64_t sums = 0;
        for (std::size_t pair = 0; pair < Factor; ++pair) sums += LoadPair(row + 4 * pair);
        const std::uint32_t first = static_cast<std::uint32_t>(sums) / Factor;
        const std::uint32_t second = static_cast<std::uint32_t>(sums >> 32) / Factor;
        Store(reduced, first | second << 16);
        row += std::size_t{4} * Factor;
        reduced += 4;
    }
}

using ReduceRow = void (*)(const std::uint8_t* row, std::uint8_t* reduced, std::size_t groups);

struct Reduction {
    std::uint32_t factor;
    ReduceRow bytes;
    ReduceRow words;
};

constexpr Reduction Reductions[] = {
    {2, HalveBytes, HalveWords},
    {3, ThirdBytes, ReduceWords<3>},
    {4, QuarterBytes, ReduceWords<4>},
};

const Reduction* FindReduction(std::uint32_t factor) {
    for (const Reduction& reduction : Reductions) {
        if (reduction.factor == factor) return &reduction;
    }
    return nullptr;
}

}  // namespace

std::uint32_t CalculateReducedWidth(std::uint32_t width, std::uint32_t factor) {
    if (factor == 0) return 0;
    return static_cast<std::uint32_t>(width / (std::uint64_t{factor} * 2) * 2);
}

bool CanReduceWidth(std::uint32_t factor) {
    return FindReduction(factor) != nullptr;
}

void ReduceRows(const std::uint8_t* rows, std::uint32_t width, std::uint32_t height,
                std::uint32_t factor, std::uint32_t sampleBytes, std::uint8_t* reduced) {
    const Reduction* const reduction = FindReduction(factor);
    if (reduction == nullptr) return;
    const ReduceRow reduce = sampleBytes == 1 ? reduction->bytes : reduction->words;
    const std::size_t groups = CalculateReducedWidth(width, factor) / 2;
    for (std::uint32_t row = 0; row < height; ++row) {
        reduce(rows, reduced, groups);
        rows += std::size_t{width} * sampleBytes;
        reduced += groups * 2 * sampleBytes;
    }
}

}  // namespace ZV
