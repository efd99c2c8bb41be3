#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>

#include "soak/process_usage.h"

namespace ZV::Soak {

/// What a soak adds up, over all of its runs.
struct SoakSums {
    static constexpr std::size_t CodeCount = 33;  ///< Of the flat interface, 0 to 32.

    std::uint64_t seconds = 0;
    std::uint64_t frames = 0, bytes = 0, gaps = 0, missing = 0, damaged = 0, repeats = 0;
    std::uint64_t misnumbered = 0;   ///< As the numbers of the frames alone tell.
    std::uint64_t wrongNumbers = 0;  ///< No loss explains them, by what the camera has numbered.
    std::uint64_t staleNumbers = 0;  ///< Likewise, but packets that went wrong explain them.
    /// Of the engine: what became of the frames that began. Those delivered came to the client, but
    /// for the ones without a taker.
    std::uint64_t begun = 0, delivered = 0, heldBack = 0, dropped = 0, refused = 0, bad = 0,
                  cleared = 0, withoutTaker = 0;
    std::uint64_t waiting = 0;  ///< In the engine's queue when the camera was closed.
    std::uint64_t unaccounted =
        0;                      ///< Begun, or delivered to the client, without a count: a fault.
    std::uint64_t changes = 0;  ///< Queued settings that were sent.
    std::uint64_t changesDropped = 0;  ///< Queued and never sent, as a last entry is.
    std::uint64_t restarts = 0, reopens = 0, unplugs = 0;
    std::uint64_t requestsFailed = 0;  ///< By a fault.
    std::uint64_t stalls = 0;          ///< Streams without frames after a request had failed.
    std::uint64_t failures = 0;        ///< Calls that failed with no fault to explain it.
    std::uint64_t grown = 0;           ///< Runs that ended with more than their first minute held.
    /// Calls that failed with a code of the table after a request had failed.
    std::array<std::uint64_t, CodeCount> failedWith{};

    SoakSums& operator+=(const SoakSums& other);
};

/// One line, without an end.
std::string Describe(const SoakSums& sums);

/// What a run leaves to the next.
struct SoakState {
    SoakSums sums;
    std::uint64_t cameras = 0;  ///< Of the run with the first minute; 0 while there is none.
    ProcessUsage firstMinute;   ///< The most that it held.
};

/// State of the former runs; zeros for a file that is not there. False for a file that is none.
bool ReadState(const std::string& path, SoakState* state);
/// Takes the file's place in one step. False when it cannot be written.
bool WriteState(const std::string& path, const SoakState& state);

}  // namespace ZV::Soak
