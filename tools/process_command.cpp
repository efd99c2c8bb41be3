#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <nlohmann/json.hpp>
#include <string>
#include <utility>
#include <vector>

#include "capture.h"
#include "commands.h"
#include "fits_reader.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

/// The gains of the frame, which the settings of the command line go before.
std::vector<SettingEdit> GetGainsOf(const Image& frame, const std::string& file) {
    constexpr std::array Keys{zprmPostProcessGainRed, zprmPostProcessGainGreen,
                              zprmPostProcessGainBlue};
    constexpr double Unit = 1000, Greatest = 1e9;
    std::vector<SettingEdit> edits;
    for (std::size_t colour = 0; colour < Keys.size(); ++colour) {
        const double gain = std::clamp(frame.scales[colour] * Unit, -Greatest, Greatest);
        edits.push_back(
            {&GetSetting(ParameterFamily::Word, Keys[colour]), std::llround(gain), file + ": "});
    }
    return edits;
}

/// What the frame and the command line ask for, in settings of a camera; or why it cannot be.
std::string MakeSettings(const ProcessOptions& options, const Image& frame,
                         SettingsOptions* settings) {
    *settings = options.settings;
    settings->first = GetGainsOf(frame, options.file);
    if (frame.layout->IsThreeColour()) return "the frame is finished: it holds three colours";
    const PixelFormat* format = FindPixelFormat(std::string_view(options.settings.colour.format));
    if (!frame.isBayer) {
        const bool isPlain = settings->colour.IsEmpty();
        return isPlain ? std::string{} : "the frame has no mosaic that colours could be made of";
    }
    if (format != nullptr && !format->IsThreeColour())
        return fmt::format("{} is no format of three colours", format->name);
    if (format != nullptr && format->IsDeep() != frame.layout->IsDeep())
        return fmt::format("{} cannot be made of a frame in {}", format->name, frame.layout->name);
    settings->colour.isColour = true;
    settings->colour.isOfStoredFrame = true;
    if (options.settings.colour.format.empty())
        settings->colour.format = frame.layout->IsDeep() ? "rgb48" : "rgb24";
    return {};
}

/// The pixels of a frame with the camera that the library is to see behind them.
Zentara_Frame MakeRecord(const Image& frame, ZentaraHandle camera,
                         std::vector<std::uint8_t>* pixels) {
    Zentara_Frame record{};
    record.pBuffer = pixels->data();
    record.bufferSize = static_cast<std::uint32_t>(pixels->size());
    record.format = frame.layout->format;
    record.width = frame.width;
    record.height = frame.height;
    record.size = record.bufferSize;
    record.bits = static_cast<std::uint16_t>(frame.bits);
    record.frameNumber = static_cast<std::uint16_t>(frame.frameNumber);
    record.bayerPattern = frame.bayerPattern;
    record.errorCode = frame.frameError;
    std::memcpy(record.privateCamera, &camera, sizeof camera);
    record.privateBinning = frame.words.binning;
    record.privateRealTime = frame.words.realTime;
    record.privatePattern = frame.words.pattern;
    record.privateFilled = 1;
    return record;
}

/// Room for the most that a step makes of a frame: six bytes of each of its own, and twice the rows
/// of a frame of the real-time mode.
std::uint64_t GetRoom(const Image& frame) {
    constexpr std::uint64_t Growth = 6;
    return Growth * frame.pixels.size() * (frame.words.realTime != 0 ? 2 : 1);
}

std::string FindMisfit(const Image& frame, const Camera& camera) {
    const std::uint32_t width = camera.GetInfo(zinfCcdWidth).value_or(0);
    const std::uint32_t height = camera.GetInfo(zinfCcdHeight).value_or(0);
    if (frame.width > width || frame.height > height)
        return fmt::format(
            "its {} x {} pixels are more than the sensor of the camera has ({}, {} x {})",
            frame.width, frame.height, camera.GetModelName(), width, height);
    constexpr std::uint64_t GreatestRoom = 0xFFFFFFFF;
    return GetRoom(frame) > GreatestRoom ? "it is too large" : "";
}

