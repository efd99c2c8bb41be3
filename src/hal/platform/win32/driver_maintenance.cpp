#include "hal/platform/driver_maintenance.h"

#include <windows.h>

#include <shlobj.h>

#include <cstdlib>
#include <cstring>

#include "hal/platform/win32/device_interface_class.h"
#include "hal/platform/win32/maintenance_functions.h"

namespace ZV {
namespace {

constexpr std::uint32_t ListingDone = 0;
constexpr std::uint32_t ListingFailed = 998;

/// The device's instance id as a heap text, or null.
char* CopyDeviceId(const MaintenanceFunctions& functions, DEVINST device) {
    ULONG length = 0;
    if (functions.getDeviceIdSize(&length, device, 0) != CR_SUCCESS) return nullptr;
    auto* text = static_cast<char*>(std::calloc(std::size_t{length} + 1, 1));
    if (text == nullptr) return nullptr;
    char id[MAX_DEVICE_ID_LEN + 1] = "";
    if (functions.getDeviceId(device, id, MAX_DEVICE_ID_LEN, 0) != CR_SUCCESS) {
        std::free(text);
        return nullptr;
    }
    std::memcpy(text, id, strnlen(id, length));
    return text;
}

bool GetListedNode(const MaintenanceFunctions& functions, const SP_DEVINFO_DATA& device,
                   bool ofParent, DEVINST* node) {
    *node = device.DevInst;
    return !ofParent || functions.getParent(node, device.DevInst, 0) == CR_SUCCESS;
}

std::uint32_t AppendIds(const MaintenanceFunctions& functions, HDEVINFO set, bool ofParent,
                        std::uint32_t* count, char** ids) {
    SP_DEVINFO_DATA device{};
    device.cbSize = sizeof device;
    for (DWORD index = 0; functions.enumerateDevices(set, index, &device); ++index) {
        DEVINST node = 0;
        if (!GetListedNode(functions, device, ofParent, &node)) return ListingFailed;
        char* id = CopyDeviceId(functions, node);
        if (id == nullptr) return ListingFailed;
        ids[(*count)++] = id;
    }
    return GetLastError() == ERROR_NO_MORE_ITEMS ? ListingDone : ListingFailed;
}

std::uint32_t AppendIdsOfClass(const MaintenanceFunctions& functions, const GUID& classId,
                               DWORD flags, bool ofParent, std::uint32_t* count, char** ids) {
    HDEVINFO set = functions.getClassDevices(&classId, nullptr, nullptr, flags);
    if (set == INVALID_HANDLE_VALUE) return ListingFailed;
    const std::uint32_t status = AppendIds(functions, set, ofParent, count, ids);
    functions.destroyDeviceInfoList(set);
    return status;
}

/// The extended record, or the basic one where the system does not know the extended one.
bool ReadVersion(const MaintenanceFunctions& functions, OSVERSIONINFOEXA* version) {
    static_assert(sizeof *version == 156 && sizeof(OSVERSIONINFOA) == 148);
    auto* basic = reinterpret_cast<OSVERSIONINFOA*>(version);
    basic->dwOSVersionInfoSize = sizeof *version;
    if (functions.getVersion(basic)) return true;
    basic->dwOSVersionInfoSize = sizeof *basic;
    return functions.getVersion(basic) != FALSE;
}

// Kept: the processor is asked for with the version, and nothing depends on the answer.
void ReadNativeSystemInfo(const MaintenanceFunctions& functions) {
    SYSTEM_INFO information{};
    const HMODULE kernel = GetModuleHandleA("kernel32.dll");
    const FARPROC symbol =
        kernel != nullptr ? functions.getProcAddress(kernel, "GetNativeSystemInfo") : nullptr;
    const auto getNativeSystemInfo =
        reinterpret_cast<decltype(&::GetSystemInfo)>(reinterpret_cast<void*>(symbol));
    (getNativeSystemInfo != nullptr ? getNativeSystemInfo : functions.getSystemInfo)(&information);
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
    return IsProcessAdministrator(GetMaintenanceFunctions());
}

bool QueryProcessElevation(bool* isElevated) {
    return QueryProcessElevation(GetMaintenanceFunctions(), isElevated);
}

bool QuerySystemVersion(SystemVersion* version) {
    return QuerySystemVersion(GetMaintenanceFunctions(), version);
}

std::uint32_t AppendAdapterIds(std::uint32_t* count, char** ids) {
    return AppendAdapterIds(GetMaintenanceFunctions(), count, ids);
}

std::uint32_t AppendClassDeviceIds(const std::uint8_t classId[16], std::uint32_t* count,
                                   char** ids) {
    return AppendClassDeviceIds(GetMaintenanceFunctions(), classId, count, ids);
}

bool IsProcessAdministrator(const MaintenanceFunctions& functions) {
    SID_IDENTIFIER_AUTHORITY authority = {SECURITY_NT_AUTHORITY};
    PSID administrators = nullptr;
    if (!functions.makeSid(&authority, 2, SECURITY_BUILTIN_DOMAIN_RID, DOMAIN_ALIAS_RID_ADMINS, 0,
                           0, 0, 0, 0, 0, &administrators)) {
        return false;
    }
    BOOL isMember = FALSE;
    const BOOL isKnown = functions.checkMembership(nullptr, administrators, &isMember);
    FreeSid(administrators);
    return isKnown && isMember;
}

bool QueryProcessElevation(const MaintenanceFunctions& functions, bool* isElevated) {
    HANDLE token = nullptr;
    if (!functions.openProcessToken(GetCurrentProcess(), TOKEN_QUERY, &token)) return false;
    TOKEN_ELEVATION elevation{};
    DWORD bytes = 0;
    const BOOL isKnown =
        functions.getTokenInformation(token, TokenElevation, &elevation, sizeof elevation, &bytes);
    CloseHandle(token);
    if (isKnown) *isElevated = elevation.TokenIsElevated != 0;
    return isKnown != FALSE;
}

bool QuerySystemVersion(const MaintenanceFunctions& functions, SystemVersion* version) {
    OSVERSIONINFOEXA read{};
    if (!ReadVersion(functions, &read)) return false;
    ReadNativeSystemInfo(functions);
    *version = SystemVersion{read.dwPlatformId, read.dwMajorVersion, read.dwMinorVersion};
    return true;
}

std::uint32_t AppendAdapterIds(const MaintenanceFunctions& functions, std::uint32_t* count,
                               char** ids) {
    return AppendIdsOfClass(functions, DeviceInterfaceClass, DIGCF_PRESENT | DIGCF_DEVICEINTERFACE,
                            true, count, ids);
}

std::uint32_t AppendClassDeviceIds(const MaintenanceFunctions& functions,
                                   const std::uint8_t classId[16], std::uint32_t* count,
                                   char** ids) {
    GUID id;
    std::memcpy(&id, classId, sizeof id);
    return AppendIdsOfClass(functions, id, DIGCF_PRESENT, false, count, ids);
}

}  // namespace ZV
