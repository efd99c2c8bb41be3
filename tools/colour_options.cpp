#include "colour_options.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <span>

#include "pixel_formats.h"

namespace ZentaraProgram {
namespace {

struct AlgorithmRow {
    const char* name;
    std::uint32_t value;
};
// The two bicubic algorithms are one; this is the number that a camera tells afterwards.
constexpr std::array Algorithms{AlgorithmRow{"average", zbayerAverage},
                                AlgorithmRow{"fast", zbayerFast},
                                AlgorithmRow{"bicubic", zbayerBicubicFaster}};

const AlgorithmRow* FindAlgorithm(const std::string& name) {
    const auto* found = std::find_if(Algorithms.begin(), Algorithms.end(),
                                     [&](const AlgorithmRow& row) { return row.name == name; });
    return found == Algorithms.end() ? nullptr : found;
}

enum class ColourMaker { Nothing, Mosaic, Wheel };

ColourMaker GetColourMaker(const Camera& camera) {
    constexpr std::uint32_t MosaicSensor = 1;
    if (camera.GetInfo(zinfCcdType).value_or(0) == MosaicSensor) return ColourMaker::Mosaic;
    return camera.GetInfo(zinfColorWheelSupported).value_or(0) != 0 ? ColourMaker::Wheel
                                                                    : ColourMaker::Nothing;
}

void AddEdit(std::uint32_t key, SettingValue value, std::vector<SettingEdit>* edits) {
    edits->push_back({&GetSetting(ParameterFamily::Word, key), value, {}});
}

/// The last edit of a setting, or null when the edits leave it as it is.
const SettingEdit* FindLastEdit(std::uint32_t key, const std::vector<SettingEdit>& edits) {
    const Setting* setting = &GetSetting(ParameterFamily::Word, key);
    const auto last = std::find_if(edits.rbegin(), edits.rend(), [&](const SettingEdit& edit) {
        return edit.setting == setting;
    });
    return last == edits.rend() ? nullptr : &*last;
}

const PixelFormat* FindFormatInForce(const SettingsBlock& block) {
    const auto value = block.Get(GetSetting(ParameterFamily::Word, zprmImageFormat));
    return FindPixelFormat(static_cast<std::uint32_t>(value.value_or(zfmtMono8)));
}

/// The image format that will be in force after the edits.
const PixelFormat* FindSourceFormat(const SettingsBlock& block,
                                    const std::vector<SettingEdit>& edits) {
    const SettingEdit* edit = FindLastEdit(zprmImageFormat, edits);
    if (edit != nullptr) return FindPixelFormat(static_cast<std::uint32_t>(edit->value));
    return FindFormatInForce(block);
}

/// Adds an edit, unless a word of the command line, and not a file, asks for another value. Returns
/// what contradicts then; `purpose` is what the edit is made for.
std::string AddWantedEdit(const std::string& purpose, std::uint32_t key, SettingValue value,
                          std::vector<SettingEdit>* edits) {
    const Setting& setting = GetSetting(ParameterFamily::Word, key);
    const SettingEdit* edit = FindLastEdit(key, *edits);
    if (edit != nullptr && edit->place.empty() && edit->value != value) {
        return fmt::format("{} needs {}={}, but --set asks for {}", purpose, setting.name,
                           FormatValue(setting, value), FormatValue(setting, edit->value));
    }
    AddEdit(key, value, edits);
    return {};
}

struct WantedEdit {
    std::uint32_t key;
    SettingValue value;
};

std::string AddWantedEdits(const PixelFormat& format, std::span<const WantedEdit> wanted,
                           std::vector<SettingEdit>* edits) {
    for (const WantedEdit& edit : wanted) {
        std::string problem = AddWantedEdit(format.name, edit.key, edit.value, edits);
        if (!problem.empty()) return problem;
    }
    return {};
}

/// True for a camera whose samples have 16 bits in every format.
bool SendsDeepSamplesOnly(const Camera& camera) {
    return camera.GetInfo(zinfCameraType) == std::uint32_t{zmodelMetrona};
}

/// The three-colour format that is meant: the one of the name, the source's own, or the usual one
/// of its depth.
const PixelFormat* ChooseFormat(const ColourOptions& options, const PixelFormat* source) {
    if (!options.format.empty()) return FindPixelFormat(std::string_view(options.format));
    if (source != nullptr && source->IsThreeColour()) return source;
    const bool isDeep = source != nullptr && source->IsDeep();
    return FindPixelFormat(std::uint32_t{isDeep ? zfmtRGB48 : zfmtRGB24});
}

std::string AddMosaicEdits(const PixelFormat& format, const ColourOptions& options,
                           std::vector<SettingEdit>* edits) {
    const std::uint32_t mosaic = format.IsDeep() ? zfmtBayer16 : zfmtBayer8;
    const WantedEdit wanted[] = {{zprmPostProcessImageFormat, format.format},
                                 {zprmImageFormat, mosaic},
                                 {zprmDoPostProcessing, 1}};
    const auto needed = std::span(wanted).first(options.isOfStoredFrame ? 1 : 3);
    std::string problem = AddWantedEdits(format, needed, edits);
    if (!problem.empty()) return problem;
    if (const AlgorithmRow* algorithm = FindAlgorithm(options.algorithm))
        AddEdit(zprmPostProcessBayerAlgorithm, algorithm->value, edits);
    return {};
}

/// The wheel itself makes the three colours; post-processing balances them.
std::string AddWheelEdits(const PixelFormat& format, const ColourOptions& options,
                          std::vector<SettingEdit>* edits) {
    if (!options.algorithm.empty())
        return "this camera has a colour filter wheel and no mosaic; --bayer means nothing to it";
    const WantedEdit wanted[] = {{zprmImageFormat, format.format},
                                 {zprmDoPostProcessing, 1},
                                 {zprmPostProcessImageFormat, format.format}};
    return AddWantedEdits(format, std::span(wanted).first(options.isColour ? 3 : 1), edits);
}

}  // namespace

std::string FindColourProblem(const ColourOptions& options) {
    const PixelFormat* format = FindPixelFormat(std::string_view(options.format));
    if (!options.format.empty() && format == nullptr) return DescribeUnknownFormat(options.format);
    const bool isPlain = format != nullptr && !format->IsThreeColour();
    if (options.isColour && isPlain)
        return fmt::format("--colour needs a format of three colours; {} is none", format->name);
    if (options.algorithm.empty()) return {};
    if (FindAlgorithm(options.algorithm) == nullptr)
        return fmt::format("--bayer: '{}' is none of average, fast, bicubic", options.algorithm);
    return options.isColour || (format != nullptr && !isPlain) ? std::string{}
                                                               : "--bayer goes with --colour";
}

std::string AddColourEdits(const Camera& camera, const SettingsBlock& block,
                           const ColourOptions& options, std::vector<SettingEdit>* edits) {
    if (options.IsEmpty()) return {};
    const PixelFormat* format = FindPixelFormat(std::string_view(options.format));
    if (format != nullptr && !format->IsThreeColour()) {
        AddEdit(zprmImageFormat, format->format, edits);
        return {};
    }
    const PixelFormat& target = *ChooseFormat(options, FindSourceFormat(block, *edits));
    const ColourMaker maker = GetColourMaker(camera);
    if (maker == ColourMaker::Mosaic) return AddMosaicEdits(target, options, edits);
    if (options.isOfStoredFrame)
        return fmt::format("this camera ({}) has no mosaic to process the frame by",
                           camera.GetModelName());
    if (maker == ColourMaker::Wheel && !target.IsDeep() && SendsDeepSamplesOnly(camera))
        return fmt::format("this camera ({}) sends samples of 16 bits alone; {} is of 8",
                           camera.GetModelName(), target.name);
    if (maker == ColourMaker::Wheel) return AddWheelEdits(target, options, edits);
    return fmt::format("this camera ({}) makes no colours: it has no mosaic and no filter wheel",
                       camera.GetModelName());
}

}  // namespace ZentaraProgram
