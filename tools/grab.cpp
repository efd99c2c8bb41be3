#include "grab.h"

#include <fmt/format.h>

#include <chrono>

#include "capture.h"
#include "grab_watch.h"
#include "interrupt.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

/// One image into `buffer`; `hasTimedOut` tells why none came.
ZentaraResult Grab(const Camera& camera, const CaptureFacts& facts, double timeoutSeconds,
                   FrameBuffer* buffer, bool* hasTimedOut) {
    const TriggerHelp help = facts.exposures > 1 ? TriggerHelp::EachImage : TriggerHelp::Once;
    GrabWatch watch(camera.GetHandle(), timeoutSeconds,
                    facts.isSoftwareTriggered ? help : TriggerHelp::None);
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
