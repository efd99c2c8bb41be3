#pragma once

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>

#include "camera/camera_result.h"

namespace ZV {

/// Counts events of several threads. Orders nothing.
class StreamCounter {
  public:
    void Add() { count.fetch_add(1, std::memory_order_relaxed); }
    std::uint64_t Get() const { return count.load(std::memory_order_relaxed); }

  private:
    std::atomic<std::uint64_t> count{0};
};

/// One counter for each frame status code.
class StatusCounters {
  public:
    void Add(std::uint16_t status) { counters[FindPlace(status)].Add(); }
    std::uint64_t Get(std::uint16_t status) const { return counters[FindPlace(status)].Get(); }
    std::uint64_t GetSum() const {
        std::uint64_t sum = 0;
        for (const StreamCounter& counter : counters) sum += counter.Get();
        return sum;
    }

  private:
    static constexpr std::size_t FindPlace(std::uint16_t status) {
        const bool isDamage = status >= FrameStatusMissingData && status <= FrameStatusIncomplete;
        return isDamage ? std::size_t{1} + status - FrameStatusMissingData : 0;
    }

    std::array<StreamCounter, 2 + FrameStatusIncomplete - FrameStatusMissingData> counters;
};

/// What became of the frames of one camera, from its making on: no frame is lost without a count.
///
/// Each frame start that the stream layer finds is `begun` or `refused`. Each begun frame is in the
/// frame queue, or counts once as `delivered`, `heldBack`, `dropped`, `bad` or `cleared`.
struct StreamCounters {
    StreamCounter begun;     ///< Got a record and a buffer.
    StreamCounter refused;   ///< After an abort, without a stream, a buffer or memory.
    StreamCounter dropped;   ///< The youngest of two that wait, when a third begins.
    StreamCounter bad;       ///< Discarded by the run loop: stale, refused, without memory.
    StreamCounter cleared;   ///< Taken out of the queue by a stop.
    StreamCounter heldBack;  ///< Kept by the pipeline: colours that are not an image yet.
    /// Handed to the image callback, by the frame status code of that moment: what post-processing
    /// adds to it behind the callback, for want of memory, a client sees alone.
    StatusCounters delivered;
    /// Delivered, but nobody waited for an image. Part of `delivered`.
    StatusCounters withoutTaker;
};

}  // namespace ZV
