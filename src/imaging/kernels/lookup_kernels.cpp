#include <algorithm>
#include <numeric>

#include "imaging/kernels/image_rows.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/kernels.h"
#include "imaging/kernels/scratch.h"

namespace ZV {

namespace {

/// 16-bit images up to this size are not worth a table of every sample.
constexpr std::int64_t SearchedPixelsMax = 6400;

/// The tables of one call, channel by channel.
struct Lookup {
    const std::int32_t* const* values;
    const std::int32_t* const* levels;
    const std::int32_t* counts;
};

template <std::size_t Channels>
KernelStatus CheckArguments(const void* image, std::int32_t rowBytes, KernelSize size,
                            const Lookup& lookup) {
    const bool isAnyNull = image == nullptr || lookup.values == nullptr ||
                           lookup.levels == nullptr || lookup.counts == nullptr;
    if (isAnyNull) return KernelNullPointer;
    for (std::size_t channel = 0; channel < Channels; ++channel) {
        if (lookup.values[channel] == nullptr || lookup.levels[channel] == nullptr) {
            return KernelNullPointer;
        }
    }
    if (IsKernelSizeBad(size)) return KernelBadSize;
    if (rowBytes < 1) return KernelBadStep;
    for (std::size_t channel = 0; channel < Channels; ++channel) {
        if (lookup.counts[channel] < 2) return KernelBadLevels;
    }
    return KernelOk;
}

/// What every sample becomes; `Value` is the samples' type.
template <typename Value>
void FillTable(const std::int32_t* values, const std::int32_t* levels, std::int32_t count,
               Value* table) {
    constexpr std::int32_t Entries = std::int32_t{static_cast<Value>(~Value{0})} + 1;
    for (std::int32_t sample = 0; sample < Entries; ++sample) {
        table[sample] = static_cast<Value>(sample);
    }
    for (std::int32_t level = 0; level < count - 1; ++level) {
        const std::int32_t from = std::max(levels[level], 0);
        const std::int32_t to = std::min(levels[level + 1], Entries);
        const auto value = static_cast<Value>(std::clamp(values[level], 0, Entries - 1));
        for (std::int32_t sample = from; sample < to; ++sample) table[sample] = value;
    }
}

template <typename Value, std::size_t Channels>
void FillTables(const Lookup& lookup, Value* tables) {
    constexpr std::size_t Entries = std::size_t{static_cast<Value>(~Value{0})} + 1;
    for (std::size_t channel = 0; channel < Channels; ++channel) {
        FillTable(lookup.values[channel], lookup.levels[channel], lookup.counts[channel],
                  tables + channel * Entries);
    }
}

/// `Value` is what the table holds, `Sample` the same at any address.
template <typename Value, typename Sample>
void ApplyTables(void (*lookupRow)(const Value*, Sample*, std::size_t), const Value* tables,
                 void* image, std::int32_t rowBytes, KernelSize size, std::size_t channels) {
    const ImageWalk walk =
        PlanImageWalk(size, IsGapless(rowBytes, size.width, channels * sizeof(Sample)));
    for (std::int32_t row = 0; row < walk.rows; ++row) {
        lookupRow(tables, GetImageRow<Sample>(image, rowBytes, row), walk.rowPixels);
    }
}

/// The last level that the sample reaches, by bisection; -1 below the first. Comes back with some
/// level for falling levels too.
std::int32_t FindLevel(const std::int32_t* levels, std::int32_t count, std::int32_t sample) {
    std::int32_t reached = -1;
    std::int32_t beyond = count;
    while (reached + 1 < beyond) {
        const std::int32_t middle = std::midpoint(reached, beyond);
        (levels[middle] <= sample ? reached : beyond) = middle;
    }
    return reached;
}

std::uint16_t SearchSample(const std::int32_t* values, const std::int32_t* levels,
                           std::int32_t count, std::uint16_t sample) {
    const std::int32_t level = FindLevel(levels, count, sample);
    if (level < 0 || level == count - 1) return sample;
    return static_cast<std::uint16_t>(std::clamp(values[level], 0, 65535));
}

template <std::size_t Channels>
void SearchImage(const Lookup& lookup, void* image, std::int32_t rowBytes, KernelSize size) {
    for (std::int32_t row = 0; row < size.height; ++row) {
        Word* sample = GetImageRow<Word>(image, rowBytes, row);
        for (std::int32_t pixel = 0; pixel < size.width; ++pixel) {
            for (std::size_t channel = 0; channel < Channels; ++channel, ++sample) {
                sample->value = SearchSample(lookup.values[channel], lookup.levels[channel],
                                             lookup.counts[channel], sample->value);
            }
        }
    }
}

template <std::size_t Channels>
KernelStatus LookUp8(void (*lookupRow)(const std::uint8_t*, std::uint8_t*, std::size_t),
                     void* image, std::int32_t rowBytes, KernelSize size, const Lookup& lookup) {
    const KernelStatus status = CheckArguments<Channels>(image, rowBytes, size, lookup);
    if (status != KernelOk) return status;
    std::uint8_t tables[Channels * 256];
    FillTables<std::uint8_t, Channels>(lookup, tables);
    ApplyTables(lookupRow, tables, image, rowBytes, size, Channels);
    return KernelOk;
}

template <std::size_t Channels>
KernelStatus LookUp16(void (*lookupRow)(const std::uint16_t*, Word*, std::size_t), void* image,
                      std::int32_t rowBytes, KernelSize size, const Lookup& lookup) {
    const KernelStatus status = CheckArguments<Channels>(image, rowBytes, size, lookup);
    if (status != KernelOk) return status;
    if (std::int64_t{size.width} * size.height <= SearchedPixelsMax) {
        SearchImage<Channels>(lookup, image, rowBytes, size);
        return KernelOk;
    }
    constexpr std::size_t Entries = Channels * 65536;
    // One word more: the row loops may read an entry as the low half of 32 bits.
    const auto tables = MakeScratch<std::uint16_t>(Entries + 1);
    if (tables == nullptr) return KernelNoMemory;
    tables[Entries] = 0;
    FillTables<std::uint16_t, Channels>(lookup, tables.get());
    ApplyTables(lookupRow, static_cast<const std::uint16_t*>(tables.get()), image, rowBytes, size,
                Channels);
    return KernelOk;
}

}  // namespace

KernelStatus LookupInPlace8x4(void* image, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* const values[4],
                              const std::int32_t* const levels[4], const std::int32_t counts[4]) {
    return LookUp8<4>(GetRowKernels().lookup8x4, image, rowBytes, size, {values, levels, counts});
}

KernelStatus LookupInPlace8x3(void* image, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* const values[3],
                              const std::int32_t* const levels[3], const std::int32_t counts[3]) {
    return LookUp8<3>(GetRowKernels().lookup8x3, image, rowBytes, size, {values, levels, counts});
}

KernelStatus LookupInPlace8x1(void* plane, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* values, const std::int32_t* levels,
                              std::int32_t count) {
    return LookUp8<1>(GetRowKernels().lookup8x1, plane, rowBytes, size, {&values, &levels, &count});
}

KernelStatus LookupInPlace16x3(void* image, std::int32_t rowBytes, KernelSize size,
                               const std::int32_t* const values[3],
                               const std::int32_t* const levels[3], const std::int32_t counts[3]) {
    return LookUp16<3>(GetRowKernels().lookup16x3, image, rowBytes, size, {values, levels, counts});
}

KernelStatus LookupInPlace16x1(void* plane, std::int32_t rowBytes, KernelSize size,
                               const std::int32_t* values, const std::int32_t* levels,
                               std::int32_t count) {
    return LookUp16<1>(GetRowKernels().lookup16x1, plane, rowBytes, size,
                       {&values, &levels, &count});
}

}  // namespace ZV
