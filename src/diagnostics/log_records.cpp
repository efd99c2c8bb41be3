#include "diagnostics/log_records.h"

#include <algorithm>
#include <cstdarg>
#include <cstdio>

#include "diagnostics/log.h"
#include "diagnostics/log_state.h"
#include "hal/platform/debug_output.h"

namespace ZV {

namespace {

/// Length of a text that was formatted into `capacity` bytes: `wanted` is what it would have had.
std::size_t GetFormattedLength(int wanted, std::size_t capacity) {
    if (wanted < 0) return 0;
    return std::min(static_cast<std::size_t>(wanted), capacity - 1);
}

/// Writes the time and the text. Returns their length; `record` is terminated.
std::size_t FormatRecord(std::span<char> record, const char* format, std::va_list values) {
    const std::int32_t elapsed =
        CalculateLogElapsed(logState.startMicroseconds, GetLogMicroseconds());
    const std::size_t start = FormatLogPrefix(elapsed, record);
    const std::span<char> rest = record.subspan(start);
    // The check knows va_start in the first of several files alone.
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized)
    const int wanted = std::vsnprintf(rest.data(), rest.size(), format, values);
    return start + GetFormattedLength(wanted, rest.size());
}

}  // namespace

std::int32_t CalculateLogElapsed(std::uint64_t start, std::uint64_t now) {
    return static_cast<std::int32_t>(static_cast<std::uint32_t>(now - start));
}

// Kept: the seconds are not what is left beside the minutes but all of them.
std::size_t FormatLogPrefix(std::int64_t elapsedMicroseconds, std::span<char> text) {
    const auto seconds = static_cast<std::int32_t>(elapsedMicroseconds / 1000000);
    const auto milliseconds = static_cast<std::int32_t>(elapsedMicroseconds / 1000 % 1000);
    const int wanted = std::snprintf(text.data(), text.size(), "%02d:%02d.%03d ", seconds / 60,
                                     seconds, milliseconds);
    return GetFormattedLength(wanted, text.size());
}

void ZLogWrite(const char* format, ...) {
    const bool isForFile = logState.outputToFile != 0;
    if (isForFile && !IsLogFileOpen()) return;

    char record[LogRecordCapacity];
    std::va_list values;
    va_start(values, format);
    const std::size_t length = FormatRecord(record, format, values);
    va_end(values);

    if (!isForFile) {
        WriteDebuggerOutput(record);
        return;
    }
    // Kept: each record in a file ends with a zero byte.
    WriteToLogFile(record, length + 1);
}

}  // namespace ZV
