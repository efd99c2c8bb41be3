#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

namespace ZV {

/// Bytes that a record may have with its terminator; what is longer is cut.
inline constexpr std::size_t LogRecordCapacity = 1024;

/// Microseconds from `start` to `now` in 32 bits with a sign: negative from about 35 minutes on,
/// and round again after twice that.
[[nodiscard]] std::int32_t CalculateLogElapsed(std::uint64_t start, std::uint64_t now);

/// Writes what stands before a record's text: minutes, whole seconds and milliseconds. Takes any
/// time of up to 68 years. Returns the length; `text` is terminated.
std::size_t FormatLogPrefix(std::int64_t elapsedMicroseconds, std::span<char> text);

}  // namespace ZV
