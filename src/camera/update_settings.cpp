#include "camera/morvane_fw_camera.h"
#include "imaging/image_pipeline.h"

namespace ZV {

void MorvaneFWCamera::TurnOffStreaming() {
    if (streaming.restartAfterUpdate) return;
    const bool wasStreaming = streaming.isStreaming;
    streaming.restartAfterUpdate = wasStreaming;
    if (wasStreaming) (void)StopStreamingImages();  // The setting goes on anyway.
}

CameraResult MorvaneFWCamera::UpdateSettingsOnCamera() {
    CameraResult result = TakeLock(streaming.streamLock);
    if (result != CameraOk) return result;
    result = TakeLock(streaming.frameLock);
    if (result == CameraOk) {
        result = TakeOverSettings();
        (void)GiveLock(streaming.frameLock);
    }
    (void)GiveLock(streaming.streamLock);
    if (result != CameraOk) return result;

    if (streaming.configStale) {
        result = RefreshConfiguration();
        if (result != CameraOk) return result;
    }
    if (streaming.restartAfterUpdate) RestartStreaming();
    return CameraOk;
}

CameraResult MorvaneFWCamera::TakeOverSettings() {
    if (imagePipeline != nullptr) imagePipeline->ResetFilters();
    const HALStatus status = TakeOverGeometry();
    if (status != HALOk) return ReportHalStatus(status);
    // Frames under way were made with the old settings.
    IgnoreFrameInfoVector();
    return CameraOk;
}

CameraResult MorvaneFWCamera::RefreshConfiguration() {
    CameraResult result = ReadRegisterSet(registers.configuration);
    if (result == CameraOk) result = SetROIHeight(GetCCDHeight());
    if (result == CameraOk) result = SetROIWidth(GetCCDWidth());
    if (result == CameraOk) streaming.configStale = false;
    return result;
}

void MorvaneFWCamera::RestartStreaming() {
    // The callbacks stay those of the stream that was stopped: GetOneImage may be exchanging them
    // on another thread. The settings are in force; a start that fails shows in the stream that
    // does not come.
    bool hasStarted = false;
    (void)StartStream(nullptr, streaming.usesExternalBuffers, &hasStarted);
    streaming.restartAfterUpdate = false;
}

}  // namespace ZV
