#include "sweep/told_failures.h"

#include <algorithm>
#include <iterator>
#include <string_view>

#include "hal/control_records.h"
#include "memory/failing_allocator.h"

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
/// A balance sends.
constexpr UntoldWrite UntoldWrites[] = {
    {"grab", "", 1, 1},   {"balance", "", 1, 1},     {"stream", "", 1, 1},
    {"list", "", 1, 1},   {"list", "", 3, 4},        {"list", "tirel", 34, 40},
    {"send", "", 1, 1},   {"send", "", 3, 4},        {"send", "folary", 2, 2},
    {"send", "", 12, 12}, {"send", "tirel", 35, 35}, {"balance", "wheel", 12, 12},
};
constexpr std::uint32_t ControlAddress = 0xD0002000;
constexpr std::uint32_t SetNumberAddress = 0xD0002004;
constexpr std::uint32_t TakeOverAddress = 0xD0003004;
constexpr std::uint32_t CommandAddress = 0xD0005004;

/// What a start and a stop write. Kept: a change that stops the stream starts it again without a
/// word.
constexpr std::uint32_t StartAddresses[] = {SetNumberAddress, 0xD0002050, TakeOverAddress,
                                            CommandAddress};

/// Of what a start sends, in this order. Kept: it goes on without the camera's new parameter set
/// number, and its frames are discarded.
constexpr CountedRequest StartRequests[] = {
    {.code = FW_IOCTL_ASYNC_WRITE, .address = SetNumberAddress},
    {.code = FW_IOCTL_LISTEN},
    {.code = FW_IOCTL_ASYNC_WRITE, .address = CommandAddress},
};

bool IsUntoldWrite(std::string_view story, const SweepCamera& camera,
                   const CountedRequest& request) {
    if (request.code != FW_IOCTL_ASYNC_WRITE) return false;
    // Kept: a send drops the result of the taking over, and a balance sends.
    if (request.address == TakeOverAddress) return story == "send" || story == "balance";
    const std::uint32_t quadlet = (request.address - ControlAddress) / 4;
    return std::any_of(std::begin(UntoldWrites), std::end(UntoldWrites), [&](const auto& untold) {
        return untold.story == story && quadlet >= untold.first && quadlet <= untold.last &&
               (untold.camera.empty() || untold.camera == camera.name);
    });
}

/// The request that has failed in the round that has just run.
CountedRequest GetFailed(const Round& round) {
    return GetCounted(round.series)[round.number - 1];
}

}  // namespace

// Kept: the resources are asked for at the slower speed then, and a notification is not needed.
bool IsUntold(const Story& story, const SweepCamera& camera, const CountedRequest& request) {
    return request.code == FW_IOCTL_ALLOC_RESOURCES || request.code == FW_IOCTL_NOTIFY_DISABLE ||
           IsUntoldWrite(story.name, camera, request);
}

