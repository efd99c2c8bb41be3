#pragma once

#include <atomic>
#include <cstdint>
#include <memory>

#include "hal/control_records.h"
#include "hal/device_slot.h"
#include "hal/frame_gate.h"
#include "hal/hal.h"
#include "hal/platform/device.h"
#include "hal/platform/event.h"
#include "hal/platform/mutex.h"
#include "hal/request_ring.h"
#include "hal/stream_assembler.h"

namespace ZV {

inline constexpr std::size_t DevicePathBytes = 256;

/// What the notification loop hands to the driver. Freed when its request has ended.
struct NotificationRequest {
    NotificationRequest();
    ~NotificationRequest();
    NotificationRequest(const NotificationRequest&) = delete;
    NotificationRequest& operator=(const NotificationRequest&) = delete;

    PlatformOverlapped* const overlapped;
    std::uint8_t record[NotifyRecordBytes] = {};
};

/// Private block of the FWCamera back end, one per device: made at enumeration, kept over a
/// disconnect, freed by HAL_CameraRelease. Locks and events stay until then, so that a call that
/// comes late never meets one that is gone.
struct FWDeviceContext {
    FWDeviceContext() = default;
    ~FWDeviceContext();
    FWDeviceContext(const FWDeviceContext&) = delete;
    FWDeviceContext& operator=(const FWDeviceContext&) = delete;

    char devicePath[DevicePathBytes] = {};
    DeviceSlot device;  ///< Every request goes through it.
    std::uint64_t bandwidthHandle = 0;
    std::uint64_t resourceHandle = 0;
    PlatformMutex* streamMutex = nullptr;  ///< Guards submission and parsing. From the first start.
    FrameGate frameEvent;
    HALThread* callbackThread = nullptr;
    PlatformEvent* stopEvent = nullptr;  ///< Manual reset; from a start to its stop.
    std::unique_ptr<RequestRing> ring;   ///< Request buffers and slots; from a start to its stop.
    std::uint32_t requestCounters[3] = {};
    StreamAssembler assembler;               ///< Guarded by streamMutex while a stream runs.
    std::atomic<std::uint8_t> streaming{0};  ///< 1 while the callback loop is to run.
    std::uint32_t channel = AnyChannel;      ///< 0xFFFFFFFF while none.
    PlatformMutex* deviceMutex = nullptr;    ///< Serialises writes and notification requests.
    HALThread* notifyThread = nullptr;
    std::atomic<std::uint8_t> notifying{0};  ///< 1 while the notification loop is to run.
    std::uint32_t speedFlag = 0;             ///< 8 with resources at S800, 4 at S400, 0 before any.
    std::uint16_t packetStride = 0;          ///< Payload + 12: the size of one packet slot.

    std::unique_ptr<NotificationRequest> notification;
    RequestRing* retiredRings = nullptr;  ///< Not ended in time; freed when the device is closed.
};

/// The context of a kind 0 record, or null.
inline FWDeviceContext* GetFWContext(const HALCamera& camera) {
    return static_cast<FWDeviceContext*>(camera.context);
}

/// Sends a buffered request with one record as input and output and waits for the answer. False for
/// a failure, and for a device that is not open. Thread-safe with a slot.
[[nodiscard]] bool SendRecord(PlatformDevice* device, std::uint32_t code, void* record,
                              std::uint32_t bytes);
[[nodiscard]] bool SendRecord(DeviceSlot& slot, std::uint32_t code, void* record,
                              std::uint32_t bytes);

struct OverlappedDeleter {
    void operator()(PlatformOverlapped* overlapped) const { DestroyOverlapped(overlapped); }
};
using OwnedOverlapped = std::unique_ptr<PlatformOverlapped, OverlappedDeleter>;

/// Waits without limit for the end of a pended request; false when it failed. A thread that is to
/// end takes its request back first, since the buffers are its own.
[[nodiscard]] bool FinishRequest(PlatformDevice* device, PlatformOverlapped* overlapped);

/// Sends a request overlapped and waits without limit for its end. False when it failed.
/// Thread-safe.
[[nodiscard]] bool SendOverlapped(DeviceSlot& slot, const ControlRequest& request);

/// Keeps `ring` until the device handle is closed.
void RetireRing(FWDeviceContext& context, std::unique_ptr<RequestRing> ring);

/// Ends and frees a thread of the HAL and nulls the pointer; null counts as ended. False when the
/// thread lives on.
[[nodiscard]] bool EndHALThread(HALThread** thread);

/// Ends the notification loop and takes its request back. False when one of them lives on.
[[nodiscard]] bool EndNotification(FWDeviceContext& context);

/// Ends what runs over the device (both threads, calls under way), closes it and frees what was
/// kept for it. Sends no control request. False when one of them could not be ended: all it may use
/// stays.
[[nodiscard]] bool CloseHeldDevice(FWDeviceContext& context);

}  // namespace ZV
