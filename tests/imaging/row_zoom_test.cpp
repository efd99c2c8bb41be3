#include "imaging/row_zoom.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "support/ratio_judge.h"

namespace ZV::Testing {
namespace {

using Test::JudgeZoomFill;
using Samples = std::vector<std::uint32_t>;

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
        const Samples expected = JudgeZoomFill(samples, width, height, pattern);
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
