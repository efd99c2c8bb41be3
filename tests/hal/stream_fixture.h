#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <vector>

#include "hal/frame_info.h"
#include "hal/stream_assembler.h"

/// A camera that hands records to an assembler, and the packets that fill them, written out byte by
/// byte so that library and tests cannot be wrong alike.
namespace ZV::Testing {

using Bytes = std::vector<std::uint8_t>;

inline constexpr std::uint8_t HeldBefore = 0xEE;  ///< What a fresh frame buffer holds.
inline constexpr std::uint8_t Guard = 0xC7;
inline constexpr std::size_t GuardBytes = 256;

/// A record whose buffer lies between guard bytes.
struct GuardedFrame {
    explicit GuardedFrame(std::uint32_t bufferSize)
        : memory(bufferSize + 2 * GuardBytes, Guard), bytes(bufferSize) {
        info.buffer = memory.data() + GuardBytes;
        info.bufferSize = bufferSize;
        info.bytesExpected = bufferSize;
        std::memset(info.buffer, HeldBefore, bufferSize);
    }

    [[nodiscard]] Bytes Pixels() const {
        return {memory.begin() + GuardBytes, memory.end() - GuardBytes};
    }

    [[nodiscard]] bool AreGuardsIntact() const {
        for (std::size_t index = 0; index < GuardBytes; ++index) {
            if (memory[index] != Guard || memory[GuardBytes + bytes + index] != Guard) return false;
        }
        return true;
    }

    Bytes memory;
    std::uint32_t bytes;
    tStFrameInfo info;
};

/// Frame header of a packet, as numbers.
struct Header {
    std::uint16_t rollingFrameNumber = 0;
    std::uint8_t psn = 0;
    std::uint8_t plane = 0;
    std::uint32_t timestamp = 0;
    std::uint8_t sampleBits = 7;
    std::uint8_t reservedNibble = 0;
    std::uint8_t field = 1;
    std::uint16_t blockPayload = 0;
};

inline void Append16(Bytes& bytes, std::uint32_t value) {
    bytes.push_back(static_cast<std::uint8_t>(value >> 8));
    bytes.push_back(static_cast<std::uint8_t>(value));
}

inline void AppendHeader(Bytes& bytes, const Header& header) {
    Append16(bytes, header.rollingFrameNumber);
    bytes.push_back(header.psn);
    bytes.push_back(header.plane);
    Append16(bytes, header.timestamp >> 16);
    Append16(bytes, header.timestamp);
    bytes.push_back(header.sampleBits);
    bytes.push_back(static_cast<std::uint8_t>(header.reservedNibble << 4 | header.field));
    Append16(bytes, header.blockPayload);
}

inline void AppendTail(Bytes& bytes) {
    bytes.insert(bytes.end(), 4, 0xAA);
}

inline Bytes PlainStart(std::uint8_t flags, std::uint8_t frameNumber, std::uint32_t offset) {
    return {flags,
            1,
            0,
            frameNumber,
            0,
            static_cast<std::uint8_t>(offset >> 16),
            static_cast<std::uint8_t>(offset >> 8),
            static_cast<std::uint8_t>(offset)};
}

inline Bytes PlainPacket(std::uint8_t frameNumber, std::uint32_t offset, const Bytes& data) {
    Bytes packet = PlainStart(0, frameNumber, offset);
    packet.insert(packet.end(), data.begin(), data.end());
    AppendTail(packet);
    return packet;
}

inline Bytes FirstPacket(std::uint8_t frameNumber, const Header& header, const Bytes& data) {
    Bytes packet = PlainStart(2, frameNumber, 0);
    AppendHeader(packet, header);
    packet.insert(packet.end(), data.begin(), data.end());
    AppendTail(packet);
    return packet;
}

/// Two header quadlets: block count, block size in quadlets, and the power of two of blocks per
/// source packet.
inline Bytes BlocksStart(std::uint8_t count, std::uint8_t quadlets, std::uint8_t blocksShift) {
    return {0x3F, quadlets, static_cast<std::uint8_t>(blocksShift << 6), count, 0x9F, 0, 0, 0};
}

/// 14 bytes at the front of a source packet.
inline Bytes SourceStart(bool isFrameStart, const Header& header) {
    Bytes bytes{static_cast<std::uint8_t>(isFrameStart ? 0x80 : 0), 1};
    AppendHeader(bytes, header);
    return bytes;
}

/// `count` bytes that go up from `first` and skip 0, so that a hole of zeros shows.
inline Bytes Ramp(std::size_t count, std::size_t first = 0) {
    Bytes bytes(count);
    for (std::size_t index = 0; index < count; ++index) {
        bytes[index] = static_cast<std::uint8_t>(1 + (first + index) % 251);
    }
    return bytes;
}

inline Bytes Slice(const Bytes& bytes, std::size_t begin, std::size_t count) {
    const auto first = bytes.begin() + static_cast<std::ptrdiff_t>(begin);
    return {first, first + static_cast<std::ptrdiff_t>(count)};
}

inline Bytes operator+(Bytes left, const Bytes& right) {
    left.insert(left.end(), right.begin(), right.end());
    return left;
}

/// The camera's side: a list of records of which one after another is given out, and a count of the
/// calls.
class StreamAssemblerTest : public testing::Test {
  protected:
    StreamAssemblerTest() {
        assembler.SetCallbacks(&GetNewFrame, &PeekNewFrame, &ImageDone, &Overrun, this);
        assembler.StartStream(1);
    }

