// The two threads of an open camera.
//
// The run loop sleeps until the bus thread says that a frame has come, or a stop or close wakes it.
// After each wake it serves every frame that the stream layer has let go of, oldest first, and only
// then sleeps again: a wake is never counted, and one that comes while it serves is not lost
// (`arrivals`). Frames are chosen under `frameLock`; a frame that has been taken out belongs to the
// run loop alone. The client's callback runs with no lock held.
//
// The expose thread sleeps on `exposeDoneCondition` and tells the client of each exposure's end.

#include <cstdio>
#include <cstring>
#include <exception>
#include <memory>
#include <new>
#include <utility>

#include "camera/morvane_fw_camera.h"
#include "imaging/ex_image.h"
#include "imaging/image_pipeline.h"

namespace ZV {

namespace {

constexpr std::uint32_t ByteBitDepth = 8;

/// Frame status codes by `frameStatus`. A refused frame, which only a triggered camera delivers, is
/// out of sync.
constexpr std::uint16_t StatusCodes[] = {FrameStatusGood,       FrameStatusMissingData,
                                         FrameStatusOutOfSync,  FrameStatusBufferTooSmall,
                                         FrameStatusIncomplete, FrameStatusOutOfSync};

std::uint16_t ConvertFrameStatus(std::uint32_t frameStatus) {
    return frameStatus < std::size(StatusCodes) ? StatusCodes[frameStatus] : FrameStatusOutOfSync;
}

/// Counts a frame as bad unless it has come to another fate, also when the way there is left by
/// what the standard library throws.
class BadFrame {
  public:
    explicit BadFrame(StreamCounters& streamCounters) : counters(streamCounters) {}
    ~BadFrame() {
        if (!hasOtherFate) counters.bad.Add();
    }
    BadFrame(const BadFrame&) = delete;
    BadFrame& operator=(const BadFrame&) = delete;

    void Redeem() { hasOtherFate = true; }

