#include "hal/platform/simulation_module.h"

#include <atomic>
#include <cstdio>

#include "hal/platform/debug_output.h"
#include "hal/platform/environment.h"
#include "hal/platform/last_error.h"
#include "hal/platform/module_loader.h"

namespace ZV {
namespace {

constexpr std::uint32_t MessageBytesMax = 2048;

/// Stands for the simulation whose scenario was refused: no devices.
constexpr KernelDriver EmptyDriver{
    KernelDriverVersion,
    [](const char*, char*, std::uint32_t) { return PlatformErrorNone; },
    [] {},
    [](void** list) {
        *list = nullptr;
        return PlatformErrorNone;
    },
    [](void*, std::uint32_t) { return PlatformErrorNoMoreItems; },
    [](void*, std::uint32_t, char*, std::uint32_t, std::uint32_t*) {
        return PlatformErrorInvalidParameter;
    },
    [](void*) {},
    [](const char*, void**) { return PlatformErrorFileNotFound; },
    [](void*) {},
    [](void*, KernelRequest*, std::uint32_t*) { return PlatformErrorInvalidHandle; },
    [](void*, KernelRequest*) {},
};

/// The module's driver once it is loaded; it stays.
constinit std::atomic<const KernelDriver*> loadedDriver{nullptr};
/// What the last selection answered.
constinit std::atomic<const KernelDriver*> selectedDriver{nullptr};
constinit std::atomic<bool> isSimulationSelected{false};

const KernelDriver* GetLoadedDriver() {
    const KernelDriver* driver = loadedDriver.load();
    if (driver != nullptr) return driver;
    driver = LoadSimulationDriver();
    if (driver == nullptr) WriteDebuggerOutput("The simulation's module cannot be loaded\n");
    loadedDriver.store(driver);
    return driver;
}

const KernelDriver* BeginSimulation(const char* configuration) {
    const KernelDriver* driver = GetLoadedDriver();
    if (driver == nullptr) return nullptr;
    char message[MessageBytesMax] = "";
    if (driver->begin(configuration, message, sizeof message) == PlatformErrorNone) return driver;
    char line[MessageBytesMax + 1];
    std::snprintf(line, sizeof line, "%.*s\n", static_cast<int>(sizeof message - 1), message);
    WriteDebuggerOutput(line);
    return &EmptyDriver;
}

}  // namespace

const KernelDriver* SelectSimulation(bool* isSelected) {
    const char* configuration = GetLibraryVariable("ZENTARA_SIMULATION");
    const bool isSet = configuration != nullptr && configuration[0] != '\0';
    selectedDriver.store(isSet ? BeginSimulation(configuration) : nullptr);
    isSimulationSelected.store(isSet);
    return GetSelectedSimulation(isSelected);
}

const KernelDriver* GetSelectedSimulation(bool* isSelected) {
    *isSelected = isSimulationSelected.load();
    return selectedDriver.load();
}

void EndSimulation() {
    selectedDriver.store(nullptr);
    isSimulationSelected.store(false);
    if (const KernelDriver* driver = loadedDriver.load(); driver != nullptr) driver->end();
}

}  // namespace ZV
