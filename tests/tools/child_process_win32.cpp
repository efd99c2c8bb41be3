#include <windows.h>

#include <cwchar>

#include "tools/child_process.h"
#include "windows/support/process_start.h"

namespace ZentaraTest {
namespace {

std::wstring Widen(const std::string& text) {
    const int size = static_cast<int>(text.size());
    std::wstring wide(text.size(), L'\0');
    const int length = MultiByteToWideChar(CP_UTF8, 0, text.data(), size, wide.data(), size);
    wide.resize(static_cast<std::size_t>(length));
    return wide;
}

/// An argument as programs take a command line apart: quoted, backslashes doubled before quotes.
std::wstring Quote(const std::wstring& argument) {
    std::wstring quoted = L"\"";
    std::size_t backslashes = 0;
    for (const wchar_t letter : argument) {
        if (letter == L'"') quoted.append(backslashes + 1, L'\\');
        backslashes = letter == L'\\' ? backslashes + 1 : 0;
        quoted += letter;
    }
    quoted.append(backslashes, L'\\');
    return quoted + L'"';
}

std::wstring MakeCommandLine(const std::vector<std::string>& values) {
    std::wstring line;
    for (const std::string& value : values)
        line += (line.empty() ? L"" : L" ") + Quote(Widen(value));
    return line;
}

bool IsSame(const std::wstring& name, const wchar_t* variable) {
    return _wcsnicmp(name.c_str(), variable, name.size()) == 0;
}

/// The variables of this process and others, which come before those of the same name.
std::wstring MakeEnvironment(const std::vector<std::string>& variables) {
    std::vector<std::wstring> names;
    std::wstring block;
    for (const std::string& variable : variables) {
        const std::wstring wide = Widen(variable);
        names.push_back(wide.substr(0, wide.find(L'=') + 1));
        block += wide + L'\0';
    }
    wchar_t* inherited = GetEnvironmentStringsW();
    for (const wchar_t* at = inherited; *at != L'\0'; at += std::wcslen(at) + 1) {
        bool isReplaced = false;
        for (const std::wstring& name : names) isReplaced = isReplaced || IsSame(name, at);
        if (!isReplaced) block += std::wstring(at) + L'\0';
    }
    FreeEnvironmentStringsW(inherited);
    return block + L'\0';
}

HANDLE CreateOutput(const std::string& path) {
    SECURITY_ATTRIBUTES inherited{sizeof inherited, nullptr, TRUE};
    const DWORD share = FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE;
    return CreateFileW(Widen(path).c_str(), GENERIC_WRITE, share, &inherited, CREATE_ALWAYS, 0,
                       nullptr);
}

HANDLE GetHandle(ChildProcess process) {
    return reinterpret_cast<HANDLE>(process);
}

BOOL WINAPI TakeInterrupt(DWORD) {
    return TRUE;
}

}  // namespace

// Each process has a console of its own without a window, so that an interrupt reaches it alone.
ChildProcess StartProcess(const ProcessStart& start) {
    std::wstring commandLine = MakeCommandLine(start.commandLine);
    std::wstring environment = MakeEnvironment(start.variables);
    STARTUPINFOW streams{};
    streams.cb = sizeof streams;
    streams.dwFlags = STARTF_USESTDHANDLES;
    streams.hStdOutput = CreateOutput(start.output);
    streams.hStdError = CreateOutput(start.errors);
    PROCESS_INFORMATION made{};
    const bool isStarted = ZV::Test::StartProcessDespiteLosses([&] {
        return CreateProcessW(nullptr, commandLine.data(), nullptr, nullptr, TRUE,
                              CREATE_NO_WINDOW | CREATE_UNICODE_ENVIRONMENT, environment.data(),
                              nullptr, &streams, &made);
    });
    CloseHandle(streams.hStdOutput);
    CloseHandle(streams.hStdError);
    if (!isStarted) return NoProcess;
    CloseHandle(made.hThread);
    return reinterpret_cast<ChildProcess>(made.hProcess);
}

// The interrupt comes to all of the console. To have it ignored would pass on to what starts next.
void InterruptProcess(ChildProcess process) {
    [[maybe_unused]] static const BOOL isTaken = SetConsoleCtrlHandler(TakeInterrupt, TRUE);
    FreeConsole();
    if (!AttachConsole(GetProcessId(GetHandle(process)))) return;
    GenerateConsoleCtrlEvent(CTRL_C_EVENT, 0);
    FreeConsole();
}

bool IsProcessEnded(ChildProcess process, int* exitCode) {
    DWORD code = 0;
    *exitCode = -1;
    if (process == NoProcess) return true;
    if (WaitForSingleObject(GetHandle(process), 0) != WAIT_OBJECT_0) return false;
    if (GetExitCodeProcess(GetHandle(process), &code)) *exitCode = static_cast<int>(code);
    CloseHandle(GetHandle(process));
    return true;
}

void KillProcess(ChildProcess process) {
    if (process == NoProcess) return;
    TerminateProcess(GetHandle(process), 1);
    WaitForSingleObject(GetHandle(process), INFINITE);
    CloseHandle(GetHandle(process));
}

std::string GetBuiltProgram(const std::string& name) {
    return ZENTARA_BINARY_DIR "/bin/" + name + ".exe";
}

}  // namespace ZentaraTest
