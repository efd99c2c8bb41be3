#include "hal/platform/device_discovery.h"

#include <windows.h>

#include <setupapi.h>

#include <new>

#include "hal/platform/driver_device.h"
#include "hal/platform/simulation_module.h"
#include "hal/platform/win32/device_interface_class.h"

namespace ZV {

static_assert(offsetof(SP_DEVICE_INTERFACE_DETAIL_DATA_A, DevicePath) == DeviceDetailPathOffset);

struct DeviceInterfaceList {
    bool isSimulated = false;
    DriverInterfaceList simulated;
    HDEVINFO set = INVALID_HANDLE_VALUE;
    SP_DEVICE_INTERFACE_DATA current{};
};

namespace {

bool OpenSet(DeviceInterfaceList* list) {
    list->set = SetupDiGetClassDevsA(&DeviceInterfaceClass, nullptr, nullptr,
                                     DIGCF_PRESENT | DIGCF_DEVICEINTERFACE);
    return list->set != INVALID_HANDLE_VALUE;
}

}  // namespace

DeviceInterfaceList* OpenDeviceInterfaceList() {
    auto* list = new (std::nothrow) DeviceInterfaceList;
    if (list == nullptr) {
        SetLastError(ERROR_NOT_ENOUGH_MEMORY);
        return nullptr;
    }
    const KernelDriver* driver = SelectSimulation(&list->isSimulated);
    const bool isOpen =
        list->isSimulated ? OpenDriverInterfaceList(driver, &list->simulated) : OpenSet(list);
    if (isOpen) return list;
    const DWORD error = GetLastError();
    delete list;
    SetLastError(error);
    return nullptr;
}

bool SelectDeviceInterface(DeviceInterfaceList* list, std::uint32_t index) {
    if (list->isSimulated) return SelectDriverInterface(&list->simulated, index);
    list->current.cbSize = sizeof list->current;
    return SetupDiEnumDeviceInterfaces(list->set, nullptr, &DeviceInterfaceClass, index,
                                       &list->current) != FALSE;
}

bool GetDeviceInterfaceDetail(DeviceInterfaceList* list, void* detail, std::uint32_t capacity,
                              std::uint32_t* requiredBytes) {
    if (list->isSimulated) {
        return GetDriverInterfaceDetail(list->simulated, detail, capacity, requiredBytes);
    }
    DWORD required = 0;
    auto* record = static_cast<SP_DEVICE_INTERFACE_DETAIL_DATA_A*>(detail);
    const BOOL isDone = SetupDiGetDeviceInterfaceDetailA(list->set, &list->current, record,
                                                         capacity, &required, nullptr);
    if (requiredBytes != nullptr) *requiredBytes = required;
    return isDone != FALSE;
}

void CloseDeviceInterfaceList(DeviceInterfaceList* list) {
    if (list == nullptr) return;
    if (list->isSimulated) {
        CloseDriverInterfaceList(list->simulated);
    } else {
        SetupDiDestroyDeviceInfoList(list->set);
    }
    delete list;
}

}  // namespace ZV
