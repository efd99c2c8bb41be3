#include <fmt/format.h>

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "commands.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

struct Result {
    ParameterFamily family;
    std::uint32_t key;
    bool isOfWheel;  ///< Only a camera with a filter wheel has more than one exposure.
};

const std::vector<Result>& GetResults(Measurement measurement) {
    static const std::vector<Result> exposures{{ParameterFamily::Wide, zprm64Exposure, false},
                                               {ParameterFamily::Wide, zprm64ExposureRed, true},
                                               {ParameterFamily::Wide, zprm64ExposureBlue, true}};
    static const std::vector<Result> balance{
        {ParameterFamily::Word, zprmPostProcessGainRed, false},
        {ParameterFamily::Word, zprmPostProcessGainGreen, false},
        {ParameterFamily::Word, zprmPostProcessGainBlue, false},
        {ParameterFamily::Wide, zprm64Exposure, true},
        {ParameterFamily::Wide, zprm64ExposureRed, true},
        {ParameterFamily::Wide, zprm64ExposureBlue, true}};
    return measurement == Measurement::WhiteBalance ? balance : exposures;
}

void Show(const CommonOptions& common, Measurement measurement, const Camera& camera,
          const SettingsBlock& block) {
    constexpr std::size_t NameWidth = 24;
    nlohmann::ordered_json report;
    for (const Result& row : GetResults(measurement)) {
        if (row.isOfWheel && camera.GetInfo(zinfColorWheelSupported).value_or(0) == 0) continue;
        const Setting& setting = GetSetting(row.family, row.key);
        const auto value = block.Get(setting);
        if (!value) continue;
        report[setting.name] = GetValueAsJson(setting, *value);
        if (!common.asJson)
            Print(
                fmt::format("{:<{}}  {}\n", setting.name, NameWidth, FormatValue(setting, *value)));
    }
    if (common.asJson) PrintJson(report);
}

}  // namespace

ExitCode RunMeasure(const CommonOptions& common, Measurement measurement,
                    const MeasureCommandOptions& options) {
    if (const std::string problem = FindMeasureProblem(options.measure); !problem.empty()) {
        PrintError(problem);
        return ExitWrongUse;
    }
    SettingsOptions wanted = options.settings;
    if (measurement == Measurement::WhiteBalance) wanted.colour.isColour = true;
    Session session;
    SentSettings settings;
    const ExitCode prepared = OpenWithSettings(common.camera, wanted, &session, &settings);
    if (prepared != ExitDone) return prepared;
    TellMended(settings, settings.sent);
    const ExitCode measured = Measure(measurement, options.measure, &session, &settings.sent);
    if (measured != ExitDone) return measured;
    Show(common, measurement, session.GetCamera(), settings.sent);
    return ExitDone;
}

}  // namespace ZentaraProgram
