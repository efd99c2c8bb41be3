#pragma once

#include <cstdint>
#include <optional>
#include <vector>

#include "api/parameter_table.h"
#include "api/settings_units.h"
#include "camera/camera.h"

/// Building blocks of the parameter rows: each makes one function of a row from an operation of the
/// camera. A negative value goes into an unsigned word bit by bit.
namespace ZV {

template <typename Value, auto Operation>
Value Read(const SettingsSource& source) {
    return static_cast<Value>((source.camera.*Operation)());
}

template <auto Operation>
std::uint32_t ReadMicroseconds(const SettingsSource& source) {
    return ConvertNanosecondsToMicroseconds((source.camera.*Operation)());
}

template <typename Value, Value Constant>
Value GiveInitial(const SettingsSource&) {
    return Constant;
}

template <typename Value, auto Operation>
std::optional<Value> Ask(ZCamera& camera) {
    return static_cast<Value>((camera.*Operation)());
}

template <auto Operation>
std::optional<std::uint32_t> AskMicroseconds(ZCamera& camera) {
    return ConvertNanosecondsToMicroseconds((camera.*Operation)());
}

template <typename Value, Value Constant>
std::optional<Value> Give(ZCamera&) {
    return Constant;
}

inline bool Always(ZCamera&) {
    return true;
}

inline bool Never(ZCamera&) {
    return false;
}

template <auto Operation>
bool Has(ZCamera& camera) {
    return (camera.*Operation)();
}

template <std::uint32_t... Constants>
void ListValues(ZCamera&, std::vector<std::uint32_t>& values) {
    (values.push_back(Constants), ...);
}

/// `Mode` is the element type of the operation's list.
template <typename Mode, auto Operation>
void ListModes(ZCamera& camera, std::vector<std::uint32_t>& values) {
    std::vector<Mode> modes;
    (camera.*Operation)(modes);
    values.insert(values.end(), modes.begin(), modes.end());
}

}  // namespace ZV
