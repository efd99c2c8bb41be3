#pragma once

#include <cstdint>

namespace ZV {

/// Installation and privilege services of the operating system, one call per step. They stand on
/// Windows; elsewhere they answer what is true there: no driver to install, privileges by the
/// effective user id.

/// The system's folder for common program files; an empty text when it is unknown.
void GetCommonProgramFilesFolder(char path[260]);

/// True when the process token is in the built-in Administrators group (effective user id 0 on
/// POSIX).
bool IsProcessAdministrator();

/// False when the token cannot be asked; else `*isElevated` tells.
bool QueryProcessElevation(bool* isElevated);

/// Platform number (2 for the NT family) and version; false when the system does not tell.
struct SystemVersion {
    std::uint32_t platform, major, minor;
};
bool QuerySystemVersion(SystemVersion* version);

/// Appends the device instance ids of the parents of the interface's devices to `ids` as heap texts
/// of the C allocator and adds their number to `*count`. 0 or 998.
std::uint32_t AppendAdapterIds(std::uint32_t* count, char** ids);

/// The same for the present devices of the class `classId` (16 bytes), without the step to the
/// parent.
std::uint32_t AppendClassDeviceIds(const std::uint8_t classId[16], std::uint32_t* count,
                                   char** ids);

/// Installs the driver of the inf file at `infPath` on the device `instanceId`. With
/// `bySystemVersion` the call depends on the version of the system: `isVistaExactly` selects the
/// newer one. Progress and failures go to the debugger output alone. A null text is a step that
/// fails: an id of no device, a path that does not fit.
void InstallDriver(const char* instanceId, const char* infPath, bool bySystemVersion,
                   bool isVistaExactly);

}  // namespace ZV
