#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "setting_names.h"

namespace ZentaraProgram {

/// A value in the steps of its key: nanoseconds, millionths of a dB, ... Values of 64 bits above
/// the greatest one count as that.
using SettingValue = std::int64_t;

/// The value that a text stands for, or why it stands for none.
struct ParsedValue {
    std::optional<SettingValue> value;
    std::string problem;  ///< With the name of the setting.
};

/// Reads "250ms", "3.5 dB", "640px", "on", "Mono 16-Bit", "mono16". What is finer than the steps of
/// the key is refused, not rounded.
ParsedValue ParseValue(const Setting& setting, std::string_view text);

/// Writes a value so that ParseValue reads the same: "250 ms", "3.5 dB", "640 px".
std::string FormatValue(const Setting& setting, SettingValue value);

/// True where a plain whole number, or true and false, say all there is to say.
bool IsPlainNumber(const Setting& setting);

/// The values' names, as far as there are any, in the order of the values.
std::vector<std::string> GetValueNames(const Setting& setting);

}  // namespace ZentaraProgram