    ~StreamAssemblerTest() override {
        for (const auto& frame : frames) EXPECT_TRUE(frame->AreGuardsIntact());
    }

    GuardedFrame& AddFrame(std::uint32_t bufferSize) {
        frames.push_back(std::make_unique<GuardedFrame>(bufferSize));
        return *frames.back();
    }

    /// A frame of two fields.
    GuardedFrame& AddTwoFieldFrame(std::uint16_t rowBytes, std::uint32_t rows) {
        GuardedFrame& frame = AddFrame(rowBytes * rows);
        frame.info.interlaced = true;
        frame.info.rowBytes = rowBytes;
        frame.info.bytesExpected = frame.info.bufferSize / 2;
        return frame;
    }

    /// Feeds a copy of the packet, in memory of exactly its length, and leaves the packet as it was
    /// parsed.
    Bytes Feed(const Bytes& packet) {
        const auto memory = std::make_unique<std::uint8_t[]>(packet.size());
        std::memcpy(memory.get(), packet.data(), packet.size());
        livePacket = memory.get();
        assembler.ParsePacket(memory.get(), static_cast<std::uint32_t>(packet.size()));
        livePacket = nullptr;
        return {memory.get(), memory.get() + packet.size()};
    }

    static std::uint32_t Status(const GuardedFrame& frame) { return frame.info.frameStatus.load(); }

    StreamAssembler assembler;
    std::vector<std::unique_ptr<GuardedFrame>> frames;
    std::size_t nextFrame = 0;
    bool refusesNewFrame = false;
    int peeks = 0;
    int takes = 0;
    int overruns = 0;
    std::vector<std::uint32_t> doneStatus;  ///< Of the frame in hand, at each `imageDone`.
    bool wasHeldWhenDone = false;
    std::uint8_t* livePacket = nullptr;
    int overwriteAtDone = -1;  ///< At `imageDone` this byte takes the place of the packet's first.

  private:
    static StreamAssemblerTest& From(void* context) {
        return *static_cast<StreamAssemblerTest*>(context);
    }

    tStFrameInfo* Front() { return nextFrame < frames.size() ? &frames[nextFrame]->info : nullptr; }

    static tStFrameInfo* PeekNewFrame(void* context) {
        StreamAssemblerTest& self = From(context);
        ++self.peeks;
        tStFrameInfo* front = self.Front();
        if (front != nullptr) front->isHeld = true;
        return front;
    }

    static tStFrameInfo* GetNewFrame(void* context) {
        StreamAssemblerTest& self = From(context);
        ++self.takes;
        return self.refusesNewFrame ? nullptr : self.Front();
    }

    static void ImageDone(void* context) {
        StreamAssemblerTest& self = From(context);
        const tStFrameInfo* front = self.Front();
        self.doneStatus.push_back(front != nullptr ? front->frameStatus.load() : 99);
        self.wasHeldWhenDone = front != nullptr && front->isHeld;
        ++self.nextFrame;
        if (self.overwriteAtDone >= 0 && self.livePacket != nullptr) {
            *self.livePacket = static_cast<std::uint8_t>(self.overwriteAtDone);
        }
    }

    static void Overrun(void* context) { ++From(context).overruns; }
};

}  // namespace ZV::Testing
