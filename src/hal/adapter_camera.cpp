#include "hal/adapter_camera.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <cstdlib>
#include <limits>
#include <memory>
#include <mutex>
#include <new>
#include <utility>

#include "hal/driver_selection.h"
#include "hal/frame_gate.h"
#include "hal/mutex_hold.h"
#include "hal/open_camera_table.h"
#include "hal/platform/event.h"
#include "hal/platform/settings_store.h"
#include "hal/platform/thread.h"
#include "hal/static_mutex.h"
#include "hal/stream_assembler.h"

// Threads: the stream thread, one per stream, and whoever starts and stops it, one at a time.
// `streamMutex` guards the assembler and the callbacks while a stream runs. The stop sets
// `stopEvent` and joins the thread before it frees the ring.

namespace ZV {
namespace {

struct FreeMemory {
    void operator()(std::uint8_t* memory) const { std::free(memory); }
};

struct AdapterRequest {
    std::unique_ptr<std::uint8_t, FreeMemory> buffer;
};

struct AdapterContext {
    AdapterContext(std::uint32_t adapterIndex, std::uint32_t nodeId)
        : entry(MakeOpenCameraEntry(adapterIndex, nodeId)) {}
    ~AdapterContext() {
        DestroyMutex(streamMutex);
        (void)DestroyEvent(stopEvent);
    }
    AdapterContext(const AdapterContext&) = delete;
    AdapterContext& operator=(const AdapterContext&) = delete;

