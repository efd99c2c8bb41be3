#pragma once

#include <cstddef>
#include <cstdint>

#include "camera/relaxed.h"

namespace ZV {

/// The process-wide state of the log. Every word is a relaxed atomic: nothing here is guarded, and
/// a thread that sees a switch late shows or drops a record, no more.
struct LogState {
    Relaxed<std::uint8_t> outputEnabled;
    Relaxed<std::uint8_t> outputSettings;
    Relaxed<std::uint8_t> outputGetInfo;
    Relaxed<std::uint8_t> outputFrame;
    Relaxed<std::uint8_t> outputSparseTable;
    Relaxed<std::uint8_t> outputNestedCalls;
    Relaxed<std::uint8_t> outputToFile;
    Relaxed<std::uint8_t> outputReads;
    Relaxed<std::uint8_t> outputWrites;
    Relaxed<std::uint64_t> startMicroseconds;  ///< System time at ZLogOpen.
    /// Exported calls that this process is in. Two threads inside the library let it drift, which
    /// decides about no more than which records are shown.
    Relaxed<std::int32_t> nesting;

    static constexpr std::uint8_t outputStart = 1;  ///< Start and end records; no switch sets it.
};

extern LogState logState;

/// Whether a record that only outermost calls show is to be left out here.
[[nodiscard]] inline bool IsNestedCallHidden() {
    return logState.outputNestedCalls == 0 && logState.nesting > 1;
}

/// System time in microseconds, of which the log uses differences only.
[[nodiscard]] std::uint64_t GetLogMicroseconds();

// ---- The file of the log ----

/// Makes `path` the log's file, appending to what is there; the former file is closed first. False
/// when it cannot be opened: there is no file then. Thread-safe.
[[nodiscard]] bool OpenLogFile(const char* path);
/// Waits for the writes that have begun, a second at most. Thread-safe.
void CloseLogFile();
[[nodiscard]] bool IsLogFileOpen();
/// Appends with one write and without a lock; nothing when there is no file. Thread-safe, also
/// against a close: bytes never go to a file that is closed.
void WriteToLogFile(const char* bytes, std::size_t count);

}  // namespace ZV
