#pragma once

#include <cstdint>
#include <deque>

namespace ZV::Soak {

/// What has gone wrong with a camera's packets by the time at which it had used up so many numbers.
struct PacketTroubles {
    std::uint64_t used = 0;
    std::uint32_t buffersFailed = 0, packetsCorrupted = 0;
};

/// Tells whether packets that went wrong explain a frame under a wrong number. A buffer that fails
/// is parsed all the same, with what it still holds of its former turn of the ring; one that fails
/// as soon as it is attached, a turn after that.
///
/// - A buffer that is filled a second time and fails meanwhile holds packets that nobody has parsed
///   behind newer ones: a former frame begins behind the next, and lacks its rest.
/// - In streaming version 0 a packet that is parsed a second time, or is corrupted, is taken for a
///   header wherever the marks of one seem to be. The frame may have any number; no real packet
///   goes on with it, so that it is damaged.
/// - In version 0 a packet of a buffer that fails in two turns is good again the third time, but
///   for a header: the bytes of its number are exchanged. Such a frame may be whole. The other
///   versions take the tail mark off a first packet: it passes once.
///
/// What takes three failures or more at once is not excused: at the rates of a soak it does not
/// come.
class StaleNumbers {
  public:
    /// `hasBlocks` as streaming version 0. At most `framesPerTurn` numbers are used up while the
    /// ring of requests goes round once.
    StaleNumbers(bool hasBlocks, std::uint64_t framesPerTurn);

    /// Nothing that has gone wrong by `now` explains a frame to come.
    void Begin(const PacketTroubles& now);
    /// With each frame that comes. `last` is the number of the one before, counted without end.
    void Add(const PacketTroubles& now, std::uint64_t last);
    /// Of a frame that came behind `last`, by what was added up to now.
    [[nodiscard]] bool MayBe(std::uint16_t number, bool isDamaged, std::uint64_t last) const;

  private:
    [[nodiscard]] bool MayBeOfBlocks(std::uint16_t number, bool isDamaged,
                                     std::uint64_t last) const;
    [[nodiscard]] std::uint64_t GoBack(std::uint64_t last, std::uint64_t turns) const;
    [[nodiscard]] PacketTroubles CountSince(std::uint64_t number) const;
    [[nodiscard]] bool WasUsedSince(std::uint64_t former, std::uint16_t number) const;

    const bool hasBlocks;
    const std::uint64_t framesPerTurn;
    std::deque<PacketTroubles> looks{PacketTroubles{}};
};

}  // namespace ZV::Soak
