#pragma once

#include <cstdint>
#include <deque>
#include <memory>
#include <string>
#include <vector>

#include "hal/platform/kernel_driver.h"

namespace ZV::Simulation {

class Device;

/// What a file handle holds of the bus.
struct Reservations {
    struct Bandwidth {
        std::uint64_t handle = 0;
        std::uint32_t bytes = 0;
    };
    std::vector<Bandwidth> bandwidths;
    std::uint64_t channels = 0;      ///< Bit n: channel n is held.
    std::uint64_t pastChannels = 0;  ///< Bit n: channel n was held once.
    std::uint64_t resources = 0;     ///< Handle of the listening resources; 0 for none.
    std::uint32_t channel = 0, stride = 0, tag = 0, bufferCount = 0;  ///< Of the resources.
    bool isListening = false;
};

/// A request in the driver's hands.
struct PendedRequest {
    std::uint64_t id = 0;  ///< Never used twice, unlike the request's address.
    KernelRequest* request = nullptr;
    std::uint32_t forcedError = 0;  ///< A fault: the request is not carried out.
    std::uint32_t answerLimit = 0xFFFFFFFF;
    std::string input;  ///< For the trace.
};

/// An attached request buffer that waits for packets.
struct AttachedBuffer {
    std::uint64_t id = 0;
    KernelRequest* request = nullptr;
    std::uint32_t filled = 0;  ///< Packet slots in use.
    bool isOverwritten = false;
};

/// One open of a device. All members are guarded by the device's mutex.
struct FileHandle {
    std::shared_ptr<Device> device;
    std::uint64_t opening = 0;  ///< Which open of the device it was, from 1.
    bool isClosed = false;
    bool isDead = false;  ///< The device went away under it.
    bool isNotifying = false;
    std::uint32_t inFlight = 0;  ///< Completions and blocked calls under way.
    std::vector<PendedRequest> pended;
    std::deque<AttachedBuffer> attached;
    std::uint32_t ringSize = 0;  ///< Most buffers that were attached at a time.
    Reservations reservations;
};

/// One control request while it is carried out.
struct Call {
    const std::shared_ptr<FileHandle>& handle;
    KernelRequest* request;
    std::uint64_t id;         ///< Of the pended request, if it is pended.
    std::uint32_t bytes = 0;  ///< Length of the answer.
};

/// A request that has ended and whose completion is still to be called.
struct EndedRequest {
    std::shared_ptr<FileHandle> handle;
    PendedRequest pended;
    std::uint32_t error = 0;
    std::uint32_t bytes = 0;
};

/// Handles of bandwidths and resources, never used twice on any bus. 0 is none.
std::uint64_t MakeReservationHandle();
/// Whether the handle was ever given out.
bool WasReservationHandle(std::uint64_t handle);

}  // namespace ZV::Simulation
