#include "simulation/world.h"

#include <utility>

namespace ZV::Simulation {

std::shared_ptr<World> World::Make(const Scenario& scenario, std::string* message) {
    std::shared_ptr<World> world(new World);
    const auto trace = std::make_shared<Trace>();
    if (!scenario.trace.empty() && !trace->Open(scenario.trace, message)) return nullptr;
    std::vector<std::shared_ptr<Bus>> buses;
    for (const BusScenario& bus : scenario.buses) {
        buses.push_back(std::make_shared<Bus>(bus.speed, bus.bytesPerCycle));
    }
    for (const CameraScenario& camera : scenario.cameras) {
        const auto position = static_cast<std::uint32_t>(world->devices.size());
        std::string reason;
        std::unique_ptr<Scene> scene = MakeScene(camera.scene, camera.sensor.width,
                                                 camera.sensor.height, camera.seed, &reason);
        if (scene == nullptr) {
            *message = "/cameras/" + std::to_string(position) + "/scene: " + reason;
            return nullptr;
        }
        world->devices.push_back(
            std::make_shared<Device>(camera, position, buses[camera.bus], trace, std::move(scene)));
    }
    world->discoveryFaults = scenario.discoveryFaults;
    return world;
}

void World::End() {
    for (const auto& device : devices) device->End();
}

std::vector<std::string> World::ListPaths() const {
    std::vector<std::string> paths;
    for (const auto& device : devices) {
        if (device->IsPlugged()) paths.push_back(device->GetPath());
    }
    return paths;
}

std::shared_ptr<Device> World::FindDevice(const std::string& path) const {
    for (const auto& device : devices) {
        if (device->GetPath() == path) return device;
    }
    return nullptr;
}

std::shared_ptr<Device> World::GetDevice(std::uint32_t position) const {
    return position < devices.size() ? devices[position] : nullptr;
}

std::uint32_t World::GetDiscoveryError(std::uint64_t listing, std::uint64_t step) const {
    for (const DiscoveryFault& fault : discoveryFaults) {
        const bool isListing = fault.listing == 0 || fault.listing == listing;
        if (isListing && fault.step == step) return fault.error;
    }
    return 0;
}

}  // namespace ZV::Simulation
