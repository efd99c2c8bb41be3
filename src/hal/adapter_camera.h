#pragma once

#include <cstdint>

#include "hal/fw_camera.h"
#include "hal/hal.h"

/// The adapter back end, kind 1: a skeleton for a second 1394 stack. Its bus calls are missing, and
/// nothing in the library makes its records. Connect and disconnect keep the open-camera table; a
/// stream takes its packets from a source that has to be given.
namespace ZV {

/// Where the stream threads of the adapter back end get their packets from.
struct AdapterPacketSource {
    /// Writes the payload of the next packet, at most `capacity` bytes, and returns its length; 0
    /// when nothing has come. Called from the stream thread. Null is a source that is always
    /// silent.
    std::uint32_t (*getPacket)(void* reference, std::uint8_t* payload, std::uint32_t capacity);
    void* reference;
};

/// Replaces the source for the streams that start from now on. Thread-safe.
void SetAdapterPacketSource(const AdapterPacketSource& source);

inline constexpr std::uint32_t AdapterRequestCount = 10;
inline constexpr std::uint32_t AdapterPacketBytesMin = 9;
inline constexpr std::uint32_t AdapterPacketBytesMax = 9200;
inline constexpr std::uint32_t AdapterPacketsPerRequestDefault = 100;
/// Length of the wait for a silent source before `timedOut` is called, in milliseconds of the wait
/// clock.
inline constexpr std::uint64_t AdapterSilenceMs = 1000;

/// Bytes of one request buffer for packets of `payloadBytes`. Any stored number counts; a start
/// whose buffers find no memory fails.
constexpr std::uint64_t GetAdapterRequestBytes(std::uint16_t payloadBytes,
                                               std::uint32_t packetsPerRequest) {
    const std::uint64_t slotBytes = (std::uint64_t{payloadBytes} + 12 + 3) / 4 * 4;
    return slotBytes * packetsPerRequest + 32;
}

/// Makes a record for the camera `nodeId` on adapter `adapterIndex`, for HAL_CameraRelease. Its
/// context is null without memory.
HALCamera MakeAdapterCamera(std::uint32_t adapterIndex, std::uint32_t nodeId);

/// 17 no context; 37 the table says that the camera is open elsewhere.
[[nodiscard]] HALStatus AdapterCameraConnect(HALCamera* camera, std::uint16_t payloadBytes);
/// Keeps `timedOut` too. Always 0.
HALStatus AdapterCameraSetCallbacks(HALCamera camera, const HALStreamCallbacks* callbacks);
[[nodiscard]] HALStatus AdapterCameraDisconnect(HALCamera* camera);
HALStatus AdapterCameraRelease(HALCamera camera);
[[nodiscard]] HALStatus AdapterCameraReallocateBandwidth(HALCamera* camera,
                                                         std::uint16_t payloadBytes,
                                                         std::uint16_t tagCode);
/// 30: the ring or the stream thread could not be made.
[[nodiscard]] HALStatus AdapterCameraStartStreaming(HALCamera camera, std::uint32_t streamRegister,
                                                    std::uint16_t streamingVersion);
[[nodiscard]] HALStatus AdapterCameraStopStreaming(HALCamera camera, std::uint32_t streamRegister);
[[nodiscard]] HALStatus AdapterCameraWaitingForFrame(HALCamera camera,
                                                     const FrameArrivals* arrivals);
[[nodiscard]] HALStatus AdapterCameraStopWaitingForFrame(HALCamera camera);

/// What a bus call that is missing answers.
[[nodiscard]] HALStatus AdapterCameraReadData(HALCamera camera, std::uint32_t address,
                                              std::uint32_t* data, std::uint32_t quadlets);
[[nodiscard]] HALStatus AdapterCameraWriteData(HALCamera camera, std::uint32_t address,
                                               const std::uint32_t* data, std::uint32_t quadlets);
[[nodiscard]] HALStatus AdapterCameraGetTimeout(HALCamera camera);
[[nodiscard]] HALStatus AdapterCameraSetTimeout(HALCamera camera, std::uint32_t timeout);
[[nodiscard]] HALStatus AdapterCameraFastestPacketSizeSupported(HALCamera camera,
                                                                std::uint16_t* bytes);
[[nodiscard]] HALStatus AdapterCameraConnectionSpeed(HALCamera camera, std::uint16_t* megabits);

}  // namespace ZV
