#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>

#include "zentara/zentara.h"

/// The flat seam between the camera classes and everything that touches the operating system: the
/// 1394 device, threads, locks and events. Exported under exactly these names.
namespace ZV {

struct tStFrameInfo;

/// HAL status, 0 for success.
using HALStatus = std::uint32_t;

inline constexpr HALStatus HALOk = 0;
inline constexpr HALStatus HALAdapterAccessFailed = 6;
inline constexpr HALStatus HALDeviceNotOpen = 17;
inline constexpr HALStatus HALReadFailed = 18;  ///< Also: the listen request failed.
inline constexpr HALStatus HALWriteFailed = 19;
inline constexpr HALStatus HALThreadNotTerminated = 23;
inline constexpr HALStatus HALBandwidthNotAllocated = 24;
inline constexpr HALStatus HALBandwidthNotFreed = 25;
inline constexpr HALStatus HALChannelNotAllocated = 26;
inline constexpr HALStatus HALChannelNotFreed =
    27;  ///< Also: the in-use query of a connect failed.
inline constexpr HALStatus HALResourcesNotAllocated = 28;
inline constexpr HALStatus HALResourcesNotFreed = 29;  ///< Also: buffers could not be detached.
inline constexpr HALStatus HALThreadNotStarted =
    30;  ///< A camera's run loop, or the stream of kind 1.
inline constexpr HALStatus HALStopFailed = 31;
inline constexpr HALStatus HALSemaphoreFailed = 32;
inline constexpr HALStatus HALConditionFailed = 33;  ///< Also: a timed wait ran out.
inline constexpr HALStatus HALDeviceInUse = 37;
inline constexpr HALStatus HALSpeedUnknown = 38;
inline constexpr HALStatus HALUnknownFault = 39;
inline constexpr HALStatus HALNotAvailable = 996;
inline constexpr HALStatus HALNullData = 997;
inline constexpr HALStatus HALListingFailed = 998;

inline constexpr std::uint32_t HALKindFWCamera = 0;
inline constexpr std::uint32_t HALKindAdapter = 1;

/// The handle of one device, 32 bytes, copied by value. Any `kind` but the two makes every bus
/// operation a no-op that returns 0.
struct HALCamera {
    std::uint32_t index;  ///< Position in the enumeration, from 0.
    std::uint32_t kind;
    std::uint8_t connected;  ///< 1 while the record owns an open device, or another user held it
                             ///< when listed.
    std::uint8_t padding9[3];
    std::uint32_t cameraWord;   ///< Identity quadlet; the model id in its upper 16 bits.
    std::uint32_t packetBytes;  ///< Payload last passed to connect or reallocate, plus 12.
    std::uint32_t padding20;
    void* context;  ///< The back end's private block; survives a disconnect.
};
static_assert(sizeof(HALCamera) == 32 && offsetof(HALCamera, context) == 24);

struct HALThread;
struct HALSemaphore;
struct HALCondition;

/// Callbacks of the stream assembler, with the `context` of the connect as their argument.
using HALFrameCallback = tStFrameInfo* (*)(void* context);
using HALEventCallback = void (*)(void* context);
using HALAsyncWriteCallback = void (*)(const std::uint8_t* bytes, std::uint32_t count);
using HALThreadEntry = void* (*)(void* argument);

extern "C" {

// Lifetime and list.
ZENTARA_API HALStatus HAL_Open(void);
ZENTARA_API HALStatus HAL_Close(void);
/// Lists at most `maxCameras` devices and reads the identity quadlet of each free one. The list is
/// a new block for HAL_MemoryFree. 17 on any failure, list and count untouched.
ZENTARA_API HALStatus HAL_CameraGetList(HALCamera** list, std::uint32_t primaryIdAddress,
                                        std::uint32_t secondaryIdAddress, std::uint32_t maxCameras,
                                        std::uint32_t* count);
ZENTARA_API HALStatus HAL_MemoryFree(void* memory);
ZENTARA_API HALStatus HAL_AdapterOpen(std::uint32_t, void*);
/// Text of the calling thread's last platform error, empty if the system has none; `status` plays
/// no part. It stays good until the thread's next call, and is cut at 2047 bytes.
ZENTARA_API const char* HAL_ErrorMessage(HALStatus status);

// Connection.
ZENTARA_API HALStatus HAL_CameraConnect(HALCamera* camera, std::uint16_t payloadBytes,
                                        HALFrameCallback getNewFrame, HALFrameCallback peekNewFrame,
                                        HALEventCallback imageDone, HALEventCallback overrun,
                                        HALEventCallback timedOut, void* context);
ZENTARA_API HALStatus HAL_CameraDisconnect(HALCamera* camera);
ZENTARA_API HALStatus HAL_CameraRelease(HALCamera* camera);
ZENTARA_API HALStatus HAL_CameraReallocateBandwidth(HALCamera* camera, std::uint16_t payloadBytes,
                                                    std::uint16_t tagCode);
ZENTARA_API HALStatus HAL_CameraFastestPacketSizeSupported(HALCamera* camera, std::uint16_t* bytes);
ZENTARA_API HALStatus HAL_CameraConnectionSpeed(HALCamera* camera, std::uint16_t* megabits);
ZENTARA_API HALStatus HAL_CameraGetTimeout(HALCamera* camera);
ZENTARA_API HALStatus HAL_CameraSetTimeout(HALCamera* camera, std::uint32_t timeout);
ZENTARA_API HALStatus HAL_CameraRegisterAsyncWriteCallback(HALCamera* camera, std::uint32_t address,
                                                           std::uint32_t length,
                                                           HALAsyncWriteCallback callback);

// Register access; data are host-order quadlets.
ZENTARA_API HALStatus HAL_CameraReadData(HALCamera* camera, std::uint32_t address,
                                         std::uint32_t* data, std::uint32_t quadlets);
ZENTARA_API HALStatus HAL_CameraWriteData(HALCamera* camera, std::uint32_t address,
                                          const std::uint32_t* data, std::uint32_t quadlets);
ZENTARA_API HALStatus HAL_CameraSetShouldOutputReads(std::uint32_t, std::uint8_t on);
ZENTARA_API HALStatus HAL_CameraSetShouldOutputWrites(std::uint32_t, std::uint8_t on);

// Streaming.
ZENTARA_API HALStatus HAL_CameraStartStreaming(HALCamera* camera, std::uint32_t streamRegister,
                                               std::uint16_t streamingVersion, void* cameraObject);
ZENTARA_API HALStatus HAL_CameraStopStreaming(HALCamera* camera, std::uint32_t streamRegister);
ZENTARA_API HALStatus HAL_CameraWaitingForFrame(HALCamera* camera);
ZENTARA_API HALStatus HAL_CameraStopWaitingForFrame(HALCamera* camera);

// Primitives. Each takes null for a record. A create or destroy function with null for the place of
// one does nothing and answers 0.

// Threads. One with a null entry counts as one that could not be made.
ZENTARA_API HALStatus HAL_ThreadCreate(HALThreadEntry entry, void* argument, HALThread** thread);
ZENTARA_API HALStatus HAL_ThreadCleanup(HALThread* thread, std::uint64_t timeoutMs);
ZENTARA_API HALStatus HAL_ThreadTerminate(HALThread* thread);

// Semaphores: initial count 1, maximum 100.
ZENTARA_API HALStatus HAL_SemaphoreCreate(HALSemaphore** semaphore);
ZENTARA_API HALStatus HAL_SemaphoreWait(HALSemaphore* semaphore);
ZENTARA_API HALStatus HAL_SemaphoreSignal(HALSemaphore* semaphore);
ZENTARA_API HALStatus HAL_SemaphoreDestroy(HALSemaphore** semaphore);

// Conditions: auto-reset events with a sticky signal.
ZENTARA_API HALStatus HAL_ConditionCreate(HALCondition** condition);
ZENTARA_API HALStatus HAL_ConditionWait(HALCondition* condition);
/// Waits `timeoutMicroseconds` / 1000 milliseconds: below 1000 it polls.
ZENTARA_API HALStatus HAL_ConditionTimedWait(HALCondition* condition,
                                             std::uint64_t timeoutMicroseconds);
ZENTARA_API HALStatus HAL_ConditionReset(HALCondition* condition);
ZENTARA_API HALStatus HAL_ConditionSignal(HALCondition* condition);
ZENTARA_API HALStatus HAL_ConditionDestroy(HALCondition** condition);

/// Frees resources, channel and bandwidth and reserves them anew for `payloadBytes`.
ZENTARA_API HALStatus FWCameraReallocateBandwidth(HALCamera* camera, std::uint16_t payloadBytes,
                                                  std::uint16_t tagCode);

}  // extern "C"

/// True when HAL_ThreadCreate could start the thread, which it does not tell. One that could not be
/// made counts as ended.
bool IsHALThreadStarted(const HALThread* thread);
/// False for one that could not be made, which its create function does not tell either.
bool IsHALSemaphoreMade(const HALSemaphore* semaphore);
bool IsHALConditionMade(const HALCondition* condition);

/// What a waiter for frames has seen: it goes on at once when `count` no longer holds `seen`.
struct FrameArrivals {
    const std::atomic<std::uint32_t>* count;
    std::uint32_t seen;
};

/// HAL_CameraWaitingForFrame without its lost signals: whoever raises `arrivals.count` before the
/// signal is heard, also between two waits.
HALStatus WaitForFrameArrival(HALCamera* camera, const FrameArrivals& arrivals);

/// `halOutputWrites` and `halOutputReads`: traces are printed only while the switch holds
/// exactly 1.
std::uint8_t GetHalOutputReads();
std::uint8_t GetHalOutputWrites();

}  // namespace ZV
