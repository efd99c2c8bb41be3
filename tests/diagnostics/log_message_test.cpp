#include "diagnostics/open_log.h"

namespace ZV {
namespace {

class LogMessages : public Test::OpenLog {
  protected:
    LogMessages() { OpenToFile(); }

    template <typename... Values>
    std::string Expand(const char* format, Values... values) {
        const std::size_t before = ReadFile().size();
        ZLogMessage("Name", format, values...);
        std::string text = ReadFile().substr(before);
        const std::size_t start = text.find("Name - ");
        if (start == std::string::npos || text.back() != '\0') return "no record";
        text.pop_back();
        return text.substr(start + 7);
    }
};

TEST_F(LogMessages, WithAnEmptyFormatAreANameAlone) {
    EXPECT_EQ("", Expand(""));
    EXPECT_EQ("<time> Name - |\n", DescribeFile());
}

TEST_F(LogMessages, AreCopiedWhereThereIsNothingToExpand) {
    EXPECT_EQ("Camera is already open", Expand("Camera is already open"));
    EXPECT_EQ("two  blanks, a line\n", Expand("two  blanks, a line\n"));
}

TEST_F(LogMessages, HaveABlankBehindEachValue) {
    EXPECT_EQ("Zentara version is 2 .0 .8 ", Expand("Zentara version is %d.%d.%d", std::uint16_t{2},
                                                    std::uint16_t{0}, std::uint16_t{8}));
    EXPECT_EQ("Opened Solvane A1  camera", Expand("Opened %s camera", "Solvane A1"));
    EXPECT_EQ("x y ", Expand("%c%c", 'x', 'y'));
}

TEST_F(LogMessages, ShowThirtyTwoBitsWithASign) {
    EXPECT_EQ("2147483647 ", Expand("%d", std::uint32_t{0x7FFFFFFF}));
    EXPECT_EQ("-2147483648 ", Expand("%d", std::uint32_t{0x80000000}));
    EXPECT_EQ("-1 ", Expand("%d", -1));
}

TEST_F(LogMessages, ShowSixtyFourBitsByTheLetterL) {
    EXPECT_EQ("Exposure is now 5000000000 ",
              Expand("Exposure is now %l", std::uint64_t{5000000000}));
    EXPECT_EQ("New red exposure: 1  ns", Expand("New red exposure: %l ns", std::uint64_t{1}));
    EXPECT_EQ("9223372036854775807 7 ",
              Expand("%l%d", std::uint64_t{0x7FFFFFFFFFFFFFFF}, std::uint32_t{7}));
}

TEST_F(LogMessages, CopyOtherConversionsAndTakeNoValueForThem) {
    EXPECT_EQ("%u %x %% 5 ", Expand("%u %x %% %d", 5));
    EXPECT_EQ("%04d", Expand("%04d", 5));
    EXPECT_EQ("100 %", Expand("100 %"));
}

TEST_F(LogMessages, CopyABackslashAndLoseWhatFollowsIt) {
    EXPECT_EQ("a\\c", Expand("a\\bc"));
    EXPECT_EQ("\\d", Expand("\\%d", 5));
    EXPECT_EQ("\\", Expand("\\\\"));
    EXPECT_EQ("end\\", Expand("end\\"));
}

TEST_F(LogMessages, StandANullTextAndAZeroCharacter) {
    EXPECT_EQ("(null) !", Expand("%s!", static_cast<const char*>(nullptr)));
    EXPECT_EQ("a b", Expand("a%cb", '\0'));
}

TEST_F(LogMessages, AreCutLikeAnyRecord) {
    const std::string tail(5000, 'x');

    const std::string text = Expand("%s end", tail.c_str());

    EXPECT_EQ(std::string::npos, text.find("end"));
    EXPECT_EQ(1024u, ReadFile().size());
}

TEST_F(LogMessages, AreNotExpandedTwice) {
    EXPECT_EQ("%d %s ", Expand("%s", "%d %s"));
}

TEST_F(LogMessages, AreShownInNestedCallsToo) {
    ZLogEnter("Outer");
    ZLogEnter("Inner");
    ZLogMessage("Inner", "text");

    EXPECT_EQ("<time> Outer start|\n<time> Inner - text|\n", DescribeFile());
}

TEST_F(LogMessages, AreSilentWhileTheLogIsOff) {
    OpenToFile("outputEnabled = 0\n");

    ZLogMessage("Name", "%s", "text");

    EXPECT_EQ("", ReadFile());
    EXPECT_EQ("", ReadDebuggerOutput());
}

}  // namespace
}  // namespace ZV
