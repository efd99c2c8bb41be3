#pragma once

#include <cstdint>
#include <string_view>
#include <vector>

#include "hal/hal.h"
#include "support/simulation_world.h"

namespace ZV::Test {

inline constexpr std::uint32_t PrimaryIdAddress = 0xE0010038;
inline constexpr std::uint32_t SecondaryIdAddress = 0xE0001138;
inline constexpr std::uint32_t ScratchAddress = 0xD0002010;  ///< A control register, free to write.
inline constexpr std::uint32_t StreamSwitchAddress = 0xD0005004;

/// A simulated world and the HAL's list of its cameras. Releases what the list holds at its end.
class HALWorld {
  public:
    explicit HALWorld(std::string_view scenario);
    ~HALWorld();
    HALWorld(const HALWorld&) = delete;
    HALWorld& operator=(const HALWorld&) = delete;

    HALStatus List(std::uint32_t primaryIdAddress = PrimaryIdAddress,
                   std::uint32_t secondaryIdAddress = SecondaryIdAddress,
                   std::uint32_t maxCameras = 10);
    /// Lists the cameras and gives up the trace of that.
    HALCamera* ListFirst();
    /// The same, and connects the first one for `payloadBytes`.
    HALCamera* Connect(std::uint16_t payloadBytes = 100);
    void GiveUpList();

    /// Control codes that the first camera was sent since the last call, in the order in which
    /// they ended.
    std::vector<std::uint32_t> TakeCodes();
    std::vector<TraceRecord> TakeRequests();

    SimulationWorld world;
    HALCamera* list = nullptr;
    std::uint32_t count = 0xDDDDDDDD;

  private:
    std::size_t requestsTaken = 0;
};

/// Connects without callbacks.
HALStatus ConnectPlain(HALCamera* camera, std::uint16_t payloadBytes);

/// Lets limited waits pass faster for its life.
class FastWaits {
  public:
    explicit FastWaits(std::uint32_t divisor = 1000);
    ~FastWaits();
};

}  // namespace ZV::Test
