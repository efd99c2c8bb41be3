#include "api/camera_store.h"

#include <algorithm>

#include "api/entry_queue.h"
#include "api/event_service.h"
#include "api/handles.h"
#include "camera/morvane_fw_camera.h"

namespace ZV {

namespace {

// Open, and the client has not closed it. A camera that another process holds reads as open, but
// has no context, and neither has one whose close failed.
bool IsInUse(ZCamera* camera) {
    return camera->IsCameraOpen() && GetCameraContext(*camera) != nullptr;
}

// Its close failed, and its device is still open.
bool IsLeftOpen(ZCamera* camera) {
    return camera->IsCameraOpen() && camera->DoWeHaveExclusiveAccess() &&
           GetCameraContext(*camera) == nullptr;
}

/// What the client gets back with its close nobody may write to afterwards.
void AwaitServices(CameraContext& context) {
    AwaitImages(context);
    AwaitExposures(context);
}

bool Holds(const std::vector<ZCamera*>& cameras, const ZCamera* camera) {
    return std::find(cameras.begin(), cameras.end(), camera) != cameras.end();
}

// The results say whether a close worked; a camera that is given up is gone either way.
void FreeCameras(std::vector<ZCamera*>& cameras) {
    for (ZCamera* camera : cameras) UnregisterCamera(camera);
    (void)ZCamera::FreeCameraList(cameras);
}

/// Every camera of the list is of this class.
bool HasLivingThreads(const ZCamera& camera) {
    return static_cast<const MorvaneFWCamera&>(camera).HasLivingThreads();
}

}  // namespace

CameraStore& CameraStore::Get() {
    static CameraStore& store = *new CameraStore;
    return store;
}

CameraResult CameraStore::MakeList() {
    FreeUnusedRetiredCameras();
    UnregisterClosedCameras();
    // Kept: only the listing's own result counts, and this stops at the first open camera.
    (void)ZCamera::EraseClosedCamerasFromList(cameraList);
    FreeCamerasLeftOpen();
    RetireList();
    (void)ZCamera::EraseCameraList(cameraList);
    FreeContextsWithoutCamera();
    const CameraResult result = ZCamera::GetCameraList(cameraList);
    for (ZCamera* camera : cameraList) RegisterCamera(camera);
    return result;
}

bool CameraStore::AttachContext(ZCamera& camera) {
    contexts.reserve(contexts.size() + 1);  // behind the making nothing may fail any more
    std::unique_ptr<CameraContext> context = MakeCameraContext(camera);
    if (!context) return false;
    camera.SetRefCon(context.get());
    contexts.push_back({&camera, std::move(context)});
    return true;
}

void CameraStore::DetachContext(ZCamera& camera) {
    CameraContext* const context = GetCameraContext(camera);
    camera.SetRefCon(nullptr);
    if (context != nullptr) ClearQueue(*context);
    // A close that failed leaves the camera open and its threads running on the context.
    if (camera.IsCameraOpen()) {
        if (context != nullptr) AwaitServices(*context);
        return;
    }
    TakeOutContextsOf(camera);
    // One that succeeded may leave an exposure callback that lasts.
    if (!HasLivingThreads(camera)) FreeContextsOf(camera);
}

void CameraStore::FreeAll() {
    FreeCameras(cameraList);
    FreeCameras(retiredCameras);
    contexts.clear();
}

void CameraStore::UnregisterClosedCameras() {
    for (ZCamera* camera : cameraList) {
        if (!camera->IsCameraOpen()) UnregisterCamera(camera);
    }
}

void CameraStore::FreeUnusedRetiredCameras() {
    const auto firstUnused =
        std::stable_partition(retiredCameras.begin(), retiredCameras.end(), IsInUse);
    std::vector<ZCamera*> unused(firstUnused, retiredCameras.end());
    retiredCameras.erase(firstUnused, retiredCameras.end());
    FreeCameras(unused);
}

// The listing would pass their devices over as held.
void CameraStore::FreeCamerasLeftOpen() {
    const auto firstLeft = std::stable_partition(
        cameraList.begin(), cameraList.end(), [](ZCamera* camera) { return !IsLeftOpen(camera); });
    std::vector<ZCamera*> left(firstLeft, cameraList.end());
    cameraList.erase(firstLeft, cameraList.end());
    FreeCameras(left);
}

void CameraStore::RetireList() {
    retiredCameras.insert(retiredCameras.end(), cameraList.begin(), cameraList.end());
}

// The pipeline's only user, the run loop, has ended. A wheel that stayed in it would meet the next
// one.
void CameraStore::TakeOutContextsOf(ZCamera& camera) {
    for (const OwnedContext& owned : contexts) {
        if (owned.camera == &camera) DetachCameraContext(camera, *owned.context);
    }
}

void CameraStore::FreeContextsOf(const ZCamera& camera) {
    std::erase_if(contexts, [&](const OwnedContext& owned) { return owned.camera == &camera; });
}

void CameraStore::FreeContextsWithoutCamera() {
    std::erase_if(contexts, [&](const OwnedContext& owned) {
        return !Holds(cameraList, owned.camera) && !Holds(retiredCameras, owned.camera);
    });
}

}  // namespace ZV
