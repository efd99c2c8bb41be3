#include "grab.h"

#include <fmt/format.h>

#include <chrono>
#include <optional>

#include "capture.h"
#include "grab_watch.h"
#include "interrupt.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

/// From the end of an exposure on. A camera that takes longer begins an exposure that is cut off
/// when the image has come.
constexpr std::chrono::seconds ReadoutTime{5};

/// How often a camera in the mode of the software trigger is given one. A wheel waits for one
/// before each exposure of an image.
std::optional<GrabWatch::Clock::duration> GetTriggerPeriod(const CaptureFacts& facts) {
    if (!facts.isSoftwareTriggered) return std::nullopt;
    if (facts.exposures > 1) return GrabWatch::Clock::duration::zero();
    return ReadoutTime + std::chrono::nanoseconds(facts.exposureNs);
}

/// One image into `buffer`; `hasTimedOut` tells why none came.
ZentaraResult Grab(const Camera& camera, const CaptureFacts& facts, double timeoutSeconds,
                   FrameBuffer* buffer, bool* hasTimedOut) {
    GrabWatch watch(camera.GetHandle(), timeoutSeconds, GetTriggerPeriod(facts));
    const ZentaraResult result = Zentara_GrabFrame(camera.GetHandle(), &buffer->frame);
    watch.Finish();
    *hasTimedOut = watch.HasAborted();
    return result;
}

}  // namespace

ExitCode TakeImage(Session* session, const SettingsBlock& settings, double timeoutSeconds,
                   Image* image) {
    const CaptureFacts facts = GetCaptureFacts(session->GetCamera(), settings);
    FrameBuffer buffer;
    buffer.Prepare(facts.imageBytes);
    const auto begin = std::chrono::system_clock::now();
    bool hasTimedOut = false;
    const ZentaraResult result =
        Grab(session->GetCamera(), facts, timeoutSeconds, &buffer, &hasTimedOut);
    if (result == zerrNone) {
        const std::string problem = FindFrameProblem(buffer.frame);
        if (problem.empty()) {
            *image = MakeImage(facts, buffer, begin);
            return ExitDone;
        }
        PrintError(problem);
        return ExitFailed;
    }
    if (IsInterrupted()) return ExitInterrupted;
    PrintError(hasTimedOut ? fmt::format("no image came within {:g} s", timeoutSeconds)
                           : "no image: " + DescribeResult(result));
    return session->Judge(result);
}

}  // namespace ZentaraProgram
