// Opening and closing a camera.
//
// An open camera has two threads of its own: the run loop (image_run_loop.cpp), which hands images
// to the client, and the expose thread, which tells it of each exposure's end. A streaming camera
// has the bus thread of the HAL besides, which asks for frames (frame_supply.cpp). CloseCamera
// stops the stream, takes the two threads' reasons to run away, wakes them and waits: for the run
// loop without limit, since it may sit in a client's callback, for the expose thread five seconds.
// An expose thread that outlasts them ends by itself when its callback returns, also if the camera
// has been opened again and has another one by then. Each thread counts itself out as the last
// thing it does; a camera is deleted only when none is left.

#include <cstdio>
#include <mutex>

#include "camera/morvane_fw_camera.h"
#include "hal/fw_camera.h"

namespace ZV {

namespace {

constexpr std::uint16_t ConnectPayloadBytes = 100;
constexpr std::uint64_t ThreadEndMs = 5000;
constexpr std::uint64_t PauseMicroseconds = 1000;

MorvaneFWCamera& GetCamera(void* context) {
    return *static_cast<MorvaneFWCamera*>(context);
}

tStFrameInfo* GetNewFrame(void* context) {
    return GetCamera(context).PrivateGetNewFrame();
}
tStFrameInfo* PeekNewFrame(void* context) {
    return GetCamera(context).PrivatePeekNewFrame();
}
void ImageHasArrived(void* context) {
    GetCamera(context).PrivateImageHasArrived();
}
void ImageHasTimedOut(void* context) {
    GetCamera(context).PrivateImageHasTimedOut();
}
void Overrun(void*) {
    std::fputs("OverrunCB called\n", stdout);
}

}  // namespace

CameraResult MorvaneFWCamera::OpenCamera() {
    HALCamera record = GetHALCamera();
    HALStatus status = HAL_CameraConnect(&record, ConnectPayloadBytes, GetNewFrame, PeekNewFrame,
                                         ImageHasArrived, Overrun, ImageHasTimedOut, this);
    SetHALCamera(record);
    if (status == HALDeviceInUse) {
        isOpen = true;  // kept: a camera that someone else holds reads as open here
        return CameraRefused;
    }
    if (status == HALOk) {
        status = HAL_CameraRegisterAsyncWriteCallback(
            &record, m_asyncWriteAddressLow, m_asyncWriteAddressLength, CameraAsyncWriteCallback);
    }
    if (status != HALOk) return ReportHalStatus(status);
    isOpen = true;
    exclusiveAccess = true;
    AddToConnectedCameras();
    StartExposeDoneThread();
    status = StartRunLoop();
    return status == HALOk ? CameraOk : ReportHalStatus(status);
}

CameraResult MorvaneFWCamera::CloseCamera() {
    if (!IsCameraOpen()) return CameraOk;
    HALStatus status = HAL_SemaphoreWait(streaming.closeLock);
    if (status != HALOk) return TranslateHalStatus(status);
    streaming.runLoopActive = false;
    const CameraResult stopped = StopStreamingImages();
    if (stopped != CameraOk) {
        (void)HAL_SemaphoreSignal(streaming.closeLock);  // the stop's result is the one that counts
        return stopped;
    }
    streaming.exposeDoneActive = false;
    streaming.callbacks.ClearExposeDone();
    (void)HAL_ConditionSignal(streaming.exposeDoneCondition);  // as of an ended thread

    status = WaitForCloseOfRunLoop();
    if (status == HALOk) {
        CleanUpThreads();
        status = Disconnect();
        // Kept: a disconnect that fails gives the lock twice.
        if (status != HALOk) (void)HAL_SemaphoreSignal(streaming.closeLock);
    }
    if (status != HALOk) {
        (void)HAL_SemaphoreSignal(streaming.closeLock);
        return ReportHalStatus(status);
    }
    if (exclusiveAccess) RemoveFromConnectedCameras();
    isOpen = false;
    exclusiveAccess = false;
    return GiveLock(streaming.closeLock);
}

/// The run loop gives `closeLock` at its end; that is how a close learns of it. A loop that never
/// started gives nothing.
HALStatus MorvaneFWCamera::WaitForCloseOfRunLoop() {
    if (!IsHALThreadStarted(streaming.runLoopThread)) return HALOk;
    WaitForRunLoopEnd();
    return HAL_SemaphoreWait(streaming.closeLock);
}

/// Beside an exposure callback that lasts: what it has begun to start or stop is done first. A
/// stream that it has started behind the close's stop ends here, or the next opening would find it
/// on and no device behind it.
HALStatus MorvaneFWCamera::Disconnect() {
    const std::lock_guard hold(streaming.switchMutex);
    if (streaming.isStreaming) (void)StopUnderSwitchMutex();  // said there; the device goes anyway
    HALCamera record = GetHALCamera();
    const HALStatus status = HAL_CameraDisconnect(&record);
    SetHALCamera(record);
    if (status == HALOk) streaming.isStreaming = false;  // also when the stop above failed
    return status;
}

CameraResult MorvaneFWCamera::StartImageStreamingRunLoop() {
    const HALStatus status = StartRunLoop();
    return status == HALOk ? CameraOk : TranslateHalStatus(status);
}

HALStatus MorvaneFWCamera::StartRunLoop() {
    if (streaming.runLoopsAlive.load(std::memory_order_acquire) != 0) return HALOk;
    (void)HAL_ThreadCleanup(streaming.runLoopThread, ThreadEndMs);  // one that has ended, or none
    streaming.runLoopThread = nullptr;
    streaming.runLoopActive = true;
    streaming.runLoopsAlive.fetch_add(1);
    const auto entry = [](void* argument) -> void* {
        MorvaneFWCamera& camera = GetCamera(argument);
        camera.PrivateImageStreamingRunLoop();
        camera.streaming.runLoopsAlive.fetch_sub(1, std::memory_order_release);
        return nullptr;
    };
    const HALStatus status = HAL_ThreadCreate(entry, this, &streaming.runLoopThread);
    if (status == HALOk && IsHALThreadStarted(streaming.runLoopThread)) return HALOk;
    streaming.runLoopsAlive.fetch_sub(1);
    return status != HALOk ? status : HALThreadNotStarted;  // it would not say so itself
}

void MorvaneFWCamera::StartExposeDoneThread() {
    (void)HAL_ThreadCleanup(streaming.exposeDoneThread, ThreadEndMs);  // as above
    streaming.exposeDoneThread = nullptr;
    // A close whose callback lasted has left its signal: it would pass for an exposure's end, or
    // take one with it when the new thread resets the condition.
    (void)HAL_ConditionReset(streaming.exposeDoneCondition);  // cannot fail
    streaming.exposeThreadsMade.fetch_add(1);
    streaming.exposeDoneActive = true;
    streaming.exposeThreadsAlive.fetch_add(1);
    const auto entry = [](void* argument) -> void* {
        MorvaneFWCamera& camera = GetCamera(argument);
        camera.RunExposeThread(camera.streaming.exposeThreadsBegun.fetch_add(1) + 1);
        camera.streaming.exposeThreadsAlive.fetch_sub(1, std::memory_order_release);
        return nullptr;
    };
    (void)HAL_ThreadCreate(entry, this, &streaming.exposeDoneThread);  // kept: not looked at
    if (IsHALThreadStarted(streaming.exposeDoneThread)) return;
    streaming.exposeThreadsMade.fetch_sub(1);
    streaming.exposeThreadsAlive.fetch_sub(1);
}

void MorvaneFWCamera::EndThreads() {
    streaming.isStreaming = false;
    streaming.runLoopActive = false;
    streaming.exposeDoneActive = false;
    streaming.callbacks.ClearExposeDone();
    WaitForRunLoopEnd();
    WaitForExposeDoneEnd();
    CleanUpThreads();
}

void MorvaneFWCamera::CleanUpThreads() {
    (void)HAL_ThreadCleanup(streaming.runLoopThread, ThreadEndMs);     // cannot fail
    (void)HAL_ThreadCleanup(streaming.exposeDoneThread, ThreadEndMs);  // cannot fail
    streaming.runLoopThread = nullptr;
    streaming.exposeDoneThread = nullptr;
}

/// Raised before the signal, so that the run loop goes on also when it was not waiting yet.
HALStatus MorvaneFWCamera::WakeRunLoop() {
    streaming.arrivals.fetch_add(1);
    HALCamera record = GetHALCamera();
    return HAL_CameraStopWaitingForFrame(&record);
}

void MorvaneFWCamera::WaitForRunLoopEnd() {
    while (streaming.runLoopsAlive.load(std::memory_order_acquire) != 0) {
        (void)WakeRunLoop();  // repeated until it has been heard
        (void)HAL_ConditionTimedWait(streaming.pauseCondition, PauseMicroseconds);
    }
}

void MorvaneFWCamera::WaitForExposeDoneEnd() {
    while (streaming.exposeThreadsAlive.load(std::memory_order_acquire) != 0) {
        (void)HAL_ConditionSignal(streaming.exposeDoneCondition);  // as above
        (void)HAL_ConditionTimedWait(streaming.pauseCondition, PauseMicroseconds);
    }
}

}  // namespace ZV
