#include "measure.h"

#include <fmt/format.h>

#include <array>
#include <charconv>
#include <string_view>

#include "frame_size.h"
#include "grab_watch.h"
#include "interrupt.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

constexpr std::uint32_t LeastSide = 16;

constexpr std::array GainKeys{zprmPostProcessGainRed, zprmPostProcessGainGreen,
                              zprmPostProcessGainBlue};

Size GetSizeOfFrames(const Camera& camera, const SettingsBlock&) {
    return GetFrameSize(camera);
}

struct MeasurementRow {
    const char* name;
    ZentaraResult (SettingsBlock::*run)(const Region&);
    /// What a region is held against: the exposure cuts it before the proportions are corrected.
    Size (*getSize)(const Camera&, const SettingsBlock&);
    const char* ground;
};
// In the order of Measurement.
constexpr std::array Measurements{
    MeasurementRow{"white balance", &SettingsBlock::BalanceWhite, &GetFinishedSize, "image"},
    MeasurementRow{"auto exposure", &SettingsBlock::Expose, &GetSizeOfFrames, "camera's frame"},
};

/// Takes a number from the begin of a text, and the sign behind it unless that is 0.
bool TakeNumber(std::string_view* text, char sign, std::uint32_t* number) {
    const char* end = text->data() + text->size();
    const auto read = std::from_chars(text->data(), end, *number);
    if (read.ec != std::errc{}) return false;
    text->remove_prefix(static_cast<std::size_t>(read.ptr - text->data()));
    if (sign == 0) return text->empty();
    if (text->empty() || text->front() != sign) return false;
    text->remove_prefix(1);
    return true;
}

/// Why a region cannot be measured in an image of this size; empty when it can.
std::string FindRegionProblem(const Region& region, Size size, const char* ground) {
    const bool isInside = std::uint64_t{region.x} + region.width <= size.width &&
                          std::uint64_t{region.y} + region.height <= size.height;
    if (!isInside)
        return fmt::format("--region reaches beyond the {} of {} x {} pixels", ground, size.width,
                           size.height);
    if (region.width >= LeastSide || region.height >= LeastSide) return {};
    return fmt::format("--region has to be {} pixels wide or high at least", LeastSide);
}

bool IsSoftwareTriggered(const SettingsBlock& settings) {
    return settings.Get(GetSetting(ParameterFamily::Word, zprmTriggerType)) == ztrigSoftware;
}

/// The exposures of a wheel are balanced as well: the gains would do it a second time.
void LeaveGainsToExposures(SettingsBlock* settings) {
    constexpr SettingValue Even = 1000;
    // Even gains are within all limits.
    for (const std::uint32_t key : GainKeys)
        (void)settings->Set(GetSetting(ParameterFamily::Word, key), Even);
}

/// A region without light has such gains; a camera takes them, but --set and files do not.
void TellExtremeGains(const SettingsBlock& settings) {
    for (const std::uint32_t key : GainKeys) {
        const Setting& setting = GetSetting(ParameterFamily::Word, key);
        const auto value = settings.Get(setting);
        const SettingLimits limits = settings.GetLimits(setting);
        if (!value || limits.Allows(*value)) continue;
        PrintError(fmt::format("{}: {} was found, which is out of range; allowed is {}",
                               setting.name, FormatValue(setting, *value),
                               DescribeLimits(setting, limits)));
    }
}

/// A failure that the library does not tell still shows in the camera: it takes nothing any more.
ZentaraResult Confirm(const Camera& camera, SettingsBlock* settings) {
    return settings->Send(camera);
}

}  // namespace

std::optional<Region> ParseRegion(const std::string& text) {
    std::string_view rest = text;
    Region region;
    const bool isRegion = TakeNumber(&rest, ',', &region.x) && TakeNumber(&rest, ',', &region.y) &&
                          TakeNumber(&rest, 'x', &region.width) &&
                          TakeNumber(&rest, 0, &region.height);
    if (!isRegion || region.width == 0 || region.height == 0) return std::nullopt;
    return region;
}

std::string FindMeasureProblem(const MeasureOptions& options) {
    if (options.region.empty() || ParseRegion(options.region)) return {};
    return fmt::format("--region: '{}' is not of the form X,Y,WxH", options.region);
}

ExitCode Measure(Measurement measurement, const MeasureOptions& options, Session* session,
                 SettingsBlock* settings) {
    const Camera& camera = session->GetCamera();
    const MeasurementRow& row = Measurements[static_cast<std::size_t>(measurement)];
    const Size size = row.getSize(camera, *settings);
    const Region region =
        ParseRegion(options.region).value_or(Region{0, 0, size.width, size.height});
    if (const std::string problem = FindRegionProblem(region, size, row.ground); !problem.empty()) {
        PrintError(problem);
        return ExitWrongUse;
    }
    GrabWatch watch(camera.GetHandle(), options.timeoutSeconds, IsSoftwareTriggered(*settings));
    ZentaraResult result = (settings->*row.run)(region);
    watch.Finish();
    if (IsInterrupted()) return ExitInterrupted;
    if (watch.HasAborted()) {
        PrintError(
            fmt::format("{}: it was not finished within {:g} s", row.name, options.timeoutSeconds));
        return session->Judge(result == zerrNone ? ZentaraResult{zerrBusy} : result);
    }
    const bool hasWheel = camera.GetInfo(zinfColorWheelSupported).value_or(0) != 0;
    if (measurement == Measurement::WhiteBalance && hasWheel) LeaveGainsToExposures(settings);
    if (measurement == Measurement::WhiteBalance && !hasWheel) TellExtremeGains(*settings);
    if (result == zerrNone) result = Confirm(camera, settings);
    if (result == zerrNone) return ExitDone;
    PrintError(fmt::format("{}: {}", row.name, DescribeResult(result)));
    return session->Judge(result);
}

}  // namespace ZentaraProgram
