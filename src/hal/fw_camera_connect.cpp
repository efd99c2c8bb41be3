#include <cstdio>
#include <utility>

#include "hal/fw_camera.h"
#include "hal/fw_camera_records.h"
#include "hal/fw_device_context.h"
#include "hal/mutex_hold.h"
#include "hal/platform/debug_output.h"

namespace ZV {
namespace {

constexpr std::uint16_t FastestPacketBytesS800 = 9044;
constexpr std::uint16_t FastestPacketBytesS400 = 5000;

struct SpeedRow {
    std::uint32_t speedFlag;
    std::uint16_t megabits;
};
constexpr SpeedRow SpeedRows[] = {{SpeedFlagS800, 800}, {SpeedFlagS400, 400}};

void StorePacketSize(HALCamera* camera, FWDeviceContext& context, std::uint16_t payloadBytes) {
    camera->packetBytes = std::uint32_t{payloadBytes} + PacketSlotExtraBytes;
    context.packetStride = static_cast<std::uint16_t>(camera->packetBytes);
}

HALStatus QueryFree(PlatformDevice* device) {
    std::uint32_t answer = 0;
    if (!SendRecord(device, FW_IOCTL_QUERY_BUSY, &answer, PlainRecordBytes)) {
        return HALChannelNotFreed;
    }
    return answer == DeviceIsBusy ? HALDeviceInUse : HALOk;
}

HALStatus OpenFreeDevice(FWDeviceContext& context) {
    PlatformDevice* const device = OpenDevice(context.devicePath);
    if (device == nullptr) return HALDeviceNotOpen;
    const HALStatus status = QueryFree(device);
    // A device that this record held until now goes before its handle is forgotten.
    if (status != HALOk || (context.device.IsOpen() && !CloseHeldDevice(context))) {
        CloseDevice(device);
        return status != HALOk ? status : HALDeviceInUse;
    }
    context.device.Put(device);
    return HALOk;
}

// Kept: after a failure what was reserved stays so, and the record stays connected; a disconnect
// releases it.
HALStatus Reserve(HALCamera camera, std::uint16_t tagCode) {
    if (const HALStatus status = FWCameraAllocateBandwidth(camera); status != HALOk) return status;
    if (const HALStatus status = FWCameraAllocateChannel(camera); status != HALOk) return status;
    return FWCameraAllocateResources(camera, tagCode);
}

HALStatus FreeReservations(HALCamera camera) {
    if (const HALStatus status = FWCameraFreeResources(camera); status != HALOk) return status;
    if (const HALStatus status = FWCameraFreeChannel(camera); status != HALOk) return status;
    return FWCameraFreeBandwidth(camera);
}

bool RequestResources(FWDeviceContext& context, std::uint32_t speed, std::uint16_t tagCode) {
    AllocateResourcesRecord record =
        MakeAllocateResourcesRecord(speed, context.channel, context.packetStride, tagCode);
    context.speedFlag = speed;
    const bool granted =
        SendRecord(context.device, FW_IOCTL_ALLOC_RESOURCES, &record, sizeof record);
    context.resourceHandle = granted ? record.resourceHandle : 0;
    return granted;
}

}  // namespace

HALStatus FWCameraConnect(HALCamera* camera, std::uint16_t payloadBytes) {
    FWDeviceContext* const context = GetFWContext(*camera);
    if (context == nullptr) return HALDeviceNotOpen;
    StorePacketSize(camera, *context, payloadBytes);
    if (context->deviceMutex == nullptr) context->deviceMutex = MakeMutex();
    if (context->deviceMutex == nullptr) return HALDeviceNotOpen;
    if (const HALStatus status = OpenFreeDevice(*context); status != HALOk) return status;
    camera->connected = 1;
    context->streaming.store(0, std::memory_order_relaxed);
    context->frameEvent.Open();
    return Reserve(*camera, /*tagCode=*/1);
}

HALStatus FWCameraSetCallbacks(HALCamera camera, const HALStreamCallbacks* callbacks) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr) return HALOk;
    const MutexHold hold(context->streamMutex);
    context->assembler.SetCallbacks(callbacks->getNewFrame, callbacks->peekNewFrame,
                                    callbacks->imageDone, callbacks->overrun, callbacks->context);
    return HALOk;
}

HALStatus FWCameraDisconnect(HALCamera* camera) {
    if (camera->connected == 0) return HALOk;
    // Kept: a reservation that cannot be freed leaves the device open and connected.
    if (const HALStatus status = FreeReservations(*camera); status != HALOk) return status;
    FWDeviceContext& context = *GetFWContext(*camera);
    // The device is closed next, whatever the answer.
    (void)FWCameraDisableNotification(*camera);
    context.frameEvent.Close();
    if (!CloseHeldDevice(context)) return HALThreadNotTerminated;
    camera->connected = 0;
    return HALOk;
}

