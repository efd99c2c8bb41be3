#include "hal/platform/device.h"

#include <new>

#include "hal/platform/driver_device.h"
#include "hal/platform/last_error.h"
#include "hal/platform/simulation_module.h"

namespace ZV {

struct PlatformDevice {
    DriverDevice device;
};

struct PlatformOverlapped {
    DriverRequest request;
};

PlatformDevice* OpenDevice(const char* path) {
    auto* device = new (std::nothrow) PlatformDevice;
    if (device == nullptr) {
        SetLastPlatformError(PlatformErrorNotEnoughMemory);
        return nullptr;
    }
    bool isSimulated = false;
    const KernelDriver* driver = GetSelectedSimulation(&isSimulated);
    if (OpenDriverDevice(driver, path, &device->device)) return device;
    delete device;
    return nullptr;
}

void CloseDevice(PlatformDevice* device) {
    if (device == nullptr) return;
    CloseDriverDevice(device->device);
    delete device;
}

bool IsRealDevice(const PlatformDevice*) {
    return false;
}

bool ControlDevice(PlatformDevice* device, const ControlRequest& request, std::uint32_t* bytes) {
    return ControlDriverDevice(device->device, request, bytes);
}

ControlOutcome ControlDeviceOverlapped(PlatformDevice* device, const ControlRequest& request,
                                       PlatformOverlapped* overlapped) {
    return ControlDriverDeviceOverlapped(device->device, request, &overlapped->request);
}

CompletionOutcome WaitForCompletion(PlatformDevice*, PlatformOverlapped* overlapped,
                                    std::uint64_t timeoutMs) {
    return WaitForDriverRequest(&overlapped->request, timeoutMs);
}

// A wait looks at the request itself: there is no event that could say something else.
void ClearOverlapped(PlatformOverlapped*) {}

void CancelOverlapped(PlatformDevice* device, PlatformOverlapped* overlapped) {
    CancelDriverRequest(device->device, &overlapped->request);
}

bool IsOverlappedPending(const PlatformOverlapped* overlapped) {
    return IsDriverRequestPending(overlapped->request);
}

PlatformOverlapped* MakeOverlapped() {
    auto* overlapped = new (std::nothrow) PlatformOverlapped;
    if (overlapped == nullptr) SetLastPlatformError(PlatformErrorNotEnoughMemory);
    return overlapped;
}

void DestroyOverlapped(PlatformOverlapped* overlapped) {
    if (overlapped != nullptr && !IsOverlappedPending(overlapped)) delete overlapped;
}

}  // namespace ZV
