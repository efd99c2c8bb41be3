#include <fmt/format.h>

#include <algorithm>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "commands.h"
#include "output.h"

namespace ZentaraProgram {
namespace {

using nlohmann::ordered_json;
using Settings = std::vector<const Setting*>;

ExitCode FindSettings(const std::vector<std::string>& keys, Settings* settings) {
    ExitCode code = ExitDone;
    for (const std::string& key : keys) {
        settings->push_back(FindSetting(key));
        if (settings->back() != nullptr) continue;
        PrintError(DescribeUnknownSetting(key));
        code = ExitWrongUse;
    }
    return code;
}

/// Those that were asked for, all of which the camera must have, or all that it has.
ExitCode ChooseSettings(const Camera& camera, Settings* settings) {
    const bool wantsAll = settings->empty();
    ExitCode code = ExitDone;
    if (wantsAll) {
        for (const Setting& setting : GetSettings()) settings->push_back(&setting);
    }
    std::erase_if(*settings, [&](const Setting* setting) {
        if (IsSupported(camera, *setting)) return false;
        if (!wantsAll) {
            PrintError(DescribeMissing(camera, *setting));
            code = ExitWrongUse;
        }
        return true;
    });
    return code;
}

struct Row {
    const Setting* setting;
    std::string text;
    std::string note;  ///< Behind it; may be empty.
};

void PrintRows(const std::vector<Row>& rows) {
    std::size_t nameWidth = 0, textWidth = 0;
    for (const Row& row : rows) {
        nameWidth = std::max(nameWidth, row.setting->name.size());
        textWidth = std::max(textWidth, row.text.size());
    }
    for (const Row& row : rows) {
        const std::string name = fmt::format("{:<{}}  ", row.setting->name, nameWidth);
        Print(row.note.empty()
                  ? fmt::format("{}{}\n", name, row.text)
                  : fmt::format("{}{:<{}}  {}\n", name, row.text, textWidth, row.note));
    }
}

Row DescribeSetting(const SettingsBlock& block, const Setting& setting) {
    const auto value = block.Get(setting);
    return {&setting, value ? FormatValue(setting, *value) : "-", setting.parameter->meaning};
}

/// The value as the library has it, its steps, and as it is shown.
ordered_json GetSettingAsJson(const SettingsBlock& block, const Setting& setting) {
    const auto value = block.Get(setting);
    return {{"value", value ? ordered_json(*value) : ordered_json(nullptr)},
            {"unit", setting.parameter->unit},
            {"text", value ? ordered_json(FormatValue(setting, *value)) : ordered_json(nullptr)}};
}

Row DescribeSettingLimits(const SettingsBlock& block, const Setting& setting) {
    const std::string limits = DescribeLimits(setting, block.GetLimits(setting));
    return {&setting, limits.empty() ? "-" : limits, {}};
}

ordered_json GetLimitsAsJson(const SettingsBlock& block, const Setting& setting) {
    const SettingLimits limits = block.GetLimits(setting);
    ordered_json json = ordered_json::object();
    if (limits.isList) {
        json["values"] = ordered_json::array();
        for (const SettingValue value : limits.values)
            json["values"].push_back(GetValueAsJson(setting, value));
    }
    if (limits.least) json["least"] = GetValueAsJson(setting, *limits.least);
    if (limits.greatest) json["greatest"] = GetValueAsJson(setting, *limits.greatest);
    return json;
}

/// One thing to tell of each setting, as text and as JSON.
struct Question {
    Row (*describe)(const SettingsBlock&, const Setting&);
    ordered_json (*getAsJson)(const SettingsBlock&, const Setting&);
};

void Show(const CommonOptions& common, const Question& question, const SettingsBlock& block,
          const Settings& settings) {
    std::vector<Row> rows;
    ordered_json json = ordered_json::object();
    for (const Setting* setting : settings) {
        rows.push_back(question.describe(block, *setting));
        json[setting->name] = question.getAsJson(block, *setting);
    }
    if (common.asJson) {
        PrintJson(json);
    } else {
        PrintRows(rows);
    }
}

ExitCode Ask(const CommonOptions& common, const std::vector<std::string>& keys,
             const Question& question) {
    Settings settings;
    if (const ExitCode found = FindSettings(keys, &settings); found != ExitDone) return found;
    Session session;
    SentSettings read;
    const ExitCode opened = OpenWithSettings(common.camera, {}, &session, &read);
    if (opened != ExitDone) return opened;
    const ExitCode chosen = ChooseSettings(session.GetCamera(), &settings);
    if (chosen == ExitDone) Show(common, question, read.before, settings);
    return chosen;
}

}  // namespace

ExitCode RunGet(const CommonOptions& common, const std::vector<std::string>& keys) {
    return Ask(common, keys, {DescribeSetting, GetSettingAsJson});
}

ExitCode RunLimits(const CommonOptions& common, const std::vector<std::string>& keys) {
    return Ask(common, keys, {DescribeSettingLimits, GetLimitsAsJson});
}

}  // namespace ZentaraProgram
