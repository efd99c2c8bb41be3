#include "hal/hal.h"

#include "hal/adapter_camera.h"
#include "hal/fw_camera.h"
#include "hal/io_trace.h"

// Bus operations dispatch on the record's kind. Only connect, disconnect and reallocate get the
// caller's own record; all others get a copy, so that they cannot change it. A release takes from
// the caller's record, after that, the context that its back end has freed.

namespace ZV {
namespace {

struct BackEnd {
    std::uint32_t kind;
    HALStatus (*connect)(HALCamera*, std::uint16_t);
    HALStatus (*setCallbacks)(HALCamera, const HALStreamCallbacks*);
    HALStatus (*disconnect)(HALCamera*);
    HALStatus (*release)(HALCamera);
    HALStatus (*reallocateBandwidth)(HALCamera*, std::uint16_t, std::uint16_t);
    HALStatus (*fastestPacketSizeSupported)(HALCamera, std::uint16_t*);
    HALStatus (*connectionSpeed)(HALCamera, std::uint16_t*);
    HALStatus (*getTimeout)(HALCamera);
    HALStatus (*setTimeout)(HALCamera, std::uint32_t);
    HALStatus (*readData)(HALCamera, std::uint32_t, std::uint32_t*, std::uint32_t);
    HALStatus (*writeData)(HALCamera, std::uint32_t, const std::uint32_t*, std::uint32_t);
    HALStatus (*startStreaming)(HALCamera, std::uint32_t, std::uint16_t);
    HALStatus (*stopStreaming)(HALCamera, std::uint32_t);
    HALStatus (*waitingForFrame)(HALCamera, const FrameArrivals*);
    HALStatus (*stopWaitingForFrame)(HALCamera);
};

HALStatus FWCameraGetTimeout(HALCamera) {
    return HALOk;
}

HALStatus FWCameraSetTimeout(HALCamera, std::uint32_t) {
    return HALNotAvailable;
}

constexpr BackEnd BackEnds[] = {
    {
        .kind = HALKindFWCamera,
        .connect = FWCameraConnect,
        .setCallbacks = FWCameraSetCallbacks,
        .disconnect = FWCameraDisconnect,
        .release = FWCameraRelease,
        .reallocateBandwidth = FWCameraReallocateBandwidth,
        .fastestPacketSizeSupported = FWCameraFastestPacketSizeSupported,
        .connectionSpeed = FWCameraConnectionSpeed,
        .getTimeout = FWCameraGetTimeout,
        .setTimeout = FWCameraSetTimeout,
        .readData = FWCameraReadData,
        .writeData = FWCameraWriteData,
        .startStreaming = FWCameraStartStreaming,
        .stopStreaming = FWCameraStopStreaming,
        .waitingForFrame = FWCameraWaitingForFrame,
        .stopWaitingForFrame = FWCameraStopWaitingForFrame,
    },
    {
        .kind = HALKindAdapter,
        .connect = AdapterCameraConnect,
        .setCallbacks = AdapterCameraSetCallbacks,
        .disconnect = AdapterCameraDisconnect,
        .release = AdapterCameraRelease,
        .reallocateBandwidth = AdapterCameraReallocateBandwidth,
        .fastestPacketSizeSupported = AdapterCameraFastestPacketSizeSupported,
        .connectionSpeed = AdapterCameraConnectionSpeed,
        .getTimeout = AdapterCameraGetTimeout,
        .setTimeout = AdapterCameraSetTimeout,
        .readData = AdapterCameraReadData,
        .writeData = AdapterCameraWriteData,
        .startStreaming = AdapterCameraStartStreaming,
        .stopStreaming = AdapterCameraStopStreaming,
        .waitingForFrame = AdapterCameraWaitingForFrame,
        .stopWaitingForFrame = AdapterCameraStopWaitingForFrame,
    },
};

const BackEnd* FindBackEnd(std::uint32_t kind) {
    for (const BackEnd& backEnd : BackEnds) {
        if (backEnd.kind == kind) return &backEnd;
    }
    return nullptr;
}

/// Runs `operation` of the record's back end with a copy of the record. A kind without a back end
/// does nothing and answers 0; a record that is not there counts as not open.
template <typename... Parameters, typename... Arguments>
HALStatus Dispatch(HALStatus (*BackEnd::*operation)(HALCamera, Parameters...),
                   const HALCamera* camera, Arguments... arguments) {
    if (camera == nullptr) return HALDeviceNotOpen;
    const BackEnd* const backEnd = FindBackEnd(camera->kind);
    return backEnd != nullptr ? (backEnd->*operation)(*camera, arguments...) : HALOk;
}

/// The same with the caller's own record.
template <typename... Parameters, typename... Arguments>
HALStatus Dispatch(HALStatus (*BackEnd::*operation)(HALCamera*, Parameters...), HALCamera* camera,
                   Arguments... arguments) {
    if (camera == nullptr) return HALDeviceNotOpen;
    const BackEnd* const backEnd = FindBackEnd(camera->kind);
    return backEnd != nullptr ? (backEnd->*operation)(camera, arguments...) : HALOk;
}

}  // namespace

extern "C" {

HALStatus HAL_CameraGetList(HALCamera** list, std::uint32_t primaryIdAddress,
                            std::uint32_t secondaryIdAddress, std::uint32_t maxCameras,
                            std::uint32_t* count) {
    if (list == nullptr || count == nullptr) return HALDeviceNotOpen;
    const HALStatus status =
        FWCameraGetList(list, primaryIdAddress, secondaryIdAddress, maxCameras, count);
    // Kept: whatever went wrong, the caller sees one code.
    return status == HALOk ? HALOk : HALDeviceNotOpen;
}

HALStatus HAL_CameraConnect(HALCamera* camera, std::uint16_t payloadBytes,
                            HALFrameCallback getNewFrame, HALFrameCallback peekNewFrame,
                            HALEventCallback imageDone, HALEventCallback overrun,
                            HALEventCallback timedOut, void* context) {
    const HALStatus status = Dispatch(&BackEnd::connect, camera, payloadBytes);
    const HALStreamCallbacks callbacks{getNewFrame, peekNewFrame, imageDone,
                                       overrun,     timedOut,     context};
    // Kept: the callbacks are stored whatever the connect gave.
    (void)Dispatch(&BackEnd::setCallbacks, camera, &callbacks);
    return status;
}

HALStatus HAL_CameraDisconnect(HALCamera* camera) {
    return Dispatch(&BackEnd::disconnect, camera);
}

HALStatus HAL_CameraRelease(HALCamera* camera) {
    if (camera == nullptr) return HALOk;
    (void)Dispatch(&BackEnd::release, camera);
    if (FindBackEnd(camera->kind) != nullptr) camera->context = nullptr;
    return HALOk;
}

HALStatus HAL_CameraReallocateBandwidth(HALCamera* camera, std::uint16_t payloadBytes,
                                        std::uint16_t tagCode) {
    return Dispatch(&BackEnd::reallocateBandwidth, camera, payloadBytes, tagCode);
}

HALStatus HAL_CameraFastestPacketSizeSupported(HALCamera* camera, std::uint16_t* bytes) {
    if (bytes == nullptr) return HALNullData;
    return Dispatch(&BackEnd::fastestPacketSizeSupported, camera, bytes);
}

HALStatus HAL_CameraConnectionSpeed(HALCamera* camera, std::uint16_t* megabits) {
    if (megabits == nullptr) return HALNullData;
    return Dispatch(&BackEnd::connectionSpeed, camera, megabits);
}

HALStatus HAL_CameraGetTimeout(HALCamera* camera) {
    return Dispatch(&BackEnd::getTimeout, camera);
}

HALStatus HAL_CameraSetTimeout(HALCamera* camera, std::uint32_t timeout) {
    return Dispatch(&BackEnd::setTimeout, camera, timeout);
}

HALStatus HAL_CameraRegisterAsyncWriteCallback(HALCamera*, std::uint32_t, std::uint32_t,
                                               HALAsyncWriteCallback) {
    // Kept: nothing is stored, and the callback never runs.
    return HALOk;
}

HALStatus HAL_CameraReadData(HALCamera* camera, std::uint32_t address, std::uint32_t* data,
                             std::uint32_t quadlets) {
    const HALStatus status = Dispatch(&BackEnd::readData, camera, address, data, quadlets);
    TraceRead(address, data, quadlets);
    return status;
}

HALStatus HAL_CameraWriteData(HALCamera* camera, std::uint32_t address, const std::uint32_t* data,
                              std::uint32_t quadlets) {
    if (camera == nullptr) return HALDeviceNotOpen;
    // Kept: a record of no kind has a read trace, but no write trace.
    if (FindBackEnd(camera->kind) != nullptr) TraceWrite(address, data, quadlets);
    return Dispatch(&BackEnd::writeData, camera, address, data, quadlets);
}

HALStatus HAL_CameraSetShouldOutputReads(std::uint32_t, std::uint8_t on) {
    SetHalOutputReads(on);
    return HALOk;
}

HALStatus HAL_CameraSetShouldOutputWrites(std::uint32_t, std::uint8_t on) {
    SetHalOutputWrites(on);
    return HALOk;
}

HALStatus HAL_CameraStartStreaming(HALCamera* camera, std::uint32_t streamRegister,
                                   std::uint16_t streamingVersion, void*) {
    return Dispatch(&BackEnd::startStreaming, camera, streamRegister, streamingVersion);
}

HALStatus HAL_CameraStopStreaming(HALCamera* camera, std::uint32_t streamRegister) {
    return Dispatch(&BackEnd::stopStreaming, camera, streamRegister);
}

HALStatus HAL_CameraWaitingForFrame(HALCamera* camera) {
    return Dispatch(&BackEnd::waitingForFrame, camera, nullptr);
}

HALStatus HAL_CameraStopWaitingForFrame(HALCamera* camera) {
    return Dispatch(&BackEnd::stopWaitingForFrame, camera);
}

}  // extern "C"

HALStatus WaitForFrameArrival(HALCamera* camera, const FrameArrivals& arrivals) {
    return Dispatch(&BackEnd::waitingForFrame, camera, &arrivals);
}

}  // namespace ZV
