#include "sweep/told_failures.h"

#include <algorithm>
#include <iterator>
#include <string_view>

#include "hal/control_records.h"

namespace ZV::Test {
namespace {

/// Registers of the control block, whose writes may fail without a word.
struct UntoldWrite {
    std::string_view story, camera;  ///< No camera: any.
    std::uint32_t first, last;       ///< Quadlets.
};
/// Kept: their results are dropped. Of the first setup: the order of bytes, the region that a
/// change of the binning brings along, the analogue registers. Of a start: the parameter set
/// number. Of a send: bit depth, that region, real-time video, the wheel and the tweaked register.
constexpr UntoldWrite UntoldWrites[] = {
    {"stream", "", 1, 1},      {"list", "", 1, 1},   {"list", "", 3, 4},
    {"list", "tirel", 34, 40}, {"send", "", 1, 1},   {"send", "", 3, 4},
    {"send", "folary", 2, 2},  {"send", "", 12, 12}, {"send", "tirel", 35, 35},
};
constexpr std::uint32_t ControlAddress = 0xD0002000;
constexpr std::uint32_t TakeOverAddress = 0xD0003004;

bool IsUntoldWrite(const Story& story, const SweepCamera& camera, const CountedRequest& request) {
    if (request.code != FW_IOCTL_ASYNC_WRITE) return false;
    // Kept: a send drops the result of the taking over.
    if (request.address == TakeOverAddress) return story.name == "send";
    const std::uint32_t quadlet = (request.address - ControlAddress) / 4;
    return std::any_of(std::begin(UntoldWrites), std::end(UntoldWrites), [&](const auto& untold) {
        return untold.story == story.name && quadlet >= untold.first && quadlet <= untold.last &&
               (untold.camera.empty() || untold.camera == camera.name);
    });
}

}  // namespace

// Kept: the resources are asked for at the slower speed then, and a notification is not needed.
bool IsUntold(const Story& story, const SweepCamera& camera, const CountedRequest& request) {
    return request.code == FW_IOCTL_ALLOC_RESOURCES || request.code == FW_IOCTL_NOTIFY_DISABLE ||
           IsUntoldWrite(story, camera, request);
}

bool MustBeTold(const Round& round, const CountedStory& counted) {
    const Story& story = Stories[round.story];
    const SweepCamera& camera = SweepCameras[round.camera];
    constexpr std::string_view TellingStories[] = {"list", "send", "grab", "stream"};
    const bool isFailure = round.failure == Failure::Fails ||
                           round.failure == Failure::CompletesInError ||
                           round.failure == Failure::DeviceGone;
    if (!isFailure || round.series != RequestSeries::Calls) return false;
    if (std::find(std::begin(TellingStories), std::end(TellingStories), story.name) ==
        std::end(TellingStories)) {
        return false;
    }
    const auto& requests = counted.requests[static_cast<std::size_t>(round.series)];
    const auto isTold = [&](const auto& request) { return !IsUntold(story, camera, request); };
    const auto failed = requests.begin() + static_cast<std::ptrdiff_t>(round.number - 1);
    if (story.name == "stream") {
        // Kept: a change that stops the stream starts it again without a word.
        const auto listen = std::find_if(requests.begin(), requests.end(), [](const auto& request) {
            return request.code == FW_IOCTL_LISTEN;
        });
        if (failed > listen) return false;
    }
    if (round.failure != Failure::DeviceGone) return isTold(*failed);
    return std::any_of(failed, requests.end(), isTold);
}

bool TellsOfMissingMemory(const Story& story) {
    constexpr std::string_view Names[] = {"list", "send", "grab", "finish"};
    return std::find(std::begin(Names), std::end(Names), story.name) != std::end(Names);
}

std::vector<CountedRequest> ListLeftOut(const CountedStory& counted) {
    const std::vector<CountedRequest> sent = GetCounted(RequestSeries::Calls);
    std::vector<CountedRequest> leftOut;
    auto next = sent.begin();
    for (const CountedRequest& request : counted.requests[0]) {
        const bool isSent = next != sent.end() && *next == request;
        if (isSent) ++next;
        if (!isSent) leftOut.push_back(request);
    }
    return leftOut;
}

}  // namespace ZV::Test
