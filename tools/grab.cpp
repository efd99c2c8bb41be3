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
    GrabWatch watch(camera.GetHandle(), timeoutSeconds,
                    facts.isSoftwareTriggered ? TriggerHelp::Once : TriggerHelp::None);
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
    if (result == zerrNone && IsWritable(buffer.frame)) {
        *image = MakeImage(facts, buffer, begin);
        return ExitDone;
    }
    if (result == zerrNone) {
        PrintError(fmt::format("images of format {} cannot be written", buffer.frame.format));
        return ExitFailed;
    }
    if (IsInterrupted()) return ExitInterrupted;
    PrintError(hasTimedOut ? fmt::format("no image came within {:g} s", timeoutSeconds)
                           : "no image: " + DescribeResult(result));
    return session->Judge(result);
}

}  // namespace ZentaraProgram
