#include "hal/request_ring.h"

#include <cstdlib>
#include <new>

#include "hal/control_records.h"
#include "hal/fw_camera_records.h"
#include "hal/fw_device_context.h"
#include "hal/platform/clock.h"

namespace ZV {
namespace {

constexpr std::uint64_t RequestEndTimeoutMs = 1000;
// A packet's length is tested against the whole stride, so that the last one may reach so far
// beyond the end that the driver knows.
constexpr std::size_t RequestBufferSpareBytes = PacketPayloadOffset;

bool SetUpSlot(RequestRing& ring, std::uint32_t index) {
    IsochRequestSlot& slot = ring.requests[index];
    const std::size_t bytes = GetRequestBufferBytes(ring.packetStride) + RequestBufferSpareBytes;
    slot.index = index;
    slot.active = 1;
    slot.buffer = static_cast<std::uint8_t*>(std::calloc(bytes, 1));
    slot.device = ring.context->device.Get();
    slot.mutex = ring.context->streamMutex;
    slot.overlapped = MakeOverlapped();
    slot.assembler = &ring.context->assembler;
    return slot.buffer != nullptr && slot.overlapped != nullptr;
}

bool EndRequestUntil(PlatformDevice* device, PlatformOverlapped* overlapped,
                     std::uint64_t deadlineMs) {
    if (!IsOverlappedPending(overlapped)) return true;
    CancelOverlapped(device, overlapped);
    const std::uint64_t now = GetWaitClockMs();
    (void)WaitForCompletion(device, overlapped, now < deadlineMs ? deadlineMs - now : 0);
    return !IsOverlappedPending(overlapped);
}

std::uint32_t ReadPacketLength(const std::uint8_t* packet) {
    return packet[PacketLengthOffset] | (std::uint32_t{packet[PacketLengthOffset + 1]} << 8);
}

}  // namespace

RequestRing::~RequestRing() {
    for (IsochRequestSlot& slot : requests) {
        DestroyOverlapped(slot.overlapped);
        std::free(slot.buffer);
    }
    DestroyOverlapped(enterOverlapped);
}

std::unique_ptr<RequestRing> MakeRequestRing(FWDeviceContext* context) {
    std::unique_ptr<RequestRing> ring(new (std::nothrow) RequestRing);
    if (ring == nullptr) return nullptr;
    ring->context = context;
    ring->packetStride = context->packetStride;
    ring->enterOverlapped = MakeOverlapped();
    if (ring->enterOverlapped == nullptr) return nullptr;
    for (std::uint32_t i = 0; i < StreamRequestCount; ++i) {
        if (!SetUpSlot(*ring, i)) return nullptr;
    }
    return ring;
}

ControlOutcome AttachRequest(const RequestRing& ring, IsochRequestSlot& slot) {
    const std::uint32_t bytes = GetRequestBufferBytes(ring.packetStride);
    const ControlRequest request{FW_IOCTL_ATTACH_BUFFER, slot.buffer, bytes, slot.buffer, bytes};
    return ControlDeviceOverlapped(slot.device, request, slot.overlapped);
}

void ParseRequest(const RequestRing& ring, const IsochRequestSlot& slot) {
    std::uint8_t* packet = slot.buffer;
    for (std::size_t i = 0; i < PacketsPerRequest; ++i, packet += ring.packetStride) {
        const std::uint32_t dataLength = ReadPacketLength(packet);
        if (dataLength < PacketLengthMin || dataLength > ring.packetStride) continue;
        slot.assembler->ParsePacket(packet + PacketPayloadOffset, dataLength);
    }
}

bool EndRequest(PlatformDevice* device, PlatformOverlapped* overlapped) {
    return EndRequestUntil(device, overlapped, GetWaitClockMs() + RequestEndTimeoutMs);
}

bool EndRequests(RequestRing& ring) {
    PlatformDevice* const device = ring.requests.front().device;
    const std::uint64_t deadlineMs = GetWaitClockMs() + RequestEndTimeoutMs;
    for (IsochRequestSlot& slot : ring.requests) {
        if (!EndRequestUntil(device, slot.overlapped, deadlineMs)) return false;
    }
    return EndRequestUntil(device, ring.enterOverlapped, deadlineMs);
}

bool IsRingPending(const RequestRing& ring) {
    for (const IsochRequestSlot& slot : ring.requests) {
        if (IsOverlappedPending(slot.overlapped)) return true;
    }
    return IsOverlappedPending(ring.enterOverlapped);
}

}  // namespace ZV
