#pragma once

#include <cstdint>
#include <mutex>

namespace ZV::Simulation {

/// Channels and bandwidth of one bus, shared by its cameras. Thread-safe; its mutex is a leaf.
class Bus {
  public:
    /// `busSpeed` 400 or 800. `bytesPerCycle` 0: what a cycle of 125 microseconds carries at that
    /// speed.
    Bus(std::uint32_t busSpeed, std::uint32_t bytesPerCycle);

    std::uint32_t GetSpeed() const { return speed; }

    bool ReserveBandwidth(std::uint32_t bytes);
    void FreeBandwidth(std::uint32_t bytes);
    std::uint32_t GetBandwidthLeft() const;

    /// A free channel, the requested one unless that is AnyChannel; AnyChannel when there is none.
    std::uint32_t ReserveChannel(std::uint32_t requested);
    void FreeChannel(std::uint32_t channel);
    bool IsChannelReserved(std::uint32_t channel) const;
    /// Bit n is channel n.
    std::uint64_t GetChannelsLeft() const;

  private:
    const std::uint32_t speed;
    mutable std::mutex mutex;
    std::uint32_t bytesLeft;             // guarded by mutex
    std::uint64_t channelsLeft = ~0ull;  // guarded by mutex
};

}  // namespace ZV::Simulation
