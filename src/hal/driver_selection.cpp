#include "hal/driver_selection.h"

#include <atomic>
#include <cstdio>
#include <cstdlib>

#include "hal/hal.h"
#include "hal/open_camera_table.h"
#include "hal/platform/settings_store.h"

namespace ZV {
namespace {

constexpr std::size_t InstallPathBytes = 260;
constexpr std::uint32_t DriverModeFixed = 1;
constexpr std::uint32_t PlatformNT = 2;
constexpr std::uint32_t VistaMajor = 6;
constexpr std::uint32_t VistaMinor = 0;

std::atomic<bool> lastCameraFlag{false};

char* MakeInstallPath(const char* tail) {
    auto* const path = static_cast<char*>(std::malloc(InstallPathBytes));
    if (path == nullptr) return nullptr;
    char folder[InstallPathBytes] = {};
    GetCommonProgramFilesFolder(folder);
    // A path that is too long is cut.
    if (std::snprintf(path, InstallPathBytes, "%s%s", folder, tail) < 0) path[0] = '\0';
    return path;
}

bool IsDriverModeFixed(SettingsStore* store) {
    std::uint32_t mode = 0;
    return ReadStoredNumber(store, "FireWireDriverMode", &mode) && mode == DriverModeFixed;
}

}  // namespace

char* GetInfPath() {
    return MakeInstallPath("\\Morvane\\inf\\1394.inf");
}

char* GetUBInfPath() {
    return MakeInstallPath("\\Morvane\\inf\\ub1394.inf");
}

char* GetUBHelperPath() {
    return MakeInstallPath("\\Morvane\\UBHelper.exe");
}

bool AnyCameraOpen() {
    return OpenCameraTable().CountUsed() != 0;
}

bool DriverSwitchDue() {
    if (!lastCameraFlag.load(std::memory_order_relaxed)) return false;
    if (AnyCameraOpen()) return false;
    SettingsStore* const store = OpenSettingsStore();
    if (store == nullptr) return true;
    const bool isFixed = IsDriverModeFixed(store);
    CloseSettingsStore(store);
    return !isFixed;
}

void SetLastCameraFlag(bool isRaised) {
    lastCameraFlag.store(isRaised, std::memory_order_relaxed);
}

bool IsAdministrator() {
    return IsProcessAdministrator();
}

bool IsNotElevated(bool* isElevated) {
    bool elevated = false;
    if (!QueryProcessElevation(&elevated)) return false;
    if (isElevated != nullptr) *isElevated = elevated;
    return !elevated;
}

bool IsVistaExactly() {
    SystemVersion version{};
    return QuerySystemVersion(&version) && IsVistaExactly(version);
}

bool IsVistaExactly(const SystemVersion& version) {
    return version.platform == PlatformNT && version.major == VistaMajor &&
           version.minor == VistaMinor;
}

std::uint32_t ListAdapterIds(std::uint32_t* count, char** ids) {
    if (count == nullptr || ids == nullptr) return HALListingFailed;
    return AppendAdapterIds(count, ids);
}

std::uint32_t ListClassDeviceIds(const std::uint8_t classId[16], std::uint32_t* count, char** ids) {
    if (classId == nullptr || count == nullptr || ids == nullptr) return HALListingFailed;
    return AppendClassDeviceIds(classId, count, ids);
}

std::uint32_t InstallDriverOnDevice(const char* instanceId, const char* infPath) {
    InstallDriver(instanceId, infPath, /*bySystemVersion=*/false, /*isVistaExactly=*/false);
    return HALOk;
}

std::uint32_t InstallDriverOnDeviceForOS(const char* instanceId, const char* infPath) {
    InstallDriver(instanceId, infPath, /*bySystemVersion=*/true, IsVistaExactly());
    return HALOk;
}

}  // namespace ZV
