// What the bus thread asks of a camera. It comes here with the HAL's stream lock held, takes the
// camera's locks one at a time and never two at once.

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <mutex>

#include "camera/morvane_fw_camera.h"

namespace ZV {

namespace {

constexpr std::size_t WaitingFramesMax = 2;
/// No sensor comes near it; a camera that claims more gets no memory.
constexpr std::uint64_t FrameBytesMax = std::uint64_t{1} << 30;

struct FrameReleaser {
    void operator()(tStFrameInfo* frame) const { FreeFrame(frame); }
};

/// Sizes have 16 bits in the registers.
constexpr std::uint64_t PackGeometry(std::uint32_t width, std::uint32_t height,
                                     std::uint32_t bitDepth, bool isInterlaced) {
    return std::uint64_t{width} << 40 | std::uint64_t{height} << 16 | std::uint64_t{bitDepth} << 8 |
           static_cast<std::uint64_t>(isInterlaced);
}

constexpr std::uint32_t CountSampleBytes(std::uint32_t bitDepth) {
    return (bitDepth + 7) / 8;
}

}  // namespace

tStFrameInfo* MorvaneFWCamera::PrivatePeekNewFrame() {
    tStFrameInfo* const frame = MakeHeldFrame();
    (frame != nullptr ? streamCounters.begun : streamCounters.refused).Add();
    return frame;
}

tStFrameInfo* MorvaneFWCamera::MakeHeldFrame() {
    if (!streaming.isStreaming || streaming.abortPending) {
        streaming.abortPending = false;  // an abort refuses exactly one frame
        return nullptr;
    }
    if (streaming.usesExternalBuffers && streaming.externalBuffers.IsEmpty()) return nullptr;
    if (!DropSurplusFrame()) return nullptr;
    // The header of a new frame means that the previous exposure has ended.
    if (streaming.callbacks.Get().exposeDone != nullptr) {
        (void)HAL_ConditionSignal(streaming.exposeDoneCondition);  // the frame comes all the same
    }
    std::unique_ptr<tStFrameInfo, FrameReleaser> frame(MakeFrame());
    if (frame == nullptr || !ProvideBuffer(*frame)) return nullptr;
    if (!DescribeFrame(*frame) || !PushHeldFrame(*frame)) {
        if (!streaming.usesExternalBuffers) std::free(frame->buffer);
        return nullptr;
    }
    return frame.release();
}

/// The run loop's backlog is what stops a third frame: the latest of those that wait loses.
bool MorvaneFWCamera::DropSurplusFrame() {
    if (HAL_SemaphoreWait(streaming.frameLock) != HALOk) return false;
    if (streaming.frameQueue.GetCount() >= WaitingFramesMax) {
        tStFrameInfo* surplus = streaming.frameQueue.TakeNewest();
        if (surplus != nullptr) {
            FreeFrameWithBuffer(surplus);
            streamCounters.dropped.Add();
        }
    }
    return HAL_SemaphoreSignal(streaming.frameLock) == HALOk;
}

std::uint64_t MorvaneFWCamera::CalculateFrameBytes() {
    const std::uint64_t pixels = std::uint64_t{GetImageWidth()} * GetImageHeight();
    return pixels * CountSampleBytes(GetBitDepth());
}

/// A frame made for an image that the camera does not send yet would come with the pixels of the
/// former one.
bool MorvaneFWCamera::IsGeometryInForce(const tStFrameInfo& frame) const {
    if (!isGeometryPending) return true;
    return PackGeometry(frame.width, frame.height, frame.bitDepth, frame.interlaced) ==
           streaming.geometryInForce;
}

/// Under `geometryMutex`.
void MorvaneFWCamera::AnnounceNewGeometry() {
    if (changesInProgress == 0 || isGeometryPending) return;
    streaming.geometryInForce =
        PackGeometry(GetImageWidth(), GetImageHeight(), GetBitDepth(), IsInterlaced());
    isGeometryPending = true;
}

CameraResult MorvaneFWCamera::WriteGeometry(std::uint32_t quadlet, std::uint32_t value) {
    const std::lock_guard hold(geometryMutex);
    AnnounceNewGeometry();
    return WriteControl(quadlet, value);
}

CameraResult MorvaneFWCamera::WriteGeometryField(const RegisterField& field, std::uint32_t value) {
    const std::lock_guard hold(geometryMutex);
    AnnounceNewGeometry();
    return WriteControlField(field, value);
}

HALStatus MorvaneFWCamera::TakeOverGeometry() {
    const std::lock_guard hold(geometryMutex);
    const HALStatus status = WriteCommand(CommandTakeOver, 1);
    if (status == HALOk) isGeometryPending = false;
    return status;
}

bool MorvaneFWCamera::ProvideBuffer(tStFrameInfo& frame) {
    const std::uint64_t bytes = CalculateFrameBytes();
    frame.bufferSize = static_cast<std::uint32_t>(bytes);
    frame.interlaced = IsInterlaced();
    frame.bytesExpected = frame.interlaced ? frame.bufferSize / 2 : frame.bufferSize;
    if (HAL_SemaphoreWait(streaming.externalLock) != HALOk) return false;
    if (streaming.usesExternalBuffers) {
        frame.buffer = static_cast<std::uint8_t*>(streaming.externalBuffers.TakeFirst());
    } else if (bytes <= FrameBytesMax) {
        frame.buffer = static_cast<std::uint8_t*>(std::malloc(frame.bufferSize));
    }
    (void)HAL_SemaphoreSignal(streaming.externalLock);  // cannot fail
    if (frame.buffer != nullptr) return true;
    std::printf("MorvaneFWCamera::PrivatePeekNewFrame - call to malloc with size %d failed\n",
                static_cast<int>(frame.bufferSize));
    return false;
}

bool MorvaneFWCamera::DescribeFrame(tStFrameInfo& frame) {
    if (HAL_SemaphoreWait(streaming.streamLock) != HALOk) return false;
    frame.psn = static_cast<std::uint8_t>(GetPSN());
    frame.fieldIndex = 0;
    frame.rowBytes = static_cast<std::uint16_t>(GetImageWidth() * CountSampleBytes(GetBitDepth()));
    frame.frameStatus = FrameComplete;
    frame.binning = GetSymmetricalBinningMode();
    frame.width = GetImageWidth();
    frame.height = GetImageHeight();
    frame.bitDepth = GetBitDepth();
    frame.exposure = GetExposure();
    frame.gain = GetNormalizedGain();
    frame.startColour = GetRGBFilterStartColour();
    frame.valid = IsGeometryInForce(frame);
    return HAL_SemaphoreSignal(streaming.streamLock) == HALOk;
}

/// The stream layer's hold begins under the lock of the push: nobody takes the frame out until it
/// has let go.
bool MorvaneFWCamera::PushHeldFrame(tStFrameInfo& frame) {
    if (HAL_SemaphoreWait(streaming.frameLock) != HALOk) return false;
    frame.isHeld = true;
    const bool isPushed = streaming.frameQueue.PushNewest(&frame);
    (void)HAL_SemaphoreSignal(streaming.frameLock);  // cannot fail
    return isPushed;
}

tStFrameInfo* MorvaneFWCamera::PrivateGetNewFrame() {
    if (HAL_SemaphoreWait(streaming.frameLock) != HALOk) return nullptr;
    tStFrameInfo* frame = streaming.frameQueue.FindHeld();
    return HAL_SemaphoreSignal(streaming.frameLock) == HALOk ? frame : nullptr;
}

void MorvaneFWCamera::PrivateImageHasArrived() {
    (void)WakeRunLoop();  // nobody to tell on the bus thread
}

void MorvaneFWCamera::PrivateImageHasTimedOut() {
    const StreamCallbacks callbacks = streaming.callbacks.Get();
    if (callbacks.image == nullptr) return;
    ZImageReceivedCallbackStruct record{nullptr, callbacks.refCon, FrameStatusTimedOut};
    (void)callbacks.image(&record);  // its result has no reader
}

}  // namespace ZV