bool MustBeTold(const Round& round, const CountedStory& counted) {
    const Story& story = Stories[round.story];
    const SweepCamera& camera = SweepCameras[round.camera];
    // Kept: a close and a release drop the results of what they end, and an automatic exposure
    // those of its images: it goes on to the exposure in force.
    constexpr std::string_view TellingStories[] = {"list", "send", "grab", "stream", "balance"};
    const bool isFailure = round.failure == Failure::Fails ||
                           round.failure == Failure::CompletesInError ||
                           round.failure == Failure::DeviceGone;
    if (!isFailure || round.series != RequestSeries::Calls) return false;
    // A camera without colours is told so, whatever its images are.
    if (story.name == "balance" && counted.results.back() != zerrNone) return false;
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

bool IsHarmless(const Round& round) {
    if (round.failure == Failure::CompletesLate) return true;
    return round.failure == Failure::AnsweredAtOnce && round.series == RequestSeries::Calls &&
           round.code != FW_IOCTL_ASYNC_READ;
}

bool LeavesReservations(const Round& round, const Story& story) {
    if (IsHarmless(round)) return false;
    // Kept: an unplugged device answers no freeing; the driver has taken all back by then.
    if (round.failure == Failure::DeviceGone) return true;
    // Kept: an opening that failed leaves what it has reserved; its device is closed with it.
    if (story.begins == Stage::Loaded &&
        (round.code == FW_IOCTL_ALLOC_CHANNEL || round.code == FW_IOCTL_ALLOC_RESOURCES)) {
        return true;
    }
    // Kept: a stop or a freeing that fails ends the camera's close, and a release tries once.
    constexpr std::uint32_t Codes[] = {FW_IOCTL_ASYNC_WRITE,    FW_IOCTL_STOP,
                                       FW_IOCTL_DETACH_BUFFERS, FW_IOCTL_FREE_RESOURCES,
                                       FW_IOCTL_FREE_CHANNEL,   FW_IOCTL_FREE_BANDWIDTH};
    if (story.ends != Stage::Unloaded) return false;
    if (round.failure == Failure::NoMemory) return true;  // all that it takes is for that write
    return std::find(std::begin(Codes), std::end(Codes), round.code) != std::end(Codes);
}

bool LeavesAWorkingCamera(const Round& round, const Story& story) {
    if (round.failure == Failure::DeviceGone) return false;
    if (story.begins != Stage::Loaded) return true;
    // Kept: what is read at once is in the order of the bus, and the camera is set up by it.
    return round.failure != Failure::AnsweredAtOnce || round.code != FW_IOCTL_ASYNC_READ;
}

bool MayEndStream(const Round& round) {
    if (round.failure == Failure::DeviceGone) return true;
    if (round.series == RequestSeries::Switches) return false;
    const CountedRequest request = GetFailed(round);
    // Kept: the loop leaves when a buffer that it hands back is refused.
    if (round.series == RequestSeries::Stream) {
        return round.failure == Failure::Fails && request.isOfStream;
    }
    if (request.code == FW_IOCTL_ASYNC_READ) return false;
    if (request.code != FW_IOCTL_ASYNC_WRITE) return true;
    return std::find(std::begin(StartAddresses), std::end(StartAddresses), request.address) !=
               std::end(StartAddresses) &&
           (IsStreamStopped(round) || request.address == CommandAddress);
}

bool IsUntoldInStream(const Round& round) {
    const SweepCamera& camera = SweepCameras[round.camera];
    const CountedRequest request = GetFailed(round);
    return IsUntold(Stories[round.story], camera, request) ||
           IsUntoldWrite("send", camera, request);  // a change is one
}

bool IsStreamStopped(const Round& round) {
    const std::vector<CountedRequest> sent = GetCounted(RequestSeries::Calls);
    const auto failed = sent.begin() + static_cast<std::ptrdiff_t>(round.number - 1);
    const auto last =
        std::find_if(std::make_reverse_iterator(failed), sent.rend(), [](const auto& request) {
            return request.code == FW_IOCTL_LISTEN || request.code == FW_IOCTL_STOP;
        });
    return last == sent.rend() || last->code == FW_IOCTL_STOP;
}

bool HasStreamed(const Story& story) {
    return story.name == "stream" || story.begins == Stage::Streaming;
}

bool TellsOfMissingMemory(const Story& story) {
    constexpr std::string_view Names[] = {"list", "send", "grab", "finish"};
    return std::find(std::begin(Names), std::end(Names), story.name) != std::end(Names);
}

bool MayMissImage(const Story& story) {
    if (story.name != "grab") return false;
    // Kept: a start goes on without the camera's new parameter set number, and its frames are bad.
    const std::vector<CountedRequest> sent = GetCounted(RequestSeries::Calls);
    return std::none_of(sent.begin(), sent.end(),
                        [](const auto& request) { return request.address == SetNumberAddress; });
}

bool IsStreamStarted() {
    const std::vector<CountedRequest> sent = GetCounted(RequestSeries::Calls);
    const auto stop = std::find_if(sent.rbegin(), sent.rend(), [](const auto& request) {
        return request.code == FW_IOCTL_STOP;
    });
    auto next = stop.base();
    for (const CountedRequest& part : StartRequests) {
        next = std::find_if(next, sent.end(), [&](const auto& request) {
            return request.code == part.code && request.address == part.address;
        });
        if (next == sent.end()) return false;
    }
    return true;
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
