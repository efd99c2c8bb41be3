// Lookups in place in every form, against the judge.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <limits>
#include <numeric>
#include <string>
#include <vector>

#include "imaging/kernels/kernel_fixture.h"
#include "imaging/kernels/kernel_judge.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/kernels.h"
#include "imaging/kernels/pixel_rows.h"

namespace ZV::Testing {
namespace {

using Numbers = std::vector<std::int32_t>;

constexpr std::int32_t Lowest = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t Highest = std::numeric_limits<std::int32_t>::max();

/// Values and levels of the channels of one call.
struct LookupTables {
    std::vector<Numbers> values;
    std::vector<Numbers> levels;
};

/// The kernels and their judges under one signature.
using LookupFunction = KernelStatus (*)(void* image, std::int32_t rowBytes, KernelSize size,
                                        const std::int32_t* const* values,
                                        const std::int32_t* const* levels,
                                        const std::int32_t* counts);

template <auto Lookup>
KernelStatus LookupOneChannel(void* image, std::int32_t rowBytes, KernelSize size,
                              const std::int32_t* const* values, const std::int32_t* const* levels,
                              const std::int32_t* counts) {
    return Lookup(image, rowBytes, size, values[0], levels[0], counts[0]);
}

struct LookupKernel {
    const char* name;
    std::size_t channels;
    std::size_t sampleBytes;
    LookupFunction kernel;
    LookupFunction judge;
};

constexpr std::array ByteKernels{
    LookupKernel{"LookupInPlace8x1", 1, 1, LookupOneChannel<LookupInPlace8x1>,
                 LookupOneChannel<Judge::LookupInPlace8x1>},
    LookupKernel{"LookupInPlace8x3", 3, 1, LookupInPlace8x3, Judge::LookupInPlace8x3},
    LookupKernel{"LookupInPlace8x4", 4, 1, LookupInPlace8x4, Judge::LookupInPlace8x4},
};

constexpr std::array WordKernels{
    LookupKernel{"LookupInPlace16x1", 1, 2, LookupOneChannel<LookupInPlace16x1>,
                 LookupOneChannel<Judge::LookupInPlace16x1>},
    LookupKernel{"LookupInPlace16x3", 3, 2, LookupInPlace16x3, Judge::LookupInPlace16x3},
};

std::vector<LookupKernel> ListAllKernels() {
    std::vector<LookupKernel> all(ByteKernels.begin(), ByteKernels.end());
    all.insert(all.end(), WordKernels.begin(), WordKernels.end());
    return all;
}

std::int32_t GetTop(const LookupKernel& row) {
    return row.sampleBytes == 1 ? 255 : 65535;
}

KernelStatus Call(LookupFunction lookup, void* image, std::int32_t rowBytes, KernelSize size,
                  const LookupTables& tables) {
    std::vector<const std::int32_t*> values;
    std::vector<const std::int32_t*> levels;
    Numbers counts;
    for (std::size_t channel = 0; channel < tables.values.size(); ++channel) {
        values.push_back(tables.values[channel].data());
        levels.push_back(tables.levels[channel].data());
        counts.push_back(static_cast<std::int32_t>(tables.levels[channel].size()));
    }
    return lookup(image, rowBytes, size, values.data(), levels.data(), counts.data());
}

KernelStatus Call(LookupFunction lookup, const PixelRows& image, KernelSize size,
                  const LookupTables& tables) {
    return Call(lookup, image.GetStart(), image.GetRowBytes(), size, tables);
}

class KernelLookups : public KernelFormTest {
  protected:
    std::int32_t PickBetween(std::int32_t low, std::int32_t high) {
        return std::uniform_int_distribution<std::int32_t>(low, high)(random);
    }

    /// As the white balance has it: each sample value is a level of its own.
    LookupTables MakeFullTables(const LookupKernel& row);
    /// Few levels that never fall, some twice, some beyond the samples' range.
    LookupTables MakeSparseTables(const LookupKernel& row, std::size_t count);
    Numbers MakeValues(std::int32_t top, std::size_t count);

    [[nodiscard]] PixelRows MakeImage(const LookupKernel& row, KernelSize size,
                                      const RowLayout& layout) const {
        return {layout, static_cast<std::size_t>(size.width) * row.channels * row.sampleBytes,
                static_cast<std::size_t>(size.height)};
    }

