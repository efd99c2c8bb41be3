#include "frame_ring.h"

#include <utility>

namespace ZentaraProgram {
namespace {

std::int64_t GetEpochNs() {
    const auto sinceEpoch = std::chrono::system_clock::now().time_since_epoch();
    return std::chrono::duration_cast<std::chrono::nanoseconds>(sinceEpoch).count();
}

}  // namespace

FrameRing::FrameRing(std::uint32_t count, std::size_t bytes) {
    for (std::uint32_t i = 0; i < count; ++i) {
        slots.push_back(std::make_unique<Slot>());
        slots.back()->buffer.Prepare(bytes);
        slots.back()->ring = this;
    }
}

ZentaraResult FrameRing::Queue(ZentaraHandle camera, Slot* slot) {
    return Zentara_QueueFrame(camera, &slot->buffer.frame, &OnEvent, zcbFrameDone | zcbExposeDone,
                              reinterpret_cast<std::uintptr_t>(slot), 0);
}

Slot* FrameRing::Take(std::chrono::milliseconds limit) {
    std::unique_lock lock(mutex);
    if (!arrived.wait_for(lock, limit, [this] { return !done.empty(); })) return nullptr;
    Slot* slot = done.front();
    done.pop_front();
    return slot;
}

std::deque<Slot*> FrameRing::TakeRest() {
    const std::lock_guard lock(mutex);
    return std::exchange(done, {});
}

std::size_t FrameRing::CountWaiting() {
    const std::lock_guard lock(mutex);
    return done.size();
}

std::uint64_t FrameRing::CountDelivered() {
    const std::lock_guard lock(mutex);
    return delivered;
}

void FrameRing::OnEvent(std::uint64_t userPrivate, std::uint32_t, std::uint32_t,
                        std::uint32_t flags) {
    auto* slot = reinterpret_cast<Slot*>(static_cast<std::uintptr_t>(userPrivate));
    if (flags == zcbExposeDone) {
        slot->exposureEndNs = GetEpochNs();
    } else {
        slot->ring->Deliver(slot);
    }
}

void FrameRing::Deliver(Slot* slot) {
    const std::lock_guard lock(mutex);
    done.push_back(slot);
    ++delivered;
    arrived.notify_one();
}

}  // namespace ZentaraProgram
