#include <cstdio>
#include <utility>

#include "hal/fw_camera.h"
#include "hal/fw_camera_records.h"
#include "hal/fw_device_context.h"
#include "hal/mutex_hold.h"
#include "hal/platform/thread.h"

// Threads: the callback loop, one per stream, and whoever starts and stops it, one at a time.
// `streamMutex` guards the assembler and the submission of requests; the loop holds it while it
// parses one request. `streaming` tells the loop to leave; it looks at it when a request ends.
// Hand-overs: a start makes the ring and gives it to the loop; the loop sets `stopEvent` as the
// last thing it does to the context; the stop joins the loop before it frees the ring. A loop that
// is ended from outside returns out of its wait for a request and touches nothing more.

namespace ZV {
namespace {

constexpr std::uint64_t StopTimeoutMs = 5000;
constexpr std::uint32_t StreamRegisterOn = 1;
constexpr std::uint32_t StreamRegisterChannelShift = 24;

enum class LoopStep { GoOn, Leave, Ended };

void EnterStream(RequestRing& ring) {
    const ControlRequest request{FW_IOCTL_STREAM_ENTER, &ring.enterRecord, PlainRecordBytes,
                                 &ring.enterRecord, PlainRecordBytes};
    // Nobody waits for its end before the ring is given up.
    (void)ControlDeviceOverlapped(ring.context->device.Get(), request, ring.enterOverlapped);
}

void LeaveStream(FWDeviceContext& context) {
    std::uint32_t record = 0;
    // The loop ends whatever the driver says.
    (void)SendRecord(context.device, FW_IOCTL_STREAM_LEAVE, &record, PlainRecordBytes);
    (void)SignalEvent(context.stopEvent);
    std::fputs("Leaving callback loop!!!", stdout);
}

LoopStep ServeRequest(const RequestRing& ring, IsochRequestSlot& slot, bool servesRealDevice) {
    // A request that failed is parsed all the same: its packets are stale or fail their tests.
    const CompletionOutcome outcome = WaitForCompletion(slot.device, slot.overlapped, WaitForEver);
    if (outcome == CompletionOutcome::Ended) return LoopStep::Ended;
    ClearOverlapped(slot.overlapped);
    if (ring.context->streaming.load(std::memory_order_relaxed) == 0) {
        // Kept: this thread does not hold the mutex here, and the system refuses the release.
        (void)GiveMutex(slot.mutex);
        return LoopStep::Leave;
    }
    const MutexHold hold(slot.mutex);
    RaiseProcessPriority(servesRealDevice);
    ParseRequest(ring, slot);
    LowerProcessPriority(servesRealDevice);
    return LoopStep::GoOn;
}

void* RunCallbackLoop(void* argument) {
    RequestRing& ring = *static_cast<RequestRing*>(argument);
    const bool servesRealDevice = IsRealDevice(ring.context->device.Get());
    EnterStream(ring);
    RaiseOwnThreadPriority(servesRealDevice);
    for (std::size_t i = 0;; i = (i + 1) % ring.requests.size()) {
        IsochRequestSlot& slot = ring.requests[i];
        const LoopStep step = ServeRequest(ring, slot, servesRealDevice);
        if (step == LoopStep::Ended) return nullptr;
        if (step == LoopStep::Leave || AttachRequest(ring, slot) == ControlOutcome::Failed) break;
    }
    LeaveStream(*ring.context);
    return nullptr;
}

bool MakeStreamObjects(FWDeviceContext& context) {
    if (context.streamMutex == nullptr) context.streamMutex = MakeMutex();
    context.ring = MakeRequestRing(&context);
    context.stopEvent = MakeEvent(EventReset::Manual);
    return context.streamMutex != nullptr && context.ring != nullptr &&
           context.stopEvent != nullptr;
}

void FreeStreamObjects(FWDeviceContext& context) {
    context.ring.reset();
    (void)DestroyEvent(std::exchange(context.stopEvent, nullptr));
}

void AttachAllRequests(RequestRing& ring) {
    for (IsochRequestSlot& slot : ring.requests) {
        const MutexHold hold(slot.mutex);
        // Kept: a refused request shows only when the loop comes to it.
        (void)AttachRequest(ring, slot);
    }
}

HALStatus StartCallbackLoop(FWDeviceContext& context) {
    context.streaming.store(1, std::memory_order_relaxed);
    for (std::uint32_t& counter : context.requestCounters) counter = 0;
    const HALStatus status =
        HAL_ThreadCreate(RunCallbackLoop, context.ring.get(), &context.callbackThread);
    if (status != HALOk) return status;
    return IsHALThreadStarted(context.callbackThread) ? HALOk : HALReadFailed;
}

bool SendListen(FWDeviceContext& context) {
    // Without the mutex: the loop may be parsing a first frame by now, and wait in the camera for a
    // lock that whoever starts the stream holds until this has returned.
    StreamSwitchRecord record = MakeStreamSwitchRecord(context.resourceHandle);
    return SendOverlapped(context.device, ControlRequest{FW_IOCTL_LISTEN, &record, sizeof record,
                                                         &record, sizeof record});
}

void AbandonFrame(FWDeviceContext& context) {
    const MutexHold hold(context.streamMutex);
    context.assembler.AbandonFrame();
}

/// Waits for the loop to leave, or ends it. False when it could not be ended.
bool EndCallbackLoop(FWDeviceContext& context) {
    // Kept: a loop that has left already by itself is waited for in vain.
    ClearEvent(context.stopEvent);
    context.streaming.store(0, std::memory_order_relaxed);
    if (context.callbackThread == nullptr) return true;
    const bool hasLeft = IsHALThreadStarted(context.callbackThread) &&
                         WaitForEvent(context.stopEvent, StopTimeoutMs) == WaitOutcome::Signalled;
    if (!hasLeft) return EndHALThread(&context.callbackThread);
    // It has nothing left to do but to print and return.
    (void)HAL_ThreadCleanup(std::exchange(context.callbackThread, nullptr), WaitForEver);
    return true;
}

HALStatus StopReception(FWDeviceContext& context) {
    StreamSwitchRecord stop = MakeStreamSwitchRecord(context.resourceHandle);
    if (!SendRecord(context.device, FW_IOCTL_STOP, &stop, sizeof stop)) return HALStopFailed;
    std::uint64_t handle = context.resourceHandle;
    if (!SendRecord(context.device, FW_IOCTL_DETACH_BUFFERS, &handle, HandleRecordBytes)) {
        return HALResourcesNotFreed;
    }
    return HALOk;
}

/// Frees the ring, or keeps it while the driver may still write to it.
void GiveUpRing(FWDeviceContext& context, bool isDetached) {
    if (context.ring == nullptr) return;
    if (!isDetached || !EndRequests(*context.ring)) {
        RetireRing(context, std::move(context.ring));
    }
    context.ring.reset();
}

/// After a start that has no loop: the driver gives the buffers back.
void GiveUpStart(FWDeviceContext& context) {
    context.streaming.store(0, std::memory_order_relaxed);
    (void)EndHALThread(&context.callbackThread);  // none runs
    std::uint64_t handle = context.resourceHandle;
    const bool isDetached =
        SendRecord(context.device, FW_IOCTL_DETACH_BUFFERS, &handle, HandleRecordBytes);
    GiveUpRing(context, isDetached);
    (void)DestroyEvent(std::exchange(context.stopEvent, nullptr));
}

HALStatus WriteStreamRegister(HALCamera camera, std::uint32_t streamRegister, std::uint32_t value) {
    return HAL_CameraWriteData(&camera, streamRegister, &value, 1);
}

}  // namespace

HALStatus FWCameraStartStreaming(HALCamera camera, std::uint32_t streamRegister,
                                 std::uint16_t streamingVersion) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr || !context->device.IsOpen()) return HALReadFailed;
    if (context->streaming.load(std::memory_order_relaxed) != 0) return HALOk;
    if (context->ring != nullptr) return HALReadFailed;  // A loop that could not be ended has it.
    if (!MakeStreamObjects(*context)) {
        FreeStreamObjects(*context);
        return HALReadFailed;
    }
    context->assembler.StartStream(static_cast<std::uint8_t>(streamingVersion));
    AttachAllRequests(*context->ring);
    if (const HALStatus status = StartCallbackLoop(*context); status != HALOk) {
        GiveUpStart(*context);
        return status;
    }
    // Kept: after a refused listen the loop runs on, and the context counts as streaming.
    if (!SendListen(*context)) return HALReadFailed;
    return WriteStreamRegister(camera, streamRegister,
                               (context->channel << StreamRegisterChannelShift) | StreamRegisterOn);
}

HALStatus FWCameraStopStreaming(HALCamera camera, std::uint32_t streamRegister) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr) return HALOk;
    if (context->streaming.load(std::memory_order_relaxed) == 0) return HALOk;
    AbandonFrame(*context);
    if (!EndCallbackLoop(*context)) return HALStopFailed;
    // The loop may have begun another frame before it saw the stop.
    AbandonFrame(*context);
    (void)DestroyEvent(std::exchange(context->stopEvent, nullptr));
    const HALStatus status = StopReception(*context);
    GiveUpRing(*context, status == HALOk);
    if (status != HALOk) return status;
    return WriteStreamRegister(camera, streamRegister, 0);
}

HALStatus FWCameraWaitingForFrame(HALCamera camera, const FrameArrivals* arrivals) {
    FWDeviceContext* const context = GetFWContext(camera);
    return context != nullptr ? context->frameEvent.Wait(arrivals) : HALOk;
}

HALStatus FWCameraStopWaitingForFrame(HALCamera camera) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context != nullptr) context->frameEvent.Release();
    return HALOk;
}

}  // namespace ZV
