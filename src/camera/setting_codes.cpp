#include "camera/setting_codes.h"

#include <algorithm>
#include <array>
#include <cstddef>

#include "camera/gain_conversion.h"

namespace ZV {

namespace {

constexpr std::array Frequencies{20.0F, 10.0F, 5.0F, 2.5F, 25.0F, 30.0F, 35.0F, 40.0F};

struct ValueCode {
    std::uint32_t value;
    std::uint32_t code;
};
// Kept: code 2 (12 bits) is never written; a depth of 12 reads back as the camera's greatest.
constexpr std::array DepthCodes{ValueCode{8, 0}, ValueCode{10, 1}, ValueCode{12, 1},
                                ValueCode{14, 3}, ValueCode{16, 1}};
constexpr std::array BinningCodes{ValueCode{1, 0}, ValueCode{2, 1}, ValueCode{3, 2},
                                  ValueCode{4, 3}, ValueCode{8, 2}};

struct TriggerRow {
    std::uint32_t mode;
    TriggerCode code;
    std::uint32_t doubleShotType;  ///< Type in place of the code's while double shot is on.
};
constexpr std::array TriggerRows{TriggerRow{1, {2, 0}, 4}, TriggerRow{2, {2, 1}, 4},
                                 TriggerRow{3, {3, 0}, 3}, TriggerRow{4, {3, 1}, 3},
                                 TriggerRow{5, {1, 0}, 1}, TriggerRow{6, {5, 0}, 5},
                                 TriggerRow{7, {5, 1}, 5}};
constexpr std::uint32_t SoftwareTriggerType = 1;
constexpr std::uint32_t SoftwareTriggerMode = 5;

constexpr float CelsiusPerCode = 0.025634765625F;
constexpr float CodesPerCelsius = 39.0095253F;
constexpr double CloseDelayStep = 6.4;
constexpr std::int64_t GreatestWord = 0xFFFFFFFF;

std::optional<std::uint32_t> FindCode(const auto& table, std::uint32_t value) {
    for (const ValueCode& row : table) {
        if (row.value == value) return row.code;
    }
    return std::nullopt;
}

double ConvertResolution(std::uint32_t resolution) {
    return static_cast<double>(static_cast<float>(resolution) / 1000000.0F);
}

}  // namespace

float ConvertCodeToFrequency(std::uint32_t code) {
    return code < Frequencies.size() ? Frequencies[code] : 0.0F;
}

std::optional<std::uint32_t> FindFrequencyCode(float megahertz) {
    for (std::size_t code = 0; code < Frequencies.size(); ++code) {
        if (Frequencies[code] == megahertz) return static_cast<std::uint32_t>(code);
    }
    return std::nullopt;
}

std::optional<std::uint32_t> FindBitDepthCode(std::uint32_t bits) {
    return FindCode(DepthCodes, bits);
}

std::optional<std::uint32_t> FindBinningCode(std::uint32_t mode) {
    return FindCode(BinningCodes, mode);
}

std::uint16_t ConvertCodeToBinning(std::uint32_t code, bool isCode2Mode8) {
    constexpr std::array<std::uint16_t, 4> Modes{1, 2, 3, 4};
    if (code == 2 && isCode2Mode8) return 8;
    return Modes[code % Modes.size()];
}

TriggerCode FindTriggerCode(std::uint32_t mode, bool isDoubleShot) {
    for (const TriggerRow& row : TriggerRows) {
        if (row.mode != mode) continue;
        return {isDoubleShot ? row.doubleShotType : row.code.type, row.code.polarity};
    }
    return {0, 0};
}

std::uint32_t FindTriggerMode(TriggerCode code) {
    if (code.type == SoftwareTriggerType) return SoftwareTriggerMode;
    for (const TriggerRow& row : TriggerRows) {
        const bool isType = code.type == row.code.type || code.type == row.doubleShotType;
        if (isType && code.polarity == row.code.polarity) return row.mode;
    }
    return 0;
}

void AppendTriggerModes(std::uint32_t lastMode, bool isFilterCycling,
                        std::vector<std::uint32_t>& modes) {
    if (isFilterCycling) {
        modes.push_back(0);
        modes.push_back(SoftwareTriggerMode);
        return;
    }
    for (std::uint32_t mode = 0; mode <= lastMode; ++mode) modes.push_back(mode);
}

std::int32_t ConvertTemperatureCode(std::uint32_t code) {
    const auto absolute = static_cast<double>(static_cast<float>(code) * CelsiusPerCode);
    const auto celsius = static_cast<std::int32_t>(absolute - 55.0);
    return celsius < CoolingCelsiusMin || celsius > CoolingReadingMax ? 0 : celsius;
}

std::uint32_t ConvertCelsiusToCode(std::int32_t celsius) {
    // Kept: a set point above 0 reads back one degree lower.
    const auto codes =
        static_cast<double>(static_cast<float>(celsius - CoolingCelsiusMin) * CodesPerCelsius);
    return static_cast<std::uint32_t>(TruncateWithin(codes - 0.5, 0, 0xFFFF));
}

std::uint32_t ConvertVClockCount(std::uint32_t count, std::uint32_t resolution) {
    if (resolution == 0) return 0;
    const double period = count / ConvertResolution(resolution) * 1000;
    return static_cast<std::uint32_t>(TruncateWithin(period, 0, GreatestWord));
}

std::uint32_t ConvertVClockPeriod(std::uint32_t nanoseconds, std::uint32_t resolution) {
    const double count = nanoseconds / 1000.0 * ConvertResolution(resolution);
    return static_cast<std::uint32_t>(TruncateWithin(count, 0, INT64_MAX)) & 0xFFFF;
}

std::uint32_t ConvertCloseDelayCode(std::uint32_t code) {
    return static_cast<std::uint32_t>(code * CloseDelayStep);
}

std::uint32_t ConvertCloseDelay(std::uint32_t delay) {
    return static_cast<std::uint32_t>(delay / CloseDelayStep);
}

std::uint32_t ConvertToMicroseconds(std::uint64_t nanoseconds) {
    return static_cast<std::uint32_t>(
        std::clamp<std::uint64_t>(nanoseconds / 1000, 1, GreatestWord));
}

}  // namespace ZV