    const OpenCameraEntry entry;
    std::unique_ptr<OpenCameraTable> table;  // from a connect to its disconnect
    std::uint16_t payloadBytes = 0;
    FrameGate frameEvent;
    PlatformMutex* const streamMutex = MakeMutex();
    PlatformEvent* const stopEvent = MakeEvent(EventReset::Manual);
    StreamAssembler assembler;            // guarded by streamMutex
    HALEventCallback timedOut = nullptr;  // guarded by streamMutex
    void* timedOutContext = nullptr;      // guarded by streamMutex
    std::array<AdapterRequest, AdapterRequestCount> requests;
    std::uint64_t requestBytes = 0;
    AdapterPacketSource source{};
    std::atomic<std::uint8_t> streaming{0};
    HALThread* streamThread = nullptr;
};

constinit StaticMutex sourceMutex;
AdapterPacketSource packetSource{};  // guarded by sourceMutex

AdapterContext* GetAdapterContext(const HALCamera& camera) {
    return static_cast<AdapterContext*>(camera.context);
}

std::uint32_t ReadPacketsPerRequest() {
    std::uint32_t packets = AdapterPacketsPerRequestDefault;
    SettingsStore* const store = OpenSettingsStore();
    if (store != nullptr) (void)ReadStoredNumber(store, "MaxPacketsPerRequest", &packets);
    CloseSettingsStore(store);
    return packets;
}

bool MakeRing(AdapterContext& context) {
    context.requestBytes = GetAdapterRequestBytes(context.payloadBytes, ReadPacketsPerRequest());
    if (context.requestBytes > std::numeric_limits<std::size_t>::max()) return false;
    for (AdapterRequest& request : context.requests) {
        request.buffer.reset(static_cast<std::uint8_t*>(
            std::calloc(static_cast<std::size_t>(context.requestBytes), 1)));
        if (request.buffer == nullptr) return false;
    }
    return true;
}

void FreeRing(AdapterContext& context) {
    for (AdapterRequest& request : context.requests) request.buffer.reset();
}

std::uint32_t TakePacket(const AdapterContext& context, const AdapterRequest& request) {
    if (context.source.getPacket == nullptr) return 0;
    const auto capacity = static_cast<std::uint32_t>(
        std::min<std::uint64_t>(context.requestBytes, AdapterPacketBytesMax));
    const std::uint32_t bytes =
        context.source.getPacket(context.source.reference, request.buffer.get(), capacity);
    return std::min(bytes, capacity);
}

void ParsePacket(AdapterContext& context, const AdapterRequest& request, std::uint32_t bytes) {
    if (bytes < AdapterPacketBytesMin) return;
    const MutexHold hold(context.streamMutex);
    context.assembler.ParsePacket(request.buffer.get(), bytes);
}

void ReportSilence(AdapterContext& context) {
    const WaitOutcome outcome = WaitForEvent(context.stopEvent, AdapterSilenceMs);
    if (outcome == WaitOutcome::Signalled) return;
    const MutexHold hold(context.streamMutex);
    if (context.timedOut != nullptr) context.timedOut(context.timedOutContext);
}

void* RunStream(void* argument) {
    AdapterContext& context = *static_cast<AdapterContext*>(argument);
    RaiseOwnThreadPriority(/*servesRealDevice=*/false);
    std::size_t i = 0;
    while (context.streaming.load(std::memory_order_relaxed) != 0) {
        const AdapterRequest& request = context.requests[i];
        const std::uint32_t bytes = TakePacket(context, request);
        if (bytes == 0) {
            ReportSilence(context);
        } else {
            ParsePacket(context, request, bytes);
        }
        i = (i + 1) % context.requests.size();
    }
    return nullptr;
}

void EndStream(AdapterContext& context) {
    context.streaming.store(0, std::memory_order_relaxed);
    (void)SignalEvent(context.stopEvent);
    (void)HAL_ThreadCleanup(std::exchange(context.streamThread, nullptr), WaitForEver);
    context.assembler.AbandonFrame();
    FreeRing(context);
}

bool StartStreamThread(AdapterContext& context) {
    context.streaming.store(1, std::memory_order_relaxed);
    (void)HAL_ThreadCreate(RunStream, &context, &context.streamThread);
    return IsHALThreadStarted(context.streamThread);
}

void LeaveTable(AdapterContext& context) {
    if (context.table == nullptr) return;
    context.table->Remove(context.entry);
    if (context.table->CountUsed() == 0) SetLastCameraFlag(true);
    context.table.reset();
}

}  // namespace

void SetAdapterPacketSource(const AdapterPacketSource& source) {
    const std::lock_guard guard(sourceMutex);
    packetSource = source;
}

HALCamera MakeAdapterCamera(std::uint32_t adapterIndex, std::uint32_t nodeId) {
    HALCamera camera{};
    camera.kind = HALKindAdapter;
    std::unique_ptr<AdapterContext> context(new (std::nothrow)
                                                AdapterContext(adapterIndex, nodeId));
    // Without its event the camera's run loop would never rest.
    if (context != nullptr && context->frameEvent.IsMade()) camera.context = context.release();
    return camera;
}

HALStatus AdapterCameraConnect(HALCamera* camera, std::uint16_t payloadBytes) {
    AdapterContext* const context = GetAdapterContext(*camera);
    if (context == nullptr) return HALDeviceNotOpen;
    camera->packetBytes = std::uint32_t{payloadBytes} + 12;
    std::unique_ptr<OpenCameraTable> table(new (std::nothrow) OpenCameraTable);
    if (table != nullptr && table->Contains(context->entry)) return HALDeviceInUse;
    context->payloadBytes = payloadBytes;
    // Kept: with all entries used the camera is simply not recorded.
    if (table != nullptr) (void)table->Add(context->entry);
    context->table = std::move(table);
    context->frameEvent.Open();
    camera->connected = 1;
    return HALOk;
}

HALStatus AdapterCameraSetCallbacks(HALCamera camera, const HALStreamCallbacks* callbacks) {
    AdapterContext* const context = GetAdapterContext(camera);
    if (context == nullptr) return HALOk;
    const MutexHold hold(context->streamMutex);
    context->assembler.SetCallbacks(callbacks->getNewFrame, callbacks->peekNewFrame,
                                    callbacks->imageDone, callbacks->overrun, callbacks->context);
    context->timedOut = callbacks->timedOut;
    context->timedOutContext = callbacks->context;
    return HALOk;
}

HALStatus AdapterCameraDisconnect(HALCamera* camera) {
    AdapterContext* const context = GetAdapterContext(*camera);
    if (camera->connected == 0 || context == nullptr) return HALOk;
    EndStream(*context);
    context->frameEvent.Close();
    LeaveTable(*context);
    camera->connected = 0;
    return HALOk;
}

HALStatus AdapterCameraRelease(HALCamera camera) {
    AdapterContext* const context = GetAdapterContext(camera);
    if (context == nullptr) return HALOk;
    EndStream(*context);
    LeaveTable(*context);
    delete context;
    return HALOk;
}

HALStatus AdapterCameraReallocateBandwidth(HALCamera* camera, std::uint16_t payloadBytes,
                                           std::uint16_t) {
    AdapterContext* const context = GetAdapterContext(*camera);
    if (context == nullptr) return HALDeviceNotOpen;
    camera->packetBytes = std::uint32_t{payloadBytes} + 12;
    context->payloadBytes = payloadBytes;
    return HALOk;
}

HALStatus AdapterCameraStartStreaming(HALCamera camera, std::uint32_t,
                                      std::uint16_t streamingVersion) {
    AdapterContext* const context = GetAdapterContext(camera);
    if (context == nullptr) return HALThreadNotStarted;
    if (context->streaming.load(std::memory_order_relaxed) != 0) return HALOk;
    // Without its event the thread would never rest, without its mutex nothing guards the frame.
    if (context->streamMutex == nullptr || context->stopEvent == nullptr) {
        return HALThreadNotStarted;
    }
    {
        const std::lock_guard guard(sourceMutex);
        context->source = packetSource;
    }
    ClearEvent(context->stopEvent);
    context->assembler.StartStream(static_cast<std::uint8_t>(streamingVersion));
    if (MakeRing(*context) && StartStreamThread(*context)) return HALOk;
    EndStream(*context);
    return HALThreadNotStarted;
}

HALStatus AdapterCameraStopStreaming(HALCamera camera, std::uint32_t) {
    AdapterContext* const context = GetAdapterContext(camera);
    if (context == nullptr) return HALOk;
    if (context->streaming.load(std::memory_order_relaxed) != 0) EndStream(*context);
    return HALOk;
}

HALStatus AdapterCameraWaitingForFrame(HALCamera camera, const FrameArrivals* arrivals) {
    AdapterContext* const context = GetAdapterContext(camera);
    return context != nullptr ? context->frameEvent.Wait(arrivals) : HALOk;
}

HALStatus AdapterCameraStopWaitingForFrame(HALCamera camera) {
    AdapterContext* const context = GetAdapterContext(camera);
    if (context != nullptr) context->frameEvent.Release();
    return HALOk;
}

HALStatus AdapterCameraReadData(HALCamera, std::uint32_t, std::uint32_t*, std::uint32_t) {
    return HALAdapterAccessFailed;
}

HALStatus AdapterCameraWriteData(HALCamera, std::uint32_t, const std::uint32_t*, std::uint32_t) {
    return HALAdapterAccessFailed;
}

HALStatus AdapterCameraGetTimeout(HALCamera) {
    return HALAdapterAccessFailed;
}

HALStatus AdapterCameraSetTimeout(HALCamera, std::uint32_t) {
    return HALAdapterAccessFailed;
}

HALStatus AdapterCameraFastestPacketSizeSupported(HALCamera, std::uint16_t*) {
    return HALSpeedUnknown;
}

HALStatus AdapterCameraConnectionSpeed(HALCamera, std::uint16_t* megabits) {
    *megabits = 0;
    return HALSpeedUnknown;
}

}  // namespace ZV
