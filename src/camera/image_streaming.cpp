#include <mutex>

#include "camera/morvane_fw_camera.h"

namespace ZV {

namespace {

constexpr std::uint32_t TriggerModeSoftware = 5;

}  // namespace

bool MorvaneFWCamera::IsCameraStreaming() {
    return streaming.isStreaming;
}

CameraResult MorvaneFWCamera::StartStreamingImages(ImageCallback imageCallback,
                                                   ExposeDoneCallback exposeDoneCallback,
                                                   bool externalBuffers, void* newRefCon) {
    const StreamCallbacks callbacks{imageCallback, exposeDoneCallback, newRefCon};
    bool hasStarted = false;
    return StartStream(&callbacks, externalBuffers, &hasStarted);
}

CameraResult MorvaneFWCamera::StartStream(const StreamCallbacks* newCallbacks, bool externalBuffers,
                                          bool* hasStarted) {
    *hasStarted = false;
    if (streaming.isStreaming) return CameraOk;
    const std::lock_guard hold(streaming.switchMutex);
    if (streaming.isStreaming) return CameraOk;  // another start was quicker
    CameraResult result = ReallocateBandwidth(CalculateRequiredPacketSize(true));
    if (result == CameraOk) result = TakeLock(streaming.streamLock);
    if (result != CameraOk) return result;
    *hasStarted = true;
    result = StartUnderStreamLock(newCallbacks, externalBuffers);
    const CameraResult given = GiveLock(streaming.streamLock);
    return result != CameraOk ? result : given;
}

CameraResult MorvaneFWCamera::StartUnderStreamLock(const StreamCallbacks* newCallbacks,
                                                   bool externalBuffers) {
    // Frames of a former run no longer match the new number. Kept: a failure gives the lock, which
    // the end gives a second time.
    if (SetPSN(GetPSN() + 1) != CameraOk) (void)HAL_SemaphoreSignal(streaming.streamLock);
    HALStatus status = TakeOverGeometry();
    if (status != HALOk) return ReportHalStatus(status);
    if (newCallbacks != nullptr) streaming.callbacks.Set(*newCallbacks);
    streaming.usesExternalBuffers = externalBuffers;
    streaming.isStreaming = true;  // kept: stays when the start below fails
    streaming.abortPending = false;
    HALCamera record = GetHALCamera();
    status = HAL_CameraStartStreaming(&record, registers.stream.GetQuadletAddress(StreamSwitch),
                                      GetStreamingVersion(), this);
    return status == HALOk ? CameraOk : ReportHalStatus(status);
}

CameraResult MorvaneFWCamera::StopStreamingImages() {
    const std::lock_guard hold(streaming.switchMutex);
    return StopUnderSwitchMutex();
}

CameraResult MorvaneFWCamera::StopUnderSwitchMutex() {
    HALCamera record = GetHALCamera();
    HALStatus status =
        HAL_CameraStopStreaming(&record, registers.stream.GetQuadletAddress(StreamSwitch));
    if (status == HALOk) status = HAL_SemaphoreWait(streaming.streamLock);
    if (status == HALOk) {
        streaming.isStreaming = false;
        status = WakeRunLoop();
    }
    if (status == HALOk) status = HAL_SemaphoreWait(streaming.frameLock);
    if (status == HALOk) {
        ClearFrameInfoVector();
        status = HAL_SemaphoreSignal(streaming.frameLock);
    }
    // Kept: every failure gives the lock, also one before it was taken.
    const HALStatus given = HAL_SemaphoreSignal(streaming.streamLock);
    if (status == HALOk) status = given;
    return status == HALOk ? CameraOk : ReportHalStatus(status);
}

void MorvaneFWCamera::ClearFrameInfoVector() {
    // Kept: the length falls while the counter rises, so the older of two frames stays behind and
    // is the first image of the next stream. The buffer goes even if it was a client's: what a
    // client offers comes from the C allocator and is given up.
    for (std::size_t round = 0; round < streaming.frameQueue.GetCount(); ++round) {
        tStFrameInfo* frame = streaming.frameQueue.TakeNewest();
        if (frame == nullptr) continue;
        FreeFrameWithBuffer(frame);
        streamCounters.cleared.Add();
    }
}

void MorvaneFWCamera::IgnoreFrameInfoVector() {
    streaming.frameQueue.MarkAllInvalid();
}

CameraResult MorvaneFWCamera::SoftwareTrigger() {
    if (!streaming.isStreaming) return CameraNotStreaming;
    if (GetTriggerMode() != TriggerModeSoftware) return CameraNotSoftwareTriggered;
    streaming.abortPending = false;
    const HALStatus status = WriteCommand(CommandSoftwareTrigger, 1);
    return status == HALOk ? CameraOk : ReportHalStatus(status);
}

CameraResult MorvaneFWCamera::Abort() {
    const CameraResult taken = TakeLock(streaming.streamLock);
    if (taken != CameraOk) {
        (void)HAL_SemaphoreSignal(streaming.streamLock);  // kept: given though not taken
        return taken;
    }
    const HALStatus status = HAL_ConditionSignal(streaming.oneImageCondition);
    if (status != HALOk) return ReportHalStatus(status);  // kept: with the lock held
    streaming.abortPending = true;
    return GiveLock(streaming.streamLock);
}

CameraResult MorvaneFWCamera::AddExternalImageBuffer(void* buffer) {
    if (!DoesSupportExternalBuffers()) return CameraRefused;
    streaming.externalBuffers.Append(buffer);
    return CameraOk;
}

void MorvaneFWCamera::SetStreamingCallback(ImageCallback imageCallback, void* newRefCon) {
    (void)streaming.callbacks.ReplaceImage(imageCallback, newRefCon);
}

CameraResult MorvaneFWCamera::IgnoreNextFrame() {
    return SetPSN(GetPSN() + 1);
}

}  // namespace ZV
