#include <array>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <iterator>

#include "api/information_table.h"
#include "api/parameter_table.h"
#include "api/settings_block.h"
#include "diagnostics/key_names.h"
#include "diagnostics/log.h"
#include "diagnostics/log_state.h"
#include "imaging/image_formats.h"

namespace ZV {

namespace {

/// A value with what its line shows around it.
struct LoggedValue {
    const char* label;
    const char* unit;
    std::span<const ValueName> names;
    std::uint64_t number;
    char digits[24];  ///< The number in decimals, with the sign of its type.
};

template <typename Value>
LoggedValue MakeLoggedValue(const char* label, const char* unit, std::span<const ValueName> names,
                            Value value) {
    LoggedValue logged{label, unit, names, static_cast<std::uint64_t>(value), {}};
    std::to_chars(std::begin(logged.digits), std::end(logged.digits) - 1, value);
    return logged;
}

void WriteNumber(const LoggedValue& value) {
    ZLogWrite("%s: %s", value.label, value.digits);
}

void WriteWithUnit(const LoggedValue& value) {
    ZLogWrite("%s: %s %s", value.label, value.digits, value.unit);
}

void WriteNamed(const LoggedValue& value) {
    const char* const name = FindValueName(value.names, static_cast<std::uint32_t>(value.number));
    ZLogWrite("%s: %s (%s)", value.label, value.digits, name);
}

void WriteImageFormat(const LoggedValue& value) {
    const char* const label = GetImageFormatLabel(static_cast<std::uint32_t>(value.number));
    ZLogWrite("%s: %s (%s)", value.label, value.digits, label);
}

void WriteMicroseconds(const LoggedValue& value) {
    ZLogWrite("%s: %s us (%.1f ms)", value.label, value.digits,
              static_cast<double>(value.number) / 1000.0);
}

void WriteNanoseconds(const LoggedValue& value) {
    ZLogWrite("%s: %s ns (%.1f ms)", value.label, value.digits,
              static_cast<double>(value.number) / 1000000.0);
}

void WriteCelsius(const LoggedValue& value) {
    ZLogWrite("%s: %s C", value.label, value.digits);
}

// Kept: the log's own speeds. A camera has no 1, 24 and 48 MHz under these indices.
void WriteMegahertz(const LoggedValue& value) {
    static constexpr std::array Speeds{20.0, 10.0, 5.0, 2.5, 1.0, 24.0, 48.0, 40.0, 30.0};
    const double speed = value.number < Speeds.size() ? Speeds[value.number] : 0.0;
    ZLogWrite("%s: %.1f MHz", value.label, speed);
}

struct FormWriter {
    LogForm form;
    void (*write)(const LoggedValue& value);
};

constexpr std::array FormWriters{
    FormWriter{LogForm::Number, WriteNumber},
    FormWriter{LogForm::WithUnit, WriteWithUnit},
    FormWriter{LogForm::Named, WriteNamed},
    FormWriter{LogForm::ImageFormat, WriteImageFormat},
    FormWriter{LogForm::Microseconds, WriteMicroseconds},
    FormWriter{LogForm::Nanoseconds, WriteNanoseconds},
    FormWriter{LogForm::Celsius, WriteCelsius},
    FormWriter{LogForm::Megahertz, WriteMegahertz},
};

void WriteByForm(LogForm form, const LoggedValue& value) {
    for (const FormWriter& row : FormWriters) {
        if (row.form == form) row.write(value);
    }
}

bool AreSettingsShown() {
    return logState.outputEnabled != 0 && logState.outputSettings != 0 && !IsNestedCallHidden();
}

template <typename Value>
void WriteSetting(const ParameterRow<Value>* row, Value value, const char* unknown) {
    if (!AreSettingsShown()) return;
    if (row == nullptr || row->log.label == nullptr) {
        ZLogWrite("%s", unknown);
        return;
    }
    WriteByForm(row->log.form,
                MakeLoggedValue(row->log.label, row->text.unit, row->text.values, value));
}

}  // namespace

void ZentaraDebugOutputSetting32(std::uint32_t key, std::uint32_t value) {
    WriteSetting(FindWordParameter(key), value,
                 "ZentaraDebugOutputSetting32() - Unknown parameter");
}

void ZentaraDebugOutputSettingS32(std::uint32_t key, std::int32_t value) {
    WriteSetting(FindSignedParameter(key), value,
                 "ZentaraDebugOutputSettingS32() - Unknown parameter");
}

void ZentaraDebugOutputSetting64(std::uint32_t key, std::uint64_t value) {
    WriteSetting(FindWideParameter(key), value,
                 "ZentaraDebugOutputSetting64() - Unknown parameter");
}

void ZentaraDebugOutputGetInfo(std::uint32_t key, std::uint32_t value) {
    if (logState.outputEnabled == 0 || logState.outputGetInfo == 0) return;
    const InformationRow* const row = FindInformationRow(key);
    if (row == nullptr) {
        ZLogWrite("ZentaraDebugOutputGetInfo() - Unknown parameter");
        return;
    }
    WriteByForm(row->form, MakeLoggedValue(row->label, row->unit, row->values, value));
}

void ZLogSettingsBlock(const char*, const Zentara_Settings& block) {
    if (!AreSettingsShown()) return;
    ZLogWrite("Zentara_Settings structure:");
    for (const WordParameter& row : GetWordParameters()) {
        ZentaraDebugOutputSetting32(row.key, GetSettingsWord(block, row.key));
    }
    for (const SignedParameter& row : GetSignedParameters()) {
        ZentaraDebugOutputSettingS32(row.key, GetSettingsSigned(block, row.key));
    }
    for (const WideParameter& row : GetWideParameters()) {
        ZentaraDebugOutputSetting64(row.key, GetSettingsWide(block, row.key));
    }
}

// Kept: the words alone are looked at, so a change of a signed or a 64-bit value is "Nothing"; and
// in a nested call that is not shown the words that differ are left out below their heading.
void ZLogSettingsChanged(const char*, const Zentara_Settings& former,
                         const Zentara_Settings& present) {
    if (logState.outputEnabled == 0 || logState.outputSettings == 0) return;
    ZLogWrite("Settings that changed:");
    bool isAnyChanged = false;
    for (const WordParameter& row : GetWordParameters()) {
        const std::uint32_t value = GetSettingsWord(present, row.key);
        if (value == GetSettingsWord(former, row.key)) continue;
        ZentaraDebugOutputSetting32(row.key, value);
        isAnyChanged = true;
    }
    if (!isAnyChanged) ZLogWrite("Nothing");
}

void ZLogFrame(const char*, const Zentara_Frame& frame) {
    if (logState.outputEnabled == 0 || logState.outputFrame == 0) return;
    struct FrameLine {
        const char* label;
        std::uint32_t value;
    };
    const FrameLine lines[] = {
        {"Buffer size", frame.bufferSize},
        {"Format", frame.format},
        {"Width", frame.width},
        {"Height", frame.height},
        {"Size", frame.size},
        {"Bit Depth", frame.bits},
        {"Frame Number", frame.frameNumber},
        {"Bayer Pattern", frame.bayerPattern},
        {"Error Code", frame.errorCode},
        {"Time Stamp", frame.timeStamp},
    };
    ZLogWrite("Zentara_Frame structure:");
    // Kept: the low 32 bits of the address.
    ZLogWrite("pBuffer: %x",
              static_cast<std::uint32_t>(reinterpret_cast<std::uintptr_t>(frame.pBuffer)));
    for (const FrameLine& line : lines) ZLogWrite("%s: %u", line.label, line.value);
}

// Kept: each line shows the running index of its entry, not the entry.
void ZLogSparseTable(const char*, std::uint32_t key, const std::uint32_t*, std::uint32_t count) {
    if (logState.outputEnabled == 0 || logState.outputSparseTable == 0) return;
    if (IsNestedCallHidden()) return;
    ZLogWrite("Sparse Table for %s:", GetKeyName32(key));
    for (std::uint32_t index = 0; index < count; ++index) ZLogWrite("%u", index);
}

}  // namespace ZV
