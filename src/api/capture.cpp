#include <memory>

#include "api/camera_context.h"
#include "api/delivery.h"
#include "api/entry_queue.h"
#include "api/event_service.h"
#include "api/exported_call.h"
#include "api/frame_export.h"
#include "api/handles.h"
#include "api/result_codes.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "imaging/ex_image.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

ZentaraResult GrabFrame(const char* function, ZentaraHandle handle, Zentara_Frame* frame) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    if (frame == nullptr) return zerrBadParameter;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    CameraContext* const context = GetCameraContext(*camera);
    if (context == nullptr) return zerrBadHandle;
    if (GetQueueCount(*context) != 0) return zerrBusy;
    if (camera->GetImageSize() > GetFrameCapacity(*frame)) return zerrBufferTooSmall;

    ZExImage* taken = nullptr;
    const CameraResult result = camera->GetOneImage(&taken);
    if (result != CameraOk) return TranslateCameraResult(result);
    if (taken == nullptr) return zerrDriverFault;
    const std::unique_ptr<ZExImage, void (*)(ZExImage*)> image(taken, ZCamera::FreeImage);
    PostProcess(*context, *image);
    ExportImageToFrame(handle, GetLastSettings(*context), *image, *frame, /*copiesPixels=*/true);
    ZLogFrame(function, *frame);
    return zerrNone;
}

ZentaraResult StartStreaming(const char* function, ZCamera& camera) {
    if (camera.IsCameraStreaming()) {
        ZLogMessage(function, "Streaming is already on");
        return zerrNone;
    }
    const CameraResult started = camera.StartStreamingImages(
        ImageReceived, ExposeDone, camera.DoesSupportExternalBuffers(), &camera);
    if (started == CameraOk) ZLogMessage(function, "Streaming is now on");
    return TranslateCameraResult(started);
}

ZentaraResult StopStreaming(const char* function, ZCamera& camera) {
    if (!camera.IsCameraStreaming()) {
        ZLogMessage(function, "Streaming is already off");
        return zerrNone;
    }
    const CameraResult stopped = camera.StopStreamingImages();
    if (stopped == CameraOk) ZLogMessage(function, "Streaming is now off");
    return TranslateCameraResult(stopped);
}

ZentaraResult SetStreaming(const char* function, ZentaraHandle handle, std::uint32_t enable) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    return enable != 0 ? StartStreaming(function, *camera) : StopStreaming(function, *camera);
}

ZentaraResult Trigger(const char* function, ZentaraHandle handle) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!camera->IsCameraStreaming()) return zerrNotStreaming;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    if (camera->GetTriggerMode() != ztrigSoftware) return zerrNotSupported;
    return TranslateCameraResult(camera->SoftwareTrigger());
}

void DropQueue(ZCamera& camera, CameraContext& context) {
    // Kept: from a callback that runs under this lock an abort waits for itself for ever.
    const SemaphoreHold delivery(*context.deliveryLock);
    {
        const SemaphoreHold queueing(*context.queueLock);
        context.abortRequested = 1;
    }
    ClearQueue(context);
    (void)camera.Abort();  // kept: its result is ignored
}

ZentaraResult Abort(const char* function, ZentaraHandle handle) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (handle == 0) return zerrBadHandle;
    ZCamera* const camera = FindCamera(handle);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    CameraContext* const context = GetCameraContext(*camera);
    if (context == nullptr) return zerrBadHandle;

    ReleaseOwnServices(*context);
    DropQueue(*camera, *context);
    // With no lock held: what ExposeDone has begun goes on to its end and calls back no more.
    AwaitExposures(*context);
    return zerrNone;
}

ZentaraResult Decline(const char*) {
    return ZCamera::IsInitalized() ? ZentaraResult{zerrNotSupported} : ZentaraResult{zerrNotLoaded};
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_GrabFrame(ZentaraHandle handle, Zentara_Frame* frame) {
    return ZV::Traced(__func__,
                      [&](const char* function) { return ZV::GrabFrame(function, handle, frame); });
}

ZentaraResult Zentara_SetStreaming(ZentaraHandle handle, uint32_t enable) {
    return ZV::Traced(
        __func__, [&](const char* function) { return ZV::SetStreaming(function, handle, enable); });
}

ZentaraResult Zentara_Trigger(ZentaraHandle handle) {
    return ZV::Traced(__func__,
                      [&](const char* function) { return ZV::Trigger(function, handle); });
}

ZentaraResult Zentara_Abort(ZentaraHandle handle) {
    return ZV::Traced(__func__, [&](const char* function) { return ZV::Abort(function, handle); });
}

ZentaraResult Zentara_GrabFrameNow(ZentaraHandle, Zentara_Frame*) {
    return ZV::Traced(__func__, ZV::Decline);
}

ZentaraResult Zentara_GrabRawNow(ZentaraHandle, Zentara_Frame*) {
    return ZV::Traced(__func__, ZV::Decline);
}

ZentaraResult Zentara_ProcessRaw(ZentaraHandle, Zentara_Frame*) {
    return ZV::Traced(__func__, ZV::Decline);
}

ZentaraResult Zentara_SetFrameBuffers(ZentaraHandle, Zentara_Frame*) {
    return ZV::Traced(__func__, ZV::Decline);
}
