#pragma once

#include <cstdint>
#include <vector>

namespace ZV::Simulation {

/// One frame on its way over the bus.
struct OutgoingFrame {
    std::vector<std::uint8_t> pixels;  ///< Row order, one part for one field.
    std::uint32_t rowBytes = 0;
    bool isInterlaced = false;         ///< Two fields: the first holds the odd rows, the second the even ones.
    std::uint32_t rollingFrameNumber = 0;
    std::uint8_t frameNumber = 0;      ///< Number in the packets of versions 1 and 2.
    std::uint8_t psn = 0;
    std::uint32_t timestamp = 0;
    std::uint8_t plane = 0;            ///< Colour pattern nibble.
    std::uint8_t sampleBits = 7;       ///< 7 or less for samples of a byte, above for two.
};

/// Cuts frames into isochronous payloads of at most `payloadBytes`, in the layout of a streaming version
/// (hal/stream_format.h). One object lives as long as a stream: version 0 counts its blocks across frames.
class PacketStream {
  public:
    /// `version` 0, 1 or 2. `payloadBytes` of the channel's reservation.
    PacketStream(std::uint32_t version, std::uint32_t payloadBytes);

    /// Begins a frame. Requires: the former one is finished.
    void Begin(OutgoingFrame frame);

    bool IsFinished() const;

    /// Writes the next payload of the frame to `payload` (room for `payloadBytes`) and returns its length.
    std::uint32_t Next(std::uint8_t* payload);

    /// Writes the payload of an idle cycle: the ignore bit set (versions 1 and 2), headers alone (version
    /// 0).
    std::uint32_t Idle(std::uint8_t* payload);

  private:
    std::uint32_t version;
    std::uint32_t payloadBytes;
    OutgoingFrame frame;
    std::uint32_t field = 0;
    std::uint64_t position = 0;
    std::uint8_t blockCount = 0;
    std::vector<std::uint8_t> fieldPixels;
    bool isActive = false;
};

}  // namespace ZV::Simulation
