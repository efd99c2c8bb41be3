#include "simulation/bus.h"

#include <bit>

#include "hal/control_records.h"

namespace ZV::Simulation {
namespace {

// 49.152 and 98.304 million bytes a second for 125 microseconds.
constexpr std::uint32_t BytesPerCycleS400 = 6144;
constexpr std::uint32_t BytesPerCycleS800 = 12288;
constexpr std::uint32_t ChannelCount = 64;

std::uint32_t GetDefaultBytes(std::uint32_t speed) {
    return speed >= 800 ? BytesPerCycleS800 : BytesPerCycleS400;
}

}  // namespace

Bus::Bus(std::uint32_t busSpeed, std::uint32_t bytesPerCycle)
    : speed(busSpeed), bytesLeft(bytesPerCycle != 0 ? bytesPerCycle : GetDefaultBytes(busSpeed)) {}

bool Bus::ReserveBandwidth(std::uint32_t bytes) {
    const std::lock_guard lock(mutex);
    if (bytes > bytesLeft) return false;
    bytesLeft -= bytes;
    return true;
}

void Bus::FreeBandwidth(std::uint32_t bytes) {
    const std::lock_guard lock(mutex);
    bytesLeft += bytes;
}

std::uint32_t Bus::GetBandwidthLeft() const {
    const std::lock_guard lock(mutex);
    return bytesLeft;
}

std::uint32_t Bus::ReserveChannel(std::uint32_t requested) {
    const std::lock_guard lock(mutex);
    std::uint32_t channel = requested;
    if (requested == AnyChannel) {
        channel = static_cast<std::uint32_t>(std::countr_zero(channelsLeft));
    }
    if (channel >= ChannelCount || (channelsLeft >> channel & 1) == 0) return AnyChannel;
    channelsLeft &= ~(1ull << channel);
    return channel;
}

void Bus::FreeChannel(std::uint32_t channel) {
    const std::lock_guard lock(mutex);
    if (channel < ChannelCount) channelsLeft |= 1ull << channel;
}

bool Bus::IsChannelReserved(std::uint32_t channel) const {
    const std::lock_guard lock(mutex);
    return channel < ChannelCount && (channelsLeft >> channel & 1) == 0;
}

std::uint64_t Bus::GetChannelsLeft() const {
    const std::lock_guard lock(mutex);
    return channelsLeft;
}

}  // namespace ZV::Simulation
