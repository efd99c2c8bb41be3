#include <exception>
#include <string>

#include "hal/platform/kernel_driver.h"
#include "simulation/driver.h"
#include "simulation/scenario_reader.h"
#include "simulation/zentara_simulation.h"

// What the module exports.
namespace ZV::Simulation {
namespace {

constexpr std::uint32_t AllCameras = 0xFFFFFFFF;
constexpr std::uint32_t Done = 0;
constexpr std::uint32_t Failed = 1;

std::shared_ptr<Device> GetDevice(std::uint32_t camera) {
    const std::shared_ptr<World> world = GetWorld();
    return world != nullptr ? world->GetDevice(camera) : nullptr;
}

template <typename Work>
std::uint32_t RunShielded(Work work) {
    try {
        return work();
    } catch (const std::exception&) {
        return Failed;
    }
}

// Runs `work` on a camera that is there.
template <typename Work>
std::uint32_t WithDevice(std::uint32_t camera, Work work) {
    return RunShielded([&] {
        const std::shared_ptr<Device> device = GetDevice(camera);
        return device != nullptr && work(*device) ? Done : Failed;
    });
}

}  // namespace
}  // namespace ZV::Simulation

using namespace ZV::Simulation;

extern "C" {

ZENTARA_SIMULATION_API const ZV::KernelDriver* ZentaraSimulation_GetKernelDriver(
    std::uint32_t version) {
    return version == ZV::KernelDriverVersion ? &GetDriverTable() : nullptr;
}

std::uint32_t ZentaraSimulation_CheckScenario(const char* scenario, char* message,
                                              std::uint32_t messageBytes) {
    return RunShielded([&] {
        Scenario read;
        std::string reason;
        const bool isGood = LoadScenario(scenario != nullptr ? scenario : "", &read, &reason);
        CopyMessage(reason, message, messageBytes);
        return isGood ? Done : Failed;
    });
}

std::uint32_t ZentaraSimulation_AddFault(std::uint32_t camera, const char* json, char* message,
                                         std::uint32_t messageBytes) {
    return RunShielded([&] {
        FaultDescription fault;
        std::string reason;
        bool isGood = ReadFault(json != nullptr ? json : "", &fault, &reason);
        const std::shared_ptr<Device> device = GetDevice(camera);
        if (isGood && device == nullptr) {
            reason = "there is no such camera";
            isGood = false;
        }
        if (isGood) device->AddFault(fault);
        CopyMessage(reason, message, messageBytes);
        return isGood ? Done : Failed;
    });
}

std::uint32_t ZentaraSimulation_Unplug(std::uint32_t camera) {
    return WithDevice(camera, [](Device& device) {
        device.Unplug();
        return true;
    });
}

std::uint32_t ZentaraSimulation_Plug(std::uint32_t camera) {
    return WithDevice(camera, [](Device& device) {
        device.Plug();
        return true;
    });
}

std::uint32_t ZentaraSimulation_GetState(std::uint32_t camera, ZentaraSimulationState* state) {
    if (state == nullptr) return Failed;
    return RunShielded([&] {
        *state = ZentaraSimulationState{};
        if (camera != AllCameras) {
            return WithDevice(camera, [&](Device& device) {
                device.AddState(state);
                return true;
            });
        }
        const std::shared_ptr<World> world = GetWorld();
        for (std::uint32_t i = 0; world != nullptr && i < world->GetDeviceCount(); ++i) {
            world->GetDevice(i)->AddState(state);
        }
        return Done;
    });
}

std::uint32_t ZentaraSimulation_PeekRegister(std::uint32_t camera, std::uint32_t address,
                                             std::uint32_t* value) {
    if (value == nullptr) return Failed;
    return WithDevice(camera, [&](Device& device) { return device.Peek(address, value); });
}

std::uint32_t ZentaraSimulation_PokeRegister(std::uint32_t camera, std::uint32_t address,
                                             std::uint32_t value) {
    return WithDevice(camera, [&](Device& device) { return device.Poke(address, value); });
}
}
