#include <cstdio>
#include <cstring>
#include <memory>
#include <new>
#include <utility>

#include "hal/fw_camera.h"
#include "hal/fw_device_context.h"
#include "hal/mutex_hold.h"

// The notification loop runs on a thread of its own and shares `notifying` and its request with the
// threads that enable, disable and disconnect. `deviceMutex` guards the sending of its requests;
// the request itself belongs to the loop until the thread has been ended.

namespace ZV {
namespace {

constexpr std::size_t ClearedRecordBegin = 4;
constexpr std::size_t ClearedRecordEnd = 2052;

ControlOutcome SendNotifyWait(const FWDeviceContext& context) {
    NotificationRequest& notification = *context.notification;
    const MutexHold hold(context.deviceMutex);
    std::memset(notification.record + ClearedRecordBegin, 0, ClearedRecordEnd - ClearedRecordBegin);
    const ControlRequest request{FW_IOCTL_NOTIFY_WAIT, notification.record, NotifyRecordBytes,
                                 notification.record, NotifyRecordBytes};
    return ControlDeviceOverlapped(context.device.Get(), request, notification.overlapped);
}

void* RunNotificationLoop(void* argument) {
    const FWDeviceContext& context = *static_cast<FWDeviceContext*>(argument);
    PlatformOverlapped* const overlapped = context.notification->overlapped;
    while (context.notifying.load(std::memory_order_relaxed) != 0) {
        // A request that was refused has no end to wait for.
        if (SendNotifyWait(context) == ControlOutcome::Failed) return nullptr;
        const CompletionOutcome outcome =
            WaitForCompletion(context.device.Get(), overlapped, WaitForEver);
        if (outcome == CompletionOutcome::Ended) return nullptr;
        ClearOverlapped(overlapped);
    }
    return nullptr;
}

bool SendPlain(FWDeviceContext& context, std::uint32_t code) {
    std::uint32_t record = 0;
    return SendRecord(context.device, code, &record, PlainRecordBytes);
}

}  // namespace

HALStatus FWCameraEnableNotification(HALCamera camera) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr || !context->device.IsOpen()) return HALDeviceNotOpen;
    if (!EndNotification(*context)) return HALWriteFailed;
    std::unique_ptr<NotificationRequest> request(new (std::nothrow) NotificationRequest);
    if (request == nullptr || request->overlapped == nullptr) return HALWriteFailed;
    const MutexHold hold(context->deviceMutex);
    if (!SendPlain(*context, FW_IOCTL_NOTIFY_ENABLE)) return HALWriteFailed;
    context->notification = std::move(request);
    context->notifying.store(1, std::memory_order_relaxed);
    (void)HAL_ThreadCreate(RunNotificationLoop, context, &context->notifyThread);
    if (IsHALThreadStarted(context->notifyThread)) return HALOk;
    (void)SendPlain(*context, FW_IOCTL_NOTIFY_DISABLE);  // there is nobody to be told
    return EndNotification(*context) ? HALWriteFailed : HALThreadNotTerminated;
}

HALStatus FWCameraDisableNotification(HALCamera camera) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr || !context->device.IsOpen()) return HALDeviceNotOpen;
    const MutexHold hold(context->deviceMutex);
    context->notifying.store(0, std::memory_order_relaxed);
    return SendPlain(*context, FW_IOCTL_NOTIFY_DISABLE) ? HALOk : HALWriteFailed;
}

void CameraAsyncWriteCallback(const std::uint8_t* bytes, std::uint32_t count) {
    std::fputs("CameraAsyncWriteCallback:\n", stdout);
    for (std::uint32_t i = 0; bytes != nullptr && i < count; ++i) {
        if (i % 4 == 0) std::fputs(" ", stdout);
        if (i % 8 == 0) std::fputs("   ", stdout);
        if (i % 16 == 0) std::fputs("\n\t\t", stdout);
        std::printf("%02x", static_cast<unsigned>(bytes[i]));
    }
    std::fputs("\n\n", stdout);
}

}  // namespace ZV
