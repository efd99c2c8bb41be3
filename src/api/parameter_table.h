#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include "api/camera_context.h"
#include "camera/camera.h"
#include "zentara/zentara.h"

namespace ZV {

/// The parameters of a settings block: one row per key in each of the three families, with
/// everything that is known of the key. Reading, defaults, accessors, capability tables, the log
/// and the generated documentation all go by these rows.

/// A value of an enumerated parameter with its name.
struct ValueName {
    std::uint32_t value;
    const char* name;
};

/// The name of `value`; "Unknown" for one without.
[[nodiscard]] const char* FindValueName(std::span<const ValueName> names, std::uint32_t value);

/// What a person is told of a key.
struct ParameterText {
    const char* name;     ///< As in zentara.h.
    const char* unit;     ///< "" where a value is a plain number or a choice.
    const char* range;    ///< Where a client's choice is bounded, in words.
    const char* meaning;  ///< One line.
    std::span<const ValueName> values = {};
};

/// How the log words a value behind its label.
enum class LogForm {
    Number,        ///< "Gain: 7"
    WithUnit,      ///< "Trigger Delay: 500 ns", by the row's unit.
    Named,         ///< "SyncB: 1 (Expose)", by the row's value names.
    ImageFormat,   ///< "Image Format: 2 (Mono 8-Bit)", by the labels of the formats.
    Microseconds,  ///< "Exposure: 1500 us (1.5 ms)"
    Nanoseconds,   ///< "Exposure (64-bit): 1500000 ns (1.5 ms)"
    Celsius,       ///< "Regulated Cooling Temp: -10 C"
    Megahertz,     ///< "Readout Speed: 20.0 MHz", by the log's own table of speeds.
};

struct ParameterLog {
    /// Null: the dump calls the key unknown.
    const char* label = nullptr;
    LogForm form = LogForm::Number;
    /// Whether the log's table of key names has it.
    bool isNamed = true;
};

/// Entries of a list that are looked at when a value is checked against it.
inline constexpr std::int32_t CheckedListEntries = 30;

/// Where a block's values come from.
struct SettingsSource {
    ZCamera& camera;
    CameraContext& context;
};

/// Least or greatest value of a key on a camera; nothing where it would be of an empty list.
template <typename Value>
using ParameterLimit = std::optional<Value> (*)(ZCamera& camera);

/// Null for a key without limits.
template <typename Value>
struct ParameterLimits {
    ParameterLimit<Value> least = nullptr;
    ParameterLimit<Value> greatest = nullptr;
};

/// What Zentara_GetParam... answers for a key; null in a row for the stored word.
template <typename Value>
using ParameterGetter = ZentaraResult (*)(const Zentara_Settings& block, ZCamera& camera,
                                          Value* value);

/// What Zentara_SetParam... does for a key; null in a row for the family's general rule.
template <typename Value>
using ParameterSetter = ZentaraResult (*)(Zentara_Settings& block, ZCamera& camera,
                                          std::uint32_t key, Value value);

template <typename Value>
struct ParameterRow {
    std::uint32_t key;
    ParameterText text;
    ParameterLog log = {};
    /// The camera's present value; null for a word that reading leaves alone.
    Value (*read)(const SettingsSource& source) = nullptr;
    /// The default; null for 0.
    Value (*initial)(const SettingsSource& source) = nullptr;
    bool (*isSupported)(ZCamera& camera) = nullptr;
    ParameterLimits<Value> limits = {};
    bool hasRange = false;
    /// Appends the allowed values in the order in which a client sees them; null for no list.
    void (*list)(ZCamera& camera, std::vector<Value>& values) = nullptr;
    ParameterGetter<Value> get = nullptr;
    ParameterSetter<Value> set = nullptr;
};

using WordParameter = ParameterRow<std::uint32_t>;
using SignedParameter = ParameterRow<std::int32_t>;
using WideParameter = ParameterRow<std::uint64_t>;

/// All rows of a family, row k being key k.
[[nodiscard]] std::span<const WordParameter> GetWordParameters();
[[nodiscard]] std::span<const SignedParameter> GetSignedParameters();
[[nodiscard]] std::span<const WideParameter> GetWideParameters();

/// The row of a key; null beyond the family's last.
[[nodiscard]] const WordParameter* FindWordParameter(std::uint32_t key);
[[nodiscard]] const SignedParameter* FindSignedParameter(std::uint32_t key);
[[nodiscard]] const WideParameter* FindWideParameter(std::uint32_t key);

}  // namespace ZV
