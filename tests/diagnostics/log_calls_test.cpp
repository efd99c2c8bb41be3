#include "diagnostics/open_log.h"

namespace ZV {
namespace {

using Test::MatchesGolden;

class LogCalls : public Test::OpenLog {
  protected:
    /// An outermost call with a call inside that has one more inside.
    static void RunNested(std::uint16_t innerCode, std::uint16_t outerCode) {
        ZLogEnter("Outer");
        ZLogEnterKey32("Inner", zprmGain);
        ZLogEnter("Innermost");
        ZLogLeave("Innermost", zerrNone);
        ZLogLeave("Inner", innerCode);
        ZLogLeave("Outer", outerCode);
    }
};

TEST_F(LogCalls, EndWithABlankLineWhenOutermostAndSuccessful) {
    OpenToFile();

    ZLogEnter("Zentara_Version");
    ZLogLeave("Zentara_Version", zerrNone);

    EXPECT_EQ(
        "<time> Zentara_Version start|\n"
        "<time> Zentara_Version end (error code 0)\\n\\n|\n",
        DescribeFile());
}

TEST_F(LogCalls, ShowTheOutermostAloneByDefault) {
    OpenToFile();

    RunNested(zerrNotSupported, zerrNone);

    EXPECT_EQ(
        "<time> Outer start|\n"
        "<time> Outer end (error code 0)\\n\\n|\n",
        DescribeFile());
    EXPECT_EQ(0, GetLogNesting());
}

TEST_F(LogCalls, LeaveAFailureInANestedCallOutAndShowThatOfTheOutermost) {
    OpenToFile();

    RunNested(zerrNotSupported, zerrBusy);

    EXPECT_EQ(
        "<time> Outer start|\n"
        "<time> Outer ending because the function cannot be processed at this time. (error 21)"
        "\\n\\n|\n",
        DescribeFile());
}

TEST_F(LogCalls, ShowNestedOnesBySwitch) {
    OpenToFile("outputNestedCalls = 1\n");

    RunNested(zerrNone, zerrNone);

    EXPECT_EQ(
        "<time> Outer start|\n"
        "<time> Inner start (zprmGain)|\n"
        "<time> Innermost start|\n"
        "<time> Innermost end (error code 0)\\n|\n"
        "<time> Inner end (error code 0)\\n|\n"
        "<time> Outer end (error code 0)\\n\\n|\n",
        DescribeFile());
}

TEST_F(LogCalls, EndTheFailureOfANestedOneWithoutALineEnd) {
    OpenToFile("outputNestedCalls = 1\n");

    RunNested(zerrNotSupported, zerrNotSupported);

    EXPECT_EQ(
        "<time> Outer start|\n"
        "<time> Inner start (zprmGain)|\n"
        "<time> Innermost start|\n"
        "<time> Innermost end (error code 0)\\n|\n"
        "<time> Inner ending because the function is not supported for this device. (error 1)|\n"
        "<time> Outer ending because the function is not supported for this device. (error 1)"
        "\\n\\n|\n",
        DescribeFile());
}

TEST_F(LogCalls, TellEachCodeInTheWordsOfItsTable) {
    OpenToFile();

    for (std::uint16_t code = 0; code < 34; ++code) {
        ZLogEnter("Zentara_Call");
        ZLogLeave("Zentara_Call", code);
    }
    ZLogError("Zentara_Call", 0xFFFF);

    EXPECT_TRUE(MatchesGolden("diagnostics/golden/codes.txt", DescribeFile()));
}

TEST_F(LogCalls, NameTheirKeysByTheTablesOfTheirFamily) {
    OpenToFile("outputNestedCalls = 1\n");

    for (std::uint32_t key = 0; key < 48; ++key) ZLogEnterKey32("Zentara_GetParam", key);
    for (std::uint32_t key = 0; key < 4; ++key) ZLogEnterKeyS32("Zentara_GetParamS32", key);
    for (std::uint32_t key = 0; key < 5; ++key) ZLogEnterKey64("Zentara_GetParam64", key);
    for (std::uint32_t key = 0; key < 42; ++key) ZLogEnterInfo("Zentara_GetInfo", key);

    EXPECT_TRUE(MatchesGolden("diagnostics/golden/keys.txt", DescribeFile()));
    EXPECT_EQ(48 + 4 + 5 + 42, GetLogNesting());
}

TEST_F(LogCalls, AreCountedWhileTheLogIsOff) {
    Open("");

    ZLogEnter("Outer");
    ZLogEnterInfo("Inner", zinfCcd);
    EXPECT_EQ(2, GetLogNesting());
    ZLogLeave("Inner", zerrBusy);
    ZLogLeave("Outer", zerrNone);

    EXPECT_EQ(0, GetLogNesting());
    EXPECT_EQ("", ReadDebuggerOutput());
}

TEST_F(LogCalls, AtADepthLeftTooHighCountAsNestedAndVanish) {
    OpenToFile();
    ZLogEnter("Left without an end");
    const std::string before = DescribeFile();

    RunNested(zerrNone, zerrNone);

    EXPECT_EQ(before, DescribeFile());
}

TEST_F(LogCalls, AtADepthLeftTooLowShowTheirFirstNestedCallLikeTheOutermost) {
    OpenToFile();
    ZLogLeave("Zentara_QueueFrame", zerrBadParameter);
    const std::string before = DescribeFile();

    RunNested(zerrNone, zerrNone);

    EXPECT_EQ(
        "<time> Zentara_QueueFrame ending because one of the parameters used is not valid. "
        "(error 2)\\n\\n|\n",
        before);
    EXPECT_EQ(before +
                  "<time> Outer start|\n"
                  "<time> Inner start (zprmGain)|\n"
                  "<time> Inner end (error code 0)\\n\\n|\n"
                  "<time> Outer end (error code 0)\\n\\n|\n",
              DescribeFile());
}

TEST_F(LogCalls, TellAnErrorOnlyWhileTheLogIsOn) {
    Open("");

    ZLogError("Zentara_Call", zerrBusy);

    EXPECT_EQ("", ReadDebuggerOutput());
}

}  // namespace
}  // namespace ZV
