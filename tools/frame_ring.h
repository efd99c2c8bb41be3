#pragma once

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <memory>
#include <mutex>
#include <vector>

#include "capture.h"

namespace ZentaraProgram {

/// A buffer that travels between the library and the program.
struct Slot {
    FrameBuffer buffer;
    std::atomic<std::int64_t> exposureEndNs{0};  ///< Since the epoch; set on the exposure thread.
    class FrameRing* ring = nullptr;
};

/// The buffers of a stream. The callbacks run on the library's threads and only move a pointer;
/// all else is called on the program's own. It has to outlive the stream.
class FrameRing {
  public:
    FrameRing(std::uint32_t count, std::size_t bytes);

    [[nodiscard]] const std::vector<std::unique_ptr<Slot>>& GetSlots() const { return slots; }

    ZentaraResult Queue(ZentaraHandle camera, Slot* slot);

    /// The next delivered slot, or null when none comes within `limit`.
    Slot* Take(std::chrono::milliseconds limit);

    /// The slots that were delivered and not taken. Behind an abort there are no more.
    std::deque<Slot*> TakeRest();

    /// Slots delivered and not taken.
    [[nodiscard]] std::size_t CountWaiting();
    /// All that were delivered.
    [[nodiscard]] std::uint64_t CountDelivered();

  private:
    static void OnEvent(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                        std::uint32_t flags);
    void Deliver(Slot* slot);

    std::vector<std::unique_ptr<Slot>> slots;
    std::mutex mutex;
    std::condition_variable arrived;
    std::deque<Slot*> done;
    std::uint64_t delivered = 0;
};

}  // namespace ZentaraProgram
