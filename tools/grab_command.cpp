#include <fmt/format.h>

#include <chrono>
#include <condition_variable>
#include <filesystem>
#include <mutex>
#include <nlohmann/json.hpp>
#include <string>
#include <thread>

#include "capture.h"
#include "commands.h"
#include "interrupt.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

using Clock = std::chrono::steady_clock;
constexpr std::chrono::milliseconds Poll{50};

/// Looks after a grab from a thread of its own. It gives the trigger that a camera in the mode of
/// the software trigger waits for. A grab that gets no image it ends: after the time-out or an
/// interrupt it aborts again and again until the grab has come back, since an abort that comes
/// before the wait is lost.
class GrabWatch {
  public:
    GrabWatch(ZentaraHandle handle, double timeoutSeconds, bool mustTrigger)
        : camera(handle),
          limit(timeoutSeconds),
          awaitsTrigger(mustTrigger),
          thread([this] { Watch(); }) {}
    ~GrabWatch() { Finish(); }
    GrabWatch(const GrabWatch&) = delete;
    GrabWatch& operator=(const GrabWatch&) = delete;

    void Finish() {
        {
            const std::lock_guard lock(mutex);
            isFinished = true;
        }
        changed.notify_all();
        if (thread.joinable()) thread.join();
    }
    [[nodiscard]] bool HasAborted() const { return hasAborted; }

  private:
    void Watch() {
        const Clock::time_point end =
            Clock::now() + std::chrono::duration_cast<Clock::duration>(limit);
        std::unique_lock lock(mutex);
        while (!changed.wait_for(lock, Poll, [this] { return isFinished; })) {
            const bool isOver = Clock::now() >= end || IsInterrupted();
            lock.unlock();
            if (isOver) {
                hasAborted = true;
                (void)Zentara_Abort(camera);  // The grab's own result tells how it ended.
            } else if (awaitsTrigger) {
                // Refused until the grab has begun to wait.
                awaitsTrigger = Zentara_Trigger(camera) != zerrNone;
            }
            lock.lock();
        }
    }

    ZentaraHandle camera;
    std::chrono::duration<double> limit;
    bool awaitsTrigger;  // the watch's thread alone
    std::mutex mutex;
    std::condition_variable changed;
    bool isFinished = false;
    bool hasAborted = false;
    std::thread thread;
};

void Report(const CommonOptions& common, const GrabOptions& options, const Image& image) {
    if (common.asJson) {
        const nlohmann::json report{{"file", options.output},
                                    {"width", image.width},
                                    {"height", image.height},
                                    {"bits", image.bits},
                                    {"exposureSeconds", image.exposureSeconds},
                                    {"dateObs", image.dateObs},
                                    {"frameNumber", image.frameNumber},
                                    {"frameError", image.frameError},
                                    {"model", image.model}};
        PrintJson(report);
        return;
    }
    Print(fmt::format("{}: {} x {}, {} bits, {:g} s, {}\n", options.output, image.width,
                      image.height, image.bits, image.exposureSeconds, image.model));
}

ExitCode SaveImage(const CommonOptions& common, const GrabOptions& options, const Image& image) {
    const std::string reason = WriteImage(options.output, image);
    if (!reason.empty()) {
        PrintError(fmt::format("{} cannot be written: {}", options.output, reason));
        return ExitFailed;
    }
    Report(common, options, image);
    if (image.frameError == zerrNone) return ExitDone;
    PrintError("the frame is damaged: " + DescribeResult(image.frameError));
    return ExitDamaged;
}

ExitCode CheckOutput(const GrabOptions& options) {
    if (GetImageKind(options.output) == ImageKind::Unknown) {
        PrintError(
            fmt::format("{}: the ending must be .fits, .tiff, .png or .raw", options.output));
        return ExitWrongUse;
    }
    return ExitDone;
}

/// One image into `buffer`; `hasTimedOut` tells why none came.
ZentaraResult Grab(const Camera& camera, const GrabOptions& options, const CaptureFacts& facts,
                   FrameBuffer* buffer, bool* hasTimedOut) {
    GrabWatch watch(camera.GetHandle(), options.timeoutSeconds, facts.isSoftwareTriggered);
    const ZentaraResult result = Zentara_GrabFrame(camera.GetHandle(), &buffer->frame);
    watch.Finish();
    *hasTimedOut = watch.HasAborted();
    return result;
}

}  // namespace

ExitCode RunGrab(const CommonOptions& common, const GrabOptions& options) {
    if (const ExitCode checked = CheckOutput(options); checked != ExitDone) return checked;
    Session session;
    SentSettings settings;
    const ExitCode prepared =
        OpenWithSettings(common.camera, options.settings, &session, &settings);
    if (prepared != ExitDone) return prepared;

    TellMended(settings, settings.sent);
    const CaptureFacts facts = GetCaptureFacts(session.GetCamera(), settings.sent);
    FrameBuffer buffer;
    buffer.Prepare(facts.imageBytes);
    const auto begin = std::chrono::system_clock::now();
    bool hasTimedOut = false;
    const ZentaraResult result = Grab(session.GetCamera(), options, facts, &buffer, &hasTimedOut);
    if (result == zerrNone) {
        if (IsWritable(buffer.frame))
            return SaveImage(common, options, MakeImage(facts, buffer, begin));
        PrintError(fmt::format("images of format {} cannot be written", buffer.frame.format));
        return ExitFailed;
    }
    if (IsInterrupted()) return ExitInterrupted;
    PrintError(hasTimedOut ? fmt::format("no image came within {:g} s", options.timeoutSeconds)
                           : "no image: " + DescribeResult(result));
    return session.Judge(result);
}

}  // namespace ZentaraProgram
