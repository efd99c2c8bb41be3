#include "diagnostics/log_state.h"

#include <filesystem>

#include "camera/camera.h"
#include "diagnostics/open_log.h"
#include "hal/hal.h"
#include "support/flat_camera.h"

namespace ZV {
namespace {

using Test::ClientFrame;

class LogNesting : public Test::OpenedCamera {
  protected:
    ~LogNesting() override { logState.nesting = 0; }
};

TEST_F(LogNesting, ACallThatEndsLeavesTheDepthAsItWas) {
    const std::int32_t depth = GetLogNesting();
    std::uint32_t value = 0;
    ClientFrame frame(64 * 48);

    EXPECT_ZERR(zerrNone, Zentara_GetInfo(handle, zinfCcdWidth, &value));
    EXPECT_ZERR(zerrNotSupported, Zentara_GetInfo(handle, 100, &value));
    EXPECT_ZERR(zerrNone, Zentara_GrabFrame(handle, frame.Get()));
    EXPECT_ZERR(zerrBadHandle, Zentara_Abort(0));
    Zentara_is16bit(0);
    Zentara_CalcImageSize(0, 1, 1);

    EXPECT_EQ(depth, GetLogNesting());
}

TEST_F(LogNesting, ASecondLoadLeavesTheDepthOneTooHighForGood) {
    const std::int32_t depth = GetLogNesting();

    EXPECT_ZERR(zerrAlreadyLoaded, Zentara_LoadDriver());
    EXPECT_EQ(depth + 1, GetLogNesting());
    Zentara_ReleaseDriver();
    EXPECT_ZERR(zerrNone, Zentara_LoadDriver());

    EXPECT_EQ(depth + 1, GetLogNesting());
}

TEST_F(LogNesting, AFrameThatIsNotQueuedLowersTheDepthByOne) {
    const std::int32_t depth = GetLogNesting();
    ClientFrame frame(64 * 48);

    EXPECT_ZERR(zerrNone, Zentara_QueueFrame(handle, frame.Get(), nullptr, 0, 0, 0));
    EXPECT_EQ(depth, GetLogNesting());

    EXPECT_ZERR(zerrBadParameter, Zentara_QueueFrame(handle, nullptr, nullptr, 0, 0, 0));
    EXPECT_EQ(depth - 1, GetLogNesting());
}

class LogSwitches : public Test::OpenLog {
  protected:
    LogSwitches() : world(ZV::Test::SmallMono) {}
    ~LogSwitches() override { Zentara_ReleaseDriver(); }

    void Load(std::string_view lines) const {
        stored.Write(lines);
        ASSERT_ZERR(zerrNone, Zentara_LoadDriver());
    }

