#pragma once

#include <condition_variable>
#include <mutex>

#include "hal/platform/device.h"

namespace ZV {

class DeviceUse;

/// The open device of a context, with the calls that are using it. Thread-safe.
///
/// Register accesses may come from any thread at any moment, also while another closes the device.
/// Each registers a DeviceUse for its time, so that the device is never closed under it.
class DeviceSlot {
  public:
    DeviceSlot() = default;
    DeviceSlot(const DeviceSlot&) = delete;
    DeviceSlot& operator=(const DeviceSlot&) = delete;

    /// The device, or null. To be used only by who opens and closes it, and by threads that the
    /// close waits for.
    PlatformDevice* Get() const;
    bool IsOpen() const { return Get() != nullptr; }
    void Put(PlatformDevice* newDevice);
    /// Lets no new use begin, takes back the requests of those under way and waits for their end,
    /// at most a second of real time. The device is then the caller's; null when it has not come to
    /// that, or there is none.
    PlatformDevice* TakeOut();

  private:
    friend class DeviceUse;

    void CancelUses();

    mutable std::mutex leafMutex;
    std::condition_variable changed;
    PlatformDevice* device = nullptr;  // guarded by leafMutex
    bool isClosing = false;            // guarded by leafMutex
    DeviceUse* uses = nullptr;         // guarded by leafMutex; a list
};

/// One call's use of the device, from its first look to the end of its request. `overlapped`, if
/// there is one, is what a close cancels.
class DeviceUse {
  public:
    explicit DeviceUse(DeviceSlot& usedSlot, PlatformOverlapped* ownOverlapped = nullptr);
    ~DeviceUse();
    DeviceUse(const DeviceUse&) = delete;
    DeviceUse& operator=(const DeviceUse&) = delete;

    /// Null when no device is open, or it is being closed.
    PlatformDevice* GetDevice() const { return device; }

  private:
    friend class DeviceSlot;

    DeviceSlot& slot;
    PlatformOverlapped* const overlapped;  // borrowed from the caller, for the use
    PlatformDevice* device = nullptr;      // borrowed from the slot, for the use
    DeviceUse* previous = nullptr;         // guarded by the slot's leafMutex
    DeviceUse* next = nullptr;             // guarded by the slot's leafMutex
};

}  // namespace ZV
