#include "setting_names.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cctype>

#include "zentara/zentara.h"

namespace ZentaraProgram {
namespace {

constexpr ParameterName Parameters[] = {
#include "parameter_names.inc"
};

/// Names that do not follow from the key: where two keys say the same, the plain name is that of
/// the key that is sent.
struct SpecialName {
    ParameterFamily family;
    std::uint32_t key;
    const char* name;
};
constexpr std::array SpecialNames{
    SpecialName{ParameterFamily::Word, zprmOffset, "offset-units"},
    SpecialName{ParameterFamily::Word, zprmExposure, "exposure-us"},
    SpecialName{ParameterFamily::Word, zprmExposureRed, "exposure-red-us"},
    SpecialName{ParameterFamily::Word, zprmExposureBlue, "exposure-blue-us"},
    SpecialName{ParameterFamily::Word, zprmIntensifierGain, "intensifier-gain-units"},
    SpecialName{ParameterFamily::Word, zprmNormIntensGaindB, "intensifier-gain-db"},
    SpecialName{ParameterFamily::Signed, zprmS32NormalizedGaindB, "gain-db"},
    SpecialName{ParameterFamily::Signed, zprmS32AbsoluteOffset, "offset"},
    SpecialName{ParameterFamily::Signed, zprmS32RegulatedCoolingTemp, "cooling"},
    SpecialName{ParameterFamily::Wide, zprm64NormIntensGain, "intensifier-gain"},
};

struct Alias {
    const char* name;
    const char* setting;
};
constexpr std::array Aliases{
    Alias{"gain-units", "gain"},
    Alias{"format", "image-format"},
    Alias{"width", "roi-width"},
    Alias{"height", "roi-height"},
    Alias{"trigger", "trigger-type"},
    Alias{"cooler", "cooler-active"},
    Alias{"temperature", "cooling"},
    Alias{"binning-x", "horizontal-binning"},
    Alias{"binning-y", "vertical-binning"},
    Alias{"post-processing", "do-post-processing"},
};

constexpr std::array<std::uint32_t, 7> Switches{
    zprmCoolerActive,        zprmDoubleShot, zprmDoPostProcessing, zprmBlackoutMode,
    zprmHighSensitivityMode, zprmDither,     zprmHighGainMode};

/// Words that say again what another key says, have no use, or cannot be read or set.
constexpr std::array<std::uint32_t, 15> UnstoredWords{zprmGain,           zprmOffset,
                                                      zprmExposure,       zprmExposureRed,
                                                      zprmExposureBlue,   zprmReserved17,
                                                      zprmShutterState,   zprmIntensifierGain,
                                                      zprmNormalizedGain, zprmNormIntensGaindB,
                                                      zprmOpenDelay,      zprmCCDClearingMode,
                                                      zprmOverSample,     zprmRevisionTwoReserved,
                                                      zprmRegisterTweak};

template <typename List>
bool HasWord(const List& list, const ParameterName& parameter) {
    return parameter.family == ParameterFamily::Word &&
           std::find(list.begin(), list.end(), parameter.key) != list.end();
}

bool IsOneOf(std::string_view text, std::initializer_list<std::string_view> list) {
    return std::find(list.begin(), list.end(), text) != list.end();
}

/// A name that tells the unit, as "exposure-us", makes up for one behind the number.
bool TellsUnit(std::string_view name) {
    constexpr std::string_view Ending = "-us";
    return name.size() > Ending.size() && name.substr(name.size() - Ending.size()) == Ending;
}

ValueKind GetKind(const ParameterName& parameter, std::string_view name) {
    if (HasWord(Switches, parameter)) return ValueKind::Switch;
    if (parameter.values[0].name != nullptr) return ValueKind::Choice;
    if (parameter.family == ParameterFamily::Word && parameter.key == zprmRegisterTweak)
        return ValueKind::Register;
    const bool isTime = IsOneOf(parameter.unit, {"ns", "us"}) && !TellsUnit(name);
    return isTime ? ValueKind::Time : ValueKind::Number;
}

std::string GetName(const ParameterName& parameter, const std::string& ruleName) {
    const auto special =
        std::find_if(SpecialNames.begin(), SpecialNames.end(), [&](const SpecialName& row) {
            return row.family == parameter.family && row.key == parameter.key;
        });
    return special == SpecialNames.end() ? ruleName : special->name;
}

std::vector<Setting> MakeSettings() {
    std::vector<Setting> settings;
    for (const ParameterName& parameter : Parameters) {
        if (parameter.family == ParameterFamily::Information) continue;
        const std::string ruleName = MakeName(parameter.name);
        const std::string name = GetName(parameter, ruleName);
        settings.push_back({&parameter, name, ruleName, GetKind(parameter, name),
                            !HasWord(UnstoredWords, parameter)});
    }
    return settings;
}

std::vector<std::string> MakeKnownNames() {
    std::vector<std::string> names;
    for (const Setting& setting : GetSettings()) names.push_back(setting.name);
    for (const Alias& alias : Aliases) names.emplace_back(alias.name);
    return names;
}

template <typename Matches>
const Setting* FindFirst(const Matches& matches) {
    const auto settings = GetSettings();
    const auto found = std::find_if(settings.begin(), settings.end(), matches);
    return found == settings.end() ? nullptr : &*found;
}

/// A new word of a name begins here: a capital behind a small letter, or the last of several.
bool IsWordStart(std::string_view name, std::size_t place) {
    const auto isUpper = [&](std::size_t i) {
        return i < name.size() && std::isupper(static_cast<unsigned char>(name[i])) != 0;
    };
    const auto isLower = [&](std::size_t i) {
        return i < name.size() && std::islower(static_cast<unsigned char>(name[i])) != 0;
    };
    if (place == 0 || !isUpper(place)) return false;
    return isLower(place - 1) || (isUpper(place - 1) && isLower(place + 1));
}

std::string_view DropPrefix(std::string_view name) {
    for (const std::string_view prefix : {"zprmS32", "zprm64", "zprm", "zinf"}) {
        if (name.substr(0, prefix.size()) == prefix) return name.substr(prefix.size());
    }
    return name;
}

/// Letters to insert, drop, change or swap with their neighbour, to make one text of the other.
std::size_t CountEdits(std::string_view one, std::string_view other) {
    std::vector<std::vector<std::size_t>> edits(one.size() + 1,
                                                std::vector<std::size_t>(other.size() + 1));
    for (std::size_t i = 0; i <= one.size(); ++i) {
        for (std::size_t j = 0; j <= other.size(); ++j) {
            if (i == 0 || j == 0) {
                edits[i][j] = i + j;
                continue;
            }
            const std::size_t change = one[i - 1] == other[j - 1] ? 0 : 1;
            edits[i][j] =
                std::min({edits[i - 1][j] + 1, edits[i][j - 1] + 1, edits[i - 1][j - 1] + change});
            if (i > 1 && j > 1 && one[i - 1] == other[j - 2] && one[i - 2] == other[j - 1])
                edits[i][j] = std::min(edits[i][j], edits[i - 2][j - 2] + 1);
        }
    }
    return edits[one.size()][other.size()];
}

/// How far a known name is from what was written: a name that holds it whole is near.
std::size_t GetDistance(const std::string& written, const std::string& known) {
    const std::size_t edits = CountEdits(written, known);
    constexpr std::size_t ShortestPart = 3;
    const bool holds = written.size() >= ShortestPart && known.find(written) != std::string::npos;
    return holds ? std::min<std::size_t>(edits, 2) : edits;
}

}  // namespace

std::string MakeName(std::string_view keyName) {
    constexpr std::string_view Decibel = "dB";
    const std::string_view name = DropPrefix(keyName);
    std::string made;
    for (std::size_t i = 0; i < name.size(); ++i) {
        const bool isDecibel = name.substr(i, Decibel.size()) == Decibel;
        const bool isInDecibel = i > 0 && name.substr(i - 1, Decibel.size()) == Decibel;
        if (isDecibel || (IsWordStart(name, i) && !isInDecibel)) made += '-';
        made += static_cast<char>(std::tolower(static_cast<unsigned char>(name[i])));
    }
    return made;
}

std::string Simplify(std::string_view name) {
    std::string simple;
    for (const char c : name) {
        if (c == '-' || c == '_' || c == ' ') continue;
        simple += static_cast<char>(std::tolower(static_cast<unsigned char>(c)));
    }
    return simple;
}

std::span<const ParameterName> GetParameterNames() {
    return Parameters;
}

std::span<const Setting> GetSettings() {
    static const std::vector<Setting> settings = MakeSettings();
    return settings;
}

const Setting& GetSetting(ParameterFamily family, std::uint32_t key) {
    const Setting* setting = FindFirst([&](const Setting& candidate) {
        return candidate.parameter->family == family && candidate.parameter->key == key;
    });
    return setting != nullptr ? *setting : GetSettings().front();
}

const Setting* FindSetting(std::string_view name) {
    const std::string simple = Simplify(name);
    const auto isNamed = [&](const Setting& setting) { return Simplify(setting.name) == simple; };
    if (const Setting* found = FindFirst(isNamed)) return found;
    const auto isKey = [&](const Setting& setting) { return setting.parameter->name == name; };
    if (const Setting* found = FindFirst(isKey)) return found;
    for (const Alias& alias : Aliases) {
        if (Simplify(alias.name) == simple) return FindSetting(alias.setting);
    }
    return FindFirst([&](const Setting& setting) { return Simplify(setting.ruleName) == simple; });
}

std::vector<std::string> FindNearest(std::string_view name, std::span<const std::string> known) {
    constexpr std::size_t MostNames = 3;
    const std::string written = Simplify(name);
    const std::size_t farthest = std::max<std::size_t>(2, written.size() / 3);
    std::vector<std::pair<std::size_t, std::string>> near;
    for (const std::string& candidate : known) {
        const std::size_t distance = GetDistance(written, Simplify(candidate));
        if (distance <= farthest) near.emplace_back(distance, candidate);
    }
    std::stable_sort(near.begin(), near.end(),
                     [](const auto& one, const auto& other) { return one.first < other.first; });
    std::vector<std::string> names;
    for (const auto& row : near) {
        if (names.size() < MostNames) names.push_back(row.second);
    }
    return names;
}

std::string DescribeUnknown(std::string_view what, std::string_view name,
                            std::span<const std::string> known) {
    const std::vector<std::string> nearest = FindNearest(name, known);
    std::string begin = fmt::format("unknown {} '{}'", what, name);
    if (nearest.empty()) return begin;
    return fmt::format("{}; did you mean {}?", begin, fmt::join(nearest, ", "));
}

std::string DescribeUnknownSetting(std::string_view name) {
    static const std::vector<std::string> known = MakeKnownNames();
    return DescribeUnknown("setting", name, known);
}

}  // namespace ZentaraProgram