    void Compare(const LookupKernel& row, KernelSize size, const RowLayout& layout, SampleKind kind,
                 const LookupTables& tables);
};

/// Some in range, some a little and some far beyond it.
Numbers KernelLookups::MakeValues(std::int32_t top, std::size_t count) {
    Numbers values(count);
    for (std::int32_t& value : values) {
        const std::int32_t pick = PickBetween(0, 9);
        value = pick == 0   ? PickBetween(Lowest, Highest)
                : pick == 1 ? PickBetween(-top, 2 * top)
                            : PickBetween(0, top);
    }
    return values;
}

LookupTables KernelLookups::MakeFullTables(const LookupKernel& row) {
    LookupTables tables;
    const std::size_t count = static_cast<std::size_t>(GetTop(row)) + 1;
    for (std::size_t channel = 0; channel < row.channels; ++channel) {
        tables.values.push_back(MakeValues(GetTop(row), count));
        tables.levels.emplace_back(count);
        std::iota(tables.levels.back().begin(), tables.levels.back().end(), 0);
    }
    return tables;
}

LookupTables KernelLookups::MakeSparseTables(const LookupKernel& row, std::size_t count) {
    LookupTables tables;
    const std::int32_t top = GetTop(row);
    for (std::size_t channel = 0; channel < row.channels; ++channel) {
        Numbers levels(count);
        for (std::int32_t& level : levels)
            level = PickBetween(0, 7) == 0 ? PickBetween(-top, 2 * top) : PickBetween(0, top);
        std::sort(levels.begin(), levels.end());
        for (std::size_t i = 1; i < count; ++i)
            if (PickBetween(0, 3) == 0) levels[i] = levels[i - 1];
        tables.values.push_back(MakeValues(top, count));
        tables.levels.push_back(levels);
    }
    return tables;
}

void KernelLookups::Compare(const LookupKernel& row, KernelSize size, const RowLayout& layout,
                            SampleKind kind, const LookupTables& tables) {
    const PixelRows actual = MakeImage(row, size, layout);
    const PixelRows expected = MakeImage(row, size, layout);
    actual.Fill(kind, row.sampleBytes, random);
    expected.CopyRowsFrom(actual);

    ASSERT_EQ(Call(row.kernel, actual, size, tables), KernelOk);
    ASSERT_EQ(Call(row.judge, expected, size, tables), KernelOk);

    ASSERT_EQ(actual.Compare(expected, row.sampleBytes), "")
        << Describe(std::string(row.name) + ", " + layout.name, size);
}

SampleKind PickKind(std::mt19937& random) {
    return random() % 2 == 0 ? SampleKind::Random
                             : AllSampleKinds[random() % AllSampleKinds.size()];
}

TEST_P(KernelLookups, FullTablesGiveTheJudgesBytesAtEverySizeAndPlace) {
    for (const LookupKernel& row : ByteKernels) {
        const LookupTables tables = MakeFullTables(row);
        for (const KernelSize size : MakeKernelSizes(random))
            for (const RowLayout& layout : DownwardLayouts) {
                Compare(row, size, layout, PickKind(random), tables);
                if (HasFatalFailure()) return;
            }
    }
}

TEST_P(KernelLookups, FullTablesGiveTheJudgesWordsAtEverySizeAndPlace) {
    for (const LookupKernel& row : WordKernels) {
        const LookupTables tables = MakeFullTables(row);
        std::size_t turn = 0;
        for (const KernelSize size : MakeKernelSizes(random)) {
            Compare(row, size, DownwardLayouts[turn++ % DownwardLayouts.size()], PickKind(random),
                    tables);
            if (HasFatalFailure()) return;
        }
    }
}

TEST_P(KernelLookups, ImagesAroundTheSizeThatEarnsATableComeOutAlike) {
    const std::array sizes{KernelSize{80, 79}, KernelSize{80, 80},   KernelSize{6401, 1},
                           KernelSize{80, 81}, KernelSize{1, 6400},  KernelSize{1, 6401},
                           KernelSize{97, 66}, KernelSize{1392, 13}, KernelSize{139, 131}};
    for (const LookupKernel& row : WordKernels)
        for (const LookupTables& tables : {MakeFullTables(row), MakeSparseTables(row, 11)})
            for (const KernelSize size : sizes) {
                Compare(row, size, DownwardLayouts[random() % DownwardLayouts.size()],
                        SampleKind::Random, tables);
                if (HasFatalFailure()) return;
            }
}

TEST_P(KernelLookups, TablesOfTheLastCallDoNotOutliveTheirContents) {
    // The same addresses with other values in them.
    for (const LookupKernel& row : ListAllKernels()) {
        LookupTables tables = MakeFullTables(row);
        for (int call = 0; call < 3; ++call) {
            Compare(row, {90, 80}, DownwardLayouts[0], SampleKind::Random, tables);
            if (HasFatalFailure()) return;
            for (Numbers& values : tables.values)
                values[values.size() / 2 + static_cast<std::size_t>(call)] = 77;
            tables.levels.back().front() = -5;
        }
    }
}

TEST_P(KernelLookups, FewLevelsGiveTheJudgesSamples) {
    for (const LookupKernel& row : ListAllKernels())
        for (int round = CountKernelRounds(300); round > 0; --round) {
            const auto count = static_cast<std::size_t>(PickBetween(2, round % 3 == 0 ? 4 : 60));
            const KernelSize size{PickBetween(1, 90), PickBetween(1, 6)};
            Compare(row, size, DownwardLayouts[random() % DownwardLayouts.size()], PickKind(random),
                    MakeSparseTables(row, count));
            if (HasFatalFailure()) return;
        }
}

TEST_P(KernelLookups, MoreLevelsThanSampleValuesGiveTheJudgesSamples) {
    for (const LookupKernel& row : ListAllKernels())
        for (const KernelSize size : {KernelSize{60, 3}, KernelSize{100, 70}}) {
            const auto count = static_cast<std::size_t>(GetTop(row)) + 100;
            Compare(row, size, DownwardLayouts[0], SampleKind::Random,
                    MakeSparseTables(row, count));
            if (HasFatalFailure()) return;
        }
}

TEST_P(KernelLookups, OfRepeatedLevelsTheLastOneWins) {
    std::array<std::uint8_t, 4> bytes{9, 10, 19, 20};
    std::array<std::uint16_t, 4> words{9, 10, 19, 20};
    constexpr std::array Levels{10, 10, 10, 20, 20};
    constexpr std::array Values{1, 2, 3, 4, 5};

    EXPECT_EQ(LookupInPlace8x1(bytes.data(), 4, {4, 1}, Values.data(), Levels.data(), 5), KernelOk);
    EXPECT_EQ(LookupInPlace16x1(words.data(), 8, {4, 1}, Values.data(), Levels.data(), 5),
              KernelOk);

    EXPECT_EQ(bytes, (std::array<std::uint8_t, 4>{9, 3, 3, 20}));
    EXPECT_EQ(words, (std::array<std::uint16_t, 4>{9, 3, 3, 20}));
}

TEST_P(KernelLookups, LevelsBeyondTheSamplesAreCut) {
    std::array<std::uint8_t, 3> bytes{0, 128, 255};
    std::array<std::uint16_t, 3> words{0, 128, 65535};
    constexpr std::array Levels{Lowest, 100, Highest};
    constexpr std::array Values{50, 60, 70};

    EXPECT_EQ(LookupInPlace8x1(bytes.data(), 3, {3, 1}, Values.data(), Levels.data(), 3), KernelOk);
    EXPECT_EQ(LookupInPlace16x1(words.data(), 6, {3, 1}, Values.data(), Levels.data(), 3),
              KernelOk);

    EXPECT_EQ(bytes, (std::array<std::uint8_t, 3>{50, 60, 60}));
    EXPECT_EQ(words, (std::array<std::uint16_t, 3>{50, 60, 60}));
}

TEST_P(KernelLookups, LevelsThatAreAllBeyondTheSamplesChangeNothing) {
    std::array<std::uint8_t, 3> bytes{0, 128, 255};
    constexpr std::array<std::uint8_t, 3> Before{0, 128, 255};
    constexpr std::array Values{50, 60};
    constexpr std::array Above{256, Highest};
    constexpr std::array Below{Lowest, -1};

    EXPECT_EQ(LookupInPlace8x1(bytes.data(), 3, {3, 1}, Values.data(), Above.data(), 2), KernelOk);
    EXPECT_EQ(bytes, Before);
    EXPECT_EQ(LookupInPlace8x1(bytes.data(), 3, {3, 1}, Values.data(), Below.data(), 2), KernelOk);
    EXPECT_EQ(bytes, Before);
}

TEST_P(KernelLookups, FallingLevelsEndAlikeInAllForms) {
    for (const LookupKernel& row : ListAllKernels())
        for (int round = CountKernelRounds(40); round > 0; --round) {
            const KernelSize size = round % 4 == 0 ? KernelSize{100, 70} : KernelSize{70, 3};
            LookupTables tables = MakeSparseTables(row, static_cast<std::size_t>(round) + 1);
            for (Numbers& levels : tables.levels)
                std::shuffle(levels.begin(), levels.end(), random);
            const PixelRows actual = MakeImage(row, size, DownwardLayouts[2]);
            const PixelRows plain = MakeImage(row, size, DownwardLayouts[2]);
            actual.Fill(SampleKind::Random, row.sampleBytes, random);
            plain.CopyRowsFrom(actual);

            ASSERT_EQ(Call(row.kernel, actual, size, tables), KernelOk);
            ASSERT_TRUE(ForceKernels("plain"));
            ASSERT_EQ(Call(row.kernel, plain, size, tables), KernelOk);
            ASSERT_TRUE(ForceKernels(GetParam()));

            ASSERT_EQ(actual.Compare(plain, row.sampleBytes), "") << Describe(row.name, size);
        }
}

TEST_P(KernelLookups, OverlappingRowsAreLookedUpAlikeInAllForms) {
    // Rows are taken one after the other, so that samples in two of them are looked up twice.
    for (const LookupKernel& row : ListAllKernels())
        for (const KernelSize size : {KernelSize{70, 5}, KernelSize{700, 10}})
            for (const std::int32_t rowBytes : {1, 2, 15, 16, 33, 69}) {
                const LookupTables tables = MakeFullTables(row);
                const PixelRows actual =
                    MakeImage(row, {size.width + 69 * size.height, 1}, DownwardLayouts[3]);
                const PixelRows plain =
                    MakeImage(row, {size.width + 69 * size.height, 1}, DownwardLayouts[3]);
                actual.Fill(SampleKind::Random, row.sampleBytes, random);
                plain.CopyRowsFrom(actual);

                ASSERT_EQ(Call(row.kernel, actual.GetStart(), rowBytes, size, tables), KernelOk);
                ASSERT_TRUE(ForceKernels("plain"));
                ASSERT_EQ(Call(row.kernel, plain.GetStart(), rowBytes, size, tables), KernelOk);
                ASSERT_TRUE(ForceKernels(GetParam()));

                ASSERT_EQ(actual.Compare(plain, 1), "")
                    << Describe(row.name, size) << ", row length " << rowBytes;
            }
}

TEST_P(KernelLookups, ChannelsHaveTablesOfTheirOwn) {
    std::array<std::uint16_t, 6> words{100, 100, 100, 200, 200, 200};
    const Numbers levels[] = {{100, 150}, {0, 200}, {200, 201}};
    const Numbers values[] = {{1, 0}, {2, 0}, {3, 0}};
    const std::int32_t* const levelPointers[] = {levels[0].data(), levels[1].data(),
                                                 levels[2].data()};
    const std::int32_t* const valuePointers[] = {values[0].data(), values[1].data(),
                                                 values[2].data()};
    constexpr std::array Counts{2, 2, 2};

    EXPECT_EQ(
        LookupInPlace16x3(words.data(), 12, {2, 1}, valuePointers, levelPointers, Counts.data()),
        KernelOk);

    EXPECT_EQ(words, (std::array<std::uint16_t, 6>{1, 2, 100, 200, 200, 3}));
}

ZENTARA_FOR_ALL_KERNEL_FORMS(KernelLookups);

}  // namespace
}  // namespace ZV::Testing
