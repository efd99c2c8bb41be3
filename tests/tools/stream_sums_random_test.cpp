// Numbers of many made-up streams against models that are too slow, or know too much, for a client:
// one knows which numbers are wrong, the other tries every way to read them.

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <random>
#include <utility>
#include <vector>

#include "tools/stream_sums.h"

namespace ZentaraTest {
namespace {

using ZentaraProgram::MissingFrames;
using ZentaraProgram::StreamSums;

/// Of the first stream, and of the rows of any numbers.
constexpr std::uint32_t FirstSeed = 20240917;

using NumberRow = std::vector<std::uint16_t>;

StreamSums ReadNumbers(const NumberRow& numbers, std::uint32_t numbersPerFrame) {
    StreamSums sums(numbersPerFrame);
    for (const std::uint16_t number : numbers) {
        Zentara_Frame frame{};
        frame.frameNumber = number;
        sums.Count(frame);
    }
    sums.Settle();
    return sums;
}

/// A stream, and what became of each of its frames. Stretches of right numbers with short losses
/// and repeats between them lie apart by a few wrong numbers or by a long loss.
class KnownStream {
  public:
    KnownStream(std::uint32_t seed, std::uint32_t frameNumbers)
        : random(seed), numbersPerFrame(frameNumbers) {
        last = Draw(65536);
        const std::uint32_t stretches = 1 + Draw(30);
        SendWrongNumbers();
        Send(static_cast<std::uint16_t>(last));
        SendStretch();
        for (std::uint32_t i = 0; i < stretches; ++i) {
            if (Draw(3) == 0) {
                Lose(StreamSums::ShortLossMax + 1 + Draw(8000));
            } else {
                SendWrongNumbers();
            }
            SendStretch();
        }
        SendWrongNumbers();
    }

    NumberRow numbers;
    std::vector<MissingFrames> missing;
    std::uint64_t last = 0, drops = 0, repeats = 0, wrong = 0;

  private:
    std::uint32_t Draw(std::uint32_t below) { return static_cast<std::uint32_t>(random()) % below; }

    void Send(std::uint16_t number) {
        numbers.push_back(number);
        if (Draw(10) != 0) return;
        numbers.push_back(number);
        ++repeats;
    }

    /// The next frame comes behind so many that do not.
    void Lose(std::uint32_t frames) {
        if (frames > 0) {
            missing.push_back({last + 1, last + std::uint64_t{frames} * numbersPerFrame});
            drops += frames;
        }
        last += (std::uint64_t{frames} + 1) * numbersPerFrame;
        Send(static_cast<std::uint16_t>(last));
    }

    void SendStretch() {
        const std::uint32_t frames = 8 + Draw(40);
        const std::uint32_t lossy = Draw(3);  // Of three frames, so many have a loss before them.
        for (std::uint32_t i = 0; i < frames; ++i) {
            Lose(Draw(3) < lossy ? Draw(StreamSums::ShortLossMax + 1) : 0);
        }
    }

    /// Wherever they lie between, no short loss leads to them or from them.
    void SendWrongNumbers() {
        const std::uint32_t far = 5000 * numbersPerFrame;
        const std::uint32_t count = Draw(StreamSums::LongLossCost + 1);
        for (std::uint32_t i = 0; i < count; ++i) {
            std::uint16_t number = 0;
            do {
                number = static_cast<std::uint16_t>(last + far + Draw(65536 - 2 * far));
            } while (!numbers.empty() && numbers.back() == number);
            Send(number);
            ++wrong;
        }
    }

