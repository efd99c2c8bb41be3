#include <algorithm>
#include <atomic>
#include <cstdlib>

#include "hal/platform/clock.h"
#include "hal/platform/environment.h"
#include "hal/platform/wait_outcome.h"

namespace ZV {
namespace {

constexpr std::uint32_t DivisorNotRead = 0;
constexpr std::uint32_t DivisorMax = 1'000'000;

constinit std::atomic<std::uint32_t> waitDivisor{DivisorNotRead};

std::uint32_t LimitDivisor(std::uint64_t divisor) {
    return static_cast<std::uint32_t>(std::clamp<std::uint64_t>(divisor, 1, DivisorMax));
}

std::uint32_t ReadDivisorVariable() {
    const char* text = GetLibraryVariable("ZENTARA_WAIT_DIVISOR");
    return LimitDivisor(text != nullptr ? std::strtoull(text, nullptr, 10) : 1);
}

std::uint32_t GetDivisor() {
    std::uint32_t divisor = waitDivisor.load(std::memory_order_relaxed);
    if (divisor != DivisorNotRead) return divisor;
    const std::uint32_t read = ReadDivisorVariable();
    // A divisor that was set meanwhile wins over the variable.
    return waitDivisor.compare_exchange_strong(divisor, read, std::memory_order_relaxed) ? read
                                                                                         : divisor;
}

}  // namespace

void SetWaitClockDivisor(std::uint32_t divisor) {
    waitDivisor.store(LimitDivisor(divisor), std::memory_order_relaxed);
}

std::uint64_t GetRealWaitMs(std::uint64_t timeoutMs) {
    if (timeoutMs == 0 || timeoutMs == WaitForEver) return timeoutMs;
    return (timeoutMs - 1) / GetDivisor() + 1;
}

std::uint64_t GetWaitClockMs() {
    constexpr std::uint64_t MicrosecondsPerMillisecond = 1000;
    return GetMonotonicMicroseconds() * GetDivisor() / MicrosecondsPerMillisecond;
}

}  // namespace ZV
