#include <fmt/format.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <deque>
#include <filesystem>
#include <memory>
#include <mutex>
#include <nlohmann/json.hpp>
#include <string>
#include <utility>
#include <vector>

#include "capture.h"
#include "commands.h"
#include "interrupt.h"
#include "output.h"
#include "paths.h"
#include "platform.h"
#include "stream_sums.h"

namespace ZentaraProgram {
namespace {

using Clock = std::chrono::steady_clock;
using SystemTime = std::chrono::system_clock::time_point;
constexpr std::chrono::milliseconds Poll{50};
constexpr std::chrono::milliseconds ProgressStep{100};
constexpr int BarWidth = 30;

std::int64_t GetEpochNs() {
    const auto sinceEpoch = std::chrono::system_clock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::nanoseconds>(sinceEpoch).count();
}

/// Buffers that travel between the library and the program. The callbacks run on the library's
/// threads and only move a pointer; files are written on the program's own.
struct Slot {
    FrameBuffer buffer;
    std::atomic<std::int64_t> exposureEndNs{0};  ///< Since the epoch; set on the exposure thread.
    class FrameRing* ring = nullptr;
};

class FrameRing {
  public:
    FrameRing(std::uint32_t count, std::size_t bytes) {
        for (std::uint32_t i = 0; i < count; ++i) {
            slots.push_back(std::make_unique<Slot>());
            slots.back()->buffer.Prepare(bytes);
            slots.back()->ring = this;
        }
    }

    [[nodiscard]] const std::vector<std::unique_ptr<Slot>>& GetSlots() const { return slots; }

    ZentaraResult Queue(ZentaraHandle camera, Slot* slot) {
        return Zentara_QueueFrame(camera, &slot->buffer.frame, &OnEvent,
                                  zcbFrameDone | zcbExposeDone,
                                  reinterpret_cast<std::uintptr_t>(slot), 0);
    }

    /// The next delivered slot, or null when none comes within the time of one poll.
    Slot* Take() {
        std::unique_lock lock(mutex);
        if (!arrived.wait_for(lock, Poll, [this] { return !done.empty(); })) return nullptr;
        Slot* slot = done.front();
        done.pop_front();
        return slot;
    }

    /// The slots that were delivered and not taken. Behind an abort there are no more.
    std::deque<Slot*> TakeRest() {
        const std::lock_guard lock(mutex);
        return std::exchange(done, {});
    }

  private:
    static void OnEvent(std::uint64_t userPrivate, std::uint32_t, std::uint32_t,
                        std::uint32_t flags) {
        auto* slot = reinterpret_cast<Slot*>(static_cast<std::uintptr_t>(userPrivate));
        if (flags == zcbExposeDone) {
            slot->exposureEndNs = GetEpochNs();
            return;
        }
        const std::lock_guard lock(slot->ring->mutex);
        slot->ring->done.push_back(slot);
        slot->ring->arrived.notify_one();
    }

    std::vector<std::unique_ptr<Slot>> slots;
    std::mutex mutex;
    std::condition_variable arrived;
    std::deque<Slot*> done;
};

/// A line on standard error that is written over and over.
class ProgressLine {
  public:
    explicit ProgressLine(const StreamOptions& streamOptions)
        : options(streamOptions), isOn(!streamOptions.isQuiet && IsTerminal(stderr)) {}

    void Show(const StreamSums& sums, bool isLast) {
        const Clock::time_point now = Clock::now();
        if (!isOn || (!isLast && now < next)) return;
        next = now + ProgressStep;
        const std::string line =
            fmt::format("\r{} {} frames  {:.1f} /s  {:.1f} MB/s  gaps {}  drops {}  damaged {}  ",
                        GetBar(sums), sums.frames, sums.GetRate(), sums.GetMegabytesPerSecond(),
                        sums.gaps, sums.drops, sums.damaged);
        (void)std::fputs((line + (isLast ? "\n" : "")).c_str(),
                         stderr);  // A picture of progress only.
    }

  private:
    [[nodiscard]] std::string GetBar(const StreamSums& sums) const {
        double share = 0;
        if (options.count > 0)
            share = static_cast<double>(sums.frames) / static_cast<double>(options.count);
        if (options.durationSeconds > 0)
            share = std::max(share, sums.seconds / options.durationSeconds);
        const int full = static_cast<int>(std::min(1.0, share) * BarWidth);
        return fmt::format("[{:=<{}}{: <{}}]", "", full, "", BarWidth - full);
    }

