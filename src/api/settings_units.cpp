#include "api/settings_units.h"

#include <array>

namespace ZV {

namespace {

constexpr std::uint32_t WordMax = 0xFFFFFFFF;

struct SpeedRow {
    std::uint32_t index;
    float megahertz;
};

// Kept: 25 and 35 MHz have no index, so a camera that runs at one of them reads as 20 MHz.
constexpr std::array Speeds{
    SpeedRow{0, 20.0F}, SpeedRow{1, 10.0F}, SpeedRow{2, 5.0F},
    SpeedRow{3, 2.5F},  SpeedRow{7, 40.0F}, SpeedRow{8, 30.0F},
};

}  // namespace

std::uint32_t ConvertNanosecondsToMicroseconds(std::uint64_t nanoseconds) {
    const std::uint64_t microseconds = nanoseconds / 1000;
    if (microseconds == 0) return 1;
    if (microseconds >= WordMax) return WordMax;
    return static_cast<std::uint32_t>(microseconds);
}

std::uint64_t ConvertMicrosecondsToNanoseconds(std::uint32_t microseconds) {
    return std::uint64_t{1000} * microseconds;
}

std::uint32_t ConvertMegahertzToSpeedIndex(float megahertz) {
    return FindSpeedIndex(megahertz).value_or(0);
}

std::optional<std::uint32_t> FindSpeedIndex(float megahertz) {
    for (const SpeedRow& row : Speeds) {
        if (row.megahertz == megahertz) return row.index;
    }
    return std::nullopt;
}

float ConvertSpeedIndexToMegahertz(std::uint32_t index) {
    for (const SpeedRow& row : Speeds) {
        if (row.index == index) return row.megahertz;
    }
    return 0.0F;
}

// Kept: single precision; 1.16 gives 1160, which double precision would make 1159.
std::uint32_t ConvertScaleToThousandths(float scale) {
    const float thousandths = scale * 1000.0F;
    if (!(thousandths > 0.0F)) return 0;
    if (thousandths >= 4294967296.0F) return WordMax;
    return static_cast<std::uint32_t>(thousandths);
}

}  // namespace ZV
