#include "hal/platform/clock.h"

#include <windows.h>

namespace ZV {

std::uint64_t GetMonotonicMicroseconds() {
    LARGE_INTEGER frequency, count;
    QueryPerformanceFrequency(&frequency);
    QueryPerformanceCounter(&count);
    const auto perSecond = static_cast<std::uint64_t>(frequency.QuadPart);
    const auto now = static_cast<std::uint64_t>(count.QuadPart);
    return now / perSecond * 1'000'000 + now % perSecond * 1'000'000 / perSecond;
}

std::uint64_t GetSystemTimeTicks() {
    FILETIME time;
    GetSystemTimeAsFileTime(&time);
    return (std::uint64_t{time.dwHighDateTime} << 32) | time.dwLowDateTime;
}

LocalTime GetLocalTime24() {
    SYSTEMTIME time;
    GetLocalTime(&time);
    return LocalTime{time.wHour, time.wMinute, time.wSecond, time.wMilliseconds};
}

}  // namespace ZV
