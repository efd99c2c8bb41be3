#pragma once

#include <cstdint>

#include "hal/platform/driver_maintenance.h"

/// Maintenance routines around the two kernel drivers: where their installation files lie, the
/// choice between them, their installation, and the privileges it needs. No operation of the
/// library calls them in its normal running.
namespace ZV {

/// Installation files, each as a heap text of 260 bytes for HAL_MemoryFree, null without memory.
char* GetInfPath();
char* GetUBInfPath();
char* GetUBHelperPath();

/// True when the open-camera table has a used entry, false when it cannot be reached. Thread-safe.
bool AnyCameraOpen();

/// True when the last camera has closed, none is open anywhere on the machine, and the stored
/// number `FireWireDriverMode` is not 1.
bool DriverSwitchDue();

/// The last-camera flag of the process, initially false. Only the disconnect of a kind 1 record
/// raises it. Thread-safe.
void SetLastCameraFlag(bool isRaised);

bool IsAdministrator();

/// True when the process is known not to be elevated; `isElevated` may be null, and is untouched
/// when the token cannot be asked.
bool IsNotElevated(bool* isElevated);

/// True on version 6.0 of the NT family only: a later version counts as an older one.
bool IsVistaExactly();
bool IsVistaExactly(const SystemVersion& version);

/// Device instance ids as heap texts in the next places of `ids`; their number is added to
/// `*count`. 0 or 998.
std::uint32_t ListAdapterIds(std::uint32_t* count, char** ids);
std::uint32_t ListClassDeviceIds(const std::uint8_t classId[16], std::uint32_t* count, char** ids);

/// Always 0; progress and failures go to the debugger output.
std::uint32_t InstallDriverOnDevice(const char* instanceId, const char* infPath);
std::uint32_t InstallDriverOnDeviceForOS(const char* instanceId, const char* infPath);

}  // namespace ZV