void TellOtherModel(const std::string& file, const Image& frame, const Camera& camera) {
    const std::string model = camera.GetModelName();
    if (frame.model.empty() || frame.model == model) return;
    PrintError(fmt::format("{}: the frame is of a {}; it is processed as one of a {}", file,
                           frame.model, model));
}

/// Runs the library over the frame, which then is the finished image.
ZentaraResult Finish(const Camera& camera, SettingsBlock* settings, Image* frame) {
    std::vector<std::uint8_t> finished(GetRoom(*frame));
    const Zentara_Frame in = MakeRecord(*frame, camera.GetHandle(), &frame->pixels);
    Zentara_Frame out = in;  // What the library does not write stays as it was in the frame.
    out.pBuffer = finished.data();
    out.bufferSize = static_cast<std::uint32_t>(finished.size());
    const ZentaraResult result = settings->ProcessFrame(camera, in, &out);
    if (result != zerrNone) return result;
    if (!FindFrameProblem(out).empty() || out.size > finished.size()) return zerrDriverFault;
    const Size before{frame->width, frame->height};
    frame->isPostProcessed = true;
    TakeFrame(out, std::move(finished), frame);
    ScaleBinning(before, frame);
    return zerrNone;
}

/// What is known of the finished image beside its pixels.
void Describe(const Camera& camera, const SettingsBlock& settings, Image* image) {
    const Image made = GetCaptureFacts(camera, settings).prototype;
    image->software = made.software;
    image->scales = made.scales;
}

ExitCode Save(const CommonOptions& common, const ProcessOptions& options, const Image& image) {
    const std::string reason = WriteImage(options.output, image);
    if (!reason.empty()) {
        PrintError(fmt::format("{} cannot be written: {}", options.output, reason));
        return ExitFailed;
    }
    if (common.asJson) {
        PrintJson(nlohmann::ordered_json{{"file", options.output},
                                         {"width", image.width},
                                         {"height", image.height},
                                         {"bits", image.bits},
                                         {"format", image.layout->name}});
    } else {
        Print(fmt::format("{}: {} x {}, {} bits, {}\n", options.output, image.width, image.height,
                          image.bits, image.layout->name));
    }
    return TellDamage(image);
}

ExitCode TellProblem(const std::string& file, const std::string& problem, ExitCode code) {
    PrintError(fmt::format("{}: {}", file, problem));
    return code;
}

}  // namespace

ExitCode RunProcess(const CommonOptions& common, const ProcessOptions& options) {
    if (const ExitCode checked = CheckImageName(options.output); checked != ExitDone)
        return checked;
    Image image;
    std::string problem = ReadFits(options.file, FitsDemand::FrameRecord, &image);
    if (!problem.empty()) return TellProblem(options.file, problem, ExitFailed);
    SettingsOptions wanted;
    problem = MakeSettings(options, image, &wanted);
    if (!problem.empty()) return TellProblem(options.file, problem, ExitWrongUse);
    Session session;
    SentSettings settings;
    const ExitCode prepared = OpenWithSettings(common.camera, wanted, &session, &settings);
    if (prepared != ExitDone) return prepared;

    problem = FindMisfit(image, session.GetCamera());
    if (!problem.empty()) return TellProblem(options.file, problem, ExitFailed);
    TellOtherModel(options.file, image, session.GetCamera());
    const ZentaraResult result = Finish(session.GetCamera(), &settings.sent, &image);
    if (result != zerrNone)
        return TellProblem(options.file, "it cannot be processed: " + DescribeResult(result),
                           ExitFailed);
    Describe(session.GetCamera(), settings.sent, &image);
    return Save(common, options, image);
}

}  // namespace ZentaraProgram
