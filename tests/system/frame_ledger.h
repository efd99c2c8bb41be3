#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <map>
#include <mutex>
#include <set>
#include <string>

#include "system/camera_session.h"

namespace ZV::Test {

// No frame is lost without a count: what the simulated camera exposed, as its state and its trace
// tell, is what the camera's counters and the client's callbacks add up to.

inline constexpr std::uint32_t TriggerModeSoftware = 5;
inline constexpr std::uint64_t LedgerWidth = 160, LedgerHeight = 120;

/// One camera of that size, fifty times as fast as a real one, with the faults of a JSON list.
std::string MakeLedgerScenario(const std::string& faults, std::uint32_t version);

/// A client that queues frames and writes down the codes that come back.
class CountingClient {
  public:
    explicit CountingClient(CameraSession& countedSession) : session(countedSession) {}
    CountingClient(const CountingClient&) = delete;
    CountingClient& operator=(const CountingClient&) = delete;

    void Queue(std::size_t count) { Queue(count, session.GetCamera().GetImageSize()); }
    void Queue(std::size_t count, std::uint32_t bytes);
    /// The first frame's callback returns when a frame behind it has been dropped.
    void DawdleUntilOneIsDropped() { hasDawdled = false; }
    std::map<std::uint32_t, std::uint64_t> CountCodes() const;
    std::uint64_t CountAll() const;
    /// Checksums of what came whole, by rolling number.
    std::map<std::uint32_t, std::uint64_t> GetWholeChecksums() const;
    /// Rolling numbers of what came whole.
    std::set<std::uint32_t> GetWholeNumbers() const;

  private:
    static void Receive(std::uint64_t userPrivate, std::uint32_t, std::uint32_t errorCode,
                        std::uint32_t);

    CameraSession& session;
    std::deque<DeliveredFrame> frames;
    mutable std::mutex mutex;
    std::map<std::uint32_t, std::uint64_t> codes;
    bool hasDawdled = true;  // The run loop's.
};

/// Starts that the library saw.
std::uint64_t CountSeen(const StreamCounters& counters);

/// What became of the starts that the library saw, after the stop.
std::uint64_t SumFates(const StreamCounters& counters);

/// A stop does not wait for the frame that the run loop is serving. False when more than `waiting`
/// frames are missing.
bool WaitUntilServed(const CountingClient& client, const StreamCounters& counters,
                     std::uint64_t waiting = 0);

void ExpectClientGotWhatWasDelivered(const CountingClient& client, const StreamCounters& counters);

/// Every whole frame stands in the trace: it went over the bus to its end.
void ExpectWholeFramesWereSent(const CountingClient& client, const SimulationWorld& world);

}  // namespace ZV::Test
