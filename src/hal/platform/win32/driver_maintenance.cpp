#include "hal/platform/driver_maintenance.h"

#include <windows.h>

#include <cfgmgr32.h>
#include <setupapi.h>
#include <shlobj.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "hal/platform/debug_output.h"
#include "hal/platform/win32/device_interface_class.h"

namespace ZV {
namespace {

constexpr std::uint32_t ListingDone = 0;
constexpr std::uint32_t ListingFailed = 998;

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
    installation->set = SetupDiCreateDeviceInfoList(nullptr, nullptr);
    if (installation->set == INVALID_HANDLE_VALUE) return false;
    installation->device.cbSize = sizeof installation->device;
    return SetupDiOpenDeviceInfoA(installation->set, instanceId, nullptr, 0,
                                  &installation->device) &&
           SetupDiSetSelectedDevice(installation->set, &installation->device);
}

bool SetDriverPath(const char* infPath, SP_DEVINSTALL_PARAMS_A* parameters) {
    const std::size_t length = std::strlen(infPath);
    if (length >= sizeof parameters->DriverPath) {
        PrintWithNumber("StringCchCopy  was NOT succesfull %d", ERROR_INVALID_PARAMETER);
        return false;
    }
    std::memcpy(parameters->DriverPath, infPath, length + 1);
    return true;
}

bool PrepareParameters(const Installation& installation, const char* infPath,
                       SP_DEVINSTALL_PARAMS_A* parameters) {
    HDEVINFO set = installation.set;
    SP_DEVINFO_DATA device = installation.device;
    parameters->cbSize = sizeof *parameters;
    if (!SetupDiGetDeviceInstallParamsA(set, &device, parameters)) return false;
    parameters->Flags |= InstallFlags;
    parameters->FlagsEx |= InstallFlagsEx;
    return SetDriverPath(infPath, parameters);
}

bool SelectBestDriver(Installation* installation, SP_DEVINSTALL_PARAMS_A* parameters) {
    HDEVINFO set = installation->set;
    SP_DEVINFO_DATA* device = &installation->device;
    SP_DRVINFO_DATA_A driver{};
    driver.cbSize = sizeof driver;
    return ReportStep(SetupDiSetDeviceInstallParamsA(set, device, parameters),
                      "SetupDiSetDeviceInstallParams  was NOT succesfull %d") &&
           ReportStep(SetupDiBuildDriverInfoList(set, device, SPDIT_COMPATDRIVER),
                      "SetupDiBuildDriverInfoList  was NOT succesfull %d") &&
           ReportStep(SetupDiCallClassInstaller(DIF_SELECTBESTCOMPATDRV, set, device),
                      "SetupDiCallClassInstaller  was NOT succesfull %d") &&
           ReportStep(SetupDiGetSelectedDriverA(set, device, &driver),
                      "SetupDiGetSelectedDriver  was NOT succesfull %d");
}

bool LoadInstaller(Installation* installation) {
    constexpr char Tail[] = "\\NEWDEV.DLL";
    char path[MAX_PATH + sizeof Tail];
    const UINT length = GetSystemDirectoryA(path, MAX_PATH);
    if (length == 0 || length >= MAX_PATH) return false;
    std::memcpy(path + length, Tail, sizeof Tail);
    installation->library = LoadLibraryA(path);
    return installation->library != nullptr;
}

template <typename Function>
Function FindInstallerFunction(const Installation& installation, const char* name) {
    const FARPROC function = GetProcAddress(installation.library, name);
    return reinterpret_cast<Function>(reinterpret_cast<void*>(function));
}

void CallInstallSelectedDriver(const Installation& installation, const char* trace) {
    const auto install =
        FindInstallerFunction<InstallSelectedDriverFunction>(installation, "InstallSelectedDriver");
    if (install == nullptr) return;
    if (trace != nullptr) WriteDebuggerOutput(trace);
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
    if (!PrepareParameters(*installation, infPath, &parameters)) return;
    if (!SelectBestDriver(installation, &parameters)) return;
    if (!LoadInstaller(installation)) return;
    if (bySystemVersion && isVistaExactly) {
        CallDiInstallDevice(installation);
    } else {
        CallInstallSelectedDriver(*installation, bySystemVersion ? "UnInstall on XP" : nullptr);
    }
}

void EndInstallation(const Installation& installation) {
    WriteDebuggerOutput("clean0");
    if (installation.library != nullptr) FreeLibrary(installation.library);
    if (installation.set != INVALID_HANDLE_VALUE) SetupDiDestroyDeviceInfoList(installation.set);
}

/// The device's instance id as a heap text, or null.
char* CopyDeviceId(DEVINST device) {
    ULONG length = 0;
    char id[MAX_DEVICE_ID_LEN + 1] = "";
    if (CM_Get_Device_ID_Size(&length, device, 0) != CR_SUCCESS) return nullptr;
    if (CM_Get_Device_IDA(device, id, MAX_DEVICE_ID_LEN, 0) != CR_SUCCESS) return nullptr;
    auto* text = static_cast<char*>(std::calloc(std::size_t{length} + 1, 1));
    if (text != nullptr) std::memcpy(text, id, strnlen(id, length));
    return text;
}

bool GetListedNode(const SP_DEVINFO_DATA& device, bool ofParent, DEVINST* node) {
    *node = device.DevInst;
    return !ofParent || CM_Get_Parent(node, device.DevInst, 0) == CR_SUCCESS;
}

std::uint32_t AppendIds(HDEVINFO set, bool ofParent, std::uint32_t* count, char** ids) {
    SP_DEVINFO_DATA device{};
    device.cbSize = sizeof device;
    for (DWORD index = 0; SetupDiEnumDeviceInfo(set, index, &device); ++index) {
        DEVINST node = 0;
        if (!GetListedNode(device, ofParent, &node)) return ListingFailed;
        char* id = CopyDeviceId(node);
        if (id == nullptr) return ListingFailed;
        ids[(*count)++] = id;
    }
    return GetLastError() == ERROR_NO_MORE_ITEMS ? ListingDone : ListingFailed;
}

std::uint32_t AppendIdsOfClass(const GUID& classId, DWORD flags, bool ofParent,
                               std::uint32_t* count, char** ids) {
    HDEVINFO set = SetupDiGetClassDevsA(&classId, nullptr, nullptr, flags);
    if (set == INVALID_HANDLE_VALUE) return ListingFailed;
    const std::uint32_t status = AppendIds(set, ofParent, count, ids);
    SetupDiDestroyDeviceInfoList(set);
    return status;
}

}  // namespace

