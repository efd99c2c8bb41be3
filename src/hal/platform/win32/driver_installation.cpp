#include <cstdio>
#include <cstring>

#include "hal/platform/debug_output.h"
#include "hal/platform/win32/maintenance_functions.h"

namespace ZV {
namespace {

constexpr DWORD InstallFlags = DI_QUIETINSTALL | DI_NOFILECOPY | DI_ENUMSINGLEINF;
constexpr DWORD InstallFlagsEx = DI_FLAGSEX_ALLOWEXCLUDEDDRVS;
static_assert(InstallFlags == 0x1810000 && InstallFlagsEx == 0x800);
static_assert(SPDIT_COMPATDRIVER == 2 && DIF_SELECTBESTCOMPATDRV == 23);
static_assert(sizeof(SP_DEVINSTALL_PARAMS_A) == 320 && sizeof(SP_DRVINFO_DATA_A) == 800);

constexpr DWORD DeviceInstallFlags = 2;

using InstallSelectedDriverFunction = BOOL(WINAPI*)(HWND, HDEVINFO, LPCWSTR reserved, BOOL backup,
                                                    DWORD* needsReboot);
using DiInstallDeviceFunction = BOOL(WINAPI*)(HWND, HDEVINFO, SP_DEVINFO_DATA*, SP_DRVINFO_DATA_A*,
                                              DWORD flags, BOOL* needsReboot);

/// What one installation holds; its end lets go of it in every case.
struct Installation {
    const MaintenanceFunctions& system;
    HDEVINFO set;
    SP_DEVINFO_DATA device;
    HMODULE library;
};

void PrintWithNumber(const char* format, DWORD number) {
    char text[128];
    std::snprintf(text, sizeof text, format, static_cast<int>(number));
    WriteDebuggerOutput(text);
}

// Kept: spelling and blanks of the texts that follow, the word UnInstall among them.

bool ReportStep(BOOL isDone, const char* format) {
    if (!isDone) PrintWithNumber(format, GetLastError());
    return isDone != FALSE;
}

bool SelectDevice(const char* instanceId, Installation* installation) {
    const MaintenanceFunctions& system = installation->system;
    SP_DEVINFO_DATA* device = &installation->device;
    installation->set = system.createDeviceInfoList(nullptr, nullptr);
    if (installation->set == INVALID_HANDLE_VALUE || instanceId == nullptr) return false;
    device->cbSize = sizeof *device;
    return system.openDeviceInfo(installation->set, instanceId, nullptr, 0, device) &&
           system.setSelectedDevice(installation->set, device);
}

bool SetDriverPath(const char* infPath, SP_DEVINSTALL_PARAMS_A* parameters) {
    constexpr std::size_t Capacity = sizeof parameters->DriverPath;
    const std::size_t length = infPath != nullptr ? strnlen(infPath, Capacity) : Capacity;
    if (length == Capacity) {
        PrintWithNumber("StringCchCopy  was NOT succesfull %d", ERROR_INVALID_PARAMETER);
        return false;
    }
    std::memcpy(parameters->DriverPath, infPath, length + 1);
    return true;
}

bool PrepareParameters(Installation* installation, const char* infPath,
                       SP_DEVINSTALL_PARAMS_A* parameters) {
    parameters->cbSize = sizeof *parameters;
    if (!installation->system.getDeviceInstallParams(installation->set, &installation->device,
                                                     parameters)) {
        return false;
    }
    parameters->Flags |= InstallFlags;
    parameters->FlagsEx |= InstallFlagsEx;
    return SetDriverPath(infPath, parameters);
}

bool SelectBestDriver(Installation* installation, SP_DEVINSTALL_PARAMS_A* parameters) {
    const MaintenanceFunctions& system = installation->system;
    HDEVINFO set = installation->set;
    SP_DEVINFO_DATA* device = &installation->device;
    SP_DRVINFO_DATA_A driver{};
    driver.cbSize = sizeof driver;
    return ReportStep(system.setDeviceInstallParams(set, device, parameters),
                      "SetupDiSetDeviceInstallParams  was NOT succesfull %d") &&
           ReportStep(system.buildDriverInfoList(set, device, SPDIT_COMPATDRIVER),
                      "SetupDiBuildDriverInfoList  was NOT succesfull %d") &&
           ReportStep(system.callClassInstaller(DIF_SELECTBESTCOMPATDRV, set, device),
                      "SetupDiCallClassInstaller  was NOT succesfull %d") &&
           ReportStep(system.getSelectedDriver(set, device, &driver),
                      "SetupDiGetSelectedDriver  was NOT succesfull %d");
}

void LoadInstaller(Installation* installation) {
    constexpr char Tail[] = "\\NEWDEV.DLL";
    char path[MAX_PATH + sizeof Tail];
    const UINT length = installation->system.getSystemDirectory(path, MAX_PATH);
    if (length == 0 || length >= MAX_PATH) return;
    std::memcpy(path + length, Tail, sizeof Tail);
    // What the library itself needs is looked for in the system folder first, not in the program's.
    installation->library =
        installation->system.loadLibrary(path, nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
}

/// Null also when the library could not be loaded.
template <typename Function>
Function FindInstallerFunction(const Installation& installation, const char* name) {
    if (installation.library == nullptr) return nullptr;
    const FARPROC function = installation.system.getProcAddress(installation.library, name);
    return reinterpret_cast<Function>(reinterpret_cast<void*>(function));
}

void CallInstallSelectedDriver(const Installation& installation) {
    const auto install =
        FindInstallerFunction<InstallSelectedDriverFunction>(installation, "InstallSelectedDriver");
    if (install == nullptr) return;
    DWORD needsReboot = 0;
    (void)install(nullptr, installation.set, nullptr, TRUE, &needsReboot);
}

void ReportDeviceInstallFailure(DWORD error) {
    if (error == ERROR_ACCESS_DENIED) {
        WriteDebuggerOutput("ERROR_ACCESS_DENIED");
    } else if (error == ERROR_INVALID_FLAGS) {
        WriteDebuggerOutput("ERROR_INVALID_FLAGS");
    } else {
        PrintWithNumber("pInstallDevice  was NOT succesfull %d", error);
    }
}

void CallDiInstallDevice(Installation* installation) {
    const auto install =
        FindInstallerFunction<DiInstallDeviceFunction>(*installation, "DiInstallDevice");
    if (install == nullptr) {
        WriteDebuggerOutput("DiInstallDevice function did not load properly");
        return;
    }
    WriteDebuggerOutput("UnInstall on Vista");
    BOOL needsReboot = FALSE;
    if (install(nullptr, installation->set, &installation->device, nullptr, DeviceInstallFlags,
                &needsReboot)) {
        WriteDebuggerOutput("pInstallDevice  was succesfull");
    } else {
        ReportDeviceInstallFailure(GetLastError());
    }
}

void RunInstallation(Installation* installation, const char* instanceId, const char* infPath,
                     bool bySystemVersion, bool isVistaExactly) {
    SP_DEVINSTALL_PARAMS_A parameters{};
    if (!SelectDevice(instanceId, installation)) return;
    if (!PrepareParameters(installation, infPath, &parameters)) return;
    if (!SelectBestDriver(installation, &parameters)) return;
    LoadInstaller(installation);
    if (bySystemVersion && isVistaExactly) {
        CallDiInstallDevice(installation);
        return;
    }
    // Before the call, and so also where the function is missing.
    if (bySystemVersion) WriteDebuggerOutput("UnInstall on XP");
    CallInstallSelectedDriver(*installation);
}

void EndInstallation(const Installation& installation) {
    const MaintenanceFunctions& system = installation.system;
    WriteDebuggerOutput("clean0");
    if (installation.library != nullptr) system.freeLibrary(installation.library);
    if (installation.set != INVALID_HANDLE_VALUE) system.destroyDeviceInfoList(installation.set);
}

}  // namespace

void InstallDriver(const char* instanceId, const char* infPath, bool bySystemVersion,
                   bool isVistaExactly) {
    InstallDriver(GetMaintenanceFunctions(), instanceId, infPath, bySystemVersion, isVistaExactly);
}

void InstallDriver(const MaintenanceFunctions& functions, const char* instanceId,
                   const char* infPath, bool bySystemVersion, bool isVistaExactly) {
    Installation installation{functions, INVALID_HANDLE_VALUE, {}, nullptr};
    RunInstallation(&installation, instanceId, infPath, bySystemVersion, isVistaExactly);
    EndInstallation(installation);
}

}  // namespace ZV
