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
    const StreamSums broken = CountNumbers({65533, 1, 65535, 3});

    EXPECT_EQ(0U, whole.gaps);
    EXPECT_EQ(65537U, whole.GetLastNumber());
    EXPECT_EQ(3U + 65533U + 3U, broken.drops);
    EXPECT_EQ("65534-65536, 65538-131070, 131072-131074", broken.DescribeMissing());
}

TEST(StreamSumsTest, AGapIsSeenAcrossTheForgettingOfTheCounts) {
    StreamSums sums = CountNumbers({4, 6});

    sums.ForgetCounts();
    sums.Count(MakeFrame(8));

    EXPECT_EQ(1U, sums.frames);
    EXPECT_EQ("7", sums.DescribeMissing());
}

TEST(StreamSumsTest, AFrameThatComesTwiceIsNoGap) {
    const StreamSums sums = CountNumbers({4, 4, 5});

    EXPECT_EQ(1U, sums.repeats);
    EXPECT_EQ(0U, sums.gaps);
}

TEST(StreamSumsTest, TheExposuresOfOneFrameAreNoGap) {
    const StreamSums sums = CountNumbers({3, 6, 9, 15, 17}, 3);

    EXPECT_EQ(1U, sums.gaps);
    EXPECT_EQ(1U, sums.drops);
    EXPECT_EQ("10-14", sums.DescribeMissing());
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

TEST(StreamSumsTest, AStreamFullOfGapsKeepsALimitedList) {
    StreamSums sums(1);
    for (std::uint32_t i = 0; i <= StreamSums::MissingMax + 5; ++i) sums.Count(MakeFrame(2 * i));

    EXPECT_EQ(StreamSums::MissingMax, sums.GetMissing().size());
    EXPECT_EQ(StreamSums::MissingMax + 5, sums.gaps);
    EXPECT_THAT(sums.DescribeMissing(), testing::EndsWith(" and 5 more gaps"));
}

}  // namespace
}  // namespace ZentaraTest
