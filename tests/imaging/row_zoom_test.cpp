#include "imaging/row_zoom.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <random>
#include <string>
#include <vector>

namespace ZV::Testing {
namespace {

using Samples = std::vector<std::uint32_t>;

// ---- The judge: the definition as data, sample by sample ----

/// A frame as a judge sees it: every access is checked.
struct Judged {
    Samples samples;
    int width;
    int height;

    std::uint32_t& At(int row, int column) {
        EXPECT_TRUE(row >= 0 && row < height && column >= 0 && column < width)
            << row << ", " << column << " of " << width << " x " << height;
        return samples.at(static_cast<std::size_t>(row) * static_cast<std::size_t>(width) +
                          static_cast<std::size_t>(column));
    }
};

enum class From { Top, Bottom };         ///< What a row of the tables counts from.
enum class Place { First, Each, Last };  ///< Columns 0 and 1; c and c + 1; ce and ce + 1.
enum class Rule { Copy, Third, Half };

/// Bottom rows are negative distances from h. Columns count from the place's own.
struct Term {
    std::uint32_t weight;
    int row;
    int column;
};

struct Target {
    Place place;
    int column;
    Rule rule;
    std::vector<Term> terms;
};

struct BorderRow {
    From from;
    int row;
    std::vector<Target> targets;
};

struct Borders {
    BorderRow top, beforeLast, last;
};

using enum Place;
using enum Rule;

const Borders GreenFirst = {{From::Top,
                             1,
                             {{First, 0, Copy, {{1, 3, 0}}},
                              {First, 1, Third, {{1, 3, 1}, {1, 0, 0}, {1, 0, 2}}},
                              {Each, 0, Copy, {{1, 3, 0}}},
                              {Each, 1, Third, {{1, 3, 1}, {1, 0, 0}, {1, 0, 2}}},
                              {Last, 0, Copy, {{1, 3, 0}}},
                              {Last, 1, Third, {{1, 3, 1}, {2, 0, 0}}}}},
                            {From::Bottom,
                             -2,
                             {{First, 0, Third, {{2, -1, 1}, {1, -4, 2}}},
                              {First, 1, Copy, {{1, -4, 1}}},
                              {Each, 0, Third, {{1, -4, 0}, {1, -1, -1}, {1, -1, 1}}},
                              {Each, 1, Copy, {{1, -4, 1}}},
                              {Last, 0, Third, {{1, -4, 0}, {2, -1, -1}}},
                              {Last, 1, Copy, {{1, -4, 1}}}}},
                            {From::Bottom,
                             -1,
                             {{First, 0, Copy, {{1, -3, 0}}},
                              {First, 1, Half, {{1, -2, 0}, {1, -2, 2}}},
                              {Each, 0, Copy, {{1, -3, 0}}},
                              {Each, 1, Half, {{1, -2, 0}, {1, -2, 2}}},
                              {Last, 0, Copy, {{1, -3, 0}}},
                              {Last, 1, Copy, {{1, -2, 0}}}}}};

const Borders GreenSecond = {{From::Top,
                              1,
                              {{First, 0, Third, {{2, 0, 1}, {1, 3, 0}}},
                               {First, 1, Copy, {{1, 3, 1}}},
                               {Each, 0, Third, {{1, 0, -1}, {1, 0, 1}, {1, 3, 0}}},
                               {Each, 1, Copy, {{1, 3, 1}}},
                               {Last, 0, Third, {{1, 3, 0}, {2, 0, -1}}},
                               {Last, 1, Copy, {{1, 3, 1}}}}},
                             {From::Bottom,
                              -2,
                              {{First, 0, Copy, {{1, -4, 0}}},
                               {First, 1, Third, {{1, -4, 3}, {2, -1, 2}}},
                               {Each, 0, Copy, {{1, -4, 0}}},
                               {Each, 1, Third, {{1, -4, 1}, {1, -1, 0}, {1, -1, 2}}},
                               {Last, 0, Copy, {{1, -4, 0}}},
                               {Last, 1, Third, {{1, -4, 1}, {2, -1, 0}}}}},
                             {From::Bottom,
                              -1,
                              {{First, 0, Copy, {{1, -2, 1}}},
                               {First, 1, Copy, {{1, -3, 1}}},
                               {Each, 0, Half, {{1, -2, -1}, {1, -2, 1}}},
                               {Each, 1, Copy, {{1, -3, 1}}},
                               {Last, 0, Copy, {{1, -2, -1}}},
                               {Last, 1, Copy, {{1, -3, 1}}}}}};

std::uint32_t TakeThird(std::uint32_t sum) {
    return static_cast<std::uint32_t>((std::uint64_t{sum} * 0x55555556U) >> 32);
}

class Judge {
  public:
    Judge(const Samples& samples, int width, int height, std::uint32_t pattern)
        : frame{samples, width, height},
          run((width + (width & 1) - 4) / 2),
          lastEven(2 + 2 * run),
          isGreenFirst(pattern == 1 || pattern == 2 || pattern == 6 || pattern == 7) {}

