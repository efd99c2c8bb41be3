#include "hal/platform/console.h"

#include <windows.h>

#include <cstdio>

namespace ZV {
namespace {

constexpr WORD GreyOnBlack = 7;

bool IsRedirected(HANDLE output) {
    const DWORD type = GetFileType(output);
    return type == FILE_TYPE_DISK || type == FILE_TYPE_PIPE;
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
    if (!IsRedirected(GetStdHandle(STD_OUTPUT_HANDLE))) {
        (void)std::freopen("CONOUT$", "wt",
                           stdout);  // a refusal is ignored: records go elsewhere then
    }
    SetConsoleTitleA(title);
    SetConsoleTextAttribute(GetStdHandle(STD_OUTPUT_HANDLE), GreyOnBlack);
}

}  // namespace ZV
