#include "api/camera_context.h"

#include <cstring>
#include <new>

#include "api/entry_queue.h"

namespace ZV {

namespace {

// Until a block is read or sent nothing is known of the settings: no sent block equals this one,
// and its image format is neither of the raw ones, so that early frames carry their own format.
constexpr int UnknownSettingsByte = 0xCD;

bool IsComplete(const CameraContext& context) {
    return context.bayerPipeline && context.postPipeline && context.rgbWheel &&
           context.ratioCorrection && context.whiteBalance && context.autoExposure &&
           context.bayerFilter && context.deliveryLock && context.queueLock;
}

/// A lock that is none excludes nobody, and a wheel without its own packs nothing.
bool HasLocks(const CameraContext& context) {
    return context.deliveryLock->IsMade() && context.queueLock->IsMade() &&
           context.rgbWheel->HasSemaphore();
}

}  // namespace

CameraContext::~CameraContext() {
    ClearQueue(*this);
}

std::unique_ptr<CameraContext> MakeCameraContext(ZCamera& camera) {
    std::unique_ptr<CameraContext> context(new (std::nothrow) CameraContext);
    if (!context) return nullptr;
    context->bayerPipeline = camera.GetBayerPipeline();
    context->postPipeline.reset(new (std::nothrow) ZImagePipeline);
    context->rgbWheel.reset(new (std::nothrow) ZRGBFilterWheel(zfmtRGBPlane8));
    context->ratioCorrection = camera.GetFYRatioCorrectionFilter();
    context->whiteBalance.reset(new (std::nothrow) ZAutoWhiteBalance(false));
    context->autoExposure.reset(new (std::nothrow) ZAutoExposure(false));
    context->bayerFilter = camera.GetBayerFilter();
    context->deliveryLock.reset(new (std::nothrow) ZSemaphore);
    context->queueLock.reset(new (std::nothrow) ZSemaphore);
    std::memset(&context->lastSettings, UnknownSettingsByte, sizeof(context->lastSettings));
    if (!IsComplete(*context) || !HasLocks(*context)) return nullptr;
    if (camera.GetImagePipeline() == nullptr) return nullptr;

    context->postPipeline->Setup(camera.GetCCDWidth(), camera.GetCCDHeight());
    context->postPipeline->AddFilter(context->ratioCorrection);
    context->postPipeline->AddFilter(context->bayerFilter);
    context->postPipeline->AddFilter(context->whiteBalance.get());
    // Last, when nothing can fail any more: the camera's pipeline keeps the wheel by its address.
    camera.GetImagePipeline()->AddFilter(context->rgbWheel.get());
    return context;
}

void DetachCameraContext(ZCamera& camera, CameraContext& context) {
    (void)camera.GetImagePipeline()->RemoveFilter(context.rgbWheel.get());  // false: not in it
    ClearQueue(context);
}

CameraContext* GetCameraContext(ZCamera& camera) {
    return static_cast<CameraContext*>(camera.GetRefCon());
}

Zentara_Settings GetLastSettings(const CameraContext& context) {
    const std::lock_guard hold(context.settingsMutex);
    return context.lastSettings;
}

void SetLastSettings(CameraContext& context, const Zentara_Settings& settings) {
    const std::lock_guard hold(context.settingsMutex);
    context.lastSettings = settings;
}

}  // namespace ZV
