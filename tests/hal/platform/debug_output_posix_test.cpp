#include "hal/platform/debug_output.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <string>

#include "support/scoped_variable.h"
#include "support/temporary_folder.h"
#include "support/test_thread.h"

namespace ZV {
namespace {

using Test::ScopedVariable;
using Test::TemporaryFolder;
using Test::TestThread;

constexpr char Variable[] = "ZENTARA_DEBUG_OUTPUT";

std::string CaptureStandardError(const char* text) {
    testing::internal::CaptureStderr();
    WriteDebuggerOutput(text);
    return testing::internal::GetCapturedStderr();
}

TEST(DebuggerOutput, IsSilentWhenNobodyListens) {
    const ScopedVariable unset(Variable, nullptr);

    EXPECT_EQ(CaptureStandardError("text"), "");
}

TEST(DebuggerOutput, IsSilentWhenTheVariableIsEmpty) {
    const ScopedVariable empty(Variable, "");

    EXPECT_EQ(CaptureStandardError("text"), "");
}

TEST(DebuggerOutput, GoesToStandardErrorAsItIsWhileTheVariableIsOne) {
    const ScopedVariable one(Variable, "1");

    EXPECT_EQ(CaptureStandardError("100 %d\n"), "100 %d\n");
}

TEST(DebuggerOutput, IsAppendedToTheFileThatTheVariableNames) {
    const TemporaryFolder folder;
    const ScopedVariable file(Variable, folder.WriteFile("log", "before\n").c_str());

    EXPECT_EQ(CaptureStandardError("one\n"), "");
    WriteDebuggerOutput("two\n");

    EXPECT_EQ(folder.ReadFile("log"), "before\none\ntwo\n");
}

TEST(DebuggerOutput, MakesItsFile) {
    const TemporaryFolder folder;
    const ScopedVariable file(Variable, folder.GetPath("new").c_str());

    WriteDebuggerOutput("text");

    EXPECT_EQ(folder.ReadFile("new"), "text");
}

TEST(DebuggerOutput, IsSilentWhenItsFileCannotBeWritten) {
    const TemporaryFolder folder;
    const ScopedVariable file(Variable, folder.GetPath("missing/file").c_str());

    EXPECT_EQ(CaptureStandardError("text"), "");
}

/// A named pipe that the variable names.
class DebuggerPipe : public testing::Test {
  protected:
    DebuggerPipe() { isMade = mkfifo(path.c_str(), 0600) == 0; }

    bool isMade = false;
    TemporaryFolder folder;
    std::string path = folder.GetPath("pipe");
    ScopedVariable variable{Variable, path.c_str()};
};

TEST_F(DebuggerPipe, IsNotWaitedForWhileNobodyReads) {
    ASSERT_TRUE(isMade);

    EXPECT_EXIT(
        {
            alarm(60);
            WriteDebuggerOutput("text");
            std::_Exit(0);
        },
        testing::ExitedWithCode(0), "");
}

TEST_F(DebuggerPipe, IsGivenItsTextsAndNotWaitedForWhenItIsFull) {
    constexpr int Calls = 200;
    ASSERT_TRUE(isMade);
    const int reader = open(path.c_str(), O_RDONLY | O_NONBLOCK);
    ASSERT_LE(0, reader);
    const std::string text(1000, 'a');

    EXPECT_EXIT(
        {
            alarm(60);
            for (int i = 0; i < Calls; ++i) WriteDebuggerOutput(text.c_str());
            std::_Exit(0);
        },
        testing::ExitedWithCode(0), "");

    std::string piece(text.size(), '\0');
    EXPECT_EQ(static_cast<ssize_t>(text.size()), read(reader, piece.data(), piece.size()));
    EXPECT_EQ(text, piece);
    close(reader);
}

void CutStandardErrorOff() {
    int ends[2] = {-1, -1};
    if (pipe(ends) != 0 || dup2(ends[1], STDERR_FILENO) < 0) std::_Exit(1);
    close(ends[0]);
}

TEST(DebuggerOutput, LetsTheProcessLiveWhenTheReaderOfStandardErrorIsGone) {
    const ScopedVariable one(Variable, "1");

    EXPECT_EXIT(
        {
            CutStandardErrorOff();
            WriteDebuggerOutput("text");
            std::_Exit(0);
        },
        testing::ExitedWithCode(0), "");
}

TEST(DebuggerOutput, IsOnePieceForEachCallOfTwoThreads) {
    constexpr int Calls = 200;
    const TemporaryFolder folder;
    const ScopedVariable file(Variable, folder.GetPath("log").c_str());

    {
        const TestThread first([] {
            for (int i = 0; i < Calls; ++i) WriteDebuggerOutput("aaaaaaaa\n");
        });
        const TestThread second([] {
            for (int i = 0; i < Calls; ++i) WriteDebuggerOutput("bbbbbbbb\n");
        });
    }

    const std::string log = folder.ReadFile("log");
    ASSERT_EQ(log.size(), 2u * Calls * 9);
    for (std::size_t i = 0; i < log.size(); i += 9) {
        EXPECT_EQ(log.substr(i, 9), std::string(8, log[i]) + "\n");
    }
}

}  // namespace
}  // namespace ZV
