#include "tools/stream_sums.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

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

StreamSums CountNumbers(const std::vector<std::uint32_t>& numbers,
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
    const StreamSums broken = CountNumbers(
        {65530, 65531, 65532, 65533, 1, 32768, 32769, 32770, 32771, 32772, 32773, 65535, 3, 4, 5});

    EXPECT_EQ(0U, whole.gaps);
    EXPECT_EQ(65537U, whole.GetLastNumber());
    EXPECT_EQ(3U + 32766U + 32761U + 3U, broken.drops);
    EXPECT_EQ("65534-65536, 65538-98303, 98310-131070, 131072-131074", broken.DescribeMissing());
}

/// Numbers as they come, and how they are read.
struct ReadRow {
    std::vector<std::uint32_t> numbers;
    std::uint64_t misnumbered;
    std::string missing;
    std::uint64_t lastNumber;
    std::uint64_t repeats = 0;
};

void ExpectToBeRead(const std::vector<ReadRow>& rows) {
    for (const ReadRow& row : rows) {
        SCOPED_TRACE("numbers " + testing::PrintToString(row.numbers));
        const StreamSums sums = CountNumbers(row.numbers);

        EXPECT_EQ(row.missing, sums.DescribeMissing());
        EXPECT_EQ(row.misnumbered, sums.misnumbered);
        EXPECT_EQ(row.repeats, sums.repeats);
        EXPECT_EQ(row.lastNumber, sums.GetLastNumber());
    }
}

TEST(StreamSumsTest, NumbersThatOnlyGoAheadByShortLossesAreBelievedWhateverTheirPattern) {
    ExpectToBeRead({
        {{4, 7}, 0, "5-6", 7},
        {{4, 900}, 0, "5-899", 900},
        {{4, 1029}, 0, "5-1028", 1029},
        {{4, 200, 400, 401}, 0, "5-199, 201-399", 401},
        {{4, 900, 1800}, 0, "5-899, 901-1799", 1800},
        {{0, 90, 180}, 0, "1-89, 91-179", 180},
        {{0, 90, 180, 181}, 0, "1-89, 91-179", 181},
        {{0, 90, 180, 270}, 0, "1-89, 91-179, 181-269", 270},
        {{0, 90, 180, 270, 271}, 0, "1-89, 91-179, 181-269", 271},
        {{65000, 65500, 464, 465}, 0, "65001-65499, 65501-65999", 66001},
    });
}

TEST(StreamSumsTest, AWrongNumberIsNoGapButItsOwnNumberIsMissing) {
    ExpectToBeRead({
        {{3, 4, 900, 6, 7}, 1, "5", 7},
        {{3, 4, 65530, 6, 7}, 1, "5", 7},
        {{3, 4, 30000, 6, 7}, 1, "5", 7},
        {{3, 4, 30000, 6}, 1, "5", 6},
        {{3, 4, 900, 900, 6, 7}, 1, "5", 7, 1},
        {{4, 6, 2, 9, 10}, 1, "5, 7-8", 10},
        {{0, 90, 180, 40000, 360, 450}, 1, "1-89, 91-179, 181-359, 361-449", 450},
    });
}

TEST(StreamSumsTest, WrongNumbersInARowAreNoGapsAndNoRoundsOfTheNumber) {
    ExpectToBeRead({
        {{4, 900, 30000, 7, 8}, 2, "5-6", 8},
        {{4, 65000, 900, 7, 8}, 2, "5-6", 8},
        {{4, 900, 30000, 20000, 8, 9}, 3, "5-7", 9},
        {{2, 3, 4, 30000, 30001, 30002, 8, 9, 10}, 3, "5-7", 10},
    });
}

TEST(StreamSumsTest, WrongNumbersCloseAheadAreNoRoundOfTheNumber) {
    ExpectToBeRead({
        {{4, 20, 25, 7, 8, 9}, 2, "5-6", 9},
        {{4, 21, 22, 23, 8, 9, 10}, 3, "5-7", 10},
        {{4, 5, 60, 500, 7, 8, 9}, 2, "6", 9},
        {{4, 30, 4, 5, 6}, 1, "", 6, 1},
    });
}

TEST(StreamSumsTest, WrongNumbersAtAnEndOfAStreamAreNoGaps) {
    ExpectToBeRead({
        {{4, 2}, 1, "", 4},
        {{4, 5000}, 1, "", 4},
        {{4, 60000, 8}, 1, "5-7", 8},
        {{4, 3000, 30000}, 2, "", 4},
        {{4, 3000, 5000}, 2, "", 4},
        {{4, 5, 40000, 40001, 40002}, 2, "", 40002},
        {{4, 5, 6, 7, 40000, 40001, 40002}, 3, "", 7},
        {{0, 90, 180, 40000}, 1, "1-89, 91-179", 180},
        {{40000, 4, 5, 6}, 1, "", 6},
        {{40000, 100, 30000, 4, 5, 6, 7}, 3, "", 7},
    });
}

TEST(StreamSumsTest, KeptAWrongLastNumberThatLiesAheadByAShortLossIsBelieved) {
    ExpectToBeRead({
        {{4, 5, 500}, 0, "6-499", 500},
        {{4, 900, 30000}, 1, "5-899", 900},
    });
}

TEST(StreamSumsTest, KeptWrongNumbersThatAreMoreThanALongLossCostsAreBelieved) {
    ExpectToBeRead({
        {{1, 2, 3, 4, 50, 51, 52, 53, 9, 10, 11, 12}, 0, "5-49, 54-65544", 65548},
    });
}

TEST(StreamSumsTest, TwoFramesInTheOtherOrderAreNoRoundOfTheNumber) {
    ExpectToBeRead({{{4, 6, 5, 7}, 1, "6", 7}});  // It came in no place of its own.
}

TEST(StreamSumsTest, ALongLossIsBelievedBetweenFourFramesAndFour) {
    ExpectToBeRead({
        {{1, 2, 3, 4, 1030, 1031, 1032, 1033}, 0, "5-1029", 1033},
        {{1, 2, 3, 4, 50000, 50001, 50002, 50003}, 0, "5-49999", 50003},
        {{6, 7, 8, 9, 1, 2, 3, 4}, 0, "10-65536", 65540},
    });
}

TEST(StreamSumsTest, NumbersThatFallIntoTwoStreamsAreReadInTheEnd) {
    StreamSums sums(1);
    for (std::uint32_t i = 0; i < 1000; ++i) {
        sums.Count(MakeFrame(i));
        sums.Count(MakeFrame(30000 + i));
    }
    const std::uint64_t doubted = sums.frames - sums.misnumbered - sums.GetLastNumber() - 1;
    EXPECT_GE(StreamSums::DoubtedMax, doubted);

    sums.Settle();

    EXPECT_EQ(1000U, sums.misnumbered);
    EXPECT_EQ(0U, sums.drops);
    EXPECT_EQ(999U, sums.GetLastNumber());
}

TEST(StreamSumsTest, ADoubtOutlivesTheForgettingOfTheCounts) {
    StreamSums sums(1);
    for (const std::uint32_t number : {3U, 4U, 900U}) sums.Count(MakeFrame(number));

    sums.ForgetCounts();
    for (const std::uint32_t number : {6U, 7U}) sums.Count(MakeFrame(number));
    sums.Settle();

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
