#include <fmt/format.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>

#include "capture.h"
#include "commands.h"
#include "frame_stream.h"
#include "interrupt.h"
#include "output.h"
#include "paths.h"
#include "platform.h"
#include "stream_sums.h"

namespace ZentaraProgram {
namespace {

using Clock = std::chrono::steady_clock;
using SystemTime = std::chrono::system_clock::time_point;
constexpr std::chrono::milliseconds ProgressStep{100};
constexpr int BarWidth = 30;

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

ExitCode WriteSlot(const CaptureFacts& facts, const Slot& slot, const std::string& name) {
    const std::string problem = FindFrameProblem(slot.buffer.frame);
    if (!problem.empty()) {
        PrintError(problem);
        return ExitFailed;
    }
    const std::chrono::nanoseconds begin(slot.exposureEndNs.load() -
                                         static_cast<std::int64_t>(facts.exposureNs));
    const std::string reason = WriteImage(
        name, MakeImage(facts, slot.buffer,
                        SystemTime(std::chrono::duration_cast<SystemTime::duration>(begin))));
    if (reason.empty()) return ExitDone;
    PrintError(fmt::format("{} cannot be written: {}", name, reason));
    return ExitFailed;
}

StreamCalls MakeCalls(const CaptureFacts& facts, const StreamOptions& options,
                      ProgressLine& progress) {
    StreamCalls calls;
    if (!options.output.empty()) {
        calls.write = [&](const Slot& slot, std::uint64_t number) {
            return WriteSlot(facts, slot, GetNumberedName(options.output, number));
        };
    }
    calls.isInterrupted = IsInterrupted;
    calls.show = [&](const StreamSums& sums, bool isLast) { progress.Show(sums, isLast); };
    return calls;
}

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

void Report(const CommonOptions& common, const FrameStream& stream) {
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
    ProgressLine progress(options);
    FrameStream stream(session.GetCamera().GetHandle(), facts, options,
                       MakeCalls(facts, options, progress));
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