    const StreamOptions& options;
    bool isOn;
    Clock::time_point next{};
};

std::string GetNumberedName(const std::string& output, std::uint64_t number) {
    const std::filesystem::path path = MakePath(output);
    const std::string name =
        fmt::format("{}-{:06}{}", GetPathText(path.stem()), number, GetPathText(path.extension()));
    return GetPathText(path.parent_path() / MakePath(name));
}

class Stream {
  public:
    Stream(const Camera& openCamera, const CaptureFacts& captureFacts,
           const StreamOptions& streamOptions)
        : camera(openCamera.GetHandle()),
          facts(captureFacts),
          options(streamOptions),
          ring(std::max(1U, streamOptions.buffers), captureFacts.imageBytes),
          progress(streamOptions),
          sums(captureFacts.exposures) {}

    ~Stream() { Stop(); }
    Stream(const Stream&) = delete;
    Stream& operator=(const Stream&) = delete;

    /// Runs to its end; `result` receives the code of a call that failed.
    ExitCode Run(ZentaraResult* result) {
        for (const auto& slot : ring.GetSlots()) {
            if (*result == zerrNone) *result = ring.Queue(camera, slot.get());
        }
        if (*result == zerrNone) *result = Zentara_SetStreaming(camera, 1);
        if (*result == zerrNone) *result = TriggerNext();
        const Clock::time_point begin = Clock::now();
        ExitCode code = *result == zerrNone ? ExitDone : ExitFailed;
        Clock::time_point lastFrame = begin;
        while (code == ExitDone && !IsFinished()) {
            Slot* slot = ring.Take();
            sums.seconds = std::chrono::duration<double>(Clock::now() - begin).count();
            if (slot != nullptr) {
                lastFrame = Clock::now();
                code = Serve(slot, result);
            } else if (std::chrono::duration<double>(Clock::now() - lastFrame).count() >
                       options.timeoutSeconds) {
                PrintError(fmt::format("no frame came within {:g} s", options.timeoutSeconds));
                code = ExitFailed;
            } else {
                TriggerRest();
            }
            if (code == ExitDone && IsInterrupted()) code = ExitInterrupted;
            progress.Show(sums, false);
        }
        Stop();
        code = KeepRest(code);
        sums.Settle();
        progress.Show(sums, true);
        return code;
    }

    [[nodiscard]] const StreamSums& GetSums() const { return sums; }
    /// Frames that came behind those that were asked for.
    [[nodiscard]] std::uint64_t GetSurplus() const { return surplus; }

  private:
    [[nodiscard]] bool IsFinished() const {
        return (options.count > 0 && sums.frames >= options.count) ||
               (options.durationSeconds > 0 && sums.seconds >= options.durationSeconds);
    }

    /// A camera in the mode of the software trigger waits for one before each exposure.
    ZentaraResult TriggerNext() {
        return facts.isSoftwareTriggered ? Zentara_Trigger(camera) : ZentaraResult{zerrNone};
    }

    /// The exposures of a wheel behind the first one of a frame.
    void TriggerRest() {
        if (facts.exposures > 1) (void)TriggerNext();  // A camera that is gone sends no frame.
    }

    ExitCode Serve(Slot* slot, ZentaraResult* result) {
        const ExitCode kept = Keep(*slot);
        if (kept != ExitDone) return kept;
        *result = ring.Queue(camera, slot);
        if (*result == zerrNone && !IsFinished()) *result = TriggerNext();
        return *result == zerrNone ? ExitDone : ExitFailed;
    }

    ExitCode Keep(const Slot& slot) {
        sums.Count(slot.buffer.frame);
        if (options.output.empty() || !isWritable) return ExitDone;
        const ExitCode written = Write(slot);
        isWritable = written == ExitDone;
        return written;
    }

    /// What came before the stream had stopped is as good as the frames before it, unless no more
    /// were asked for.
    ExitCode KeepRest(ExitCode code) {
        for (const Slot* slot : ring.TakeRest()) {
            if (options.count > 0 && sums.frames >= options.count) {
                ++surplus;
            } else if (Keep(*slot) != ExitDone) {
                code = ExitFailed;
            }
        }
        return code;
    }

    ExitCode Write(const Slot& slot) {
        const std::string problem = FindFrameProblem(slot.buffer.frame);
        if (!problem.empty()) {
            PrintError(problem);
            return ExitFailed;
        }
        const std::chrono::nanoseconds begin(slot.exposureEndNs.load() -
                                             static_cast<std::int64_t>(facts.exposureNs));
        const std::string name = GetNumberedName(options.output, sums.frames);
        const std::string reason = WriteImage(
            name, MakeImage(facts, slot.buffer,
                            SystemTime(std::chrono::duration_cast<SystemTime::duration>(begin))));
        if (reason.empty()) {
            ++sums.files;
            return ExitDone;
        }
        PrintError(fmt::format("{} cannot be written: {}", name, reason));
        return ExitFailed;
    }

