#include "hal/platform/clock.h"

#include <ctime>

namespace ZV {
namespace {

constexpr std::uint64_t TicksPerSecond = 10'000'000;
constexpr std::uint64_t TicksFrom1601To1970 = 11'644'473'600 * TicksPerSecond;

timespec ReadClock(clockid_t clock) {
    timespec time{};
    clock_gettime(clock, &time);
    return time;
}

}  // namespace

std::uint64_t GetMonotonicMicroseconds() {
    const timespec time = ReadClock(CLOCK_MONOTONIC);
    return static_cast<std::uint64_t>(time.tv_sec) * 1'000'000 +
           static_cast<std::uint64_t>(time.tv_nsec) / 1000;
}

std::uint64_t GetSystemTimeTicks() {
    const timespec time = ReadClock(CLOCK_REALTIME);
    return TicksFrom1601To1970 + static_cast<std::uint64_t>(time.tv_sec) * TicksPerSecond +
           static_cast<std::uint64_t>(time.tv_nsec) / 100;
}

LocalTime GetLocalTime24() {
    const timespec time = ReadClock(CLOCK_REALTIME);
    tm local{};
    localtime_r(&time.tv_sec, &local);
    return LocalTime{static_cast<std::uint16_t>(local.tm_hour),
                     static_cast<std::uint16_t>(local.tm_min),
                     static_cast<std::uint16_t>(local.tm_sec),
                     static_cast<std::uint16_t>(time.tv_nsec / 1'000'000)};
}

}  // namespace ZV
