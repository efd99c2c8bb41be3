#include "windows/road/child_process.h"

#include <gtest/gtest.h>

#include "support/wait_until.h"
#include "windows/road/test_driver.h"
#include "windows/support/process_start.h"

namespace ZV::Test {
namespace {

// A busy machine takes its time to start a process.
constexpr auto AnswerLimit = std::chrono::seconds(60);
constexpr DWORD EndLimitMs = 60000;

/// A pipe of which the child inherits one end.
bool MakePipe(HANDLE* reading, HANDLE* writing, bool isReadByChild) {
    SECURITY_ATTRIBUTES inherited{sizeof inherited, nullptr, TRUE};
    if (!CreatePipe(reading, writing, &inherited, 0)) return false;
    return SetHandleInformation(isReadByChild ? *writing : *reading, HANDLE_FLAG_INHERIT, 0);
}

bool Create(std::string* line, STARTUPINFOA* start, PROCESS_INFORMATION* started) {
    return StartProcessDespiteLosses([&] {
        return CreateProcessA(nullptr, line->data(), nullptr, nullptr, TRUE, 0, nullptr, nullptr,
                              start, started);
    });
}

void CloseAndClear(HANDLE* handle) {
    if (*handle != nullptr) CloseHandle(*handle);
    *handle = nullptr;
}

}  // namespace

ChildProcess::ChildProcess(const std::string& program, const std::string& arguments) {
    HANDLE childInput = nullptr;
    HANDLE childOutput = nullptr;
    STARTUPINFOA start{};
    PROCESS_INFORMATION started{};
    std::string line = '"' + GetProgramFolder() + '\\' + program + "\" " + arguments;
    start.cb = sizeof start;
    if (MakePipe(&childInput, &input, true) && MakePipe(&output, &childOutput, false)) {
        start.dwFlags = STARTF_USESTDHANDLES;
        start.hStdInput = childInput;
        start.hStdOutput = childOutput;
        start.hStdError = GetStdHandle(STD_ERROR_HANDLE);
        if (Create(&line, &start, &started)) {
            process = started.hProcess;
            CloseHandle(started.hThread);
        }
    }
    CloseAndClear(&childInput);
    CloseAndClear(&childOutput);
    EXPECT_NE(nullptr, process) << line << " does not start: " << GetLastError();
}

ChildProcess::~ChildProcess() {
    Kill();
    CloseAndClear(&process);
    CloseAndClear(&input);
    CloseAndClear(&output);
}

bool ChildProcess::ReadAvailable() {
    DWORD available = 0;
    char buffer[512];
    if (!PeekNamedPipe(output, nullptr, 0, nullptr, &available, nullptr)) return false;
    if (available == 0) return true;
    DWORD bytes = 0;
    const DWORD wanted = available < sizeof buffer ? available : sizeof buffer;
    if (!ReadFile(output, buffer, wanted, &bytes, nullptr)) return false;
    read.append(buffer, bytes);
    return true;
}

std::string ChildProcess::ReadLine() {
    std::size_t end = std::string::npos;
    // The output of a process that has gone ends the wait too.
    (void)WaitUntil(
        [&] {
            const bool isOpen = ReadAvailable();
            end = read.find('\n');
            return end != std::string::npos || !isOpen;
        },
        AnswerLimit);
    if (end == std::string::npos) return "";
    std::string line = read.substr(0, end);
    read.erase(0, end + 1);
    if (!line.empty() && line.back() == '\r') line.pop_back();
    return line;
}

std::string ChildProcess::Ask(const std::string& line) {
    const std::string sent = line + '\n';
    DWORD written = 0;
    if (!WriteFile(input, sent.data(), static_cast<DWORD>(sent.size()), &written, nullptr)) {
        return "";
    }
    return ReadLine();
}

bool ChildProcess::Finish() {
    CloseAndClear(&input);
    return WaitForSingleObject(process, EndLimitMs) == WAIT_OBJECT_0;
}

void ChildProcess::Kill() {
    if (process == nullptr || WaitForSingleObject(process, 0) == WAIT_OBJECT_0) return;
    TerminateProcess(process, 1);
    WaitForSingleObject(process, EndLimitMs);
}

}  // namespace ZV::Test
