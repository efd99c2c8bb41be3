#include <fmt/format.h>

#include <algorithm>
#include <charconv>
#include <nlohmann/json.hpp>
#include <string>

#include "capture.h"
#include "commands.h"
#include "grab.h"
#include "histogram.h"
#include "image_readers.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

enum class SourceKind { Camera, NoCamera, File };

/// A text of digits alone is the number of a camera, and one that is too large that of none.
SourceKind ReadSource(const std::string& text, std::uint32_t* camera) {
    const char* end = text.data() + text.size();
    const auto read = std::from_chars(text.data(), end, *camera);
    if (read.ptr != end || text.empty()) return SourceKind::File;
    return read.ec == std::errc{} ? SourceKind::Camera : SourceKind::NoCamera;
}

ExitCode ReadFile(const std::string& path, Image* image) {
    const std::string problem = ReadImage(path, image);
    if (problem.empty()) return ExitDone;
    PrintError(fmt::format("{}: {}", path, problem));
    return ExitFailed;
}

ExitCode TakeFromCamera(std::uint32_t number, const HistogramOptions& options, Image* image) {
    Session session;
    SentSettings settings;
    const ExitCode prepared = OpenWithSettings(number, options.settings, &session, &settings);
    if (prepared != ExitDone) return prepared;
    TellMended(settings, settings.sent);
    return TakeImage(&session, settings.sent, options.timeoutSeconds, image);
}

ExitCode CheckOptions(const HistogramOptions& options, bool isFile) {
    if (!options.picture.empty() && GetImageKind(options.picture) != ImageKind::Png) {
        PrintError(fmt::format("{}: the ending must be .png", options.picture));
        return ExitWrongUse;
    }
    const SettingsOptions& settings = options.settings;
    if (!isFile ||
        (settings.file.empty() && settings.assignments.empty() && settings.colour.IsEmpty()))
        return ExitDone;
    PrintError("settings are for cameras; a file is shown as it is");
    return ExitWrongUse;
}

void Show(const CommonOptions& common, const Image& image,
          const std::vector<Histogram>& histograms) {
    if (!common.asJson) {
        for (const Histogram& histogram : histograms) Print(DrawInText(histogram));
        return;
    }
    nlohmann::ordered_json channels = nlohmann::ordered_json::array();
    for (const Histogram& histogram : histograms) channels.push_back(GetAsJson(histogram));
    PrintJson(nlohmann::ordered_json{{"width", image.width},
                                     {"height", image.height},
                                     {"bits", image.bits},
                                     {"channels", channels}});
}

ExitCode SavePicture(const std::string& path, const std::vector<Histogram>& histograms) {
    const std::string reason = WriteImage(path, DrawPicture(histograms));
    if (reason.empty()) return ExitDone;
    PrintError(fmt::format("{} cannot be written: {}", path, reason));
    return ExitFailed;
}

}  // namespace

ExitCode RunHistogram(const CommonOptions& common, const HistogramOptions& options) {
    std::uint32_t number = 0;
    const SourceKind kind = ReadSource(options.source, &number);
    const bool isFile = kind == SourceKind::File;
    if (const ExitCode checked = CheckOptions(options, isFile); checked != ExitDone) return checked;
    if (kind == SourceKind::NoCamera) {
        PrintError(fmt::format("there is no camera {}", options.source));
        return ExitNoCamera;
    }
    Image image;
    const ExitCode taken =
        isFile ? ReadFile(options.source, &image) : TakeFromCamera(number, options, &image);
    if (taken != ExitDone) return taken;
    const std::vector<Histogram> histograms = MakeHistograms(image);
    Show(common, image, histograms);
    const ExitCode drawn =
        options.picture.empty() ? ExitDone : SavePicture(options.picture, histograms);
    return drawn == ExitDone ? TellDamage(image) : drawn;
}

}  // namespace ZentaraProgram
