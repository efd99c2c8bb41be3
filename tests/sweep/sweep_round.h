#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "sweep/failing_driver.h"
#include "sweep/stories.h"
#include "sweep/sweep_worlds.h"

namespace ZV::Test {

/// Whether the story is run with the camera.
bool HasStory(std::size_t camera, std::size_t story);

enum class Failure {
    Fails,
    AnsweredAtOnce,
    CompletesInError,
    CompletesLate,
    DeviceGone,
    NoMemory,  ///< An allocation, thread, file, module, shared memory or mapping is refused.
};
inline constexpr std::string_view FailureNames[] = {"fails",     "at-once",     "ends-in-error",
                                                    "ends-late", "device-gone", "no-memory"};
inline constexpr std::size_t FailureCount = std::size(FailureNames);

struct Round {
    std::size_t camera = 0;
    std::size_t story = 0;
    Failure failure = Failure::Fails;
    RequestSeries series = RequestSeries::Calls;  ///< Of requests.
    std::uint64_t number = 0;                     ///< Of the request or allocation, from 1.
    std::uint32_t code = 0;                       ///< Of the request as the story was counted.

    std::string GetText() const;
};

/// What a story does without a failure.
struct CountedStory {
    std::vector<ZentaraResult> results;
    std::uint64_t answers = 0;  ///< Client::GetAnswers of it.
    Client::FinishedFrames finished{};
    std::uint64_t image = 0;  ///< Client::GetImage of every good grab.
    std::vector<CountedRequest> requests[std::size(AllSeries)];
    std::int64_t allocations = 0;
    std::vector<std::string> problems;
};

CountedStory CountStory(std::size_t camera, std::size_t story);

struct RoundOutcome {
    std::size_t leaked = 0;  ///< Allocations that are left when all is released.
    bool hasFailed = false;  ///< Whether what was to fail came at all.
    std::uint32_t code = 0;  ///< Of the request that failed.
    /// What does not stand as it should; empty when all is well.
    std::vector<std::string> problems;
};

/// Runs a story in which an allocation is refused as the first use of the library in the process,
/// which loads the simulation's module, and looks at what it leaves as RunRound does. What is left
/// of the process's first calls is no leak.
RoundOutcome RunFirstRound(const Round& round);

/// Runs a story with a failure and looks at what it leaves: result codes, locks, close and release,
/// the same camera used again, threads, files, and what the driver holds. A round that hangs ends
/// the process with its text.
RoundOutcome RunRound(const Round& round, const CountedStory& counted);

}  // namespace ZV::Test
