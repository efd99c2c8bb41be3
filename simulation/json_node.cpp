#include "simulation/json_node.h"

#include <charconv>
#include <cmath>
#include <set>
#include <vector>

namespace ZV::Simulation {
namespace {

using Json = nlohmann::json;

// Escapes of a JSON pointer's token.
std::string EscapeToken(const std::string& key) {
    std::string token;
    for (const char character : key) {
        if (character == '~')
            token += "~0";
        else if (character == '/')
            token += "~1";
        else
            token += character;
    }
    return token;
}

bool ParseWhole(const std::string& text, std::uint64_t* number) {
    const bool isHex = text.starts_with("0x") || text.starts_with("0X");
    const char* const first = text.data() + (isHex ? 2 : 0);
    const char* const last = text.data() + text.size();
    const auto [end, error] = std::from_chars(first, last, *number, isHex ? 16 : 10);
    return error == std::errc() && end == last && first != last;
}

bool ReadWhole(const Json& value, std::uint64_t* number) {
    if (value.is_number_unsigned()) {
        *number = value.get<std::uint64_t>();
        return true;
    }
    return value.is_string() && ParseWhole(value.get<std::string>(), number);
}

std::string PrintNumber(double number) {
    return Json(number).dump();
}

}  // namespace

void JsonNode::Fail(const std::string& reason) const {
    if (HasFailed()) return;
    failure->message = (pointer.empty() ? "/" : pointer) + ": " + reason;
}

JsonNode JsonNode::GetChild(const std::string& key) const {
    return {value.at(key), pointer + "/" + EscapeToken(key), failure};
}

JsonNode JsonNode::GetElement(std::size_t index) const {
    return {value.at(index), pointer + "/" + std::to_string(index), failure};
}

void JsonNode::Get(bool* target) const {
    if (!value.is_boolean()) return Fail("true or false is wanted");
    *target = value.get<bool>();
}

void JsonNode::Get(std::string* target) const {
    if (!value.is_string()) return Fail("a text is wanted");
    const auto text = value.get<std::string>();
    if (text.empty()) return Fail("the text is empty");
    if (text.find('\0') != std::string::npos) return Fail("the text holds a zero byte");
    *target = text;
}

void JsonNode::Get(double* target, double minimum, double maximum) const {
    if (!value.is_number()) return Fail("a number is wanted");
    const double number = value.get<double>();
    if (!std::isfinite(number) || number < minimum || number > maximum) {
        return Fail("is out of range, " + PrintNumber(minimum) + " to " + PrintNumber(maximum));
    }
    *target = number;
}

void JsonNode::GetWhole(std::uint64_t* target, std::uint64_t minimum, std::uint64_t maximum) const {
    std::uint64_t number = 0;
    const bool isNegative = value.is_number_integer() && !value.is_number_unsigned();
    if (!isNegative && !ReadWhole(value, &number)) return Fail("a whole number is wanted");
    if (isNegative || number < minimum || number > maximum) {
        return Fail("is out of range, " + std::to_string(minimum) + " to " +
                    std::to_string(maximum));
    }
    *target = number;
}

void JsonNode::GetChoice(std::size_t* target, std::span<const std::string_view> names) const {
    std::string wanted;
    for (std::size_t i = 0; i < names.size(); ++i) {
        if (value.is_string() && value.get<std::string>() == names[i]) {
            *target = i;
            return;
        }
        wanted += (i == 0 ? "" : ", ") + std::string(names[i]);
    }
    Fail("one of these is wanted: " + wanted);
}

bool JsonNode::CheckObject() const {
    if (!value.is_object()) Fail("an object is wanted");
    return !HasFailed();
}

bool JsonNode::CheckArray() const {
    if (!value.is_array()) Fail("a list is wanted");
    return !HasFailed();
}

bool ParseJson(const std::string& text, Json* document, std::string* message) {
    std::vector<std::set<std::string>> keys;
    std::string repeated;
    const auto note = [&](int, Json::parse_event_t event, Json& parsed) {
        if (event == Json::parse_event_t::object_start) keys.emplace_back();
        if (event == Json::parse_event_t::object_end) keys.pop_back();
        if (event != Json::parse_event_t::key) return true;
        const auto key = parsed.get<std::string>();
        if (!keys.back().insert(key).second && repeated.empty()) repeated = key;
        return true;
    };
    try {
        *document = Json::parse(text, note);
    } catch (const Json::exception& error) {
        const std::string what = error.what();
        const std::size_t begin = what.find("] ");
        *message = begin == std::string::npos ? what : what.substr(begin + 2);
        return false;
    }
    if (!repeated.empty()) *message = "the key \"" + repeated + "\" stands twice in one object";
    return repeated.empty();
}

}  // namespace ZV::Simulation
