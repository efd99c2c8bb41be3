#pragma once

#include <gtest/gtest.h>
#include <windows.h>

#include <string>

namespace ZV::Test {

[[nodiscard]] inline std::string GetOwnPath() {
    char path[MAX_PATH] = "";
    EXPECT_NE(GetModuleFileNameA(nullptr, path, sizeof path), 0u);
    return path;
}

/// A test of a suite, this one or another, in a process of its own. A disabled test runs too: it is
/// one that makes sense as a child alone.
class ChildProcess {
  public:
    ChildProcess(const std::string& program, const std::string& test) {
        std::string line =
            "\"" + program +
            "\" --gtest_brief=1 --gtest_also_run_disabled_tests --gtest_filter=" + test;
        STARTUPINFOA start{};
        start.cb = sizeof start;
        EXPECT_TRUE(CreateProcessA(program.c_str(), line.data(), nullptr, nullptr,
                                   /*bInheritHandles=*/TRUE, 0, nullptr, nullptr, &start, &process))
            << GetLastError();
    }
    explicit ChildProcess(const std::string& test) : ChildProcess(GetOwnPath(), test) {}
    /// Ends a child that still runs.
    ~ChildProcess() {
        if (process.hProcess == nullptr) return;
        TerminateProcess(process.hProcess, 1);
        CloseHandle(process.hThread);
        CloseHandle(process.hProcess);
    }
    ChildProcess(const ChildProcess&) = delete;
    ChildProcess& operator=(const ChildProcess&) = delete;

    /// 0 for a test that passed.
    [[nodiscard]] DWORD WaitForExitCode() {
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
