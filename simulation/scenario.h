#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "simulation/faults.h"
#include "simulation/models.h"
#include "simulation/scene.h"
#include "simulation/sensor.h"

namespace ZV::Simulation {

struct BlockVersions {
    std::uint32_t directory = MakeVersion(1, 1);
    std::uint32_t configuration = VersionModernConfiguration;
    std::uint32_t control = VersionModernControl;
    std::uint32_t stream = MakeVersion(1, 2);
    std::uint32_t command = MakeVersion(1, 2);
    std::uint32_t status = MakeVersion(1, 3);
};

/// Configuration quadlets that are reported while a control register has a value.
struct AlternateConfiguration {
    std::uint32_t controlQuadlet = 0;  ///< 0 for none.
    std::uint32_t mask = 0xFFFFFFFF;
    std::uint32_t value = 0;
    std::map<std::uint32_t, std::uint32_t> quadlets;
};

enum class IdentityPlace { Primary, Secondary, Both, None };

struct CameraScenario {
    std::uint32_t modelId = 5;
    std::uint32_t bus = 0;
    std::uint32_t speed = 800;  ///< The camera's own; the slower of it and its bus counts.

    std::string path;              ///< Of the device; made from the position when empty.
    std::uint32_t pathLength = 0;  ///< Pads the path to this length; 0 leaves it.
    bool isPlugged = true;
    bool hasIdentity = false;
    std::uint32_t identity =
        0;  ///< Quadlet at the identity address; the model id in its upper half.
    IdentityPlace identityPlace = IdentityPlace::Primary;

    std::string serial;
    std::uint64_t uniqueId = 0;
    std::uint32_t firmwareVersion = 116;
    std::uint32_t firmwareBuild = 7;
    BlockVersions versions;
    bool hasStrictBlocks = false;  ///< Registers beyond a block's length answer with an error.
    std::map<std::uint32_t, std::uint32_t> configuration;  ///< Quadlets that replace the model's.
    AlternateConfiguration alternate;

    std::uint32_t sensorId = 6;
    SensorDescription sensor;
    SceneDescription scene;
    std::uint32_t streamingVersion = 1;
    std::uint32_t tag = 1;

    std::uint64_t seed = 0;
    double timeScale = 1;
    bool hasIdlePackets = true;
    bool waitsForBuffers = true;
    std::uint32_t ringWindow = 2;
    double triggerPeriodMs = 0;

    bool areWritesPended = true;
    /// Opens, counted from 1, at which another process holds the device. `heldTo` 0: for ever.
    std::uint64_t heldFrom = 0, heldTo = 0;

    std::vector<FaultDescription> faults;
};

struct BusScenario {
    std::uint32_t speed = 800;
    std::uint32_t bytesPerCycle = 0;  ///< 0: what a cycle of the speed carries.
};

struct DiscoveryFault {
    std::uint64_t step = 1;     ///< Call of a listing, from 1.
    std::uint64_t listing = 0;  ///< Listing, from 1; 0 for each.
    std::uint32_t error = 31;
};

struct Scenario {
    std::uint64_t seed = 1;
    std::string trace;
    std::vector<BusScenario> buses{BusScenario{}};
    std::vector<CameraScenario> cameras;
    std::vector<DiscoveryFault> discoveryFaults;
};

/// A camera of the model with the contents that belong to it.
CameraScenario MakeCamera(const ModelRow& model);

/// Fills `scenario` from a built-in name or `model:NAME`. False for a name that is neither.
bool MakeBuiltInScenario(std::string_view name, Scenario* scenario);

/// Gives each camera the serial, unique id, seed and path that the scenario left open. Requires:
/// each camera's bus exists.
void FinishScenario(Scenario* scenario);

}  // namespace ZV::Simulation
