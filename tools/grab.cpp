#include "grab.h"

#include <fmt/format.h>

#include <chrono>
#include <utility>

#include "capture.h"
#include "frame_ring.h"
#include "grab_watch.h"
#include "interrupt.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

using Clock = std::chrono::steady_clock;

/// One image of a capture, and why none came.
struct Grabbed {
    FrameBuffer buffer;
    ZentaraResult result = zerrNone;
    bool hasTimedOut = false;
};

Grabbed Grab(const Camera& camera, const CaptureFacts& facts, double timeoutSeconds) {
    Grabbed grabbed;
    grabbed.buffer.Prepare(facts.imageBytes);
    GrabWatch watch(camera.GetHandle(), timeoutSeconds, /*givesTriggers=*/false);
    grabbed.result = Zentara_GrabFrame(camera.GetHandle(), &grabbed.buffer.frame);
    watch.Finish();
    grabbed.hasTimedOut = watch.HasAborted();
    return grabbed;
}

/// Waits for the one slot of a stream. A wheel waits for a trigger before each of its exposures.
ZentaraResult AwaitTriggered(ZentaraHandle camera, const CaptureFacts& facts, Clock::time_point end,
                             FrameRing* ring) {
    ZentaraResult result = Zentara_Trigger(camera);
    while (result == zerrNone && ring->Take(InterruptPoll) == nullptr) {
        if (Clock::now() >= end || IsInterrupted()) return zerrBusy;
        if (facts.exposures > 1) result = Zentara_Trigger(camera);
    }
    return result;
}

/// The same where the camera waits for a trigger by software. Beside a grab it could come before
/// the camera waits for it, and be lost; behind a start that has come back it is not.
Grabbed GrabTriggered(const Camera& camera, const CaptureFacts& facts, double timeoutSeconds) {
    const auto limit = std::chrono::duration<double>(timeoutSeconds);
    const Clock::time_point end = Clock::now() + std::chrono::duration_cast<Clock::duration>(limit);
    const ZentaraHandle handle = camera.GetHandle();
    FrameRing ring(1, facts.imageBytes);
    Slot* const slot = ring.GetSlots().front().get();
    Grabbed grabbed;
    grabbed.result = ring.Queue(handle, slot);
    if (grabbed.result == zerrNone) grabbed.result = Zentara_SetStreaming(handle, 1);
    if (grabbed.result == zerrNone) grabbed.result = AwaitTriggered(handle, facts, end, &ring);
    grabbed.hasTimedOut = grabbed.result == zerrBusy;
    // The slot is the program's again when the abort has come back, also of a camera that is gone.
    (void)Zentara_SetStreaming(handle, 0);
    (void)Zentara_Abort(handle);
    grabbed.buffer = std::move(slot->buffer);
    return grabbed;
}

}  // namespace

ExitCode TakeImage(Session* session, const SettingsBlock& settings, double timeoutSeconds,
                   Image* image) {
    const CaptureFacts facts = GetCaptureFacts(session->GetCamera(), settings);
    const auto begin = std::chrono::system_clock::now();
    const auto grab = facts.isSoftwareTriggered ? GrabTriggered : Grab;
    const Grabbed grabbed = grab(session->GetCamera(), facts, timeoutSeconds);
    if (grabbed.result == zerrNone) {
        const std::string problem = FindFrameProblem(grabbed.buffer.frame);
        if (problem.empty()) {
            *image = MakeImage(facts, grabbed.buffer, begin);
            return ExitDone;
        }
        PrintError(problem);
        return ExitFailed;
    }
    if (IsInterrupted()) return ExitInterrupted;
    PrintError(grabbed.hasTimedOut ? fmt::format("no image came within {:g} s", timeoutSeconds)
                                   : "no image: " + DescribeResult(grabbed.result));
    return session->Judge(grabbed.result);
}

}  // namespace ZentaraProgram
