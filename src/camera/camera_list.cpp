#include <cstddef>
#include <memory>
#include <mutex>
#include <utility>

#include "camera/camera.h"
#include "camera/camera_factory.h"
#include "camera/morvane_fw_camera.h"
#include "hal/hal.h"
#include "hal/static_mutex.h"
#include "imaging/bayer_interpolation.h"
#include "imaging/folary_ratio_correction.h"
#include "imaging/image_pipeline.h"

namespace ZV {

namespace {

constexpr std::uint32_t MaxListedCameras = 10;

constinit StaticMutex lostCamerasMutex;

/// A camera's threads must have ended before any of its destructors begins.
void DeleteCamera(ZCamera* camera) {
    if (auto* concrete = dynamic_cast<MorvaneFWCamera*>(camera)) concrete->EndWhatCloseLeft();
    delete camera;
}

/// Null when there is no memory; the record then is still the caller's.
MorvaneFWCamera* MakeWholeCamera(const HALCamera& record) {
    MorvaneFWCamera* made = MakeCamera(record.cameraWord, record);
    if (made == nullptr || made->HasSynchronisation()) return made;
    made->SetShouldDeleteHALCamera(false);
    DeleteCamera(made);
    return nullptr;
}

/// The device records of a listing. Those that no camera has taken over are let go at the end.
class DeviceRecords {
  public:
    DeviceRecords() = default;
    ~DeviceRecords() {
        for (std::uint32_t record = firstFree; record < count; ++record) Release(record);
        (void)HAL_MemoryFree(list);  // cannot fail
    }
    DeviceRecords(const DeviceRecords&) = delete;
    DeviceRecords& operator=(const DeviceRecords&) = delete;

    HALStatus Read() {
        return HAL_CameraGetList(&list, MorvaneFWCamera::m_cameraModelAddress,
                                 MorvaneFWCamera::m_cameraModelAddressAlt, MaxListedCameras,
                                 &count);
    }
    /// The next record that nobody has open, or null. It is the caller's from now on.
    HALCamera* TakeNextFree() {
        while (firstFree < count && list[firstFree].connected != 0) Release(firstFree++);
        return firstFree < count ? &list[firstFree++] : nullptr;
    }

  private:
    void Release(std::uint32_t record) { (void)HAL_CameraRelease(&list[record]); }

    HALCamera* list = nullptr;
    std::uint32_t count = 0;
    std::uint32_t firstFree = 0;
};

}  // namespace

ZCamera* ZCamera::m_firstLostCamera = nullptr;

CameraResult ZCamera::GetCameraList(std::vector<ZCamera*>& cameras) {
    DeleteLostCameras();
    cameras.reserve(cameras.size() + MaxListedCameras);
    DeviceRecords records;
    const HALStatus status = records.Read();
    if (status != HALOk) return ReportHalStatus(status);
    while (HALCamera* record = records.TakeNextFree()) {
        ZCamera* made = nullptr;
        // Also for what the standard library throws.
        const auto keep = [&made](void*) { KeepLostCamera(made); };
        const std::unique_ptr<void, decltype(keep)> unlisted(&made, keep);
        const CameraResult result = ListCamera(*record, &made);
        if (result != CameraOk) return result;
        cameras.push_back(std::exchange(made, nullptr));
    }
    return CameraOk;
}

/// On failure `*listed` is the object made last, or null.
CameraResult ZCamera::ListCamera(HALCamera& record, ZCamera** listed) {
    for (bool isOtherModel = true; isOtherModel;) {
        if (record.kind > HALKindAdapter) return CameraBadBackEnd;
        record.cameraWord >>= MorvaneFWCamera::m_cameraModelShift;
        MorvaneFWCamera* made = MakeWholeCamera(record);
        *listed = made;
        if (made == nullptr) {
            (void)HAL_CameraRelease(&record);  // cannot fail
            return CameraHalFault;
        }
        isOtherModel = false;
        if (made->IsCameraOpen()) break;
        const CameraResult result = ReadListedCamera(*made, &isOtherModel);
        if (result != CameraOk) return result;
        if (!isOtherModel) break;
        // The class was wrong for this camera; its record goes on to an object of the right one.
        record.cameraWord = made->ReturnMasqueradedModel() << MorvaneFWCamera::m_cameraModelShift;
        made->SetShouldDeleteHALCamera(false);
        DeleteCamera(made);
        *listed = nullptr;
    }
    return (*listed)->IsCameraOpen() ? CameraOk : SetUpListedCamera(**listed);
}

CameraResult ZCamera::ReadListedCamera(ZCamera& camera, bool* isOtherModel) {
    CameraResult result = camera.OpenCamera();
    if (result == CameraOk) result = camera.ReadCameraInfo();
    if (result != CameraOk) return result;
    *isOtherModel = camera.ReturnMasqueradedModel() != camera.GetModel();
    return camera.CloseCamera();
}

CameraResult ZCamera::SetUpListedCamera(ZCamera& camera) {
    CameraResult result = camera.OpenCamera();
    if (result == CameraOk) result = camera.SetupCamera();
    if (result != CameraOk) return result;
    if (ZImagePipeline* pipeline = camera.GetBayerPipeline()) {
        pipeline->Setup(camera.GetCCDWidth(), camera.GetCCDHeight());
        if (camera.ratioCorrection != nullptr) pipeline->AddFilter(camera.ratioCorrection);
        if (camera.bayerFilter != nullptr) pipeline->AddFilter(camera.bayerFilter);
    }
    return camera.CloseCamera();
}

CameraResult ZCamera::EraseCameraList(std::vector<ZCamera*>& cameras) {
    cameras.clear();
    return CameraOk;
}

CameraResult ZCamera::EraseClosedCamerasFromList(std::vector<ZCamera*>& cameras) {
    // Kept: every round looks at the first camera again, so the first open one ends the work and
    // closed ones behind it stay.
    const std::size_t rounds = cameras.size();
    for (std::size_t round = 0; round < rounds; ++round) {
        ZCamera* first = cameras.front();
        if (first->IsCameraOpen()) continue;
        (void)first->CloseCamera();  // not open: nothing to fail
        DeleteCamera(first);
        cameras.erase(cameras.begin());
    }
    return CameraOk;
}

CameraResult ZCamera::FreeCameraList(std::vector<ZCamera*>& cameras) {
    for (ZCamera* camera : cameras) {
        if (camera == nullptr) continue;
        (void)camera->CloseCamera();  // what it leaves is ended before the delete
        DeleteCamera(camera);
    }
    cameras.clear();
    return CameraOk;
}

void ZCamera::KeepLostCamera(ZCamera* camera) {
    if (camera == nullptr) return;
    const std::lock_guard hold(lostCamerasMutex);
    camera->nextLost = m_firstLostCamera;
    m_firstLostCamera = camera;
}

void ZCamera::DeleteLostCameras() {
    ZCamera* lost = nullptr;
    {
        const std::lock_guard hold(lostCamerasMutex);
        std::swap(lost, m_firstLostCamera);
    }
    while (lost != nullptr) {
        ZCamera* next = lost->nextLost;
        (void)lost->CloseCamera();  // as above
        DeleteCamera(lost);
        lost = next;
    }
}

}  // namespace ZV
