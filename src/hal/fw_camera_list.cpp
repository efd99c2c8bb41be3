#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <new>

#include "hal/fw_camera.h"
#include "hal/fw_device_context.h"
#include "hal/platform/debug_output.h"
#include "hal/platform/device_discovery.h"
#include "hal/platform/last_error.h"

namespace ZV {
namespace {

/// Detail records are told their size less the head of the record, aligned to 8 bytes.
constexpr std::uint32_t DetailHeadBytes = 8;
constexpr std::uint32_t DetailTextBytesMax = 255;

struct FreeMemory {
    void operator()(void* memory) const { std::free(memory); }
};

struct CloseList {
    void operator()(DeviceInterfaceList* list) const { CloseDeviceInterfaceList(list); }
};

struct DevicePath {
    char text[DevicePathBytes];
};

/// The paths that a walk found, `count` of them, in the order found.
struct PathStaging {
    std::unique_ptr<DevicePath, FreeMemory> paths;
    std::uint32_t count = 0;
    std::uint32_t capacity = 0;
    std::uint32_t rememberedError = PlatformErrorNone;
};

bool GrowStaging(PathStaging& staging) {
    if (staging.count < staging.capacity) return true;
    const std::size_t capacity = std::size_t{staging.capacity} * 2 + 16;
    void* const grown = std::realloc(staging.paths.get(), capacity * sizeof(DevicePath));
    if (grown == nullptr) return false;
    (void)staging.paths.release();
    staging.paths.reset(static_cast<DevicePath*>(grown));
    staging.capacity = static_cast<std::uint32_t>(capacity);
    return true;
}

/// Ends a walk with nothing found and an error.
bool GiveUpWalk(PathStaging& staging, std::uint32_t error) {
    staging.count = 0;
    staging.rememberedError = error;
    return false;
}

bool StagePath(PathStaging& staging, const char* path) {
    if (!GrowStaging(staging)) return GiveUpWalk(staging, PlatformErrorNotEnoughMemory);
    DevicePath& staged = staging.paths.get()[staging.count];
    std::snprintf(staged.text, sizeof staged.text, "%s", path);
    ++staging.count;
    return true;
}

/// Takes the path of the current interface. False ends the walk.
bool TakeInterface(DeviceInterfaceList* list, PathStaging& staging) {
    std::uint32_t bytes = 0;
    if (GetDeviceInterfaceDetail(list, nullptr, 0, &bytes) ||
        GetLastPlatformError() != PlatformErrorInsufficientBuffer) {
        return false;
    }
    // Zeroed and one byte longer than the system is told, so that the path always ends inside.
    const std::size_t heldBytes = std::max<std::size_t>(bytes, DetailHeadBytes) + 1;
    const std::unique_ptr<char, FreeMemory> detail(static_cast<char*>(std::calloc(heldBytes, 1)));
    if (detail == nullptr) return GiveUpWalk(staging, PlatformErrorNotEnoughMemory);
    std::memcpy(detail.get(), &DetailHeadBytes, sizeof DetailHeadBytes);
    if (!GetDeviceInterfaceDetail(list, detail.get(), bytes, nullptr)) {
        return GiveUpWalk(staging, GetLastPlatformError());
    }
    if (bytes > DetailHeadBytes + DetailTextBytesMax) {
        // Kept: the devices before it are probed, and the listing fails at its end.
        staging.rememberedError = PlatformErrorInsufficientBuffer;
        return false;
    }
    return StagePath(staging, detail.get() + DeviceDetailPathOffset);
}

void WalkInterfaces(DeviceInterfaceList* list, std::uint32_t maxCameras, PathStaging& staging) {
    for (std::uint32_t i = 0; staging.count < maxCameras; ++i) {
        if (!SelectDeviceInterface(list, i)) {
            const std::uint32_t error = GetLastPlatformError();
            if (error != PlatformErrorNoMoreItems) (void)GiveUpWalk(staging, error);
            return;
        }
        if (!TakeInterface(list, staging)) return;
    }
}

HALStatus FindDevices(std::uint32_t maxCameras, PathStaging& staging) {
    const std::unique_ptr<DeviceInterfaceList, CloseList> list(OpenDeviceInterfaceList());
    if (list == nullptr) return GetLastPlatformError();
    WalkInterfaces(list.get(), maxCameras, staging);
    return HALOk;
}

void PrintDeviceCount(std::uint32_t count) {
    char text[80];
    std::snprintf(text, sizeof text, "FWCameraGetList - got %d devices using setup API\n",
                  static_cast<std::int32_t>(count));
    WriteDebuggerOutput(text);
}

/// Disconnects and releases the records of a list that is not handed out.
void GiveUpRecords(HALCamera* cameras, std::uint32_t count) {
    for (std::uint32_t i = 0; i < count; ++i) {
        // A device that cannot be disconnected in order is closed by the release.
        (void)HAL_CameraDisconnect(&cameras[i]);
        (void)HAL_CameraRelease(&cameras[i]);
    }
}

bool FillRecords(HALCamera* cameras, const PathStaging& staging) {
    for (std::uint32_t i = 0; i < staging.count; ++i) {
        std::unique_ptr<FWDeviceContext> context(new (std::nothrow) FWDeviceContext);
        // Without its event the camera's run loop would never rest.
        if (context == nullptr || !context->frameEvent.IsMade()) return false;
        std::memcpy(context->devicePath, staging.paths.get()[i].text, DevicePathBytes);
        cameras[i].index = i;
        cameras[i].kind = HALKindFWCamera;
        cameras[i].context = context.release();
    }
    return true;
}

HALStatus ReadIdentity(HALCamera* camera, std::uint32_t primaryIdAddress,
                       std::uint32_t secondaryIdAddress) {
    if (primaryIdAddress == 0) return HALOk;
    if (HAL_CameraReadData(camera, primaryIdAddress, &camera->cameraWord, 1) == HALOk) {
        return HALOk;
    }
    return HAL_CameraReadData(camera, secondaryIdAddress, &camera->cameraWord, 1);
}

HALStatus ProbeDevice(HALCamera* camera, std::uint32_t primaryIdAddress,
                      std::uint32_t secondaryIdAddress) {
    const HALStatus connected =
        HAL_CameraConnect(camera, 0, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr);
    if (connected == HALDeviceInUse) {
        camera->connected = 1;
        return HALOk;
    }
    if (connected != HALOk) return connected;
    const HALStatus read = ReadIdentity(camera, primaryIdAddress, secondaryIdAddress);
    const HALStatus disconnected = HAL_CameraDisconnect(camera);
    return read != HALOk ? read : disconnected;
}

HALStatus ProbeDevices(HALCamera* cameras, const PathStaging& staging,
                       std::uint32_t primaryIdAddress, std::uint32_t secondaryIdAddress) {
    if (!FillRecords(cameras, staging)) return PlatformErrorNotEnoughMemory;
    for (std::uint32_t i = 0; i < staging.count; ++i) {
        const HALStatus status = ProbeDevice(&cameras[i], primaryIdAddress, secondaryIdAddress);
        if (status != HALOk) return status;
    }
    return staging.rememberedError != PlatformErrorNone ? HALDeviceNotOpen : HALOk;
}

}  // namespace

HALStatus FWCameraGetList(HALCamera** list, std::uint32_t primaryIdAddress,
                          std::uint32_t secondaryIdAddress, std::uint32_t maxCameras,
                          std::uint32_t* count) {
    PathStaging staging;
    if (const HALStatus status = FindDevices(maxCameras, staging); status != HALOk) return status;
    PrintDeviceCount(staging.count);
    // An empty list is a block as well.
    const std::size_t records = std::max<std::size_t>(staging.count, 1);
    auto* const cameras = static_cast<HALCamera*>(std::calloc(records, sizeof(HALCamera)));
    if (cameras == nullptr) return PlatformErrorNotEnoughMemory;
    const HALStatus status = ProbeDevices(cameras, staging, primaryIdAddress, secondaryIdAddress);
    if (status != HALOk) {
        const std::uint32_t error = GetLastPlatformError();
        GiveUpRecords(cameras, staging.count);
        std::free(cameras);
        SetLastPlatformError(error);  // The caller prints its text.
        return status;
    }
    *list = cameras;
    *count = staging.count;
    return HALOk;
}

}  // namespace ZV
