#include "camera/packet_size.h"

#include <algorithm>

#include "camera/gain_conversion.h"

namespace ZV {

namespace {

constexpr std::uint16_t FixedFastBytes = 4980;
constexpr std::uint32_t RoundingDownFirmware = 102;
constexpr std::uint32_t EightKilobyteFirmware = 114;
constexpr std::uint16_t FastMegabits = 800;
constexpr std::int64_t FastBaseBytes = 8192;
constexpr std::int64_t GreatestBytes = 0xFFFF;

struct PacketRule {
    std::uint16_t fastestBytes;
    std::uint32_t lineTime;
};

PacketRule FindPacketRule(std::uint16_t fastest, std::uint32_t firmware) {
    const bool isLateFirmware = firmware >= EightKilobyteFirmware;
    if (isLateFirmware && fastest > 8180) return {8180, 70};
    if (fastest > 8192 && fastest <= 9056) return {fastest, 78};
    if (fastest > 5012 && fastest <= 8192) return {fastest, 70};
    if (isLateFirmware && fastest <= 4096) return {fastest, 35};
    if (isLateFirmware) return {fastest, 39};
    return {fastest, 40};
}

std::uint32_t FindUncutLineTime(std::uint16_t fastest) {
    if (fastest >= 8193 && fastest <= 9056) return 78;
    if (fastest > 5012 && fastest < 8193) return 70;
    return 40;
}

std::int64_t CountBytes(std::uint16_t bitDepth) {
    return (bitDepth + 7) / 8;
}

/// In single precision. Slowest readouts count as a little faster than they are.
std::int64_t ScaleSize(std::int64_t base, std::int64_t overhead, const ReadoutLoad& load,
                       std::uint32_t lineTime) {
    const float megahertz = load.megahertz == 2.5F ? 3.0F : load.megahertz;
    const auto bytes = static_cast<float>((base - overhead) * CountBytes(load.bitDepth));
    const std::uint32_t binning = std::max<std::uint32_t>(load.binning, 1);
    const float size =
        bytes * megahertz / static_cast<float>(binning * lineTime) + static_cast<float>(overhead);
    return TruncateWithin(static_cast<double>(size), 0, GreatestBytes);
}

constexpr std::int64_t RoundDown(std::int64_t size) {
    return size / 4 * 4;
}
constexpr std::int64_t RoundUp(std::int64_t size) {
    return (size + 3) / 4 * 4;
}

}  // namespace

std::uint16_t CalculateFixedPacketSize(const ReadoutLoad& load) {
    const bool isFast = load.bitDepth > 8 && load.binning == 1 && load.megahertz == 20.0F;
    return isFast ? FixedFastBytes : FixedPacketBytes;
}

std::uint16_t CalculatePacketSize(const ReadoutLoad& load, const BusConnection& bus,
                                  std::uint32_t firmware) {
    const bool roundsDown = firmware >= RoundingDownFirmware;
    const std::int64_t overhead = roundsDown ? 40 : 56;
    const PacketRule rule = FindPacketRule(bus.fastestBytes, firmware);
    const bool isShortOfBase = rule.fastestBytes < FastBaseBytes && bus.megabits == FastMegabits;
    const std::int64_t base = isShortOfBase ? FastBaseBytes : rule.fastestBytes;

    const std::int64_t scaled = ScaleSize(base, overhead, load, rule.lineTime);
    const std::int64_t size = roundsDown ? RoundDown(scaled) : RoundUp(scaled);
    return static_cast<std::uint16_t>(std::min<std::int64_t>(size, rule.fastestBytes));
}

std::uint16_t CalculateUncutPacketSize(const ReadoutLoad& load, const BusConnection& bus) {
    constexpr std::int64_t Overhead = 40;
    const bool isShortOfBase = bus.fastestBytes < FastBaseBytes && bus.megabits == FastMegabits;
    const std::int64_t base = isShortOfBase ? FastBaseBytes : bus.fastestBytes;
    const std::int64_t scaled =
        ScaleSize(base, Overhead, load, FindUncutLineTime(bus.fastestBytes));
    return static_cast<std::uint16_t>(std::min(RoundUp(scaled), GreatestBytes));
}

}  // namespace ZV
