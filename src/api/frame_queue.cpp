#include "api/camera_context.h"
#include "api/entry_queue.h"
#include "api/exported_call.h"
#include "api/frame_export.h"
#include "api/handles.h"
#include "api/settings_block.h"
#include "api/stream_compatibility.h"
#include "camera/camera.h"
#include "diagnostics/log.h"
#include "zentara/zentara.h"

namespace ZV {

namespace {

// Kept: off, so that the call of the high-rate path is silent in the log but for its failures, each
// of which writes an end record without a start record.
constexpr bool LogsQueuedFrames = false;

ZentaraResult QueueFrameLocked(const char* function, ZCamera& camera, CameraContext& context,
                               const QueueEntry& entry) {
    const SemaphoreHold queueing(*context.queueLock);
    if (entry.frame == nullptr) return zerrBadParameter;
    if (GetQueueCount(context) >= QueueCapacity) return zerrQueueFull;
    if (camera.GetImageSize() > GetFrameCapacity(*entry.frame)) return zerrBufferTooSmall;
    if (!AppendEntry(context, entry)) return zerrDriverFault;
    if (camera.DoesSupportExternalBuffers()) {
        (void)camera.AddExternalImageBuffer(entry.frame->pBuffer);  // the capability was just asked
    }
    if (LogsQueuedFrames) {
        ZLogMessage(function, "Queued up frame (array size = %d)", GetQueueCount(context));
    }
    context.abortRequested = 0;
    return zerrNone;
}

ZentaraResult QueueFrame(const char* function, const QueueEntry& entry) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (entry.camera == 0) return zerrBadHandle;
    ZCamera* const camera = FindCamera(entry.camera);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    CameraContext* const context = GetCameraContext(*camera);
    if (context == nullptr) return zerrBadHandle;
    return QueueFrameLocked(function, *camera, *context, entry);
}

/// The queue is empty: the change is made at once, on this thread, without `queueLock`.
ZentaraResult SendUnlocked(CameraContext& context, const QueueEntry& entry) {
    struct Released {
        ZSemaphore& lock;
        explicit Released(ZSemaphore& given) : lock(given) { lock.Signal(); }
        ~Released() { lock.Wait(); }
    };
    const Released released(*context.queueLock);
    return Zentara_SendSettingsToCam(entry.camera, entry.settings);
}

ZentaraResult ApplyAtOnce(const char* function, CameraContext& context, const QueueEntry& entry) {
    const ZentaraResult result = SendUnlocked(context, entry);
    // Kept: this callback runs with the lock held, so it must not queue anything.
    if ((entry.flags & zcbFrameDone) != 0 && entry.callback != nullptr) {
        entry.callback(entry.userPrivate, entry.userData, result, entry.flags);
    }
    ZLogMessage(function, "Queue was empty, so settings change applied immediately");
    return result;
}

ZentaraResult QueueSettingsLocked(const char* function, ZCamera& camera, CameraContext& context,
                                  const QueueEntry& entry) {
    const SemaphoreHold queueing(*context.queueLock);
    if (entry.settings == nullptr || !HasSettingsMagic(*entry.settings)) return zerrBadSettings;
    if (GetQueueCount(context) >= QueueCapacity) return zerrQueueFull;
    if (!IsStreamCompatible(camera, *entry.settings)) return zerrBadSettings;
    ZentaraResult result = zerrNone;
    if (GetQueueCount(context) == 0) {
        result = ApplyAtOnce(function, context, entry);
    } else {
        if (!AppendEntry(context, entry)) return zerrDriverFault;
        ZLogMessage(function, "Queued up settings (array size = %d)", GetQueueCount(context));
    }
    context.abortRequested = 0;
    return result;
}

ZentaraResult QueueSettings(const char* function, const QueueEntry& entry) {
    if (!ZCamera::IsInitalized()) return zerrNotLoaded;
    if (entry.camera == 0) return zerrBadHandle;
    ZCamera* const camera = FindCamera(entry.camera);
    if (!IsOpen(camera)) return zerrBadHandle;
    if (!HasExclusiveAccess(function, camera)) return zerrBadHandle;
    CameraContext* const context = GetCameraContext(*camera);
    if (context == nullptr) return zerrBadHandle;
    return QueueSettingsLocked(function, *camera, *context, entry);
}

}  // namespace

}  // namespace ZV

ZentaraResult Zentara_QueueFrame(ZentaraHandle handle, Zentara_Frame* frame,
                                 ZentaraAsyncCallback callback, uint32_t flags,
                                 uint64_t userPrivate, uint32_t userData) {
    const ZV::QueueEntry entry{.camera = handle,
                               .frame = frame,
                               .callback = callback,
                               .flags = flags,
                               .userPrivate = userPrivate,
                               .userData = userData,
                               .kind = ZV::QueueKindFrame};
    if (ZV::LogsQueuedFrames) ZV::ZLogEnter(__func__);
    const char* const function = __func__;
    const ZentaraResult result = ZV::Guarded([&] { return ZV::QueueFrame(function, entry); });
    if (ZV::LogsQueuedFrames || result != zerrNone) {
        ZV::ZLogLeave(function, static_cast<std::uint16_t>(result));
    }
    return result;
}

ZentaraResult Zentara_QueueSettings(ZentaraHandle handle, Zentara_Settings* settings,
                                    ZentaraAsyncCallback callback, uint32_t flags,
                                    uint64_t userPrivate, uint32_t userData) {
    const ZV::QueueEntry entry{.camera = handle,
                               .settings = settings,
                               .callback = callback,
                               .flags = flags,
                               .userPrivate = userPrivate,
                               .userData = userData,
                               .kind = ZV::QueueKindSettings};
    return ZV::Traced(__func__,
                      [&](const char* function) { return ZV::QueueSettings(function, entry); });
}
