#pragma once

#include <windows.h>

#include <cfgmgr32.h>
#include <setupapi.h>

#include <cstdint>

#include "hal/platform/driver_maintenance.h"

namespace ZV {

/// The functions of the system that the services of driver_maintenance.h are made of, in groups, in
/// the order in which they are called. The services run over the system's own ones; a test changes
/// single entries to see a step fail that would not fail otherwise.
struct MaintenanceFunctions {
    // Installation.
    decltype(&::SetupDiCreateDeviceInfoList) createDeviceInfoList;
    decltype(&::SetupDiOpenDeviceInfoA) openDeviceInfo;
    decltype(&::SetupDiSetSelectedDevice) setSelectedDevice;
    decltype(&::SetupDiGetDeviceInstallParamsA) getDeviceInstallParams;
    decltype(&::SetupDiSetDeviceInstallParamsA) setDeviceInstallParams;
    decltype(&::SetupDiBuildDriverInfoList) buildDriverInfoList;
    decltype(&::SetupDiCallClassInstaller) callClassInstaller;
    decltype(&::SetupDiGetSelectedDriverA) getSelectedDriver;
    decltype(&::GetSystemDirectoryA) getSystemDirectory;
    decltype(&::LoadLibraryExA) loadLibrary;
    decltype(&::GetProcAddress) getProcAddress;
    decltype(&::FreeLibrary) freeLibrary;
    decltype(&::SetupDiDestroyDeviceInfoList) destroyDeviceInfoList;
    // Listings.
    decltype(&::SetupDiGetClassDevsA) getClassDevices;
    decltype(&::SetupDiEnumDeviceInfo) enumerateDevices;
    decltype(&::CM_Get_Parent) getParent;
    decltype(&::CM_Get_Device_ID_Size) getDeviceIdSize;
    decltype(&::CM_Get_Device_IDA) getDeviceId;
    // Privileges and version.
    decltype(&::AllocateAndInitializeSid) makeSid;
    decltype(&::CheckTokenMembership) checkMembership;
    decltype(&::OpenProcessToken) openProcessToken;
    decltype(&::GetTokenInformation) getTokenInformation;
    decltype(&::GetVersionExA) getVersion;
    decltype(&::GetSystemInfo) getSystemInfo;
};

/// The system's own functions.
MaintenanceFunctions GetMaintenanceFunctions();

// The services of driver_maintenance.h over `functions`.

bool IsProcessAdministrator(const MaintenanceFunctions& functions);
bool QueryProcessElevation(const MaintenanceFunctions& functions, bool* isElevated);
bool QuerySystemVersion(const MaintenanceFunctions& functions, SystemVersion* version);
std::uint32_t AppendAdapterIds(const MaintenanceFunctions& functions, std::uint32_t* count,
                               char** ids);
std::uint32_t AppendClassDeviceIds(const MaintenanceFunctions& functions,
                                   const std::uint8_t classId[16], std::uint32_t* count,
                                   char** ids);
void InstallDriver(const MaintenanceFunctions& functions, const char* instanceId,
                   const char* infPath, bool bySystemVersion, bool isVistaExactly);

}  // namespace ZV
