#include "hal/platform/console.h"

#include <io.h>
#include <windows.h>

#include <cstdio>

namespace ZV {
namespace {

constexpr WORD GreyOnBlack = 7;

/// Whether an output goes to something that is no console: a file, a pipe, another device.
bool IsRedirected(HANDLE output) {
    if (output == nullptr || output == INVALID_HANDLE_VALUE) return false;
    DWORD mode = 0;
    return GetFileType(output) != FILE_TYPE_UNKNOWN && !GetConsoleMode(output, &mode);
}

/// What the stream of the C library writes to, which a host may have changed without the process's
/// own handle. Null for a stream that is closed.
HANDLE GetStreamHandle() {
    const int descriptor = _fileno(stdout);
    return descriptor >= 0 ? reinterpret_cast<HANDLE>(_get_osfhandle(descriptor)) : nullptr;
}

bool IsOutputRedirected() {
    return IsRedirected(GetStdHandle(STD_OUTPUT_HANDLE)) || IsRedirected(GetStreamHandle());
}

bool HasConsole() {
    HANDLE console =
        CreateFileA("CONOUT$", GENERIC_READ | GENERIC_WRITE, FILE_SHARE_READ | FILE_SHARE_WRITE,
                    nullptr, OPEN_EXISTING, 0, nullptr);
    if (console == INVALID_HANDLE_VALUE) return false;
    CloseHandle(console);
    return true;
}

}  // namespace

void PrepareLogConsole(const char* title) {
    if (!HasConsole()) return;
    if (!IsOutputRedirected()) {
        // A refusal is ignored: the log goes elsewhere.
        (void)std::freopen("CONOUT$", "wt", stdout);
    }
    SetConsoleTitleA(title);
    SetConsoleTextAttribute(GetStdHandle(STD_OUTPUT_HANDLE), GreyOnBlack);
}

}  // namespace ZV
