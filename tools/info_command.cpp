#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <nlohmann/json.hpp>
#include <string>
#include <string_view>
#include <vector>

#include "commands.h"
#include "driver.h"
#include "output.h"
#include "setting_names.h"
#include "setting_values.h"

namespace ZentaraProgram {
namespace {

/// Answers without a meaning; the serial number is a text.
constexpr std::array<std::uint32_t, 5> LeftOut{zinfSerialNumber, zinfReserved7, zinfReserved27,
                                               zinfReserved28, zinfReserved35};

constexpr std::array<std::uint32_t, 14> YesOrNo{zinfCooled,
                                                zinfIsModelB,
                                                zinfRegulatedCooling,
                                                zinfRegulatedCoolingLock,
                                                zinfFanControl,
                                                zinfHighSensitivityMode,
                                                zinfBlackoutMode,
                                                zinfAsymmetricalBinning,
                                                zinfEMGain,
                                                zinfCloseDelay,
                                                zinfColorWheelSupported,
                                                zinfReserved2,
                                                zinfReserved3,
                                                zinfReserved4};

/// Names that do not follow from the key. The last three keys keep reserved names in the header.
struct SpecialName {
    std::uint32_t key;
    const char* name;  ///< Null for that of the key.
    const char* jsonName;
};
constexpr std::array SpecialNames{
    SpecialName{zinfExposureRes, nullptr, "exposureResolution"},
    SpecialName{zinfTriggerDelayRes, nullptr, "triggerDelayResolution"},
    SpecialName{zinfNormGaindBRes, nullptr, "normGaindBResolution"},
    SpecialName{zinfNormITGainSigFigs, nullptr, "normIntensifierGainSigFigs"},
    SpecialName{zinfNormITGaindBRes, nullptr, "normIntensifierGaindBResolution"},
    SpecialName{zinfEMGain, nullptr, "emGain"},
    SpecialName{zinfColorWheelSupported, nullptr, "colorWheel"},
    SpecialName{zinfReserved2, "dither-control", "ditherControl"},
    SpecialName{zinfReserved3, "high-gain-mode", "highGainMode"},
    SpecialName{zinfReserved4, "v-clock-control", "vClockControl"},
};

/// A question to the camera by its names.
struct InfoRow {
    const ParameterName* parameter;
    std::string name, jsonName;
};

/// "zinfCcdWidth" becomes "ccdWidth".
std::string MakeJsonName(std::string_view keyName) {
    constexpr std::string_view Prefix = "zinf";
    std::string name(keyName.substr(Prefix.size()));
    name.front() = static_cast<char>(std::tolower(static_cast<unsigned char>(name.front())));
    return name;
}

InfoRow MakeRow(const ParameterName& parameter) {
    InfoRow row{&parameter, MakeName(parameter.name), MakeJsonName(parameter.name)};
    for (const SpecialName& special : SpecialNames) {
        if (special.key != parameter.key) continue;
        row.jsonName = special.jsonName;
        if (special.name != nullptr) row.name = special.name;
    }
    return row;
}

template <typename List>
bool Holds(const List& list, std::uint32_t key) {
    return std::find(list.begin(), list.end(), key) != list.end();
}

std::vector<InfoRow> GetRows() {
    std::vector<InfoRow> rows;
    for (const ParameterName& parameter : GetParameterNames()) {
        const bool isInformation = parameter.family == ParameterFamily::Information;
        if (isInformation && !Holds(LeftOut, parameter.key)) rows.push_back(MakeRow(parameter));
    }
    return rows;
}

/// A line of the answer: what there is to tell, as text and as JSON.
struct InfoAnswer {
    std::string name, jsonName, meaning, text;
    nlohmann::json json;
};

std::string FormatInfo(const InfoRow& row, std::uint32_t value) {
    const std::uint32_t key = row.parameter->key;
    if (Holds(YesOrNo, key)) return value != 0 ? "yes" : "no";
    if (key == zinfCcdType) return value != 0 ? "colour mosaic" : "monochrome";
    const bool isNamed = row.parameter->values[0].name != nullptr;
    return FormatValue({.parameter = row.parameter,
                        .name = row.name,
                        .ruleName = row.name,
                        .kind = isNamed ? ValueKind::Choice : ValueKind::Number,
                        .isStored = false},
                       value);
}

/// What stands behind a semicolon is for programmers.
std::string GetMeaning(const ParameterName& parameter) {
    const std::string_view meaning = parameter.meaning;
    return std::string(meaning.substr(0, meaning.find(';')));
}

InfoAnswer MakeAnswer(const Camera& camera, const InfoRow& row) {
    const auto value = camera.GetInfo(row.parameter->key);
    return {row.name, row.jsonName, GetMeaning(*row.parameter),
            value ? FormatInfo(row, *value) : "-",
            value ? nlohmann::json(*value) : nlohmann::json(nullptr)};
}

std::vector<InfoAnswer> GetAnswers(const Camera& camera) {
    const std::string model = camera.GetModelName(), serial = camera.GetSerialNumber();
    std::vector<InfoAnswer> answers{
        {"model", "model", "Model", model, model},
        {"serial-number", "serialNumber", "Serial number", serial, serial}};
    for (const InfoRow& row : GetRows()) answers.push_back(MakeAnswer(camera, row));
    return answers;
}

std::vector<std::string> GetInfoNames() {
    std::vector<std::string> names{"model", "serial-number"};
    for (const InfoRow& row : GetRows()) names.push_back(row.name);
    return names;
}

/// The name of a row by what a user wrote: its name, that of the header or that in JSON.
std::string FindInfoName(const std::string& written) {
    const std::string simple = Simplify(written);
    for (const std::string& name : GetInfoNames()) {
        if (Simplify(name) == simple) return name;
    }
    for (const InfoRow& row : GetRows()) {
        if (Simplify(row.jsonName) == simple || row.parameter->name == written) return row.name;
    }
    return {};
}

ExitCode FindNames(const std::vector<std::string>& keys, std::vector<std::string>* names) {
    ExitCode code = ExitDone;
    for (const std::string& key : keys) {
        names->push_back(FindInfoName(key));
        if (!names->back().empty()) continue;
        PrintError(DescribeUnknown("information", key, GetInfoNames()));
        code = ExitWrongUse;
    }
    return code;
}

std::vector<InfoAnswer> Choose(const std::vector<InfoAnswer>& answers,
                               const std::vector<std::string>& names) {
    if (names.empty()) return answers;
    std::vector<InfoAnswer> chosen;
    for (const std::string& name : names) {
        const auto found = std::find_if(answers.begin(), answers.end(),
                                        [&](const InfoAnswer& row) { return row.name == name; });
        if (found != answers.end()) chosen.push_back(*found);
    }
    return chosen;
}

void PrintAnswers(const std::vector<InfoAnswer>& answers) {
    std::size_t nameWidth = 0, textWidth = 0;
    for (const InfoAnswer& answer : answers) {
        nameWidth = std::max(nameWidth, answer.name.size());
        textWidth = std::max(textWidth, answer.text.size());
    }
    for (const InfoAnswer& answer : answers) {
        Print(fmt::format("{:<{}}  {:<{}}  {}\n", answer.name, nameWidth, answer.text, textWidth,
                          answer.meaning));
    }
}

}  // namespace

ExitCode RunInfo(const CommonOptions& common, const std::vector<std::string>& keys) {
    std::vector<std::string> names;
    if (const ExitCode found = FindNames(keys, &names); found != ExitDone) return found;
    Session session;
    const ExitCode opened = session.Open(common.camera);
    if (opened != ExitDone) return opened;
    const std::vector<InfoAnswer> answers = Choose(GetAnswers(session.GetCamera()), names);
    if (!common.asJson) {
        PrintAnswers(answers);
        return ExitDone;
    }
    nlohmann::json info = nlohmann::json::object();
    for (const InfoAnswer& answer : answers) info[answer.jsonName] = answer.json;
    PrintJson(info);
    return ExitDone;
}

}  // namespace ZentaraProgram
