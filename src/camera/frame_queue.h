#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <mutex>
#include <vector>

#include "hal/frame_info.h"

namespace ZV {

/// Allocates a frame record without a buffer. Null when there is no memory.
tStFrameInfo* MakeFrame();
/// Frees the buffer, if there is one, and the record.
void FreeFrameWithBuffer(tStFrameInfo* frame);
/// Frees the record alone.
void FreeFrame(tStFrameInfo* frame);

/// Frames in flight of one camera, by age. Whole under its leaf mutex, whatever the callers lock.
///
/// A record that the stream layer holds (`isHeld`) is in its hands: no operation takes it out.
class FrameQueue {
  public:
    static constexpr std::size_t Capacity = 8;

    /// False when the queue is full; the frame is then still the caller's.
    bool PushNewest(tStFrameInfo* frame);
    /// The youngest or oldest frame that nobody holds, taken out; null when there is none.
    tStFrameInfo* TakeNewest();
    tStFrameInfo* TakeOldest();
    /// The oldest frame, even one that is held: for the end of a camera, when no stream is left.
    tStFrameInfo* TakeAny();
    /// The frame that the stream layer holds, or null. It stays in the queue.
    tStFrameInfo* FindHeld() const;
    std::size_t GetCount() const {
        const std::lock_guard hold(leafMutex);
        return count;
    }
    void MarkAllInvalid();

  private:
    tStFrameInfo* TakeOut(std::size_t place);

    mutable std::mutex leafMutex;
    std::array<tStFrameInfo*, Capacity> frames{};  ///< Oldest first. Guarded by leafMutex.
    std::size_t count = 0;
};

/// Buffers that a client has offered, first come first served. They stay the client's.
class ExternalBufferQueue {
  public:
    void Append(void* buffer);
    /// Null when there is none.
    void* TakeFirst();
    bool IsEmpty() const;

  private:
    mutable std::mutex leafMutex;
    std::vector<void*> buffers;  // guarded by leafMutex; takes no memory before the first
};

}  // namespace ZV
