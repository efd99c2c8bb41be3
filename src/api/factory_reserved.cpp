#include "api/exported_call.h"
#include "api/handles.h"
#include "camera/camera.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

// Kept: the handle is not tested beyond naming a camera, and the result is not translated.
ZentaraResult PassReserved(ZentaraHandle handle, std::uint32_t selector, void* data,
                           std::uint32_t quadlets, std::uint32_t checksum) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    ZCamera* const camera = FindCamera(handle);
    if (camera == nullptr) return zerrNotSupported;
    // The checksum of a write is formed before the bus layer looks at the data.
    if (data == nullptr) return zerrNotSupported;
    const CameraResult result = camera->SetReserved0(selector, data, quadlets, checksum);
    return result == CameraOk ? zerrNone : zerrNotSupported;
}

}  // namespace

}  // namespace ZV

ZentaraResult _Zentara_factory_reserved0(ZentaraHandle handle, uint32_t selector, void* data,
                                         uint32_t quadlets, uint32_t checksum) {
    return ZV::Traced(__func__, [&](const char*) {
        return ZV::PassReserved(handle, selector, data, quadlets, checksum);
    });
}
