#include "settings_options.h"

#include <fmt/format.h>

#include <algorithm>

#include "output.h"

namespace ZentaraProgram {
namespace {

/// Why the camera cannot take an edit; empty when it can.
std::string FindObstacle(const Camera& camera, const SettingEdit& edit,
                         const SettingsBlock& block) {
    const Setting& setting = *edit.setting;
    if (!IsSupported(camera, setting)) return DescribeMissing(camera, setting);
    const SettingLimits limits = block.GetLimits(setting);
    if (limits.Allows(edit.value) || block.Get(setting) == edit.value) return {};
    const std::string value = FormatValue(setting, edit.value);
    return limits.isList ? fmt::format("{}: {} is not allowed; allowed are {}", setting.name, value,
                                       DescribeLimits(setting, limits))
                         : fmt::format("{}: {} is out of range; allowed is {}", setting.name, value,
                                       DescribeLimits(setting, limits));
}

std::string ApplyEdit(const Camera& camera, const SettingEdit& edit, SettingsBlock* block) {
    std::string obstacle = FindObstacle(camera, edit, *block);
    if (!obstacle.empty() || block->Get(*edit.setting) == edit.value) return obstacle;
    const ZentaraResult result = block->Set(*edit.setting, edit.value);
    if (result == zerrNone) return {};
    return fmt::format("{}: {} is refused: {}", edit.setting->name,
                       FormatValue(*edit.setting, edit.value), DescribeResult(result));
}

/// Why an assignment is none; empty when `edit` holds it.
std::string ReadAssignment(const std::string& assignment, SettingEdit* edit) {
    const std::size_t sign = assignment.find('=');
    if (sign == std::string::npos || sign == 0)
        return fmt::format("'{}' is not of the form KEY=VALUE", assignment);
    const std::string name = assignment.substr(0, sign);
    edit->setting = FindSetting(name);
    if (edit->setting == nullptr) return DescribeUnknownSetting(name);
    const ParsedValue parsed = ParseValue(*edit->setting, assignment.substr(sign + 1));
    edit->value = parsed.value.value_or(0);
    return parsed.problem;
}

/// Puts edits before others, but those whose settings the others make anyway.
void InsertFirst(const std::vector<SettingEdit>& first, std::vector<SettingEdit>* edits) {
    std::vector<SettingEdit> all;
    for (const SettingEdit& edit : first) {
        const bool isMadeLater =
            std::any_of(edits->begin(), edits->end(),
                        [&](const SettingEdit& later) { return later.setting == edit.setting; });
        if (!isMadeLater) all.push_back(edit);
    }
    edits->insert(edits->begin(), all.begin(), all.end());
}

ExitCode TellProblems(const std::vector<std::string>& problems) {
    for (const std::string& problem : problems) PrintError(problem);
    return problems.empty() ? ExitDone : ExitWrongUse;
}

}  // namespace

ExitCode ReadEdits(const SettingsOptions& options, std::vector<SettingEdit>* edits) {
    std::vector<std::string> problems;
    if (!options.file.empty()) *edits = ReadSettingsFile(options.file, &problems);
    for (const std::string& assignment : options.assignments) {
        SettingEdit edit;
        const std::string problem = ReadAssignment(assignment, &edit);
        if (problem.empty()) {
            edits->push_back(edit);
        } else {
            problems.push_back(problem);
        }
    }
    InsertFirst(options.first, edits);
    const std::string colour = FindColourProblem(options.colour);
    if (!colour.empty()) problems.push_back(colour);
    return TellProblems(problems);
}

ExitCode ApplyEdits(const Camera& camera, const std::vector<SettingEdit>& edits,
                    SettingsBlock* block) {
    std::vector<std::string> problems;
    for (const SettingEdit& edit : edits) {
        const std::string problem = ApplyEdit(camera, edit, block);
        if (!problem.empty()) problems.push_back(edit.place + problem);
    }
    return TellProblems(problems);
}

namespace {

/// Reads the settings of the camera, makes the edits and sends them. `result` is the code of a call
/// that failed.
ExitCode SendEdits(const Camera& camera, const ColourOptions& colour, SentSettings* settings,
                   ZentaraResult* result) {
    *result = settings->before.Read(camera);
    if (*result != zerrNone) {
        PrintError("the settings cannot be read: " + DescribeResult(*result));
        return GetExitCode(*result);
    }
    const std::string problem = AddColourEdits(camera, settings->before, colour, &settings->edits);
    if (!problem.empty()) return TellProblems({problem});
    settings->asked = settings->before;
    const ExitCode applied = ApplyEdits(camera, settings->edits, &settings->asked);
    settings->sent = settings->asked;
    if (applied != ExitDone || settings->asked.IsSame(settings->before)) return applied;
    *result = settings->sent.Send(camera);
    if (*result == zerrNone) return ExitDone;
    PrintError("the camera does not take all settings: " + DescribeResult(*result));
    return GetExitCode(*result);
}

}  // namespace

ExitCode OpenWithSettings(std::uint32_t cameraId, const SettingsOptions& options, Session* session,
                          SentSettings* settings) {
    const ExitCode read = ReadEdits(options, &settings->edits);
    if (read != ExitDone) return read;
    const ExitCode opened = session->Open(cameraId);
    if (opened != ExitDone) return opened;
    ZentaraResult result = zerrNone;
    const ExitCode sent = SendEdits(session->GetCamera(), options.colour, settings, &result);
    return result == zerrNone ? sent : session->Judge(result);
}

void TellMended(const SentSettings& settings, const SettingsBlock& block) {
    std::vector<const Setting*> told;
    for (const SettingEdit& edit : settings.edits) {
        const auto wanted = settings.asked.Get(*edit.setting), found = block.Get(*edit.setting);
        const bool isTold = std::find(told.begin(), told.end(), edit.setting) != told.end();
        if (wanted == found || !wanted || !found || isTold) continue;
        told.push_back(edit.setting);
        PrintError(fmt::format("{}: {} was asked for, {} is what it becomes", edit.setting->name,
                               FormatValue(*edit.setting, *wanted),
                               FormatValue(*edit.setting, *found)));
    }
}

}  // namespace ZentaraProgram
