#pragma once

#include <cstdint>
#include <deque>
#include <memory>
#include <vector>

#include "simulation/driver_client.h"

namespace ZV::Test {

using Payload = std::vector<std::uint8_t>;

/// A frame put together from packets of versions 1 and 2.
struct ReceivedFrame {
    std::vector<std::uint8_t> pixels;
    std::uint32_t rollingFrameNumber = 0, psn = 0, plane = 0, field = 0, sampleBits = 0;
    std::uint32_t packets = 0;
};

/// Writes control registers and takes them over: a free-running image of `width` by `height` at 8
/// bits with an exposure of a millisecond and parameter set number 7.
void SetUpImage(DriverClient* client, std::uint32_t width, std::uint32_t height);

/// A ring of attached buffers that is read request by request.
class StreamReader {
  public:
    StreamReader(DriverClient* streamClient, std::uint32_t stride, std::size_t ring = 6,
                 std::uint32_t speed = SpeedFlagS800, std::uint32_t tag = 1);
    ~StreamReader();
    StreamReader(const StreamReader&) = delete;
    StreamReader& operator=(const StreamReader&) = delete;

    /// Reserves, attaches, listens and switches the camera on. 0 or a system error number.
    std::uint32_t Start();
    /// Switches the camera off, stops listening and detaches.
    void Stop();

    /// Payloads of the next request, in their slots; empty when none came within the deadline. The
    /// buffer is attached again.
    std::vector<Payload> ReadRequest();
    /// The next payload that is no idle one; empty when none came within the deadline.
    Payload ReadPacket();
    /// The next frame, until its last byte or the next frame's first packet. Requires version 1
    /// or 2.
    ReceivedFrame ReadFrame(std::uint64_t bytes);

    Stream stream;
    std::vector<std::unique_ptr<TestRequest>> requests;
    std::uint32_t lastError = 0;  ///< Of the last request that was read.

  private:
    bool Attach(std::size_t index);

    DriverClient* client;
    std::uint32_t wantedStride, speed, tag;
    std::size_t next = 0;
    std::deque<Payload> waiting;
    bool isOn = false;
};

}  // namespace ZV::Test
