#pragma once

#include <atomic>
#include <mutex>

#include "camera/camera.h"
#include "camera/frame_queue.h"
#include "camera/relaxed.h"
#include "hal/hal.h"

namespace ZV {

/// Whom a stream tells, with the one reference that both callbacks get.
struct StreamCallbacks {
    ImageCallback image = nullptr;
    ExposeDoneCallback exposeDone = nullptr;
    void* refCon = nullptr;
};

/// The callbacks of a camera, exchanged as one set: no thread ever sees a callback with the
/// reference of another. Thread-safe; calls nothing.
class StreamCallbackSlot {
  public:
    StreamCallbacks Get() const {
        const std::lock_guard hold(leafMutex);
        return callbacks;
    }
    void Set(const StreamCallbacks& newCallbacks) {
        const std::lock_guard hold(leafMutex);
        callbacks = newCallbacks;
    }
    /// Replaces the image callback and the reference, returns what was there.
    StreamCallbacks ReplaceImage(ImageCallback image, void* refCon) {
        const std::lock_guard hold(leafMutex);
        const StreamCallbacks former = callbacks;
        callbacks.image = image;
        callbacks.refCon = refCon;
        return former;
    }
    void ClearExposeDone() {
        const std::lock_guard hold(leafMutex);
        callbacks.exposeDone = nullptr;
    }

  private:
    mutable std::mutex leafMutex;
    StreamCallbacks callbacks;  // guarded by leafMutex
};

/// Streaming members of a camera.
///
/// Locks, taken with HAL_SemaphoreWait and given with HAL_SemaphoreSignal: `streamLock` before
/// `frameLock`. `streamLock`: starting, stopping, settings that a frame is made from. `frameLock`:
/// the choice of frames in `frameQueue`. `externalLock`: taking from `externalBuffers`.
/// `closeLock`: the run loop gives it at its end.
struct StreamingState {
    HALSemaphore* spareSemaphore = nullptr;       ///< Taken by nobody.
    HALCondition* spareCondition = nullptr;       ///< Waited on by nobody.
    HALCondition* oneImageCondition = nullptr;    ///< GetOneImage waits here.
    HALCondition* exposeDoneCondition = nullptr;  ///< The expose thread waits here.
    HALCondition* pauseCondition = nullptr;  ///< Never signalled: the pauses of a polling wait.
    /// Leaf: image, flag and signal of GetOneImage change in one step.
    std::mutex oneImageMutex;
    ZExImage* oneImage = nullptr;  ///< Owned until GetOneImage hands it out.
    bool oneImageReady = false;
    Relaxed<bool> isStreaming{false};
    Relaxed<bool> runLoopActive{false};     ///< Keeps the run loop alive.
    Relaxed<bool> exposeDoneActive{false};  ///< Keeps the expose thread alive.
    /// Threads that may still touch the camera. Counting down is the last thing that a thread does:
    /// release there, acquire where its end is waited for.
    std::atomic<int> runLoopsAlive{0};
    std::atomic<int> exposeThreadsAlive{0};
    /// Expose threads made and begun since the camera was. One that outlives its close, in a
    /// client's callback, is not the last one made any more and serves nothing after it.
    std::atomic<std::uint32_t> exposeThreadsMade{0}, exposeThreadsBegun{0};
    std::atomic<std::uint32_t> arrivals{0};  ///< Raised before each signal to the run loop.
    std::uint32_t seenArrivals = 0;          ///< Bound to the run loop.
    std::uint32_t lastImageFormat = 0;       ///< Bound to the run loop; 0 before the first frame.
    FrameQueue frameQueue;
    ExternalBufferQueue externalBuffers;
    Relaxed<bool> bigEndian{false};  ///< Goes to each image; nothing ever sets it.
    Relaxed<bool> usesExternalBuffers{false};
    Relaxed<bool> restartAfterUpdate{false};    ///< A setter has stopped a stream that is to go on.
    Relaxed<bool> abortPending{false};          ///< The next frame request is refused.
    Relaxed<std::uint64_t> geometryInForce{0};  ///< Of the images that the camera sends.
    Relaxed<bool> configStale{false};           ///< MiscCtrl has changed what the camera reports.
    HALThread* runLoopThread = nullptr;
    HALThread* exposeDoneThread = nullptr;
    HALSemaphore* streamLock = nullptr;
    HALSemaphore* externalLock = nullptr;
    HALSemaphore* frameLock = nullptr;
    HALSemaphore* closeLock = nullptr;
    StreamCallbackSlot callbacks;
    /// One start or stop at a time, whoever calls: the stream layer takes them only one by one.
    /// Taken before `streamLock`, never by the bus thread.
    std::mutex switchMutex;
};

}  // namespace ZV
