#include <cstdlib>
#include <limits>
#include <memory>

#include "hal/fw_camera.h"
#include "hal/fw_camera_records.h"
#include "hal/fw_device_context.h"
#include "hal/mutex_hold.h"
#include "hal/platform/last_error.h"

namespace ZV {
namespace {

struct MemoryDeleter {
    void operator()(std::uint8_t* memory) const { std::free(memory); }
};
using OwnedMemory = std::unique_ptr<std::uint8_t, MemoryDeleter>;

constexpr bool FitsRequest(std::uint64_t bytes) {
    return bytes <= std::numeric_limits<std::uint32_t>::max();
}

HALStatus SendAsyncRead(DeviceSlot& slot, std::uint32_t address, std::uint32_t* data,
                        std::uint32_t quadlets) {
    const OwnedOverlapped overlapped(MakeOverlapped());
    if (overlapped == nullptr) return HALReadFailed;
    const DeviceUse use(slot, overlapped.get());
    PlatformDevice* const device = use.GetDevice();
    if (device == nullptr) return HALDeviceNotOpen;  // closed meanwhile
    const AsyncReadRecord record = MakeAsyncReadRecord(address, quadlets);
    const ControlRequest request{FW_IOCTL_ASYNC_READ, &record, sizeof record, data, record.bytes};
    const ControlOutcome outcome = ControlDeviceOverlapped(device, request, overlapped.get());
    if (outcome == ControlOutcome::Failed) return HALReadFailed;
    // Kept: an answer that comes at once leaves the data in bus order. The driver is expected to
    // pend every read.
    if (outcome == ControlOutcome::Done) return HALOk;
    if (!FinishRequest(device, overlapped.get())) return HALReadFailed;
    ReverseQuadlets(data, quadlets);
    return HALOk;
}

HALStatus SendAsyncWrite(DeviceSlot& slot, std::uint32_t address, const std::uint32_t* data,
                         std::uint32_t quadlets) {
    const std::uint64_t recordBytes = GetAsyncWriteBytes(quadlets);
    if (!FitsRequest(recordBytes)) return HALWriteFailed;
    const OwnedOverlapped overlapped(MakeOverlapped());
    const OwnedMemory record(static_cast<std::uint8_t*>(std::malloc(recordBytes)));
    if (overlapped == nullptr || record == nullptr) return HALWriteFailed;
    const DeviceUse use(slot, overlapped.get());
    PlatformDevice* const device = use.GetDevice();
    if (device == nullptr) return HALDeviceNotOpen;  // closed while the mutex was waited for
    FillAsyncWriteRecord(record.get(), address, data, quadlets);
    const ControlRequest request{FW_IOCTL_ASYNC_WRITE, record.get(),
                                 static_cast<std::uint32_t>(recordBytes), nullptr, 0};
    const ControlOutcome outcome = ControlDeviceOverlapped(device, request, overlapped.get());
    if (outcome == ControlOutcome::Failed) return HALWriteFailed;
    if (outcome == ControlOutcome::Done) return HALOk;
    // Kept: the failure of a pended write is the system's number, not a HAL status.
    return FinishRequest(device, overlapped.get()) ? HALOk : GetLastPlatformError();
}

}  // namespace

HALStatus FWCameraReadData(HALCamera camera, std::uint32_t address, std::uint32_t* data,
                           std::uint32_t quadlets) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr || !context->device.IsOpen()) return HALDeviceNotOpen;
    if (data == nullptr) return HALNullData;
    if (!FitsRequest(std::uint64_t{quadlets} * 4)) return HALReadFailed;
    return SendAsyncRead(context->device, address, data, quadlets);
}

HALStatus FWCameraWriteData(HALCamera camera, std::uint32_t address, const std::uint32_t* data,
                            std::uint32_t quadlets) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr || !context->device.IsOpen()) return HALDeviceNotOpen;
    const MutexHold hold(context->deviceMutex);
    if (data == nullptr) return HALNullData;
    return SendAsyncWrite(context->device, address, data, quadlets);
}

}  // namespace ZV
