#pragma once

#include <condition_variable>
#include <cstdint>
#include <mutex>

#include "hal/platform/device.h"
#include "hal/platform/kernel_driver.h"

/// Devices and device interfaces that a KernelDriver serves, the same on every platform. Failures
/// set the last platform error, as in device.h and device_discovery.h, whose contracts hold here.
namespace ZV {

struct DriverDevice {
    const KernelDriver* driver = nullptr;
    void* handle = nullptr;
};

/// One request on its way through a driver. The driver may end it from any thread, also before it
/// has answered that the request is pended.
struct DriverRequest : KernelRequest {
    DriverRequest();

    mutable std::mutex mutex;
    std::condition_variable ended;
    bool isPending = false;   // guarded by mutex
    std::uint32_t error = 0;  // guarded by mutex; outcome of the last request
    std::uint32_t bytes = 0;  // guarded by mutex
};

[[nodiscard]] bool OpenDriverDevice(const KernelDriver* driver, const char* path,
                                    DriverDevice* device);
void CloseDriverDevice(const DriverDevice& device);

bool ControlDriverDevice(const DriverDevice& device, const ControlRequest& request,
                         std::uint32_t* bytes);
ControlOutcome ControlDriverDeviceOverlapped(const DriverDevice& device,
                                             const ControlRequest& request, DriverRequest* record);
CompletionOutcome WaitForDriverRequest(DriverRequest* record, std::uint64_t timeoutMs);
void CancelDriverRequest(const DriverDevice& device, DriverRequest* record);
bool IsDriverRequestPending(const DriverRequest& record);

/// A driver's list of device interfaces; without a driver it is empty.
struct DriverInterfaceList {
    const KernelDriver* driver = nullptr;
    void* list = nullptr;
    std::uint32_t index = 0;
    bool isIndexValid = false;
};

[[nodiscard]] bool OpenDriverInterfaceList(const KernelDriver* driver, DriverInterfaceList* list);
bool SelectDriverInterface(DriverInterfaceList* list, std::uint32_t index);
bool GetDriverInterfaceDetail(const DriverInterfaceList& list, void* detail, std::uint32_t capacity,
                              std::uint32_t* requiredBytes);
void CloseDriverInterfaceList(const DriverInterfaceList& list);

}  // namespace ZV
