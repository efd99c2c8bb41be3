// Row loops that no kernel reaches, or not with every count, in every form.

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <vector>

#include "imaging/kernels/kernel_fixture.h"
#include "imaging/kernels/kernel_selection.h"
#include "imaging/kernels/pixel_rows.h"

namespace ZV::Testing {
namespace {

std::vector<std::size_t> ListCounts() {
    std::vector<std::size_t> counts;
    for (std::size_t count = 1; count <= 300; ++count) counts.push_back(count);
    counts.push_back(696);
    counts.push_back(1391);
    return counts;
}

Word* WordsOf(const PixelRows& row) {
    return static_cast<Word*>(row.GetStart());
}

std::uint8_t* BytesOf(const PixelRows& row) {
    return static_cast<std::uint8_t*>(row.GetStart());
}

class RowLoops : public KernelFormTest {
  protected:
    void SetUp() override {
        KernelFormTest::SetUp();
        if (!IsSkipped()) rows = FindRowKernels(GetParam());
    }

    /// A row of samples by chance. `skew` keeps rows from being aligned alike.
    [[nodiscard]] PixelRows MakeRow(const RowLayout& layout, std::size_t count,
                                    std::size_t sampleBytes, std::size_t skew = 0) {
        PixelRows row(layout, count * sampleBytes, 1, skew * layout.offset);
        row.Fill(random() % 3 == 0 ? SampleKind::Extreme : SampleKind::Random, sampleBytes, random);
        return row;
    }

    [[nodiscard]] std::string DescribeRow(std::size_t count, const RowLayout& layout) const {
        return Describe(layout.name, {static_cast<std::int32_t>(count), 1});
    }

