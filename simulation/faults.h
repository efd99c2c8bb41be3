#pragma once

#include <cstdint>
#include <random>
#include <string>
#include <vector>

namespace ZV::Simulation {

/// What goes wrong. The first four and Plug meet a control request, WrongPsn a frame, the rest a
/// packet. BusReset and Unplug meet a control request when `request` or `code` is given.
enum class FaultKind {
    FailRequest,    ///< Ends with `error`: at once, or on completion when `isPended`.
    AnswerAtOnce,   ///< Answered by the call itself instead of pended.
    NeverComplete,  ///< Stays pended until unplugging or the close.
    ShortAnswer,    ///< Only the first `bytes` of the answer arrive.
    LosePacket,
    RepeatPacket,
    TruncatePacket,  ///< Only the first `bytes` of the payload arrive.
    CorruptPacket,   ///< `bytes` of the payload, from `offset` on, are inverted.
    MissingTail,
    OverwriteRequest,  ///< The request buffer that holds the packet is filled a second time.
    FrameStart,        ///< The frame begins anew, under the next number.
    BusReset,          ///< The rest of the frame is lost, and what is pended fails.
    Unplug,
    Plug,
    WrongPsn,
};

/// One fault of a camera. Frames count from 1 and packets of a frame from 0; requests count from 1
/// among those that `code` and `address` let through; all since the bus was started.
struct FaultDescription {
    FaultKind kind = FaultKind::FailRequest;
    std::uint32_t code = 0;   ///< Control code; 0 for any.
    bool hasAddress = false;  ///< Register reads and writes of `address` alone.
    std::uint32_t address = 0;
    std::uint64_t request = 0;  ///< 0 for any.
    std::uint64_t frame = 0;    ///< 0 for any.
    bool hasPacket = false;
    std::uint64_t packet = 0;
    std::uint64_t count = 1;  ///< How many in a row from the first on; 0 for all.
    double probability =
        -1;  ///< 0 to 1 for each request, packet or frame that fits; below 0: always.
    std::uint32_t error = 31;
    bool isPended = false;
    bool hasBytes = false;
    std::uint32_t bytes = 0;
    std::uint32_t offset = 0;
};

/// Tells for each event of a camera which faults meet it. Not thread-safe.
class FaultPlan {
  public:
    explicit FaultPlan(std::uint64_t seed) : random(seed) {}

    void Add(const FaultDescription& fault);

    /// Faults that meet this control request. Counts the request.
    std::vector<FaultDescription> MatchRequest(std::uint32_t code, bool hasAddress,
                                               std::uint32_t address);
    /// Faults that meet the start of frame number `frame`.
    std::vector<FaultDescription> MatchFrame(std::uint64_t frame);
    /// Faults that meet packet `packet` of a frame.
    std::vector<FaultDescription> MatchPacket(std::uint64_t frame, std::uint64_t packet);

    bool HasPacketFaults() const { return packetFaults != 0; }

  private:
    struct Entry {
        FaultDescription fault;
        std::uint64_t seen = 0;  // Requests that fit, or hits of a packet or frame fault.
    };

    bool Decide(const FaultDescription& fault);

    std::vector<Entry> entries;
    std::size_t packetFaults = 0;
    std::mt19937_64 random;
};

}  // namespace ZV::Simulation
