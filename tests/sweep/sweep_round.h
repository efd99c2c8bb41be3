#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "sweep/failing_driver.h"
#include "sweep/stories.h"

namespace ZV::Test {

/// A simulated world of a sweep and its first camera, which the stories use; all sensors are of
/// Client::Width by Client::Height.
struct SweepCamera {
    std::string_view name;
    std::string_view base;      ///< Built-in scenario or model.
    std::string_view sensor;    ///< Further keys of its sensor.
    std::string_view extra;     ///< Further keys of the camera.
    std::uint32_t imageFormat;  ///< In which the stories begin.
    std::string_view others;    ///< Further cameras.
    bool hasAllStories;         ///< Else those that go another way with this one.
    bool isLogged = false;      ///< Everything that the debug log can tell goes to a file.
};

extern const SweepCamera SweepCameras[15];

/// Whether the story is run with the camera.
bool HasStory(std::size_t camera, std::size_t story);

enum class Failure {
    Fails,
    AnsweredAtOnce,
    CompletesInError,
    CompletesLate,
    DeviceGone,
    NoMemory,  ///< An allocation, thread, shared memory or mapping is refused.
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

/// Runs a story with a failure and looks at what it leaves: result codes, locks, close and release,
/// the same camera used again, threads, files, and what the driver holds. A round that hangs ends
/// the process with its text.
RoundOutcome RunRound(const Round& round, const CountedStory& counted);

}  // namespace ZV::Test
