#include "system/frame_flow.h"

#include <gtest/gtest.h>

#include <chrono>

#include "support/expect_zerr.h"
#include "support/simulation_world.h"
#include "support/wait_until.h"

namespace ZV::Test {
namespace {

constexpr std::chrono::seconds Deadline{60};

std::uint64_t GetFramesExposed() {
    ZentaraSimulationState state{};
    (void)ZentaraSimulation_GetState(0, &state);  // zeros say the same
    return state.framesExposed;
}

template <typename Object>
Object& Restore(std::uint64_t userPrivate) {
    return *reinterpret_cast<Object*>(static_cast<std::uintptr_t>(userPrivate));
}

}  // namespace

FrameFlow::FrameFlow(ZentaraHandle flowHandle, std::size_t frameCount, std::uint32_t bufferBytes,
                     std::uint64_t firstLastNumber)
    : handle(flowHandle), lastNumber(firstLastNumber) {
    for (std::size_t i = 0; i < frameCount; ++i) {
        slots.push_back(std::make_unique<Slot>());
        Slot& slot = *slots.back();
        slot.flow = this;
        slot.pixels.resize(bufferBytes);
        slot.frame.pBuffer = slot.pixels.data();
        slot.frame.bufferSize = bufferBytes;
    }
}

void FrameFlow::Begin() {
    for (std::size_t i = 0; i < slots.size(); ++i) QueueFrame(i);
}

void FrameFlow::QueueFrame(std::size_t index) {
    {
        const std::lock_guard hold(mutex);
        ++inCirculation;
    }
    Queue(*slots[index]);
}

void FrameFlow::Queue(Slot& slot) {
    const std::lock_guard hold(queueingMutex);
    EXPECT_ZERR(zerrNone,
                Zentara_QueueFrame(handle, &slot.frame, Serve, zcbFrameDone | zcbExposeDone,
                                   reinterpret_cast<std::uintptr_t>(&slot), queuedCount));
    ++queuedCount;
}

ZentaraResult FrameFlow::QueueSettings(Zentara_Settings* settings, std::uint32_t flags,
                                       std::uint32_t userData) {
    return Zentara_QueueSettings(handle, settings, ServeSettings, flags,
                                 reinterpret_cast<std::uintptr_t>(this), userData);
}

void FrameFlow::StopCirculating() {
    const std::lock_guard hold(mutex);
    isDraining = true;
}

bool FrameFlow::Drain() {
    StopCirculating();
    return WaitUntil(
        [this] {
            const std::lock_guard hold(mutex);
            return inCirculation == 0;
        },
        Deadline);
}

void FrameFlow::Serve(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                      std::uint32_t flags) {
    Slot& slot = Restore<Slot>(userPrivate);
    FrameFlow& flow = *slot.flow;
    const bool isExposure = flags == zcbExposeDone;
    flow.Note({isExposure ? FlowEvent::Kind::Exposure : FlowEvent::Kind::Frame, userData, errorCode,
               flags, 0, std::this_thread::get_id()});
    if (isExposure) return;
    flow.TakeHome(slot, userData);
    {
        const std::lock_guard hold(flow.mutex);
        if (flow.isDraining) --flow.inCirculation;
        if (flow.isDraining) return;
    }
    flow.Queue(slot);
}

void FrameFlow::ServeSettings(std::uint64_t userPrivate, std::uint32_t userData,
                              std::uint32_t errorCode, std::uint32_t flags) {
    FrameFlow& flow = Restore<FrameFlow>(userPrivate);
    const FlowEvent event{FlowEvent::Kind::Settings, userData, errorCode, flags, GetFramesExposed(),
                          std::this_thread::get_id()};
    const std::lock_guard hold(flow.mutex);
    flow.events.push_back(event);
    flow.settingsEvents.push_back(event);
}

void FrameFlow::Note(const FlowEvent& event) {
    const std::lock_guard hold(mutex);
    events.push_back(event);
}

void FrameFlow::TakeHome(const Slot& slot, std::uint32_t userData) {
    const Zentara_Frame& record = slot.frame;
    const FlownFrame flown{userData,
                           0,
                           record.width,
                           record.height,
                           record.bits,
                           record.errorCode,
                           CalculateChecksum(slot.pixels.data(), record.size)};
    const std::lock_guard hold(mutex);
    frames.push_back(flown);
    if (flown.errorCode != zerrNone) return;  // what was never accepted has no number
    // The record has the low 16 bits.
    const auto step = static_cast<std::int16_t>(record.frameNumber - lastNumber);
    lastNumber += static_cast<std::uint64_t>(std::int64_t{step});
    frames.back().number = lastNumber;
}

std::uint64_t FrameFlow::GetLastNumber() const {
    const std::lock_guard hold(mutex);
    return lastNumber;
}

std::size_t FrameFlow::CountFrames() const {
    const std::lock_guard hold(mutex);
    return frames.size();
}

std::vector<FlownFrame> FrameFlow::GetFrames() const {
    const std::lock_guard hold(mutex);
    return frames;
}

std::vector<FlowEvent> FrameFlow::GetEvents() const {
    const std::lock_guard hold(mutex);
    return events;
}

std::size_t FrameFlow::CountSettings() const {
    const std::lock_guard hold(mutex);
    return settingsEvents.size();
}

FlowEvent FrameFlow::GetLastSettings() const {
    const std::lock_guard hold(mutex);
    return settingsEvents.empty() ? FlowEvent{} : settingsEvents.back();
}

bool FrameFlow::WaitForFrameAfter(std::uint64_t number) const {
    return WaitUntil([&] { return GetLastNumber() > number; }, Deadline);
}

bool FrameFlow::WaitForFrames(std::size_t count) const {
    return WaitUntil([&] { return CountFrames() >= count; }, Deadline);
}

bool FrameFlow::WaitForSettings(std::size_t count) const {
    return WaitUntil([&] { return CountSettings() >= count; }, Deadline);
}

}  // namespace ZV::Test