    ZV::Test::SimulationWorld world;
};

TEST_F(LogSwitches, AreOffWithoutAStore) {
    stored.Remove();
    ASSERT_ZERR(zerrNone, Zentara_LoadDriver());

    EXPECT_EQ(0, GetOutputReads());
    EXPECT_EQ(0, GetOutputWrites());
    EXPECT_EQ(0, logState.outputEnabled);
    EXPECT_FALSE(ZCamera::GetShouldOutputReads());
}

TEST_F(LogSwitches, AnyValueButZeroTurnsATraceOnAsOne) {
    Load("outputReads = 7\noutputWrites = 1\n");

    EXPECT_EQ(1, GetOutputReads());
    EXPECT_EQ(1, GetOutputWrites());
    EXPECT_TRUE(ZCamera::GetShouldOutputReads());
    EXPECT_TRUE(ZCamera::GetShouldOutputWrites());
    EXPECT_EQ(1, GetHalOutputReads());
    EXPECT_EQ(1, GetHalOutputWrites());
}

TEST_F(LogSwitches, AreReadAtEachLoad) {
    Load("outputReads = 1\n");
    Zentara_ReleaseDriver();

    Load("outputReads = 0\n");

    EXPECT_EQ(0, GetOutputReads());
    EXPECT_FALSE(ZCamera::GetShouldOutputReads());
}

TEST_F(LogSwitches, AListingTurnsTheTraceOfWritesOffAndLeavesThatOfReads) {
    Load("outputReads = 1\noutputWrites = 1\n");
    Zentara_CamListItem item{};
    std::uint32_t length = 1;
    testing::internal::CaptureStdout();

    EXPECT_ZERR(zerrNone, Zentara_ListCameras(&item, &length));

    (void)testing::internal::GetCapturedStdout();
    EXPECT_TRUE(ZCamera::GetShouldOutputReads());
    EXPECT_FALSE(ZCamera::GetShouldOutputWrites());
    EXPECT_EQ(1, GetHalOutputReads());
    EXPECT_EQ(0, GetHalOutputWrites());
}

TEST_F(LogSwitches, HaveANameOfTheirOwnEach) {
    struct Row {
        const char* name;
        Relaxed<std::uint8_t> LogState::*flag;
    };
    static constexpr Row Rows[] = {
        {"outputEnabled", &LogState::outputEnabled},
        {"outputSettings", &LogState::outputSettings},
        {"outputGetInfo", &LogState::outputGetInfo},
        {"outputFrame", &LogState::outputFrame},
        {"outputSparseTable", &LogState::outputSparseTable},
        {"outputNestedCalls", &LogState::outputNestedCalls},
        {"outputToFile", &LogState::outputToFile},
        {"outputReads", &LogState::outputReads},
        {"outputWrites", &LogState::outputWrites},
    };
    for (const Row& on : Rows) {
        Open(std::string(on.name) + " = 0x80000000\n");
        for (const Row& row : Rows) {
            EXPECT_EQ(&on == &row ? 1 : 0, logState.*row.flag) << row.name << " by " << on.name;
        }
    }
}

const std::string ClosingBlock = "\\n" + std::string(48, '-') + "\\n\\n|\n";

class LogFiles : public Test::OpenLog {
  protected:
    bool HasFile() const { return std::filesystem::exists(GetFilePath()); }
};

TEST_F(LogFiles, AreNotMadeWhileTheLogIsOff) {
    Open("outputEnabled = 0\noutputToFile = 1\noutputFilePath = " + GetFilePath() + "\n");
    ZLogEnter("Zentara_Call");
    ZLogLeave("Zentara_Call", zerrNone);
    ZLogClose();

    EXPECT_FALSE(HasFile());
    EXPECT_EQ("", ReadDebuggerOutput());
}

TEST_F(LogFiles, AreNotMadeForAPathAlone) {
    Open("outputEnabled = 1\noutputFilePath = " + GetFilePath() + "\n");
    ZLogWrite("record");

    EXPECT_FALSE(HasFile());
    EXPECT_NE("", ReadDebuggerOutput());
}

TEST_F(LogFiles, AreClosedWithABlock) {
    OpenToFile();
    ZLogWrite("record");
    EXPECT_EQ("<time> record|\n", DescribeFile());

    ZLogClose();

    EXPECT_EQ("<time> record|\n" + ClosingBlock, DescribeFile());
    ZLogWrite("lost");
    ZLogClose();
    EXPECT_EQ("<time> record|\n" + ClosingBlock, DescribeFile());
    EXPECT_EQ("", ReadDebuggerOutput());
}

TEST_F(LogFiles, AreAppendedTo) {
    folder.WriteFile("log.txt", "before");
    OpenToFile();
    ZLogWrite(" first");
    // A second opening closes the former stream without a block.
    ZLogOpen();
    ZLogWrite("second");
    ZLogClose();

    EXPECT_EQ(0u, ReadFile().find("before00:0"));
    const std::string text = DescribeFile();
    EXPECT_NE(std::string::npos, text.find(" first|\n<time> second|\n" + ClosingBlock));
}

TEST_F(LogFiles, ThatCannotBeOpenedAreToldOnceAndTheirRecordsAreLost) {
    Open("outputEnabled = 1\noutputToFile = 1\noutputFilePath = /nonexistent/folder/log.txt\n");
    ZLogEnter("Zentara_Call");
    ZLogMessage("Zentara_Call", "text");
    ZLogLeave("Zentara_Call", zerrBusy);
    ZLogClose();

    EXPECT_EQ(
        "ZLog() - cannot output to file.  The file path /nonexistent/folder/log.txt is invalid or "
        "not accessable",
        ReadDebuggerOutput());
    EXPECT_EQ(1, logState.outputToFile);
}

TEST_F(LogFiles, WithoutAPathAreToldLikeABadOne) {
    Open("outputEnabled = 1\noutputToFile = 1\n");

    EXPECT_EQ("ZLog() - cannot output to file.  The file path  is invalid or not accessable",
              ReadDebuggerOutput());
}

TEST_F(LogFiles, HavePathsOfUpToAThousandAndTwentyThreeBytes) {
    const std::string path(2000, 'p');

    Open("outputEnabled = 1\noutputToFile = 1\noutputFilePath = " + path + "\n");

    EXPECT_EQ("ZLog() - cannot output to file.  The file path " + path.substr(0, 1023) +
                  " is invalid or not accessable",
              ReadDebuggerOutput());
}

TEST_F(LogFiles, AreLeftWhenALaterOpeningSendsTheRecordsElsewhere) {
    OpenToFile();
    ZLogWrite("record");

    Open("outputEnabled = 1\n");
    ZLogWrite("elsewhere");
    ZLogClose();

    EXPECT_EQ("<time> record|\n", DescribeFile());
    EXPECT_NE(std::string::npos, ReadDebuggerOutput().find("elsewhere"));
}

TEST_F(LogSwitches, ReachTheCallsOfALoadedLibrary) {
    Load("outputEnabled = 1\noutputToFile = 1\noutputFilePath = " + GetFilePath() + "\n");
    std::uint16_t major = 0, minor = 0, build = 0;

    EXPECT_ZERR(zerrNone, Zentara_LibVersion(&major, &minor, &build));
    EXPECT_ZERR(zerrBadParameter, Zentara_Version(&major, nullptr));
    Zentara_ReleaseDriver();

    EXPECT_EQ(
        "<time> Zentara_LoadDriver start|\n"
        "<time> Zentara_LoadDriver end (error code 0)\\n\\n|\n"
        "<time> Zentara_LibVersion start|\n"
        "<time> Zentara_LibVersion - Zentara version is 2 .0 .8 |\n"
        "<time> Zentara_LibVersion end (error code 0)\\n\\n|\n"
        "<time> Zentara_Version start|\n"
        "<time> Zentara_Version ending because one of the parameters used is not valid. (error 2)"
        "\\n\\n|\n"
        "<time> Zentara_ReleaseDriver start|\n"
        "<time> Zentara_ReleaseDriver end (error code 0)\\n\\n|\n" +
            ClosingBlock,
        DescribeFile());
}

TEST_F(LogSwitches, AfterASecondLoadHideOutermostCallsAsNestedOnes) {
    Load("outputEnabled = 1\noutputToFile = 1\noutputFilePath = " + GetFilePath() + "\n");
    EXPECT_ZERR(zerrAlreadyLoaded, Zentara_LoadDriver());
    const std::string before = DescribeFile();
    std::uint16_t version = 0;

    EXPECT_ZERR(zerrBadParameter, Zentara_Version(&version, nullptr));
    Zentara_ReleaseDriver();

    // Kept: the second load has a start record and no end.
    EXPECT_EQ(
        "<time> Zentara_LoadDriver start|\n"
        "<time> Zentara_LoadDriver end (error code 0)\\n\\n|\n"
        "<time> Zentara_LoadDriver start|\n",
        before);
    EXPECT_EQ(before + ClosingBlock, DescribeFile());
}

TEST_F(LogSwitches, AReleaseThatHasNothingToReleaseLeavesTheLogRunning) {
    OpenToFile();

    Zentara_ReleaseDriver();
    ZLogWrite("running");

    EXPECT_EQ(
        "<time> Zentara_ReleaseDriver start|\n"
        "<time> Zentara_ReleaseDriver ending because Zentara has not been loaded. Call "
        "Zentara_LoadDriver(). (error 8)\\n\\n|\n"
        "<time> running|\n",
        DescribeFile());
}

}  // namespace
}  // namespace ZV
