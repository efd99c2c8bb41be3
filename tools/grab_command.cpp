#include <fmt/format.h>

#include <nlohmann/json.hpp>
#include <string>

#include "capture.h"
#include "commands.h"
#include "grab.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

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
    return TellDamage(image);
}

ExitCode CheckOptions(const GrabOptions& options) {
    if (const ExitCode checked = CheckImageName(options.output); checked != ExitDone)
        return checked;
    const std::string problem = FindMeasureProblem(options.measure);
    if (problem.empty() && (options.isBalanced || options.measure.region.empty())) return ExitDone;
    PrintError(problem.empty() ? "--region goes with --white-balance" : problem);
    return ExitWrongUse;
}

ExitCode BalanceWhite(const GrabOptions& options, Session* session, SettingsBlock* settings) {
    if (!options.isBalanced) return ExitDone;
    MeasureOptions measure = options.measure;
    measure.timeoutSeconds = options.timeoutSeconds;
    return Measure(Measurement::WhiteBalance, measure, session, settings);
}

}  // namespace

ExitCode RunGrab(const CommonOptions& common, const GrabOptions& options) {
    if (const ExitCode checked = CheckOptions(options); checked != ExitDone) return checked;
    Session session;
    SentSettings settings;
    const ExitCode prepared =
        OpenWithSettings(common.camera, options.settings, &session, &settings);
    if (prepared != ExitDone) return prepared;

    TellMended(settings, settings.sent);
    const ExitCode balanced = BalanceWhite(options, &session, &settings.sent);
    if (balanced != ExitDone) return balanced;
    Image image;
    const ExitCode taken = TakeImage(&session, settings.sent, options.timeoutSeconds, &image);
    return taken == ExitDone ? SaveImage(common, options, image) : taken;
}

}  // namespace ZentaraProgram