HALStatus FWCameraRelease(HALCamera camera) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr) return HALOk;
    context->frameEvent.Close();
    // A thread that could not be ended still uses the context.
    if (CloseHeldDevice(*context)) delete context;
    return HALOk;
}

HALStatus FWCameraReallocateBandwidth(HALCamera* camera, std::uint16_t payloadBytes,
                                      std::uint16_t tagCode) {
    if (camera == nullptr || camera->kind != HALKindFWCamera) return HALDeviceNotOpen;
    // Kept: a failure ends it at once, also with a part of the reservations gone.
    if (const HALStatus status = FreeReservations(*camera); status != HALOk) return status;
    StorePacketSize(camera, *GetFWContext(*camera), payloadBytes);
    return Reserve(*camera, tagCode);
}

HALStatus FWCameraAllocateBandwidth(HALCamera camera) {
    if (GetFWContext(camera) == nullptr) return HALBandwidthNotAllocated;
    FWDeviceContext& context = *GetFWContext(camera);
    WriteDebuggerOutput("Allocating resources\n");
    AllocateBandwidthRecord record = MakeAllocateBandwidthRecord(context.packetStride);
    if (SendRecord(context.device, FW_IOCTL_ALLOC_BANDWIDTH, &record, sizeof record)) {
        context.bandwidthHandle = record.bandwidthHandle;
        return HALOk;
    }
    context.bandwidthHandle = 0;
    char text[64];
    // Kept: the number is always this status, not what the system said.
    std::snprintf(text, sizeof text, "Allocating Resources Failed with error %d",
                  static_cast<int>(HALBandwidthNotAllocated));
    WriteDebuggerOutput(text);
    return HALBandwidthNotAllocated;
}

HALStatus FWCameraAllocateChannel(HALCamera camera) {
    if (GetFWContext(camera) == nullptr) return HALChannelNotAllocated;
    FWDeviceContext& context = *GetFWContext(camera);
    context.channel = AnyChannel;
    AllocateChannelRecord record = MakeAllocateChannelRecord();
    if (!SendRecord(context.device, FW_IOCTL_ALLOC_CHANNEL, &record, sizeof record)) {
        return HALChannelNotAllocated;
    }
    context.channel = record.channel;
    return HALOk;
}

HALStatus FWCameraAllocateResources(HALCamera camera, std::uint16_t tagCode) {
    if (GetFWContext(camera) == nullptr) return HALResourcesNotAllocated;
    FWDeviceContext& context = *GetFWContext(camera);
    // Kept: the bandwidth was asked for at S800 in either case.
    if (RequestResources(context, SpeedFlagS800, tagCode)) return HALOk;
    context.speedFlag = SpeedFlagS400;
    if (context.packetStride > PacketStrideMaxS400) return HALResourcesNotAllocated;
    return RequestResources(context, SpeedFlagS400, tagCode) ? HALOk : HALResourcesNotAllocated;
}

HALStatus FWCameraFreeBandwidth(HALCamera camera) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr) return HALBandwidthNotFreed;
    std::uint64_t handle = context->bandwidthHandle;
    if (!SendRecord(context->device, FW_IOCTL_FREE_BANDWIDTH, &handle, HandleRecordBytes)) {
        return HALBandwidthNotFreed;
    }
    context->bandwidthHandle = 0;
    return HALOk;
}

HALStatus FWCameraFreeChannel(HALCamera camera) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr) return HALChannelNotFreed;
    std::uint32_t channel = context->channel;
    if (!SendRecord(context->device, FW_IOCTL_FREE_CHANNEL, &channel, ChannelRecordBytes)) {
        return HALChannelNotFreed;
    }
    // The number may be another camera's from here on.
    context->channel = AnyChannel;
    return HALOk;
}

HALStatus FWCameraFreeResources(HALCamera camera) {
    FWDeviceContext* const context = GetFWContext(camera);
    if (context == nullptr) return HALResourcesNotFreed;
    std::uint64_t handle = context->resourceHandle;
    if (!SendRecord(context->device, FW_IOCTL_FREE_RESOURCES, &handle, HandleRecordBytes)) {
        return HALResourcesNotFreed;
    }
    context->resourceHandle = 0;
    return HALOk;
}

HALStatus FWCameraFastestPacketSizeSupported(HALCamera camera, std::uint16_t* bytes) {
    const FWDeviceContext* const context = GetFWContext(camera);
    const bool isFast = context != nullptr && context->speedFlag == SpeedFlagS800;
    *bytes = isFast ? FastestPacketBytesS800 : FastestPacketBytesS400;
    return HALOk;
}

HALStatus FWCameraConnectionSpeed(HALCamera camera, std::uint16_t* megabits) {
    const FWDeviceContext* const context = GetFWContext(camera);
    *megabits = 0;
    if (context == nullptr) return HALSpeedUnknown;
    for (const SpeedRow& row : SpeedRows) {
        if (row.speedFlag != context->speedFlag) continue;
        *megabits = row.megabits;
        return HALOk;
    }
    return HALSpeedUnknown;
}

}  // namespace ZV
