#include "api/camera_store.h"
#include "api/exported_call.h"
#include "api/result_codes.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

constexpr std::uint32_t VersionNumber = 2008;
constexpr std::uint32_t VersionMajor = 2;

std::uint16_t GetMinorVersion() {
    return static_cast<std::uint16_t>((VersionNumber - VersionMajor * 1000) / 10);
}

// Kept: two ways to a build number, though this version number reaches only the second.
std::uint16_t GetBuildNumber() {
    const std::uint32_t minor = GetMinorVersion();
    const std::uint32_t rest = VersionNumber - VersionMajor * 1000;
    return static_cast<std::uint16_t>(minor >= 10 ? rest - minor * 10 : rest - minor * 100);
}

CameraResult InitializeCameras() {
    CameraResult result = CameraHalFault;
    (void)Guarded([&] {
        result = ZCamera::Initialize();
        return ZentaraResult{zerrNone};
    });
    return result;
}

ZentaraResult StoreVersion(const char* function, std::uint16_t* major, std::uint16_t* minor) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (major == nullptr) return zerrBadParameter;
    if (minor == nullptr) return zerrBadParameter;
    *major = VersionMajor;
    *minor = GetMinorVersion();
    ZLogMessage(function, "Zentara version is %d.%d", *major, *minor);
    return zerrNone;
}

ZentaraResult StoreLibVersion(const char* function, std::uint16_t* major, std::uint16_t* minor,
                              std::uint16_t* build) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (major == nullptr) return zerrBadParameter;
    if (minor == nullptr) return zerrBadParameter;
    if (build == nullptr) return zerrBadParameter;
    *major = VersionMajor;
    *minor = GetMinorVersion();
    *build = GetBuildNumber();
    ZLogMessage(function, "Zentara version is %d.%d.%d", *major, *minor, *build);
    return zerrNone;
}

ZentaraResult ReleaseCameras() {
    CameraStore::Get().FreeAll();
    (void)ZCamera::Shutdown();  // 0 whatever happened
    return zerrNone;
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_LoadDriver(void) {
    constexpr const char* Function = "Zentara_LoadDriver";
    ZV::ZLogOpen();
    ZV::ZLogEnter(Function);
    const ZV::CameraResult result = ZV::InitializeCameras();
    // Kept: no end record, so the log's nesting stays one too high after a second load.
    if (result == ZV::CameraAlreadyInitialized) return zerrAlreadyLoaded;
    const ZentaraResult code = ZV::TranslateCameraResult(result);
    if (result == ZV::CameraOk) {
        ZV::ZCamera::SetShouldOutputReads(ZV::GetOutputReads() != 0);
        ZV::ZCamera::SetShouldOutputWrites(ZV::GetOutputWrites() != 0);
    }
    ZV::ZLogLeave(Function, static_cast<std::uint16_t>(code));
    return code;
}

void Zentara_ReleaseDriver(void) {
    constexpr const char* Function = "Zentara_ReleaseDriver";
    ZV::ZLogEnter(Function);
    if (!ZV::ZCamera::IsInitalized()) {
        ZV::ZLogLeave(Function, zerrNotLoaded);
        return;
    }
    (void)ZV::Guarded(ZV::ReleaseCameras);
    ZV::ZLogLeave(Function, zerrNone);
    ZV::ZLogClose();
}

ZentaraResult Zentara_Version(uint16_t* major, uint16_t* minor) {
    return ZV::Traced(
        __func__, [&](const char* function) { return ZV::StoreVersion(function, major, minor); });
}

ZentaraResult Zentara_LibVersion(uint16_t* major, uint16_t* minor, uint16_t* build) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::StoreLibVersion(function, major, minor, build);
    });
}
