#include "hal/platform/device_discovery.h"

#include <new>

#include "hal/platform/driver_device.h"
#include "hal/platform/last_error.h"
#include "hal/platform/simulation_module.h"

namespace ZV {

struct DeviceInterfaceList {
    DriverInterfaceList interfaces;
};

DeviceInterfaceList* OpenDeviceInterfaceList() {
    bool isSimulated = false;
    const KernelDriver* driver = SelectSimulation(&isSimulated);
    auto* list = new (std::nothrow) DeviceInterfaceList;
    if (list == nullptr) {
        SetLastPlatformError(PlatformErrorNotEnoughMemory);
        return nullptr;
    }
    if (OpenDriverInterfaceList(driver, &list->interfaces)) return list;
    delete list;
    return nullptr;
}

bool SelectDeviceInterface(DeviceInterfaceList* list, std::uint32_t index) {
    return SelectDriverInterface(&list->interfaces, index);
}

bool GetDeviceInterfaceDetail(DeviceInterfaceList* list, void* detail, std::uint32_t capacity,
                              std::uint32_t* requiredBytes) {
    return GetDriverInterfaceDetail(list->interfaces, detail, capacity, requiredBytes);
}

void CloseDeviceInterfaceList(DeviceInterfaceList* list) {
    if (list == nullptr) return;
    CloseDriverInterfaceList(list->interfaces);
    delete list;
}

}  // namespace ZV