    const RowKernels* rows = nullptr;
};

TEST_P(RowLoops, BearTheNameUnderWhichTheyAreFound) {
    ASSERT_NE(rows, nullptr);
    EXPECT_STREQ(rows->name, GetParam());
    EXPECT_EQ(rows, &GetRowKernels());
}

TEST_P(RowLoops, SplittingSortsBytesByTheirPlace) {
    for (const std::size_t count : ListCounts())
        for (const RowLayout& layout : DownwardLayouts) {
            const PixelRows row = MakeRow(layout, 2 * count, 1);
            const PixelRows even = MakeRow(layout, count, 1, 1);
            const PixelRows odd = MakeRow(layout, count, 1, 2);
            const PixelRows expectedEven(DownwardLayouts[0], count, 1);
            const PixelRows expectedOdd(DownwardLayouts[0], count, 1);
            for (std::size_t i = 0; i < count; ++i) {
                BytesOf(expectedEven)[i] = BytesOf(row)[2 * i];
                BytesOf(expectedOdd)[i] = BytesOf(row)[2 * i + 1];
            }

            rows->split8(BytesOf(row), BytesOf(even), BytesOf(odd), count);

            ASSERT_EQ(even.Compare(expectedEven, 1), "") << DescribeRow(count, layout);
            ASSERT_EQ(odd.Compare(expectedOdd, 1), "") << DescribeRow(count, layout);
        }
}

TEST_P(RowLoops, SplittingSortsWordsByTheirPlace) {
    for (const std::size_t count : ListCounts())
        for (const RowLayout& layout : DownwardLayouts) {
            const PixelRows row = MakeRow(layout, 2 * count, 2);
            const PixelRows even = MakeRow(layout, count, 2, 1);
            const PixelRows odd = MakeRow(layout, count, 2, 2);
            const PixelRows expectedEven(DownwardLayouts[0], 2 * count, 1);
            const PixelRows expectedOdd(DownwardLayouts[0], 2 * count, 1);
            for (std::size_t i = 0; i < count; ++i) {
                WordsOf(expectedEven)[i] = WordsOf(row)[2 * i];
                WordsOf(expectedOdd)[i] = WordsOf(row)[2 * i + 1];
            }

            rows->split16(WordsOf(row), WordsOf(even), WordsOf(odd), count);

            ASSERT_EQ(even.Compare(expectedEven, 2), "") << DescribeRow(count, layout);
            ASSERT_EQ(odd.Compare(expectedOdd, 2), "") << DescribeRow(count, layout);
        }
}

TEST_P(RowLoops, BytesAreHalvedBeforeTheyAreAdded) {
    for (const std::size_t count : ListCounts())
        for (const RowLayout& layout : DownwardLayouts) {
            const PixelRows first = MakeRow(layout, count, 1);
            const PixelRows second = MakeRow(layout, count, 1, 1);
            const PixelRows output = MakeRow(layout, count, 1, 2);
            const PixelRows expected(DownwardLayouts[0], count, 1);
            for (std::size_t i = 0; i < count; ++i)
                BytesOf(expected)[i] =
                    static_cast<std::uint8_t>(BytesOf(first)[i] / 2 + BytesOf(second)[i] / 2);

            rows->addHalves8(BytesOf(first), BytesOf(second), BytesOf(output), count);

            ASSERT_EQ(output.Compare(expected, 1), "") << DescribeRow(count, layout);
        }
}

TEST_P(RowLoops, WordsAreHalvedBeforeTheyAreAdded) {
    for (const std::size_t count : ListCounts())
        for (const RowLayout& layout : DownwardLayouts) {
            const PixelRows first = MakeRow(layout, count, 2);
            const PixelRows second = MakeRow(layout, count, 2, 1);
            const PixelRows output = MakeRow(layout, count, 2, 2);
            const PixelRows expected(DownwardLayouts[0], 2 * count, 1);
            for (std::size_t i = 0; i < count; ++i)
                WordsOf(expected)[i].value = static_cast<std::uint16_t>(
                    WordsOf(first)[i].value / 2 + WordsOf(second)[i].value / 2);

            rows->addHalves16(WordsOf(first), WordsOf(second), WordsOf(output), count);

            ASSERT_EQ(output.Compare(expected, 2), "") << DescribeRow(count, layout);
        }
}

TEST_P(RowLoops, DoublingBytesMayEndInTheMiddleOfAPair) {
    for (const std::size_t count : ListCounts())
        for (const RowLayout& layout : DownwardLayouts) {
            const PixelRows row = MakeRow(layout, (count + 1) / 2, 1);
            const PixelRows output = MakeRow(layout, count, 1, 1);
            const PixelRows expected(DownwardLayouts[0], count, 1);
            for (std::size_t i = 0; i < count; ++i) BytesOf(expected)[i] = BytesOf(row)[i / 2];

            rows->double8(BytesOf(row), BytesOf(output), count);

            ASSERT_EQ(output.Compare(expected, 1), "") << DescribeRow(count, layout);
        }
}

TEST_P(RowLoops, DoublingWordsMayEndInTheMiddleOfAPair) {
    for (const std::size_t count : ListCounts())
        for (const RowLayout& layout : DownwardLayouts) {
            const PixelRows row = MakeRow(layout, (count + 1) / 2, 2);
            const PixelRows output = MakeRow(layout, count, 2, 1);
            const PixelRows expected(DownwardLayouts[0], 2 * count, 1);
            for (std::size_t i = 0; i < count; ++i) WordsOf(expected)[i] = WordsOf(row)[i / 2];

            rows->double16(WordsOf(row), WordsOf(output), count);

            ASSERT_EQ(output.Compare(expected, 2), "") << DescribeRow(count, layout);
        }
}

/// Tables of random entries that end at an unreadable page, the word more of deep ones included.
PixelRows MakeTables(std::size_t entries, std::size_t sampleBytes, std::mt19937& random) {
    PixelRows tables({"", RowPlacement::RowsEndAtPage}, entries * sampleBytes, 1);
    tables.Fill(SampleKind::Random, sampleBytes, random);
    return tables;
}

TEST_P(RowLoops, ByteLookupsReadTheirTablesAlone) {
    struct Loop {
        std::size_t channels;
        void (*lookUp)(const std::uint8_t* tables, std::uint8_t* samples, std::size_t count);
    };
    const Loop loops[] = {{1, rows->lookup8x1}, {3, rows->lookup8x3}, {4, rows->lookup8x4}};
    for (const auto& [channels, lookUp] : loops) {
        const PixelRows tables = MakeTables(256 * channels, 1, random);
        const PixelRows samples = MakeRow(DownwardLayouts[4], 301 * channels, 1);
        const PixelRows expected(DownwardLayouts[0], 301 * channels, 1);
        for (std::size_t i = 0; i < 301 * channels; ++i)
            BytesOf(expected)[i] = BytesOf(tables)[256 * (i % channels) + BytesOf(samples)[i]];

        lookUp(BytesOf(tables), BytesOf(samples), 301);

        ASSERT_EQ(samples.Compare(expected, 1), "") << DescribeRow(channels, DownwardLayouts[4]);
    }
}

TEST_P(RowLoops, WordLookupsReadTheirTablesAndOneWordMore) {
    struct Loop {
        std::size_t channels;
        void (*lookUp)(const std::uint16_t* tables, Word* samples, std::size_t count);
    };
    const Loop loops[] = {{1, rows->lookup16x1}, {3, rows->lookup16x3}};
    for (const auto& [channels, lookUp] : loops) {
        const PixelRows tables = MakeTables(65536 * channels + 1, 2, random);
        const PixelRows samples = MakeRow(DownwardLayouts[4], 301 * channels, 2);
        WordsOf(samples)[301 * channels - 1].value = 65535;
        const PixelRows expected(DownwardLayouts[0], 602 * channels, 1);
        for (std::size_t i = 0; i < 301 * channels; ++i)
            WordsOf(expected)[i] =
                WordsOf(tables)[65536 * (i % channels) + WordsOf(samples)[i].value];

        lookUp(reinterpret_cast<const std::uint16_t*>(BytesOf(tables)), WordsOf(samples), 301);

        ASSERT_EQ(samples.Compare(expected, 2), "") << DescribeRow(channels, DownwardLayouts[4]);
    }
}

TEST_P(RowLoops, TwoLinearRowsAtOnceAreTheOnesThatThePlainFormMakesOneByOne) {
    const RowKernels& plain = *FindRowKernels("plain");
    const std::int32_t choices[] = {0, 1, 4095, 8192, 12289, 16383, 16384};
    for (const std::size_t count : ListCounts()) {
        const std::int32_t weights[] = {choices[random() % 7], choices[random() % 7]};
        std::vector<std::uint16_t> upper(count), lower(count);
        for (std::uint16_t& sum : upper) sum = static_cast<std::uint16_t>(random());
        for (std::uint16_t& sum : lower) sum = static_cast<std::uint16_t>(random());
        std::vector<Word> words[2], expectedWords(count);
        for (auto& row : words) row.resize(count);
        Word* const wordRows[] = {words[0].data(), words[1].data()};

        rows->linearColumnPair16(upper.data(), lower.data(), weights, wordRows, count);

        for (std::size_t i = 0; i < 2; ++i) {
            plain.linearColumn16(upper.data(), lower.data(), weights[i], expectedWords.data(),
                                 count);
            ASSERT_EQ(std::memcmp(wordRows[i], expectedWords.data(), 2 * count), 0) << count;
        }

        for (std::uint16_t& sum : upper) sum %= 16321;
        for (std::uint16_t& sum : lower) sum %= 16321;
        std::vector<std::uint8_t> bytes[2], expected(count);
        for (auto& row : bytes) row.resize(count);
        std::uint8_t* const byteRows[] = {bytes[0].data(), bytes[1].data()};

        rows->linearColumnPair8(upper.data(), lower.data(), weights, byteRows, count);

        for (std::size_t i = 0; i < 2; ++i) {
            plain.linearColumn8(upper.data(), lower.data(), weights[i], expected.data(), count);
            ASSERT_EQ(bytes[i], expected) << count;
        }
    }
}

ZENTARA_FOR_ALL_KERNEL_FORMS(RowLoops);

}  // namespace
}  // namespace ZV::Testing
