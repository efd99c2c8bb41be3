#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace ZentaraProgram {

/// The three groups of keys of a settings block, and what Zentara_GetInfo answers.
enum class ParameterFamily { Word, Signed, Wide, Information };

struct ValueName {
    std::uint32_t value;
    const char* name;  ///< Null behind the last one.
};

/// What is known of a key, from the library's own table.
struct ParameterName {
    static constexpr std::size_t MaximalValueNames = 32;

    ParameterFamily family;
    std::uint32_t key;
    const char* name;
    const char* unit;
    const char* meaning;
    ValueName values[MaximalValueNames];
};

/// How a value is written.
enum class ValueKind {
    Number,   ///< A decimal number, with its unit or without.
    Time,     ///< A decimal number whose unit must be told.
    Switch,   ///< on, off
    Choice,   ///< One of the value names.
    Register  ///< A whole number, decimal or with 0x.
};

/// One setting as the program knows it.
struct Setting {
    const ParameterName* parameter;
    std::string name;      ///< As users write it: "roi-width".
    std::string ruleName;  ///< The key's name without its prefix; the same for most.
    ValueKind kind;
    bool isStored;  ///< Part of a settings file: no other key says the same.
};

/// All rows of the library's table.
std::span<const ParameterName> GetParameterNames();

/// All settings, in the order of the families and of their keys.
std::span<const Setting> GetSettings();

/// The setting of a name, an alias or a key of the header; null for none. Case and dashes do not
/// count.
const Setting* FindSetting(std::string_view name);

/// The setting of a key.
const Setting& GetSetting(ParameterFamily family, std::uint32_t key);

/// "zprmRoiWidth" becomes "roi-width".
std::string MakeName(std::string_view keyName);

/// Lower case without dashes, underscores and blanks.
std::string Simplify(std::string_view name);

/// Those of `known` that are most like `name`, the nearest first; at most three, or none.
std::vector<std::string> FindNearest(std::string_view name, std::span<const std::string> known);

/// "unknown setting 'exposre'; did you mean exposure?"
std::string DescribeUnknown(std::string_view what, std::string_view name,
                            std::span<const std::string> known);
std::string DescribeUnknownSetting(std::string_view name);

}  // namespace ZentaraProgram
