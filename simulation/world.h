#pragma once

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "simulation/device.h"
#include "simulation/scenario.h"

namespace ZV::Simulation {

/// The devices of a scenario, running. Thread-safe.
class World {
  public:
    /// Null with `message` when a scene or the trace file cannot be made.
    static std::shared_ptr<World> Make(const Scenario& scenario, std::string* message);

    /// Ends all devices and joins their threads.
    void End();

    /// Paths of the devices that are plugged in, in the order of the scenario.
    std::vector<std::string> ListPaths() const;
    /// Null for a path that no device has.
    std::shared_ptr<Device> FindDevice(const std::string& path) const;
    /// Null for a position beyond the last.
    std::shared_ptr<Device> GetDevice(std::uint32_t position) const;
    std::size_t GetDeviceCount() const { return devices.size(); }

    /// Counts a listing of the device interfaces, from 1.
    std::uint64_t CountListing() { return ++listings; }
    /// Error of a listing's step, both from 1; 0 for none.
    std::uint32_t GetDiscoveryError(std::uint64_t listing, std::uint64_t step) const;

  private:
    World() = default;

    std::vector<std::shared_ptr<Device>> devices;
    std::vector<DiscoveryFault> discoveryFaults;
    std::atomic<std::uint64_t> listings{0};
};

}  // namespace ZV::Simulation
