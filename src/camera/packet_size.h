#pragma once

#include <cstdint>

/// Sizes of the isochronous packets, as bytes of payload. Pure functions; `overhead` and `lineTime`
/// in them are numbers of the firmware without a meaning of their own.
namespace ZV {

/// From this control version the camera is told its packet size; below it sizes are fixed.
inline constexpr std::uint32_t FirstSizedControlVersion = 0x20003;
/// Fastest packet below that version.
inline constexpr std::uint16_t FixedPacketBytes = 4080;

/// What a readout asks of the bus.
struct ReadoutLoad {
    std::uint16_t binning;
    std::uint16_t bitDepth;
    float megahertz;
};

/// What the connection gives.
struct BusConnection {
    std::uint16_t megabits;      ///< 800 or 400, 0 when not known.
    std::uint16_t fastestBytes;  ///< The greatest packet.
};

/// Below FirstSizedControlVersion.
std::uint16_t CalculateFixedPacketSize(const ReadoutLoad& load);
/// From FirstSizedControlVersion: never above the connection's greatest packet, a multiple of 4
/// below it.
std::uint16_t CalculatePacketSize(const ReadoutLoad& load, const BusConnection& bus,
                                  std::uint32_t firmware);
/// `PellanB1`: a multiple of 4 that may exceed the connection's greatest packet.
std::uint16_t CalculateUncutPacketSize(const ReadoutLoad& load, const BusConnection& bus);

}  // namespace ZV