  private:
    StreamCounters& counters;
    bool hasOtherFate = false;
};

bool RunPipeline(ZImagePipeline* pipeline, ZExImage& image) {
    bool isComplete = true;
    // Kept: the result is not looked at; what the pipeline could not do leaves the image as it was.
    if (pipeline != nullptr) (void)pipeline->ProcessImage(&image, &isComplete);
    return isComplete;
}

}  // namespace

void MorvaneFWCamera::PrivateImageStreamingRunLoop() {
    streaming.seenArrivals = 0;  // whatever came before is looked at once
    while (streaming.runLoopActive) RunShielded(&MorvaneFWCamera::ServeNextWake);
    const HALStatus status = HAL_SemaphoreSignal(streaming.closeLock);
    if (status == HALOk) return;
    std::printf(
        "MorvaneFWCamera::PrivateImageStreamingRunLoop() error %d occurred calling "
        "HAL_SignalSignl\n",
        static_cast<int>(status));
}

/// What the standard library throws ends a step, never the thread.
void MorvaneFWCamera::RunShielded(void (MorvaneFWCamera::*step)()) {
    try {
        (this->*step)();
    } catch (const std::exception&) {
    }
}

void MorvaneFWCamera::ServeNextWake() {
    HALCamera record = GetHALCamera();
    const HALStatus status =
        WaitForFrameArrival(&record, {&streaming.arrivals, streaming.seenArrivals});
    if (status != HALOk) {
        std::printf(
            "PrivateImageStreamingRunLoop() - call to HAL_WaitingForFrame failed with error %d\n",
            static_cast<int>(status));
    }
    streaming.seenArrivals = streaming.arrivals.load();
    while (streaming.runLoopActive) {
        tStFrameInfo* frame = TakeOldestFrame();
        if (frame == nullptr) return;
        ServeFrame(frame);
    }
}

tStFrameInfo* MorvaneFWCamera::TakeOldestFrame() {
    HALStatus status = HAL_SemaphoreWait(streaming.frameLock);
    if (status != HALOk) {
        std::printf(
            "MorvaneFWCamera::PrivateImageStreamingRunLoop() error %d occurred calling "
            "HAL_SemaphoreWait\n",
            static_cast<int>(status));
    }
    tStFrameInfo* frame = streaming.isStreaming ? streaming.frameQueue.TakeOldest() : nullptr;
    status = HAL_SemaphoreSignal(streaming.frameLock);
    if (status != HALOk) {
        std::printf(
            "MorvaneFWCamera::PrivateImageStreamingRunLoop() error %d occurred calling "
            "HAL_SemaphoreSignal\n",
            static_cast<int>(status));
    }
    return frame;
}

void MorvaneFWCamera::ServeFrame(tStFrameInfo* frame) {
    BadFrame fate(streamCounters);
    if (!streaming.isStreaming || !IsFrameValid(frame)) return DiscardFrame(frame);
    const std::unique_ptr<tStFrameInfo, void (*)(tStFrameInfo*)> served(frame, FreeFrame);
    // Nothing has been written to a refused frame: it must not show what its buffer held.
    if (frame->frameStatus == FrameRefused) std::memset(frame->buffer, 0, frame->bufferSize);
    std::unique_ptr<ZExImage> image(MakeImage(*frame));
    if (image == nullptr) return;
    const bool isComplete = RunPipeline(imagePipeline, *image);
    fate.Redeem();
    if (isComplete) {
        DeliverImage(image.release());
    } else {
        streamCounters.heldBack.Add();
    }
}

bool MorvaneFWCamera::IsFrameValid(tStFrameInfo* frame) {
    if (frame == nullptr || !frame->valid) return false;
    // A frame made under another size is dropped without a word to the client.
    if (frame->bufferSize != CalculateFrameBytes()) return false;
    // One whose record was made while a setting changed does not describe its own buffer.
    const std::uint64_t bytesPerPixel = (frame->bitDepth + 7) / 8;
    const std::uint64_t pixels = std::uint64_t{frame->width} * frame->height;
    if (frame->bufferSize != pixels * bytesPerPixel) return false;
    return frame->frameStatus != FrameRefused || GetTriggerMode() != 0;
}

void MorvaneFWCamera::DiscardFrame(tStFrameInfo* frame) {
    if (streaming.usesExternalBuffers) {
        FreeFrame(frame);
    } else {
        FreeFrameWithBuffer(frame);
    }
}

/// The pixels are the image's from here on.
ZExImage* MorvaneFWCamera::MakeImage(tStFrameInfo& frame) {
    std::uint8_t* const buffer = std::exchange(frame.buffer, nullptr);
    const bool ownsBuffer = !streaming.usesExternalBuffers;
    auto* image = new (std::nothrow)
        ZExImage(buffer, frame.bufferSize, frame.width, frame.height,
                 static_cast<std::uint16_t>(frame.bitDepth), frame.exposure, frame.gain,
                 static_cast<ZImageFormatEnum>(ChooseImageFormat(frame.bitDepth)),
                 static_cast<ZCameraImageFormatEnum>(GetImageFormat()),
                 static_cast<ZColourPatternEnum>(frame.colourPattern), frame.startColour,
                 streaming.bigEndian, static_cast<std::uint16_t>(GetModel()),
                 static_cast<std::uint16_t>(GetHALCamera().index),
                 static_cast<std::uint16_t>(frame.binning), GetRTVMode(), frame.rollingFrameNumber,
                 ConvertFrameStatus(frame.frameStatus), static_cast<ZCamera*>(this), ownsBuffer);
    if (image == nullptr && ownsBuffer) std::free(buffer);
    return image;
}

/// By the frame's own depth: the camera's may be changing at this moment.
std::uint32_t MorvaneFWCamera::ChooseImageFormat(std::uint32_t bitDepth) {
    const bool isByte = bitDepth == ByteBitDepth;
    switch (GetImageFormat()) {
        case CameraMono:
        case CameraRGBFilter:
            streaming.lastImageFormat = isByte ? Mono8 : Mono16;
            break;
        case CameraBayer:
            streaming.lastImageFormat = isByte ? Bayer8 : Bayer16;
            break;
        default:
            // Kept: a kind that is none keeps the format of the last frame.
            if (streaming.lastImageFormat == 0) return isByte ? Mono8 : Mono16;
    }
    return streaming.lastImageFormat;
}

void MorvaneFWCamera::DeliverImage(ZExImage* image) {
    std::unique_ptr<ZExImage> owned(image);
    const StreamCallbacks callbacks = streaming.callbacks.Get();
    streamCounters.delivered.Add(image->GetErrorCode());
    if (callbacks.image == nullptr) {
        streamCounters.withoutTaker.Add(image->GetErrorCode());
        return;
    }
    ZImageReceivedCallbackStruct record{owned.release(), callbacks.refCon, image->GetErrorCode()};
    (void)callbacks.image(&record);  // its result has no reader
}

void MorvaneFWCamera::PrivateRunExposeDoneCB() {
    RunExposeThread(streaming.exposeThreadsMade);
}

/// `number` tells the threads of one camera apart, in the order in which they begin. A thread that
/// could not be made leaves its number to the next: until then one that has outlived its close is
/// the last again, and finds its reason to run taken away or serves the camera in its stead.
void MorvaneFWCamera::RunExposeThread(std::uint32_t number) {
    const auto isLast = [&] { return number == streaming.exposeThreadsMade.load(); };
    while (streaming.exposeDoneActive && isLast()) {
        (void)HAL_ConditionWait(streaming.exposeDoneCondition);  // kept: not looked at
        if (!isLast()) {
            (void)HAL_ConditionSignal(streaming.exposeDoneCondition);  // it is for the last one
            return;
        }
        (void)HAL_ConditionReset(streaming.exposeDoneCondition);  // cannot fail
        RunShielded(&MorvaneFWCamera::ServeExposeDone);
    }
}

void MorvaneFWCamera::ServeExposeDone() {
    const StreamCallbacks callbacks = streaming.callbacks.Get();
    if (callbacks.exposeDone == nullptr) return;
    (void)callbacks.exposeDone(callbacks.refCon);  // its result has no reader
}

}  // namespace ZV