void GetCommonProgramFilesFolder(char path[260]) {
    static_assert(CSIDL_PROGRAM_FILES_COMMON == 43 && MAX_PATH == 260);
    if (FAILED(SHGetFolderPathA(nullptr, CSIDL_PROGRAM_FILES_COMMON, nullptr, SHGFP_TYPE_CURRENT,
                                path))) {
        path[0] = '\0';
    }
}

bool IsProcessAdministrator() {
    SID_IDENTIFIER_AUTHORITY authority = {SECURITY_NT_AUTHORITY};
    PSID administrators = nullptr;
    if (!AllocateAndInitializeSid(&authority, 2, SECURITY_BUILTIN_DOMAIN_RID,
                                  DOMAIN_ALIAS_RID_ADMINS, 0, 0, 0, 0, 0, 0, &administrators)) {
        return false;
    }
    BOOL isMember = FALSE;
    const BOOL isKnown = CheckTokenMembership(nullptr, administrators, &isMember);
    FreeSid(administrators);
    return isKnown && isMember;
}

bool QueryProcessElevation(bool* isElevated) {
    HANDLE token = nullptr;
    if (!OpenProcessToken(GetCurrentProcess(), TOKEN_QUERY, &token)) return false;
    TOKEN_ELEVATION elevation{};
    DWORD bytes = 0;
    const BOOL isKnown =
        GetTokenInformation(token, TokenElevation, &elevation, sizeof elevation, &bytes);
    CloseHandle(token);
    if (isKnown) *isElevated = elevation.TokenIsElevated != 0;
    return isKnown != FALSE;
}

bool QuerySystemVersion(SystemVersion* version) {
    OSVERSIONINFOEXA extended{};
    static_assert(sizeof extended == 156 && sizeof(OSVERSIONINFOA) == 148);
    auto* basic = reinterpret_cast<OSVERSIONINFOA*>(&extended);
    extended.dwOSVersionInfoSize = sizeof extended;
    if (!GetVersionExA(basic)) {
        extended.dwOSVersionInfoSize = sizeof *basic;
        if (!GetVersionExA(basic)) return false;
    }
    *version =
        SystemVersion{extended.dwPlatformId, extended.dwMajorVersion, extended.dwMinorVersion};
    return true;
}

std::uint32_t AppendAdapterIds(std::uint32_t* count, char** ids) {
    return AppendIdsOfClass(DeviceInterfaceClass, DIGCF_PRESENT | DIGCF_DEVICEINTERFACE, true,
                            count, ids);
}

std::uint32_t AppendClassDeviceIds(const std::uint8_t classId[16], std::uint32_t* count,
                                   char** ids) {
    GUID id;
    std::memcpy(&id, classId, sizeof id);
    return AppendIdsOfClass(id, DIGCF_PRESENT, false, count, ids);
}

void InstallDriver(const char* instanceId, const char* infPath, bool bySystemVersion,
                   bool isVistaExactly) {
    Installation installation{INVALID_HANDLE_VALUE, {}, nullptr};
    RunInstallation(&installation, instanceId, infPath, bySystemVersion, isVistaExactly);
    EndInstallation(installation);
}

}  // namespace ZV
