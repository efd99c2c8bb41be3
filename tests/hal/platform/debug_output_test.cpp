#include "hal/platform/debug_output.h"

#include <gtest/gtest.h>

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
