#include "settings_block.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <limits>

#include "measure.h"

namespace ZentaraProgram {
namespace {

using Answer = std::optional<SettingValue>;

template <auto Function, typename Value>
Answer Ask(Zentara_Settings& block, std::uint32_t key) {
    Value value{};
    if (Function(&block, key, &value) != zerrNone) return std::nullopt;
    if constexpr (sizeof(Value) == sizeof(SettingValue)) {
        constexpr auto Greatest = std::numeric_limits<SettingValue>::max();
        return static_cast<SettingValue>(std::min(value, static_cast<Value>(Greatest)));
    } else {
        return value;
    }
}

template <auto Function, typename Value>
ZentaraResult Store(Zentara_Settings& block, std::uint32_t key, SettingValue value) {
    if constexpr (sizeof(Value) == sizeof(SettingValue)) {
        if (value < 0) return zerrBadParameter;
    } else {
        if (value < std::numeric_limits<Value>::min() || value > std::numeric_limits<Value>::max())
            return zerrBadParameter;
    }
    return Function(&block, key, static_cast<Value>(value));
}

/// The functions of a family of keys.
struct FamilyRow {
    ZentaraResult (*isSupported)(ZentaraHandle, std::uint32_t);
    Answer (*get)(Zentara_Settings&, std::uint32_t);
    Answer (*least)(Zentara_Settings&, std::uint32_t);
    Answer (*greatest)(Zentara_Settings&, std::uint32_t);
    ZentaraResult (*set)(Zentara_Settings&, std::uint32_t, SettingValue);
};
// In the order of ParameterFamily.
constexpr std::array Families{
    FamilyRow{Zentara_IsParamSupported, Ask<Zentara_GetParam, std::uint32_t>,
              Ask<Zentara_GetParamMin, std::uint32_t>, Ask<Zentara_GetParamMax, std::uint32_t>,
              Store<Zentara_SetParam, std::uint32_t>},
    FamilyRow{Zentara_IsParamS32Supported, Ask<Zentara_GetParamS32, std::int32_t>,
              Ask<Zentara_GetParamS32Min, std::int32_t>, Ask<Zentara_GetParamS32Max, std::int32_t>,
              Store<Zentara_SetParamS32, std::int32_t>},
    FamilyRow{Zentara_IsParam64Supported, Ask<Zentara_GetParam64, std::uint64_t>,
              Ask<Zentara_GetParam64Min, std::uint64_t>, Ask<Zentara_GetParam64Max, std::uint64_t>,
              Store<Zentara_SetParam64, std::uint64_t>},
};

const FamilyRow& GetFamily(const Setting& setting) {
    return Families[static_cast<std::size_t>(setting.parameter->family)];
}

/// The list of a key of 32 bits; the other families have none.
std::optional<std::vector<SettingValue>> GetList(Zentara_Settings& block, const Setting& setting) {
    constexpr std::int32_t Room = 100;
    if (setting.parameter->family != ParameterFamily::Word) return std::nullopt;
    std::array<std::uint32_t, Room> values{};
    std::int32_t count = Room;
    if (Zentara_GetParamSparseTable(&block, setting.parameter->key, values.data(), &count) !=
        zerrNone)
        return std::nullopt;
    return std::vector<SettingValue>(values.begin(),
                                     values.begin() + std::clamp<std::int32_t>(count, 0, Room));
}

}  // namespace

bool SettingLimits::Allows(SettingValue value) const {
    if (isList) return std::find(values.begin(), values.end(), value) != values.end();
    return (!least || value >= *least) && (!greatest || value <= *greatest);
}

ZentaraResult SettingsBlock::Read(const Camera& camera) {
    return Zentara_ReadSettingsFromCam(camera.GetHandle(), &block);
}

ZentaraResult SettingsBlock::Send(const Camera& camera) {
    return Zentara_SendSettingsToCam(camera.GetHandle(), &block);
}

ZentaraResult SettingsBlock::Preflight(const Camera& camera) {
    return Zentara_PreflightSettings(camera.GetHandle(), &block);
}

ZentaraResult SettingsBlock::BalanceWhite(const Region& region) {
    return Zentara_WhiteBalance(&block, region.x, region.y, region.width, region.height);
}

ZentaraResult SettingsBlock::Expose(const Region& region) {
    return Zentara_AutoExpose(&block, region.x, region.y, region.width, region.height);
}

ZentaraResult SettingsBlock::ProcessFrame(const Camera& camera, const Zentara_Frame& in,
                                          Zentara_Frame* out) {
    return Zentara_PostProcessSingleFrame(camera.GetHandle(), &block, &in, out);
}

std::optional<SettingValue> SettingsBlock::Get(const Setting& setting) const {
    return GetFamily(setting).get(block, setting.parameter->key);
}

ZentaraResult SettingsBlock::Set(const Setting& setting, SettingValue value) {
    return GetFamily(setting).set(block, setting.parameter->key, value);
}

SettingLimits SettingsBlock::GetLimits(const Setting& setting) const {
    SettingLimits limits;
    if (const auto list = GetList(block, setting)) {
        limits.isList = true;
        limits.values = *list;
        return limits;
    }
    if (setting.kind == ValueKind::Switch) {
        limits.isList = true;
        limits.values = {0, 1};
        return limits;
    }
    limits.least = GetFamily(setting).least(block, setting.parameter->key);
    limits.greatest = GetFamily(setting).greatest(block, setting.parameter->key);
    return limits;
}

bool SettingsBlock::IsSame(const SettingsBlock& other) const {
    return std::memcmp(&block, &other.block, sizeof block) == 0;
}

bool IsSupported(const Camera& camera, const Setting& setting) {
    return GetFamily(setting).isSupported(camera.GetHandle(), setting.parameter->key) == zerrNone;
}

std::string DescribeMissing(const Camera& camera, const Setting& setting) {
    return fmt::format("this camera ({}) does not have the setting {}", camera.GetModelName(),
                       setting.name);
}

std::string DescribeLimits(const Setting& setting, const SettingLimits& limits) {
    if (limits.isList) {
        std::vector<std::string> values;
        for (const SettingValue value : limits.values)
            values.push_back(FormatValue(setting, value));
        return fmt::format("{}", fmt::join(values, ", "));
    }
    if (!limits.least || !limits.greatest) return {};
    return fmt::format("{} to {}", FormatValue(setting, *limits.least),
                       FormatValue(setting, *limits.greatest));
}

std::vector<SettingChange> FindChanges(const SettingsBlock& before, const SettingsBlock& after) {
    std::vector<SettingChange> changes;
    for (const Setting& setting : GetSettings()) {
        if (!setting.isStored) continue;
        const SettingChange change{&setting, before.Get(setting), after.Get(setting)};
        if (change.before != change.after) changes.push_back(change);
    }
    return changes;
}

}  // namespace ZentaraProgram
