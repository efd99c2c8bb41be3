#pragma once

#include <array>
#include <atomic>
#include <condition_variable>
#include <cstdint>
#include <deque>
#include <memory>
#include <mutex>
#include <random>
#include <vector>

#include "soak/soak_sums.h"
#include "tools/stream_sums.h"
#include "zentara/zentara.h"

namespace ZV::Soak {

/// One camera that streams for as long as the soak lasts, on a thread of its own. Its frames
/// circulate; now and then its settings change, its stream is switched off and on, it is closed and
/// opened again, and it is unplugged and plugged in. What goes wrong is counted, never repaired in
/// silence.
class SoakedCamera {
  public:
    /// `position` in the scenario. `listMutex` is for all cameras: one lists, opens or closes.
    SoakedCamera(std::uint32_t position, std::uint32_t uniqueId, std::mutex& listMutex);
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
        Zentara_Settings settings{};
    };

    static void Receive(std::uint64_t userPrivate, std::uint32_t userData, std::uint32_t errorCode,
                        std::uint32_t flags);
    static void ReceiveChange(std::uint64_t userPrivate, std::uint32_t userData,
                              std::uint32_t errorCode, std::uint32_t flags);
    bool Open();
    void Close();
    bool Reopen();
    void BeginStream();
    void EndStream(bool isExpectedToFail);
    void QueueAll();
    void Queue(Slot& slot);
    void QueueChange();
    void Serve(Slot& slot);
    bool TakeTurn();
    Slot* Take();
    void CountEngine();
    void CountStream();
    void CountChanges();
    void Expect(ZentaraResult result);

    const std::uint32_t position, uniqueId;
    std::mutex& listMutex;
    std::mt19937 random;
    ZentaraHandle handle{};  ///< 0 while the camera is not open.
    std::array<Slot, FrameCount> slots;
    Zentara_Settings settings{};
    /// Of this opening and of the one before, which a callback may outlive.
    std::deque<Change> changes, formerChanges;
    std::atomic<std::uint64_t> changesMade{0};  ///< Of this opening.
    std::atomic<std::uint64_t> received{0};     ///< Frames of this opening.
    std::atomic<std::uint32_t> opening{0};
    std::atomic<bool> isPlugged{true};
    std::uint64_t served = 0;
    ZentaraProgram::StreamSums stream{1};

    std::mutex doneMutex;
    std::condition_variable arrived;
    std::deque<Slot*> done;  // guarded by doneMutex

    mutable std::mutex sumsMutex;
    SoakSums sums;  // guarded by sumsMutex
};

}  // namespace ZV::Soak
