#pragma once

#include <windows.h>

namespace ZV {

/// The class {E262A0C7-FD57-44A1-A9D3-8806349A39DA} of the driver's device interface.
inline constexpr GUID DeviceInterfaceClass{
    0xE262A0C7, 0xFD57, 0x44A1, {0xA9, 0xD3, 0x88, 0x06, 0x34, 0x9A, 0x39, 0xDA}};

}  // namespace ZV
