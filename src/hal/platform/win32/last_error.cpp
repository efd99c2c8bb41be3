#include "hal/platform/last_error.h"

#include <windows.h>

namespace ZV {

std::uint32_t GetLastPlatformError() {
    return GetLastError();
}

void SetLastPlatformError(std::uint32_t error) {
    SetLastError(error);
}

bool GetPlatformErrorText(std::uint32_t error, char* text, std::size_t capacity) {
    if (capacity == 0) return false;
    text[0] = '\0';
    char* systemText = nullptr;
    const DWORD flags =
        FORMAT_MESSAGE_ALLOCATE_BUFFER | FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS;
    const DWORD length =
        FormatMessageA(flags, nullptr, error, 0, reinterpret_cast<char*>(&systemText), 0, nullptr);
    if (length != 0) lstrcpynA(text, systemText, static_cast<int>(capacity));
    LocalFree(systemText);
    // Whoever asks again gets the same answer, also where there was none.
    SetLastError(error);
    return length != 0;
}

}  // namespace ZV
