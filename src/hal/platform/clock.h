#pragma once

#include <cstdint>

namespace ZV {

/// The wait clock gives every limited wait of the library its length. It normally runs in real
/// time; a test makes it run faster by a divisor of 1 or more (0 counts as 1), so that 5000 ms pass
/// in 5. Until it is set the divisor is that of the variable `ZENTARA_WAIT_DIVISOR`, read at the
/// first wait; 1 when the variable is unset or no number. Thread-safe.
void SetWaitClockDivisor(std::uint32_t divisor);

/// Real milliseconds that `timeoutMs` milliseconds of the wait clock take, rounded up to at least 1
/// for a limit that is not 0. `WaitForEver` stays what it is.
std::uint64_t GetRealWaitMs(std::uint64_t timeoutMs);

/// Milliseconds that the wait clock has run. Its differences measure limited waits; a change of the
/// divisor makes it jump.
std::uint64_t GetWaitClockMs();

/// Microseconds of a clock that never goes back.
std::uint64_t GetMonotonicMicroseconds();

/// System time in ticks of 100 ns since 1601-01-01 UTC.
std::uint64_t GetSystemTimeTicks();

/// Local time of day, for trace records.
struct LocalTime {
    std::uint16_t hour, minute, second, millisecond;
};
LocalTime GetLocalTime24();

}  // namespace ZV
