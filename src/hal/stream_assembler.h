#pragma once

#include <cstddef>
#include <cstdint>

#include "hal/hal.h"

namespace ZV {

struct tStFrameInfo;

/// Turns the payloads of isochronous packets into frames in buffers that the camera supplies.
///
/// One per device. Every member runs under the device's `streamMutex`, the callbacks too; it
/// allocates nothing and copies each byte once, from the packet to the frame.
///
/// A record that `peekNewFrame` answers is held (`tStFrameInfo::isHeld`) by the camera for the
/// assembler. The assembler clears the flag, with release order and as the last thing it does to
/// the record, when it lets go: just before `imageDone` or `overrun`, when it refuses the record,
/// or when the frame is abandoned. What no packet has written of a frame in hand is cleared first,
/// so that it never shows what its buffer held before; the buffer of a refused record is left
/// alone.
struct StreamAssembler {
    /// Asked when a frame start is accepted; answers with the held record, or null.
    HALFrameCallback getNewFrame = nullptr;
    /// Asked at a frame start; answers with the record next to be filled, or null.
    HALFrameCallback peekNewFrame = nullptr;
    /// A frame is finished or given up. Must not call back into the assembler.
    HALEventCallback imageDone = nullptr;
    /// A request was overwritten while it was being read; the frame in hand has been let go.
    HALEventCallback overrun = nullptr;
    void* context = nullptr;
    tStFrameInfo* current = nullptr;  ///< Borrowed from the camera, until it is let go.
    std::uint8_t* writePointer = nullptr;
    std::uint32_t capacity = 0;  ///< Bytes left behind `writePointer`.
    std::uint8_t plane = 0;
    std::uint8_t sampleBits = 0;      ///< Bits per sample less one.
    std::uint8_t reservedNibble = 0;  ///< Stored and never read.
    std::uint8_t field = 0;
    std::uint16_t rowPosition = 0;  ///< Bytes of the row in hand, two-field frames only.
    std::uint8_t streamingVersion = 0;
    std::uint32_t remaining = 0;    ///< Bytes still due for the plane or field in hand.
    std::uint8_t blockCounter = 0;  ///< The next expected data block count, version 0 only.
    std::uint16_t blockPayload = 0;
    std::uint16_t blockLeft = 0;
    std::uint8_t frameNumber = 0;      ///< Versions 1 and 2 only.
    std::uint32_t expectedOffset = 0;  ///< Versions 1 and 2 only.

    /// Bytes from the start of the buffer behind which nothing has been written, unless by rows.
    std::uint32_t writtenEnd = 0;
    /// Bytes that went to the even [0] and to the odd rows [1] of a two-field frame.
    std::uint32_t rowsWritten[2] = {};
    /// Bytes of the image that is written turned by half a turn, 0 while it is written as it comes.
    std::uint32_t turnedBytes = 0;

    void SetCallbacks(HALFrameCallback newGetNewFrame, HALFrameCallback newPeekNewFrame,
                      HALEventCallback newImageDone, HALEventCallback newOverrun, void* newContext);

    /// Stores `version` (0, 1 or 2; packets of any other are ignored) and clears `blockCounter`
    /// alone.
    void StartStream(std::uint8_t version);

    /// Parses one payload of `dataLength` bytes, which must all lie in the request buffer. Bytes of
    /// the headers are reversed in place. Any contents and any length are safe.
    void ParsePacket(std::uint8_t* payload, std::uint32_t dataLength);

    /// The stream stops: a frame in hand gets a `bufferSize` of 0 and is let go without
    /// `imageDone`.
    void AbandonFrame();
};

}  // namespace ZV
