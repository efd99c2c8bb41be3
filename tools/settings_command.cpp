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

std::string FormatOptional(const Setting& setting, const std::optional<SettingValue>& value) {
    return value ? FormatValue(setting, *value) : "-";
}

ordered_json GetOptionalAsJson(const Setting& setting, const std::optional<SettingValue>& value) {
    return value ? GetValueAsJson(setting, *value) : ordered_json(nullptr);
}

void PrintChanges(const std::vector<SettingChange>& changes, const char* nothing) {
    if (changes.empty()) Print(fmt::format("{}\n", nothing));
    std::size_t width = 0;
    for (const SettingChange& change : changes)
        width = std::max(width, change.setting->name.size());
    for (const SettingChange& change : changes) {
        Print(fmt::format("{:<{}}  {} -> {}\n", change.setting->name, width,
                          FormatOptional(*change.setting, change.before),
                          FormatOptional(*change.setting, change.after)));
    }
}

void PrintChangesAsJson(const std::vector<SettingChange>& changes) {
    ordered_json list = ordered_json::array();
    for (const SettingChange& change : changes) {
        list.push_back({{"name", change.setting->name},
                        {"before", GetOptionalAsJson(*change.setting, change.before)},
                        {"after", GetOptionalAsJson(*change.setting, change.after)}});
    }
    PrintJson(ordered_json{{"changes", list}});
}

void ShowChanges(const CommonOptions& common, const std::vector<SettingChange>& changes,
                 const char* nothing) {
    if (common.asJson) {
        PrintChangesAsJson(changes);
    } else {
        PrintChanges(changes, nothing);
    }
}

ExitCode TellFailure(Session& session, const char* what, ZentaraResult result) {
    PrintError(fmt::format("{}: {}", what, DescribeResult(result)));
    return session.Judge(result);
}

/// The camera with the settings of the options in force, and what it says of itself then.
ExitCode SendAndRead(const CommonOptions& common, const SettingsOptions& options, Session* session,
                     SentSettings* settings, SettingsBlock* inForce) {
    const ExitCode sent = OpenWithSettings(common.camera, options, session, settings);
    if (sent != ExitDone) return sent;
    const ZentaraResult result = inForce->Read(session->GetCamera());
    if (result != zerrNone) return TellFailure(*session, "the settings cannot be read", result);
    TellMended(*settings, *inForce);
    return ExitDone;
}

}  // namespace

ExitCode RunSet(const CommonOptions& common, const SettingsOptions& options) {
    Session session;
    SentSettings settings;
    SettingsBlock inForce;
    const ExitCode sent = SendAndRead(common, options, &session, &settings, &inForce);
    if (sent != ExitDone) return sent;
    ShowChanges(common, FindChanges(settings.before, inForce), "Nothing has changed.");
    return ExitDone;
}

ExitCode RunPreflight(const CommonOptions& common, const SettingsOptions& options) {
    SentSettings settings;
    const ExitCode read = ReadEdits(options, &settings.edits);
    if (read != ExitDone) return read;
    Session session;
    const ExitCode opened = session.Open(common.camera);
    if (opened != ExitDone) return opened;
    ZentaraResult result = settings.before.Read(session.GetCamera());
    if (result != zerrNone) return TellFailure(session, "the settings cannot be read", result);
    settings.asked = settings.before;
    const ExitCode applied = ApplyEdits(session.GetCamera(), settings.edits, &settings.asked);
    if (applied != ExitDone) return applied;
    settings.sent = settings.asked;
    result = settings.sent.Preflight(session.GetCamera());
    if (result != zerrNone) return TellFailure(session, "the settings cannot be checked", result);
    TellMended(settings, settings.sent);
    ShowChanges(common, FindChanges(settings.before, settings.sent), "Nothing would change.");
    return ExitDone;
}

ExitCode RunSave(const CommonOptions& common, const std::string& file,
                 const SettingsOptions& options) {
    Session session;
    SentSettings settings;
    SettingsBlock inForce;
    const ExitCode sent = SendAndRead(common, options, &session, &settings, &inForce);
    if (sent != ExitDone) return sent;
    const std::string reason = WriteSettingsFile(file, session.GetCamera(), inForce);
    if (!reason.empty()) {
        PrintError(fmt::format("{} cannot be written: {}", file, reason));
        return ExitFailed;
    }
    if (common.asJson) {
        PrintJson(ordered_json{{"file", file}, {"model", session.GetCamera().GetModelName()}});
    } else {
        Print(fmt::format("{}: the settings of {}\n", file, session.GetCamera().GetModelName()));
    }
    return ExitDone;
}

}  // namespace ZentaraProgram