    /// The buffers are the program's again once the abort has come back.
    void Stop() {
        if (isStopped) return;
        isStopped = true;
        (void)Zentara_SetStreaming(
            camera, 0);  // A camera that is gone cannot be stopped; the rest goes on.
        (void)Zentara_Abort(camera);
    }

    ZentaraHandle camera;
    const CaptureFacts& facts;
    const StreamOptions& options;
    FrameRing ring;
    ProgressLine progress;
    StreamSums sums;
    std::uint64_t surplus = 0;
    bool isStopped = false, isWritable = true;
};

void ReportAsJson(const StreamSums& sums, std::uint64_t surplus) {
    nlohmann::json errors = nlohmann::json::object();
    for (const auto& [code, count] : sums.GetErrors()) errors[GetFrameErrorName(code)] = count;
    nlohmann::json missing = nlohmann::json::array();
    for (const MissingFrames& run : sums.GetMissing()) missing.push_back({run.first, run.last});
    PrintJson(nlohmann::json{{"frames", sums.frames},
                             {"seconds", sums.seconds},
                             {"framesPerSecond", sums.GetRate()},
                             {"megabytesPerSecond", sums.GetMegabytesPerSecond()},
                             {"gaps", sums.gaps},
                             {"drops", sums.drops},
                             {"repeats", sums.repeats},
                             {"misnumbered", sums.misnumbered},
                             {"damaged", sums.damaged},
                             {"errors", errors},
                             {"lastNumber", sums.GetLastNumber()},
                             {"missing", missing},
                             {"gapsNotNamed", sums.CountUnnamedGaps()},
                             {"surplus", surplus},
                             {"files", sums.files}});
}

void ReportAsText(const StreamSums& sums, std::uint64_t surplus) {
    Print(fmt::format(
        "{} frames in {:.2f} s: {:.1f} frames/s, {:.1f} MB/s; {} gaps, {} drops, {} damaged\n",
        sums.frames, sums.seconds, sums.GetRate(), sums.GetMegabytesPerSecond(), sums.gaps,
        sums.drops, sums.damaged));
    for (const auto& [code, count] : sums.GetErrors()) {
        Print(fmt::format("{} frames with the error {}\n", count, GetFrameErrorName(code)));
    }
    if (sums.repeats > 0) Print(fmt::format("{} frames came twice\n", sums.repeats));
    if (sums.misnumbered > 0)
        Print(fmt::format("{} frames bear a wrong number\n", sums.misnumbered));
    if (sums.gaps > 0) Print(fmt::format("missing frames: {}\n", sums.DescribeMissing()));
    if (surplus > 0) Print(fmt::format("{} more frames came before it had stopped\n", surplus));
    if (sums.files > 0) Print(fmt::format("{} files written\n", sums.files));
}

void Report(const CommonOptions& common, const Stream& stream) {
    if (common.asJson) {
        ReportAsJson(stream.GetSums(), stream.GetSurplus());
    } else {
        ReportAsText(stream.GetSums(), stream.GetSurplus());
    }
}

bool HasLosses(const StreamSums& sums) {
    return sums.damaged > 0 || sums.drops > 0 || sums.misnumbered > 0;
}

ExitCode CheckOptions(const StreamOptions& options) {
    if (!options.output.empty() && CheckImageName(options.output) != ExitDone) return ExitWrongUse;
    if (options.count == 0 && options.durationSeconds <= 0) {
        PrintError("a stream needs --count or --duration");
        return ExitWrongUse;
    }
    return ExitDone;
}

}  // namespace

ExitCode RunStream(const CommonOptions& common, const StreamOptions& options) {
    if (const ExitCode checked = CheckOptions(options); checked != ExitDone) return checked;
    Session session;
    SentSettings settings;
    const ExitCode prepared =
        OpenWithSettings(common.camera, options.settings, &session, &settings);
    if (prepared != ExitDone) return prepared;

    TellMended(settings, settings.sent);
    const CaptureFacts facts = GetCaptureFacts(session.GetCamera(), settings.sent);
    Stream stream(session.GetCamera(), facts, options);
    ZentaraResult result = zerrNone;
    const ExitCode code = stream.Run(&result);
    session.Close();  // No callback can come any more, so the stream's buffers may go.
    Report(common, stream);
    if (code == ExitFailed) {
        if (result != zerrNone) PrintError("the stream ended: " + DescribeResult(result));
        return session.Judge(result == zerrNone ? ZentaraResult{zerrDriverFault} : result);
    }
    if (code != ExitDone) return code;
    return HasLosses(stream.GetSums()) ? ExitDamaged : ExitDone;
}

}  // namespace ZentaraProgram