    Samples Fill() {
        if (frame.width < 5 || frame.height < 6) return frame.samples;
        for (const int start : {2, 3}) {
            for (int i = 0; i < (frame.height - 4 + 3) / 4; ++i) {
                FillRow(2 + 4 * i, start, (start == 2) != isGreenFirst);
            }
        }
        for (const int start : {2, 3}) {
            for (int i = 0; i < (frame.height - 4) / 4; ++i) {
                FillRow(5 + 4 * i, start, (start == 2) == isGreenFirst);
            }
        }
        const Borders& borders = isGreenFirst ? GreenFirst : GreenSecond;
        Finish(borders.top);
        Finish(frame.height % 4 == 0 ? borders.beforeLast : borders.last);
        return frame.samples;
    }

  private:
    void FillRow(int row, int start, bool isVertical) {
        const bool isBelow = row % 4 == 2;
        const int near = isBelow ? row + 1 : row - 1;
        const int far = isBelow ? row - 2 : row + 2;
        const bool isWithoutRightEdge = frame.width % 2 == 1 && start == 3;
        const int pieces = run + (isWithoutRightEdge ? 1 : 2);
        for (int piece = 0; piece < pieces; ++piece) {
            const int c = start - 2 + 2 * piece;
            std::uint32_t sum = 2;
            if (isVertical) {
                sum += isBelow ? 2 * frame.At(row - 2, c) + frame.At(row + 2, c)
                               : frame.At(row - 2, c) + 2 * frame.At(row + 2, c);
            } else if (piece == 0) {
                sum += frame.At(far, c) + 2 * frame.At(near, c + 1);
            } else if (piece <= run) {
                sum += frame.At(near, c - 1) + frame.At(near, c + 1) + frame.At(far, c);
            } else {
                sum += frame.At(far, c) + 2 * frame.At(near, c - 1);
            }
            frame.At(row, c) = TakeThird(sum);
        }
    }

    void Finish(const BorderRow& row) {
        for (const Target& target : row.targets) {
            if (target.place == First) Finish(row, target, 0);
            if (target.place == Last && !(target.column == 1 && frame.width % 2 == 1)) {
                Finish(row, target, lastEven);
            }
            if (target.place != Each) continue;
            for (int c = 2; c <= lastEven - 2; c += 2) Finish(row, target, c);
        }
    }

    void Finish(const BorderRow& row, const Target& target, int c) {
        const int base = row.from == From::Top ? 0 : frame.height;
        std::uint32_t sum = target.rule == Third ? 2 : target.rule == Half ? 1 : 0;
        for (const Term& term : target.terms) {
            sum += term.weight * frame.At(base + term.row, c + term.column);
        }
        if (target.rule == Third) sum = TakeThird(sum);
        if (target.rule == Half) sum >>= 1;
        frame.At(base + row.row, c + target.column) = sum;
    }

    Judged frame;
    int run, lastEven;
    bool isGreenFirst;
};

// ---- What is judged ----

constexpr std::uint8_t Guard = 0xC3;
constexpr std::size_t GuardBytes = 33;  // Samples of 16 bits stand at odd addresses.

/// Samples in memory between guard bytes.
class Memory {
  public:
    Memory(const Samples& samples, std::uint32_t newSampleBytes)
        : sampleBytes(newSampleBytes), bytes(samples.size() * sampleBytes + 2 * GuardBytes, Guard) {
        for (std::size_t i = 0; i < samples.size(); ++i) {
            const auto word = static_cast<std::uint16_t>(samples[i]);
            const auto byte = static_cast<std::uint8_t>(samples[i]);
            std::uint8_t* const place = GetData() + i * sampleBytes;
            if (sampleBytes == 1) std::memcpy(place, &byte, 1);
            if (sampleBytes == 2) std::memcpy(place, &word, 2);
        }
    }

