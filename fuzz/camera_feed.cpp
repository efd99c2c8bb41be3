#include "fuzz/camera_feed.h"

#include <chrono>

#include "fuzz/client_calls.h"
#include "fuzz/hostile_driver.h"

namespace ZV::Fuzzing {

CameraFeed::CameraFeed(std::size_t sendingCamera, GoodPackets& goodPackets,
                       const FeedPlan& feedPlan)
    : camera(sendingCamera), packets(goodPackets), plan(feedPlan), thread([this] { Run(); }) {}

CameraFeed::~CameraFeed() {
    {
        const std::lock_guard hold(mutex);
        hasEnded = true;
    }
    ended.notify_all();
    thread.join();
}

void CameraFeed::Run() {
    constexpr std::uint32_t RestsBeforeAborts = 50;  // for the stream to begin
    std::uint32_t rests = 0;
    while (Rest()) {
        const bool isSending = sent < plan.requests && rests < RestsBeforeAborts;
        if (isSending && Send()) {
            rests = 0;
        } else if (!isSending) {
            RequireKnownResult(Zentara_Abort(plan.handle));
        }
        ++rests;
    }
}

bool CameraFeed::Send() {
    const auto frameNumber = static_cast<std::uint8_t>(plan.frameNumber + sent);
    const bool starts = packets.IsBetweenFrames();
    const auto form = static_cast<std::uint8_t>((plan.form & ~StartsFrame) |  //
                                                (starts ? StartsFrame : 0));
    if (!packets.Deliver(form, frameNumber, plan.bytes)) return false;
    // A loop that supplies the ring no more has left.
    sent = WaitForRing(camera) ? static_cast<std::uint8_t>(sent + 1) : plan.requests;
    return true;
}

/// False when the feed is to end.
bool CameraFeed::Rest() {
    constexpr std::chrono::microseconds Pause{100};
    std::unique_lock lock(mutex);
    return !ended.wait_for(lock, Pause, [this] { return hasEnded; });
}

}  // namespace ZV::Fuzzing
