#include "hal/fw_device_context.h"

#include <chrono>
#include <thread>
#include <utility>

#include "hal/platform/last_error.h"

namespace ZV {
namespace {

void FreeRetiredRings(FWDeviceContext& context) {
    while (context.retiredRings != nullptr) {
        RequestRing* const ring = context.retiredRings;
        context.retiredRings = ring->nextRetired;
        // A driver that has not ended its requests at the close may still write to them: such a
        // ring is never freed.
        if (!IsRingPending(*ring)) delete ring;
    }
}

void FreeNotification(FWDeviceContext& context) {
    if (context.notification == nullptr) return;
    // As for the rings.
    if (IsOverlappedPending(context.notification->overlapped)) {
        (void)context.notification.release();
    }
    context.notification.reset();
}

}  // namespace

NotificationRequest::NotificationRequest() : overlapped(MakeOverlapped()) {}

NotificationRequest::~NotificationRequest() {
    DestroyOverlapped(overlapped);
}

FWDeviceContext::~FWDeviceContext() {
    DestroyMutex(streamMutex);
    DestroyMutex(deviceMutex);
}

bool SendRecord(PlatformDevice* device, std::uint32_t code, void* record, std::uint32_t bytes) {
    if (device == nullptr) return false;
    return ControlDevice(device, ControlRequest{code, record, bytes, record, bytes}, nullptr);
}

bool SendRecord(DeviceSlot& slot, std::uint32_t code, void* record, std::uint32_t bytes) {
    const DeviceUse use(slot);
    return SendRecord(use.GetDevice(), code, record, bytes);
}

bool FinishRequest(PlatformDevice* device, PlatformOverlapped* overlapped) {
    const CompletionOutcome outcome = WaitForCompletion(device, overlapped, WaitForEver);
    if (outcome != CompletionOutcome::Ended) return outcome == CompletionOutcome::Completed;
    CancelOverlapped(device, overlapped);
    while (IsOverlappedPending(overlapped)) {
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
    SetLastPlatformError(PlatformErrorOperationAborted);
    return false;
}

bool SendOverlapped(DeviceSlot& slot, const ControlRequest& request) {
    const OwnedOverlapped overlapped(MakeOverlapped());
    if (overlapped == nullptr) return false;
    const DeviceUse use(slot, overlapped.get());
    PlatformDevice* const device = use.GetDevice();
    if (device == nullptr) return false;
    const ControlOutcome outcome = ControlDeviceOverlapped(device, request, overlapped.get());
    if (outcome != ControlOutcome::Pending) return outcome == ControlOutcome::Done;
    return FinishRequest(device, overlapped.get());
}

void RetireRing(FWDeviceContext& context, std::unique_ptr<RequestRing> ring) {
    ring->nextRetired = context.retiredRings;
    context.retiredRings = ring.release();
}

bool EndHALThread(HALThread** thread) {
    if (HAL_ThreadTerminate(*thread) != HALOk) return false;
    *thread = nullptr;
    return true;
}

bool EndNotification(FWDeviceContext& context) {
    context.notifying.store(0, std::memory_order_relaxed);
    if (!EndHALThread(&context.notifyThread)) return false;
    if (context.notification == nullptr) return true;
    return EndRequest(context.device.Get(), context.notification->overlapped);
}

bool CloseHeldDevice(FWDeviceContext& context) {
    context.streaming.store(0, std::memory_order_relaxed);
    // What the driver still holds of it, the close ends.
    (void)EndNotification(context);
    if (!EndHALThread(&context.callbackThread) || context.notifyThread != nullptr) return false;
    PlatformDevice* const device = context.device.TakeOut();
    if (device == nullptr && context.device.IsOpen()) return false;
    (void)DestroyEvent(std::exchange(context.stopEvent, nullptr));
    // The next stream must not go on with a frame of this one.
    context.assembler.AbandonFrame();
    if (context.ring != nullptr) {
        (void)EndRequests(*context.ring);
        RetireRing(context, std::move(context.ring));
    }
    CloseDevice(device);
    FreeRetiredRings(context);
    FreeNotification(context);
    return true;
}

}  // namespace ZV
