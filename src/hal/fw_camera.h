#pragma once

#include <cstdint>

#include "hal/hal.h"

/// The FWCamera back end, kind 0: the branches of the HAL operations of the same stem, over a
/// HALCamera and its FWDeviceContext. A record without a context counts as not open.
namespace ZV {

/// Callbacks of a connect, with their argument.
struct HALStreamCallbacks {
    HALFrameCallback getNewFrame;
    HALFrameCallback peekNewFrame;
    HALEventCallback imageDone;
    HALEventCallback overrun;
    HALEventCallback timedOut;
    void* context;
};

/// Lists the devices. 0, a system error number or a HAL status; `*list` is a new block of `*count`
/// records from the C allocator, both untouched on failure.
[[nodiscard]] HALStatus FWCameraGetList(HALCamera** list, std::uint32_t primaryIdAddress,
                                        std::uint32_t secondaryIdAddress, std::uint32_t maxCameras,
                                        std::uint32_t* count);

/// Opens the device and reserves bandwidth, channel and resources. 17 not opened; 27 in-use query
/// failed; 37 in use; 24, 26, 28: a reservation failed, the record stays connected.
[[nodiscard]] HALStatus FWCameraConnect(HALCamera* camera, std::uint16_t payloadBytes);

/// `timedOut` is not kept. Always 0.
HALStatus FWCameraSetCallbacks(HALCamera camera, const HALStreamCallbacks* callbacks);

/// 0 when not connected. 29, 27, 25: a reservation could not be freed, the device stays open.
[[nodiscard]] HALStatus FWCameraDisconnect(HALCamera* camera);

/// Frees the context; a device that is still open is closed without a request. Always 0.
HALStatus FWCameraRelease(HALCamera camera);

[[nodiscard]] HALStatus FWCameraAllocateBandwidth(HALCamera camera);
[[nodiscard]] HALStatus FWCameraAllocateChannel(HALCamera camera);
[[nodiscard]] HALStatus FWCameraAllocateResources(HALCamera camera, std::uint16_t tagCode);
[[nodiscard]] HALStatus FWCameraFreeBandwidth(HALCamera camera);
[[nodiscard]] HALStatus FWCameraFreeChannel(HALCamera camera);
[[nodiscard]] HALStatus FWCameraFreeResources(HALCamera camera);
[[nodiscard]] HALStatus FWCameraFastestPacketSizeSupported(HALCamera camera, std::uint16_t* bytes);
[[nodiscard]] HALStatus FWCameraConnectionSpeed(HALCamera camera, std::uint16_t* megabits);

/// 17 not open, 997 null data, 18 failed. A request that the driver answers at once leaves the data
/// in bus order. Not serialised with anything.
[[nodiscard]] HALStatus FWCameraReadData(HALCamera camera, std::uint32_t address,
                                         std::uint32_t* data, std::uint32_t quadlets);

/// 17 not open, 997 null data, 19 not issued; a pended write that fails gives the system's error
/// number.
[[nodiscard]] HALStatus FWCameraWriteData(HALCamera camera, std::uint32_t address,
                                          const std::uint32_t* data, std::uint32_t quadlets);

/// Notification loop: 17 not open, 19 request failed. Nothing in the library enables it.
[[nodiscard]] HALStatus FWCameraEnableNotification(HALCamera camera);
[[nodiscard]] HALStatus FWCameraDisableNotification(HALCamera camera);

/// Prints the bytes of an asynchronous write on standard output.
void CameraAsyncWriteCallback(const std::uint8_t* bytes, std::uint32_t count);

[[nodiscard]] HALStatus FWCameraStartStreaming(HALCamera camera, std::uint32_t streamRegister,
                                               std::uint16_t streamingVersion);
[[nodiscard]] HALStatus FWCameraStopStreaming(HALCamera camera, std::uint32_t streamRegister);
[[nodiscard]] HALStatus FWCameraWaitingForFrame(HALCamera camera, const FrameArrivals* arrivals);
[[nodiscard]] HALStatus FWCameraStopWaitingForFrame(HALCamera camera);

}  // namespace ZV
