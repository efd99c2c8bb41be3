#include "hal/platform/win32/maintenance_functions.h"

namespace ZV {

MaintenanceFunctions GetMaintenanceFunctions() {
    MaintenanceFunctions functions{};
    functions.createDeviceInfoList = SetupDiCreateDeviceInfoList;
    functions.openDeviceInfo = SetupDiOpenDeviceInfoA;
    functions.setSelectedDevice = SetupDiSetSelectedDevice;
    functions.getDeviceInstallParams = SetupDiGetDeviceInstallParamsA;
    functions.setDeviceInstallParams = SetupDiSetDeviceInstallParamsA;
    functions.buildDriverInfoList = SetupDiBuildDriverInfoList;
    functions.callClassInstaller = SetupDiCallClassInstaller;
    functions.getSelectedDriver = SetupDiGetSelectedDriverA;
    functions.getSystemDirectory = GetSystemDirectoryA;
    functions.loadLibrary = LoadLibraryExA;
    functions.getProcAddress = GetProcAddress;
    functions.freeLibrary = FreeLibrary;
    functions.destroyDeviceInfoList = SetupDiDestroyDeviceInfoList;
    functions.getClassDevices = SetupDiGetClassDevsA;
    functions.enumerateDevices = SetupDiEnumDeviceInfo;
    functions.getParent = CM_Get_Parent;
    functions.getDeviceIdSize = CM_Get_Device_ID_Size;
    functions.getDeviceId = CM_Get_Device_IDA;
    functions.makeSid = AllocateAndInitializeSid;
    functions.checkMembership = CheckTokenMembership;
    functions.openProcessToken = OpenProcessToken;
    functions.getTokenInformation = GetTokenInformation;
    functions.getVersion = GetVersionExA;
    functions.getSystemInfo = GetSystemInfo;
    return functions;
}

}  // namespace ZV
