#pragma once

#include <cstdint>
#include <vector>

namespace ZV::Simulation {

/// One frame on its way over the bus.
struct OutgoingFrame {
    /// Whole rows in their order from the top, whether sent in one part or in two fields.
    std::vector<std::uint8_t> pixels;
    std::uint32_t rowBytes = 0;
    /// Two fields: the first holds the rows 0, 2, 4, ... and has field value 1, the second the rows
    /// 1, 3, 5, ... and field value 0. Needs `rowBytes`; without it the frame goes in one part.
    bool isInterlaced = false;
    std::uint32_t rollingFrameNumber = 0;  ///< The low 16 bits are sent, the same in both fields.
    std::uint8_t frameNumber =
        0;  ///< In the packets of versions 1 and 2; differs from frame to frame.
    std::uint8_t psn = 0;
    std::uint32_t timestamp = 0;
    std::uint8_t plane = 0;       ///< Colour pattern nibble.
    std::uint8_t sampleBits = 7;  ///< 7 or less for samples of a byte, above for two; a nibble.
};

/// Cuts frames into isochronous payloads of at most the reserved bytes, in the layout of a
/// streaming version (hal/stream_format.h). One object lives as long as a stream: version 0 counts
/// its blocks across frames.
///
/// Each field begins with a first packet of its own, its offsets start at 0 again. A version 0
/// payload holds one whole source packet, so that a lost payload is one hole of whole source
/// packets.
class PacketStream {
  public:
    /// `streamingVersion` 0, 1 or 2; any other is sent in the layout of 1 and 2. `reservedBytes`
    /// of payload are what the channel's reservation holds; below PayloadBytesMin nothing can be
    /// sent and each frame is finished at once.
    PacketStream(std::uint32_t streamingVersion, std::uint32_t reservedBytes);

    /// Room for a frame header, its marks and four bytes of image.
    static constexpr std::uint32_t PayloadBytesMin = 28;

    /// Begins a frame. What is left of the former one is never sent: a frame start inside a frame.
    void Begin(OutgoingFrame frame);

    [[nodiscard]] bool IsFinished() const { return !isActive; }

    /// Writes the next payload of the frame to `payload` (room for the reserved bytes) and returns
    /// its length; 0 when the frame is finished.
    std::uint32_t Next(std::uint8_t* payload);

    /// Writes the payload of an idle cycle: the ignore bit set (versions 1 and 2), headers alone
    /// (version 0). Returns its length, at most 16. The state of the frame stays.
    std::uint32_t Idle(std::uint8_t* payload) const;

  private:
    void BeginField(std::uint32_t index);
    std::uint32_t NextPlain(std::uint8_t* payload);
    std::uint32_t NextCip(std::uint8_t* payload);
    void WriteCipHeader(std::uint8_t* payload) const;
    void WriteFrameHeader(std::uint8_t* header, std::uint16_t blockPayload) const;
    /// Copies the next bytes of the field, at most `room`, and returns how many.
    std::uint32_t TakeImageBytes(std::uint8_t* target, std::uint32_t room);

    std::uint32_t version;
    std::uint32_t payloadBytes;
    std::uint32_t blocksShift =
        0;  ///< Version 0: a source packet has 2 to the power of this in blocks.
    std::uint32_t blockBytes = 0;  ///< Version 0.
    std::uint8_t blockCount = 0;   ///< Version 0: count of the next payload's first block.
    OutgoingFrame frame;
    std::uint32_t fieldIndex = 0;  ///< 0 for the field sent first.
    std::uint64_t fieldBytes = 0;
    std::uint64_t position = 0;  ///< Bytes of the field that have been sent.
    bool isActive = false;
};

}  // namespace ZV::Simulation
