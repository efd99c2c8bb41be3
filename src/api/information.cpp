#include <cstdio>
#include <cstring>

#include "api/camera_context.h"
#include "api/exported_call.h"
#include "api/handles.h"
#include "api/information_table.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

ZentaraResult GetInfo(const char* function, ZentaraHandle handle, std::uint32_t key,
                      std::uint32_t* value) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (value == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    const InformationRow* const row = FindInformationRow(key);
    if (row == nullptr || row->answer == nullptr) {
        std::printf("Zentara_GetInfo not implemented for key %d\n", static_cast<std::int32_t>(key));
        *value = 0;
        return zerrNotSupported;
    }
    const ZentaraResult result = row->answer({*camera, GetCameraContext(*camera)}, value);
    if (result == zerrNone) ZentaraDebugOutputGetInfo(key, *value);
    return result;
}

ZentaraResult CopyText(const char* source, char* text, std::uint32_t length) {
    const std::size_t bytes = std::strlen(source) + 1;
    if (length < bytes) return zerrBadParameter;
    std::memcpy(text, source, bytes);
    return zerrNone;
}

ZentaraResult GetSerialString(const char* function, ZentaraHandle handle, char* text,
                              std::uint32_t length) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (text == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    if (!IsOpen(camera)) return zerrBadHandle;
    const ZCamera::SerialNumberText serial = camera->CopySerialNumber();
    const ZentaraResult result = CopyText(serial.data(), text, length);
    if (result == zerrNone) ZLogMessage(function, "Serial: %s", serial.data());
    return result;
}

ZentaraResult GetCameraModelString(const char* function, ZentaraHandle handle, char* text,
                                   std::uint32_t length) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (text == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    const char* const name = camera->GetModelName();
    const ZentaraResult result = CopyText(name, text, length);
    if (result == zerrNone) ZLogMessage(function, "Camera model: %s", name);
    return result;
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_GetInfo(ZentaraHandle handle, uint32_t key, uint32_t* value) {
    constexpr const char* Function = "Zentara_GetInfo";
    ZV::ZLogEnterInfo(Function, key);
    const ZentaraResult result =
        ZV::Guarded([&] { return ZV::GetInfo(Function, handle, key, value); });
    ZV::ZLogLeave(Function, static_cast<std::uint16_t>(result));
    return result;
}

ZentaraResult Zentara_GetSerialString(ZentaraHandle handle, char* text, uint32_t length) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::GetSerialString(function, handle, text, length);
    });
}

ZentaraResult Zentara_GetCameraModelString(ZentaraHandle handle, char* text, uint32_t length) {
    return ZV::Traced(__func__, [&](const char* function) {
        return ZV::GetCameraModelString(function, handle, text, length);
    });
}