    std::uint8_t* GetData() { return bytes.data() + GuardBytes; }
    Samples GetSamples() {
        Samples samples((bytes.size() - 2 * GuardBytes) / sampleBytes);
        for (std::size_t i = 0; i < samples.size(); ++i) {
            std::uint16_t word = GetData()[i * sampleBytes];
            if (sampleBytes == 2) std::memcpy(&word, GetData() + 2 * i, 2);
            samples[i] = word;
        }
        return samples;
    }
    bool IsGuardIntact() const {
        for (std::size_t i = 0; i < GuardBytes; ++i) {
            if (bytes[i] != Guard || bytes[bytes.size() - 1 - i] != Guard) return false;
        }
        return true;
    }

  private:
    std::uint32_t sampleBytes;
    std::vector<std::uint8_t> bytes;
};

Samples MakeRandom(std::size_t count, std::uint32_t sampleBytes, std::uint32_t seed) {
    std::mt19937 random(seed);
    Samples samples(count);
    for (std::uint32_t& sample : samples) {
        sample = static_cast<std::uint32_t>(random() & (sampleBytes == 1 ? 0xFF : 0xFFFF));
    }
    return samples;
}

struct ZoomCase {
    std::uint32_t pattern;
    std::uint32_t sampleBytes;
};

std::vector<ZoomCase> MakeCases() {
    std::vector<ZoomCase> cases;
    for (std::uint32_t pattern = 0; pattern <= 8; ++pattern) {
        cases.push_back({pattern, 1});
        cases.push_back({pattern, 2});
    }
    return cases;
}

class RowZoom : public testing::TestWithParam<ZoomCase> {
  protected:
    static void ExpectFilled(const Samples& samples, std::uint32_t width, std::uint32_t height) {
        const auto [pattern, sampleBytes] = GetParam();
        Memory memory(samples, sampleBytes);
        ZoomFillRows(pattern, memory.GetData(), width, height, sampleBytes);
        const Samples expected =
            Judge(samples, static_cast<int>(width), static_cast<int>(height), pattern).Fill();
        ASSERT_EQ(expected, memory.GetSamples())
            << width << " x " << height << ", pattern " << pattern;
        ASSERT_TRUE(memory.IsGuardIntact()) << width << " x " << height;
    }
};

TEST_P(RowZoom, FillsEachSampleOfEverySizeAsItIsDefinedAndTouchesNoOther) {
    for (std::uint32_t height = 1; height <= 40; ++height) {
        for (std::uint32_t width = 1; width <= 40; ++width) {
            ExpectFilled(MakeRandom(std::size_t{width} * height, GetParam().sampleBytes,
                                    width * 100 + height),
                         width, height);
            if (HasFatalFailure()) return;
        }
    }
}

TEST_P(RowZoom, HoldsForTheGreatestAndTheLeastSamples) {
    const std::uint32_t top = GetParam().sampleBytes == 1 ? 0xFF : 0xFFFF;
    for (const std::uint32_t width : {5U, 6U, 11U}) {
        for (const std::uint32_t height : {6U, 8U, 10U}) {
            const std::size_t count = std::size_t{width} * height;
            ExpectFilled(Samples(count, top), width, height);
            ExpectFilled(Samples(count, 0), width, height);
            Samples mixed(count);
            for (std::size_t i = 0; i < count; ++i) mixed[i] = i % 3 == 0 ? top : 0;
            ExpectFilled(mixed, width, height);
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Patterns, RowZoom, testing::ValuesIn(MakeCases()), [](const auto& test) {
    return "Pattern" + std::to_string(test.param.pattern) + "Of" +
           std::to_string(8 * test.param.sampleBytes) + "Bits";
});

TEST(RowZoom, SpreadsTwoRowsToTheFirstAndLastOfEachFour) {
    for (const std::uint32_t sampleBytes : {1U, 2U}) {
        for (std::uint32_t rowCount = 1; rowCount <= 9; ++rowCount) {
            constexpr std::uint32_t Width = 7;
            const Samples rows = MakeRandom(std::size_t{Width} * rowCount, sampleBytes, rowCount);
            Samples expected(2 * rows.size(), 0xAA);
            for (std::size_t row = 0; row < rowCount; ++row) {
                const std::size_t target = row % 2 == 0 ? 2 * row : 2 * row + 1;
                std::copy_n(rows.begin() + static_cast<std::ptrdiff_t>(row * Width), Width,
                            expected.begin() + static_cast<std::ptrdiff_t>(target * Width));
            }
            Memory source(rows, sampleBytes), zoomed(Samples(2 * rows.size(), 0xAA), sampleBytes);

            ZoomSpreadRows(source.GetData(), zoomed.GetData(), Width, rowCount, sampleBytes);

            EXPECT_EQ(expected, zoomed.GetSamples());
            EXPECT_TRUE(zoomed.IsGuardIntact());
        }
    }
}

TEST(RowZoom, SpreadsRowsInPlaceAndLosesNone) {
    constexpr std::uint32_t Width = 5;
    for (std::uint32_t rowCount = 1; rowCount <= 9; ++rowCount) {
        const Samples rows = MakeRandom(std::size_t{2} * Width * rowCount, 2, rowCount);
        Memory memory(rows, 2);

        ZoomSpreadRows(memory.GetData(), memory.GetData(), Width, rowCount, 2);

        const Samples spread = memory.GetSamples();
        for (std::size_t i = 0; i < std::size_t{Width} * rowCount; ++i) {
            const std::size_t row = i / Width;
            ASSERT_EQ(rows[i], spread[(2 * row + row % 2) * Width + i % Width]) << i;
        }
        EXPECT_TRUE(memory.IsGuardIntact());
    }
}

TEST(RowZoom, SpreadsNothingOfAFrameWithoutColumnsOrRows) {
    std::uint8_t byte = 7;
    ZoomSpreadRows(&byte, &byte, 0, 100, 1);
    ZoomSpreadRows(&byte, &byte, 100, 0, 1);
    EXPECT_EQ(7, byte);
}

TEST(RowZoom, KeptTheSampleAboveTheRowBeforeTheLastIsTakenTwoColumnsTooFarRight) {
    constexpr std::uint32_t Width = 6, Height = 8;
    Samples samples(std::size_t{Width} * Height, 0);
    samples[4 * Width + 2] = 90;
    samples[4 * Width + 3] = 60;
    Memory greenFirst(samples, 1), greenSecond(samples, 1);

    ZoomFillRows(1, greenFirst.GetData(), Width, Height, 1);
    ZoomFillRows(0, greenSecond.GetData(), Width, Height, 1);

    EXPECT_EQ(30U, greenFirst.GetSamples()[6 * Width]);
    EXPECT_EQ(20U, greenSecond.GetSamples()[6 * Width + 1]);
}

TEST(RowZoom, KeptColumnsBesideTheEdgesTakeOneNeighbourTwiceThoughTheyHaveTwo) {
    constexpr std::uint32_t Width = 8, Height = 8;
    Samples samples(std::size_t{Width} * Height, 0);
    samples[3 * Width + 0] = 200;
    samples[3 * Width + 2] = 30;
    Memory memory(samples, 1);
    ZoomFillRows(0, memory.GetData(), Width, Height, 1);
    EXPECT_EQ(20U, memory.GetSamples()[2 * Width + 1]) << "twice column 2, nothing of column 0";

    samples.assign(samples.size(), 0);
    samples[3 * Width + 5] = 30;
    samples[3 * Width + 7] = 200;
    Memory other(samples, 1);
    ZoomFillRows(1, other.GetData(), Width, Height, 1);
    EXPECT_EQ(20U, other.GetSamples()[2 * Width + 6]) << "twice column 5, nothing of column 7";
}

TEST(RowZoom, AFlatFrameStaysFlat) {
    for (std::uint32_t pattern = 0; pattern < 4; ++pattern) {
        const Samples flat(std::size_t{12} * 12, 77);
        Memory memory(flat, 2);
        ZoomFillRows(pattern, memory.GetData(), 12, 12, 2);
        EXPECT_EQ(flat, memory.GetSamples());
    }
}

}  // namespace
}  // namespace ZV::Testing
