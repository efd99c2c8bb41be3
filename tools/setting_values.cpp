#include "setting_values.h"

#include <fmt/format.h>

#include <algorithm>
#include <array>
#include <charconv>
#include <limits>

namespace ZentaraProgram {
namespace {

/// A unit that a value may be written with: 10 to the power `exponent` steps of the key.
struct UnitRow {
    std::string_view steps;  ///< The key's own unit.
    std::string_view symbol;
    int exponent;
};
// The first symbol of an exponent is the one that is printed.
constexpr std::array Units{
    UnitRow{"ns", "ns", 0},        UnitRow{"ns", "us", 3},
    UnitRow{"ns", "\u00B5s", 3},   UnitRow{"ns", "\u03BCs", 3},
    UnitRow{"ns", "ms", 6},        UnitRow{"ns", "s", 9},
    UnitRow{"us", "us", 0},        UnitRow{"us", "\u00B5s", 0},
    UnitRow{"us", "\u03BCs", 0},   UnitRow{"us", "ms", 3},
    UnitRow{"us", "s", 6},         UnitRow{"millionths of a dB", "dB", 6},
    UnitRow{"millionths", "x", 6}, UnitRow{"thousandths", "x", 3},
    UnitRow{"degrees C", "C", 0},  UnitRow{"degrees C", "\u00B0C", 0},
    UnitRow{"pixels", "px", 0},    UnitRow{"pixels", "pixels", 0},
    UnitRow{"bytes", "bytes", 0},  UnitRow{"bits", "bits", 0},
};

std::vector<UnitRow> GetUnits(const Setting& setting) {
    std::vector<UnitRow> units;
    std::copy_if(Units.begin(), Units.end(), std::back_inserter(units),
                 [&](const UnitRow& row) { return row.steps == setting.parameter->unit; });
    return units;
}

/// The unit of a number without one: that of the first row.
int GetPlainExponent(const std::vector<UnitRow>& units) {
    return units.empty() ? 0 : units.front().exponent;
}

std::string DescribeUnits(const std::vector<UnitRow>& units) {
    std::vector<std::string_view> symbols;
    for (const UnitRow& row : units) {
        const bool isAscii = std::all_of(row.symbol.begin(), row.symbol.end(),
                                         [](char c) { return static_cast<signed char>(c) > 0; });
        if (isAscii) symbols.push_back(row.symbol);
    }
    return fmt::format("{}", fmt::join(symbols, ", "));
}

bool IsDigit(char c) {
    return c >= '0' && c <= '9';
}

bool IsBlank(char c) {
    return c == ' ' || c == '\t';
}

std::string_view Trim(std::string_view text) {
    while (!text.empty() && IsBlank(text.front())) text.remove_prefix(1);
    while (!text.empty() && IsBlank(text.back())) text.remove_suffix(1);
    return text;
}

/// A number as it is written: its digits, how many of them stand behind the point, and what
/// follows.
struct WrittenNumber {
    bool isNegative = false;
    std::string digits;
    int places = 0;
    std::string_view rest;
};

std::size_t TakeDigits(std::string_view* text, std::string* digits) {
    const std::size_t before = digits->size();
    while (!text->empty() && IsDigit(text->front())) {
        *digits += text->front();
        text->remove_prefix(1);
    }
    return digits->size() - before;
}

/// "e-3" behind a number moves its point. Nothing happens when no number follows the e.
void TakeExponent(WrittenNumber* number) {
    constexpr int GreatestExponent = 100;
    std::string_view text = number->rest;
    if (text.empty() || (text.front() != 'e' && text.front() != 'E')) return;
    text.remove_prefix(1);
    if (!text.empty() && text.front() == '+') text.remove_prefix(1);
    int exponent = 0;
    const auto [end, problem] = std::from_chars(text.data(), text.data() + text.size(), exponent);
    if (problem != std::errc{} || exponent < -GreatestExponent || exponent > GreatestExponent)
        return;
    number->places -= exponent;
    number->rest = text.substr(static_cast<std::size_t>(end - text.data()));
}

std::optional<WrittenNumber> ReadNumber(std::string_view text) {
    WrittenNumber number;
    if (!text.empty() && (text.front() == '-' || text.front() == '+')) {
        number.isNegative = text.front() == '-';
        text.remove_prefix(1);
    }
    std::size_t count = TakeDigits(&text, &number.digits);
    if (!text.empty() && text.front() == '.') {
        text.remove_prefix(1);
        const std::size_t places = TakeDigits(&text, &number.digits);
        number.places = static_cast<int>(places);
        count += places;
    }
    if (count == 0) return std::nullopt;
    number.rest = text;
    TakeExponent(&number);
    number.rest = Trim(number.rest);
    return number;
}

/// The number times 10 to the power `exponent`, exactly. Nothing when it is not whole (`isFine`
/// becomes true) or too large.
std::optional<SettingValue> Scale(const WrittenNumber& number, int exponent, bool* isFine) {
    constexpr int MostZeros = 40;
    std::string digits = number.digits;
    int shift = exponent - number.places;
    for (; shift < 0 && !digits.empty(); ++shift) {
        *isFine = *isFine || digits.back() != '0';
        digits.pop_back();
    }
    if (*isFine) return std::nullopt;
    digits.erase(0, digits.find_first_not_of('0'));
    if (digits.empty()) return 0;
    digits.append(static_cast<std::size_t>(std::min(shift, MostZeros)), '0');
    if (number.isNegative) digits.insert(0, 1, '-');
    SettingValue value = 0;
    const auto [end, problem] =
        std::from_chars(digits.data(), digits.data() + digits.size(), value);
    return problem == std::errc{} ? std::optional(value) : std::nullopt;
}

ParsedValue Refuse(const Setting& setting, const std::string& reason) {
    return {std::nullopt, fmt::format("{}: {}", setting.name, reason)};
}

std::string FoldCase(std::string_view text) {
    std::string folded(text);
    std::transform(folded.begin(), folded.end(), folded.begin(), [](char c) {
        return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
    });
    return folded;
}

const UnitRow* FindUnit(const std::vector<UnitRow>& units, std::string_view symbol) {
    const auto found = std::find_if(units.begin(), units.end(), [&](const UnitRow& row) {
        return FoldCase(row.symbol) == FoldCase(symbol);
    });
    return found == units.end() ? nullptr : &*found;
}

ParsedValue ParseNumber(const Setting& setting, std::string_view text) {
    const std::vector<UnitRow> units = GetUnits(setting);
    const std::optional<WrittenNumber> number = ReadNumber(text);
    if (!number) return Refuse(setting, fmt::format("'{}' is not a number", text));
    int exponent = GetPlainExponent(units);
    if (!number->rest.empty()) {
        const UnitRow* unit = FindUnit(units, number->rest);
        if (unit == nullptr && units.empty())
            return Refuse(setting, fmt::format("'{}' is not a number", text));
        if (unit == nullptr)
            return Refuse(setting, fmt::format("'{}' is not a unit of it; its units are {}",
                                               number->rest, DescribeUnits(units)));
        exponent = unit->exponent;
    }
    bool isFine = false;
    const std::optional<SettingValue> value = Scale(*number, exponent, &isFine);
    if (isFine) {
        return Refuse(setting, fmt::format("'{}' is finer than its steps of {}", text,
                                           FormatValue(setting, 1)));
    }
    if (!value) return Refuse(setting, fmt::format("'{}' is out of range", text));
    if (setting.kind == ValueKind::Time && number->rest.empty() && *value != 0) {
        return Refuse(setting, fmt::format("'{}' needs a unit: {}", text, DescribeUnits(units)));
    }
    return {value, {}};
}

ParsedValue ParseSwitch(const Setting& setting, std::string_view text) {
    struct Word {
        std::string_view text;
        SettingValue value;
    };
    constexpr std::array Words{Word{"on", 1},  Word{"true", 1},  Word{"yes", 1}, Word{"1", 1},
                               Word{"off", 0}, Word{"false", 0}, Word{"no", 0},  Word{"0", 0}};
    for (const Word& word : Words) {
        if (FoldCase(text) == word.text) return {word.value, {}};
    }
    return Refuse(setting, fmt::format("'{}' is neither on nor off", text));
}

std::vector<ValueName> GetNamedValues(const Setting& setting) {
    std::vector<ValueName> values;
    for (const ValueName& row : setting.parameter->values) {
        if (row.name != nullptr) values.push_back(row);
    }
    return values;
}

/// "Mono 16-Bit" and "mono16" alike, "RTV Mode" and "rtv".
std::string SimplifyValue(std::string_view text) {
    std::string simple = Simplify(text);
    for (const std::string_view ending : {"bit", "mode"}) {
        if (simple.size() > ending.size() && simple.ends_with(ending))
            simple.resize(simple.size() - ending.size());
    }
    return simple;
}

/// A number stands for a value without a name alone: of others it is not clear whether their place
/// or what they mean is meant.
std::optional<SettingValue> ReadNameless(const std::vector<ValueName>& names,
                                         std::string_view text) {
    std::uint32_t value = 0;
    const auto [end, problem] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (problem != std::errc{} || end != text.data() + text.size()) return std::nullopt;
    const bool hasName = std::any_of(names.begin(), names.end(),
                                     [&](const ValueName& row) { return row.value == value; });
    return hasName ? std::nullopt : std::optional<SettingValue>(value);
}

ParsedValue ParseChoice(const Setting& setting, std::string_view text) {
    const std::vector<ValueName> names = GetNamedValues(setting);
    for (const ValueName& row : names) {
        if (SimplifyValue(row.name) == SimplifyValue(text)) return {row.value, {}};
    }
    if (const auto value = ReadNameless(names, text)) return {value, {}};
    return Refuse(setting, fmt::format("'{}' is not a value of it; its values are {}", text,
                                       fmt::join(GetValueNames(setting), ", ")));
}

ParsedValue ParseRegister(const Setting& setting, std::string_view text) {
    const bool isHexadecimal = text.starts_with("0x") || text.starts_with("0X");
    const std::string_view digits = isHexadecimal ? text.substr(2) : text;
    std::uint32_t value = 0;
    const auto [end, problem] = std::from_chars(digits.data(), digits.data() + digits.size(), value,
                                                isHexadecimal ? 16 : 10);
    if (problem == std::errc{} && end == digits.data() + digits.size()) return {value, {}};
    return Refuse(setting, fmt::format("'{}' is not a word of 32 bits", text));
}

/// The value over 10 to the power `exponent`, with as many decimals as it needs.
std::string FormatScaled(SettingValue value, int exponent) {
    const auto places = static_cast<std::size_t>(exponent);
    std::string digits = fmt::format("{:0{}}", value, places + (value < 0 ? 2 : 1));
    if (places == 0) return digits;
    std::string decimals = digits.substr(digits.size() - places);
    digits.resize(digits.size() - places);
    decimals.resize(decimals.find_last_not_of('0') + 1);
    return decimals.empty() ? digits : digits + "." + decimals;
}

std::string FormatNumber(const Setting& setting, SettingValue value) {
    const std::vector<UnitRow> units = GetUnits(setting);
    if (units.empty()) return fmt::format("{}", value);
    UnitRow shown = units.front();
    SettingValue step = 1;
    for (int exponent = 0; exponent <= 9; ++exponent, step *= 10) {
        const auto unit = std::find_if(units.begin(), units.end(), [&](const UnitRow& row) {
            return row.exponent == exponent;
        });
        const bool isReached = value >= step || value <= -step;
        if (unit != units.end() && isReached) shown = *unit;
    }
    return fmt::format("{} {}", FormatScaled(value, shown.exponent), shown.symbol);
}

std::string FormatChoice(const Setting& setting, SettingValue value) {
    for (const ValueName& row : GetNamedValues(setting)) {
        if (row.value == value) return row.name;
    }
    return fmt::format("{}", value);
}

std::string FormatSwitch(const Setting&, SettingValue value) {
    return value != 0 ? "on" : "off";
}

std::string FormatRegister(const Setting&, SettingValue value) {
    return fmt::format("0x{:08X}", value);
}

struct KindRow {
    ValueKind kind;
    ParsedValue (*parse)(const Setting&, std::string_view);
    std::string (*format)(const Setting&, SettingValue);
};
constexpr std::array Kinds{
    KindRow{ValueKind::Number, ParseNumber, FormatNumber},
    KindRow{ValueKind::Time, ParseNumber, FormatNumber},
    KindRow{ValueKind::Switch, ParseSwitch, FormatSwitch},
    KindRow{ValueKind::Choice, ParseChoice, FormatChoice},
    KindRow{ValueKind::Register, ParseRegister, FormatRegister},
};

const KindRow& GetKind(const Setting& setting) {
    return *std::find_if(Kinds.begin(), Kinds.end(),
                         [&](const KindRow& row) { return row.kind == setting.kind; });
}

}  // namespace

ParsedValue ParseValue(const Setting& setting, std::string_view text) {
    return GetKind(setting).parse(setting, Trim(text));
}

std::string FormatValue(const Setting& setting, SettingValue value) {
    return GetKind(setting).format(setting, value);
}

bool IsPlainNumber(const Setting& setting) {
    if (setting.kind != ValueKind::Number) return false;
    const std::vector<UnitRow> units = GetUnits(setting);
    return units.empty() || units.front().steps == "pixels";
}

std::vector<std::string> GetValueNames(const Setting& setting) {
    std::vector<std::string> names;
    for (const ValueName& row : GetNamedValues(setting)) names.emplace_back(row.name);
    return names;
}

}  // namespace ZentaraProgram
