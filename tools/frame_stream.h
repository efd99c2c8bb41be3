#pragma once

#include <chrono>
#include <cstdint>
#include <functional>

#include "commands.h"
#include "frame_ring.h"
#include "stream_sums.h"

namespace ZentaraProgram {

/// What a stream asks of its command; each is called on the thread of `Run`.
struct StreamCalls {
    /// Writes the frame of a slot as the file of this number. After a failure it is not called any
    /// more. Empty where no files are wanted.
    std::function<ExitCode(const Slot& slot, std::uint64_t number)> write;
    std::function<bool()> isInterrupted;
    std::function<void(const StreamSums& sums, bool isLast)> show;
};

/// A stream of queued frames. Each frame that is delivered until the stream has stopped is counted
/// and written, or told of as surplus.
class FrameStream {
  public:
    FrameStream(ZentaraHandle openCamera, const CaptureFacts& captureFacts,
                const StreamOptions& streamOptions, StreamCalls streamCalls);
    ~FrameStream() { Stop(); }
    FrameStream(const FrameStream&) = delete;
    FrameStream& operator=(const FrameStream&) = delete;

    /// Runs to its end; `result` receives the code of a call that failed.
    ExitCode Run(ZentaraResult* result);

    [[nodiscard]] const StreamSums& GetSums() const { return sums; }
    /// Frames that came behind those that were asked for.
    [[nodiscard]] std::uint64_t GetSurplus() const { return surplus; }
    FrameRing& GetRing() { return ring; }

  private:
    using Clock = std::chrono::steady_clock;

    [[nodiscard]] double GetSeconds() const;
    [[nodiscard]] bool HasAllFrames() const;
    [[nodiscard]] bool IsFinished() const;
    ZentaraResult Begin();
    ZentaraResult TriggerNext();
    void TriggerRest();
    ExitCode Step(ZentaraResult* result);
    ExitCode Serve(Slot* slot, ZentaraResult* result);
    ExitCode Keep(const Slot& slot);
    ExitCode KeepRest(ExitCode code);
    void Stop();

    ZentaraHandle camera;
    const CaptureFacts& facts;
    const StreamOptions& options;
    const StreamCalls calls;
    FrameRing ring;
    StreamSums sums;
    Clock::time_point begin{}, lastFrame{};
    std::uint64_t surplus = 0;
    bool isStopped = false, isWritable = true;
};

}  // namespace ZentaraProgram
