#include "hal/device_slot.h"

#include <chrono>
#include <utility>

namespace ZV {
namespace {

/// Real time: a request that has been cancelled needs it however fast the waits run.
constexpr std::chrono::seconds UseEndLimit{1};
/// A use may send its request behind the cancelling, which is therefore repeated.
constexpr std::chrono::milliseconds CancelInterval{5};

}  // namespace

PlatformDevice* DeviceSlot::Get() const {
    const std::lock_guard hold(leafMutex);
    return device;
}

void DeviceSlot::Put(PlatformDevice* newDevice) {
    const std::lock_guard hold(leafMutex);
    device = newDevice;
}

PlatformDevice* DeviceSlot::TakeOut() {
    const auto end = std::chrono::steady_clock::now() + UseEndLimit;
    const auto isUnused = [this] { return uses == nullptr; };
    std::unique_lock lock(leafMutex);
    isClosing = true;
    while (!isUnused() && std::chrono::steady_clock::now() < end) {
        CancelUses();
        changed.wait_for(lock, CancelInterval, isUnused);
    }
    isClosing = false;
    return isUnused() ? std::exchange(device, nullptr) : nullptr;
}

/// Requires: leafMutex held, which keeps the uses and their records in place.
void DeviceSlot::CancelUses() {
    for (const DeviceUse* use = uses; use != nullptr; use = use->next) {
        if (use->overlapped != nullptr) CancelOverlapped(device, use->overlapped);
    }
}

DeviceUse::DeviceUse(DeviceSlot& usedSlot, PlatformOverlapped* ownOverlapped)
    : slot(usedSlot), overlapped(ownOverlapped) {
    const std::lock_guard hold(slot.leafMutex);
    if (slot.device == nullptr || slot.isClosing) return;
    device = slot.device;
    next = slot.uses;
    if (next != nullptr) next->previous = this;
    slot.uses = this;
}

DeviceUse::~DeviceUse() {
    if (device == nullptr) return;
    const std::lock_guard hold(slot.leafMutex);
    if (next != nullptr) next->previous = previous;
    (previous != nullptr ? previous->next : slot.uses) = next;
    slot.changed.notify_all();
}

}  // namespace ZV
