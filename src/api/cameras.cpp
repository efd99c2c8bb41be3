#include <algorithm>
#include <new>

#include "api/camera_store.h"
#include "api/exported_call.h"
#include "api/handles.h"
#include "api/result_codes.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

void FillItem(Zentara_CamListItem& item, std::uint32_t cameraId, ZCamera& camera) {
    item.cameraId = cameraId;
    item.cameraType = camera.GetModel();
    item.isOpen = camera.IsCameraOpen() ? 1 : 0;
    if (item.isOpen == 0) item.uniqueId = static_cast<std::uint32_t>(camera.GetUniqueID());
}

ZentaraResult ListCameras(const char* function, Zentara_CamListItem* items, std::uint32_t* length) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (items == nullptr) return zerrBadParameter;
    if (length == nullptr) return zerrBadParameter;

    CameraStore& store = CameraStore::Get();
    const ZentaraResult result = TranslateCameraResult(store.MakeList());
    const auto count = static_cast<std::uint32_t>(store.GetList().size());
    const std::uint32_t filled = std::min(count, *length);
    for (std::uint32_t id = 0; id < filled; ++id) FillItem(items[id], id, *store.GetList()[id]);
    *length = count;
    ZLogMessage(function, "Found %d cameras", count);
    return result;
}

/// A camera whose opening broke off when it was connected already, for want of memory, is closed
/// again. One that another process holds stays as it is.
CameraResult ConnectCamera(ZCamera& camera) {
    CameraResult result = CameraHalFault;
    (void)Guarded([&] {
        result = camera.OpenCamera();
        return ZentaraResult{zerrNone};
    });
    if (result != CameraOk && camera.DoWeHaveExclusiveAccess()) (void)camera.CloseCamera();
    return result;
}

ZentaraResult MakeAndAttachContext(ZCamera& camera) {
    const ZentaraResult result = Guarded([&] {
        const bool isAttached = CameraStore::Get().AttachContext(camera);
        return isAttached ? ZentaraResult{zerrNone} : ZentaraResult{zerrDriverFault};
    });
    // There is no better code than the one for the context.
    if (result != zerrNone) (void)camera.CloseCamera();
    return result;
}

ZentaraResult OpenCamera(const char* function, std::uint32_t cameraId, ZentaraHandle* handle) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == nullptr) return zerrBadParameter;
    const std::vector<ZCamera*>& list = CameraStore::Get().GetList();
    if (cameraId >= list.size()) return zerrBadCameraId;
    ZCamera& camera = *list[cameraId];
    if (camera.IsCameraOpen()) {
        // Kept: the client gets a usable handle and a failure.
        *handle = GetHandle(&camera);
        ZLogMessage(function, "Camera is already open");
        return zerrBadCameraId;
    }
    // A listing that ended early, for want of memory, may not have come to it.
    if (FindCamera(GetHandle(&camera)) == nullptr) RegisterCamera(&camera);
    const CameraResult opened = ConnectCamera(camera);
    if (opened != CameraOk) return TranslateCameraResult(opened);
    ZLogMessage(function, "Opened %s camera", camera.GetModelName());
    const ZentaraResult result = MakeAndAttachContext(camera);
    if (result == zerrNone) *handle = GetHandle(&camera);
    return result;
}

ZentaraResult CloseCamera(const char* function, ZentaraHandle handle) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    ZCamera* const camera = FindCamera(handle);
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    if (!IsOpen(camera)) return zerrBadHandle;
    // Kept: what the camera reports is ignored. After a close that failed the camera stays open
    // without a context, and functions that need one answer as for a closed camera.
    (void)camera->StopStreamingImages();
    (void)camera->CloseCamera();
    CameraStore::Get().DetachContext(*camera);
    ZLogMessage(function, "Closed %s camera", camera->GetModelName());
    return zerrNone;
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_ListCameras(Zentara_CamListItem* items, uint32_t* length) {
    return ZV::Traced(
        __func__, [&](const char* function) { return ZV::ListCameras(function, items, length); });
}

ZentaraResult Zentara_OpenCamera(uint32_t cameraId, ZentaraHandle* handle) {
    return ZV::Traced(
        __func__, [&](const char* function) { return ZV::OpenCamera(function, cameraId, handle); });
}

ZentaraResult Zentara_CloseCamera(ZentaraHandle handle) {
    return ZV::Traced(__func__,
                      [&](const char* function) { return ZV::CloseCamera(function, handle); });
}

ZentaraResult Zentara_RegisterUnpluggedCallback(ZentaraHandle, ZentaraUnpluggedCallback, uint64_t) {
    return ZV::Traced(__func__, [](const char*) {
        return ZV::ZCamera::IsInitalized() ? ZentaraResult{zerrNone} : ZentaraResult{zerrNotLoaded};
    });
}
