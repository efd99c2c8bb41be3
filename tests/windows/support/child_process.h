#pragma once

#include <gtest/gtest.h>
#include <windows.h>

#include <string>

#include "windows/support/process_start.h"

namespace ZV::Test {

[[nodiscard]] inline std::string GetOwnPath() {
    char path[MAX_PATH] = "";
    EXPECT_NE(GetModuleFileNameA(nullptr, path, sizeof path), 0u);
    return path;
}

/// A word that a test gives to its child.
inline constexpr char ChildWordVariable[] = "ZENTARA_TEST_CHILD_WORD";

[[nodiscard]] inline std::string GetChildWord() {
    char word[MAX_PATH] = "";
    (void)GetEnvironmentVariableA(ChildWordVariable, word, sizeof word);
    return word;
}

/// A test of a suite in a process of its own, with a word for it. A disabled test runs too: it is
/// one that makes sense as a child alone.
class ChildProcess {
  public:
    struct Options {
        std::string program = GetOwnPath();
        std::string word = {};
        HANDLE standardOutput = GetStdHandle(STD_OUTPUT_HANDLE);
        /// A console of its own, without a window, takes the place of the standard output.
        bool hasConsole = false;
    };

    ChildProcess(const std::string& test, const Options& options) {
        std::string line =
            "\"" + options.program +
            "\" --gtest_brief=1 --gtest_also_run_disabled_tests --gtest_filter=" + test;
        STARTUPINFOA start{};
        start.cb = sizeof start;
        if (!options.hasConsole) start.dwFlags = STARTF_USESTDHANDLES;
        start.hStdInput = GetStdHandle(STD_INPUT_HANDLE);
        start.hStdOutput = options.standardOutput;
        start.hStdError = GetStdHandle(STD_ERROR_HANDLE);
        SetEnvironmentVariableA(ChildWordVariable, options.word.c_str());
        const DWORD flags = options.hasConsole ? DWORD{CREATE_NO_WINDOW} : 0;
        EXPECT_TRUE(StartProcessDespiteLosses([&] {
            return CreateProcessA(options.program.c_str(), line.data(), nullptr, nullptr,
                                  /*bInheritHandles=*/TRUE, flags, nullptr, nullptr, &start,
                                  &process);
        })) << GetLastError();
        SetEnvironmentVariableA(ChildWordVariable, nullptr);
    }
    /// Ends a child that still runs.
    ~ChildProcess() {
        if (process.hProcess == nullptr) return;
        TerminateProcess(process.hProcess, 1);
        CloseHandle(process.hThread);
        CloseHandle(process.hProcess);
    }
    ChildProcess(const ChildProcess&) = delete;
    ChildProcess& operator=(const ChildProcess&) = delete;

    [[nodiscard]] DWORD GetId() const { return process.dwProcessId; }
    [[nodiscard]] bool HasEnded() const {
        return WaitForSingleObject(process.hProcess, 0) == WAIT_OBJECT_0;
    }
    /// 0 for a test that passed.
    [[nodiscard]] DWORD WaitForExitCode() const {
        DWORD code = STILL_ACTIVE;
        EXPECT_EQ(WaitForSingleObject(process.hProcess, DeadlineMs), DWORD{WAIT_OBJECT_0});
        GetExitCodeProcess(process.hProcess, &code);
        return code;
    }

  private:
    static constexpr DWORD DeadlineMs = 60000;

    PROCESS_INFORMATION process{};
};

}  // namespace ZV::Test
