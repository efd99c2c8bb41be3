#pragma once

#include <cstdint>

/// Control of the simulated driver, for tests and the program. The library itself reaches the
/// simulation through the kernel driver's table alone (hal/platform/kernel_driver.h), which the
/// module exports as `ZentaraSimulation_GetKernelDriver`.
#if defined(_WIN32)
#if defined(ZENTARA_BUILDING_SIMULATION)
#define ZENTARA_SIMULATION_API __declspec(dllexport)
#else
#define ZENTARA_SIMULATION_API __declspec(dllimport)
#endif
#else
#define ZENTARA_SIMULATION_API __attribute__((visibility("default")))
#endif

extern "C" {

/// Reads a scenario (a built-in name, `model:NAME`, or the path of a JSON file) without starting
/// it. 0, or 1 with the reason and the place in the file in `message`, terminated.
ZENTARA_SIMULATION_API std::uint32_t ZentaraSimulation_CheckScenario(const char* scenario,
                                                                     char* message,
                                                                     std::uint32_t messageBytes);

/// Adds a fault to the running bus: a JSON object as in the list `faults` of a scenario's camera.
/// 0, or 1 with a message.
ZENTARA_SIMULATION_API std::uint32_t ZentaraSimulation_AddFault(std::uint32_t camera,
                                                                const char* json, char* message,
                                                                std::uint32_t messageBytes);

/// Takes a camera off the bus (pended requests end with an error, its handles answer errors) and
/// puts it back. `camera` is its position in the scenario. 0, or 1 for a camera that is not there.
ZENTARA_SIMULATION_API std::uint32_t ZentaraSimulation_Unplug(std::uint32_t camera);
ZENTARA_SIMULATION_API std::uint32_t ZentaraSimulation_Plug(std::uint32_t camera);

/// What the driver holds for a camera. Frame counts are since the bus was started.
struct ZentaraSimulationState {
    std::uint32_t openHandles;
    std::uint32_t reservedChannels;
    std::uint32_t reservedBandwidths;
    std::uint32_t reservedResources;
    std::uint32_t pendedRequests;
    std::uint32_t attachedBuffers;
    std::uint32_t requestsServed;
    std::uint64_t framesExposed;
    std::uint64_t framesSent;
    std::uint32_t isStreaming;
    std::uint32_t requestsFailed;  ///< By failRequest; register requests by busReset too.
    /// Of them the reads and writes of registers.
    std::uint32_t registerRequestsFailed;
    /// Buffers of a stream that failRequest has refused by the call itself.
    std::uint32_t buffersRefused;
    /// Buffers of a stream that ended with an error of failRequest or busReset.
    std::uint32_t buffersFailed;
    /// Numbers that frames have used up: one that begins anew takes another.
    std::uint64_t framesBegun;
    std::uint32_t psn;  ///< Parameter set number in force, of one camera alone.
    /// Packets that corruptPacket has met.
    std::uint32_t packetsCorrupted;
};

/// 0, or 1 for a camera that is not there. `camera` 0xFFFFFFFF sums over all.
ZENTARA_SIMULATION_API std::uint32_t ZentaraSimulation_GetState(std::uint32_t camera,
                                                                ZentaraSimulationState* state);

/// Reads and writes one quadlet of a camera's memory as host-order value, past bus and faults.
ZENTARA_SIMULATION_API std::uint32_t ZentaraSimulation_PeekRegister(std::uint32_t camera,
                                                                    std::uint32_t address,
                                                                    std::uint32_t* value);
ZENTARA_SIMULATION_API std::uint32_t ZentaraSimulation_PokeRegister(std::uint32_t camera,
                                                                    std::uint32_t address,
                                                                    std::uint32_t value);
}
