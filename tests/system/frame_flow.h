#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

#include "zentara/zentara.h"

namespace ZV::Test {

/// A frame as its callback found it.
struct FlownFrame {
    std::uint32_t userData = 0;  ///< Place in the order of the queueing calls, from 0.
    std::uint64_t number = 0;    ///< Of the camera's frames, from 1; 0 for a damaged one.
    std::uint32_t width = 0, height = 0, bits = 0, errorCode = 0;
    std::uint64_t checksum = 0;  ///< CalculateChecksum of the pixels.
};

/// One call of a callback.
struct FlowEvent {
    enum class Kind { Exposure, Frame, Settings };

    Kind kind = Kind::Frame;
    std::uint32_t userData = 0, errorCode = 0, flags = 0;
    std::uint64_t framesExposed = 0;  ///< By the camera, when a settings callback came.
    std::thread::id thread;
};

/// Frames in circulation: each is queued again by its own callback, with both events asked for, as
/// long as the flow goes on. It writes down what was delivered, and the order of all callbacks.
/// Thread-safe.
class FrameFlow {
  public:
    /// `frameCount` frames with buffers of `bufferBytes`. Nothing is queued yet. Numbers begin
    /// after `lastNumber`.
    FrameFlow(ZentaraHandle handle, std::size_t frameCount, std::uint32_t bufferBytes,
              std::uint64_t lastNumber);
    FrameFlow(const FrameFlow&) = delete;
    FrameFlow& operator=(const FrameFlow&) = delete;

    /// Queues all frames.
    void Begin();
    /// Queues one of them.
    void QueueFrame(std::size_t index);
    /// Queues a settings change whose callback is written down with `userData`.
    ZentaraResult QueueSettings(Zentara_Settings* settings, std::uint32_t flags,
                                std::uint32_t userData);
    /// From here on frames are not queued again.
    void StopCirculating();
    /// The same, and waits for those in circulation. False when the deadline passed first.
    [[nodiscard]] bool Drain();

    std::uint64_t GetLastNumber() const;
    std::size_t CountFrames() const;
    std::vector<FlownFrame> GetFrames() const;
    std::vector<FlowEvent> GetEvents() const;
    std::size_t CountSettings() const;
    /// The latest settings callback.
    FlowEvent GetLastSettings() const;

    /// False when the deadline passed first.
    [[nodiscard]] bool WaitForFrameAfter(std::uint64_t number) const;
    [[nodiscard]] bool WaitForFrames(std::size_t count) const;
    [[nodiscard]] bool WaitForSettings(std::size_t count) const;

  private:
    struct Slot {
        FrameFlow* flow = nullptr;
        Zentara_Frame frame{};
        std::vector<std::uint8_t> pixels;
    };

    static void Serve(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                      std::uint32_t flags);
    static void ServeSettings(std::uint64_t userPrivate, std::uint32_t userData,
                              std::uint32_t errorCode, std::uint32_t flags);
    void Queue(Slot& slot);
    void TakeHome(const Slot& slot, std::uint32_t userData);
    void Note(const FlowEvent& event);

    const ZentaraHandle handle;
    std::vector<std::unique_ptr<Slot>> slots;
    std::mutex queueingMutex;  ///< Numbers are given in the order of the calls.
    std::uint32_t queuedCount = 0;
    mutable std::mutex mutex;  ///< Leaf, of all below.
    std::size_t inCirculation = 0;
    bool isDraining = false;
    std::uint64_t lastNumber;
    std::vector<FlownFrame> frames;
    std::vector<FlowEvent> events;
    std::vector<FlowEvent> settingsEvents;
};

}  // namespace ZV::Test
