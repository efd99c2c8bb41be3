#pragma once

#include <array>
#include <condition_variable>
#include <cstdint>
#include <memory>
#include <mutex>

#include "camera/camera.h"
#include "camera/relaxed.h"
#include "hal/semaphore.h"
#include "imaging/auto_exposure.h"
#include "imaging/auto_white_balance.h"
#include "imaging/bayer_interpolation.h"
#include "imaging/folary_ratio_correction.h"
#include "imaging/image_pipeline.h"
#include "imaging/rgb_filter_wheel.h"
#include "zentara/zentara.h"

namespace ZV {

class EventService;

inline constexpr std::uint16_t QueueKindFrame = 0;
inline constexpr std::uint16_t QueueKindSettings = 1;

/// One frame or settings change that waits its turn. What it points to is the client's.
struct QueueEntry {
    ZentaraHandle camera = 0;
    Zentara_Frame* frame = nullptr;        ///< Set for a frame.
    Zentara_Settings* settings = nullptr;  ///< Set for a settings change.
    ZentaraAsyncCallback callback = nullptr;
    std::uint32_t flags = 0;
    std::uint64_t userPrivate = 0;
    std::uint32_t userData = 0;
    std::uint16_t kind = QueueKindFrame;
    Relaxed<std::uint8_t> exposeDoneCalled{0};  ///< 1 after this frame's exposure callback.
    std::uint8_t holdCount = 0;                 ///< Guarded by the queue's leafMutex.
};
static_assert(sizeof(QueueEntry) == 56);

/// Most entries that wait at a time.
inline constexpr std::uint32_t QueueCapacity = 100;

/// What the flat interface keeps for an open camera.
///
/// Locks: `measuringMutex` before all others, `deliveryLock` before `queueLock` and before
/// `postMutex`; the leaf mutexes (`queueMutex`, `settingsMutex`) last. `deliveryLock` is held
/// for the whole of ImageReceived and of Zentara_Abort. `queueLock` keeps clients, ExposeDone and
/// the sending of settings apart; ImageReceived and the emptying by Zentara_Abort do without it.
/// `queueMutex` keeps the queue whole whoever changes it. No callback runs under a leaf mutex.
struct CameraContext {
    CameraContext() = default;
    ~CameraContext();  ///< Frees what is still queued.
    CameraContext(const CameraContext&) = delete;
    CameraContext& operator=(const CameraContext&) = delete;

    std::unique_ptr<ZImagePipeline> postPipeline;
    std::unique_ptr<ZRGBFilterWheel> rgbWheel;
    ZFolaryRatioCorrection* ratioCorrection = nullptr;  ///< borrowed from the camera, for its life
    std::unique_ptr<ZAutoWhiteBalance> whiteBalance;
    std::unique_ptr<ZAutoExposure> autoExposure;
    std::unique_ptr<ZSemaphore> deliveryLock;
    std::unique_ptr<ZSemaphore> queueLock;
    Relaxed<std::uint8_t> abortRequested{0};  ///< 1 from Zentara_Abort until the next queue call.
    std::array<QueueEntry*, QueueCapacity> queue{};  ///< Oldest first. Guarded by queueMutex.
    std::uint32_t queueCount = 0;                    ///< Live entries. Guarded by queueMutex.
    Zentara_Settings lastSettings;  ///< Last read or sent. Guarded by settingsMutex.
    Relaxed<std::uint8_t> sendInProgress{0};
    ZBayerInterpolation* bayerFilter = nullptr;  ///< borrowed from the camera, for its life
    ZImagePipeline* bayerPipeline = nullptr;     ///< borrowed from the camera, for its life
    Relaxed<std::uint8_t> postProcessing{0};     ///< 1 when post-processing is on.

    mutable std::mutex queueMutex;
    std::uint64_t changesTaken = 0;  ///< Settings changes taken out of the queue. Guarded as it is.
    std::uint64_t servicesBegun = 0;         ///< Numbers services. Guarded by queueMutex.
    EventService* services = nullptr;        ///< What threads serve now. Guarded by queueMutex.
    std::condition_variable serviceChanged;  ///< A service has ended or moved on.
    mutable std::mutex settingsMutex;
    std::mutex measuringMutex;  ///< One white balance or auto exposure at a time, waits included.
    /// One run of `postPipeline` at a time: deliveries, grabs and single frames may meet.
    std::mutex postMutex;
};

/// Makes the context of a camera that has just been opened and puts the wheel into the camera's own
/// pipeline. Null when there is no memory for it or for one of its locks.
std::unique_ptr<CameraContext> MakeCameraContext(ZCamera& camera);

/// Takes the wheel out of the camera's pipeline and drops what is queued, without a callback.
void DetachCameraContext(ZCamera& camera, CameraContext& context);

/// Null for a camera that was never opened here, and after its close.
CameraContext* GetCameraContext(ZCamera& camera);

/// The block last read from the camera or sent to it; exchanged whole. Thread-safe.
Zentara_Settings GetLastSettings(const CameraContext& context);
void SetLastSettings(CameraContext& context, const Zentara_Settings& settings);

}  // namespace ZV
