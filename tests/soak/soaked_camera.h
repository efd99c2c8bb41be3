#pragma once

#include <array>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <memory>
#include <mutex>
#include <random>
#include <vector>

#include "soak/frame_numbers.h"
#include "soak/soak_sums.h"
#include "soak/stale_numbers.h"
#include "tools/stream_sums.h"
#include "zentara/zentara.h"

namespace ZV::Soak {

/// Requests of a camera that faults have failed.
struct FailedRequests {
    std::uint32_t all = 0;
    std::uint32_t registers = 0;  ///< Of those the reads and writes.
    std::uint32_t refused = 0;    ///< Buffers of a stream, by the call itself.
};

/// One camera that streams for as long as the soak lasts, on a thread of its own. Its frames
/// circulate; now and then its settings change, its stream is switched off and on, it is closed and
/// opened again, and it is unplugged and plugged in. Calls may fail when a fault has failed a
/// request of theirs: they are counted by their codes, and the camera is opened anew where it
/// cannot go on. What else goes wrong is counted apart, never repaired in silence.
class SoakedCamera {
  public:
    /// `position` in the scenario. `listMutex` is for all cameras: one lists, opens or closes.
    SoakedCamera(std::uint32_t position, std::uint32_t uniqueId, std::uint32_t streamingVersion,
                 std::mutex& listMutex);
    SoakedCamera(const SoakedCamera&) = delete;
    SoakedCamera& operator=(const SoakedCamera&) = delete;

    /// Until `isOver`, or until the camera cannot be opened; then it is closed.
    void Run(const std::atomic<bool>& isOver);
    /// So far. Thread-safe.
    [[nodiscard]] SoakSums GetSums() const;

  private:
    static constexpr std::size_t FrameCount = 6;

    struct Slot {
        SoakedCamera* camera = nullptr;
        Zentara_Frame frame{};
        std::vector<std::uint8_t> pixels;
    };

    /// Settings in the queue. They are the library's until the change is made or dropped, of which
    /// the latter is not told: none is used twice.
    struct Change {
        SoakedCamera* camera = nullptr;
        std::uint32_t opening = 0;
        std::uint32_t failedBefore = 0;  ///< Reads and writes, when it was queued.
        Zentara_Settings settings{};
        std::atomic<bool> isMade{false};  ///< Or has been tried: its callback came.
    };

    static void Receive(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                        std::uint32_t flags);
    static void ReceiveChange(std::uint64_t userPrivate, std::uint32_t userData,
                              std::uint32_t errorCode, std::uint32_t flags);
    bool Open();
    bool OpenListed(std::uint32_t cameraId, const FailedRequests& failedBefore);
    void Prepare();
    bool Start();
    void Close();
    bool Reopen();
    bool Restart();
    bool ReopenUnplugged();
    bool GoOnWithoutFrames();
    bool BeginStream();
    bool EndStream();
    void QueueAll();
    void Queue(Slot& slot);
    void QueueChange();
    void Serve(Slot& slot);
    bool TakeTurn();
    Slot* Take();
    [[nodiscard]] bool HasReasonToStall() const;
    [[nodiscard]] bool HasOtherPsn() const;
    bool IsStalled(std::chrono::steady_clock::time_point begin) const;
    bool CountEngine();
    void CountStream();
    void SettleStream();
    bool CountRest();
    void CountChanges();
    [[nodiscard]] FailedRequests CountFailedRequests() const;
    bool Tell(const char* call, ZentaraResult result, bool isExcused);
    bool Judge(const char* call, ZentaraResult result, const FailedRequests& failedBefore);
    bool JudgeEnd(const char* call, ZentaraResult result);
    void Expect(const char* call, ZentaraResult result);
    void Count(std::uint64_t SoakSums::*sum);
    void JudgeNumber(const Zentara_Frame& frame);

    const std::uint32_t position, uniqueId;
    std::mutex& listMutex;
    std::mt19937 random;
    ZentaraHandle handle{};  ///< 0 while the camera is not open.
    std::array<Slot, FrameCount> slots;
    Zentara_Settings settings{};
    /// Of this opening and of the one before, which a callback may outlive.
    std::deque<Change> changes, formerChanges;
    std::atomic<std::uint64_t> changesMade{0};  ///< Of this opening.
    /// Frames of this opening, with which the client was called; and those that `stream` knows.
    std::atomic<std::uint64_t> received{0};
    std::uint64_t taken = 0;
    std::atomic<std::uint32_t> opening{0};
    std::atomic<bool> isPlugged{true};
    /// When this opening was listed, and when its stream began: the first one that has failed to
    /// begin or to end, since the next may fail for the same reason.
    FailedRequests failedAtOpening, failedAtStream;
    bool hasTrouble = false;          ///< There is such a stream.
    std::uint32_t failedCounted = 0;  ///< Of all, those taken over into the sums.
    std::uint64_t served = 0;
    ZentaraProgram::StreamSums stream{1};

    std::mutex doneMutex;
    std::condition_variable arrived;
    std::deque<Slot*> done;     // guarded by doneMutex
    FrameNumbers numbers;       // guarded by doneMutex
    StaleNumbers staleNumbers;  // guarded by doneMutex

    mutable std::mutex sumsMutex;
    SoakSums sums;  // guarded by sumsMutex
};

}  // namespace ZV::Soak
