#include <cstdio>
#include <mutex>
#include <utility>

#include "camera/morvane_fw_camera.h"
#include "imaging/ex_image.h"

namespace ZV {

namespace {

constexpr std::uint64_t WaitBase = 5000000000;

}  // namespace

CameraResult MorvaneFWCamera::GetOneImage(ZExImage** image) {
    const HALStatus status = ForgetOneImage();
    if (status != HALOk) return ReportHalStatus(status);

    StreamCallbacks former = streaming.callbacks.Get();
    auto* const self = static_cast<ZCamera*>(this);
    const StreamCallbacks single{TakeOneImage, former.exposeDone, self};
    bool hasStarted = false;
    CameraResult result = StartStream(&single, false, &hasStarted);
    if (!hasStarted && result == CameraOk) {
        former = streaming.callbacks.ReplaceImage(TakeOneImage, self);
    }
    // Kept: a wait that fails or runs out leaves the callback swapped, or the stream on.
    if (result == CameraOk) result = AwaitOneImage();
    if (result != CameraOk) return result;
    if (hasStarted) {
        // Kept: the callback stays the one of this call. A commit that starts the stream of a
        // failed change again, or one that another thread's setter has stopped here, starts it with
        // this callback, and the client's frames are served only after it is switched off and on.
        result = StopStreamingImages();
        if (result != CameraOk) return result;
    } else {
        (void)streaming.callbacks.ReplaceImage(former.image, former.refCon);
    }
    *image = ClaimOneImage();
    return *image != nullptr ? CameraOk : CameraNoImage;
}

/// Drops the image and the signal that came too late for their call. One step under the mutex, as
/// in the callback: a run loop late with the former call's image must not leave half of it.
HALStatus MorvaneFWCamera::ForgetOneImage() {
    const std::lock_guard hold(streaming.oneImageMutex);
    DropOneImage(nullptr);
    streaming.oneImageReady = false;
    return HAL_ConditionReset(streaming.oneImageCondition);
}

/// Puts `next` in the place of an image that nobody came for. Under the mutex.
void MorvaneFWCamera::DropOneImage(ZExImage* next) {
    ZExImage* const late = std::exchange(streaming.oneImage, next);
    if (late != nullptr) streamCounters.withoutTaker.Add(late->GetErrorCode());
    FreeImage(late);
}

ZExImage* MorvaneFWCamera::ClaimOneImage() {
    const std::lock_guard hold(streaming.oneImageMutex);
    return streaming.oneImageReady ? std::exchange(streaming.oneImage, nullptr) : nullptr;
}

CameraResult MorvaneFWCamera::AwaitOneImage() {
    // Kept: nanoseconds go in where microseconds are waited for, so the limit is a thousand times
    // as long. A client ends the wait with Abort.
    const HALStatus status =
        HAL_ConditionTimedWait(streaming.oneImageCondition, CalculateOneImageWait());
    return status == HALOk ? CameraOk : ReportHalStatus(status);
}

std::uint64_t MorvaneFWCamera::CalculateOneImageWait() {
    if (GetRGBFilterCycleMode()) {
        return WaitBase + GetExposure() + GetRGBFilterRedExposure() + GetRGBFilterBlueExposure();
    }
    const std::uint64_t exposures = IsInterlaced() ? 3 : 2;
    return WaitBase + exposures * GetExposure();
}

/// On the run loop. The image is the camera's until GetOneImage takes it.
void* MorvaneFWCamera::TakeOneImage(ZImageReceivedCallbackStruct* record) {
    auto& camera = static_cast<MorvaneFWCamera&>(*static_cast<ZCamera*>(record->refCon));
    StreamingState& streaming = camera.streaming;
    const std::lock_guard hold(streaming.oneImageMutex);
    camera.DropOneImage(record->image);
    streaming.oneImageReady = true;
    const HALStatus status = HAL_ConditionSignal(streaming.oneImageCondition);
    if (status != HALOk) {
        std::printf("GetOneImageCallback error %d occurred calling HAL_ConditionSignal\n",
                    static_cast<int>(status));
    }
    return nullptr;
}

}  // namespace ZV