    std::mt19937 random;
    std::uint32_t numbersPerFrame;
};

void ExpectToKnow(const KnownStream& stream, const StreamSums& sums) {
    EXPECT_EQ(stream.missing, sums.GetMissing());
    EXPECT_EQ(stream.missing.size(), sums.gaps);
    EXPECT_EQ(stream.drops, sums.drops);
    EXPECT_EQ(stream.repeats, sums.repeats);
    EXPECT_EQ(stream.wrong, sums.misnumbered);
    EXPECT_EQ(stream.numbers.size(), sums.frames);
}

TEST(StreamSumsRandom, LossesRepeatsAndWrongNumbersAreToldApart) {
    for (const std::uint32_t numbersPerFrame : {1U, 3U}) {
        for (std::uint32_t i = 0; i < 300; ++i) {
            const KnownStream stream(FirstSeed + i, numbersPerFrame);
            const StreamSums sums = ReadNumbers(stream.numbers, numbersPerFrame);

            ExpectToKnow(stream, sums);
            EXPECT_EQ(stream.last % 65536, sums.GetLastNumber() % 65536);
            if (testing::Test::HasFailure())
                FAIL() << "seed " << FirstSeed + i << ", " << numbersPerFrame << " numbers each";
        }
    }
}

using Price = std::pair<std::uint64_t, std::uint64_t>;  ///< What it costs, and frames missing.

/// Of the reading that believes the numbers whose bits are set.
Price GetPrice(const NumberRow& numbers, std::uint32_t believed) {
    Price price;
    const std::uint16_t* former = nullptr;
    for (std::size_t i = 0; i < numbers.size(); ++i) {
        if ((believed >> i & 1U) == 0) {
            ++price.first;
            continue;
        }
        if (former != nullptr && *former != numbers[i]) {
            const std::uint16_t lost = static_cast<std::uint16_t>(numbers[i] - *former - 1);
            price.second += lost;
            if (lost > StreamSums::ShortLossMax) price.first += StreamSums::LongLossCost;
        }
        former = &numbers[i];
    }
    return price;
}

Price GetLowestPrice(const NumberRow& numbers) {
    Price lowest = GetPrice(numbers, 1);
    for (std::uint32_t believed = 1; believed < 1U << numbers.size(); ++believed) {
        lowest = std::min(lowest, GetPrice(numbers, believed));
    }
    return lowest;
}

Price GetPrice(const StreamSums& sums) {
    Price price{sums.misnumbered, sums.drops};
    for (const MissingFrames& run : sums.GetMissing()) {
        if (run.last - run.first >= StreamSums::ShortLossMax)
            price.first += StreamSums::LongLossCost;
    }
    return price;
}

/// From few places, so that many go together, no number under that of the one before.
NumberRow MakeShortStream(std::mt19937& random) {
    constexpr std::uint16_t Places[] = {0, 3, 900, 1900, 30000, 60000, 65530};
    NumberRow numbers;
    const std::size_t count = 1 + random() % 11;
    while (numbers.size() < count) {
        const auto number = static_cast<std::uint16_t>(Places[random() % 7] + random() % 6);
        if (numbers.empty() || numbers.back() != number) numbers.push_back(number);
    }
    return numbers;
}

TEST(StreamSumsRandom, NoReadingOfAShortStreamIsCheaper) {
    std::mt19937 random(FirstSeed);
    for (int i = 0; i < 3000; ++i) {
        const NumberRow numbers = MakeShortStream(random);
        ASSERT_EQ(GetLowestPrice(numbers), GetPrice(ReadNumbers(numbers, 1)))
            << testing::PrintToString(numbers);
    }
}

/// Any numbers: half of them out of nowhere, the others close to the one before.
TEST(StreamSumsRandom, EveryFrameCountsOnceAndEveryNumberIsCoveredOrMissing) {
    std::mt19937 random(FirstSeed);
    for (int i = 0; i < 20; ++i) {
        NumberRow numbers(1 + random() % 1000);
        std::uint16_t number = 0;
        for (std::uint16_t& each : numbers) {
            number =
                static_cast<std::uint16_t>(random() % 2 == 0 ? random() : number + random() % 4);
            each = number;
        }

        const StreamSums sums = ReadNumbers(numbers, 1);

        const std::uint64_t ordinary = sums.frames - sums.repeats - sums.misnumbered;
        const std::uint64_t first = sums.GetLastNumber() + 1 - sums.drops - ordinary;
        EXPECT_EQ(numbers.size(), sums.frames);
        EXPECT_GE(65535U, first);
        EXPECT_NE(numbers.end(), std::find(numbers.begin(), numbers.end(), first));
    }
}

}  // namespace
}  // namespace ZentaraTest
