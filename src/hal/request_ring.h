#pragma once

#include <array>
#include <cstdint>
#include <memory>

#include "hal/platform/device.h"
#include "hal/platform/mutex.h"
#include "hal/stream_format.h"

namespace ZV {

struct FWDeviceContext;
struct StreamAssembler;

/// One isochronous request of the ring.
struct IsochRequestSlot {
    std::uint32_t index = 0;           ///< 0 to 59.
    std::uint8_t active = 0;           ///< 1 once it is set up.
    std::uint8_t* buffer = nullptr;    ///< From the C allocator; 8 bytes longer than told.
    PlatformDevice* device = nullptr;  // borrowed from the context, until the device is closed
    PlatformMutex* mutex = nullptr;    // borrowed from the context, its streamMutex
    PlatformOverlapped* overlapped = nullptr;
    StreamAssembler* assembler = nullptr;  // borrowed from the context
};

/// The requests of one run of the stream, with all that the driver may touch while they are pended:
/// their buffers and overlapped records, and those of the loop's stream-enter request. Freed only
/// when no request is pended.
struct RequestRing {
    RequestRing() = default;
    ~RequestRing();
    RequestRing(const RequestRing&) = delete;
    RequestRing& operator=(const RequestRing&) = delete;

    std::array<IsochRequestSlot, StreamRequestCount> requests{};
    std::uint16_t packetStride = 0;
    PlatformOverlapped* enterOverlapped = nullptr;
    std::uint32_t enterRecord = 0;
    FWDeviceContext* context = nullptr;  // borrowed, until the loop has ended
    RequestRing* nextRetired = nullptr;
};

/// Null when memory or the system's events run short.
std::unique_ptr<RequestRing> MakeRequestRing(FWDeviceContext* context);

/// Hands the buffer of `slot` to the driver.
ControlOutcome AttachRequest(const RequestRing& ring, IsochRequestSlot& slot);

/// Feeds the packets of an ended request to the assembler; under `streamMutex`.
void ParseRequest(const RequestRing& ring, const IsochRequestSlot& slot);

/// Takes a request back that is still pended and waits for its end, at most a second of the wait
/// clock. False when it has not ended.
[[nodiscard]] bool EndRequest(PlatformDevice* device, PlatformOverlapped* overlapped);

/// Takes back what is still pended and waits for its end, at most a second of the wait clock for
/// the whole set. False at the first one that has not ended.
[[nodiscard]] bool EndRequests(RequestRing& ring);

[[nodiscard]] bool IsRingPending(const RequestRing& ring);

}  // namespace ZV
