#include "tools/stream_sums.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace ZentaraTest {
namespace {

using ZentaraProgram::MissingFrames;
using ZentaraProgram::StreamSums;

Zentara_Frame MakeFrame(std::uint32_t number, std::uint32_t errorCode = zerrNone) {
    Zentara_Frame frame{};
    frame.frameNumber = static_cast<std::uint16_t>(number);
    frame.size = 10;
    frame.errorCode = errorCode;
    return frame;
}

StreamSums CountNumbers(std::initializer_list<std::uint32_t> numbers,
                        std::uint32_t numbersPerFrame = 1) {
    StreamSums sums(numbersPerFrame);
    for (const std::uint32_t number : numbers) sums.Count(MakeFrame(number));
    sums.Settle();
    return sums;
}

TEST(StreamSumsTest, AnUnbrokenStreamHasNoGaps) {
    const StreamSums sums = CountNumbers({7, 8, 9});

    EXPECT_EQ(3U, sums.frames);
    EXPECT_EQ(30U, sums.bytes);
    EXPECT_EQ(0U, sums.gaps);
    EXPECT_EQ("", sums.DescribeMissing());
}

TEST(StreamSumsTest, EachGapNamesItsFrames) {
    const StreamSums sums = CountNumbers({2, 6, 7, 9});

    EXPECT_EQ(2U, sums.gaps);
    EXPECT_EQ(4U, sums.drops);
    EXPECT_THAT(sums.GetMissing(), testing::ElementsAre(MissingFrames{3, 5}, MissingFrames{8, 8}));
    EXPECT_EQ("3-5, 8", sums.DescribeMissing());
}

TEST(StreamSumsTest, TheNumberGoesOnBeyondItsSixteenBits) {
    const StreamSums whole = CountNumbers({65534, 65535, 0, 1});
    const StreamSums broken = CountNumbers({65533, 1, 32768, 32769, 65535, 3});

    EXPECT_EQ(0U, whole.gaps);
    EXPECT_EQ(65537U, whole.GetLastNumber());
    EXPECT_EQ(3U + 32766U + 32765U + 3U, broken.drops);
    EXPECT_EQ("65534-65536, 65538-98303, 98306-131070, 131072-131074", broken.DescribeMissing());
}

TEST(StreamSumsTest, AWrongNumberIsNoGapButItsOwnNumberIsMissing) {
    const StreamSums ahead = CountNumbers({3, 4, 900, 6, 7});
    const StreamSums back = CountNumbers({3, 4, 65530, 6, 7});

    for (const StreamSums& sums : {ahead, back}) {
        EXPECT_EQ(1U, sums.misnumbered);
        EXPECT_EQ(1U, sums.drops);
        EXPECT_EQ("5", sums.DescribeMissing());
        EXPECT_EQ(7U, sums.GetLastNumber());
    }
}

TEST(StreamSumsTest, WrongNumbersInARowAreNoGapsAndNoRoundsOfTheNumber) {
    const StreamSums two = CountNumbers({4, 900, 30000, 7, 8});
    const StreamSums three = CountNumbers({4, 900, 30000, 20000, 8, 9});
    const StreamSums back = CountNumbers({4, 65000, 900, 7, 8});

    for (const StreamSums& sums : {two, back}) {
        EXPECT_EQ(2U, sums.misnumbered);
        EXPECT_EQ("5-6", sums.DescribeMissing());
        EXPECT_EQ(8U, sums.GetLastNumber());
    }
    EXPECT_EQ(3U, three.misnumbered);
    EXPECT_EQ("5-7", three.DescribeMissing());
    EXPECT_EQ(9U, three.GetLastNumber());
}

TEST(StreamSumsTest, AFrameBetweenTwoLongLossesIsMissingUnderItsNumber) {
    const StreamSums sums = CountNumbers({4, 200, 400, 401});

    EXPECT_EQ(1U, sums.misnumbered);
    EXPECT_EQ("5-399", sums.DescribeMissing());
}

TEST(StreamSumsTest, AClientThatLosesManyFramesEachTimeIsToldOfAll) {
    const StreamSums sums = CountNumbers({0, 90, 180, 270});
    const StreamSums longer = CountNumbers({0, 90, 180, 270, 360, 450, 540, 630, 720});
    const StreamSums oneWrong = CountNumbers({0, 90, 180, 40000, 360, 450, 540, 630});

    EXPECT_EQ("1-89, 91-179, 181-269", sums.DescribeMissing());
    EXPECT_EQ(8U * 89U, longer.drops);
    EXPECT_EQ(8U, longer.gaps);
    EXPECT_EQ(720U, longer.GetLastNumber());
    for (const StreamSums& whole : {sums, longer}) EXPECT_EQ(0U, whole.misnumbered);
    EXPECT_EQ(3U, oneWrong.misnumbered);
    EXPECT_EQ("1-359, 361-449, 451-539, 541-629", oneWrong.DescribeMissing());
}

TEST(StreamSumsTest, WrongNumbersAtTheEndOfAStreamAreNoRow) {
    for (const StreamSums& sums : {CountNumbers({4, 900, 30000}), CountNumbers({4, 900, 300}),
                                   CountNumbers({4, 60000, 8})}) {
        EXPECT_GE(2U, sums.gaps);
        EXPECT_LE(1U, sums.misnumbered);
        EXPECT_GT(10U, sums.drops);
    }
}

TEST(StreamSumsTest, AWrongNumberBesideALossHidesNothing) {
    const StreamSums sums = CountNumbers({4, 6, 2, 9, 10});

    EXPECT_EQ(1U, sums.misnumbered);
    EXPECT_EQ("5, 7-8", sums.DescribeMissing());
}

TEST(StreamSumsTest, TwoFramesInTheOtherOrderAreNoRoundOfTheNumber) {
    const StreamSums sums = CountNumbers({4, 6, 5, 7});

    EXPECT_EQ(1U, sums.misnumbered);
    EXPECT_EQ(1U, sums.drops);
    EXPECT_EQ("6", sums.DescribeMissing()) << "it came in no place of its own";
}

TEST(StreamSumsTest, AGapOfMostOfTheNumbersIsBelievedOnceTheStreamGoesOnBehindIt) {
    const StreamSums sums = CountNumbers({4, 50000, 50001, 50002});

    EXPECT_EQ(0U, sums.misnumbered);
    EXPECT_EQ(49995U, sums.drops);
    EXPECT_EQ("5-49999", sums.DescribeMissing());
}

TEST(StreamSumsTest, TheLastNumberIsBelievedCloseAheadAndNowhereElse) {
    const StreamSums ahead = CountNumbers({4, 7});
    const StreamSums farAhead = CountNumbers({4, 900});
    const StreamSums back = CountNumbers({4, 2});

    EXPECT_EQ("5-6", ahead.DescribeMissing());
    for (const StreamSums& sums : {farAhead, back}) {
        EXPECT_EQ(0U, sums.gaps);
        EXPECT_EQ(1U, sums.misnumbered);
    }
}

TEST(StreamSumsTest, ADoubtOutlivesTheForgettingOfTheCounts) {
    StreamSums sums(1);
    for (const std::uint32_t number : {3U, 4U, 900U}) sums.Count(MakeFrame(number));

    sums.ForgetCounts();
    for (const std::uint32_t number : {6U, 7U}) sums.Count(MakeFrame(number));

    EXPECT_EQ(1U, sums.misnumbered);
    EXPECT_EQ("5", sums.DescribeMissing());
}

TEST(StreamSumsTest, AGapIsSeenAcrossTheForgettingOfTheCounts) {
    StreamSums sums = CountNumbers({4, 6});

    sums.ForgetCounts();
    sums.Count(MakeFrame(8));
    sums.Settle();

    EXPECT_EQ(1U, sums.frames);
    EXPECT_EQ("7", sums.DescribeMissing());
}

TEST(StreamSumsTest, AFrameThatComesTwiceIsNoGap) {
    const StreamSums sums = CountNumbers({4, 4, 5, 7, 7, 8});

    EXPECT_EQ(2U, sums.repeats);
    EXPECT_EQ("6", sums.DescribeMissing());
}

TEST(StreamSumsTest, TheExposuresOfOneFrameAreNoGap) {
    const StreamSums sums = CountNumbers({3, 6, 9, 15, 17}, 3);

    EXPECT_EQ(1U, sums.gaps);
    EXPECT_EQ(1U, sums.drops);
    EXPECT_EQ("10-12", sums.DescribeMissing()) << "13 to 15 are the exposures of frame 15";
}

TEST(StreamSumsTest, DamagedFramesAreCountedByTheirCode) {
    StreamSums sums(1);
    sums.Count(MakeFrame(1, zerrMissingData));
    sums.Count(MakeFrame(2));
    sums.Count(MakeFrame(3, zerrOutOfSync));
    sums.Count(MakeFrame(4, zerrMissingData));

    EXPECT_EQ(3U, sums.damaged);
    EXPECT_THAT(sums.GetErrors(), testing::ElementsAre(testing::Pair(zerrOutOfSync, 1),
                                                       testing::Pair(zerrMissingData, 2)));
    EXPECT_EQ("missingData", ZentaraProgram::GetFrameErrorName(zerrMissingData));
    EXPECT_EQ("code77", ZentaraProgram::GetFrameErrorName(77));
}

StreamSums CountGaps(std::size_t gaps) {
    StreamSums sums(1);
    for (std::size_t i = 0; i <= gaps; ++i) {
        sums.Count(MakeFrame(static_cast<std::uint32_t>(2 * i)));
    }
    sums.Settle();
    return sums;
}

TEST(StreamSumsTest, AStreamFullOfGapsKeepsALimitedList) {
    const StreamSums sums = CountGaps(StreamSums::MissingMax + 5);

    EXPECT_EQ(StreamSums::MissingMax, sums.GetMissing().size());
    EXPECT_EQ(StreamSums::MissingMax + 5, sums.gaps);
    EXPECT_EQ(5U, sums.CountUnnamedGaps());
}

TEST(StreamSumsTest, ATextOfManyGapsTellsHowManyItDoesNotName) {
    const StreamSums sums = CountGaps(StreamSums::DescribedMax + 5);

    EXPECT_EQ(StreamSums::DescribedMax + 5, sums.GetMissing().size());
    EXPECT_EQ(0U, sums.CountUnnamedGaps());
    EXPECT_THAT(sums.DescribeMissing(), testing::EndsWith(", 1999 and 5 more gaps"));
}

}  // namespace
}  // namespace ZentaraTest
