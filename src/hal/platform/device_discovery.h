#pragma once

#include <cstdint>

namespace ZV {

/// The present devices that expose the driver's interface {E262A0C7-FD57-44A1-A9D3-8806349A39DA},
/// as the setup interface lists them. Simulated devices only while a simulation is selected, else
/// real ones only.
struct DeviceInterfaceList;

/// Detail record: a size field of 32 bits, then the device path with its terminator.
inline constexpr std::uint32_t DeviceDetailPathOffset = 4;

/// Null when the setup interface refuses; the last platform error says why.
DeviceInterfaceList* OpenDeviceInterfaceList();

/// Makes interface `index` the current one. False with last error 259 beyond the last, or another
/// error.
bool SelectDeviceInterface(DeviceInterfaceList* list, std::uint32_t index);

/// Detail record of the current interface. With a `capacity` below the size needed it returns false
/// with last error 122 and the size in `requiredBytes`, which may be null. `detail` may be null for
/// capacity 0; its size field must hold 8.
bool GetDeviceInterfaceDetail(DeviceInterfaceList* list, void* detail, std::uint32_t capacity,
                              std::uint32_t* requiredBytes);

/// Null is ignored.
void CloseDeviceInterfaceList(DeviceInterfaceList* list);

}  // namespace ZV
