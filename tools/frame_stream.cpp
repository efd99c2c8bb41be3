#include "frame_stream.h"

#include <fmt/format.h>

#include <algorithm>
#include <utility>

#include "interrupt.h"
#include "output.h"

namespace ZentaraProgram {

FrameStream::FrameStream(ZentaraHandle openCamera, const CaptureFacts& captureFacts,
                         const StreamOptions& streamOptions, StreamCalls streamCalls)
    : camera(openCamera),
      facts(captureFacts),
      options(streamOptions),
      calls(std::move(streamCalls)),
      ring(std::max(1U, streamOptions.buffers), captureFacts.imageBytes),
      sums(captureFacts.exposures) {}

ExitCode FrameStream::Run(ZentaraResult* result) {
    *result = Begin();
    begin = lastFrame = Clock::now();
    ExitCode code = *result == zerrNone ? ExitDone : ExitFailed;
    while (code == ExitDone && !IsFinished()) {
        code = Step(result);
        if (code == ExitDone && calls.isInterrupted()) code = ExitInterrupted;
        calls.show(sums, /*isLast=*/false);
    }
    Stop();
    code = KeepRest(code);
    sums.Settle();
    calls.show(sums, /*isLast=*/true);
    return code;
}

double FrameStream::GetSeconds() const {
    return std::chrono::duration<double>(Clock::now() - begin).count();
}

bool FrameStream::HasAllFrames() const {
    return options.count > 0 && sums.frames >= options.count;
}

bool FrameStream::IsFinished() const {
    return HasAllFrames() ||
           (options.durationSeconds > 0 && sums.seconds >= options.durationSeconds);
}

ZentaraResult FrameStream::Begin() {
    for (const auto& slot : ring.GetSlots()) {
        if (const ZentaraResult result = ring.Queue(camera, slot.get()); result != zerrNone)
            return result;
    }
    const ZentaraResult result = Zentara_SetStreaming(camera, 1);
    return result == zerrNone ? TriggerNext() : result;
}

/// A camera in the mode of the software trigger waits for one before each exposure.
ZentaraResult FrameStream::TriggerNext() {
    return facts.isSoftwareTriggered ? Zentara_Trigger(camera) : ZentaraResult{zerrNone};
}

/// The exposures of a wheel behind the first one of a frame.
void FrameStream::TriggerRest() {
    if (facts.exposures > 1) (void)TriggerNext();  // A camera that is gone sends no frame.
}

ExitCode FrameStream::Step(ZentaraResult* result) {
    Slot* slot = ring.Take(InterruptPoll);
    sums.seconds = GetSeconds();
    if (slot != nullptr) {
        lastFrame = Clock::now();
        return Serve(slot, result);
    }
    if (std::chrono::duration<double>(Clock::now() - lastFrame).count() > options.timeoutSeconds) {
        PrintError(fmt::format("no frame came within {:g} s", options.timeoutSeconds));
        return ExitFailed;
    }
    TriggerRest();
    return ExitDone;
}

ExitCode FrameStream::Serve(Slot* slot, ZentaraResult* result) {
    const ExitCode kept = Keep(*slot);
    if (kept != ExitDone) return kept;
    *result = ring.Queue(camera, slot);
    if (*result == zerrNone && !IsFinished()) *result = TriggerNext();
    return *result == zerrNone ? ExitDone : ExitFailed;
}

ExitCode FrameStream::Keep(const Slot& slot) {
    sums.Count(slot.buffer.frame);
    if (!calls.write || !isWritable) return ExitDone;
    const ExitCode written = calls.write(slot, sums.frames);
    isWritable = written == ExitDone;
    if (isWritable) ++sums.files;
    return written;
}

/// What came before the stream had stopped is as good as the frames before it, unless no more were
/// asked for; then the time of the stop is the stream's, too.
ExitCode FrameStream::KeepRest(ExitCode code) {
    const double stoppedAt = GetSeconds();
    for (const Slot* slot : ring.TakeRest()) {
        if (HasAllFrames()) {
            ++surplus;
            continue;
        }
        sums.seconds = stoppedAt;
        if (Keep(*slot) != ExitDone) code = ExitFailed;
    }
    return code;
}

/// The buffers are the program's again once the abort has come back.
void FrameStream::Stop() {
    if (isStopped) return;
    isStopped = true;
    // A camera that is gone cannot be stopped; the rest goes on.
    (void)Zentara_SetStreaming(camera, 0);
    (void)Zentara_Abort(camera);
}

}  // namespace ZentaraProgram
