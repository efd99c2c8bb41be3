#include <cstdio>

#include "camera/morvane_fw_camera.h"

namespace ZV {

namespace {

constexpr std::uint64_t WaitBase = 5000000000;

}  // namespace

CameraResult MorvaneFWCamera::GetOneImage(ZExImage** image) {
    FreeImage(streaming.oneImage.exchange(nullptr));  // one that came too late for its call
    const bool wasStreaming = streaming.isStreaming;
    const HALStatus status = HAL_ConditionReset(streaming.oneImageCondition);
    if (status != HALOk) return ReportHalStatus(status);
    streaming.oneImageReady = false;

    StreamCallbacks former;
    auto* const self = static_cast<ZCamera*>(this);
    CameraResult result = CameraOk;
    if (wasStreaming) {
        former = streaming.callbacks.ReplaceImage(TakeOneImage, self);
    } else {
        result =
            StartStreamingImages(TakeOneImage, streaming.callbacks.Get().exposeDone, false, self);
    }
    // Kept: a wait that fails or runs out leaves the callback swapped, or the stream on.
    if (result == CameraOk) result = AwaitOneImage();
    if (result != CameraOk) return result;
    if (wasStreaming) {
        (void)streaming.callbacks.ReplaceImage(former.image, former.refCon);
    } else {
        result = StopStreamingImages();
        if (result != CameraOk) return result;
    }
    *image = streaming.oneImageReady ? streaming.oneImage.exchange(nullptr) : nullptr;
    return *image != nullptr ? CameraOk : CameraNoImage;
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
    if (streaming.oneImageReady) {
        FreeImage(streaming.oneImage.exchange(nullptr));
        streaming.oneImageReady = false;
    }
    FreeImage(streaming.oneImage.exchange(record->image));
    streaming.oneImageReady = true;
    const HALStatus status = HAL_ConditionSignal(streaming.oneImageCondition);
    if (status != HALOk) {
        std::printf("GetOneImageCallback error %d occurred calling HAL_ConditionSignal\n",
                    static_cast<int>(status));
    }
    return nullptr;
}

}  // namespace ZV
