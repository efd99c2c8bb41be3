#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

#include "simulation/packet_stream.h"

namespace ZV::Fuzzing {

/// How a request is filled. Whatever fits the camera's settings makes frames that it delivers
/// whole; the rest makes any other.
enum DeliveryForm : std::uint8_t {
    HasGoodPackets = 1,  ///< The bytes are pixels of good packets; else they are all there is.
    StartsFrame = 2,
    HasBlocks = 4,  ///< Packets of streaming version 0; else of versions 1 and 2.
    HasTwoFields = 8,
    HasWideSamples = 16,  ///< Of two bytes.
    FirstPatternBit = 32  ///< This bit and those above: 0, or the colour pattern less 4.
};

/// What one camera sends, around pixels that are bytes over and over. A frame that does not fit a
/// request goes on in the next. One thread at a time.
class GoodPackets {
  public:
    explicit GoodPackets(std::size_t sendingCamera) : camera(sendingCamera) {}

    /// Whether the last frame has been sent to its end.
    [[nodiscard]] bool IsBetweenFrames() const { return !stream || stream->IsFinished(); }

    /// Fills the request that was attached first and ends it. False when none is attached.
    bool Deliver(std::uint8_t form, std::uint8_t frameNumber, std::span<const std::uint8_t> bytes);

  private:
    void Fill(std::span<std::uint8_t> buffer, std::uint8_t form, std::uint8_t frameNumber,
              std::span<const std::uint8_t> bytes);
    void PrepareStream(std::uint32_t newVersion, std::uint32_t newStride);

    const std::size_t camera;
    std::optional<Simulation::PacketStream> stream;
    std::uint32_t version = 0, stride = 0;
};

}  // namespace ZV::Fuzzing
