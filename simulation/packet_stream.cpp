#include "simulation/packet_stream.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "hal/stream_format.h"

namespace ZV::Simulation {
namespace {

constexpr std::uint32_t BlocksShiftMax = 3;
constexpr std::uint32_t QuadletBytes = 4;
/// The first block of a source packet holds the source packet header whole.
constexpr std::uint32_t BlockBytesMin = 16;
constexpr std::uint32_t IdlePlainBytes = PlainHeaderBytes + QuadletBytes + TailMarkBytes;
constexpr std::uint32_t CipFormatQuadlet = 0x80000000;  ///< End of header, format 0.

void WriteBig16(std::uint8_t* target, std::uint32_t value) {
    target[0] = static_cast<std::uint8_t>(value >> 8);
    target[1] = static_cast<std::uint8_t>(value);
}

void WriteBig32(std::uint8_t* target, std::uint32_t value) {
    WriteBig16(target, value >> 16);
    WriteBig16(target + 2, value);
}

/// The most blocks of a source packet that fit `room` bytes without being too small.
std::uint32_t ChooseBlocksShift(std::uint32_t room) {
    std::uint32_t shift = BlocksShiftMax;
    while (shift > 0 && (room >> shift) < BlockBytesMin) --shift;
    return shift;
}

std::uint32_t ChooseBlockBytes(std::uint32_t room, std::uint32_t blocksShift) {
    const std::uint32_t quadlets = (room >> blocksShift) / QuadletBytes;
    return std::min<std::uint32_t>(quadlets * QuadletBytes, CipBlockBytesForDbsZero);
}

}  // namespace

PacketStream::PacketStream(std::uint32_t streamingVersion, std::uint32_t reservedBytes)
    : version(streamingVersion), payloadBytes(reservedBytes) {
    if (payloadBytes < PayloadBytesMin) return;
    const auto room = static_cast<std::uint32_t>(payloadBytes - CipHeaderBytes);
    blocksShift = ChooseBlocksShift(room);
    blockBytes = ChooseBlockBytes(room, blocksShift);
}

void PacketStream::Begin(OutgoingFrame newFrame) {
    frame = std::move(newFrame);
    if (frame.rowBytes == 0) frame.isInterlaced = false;
    isActive = payloadBytes >= PayloadBytesMin;
    BeginField(0);
}

void PacketStream::BeginField(std::uint32_t index) {
    fieldIndex = index;
    position = 0;
    fieldBytes = frame.pixels.size();
    if (!frame.isInterlaced) return;
    const std::uint64_t rows = frame.pixels.size() / frame.rowBytes;
    fieldBytes = (rows + 1 - index) / 2 * frame.rowBytes;
}

std::uint32_t PacketStream::Next(std::uint8_t* payload) {
    if (!isActive) return 0;
    const std::uint32_t length = version == 0 ? NextCip(payload) : NextPlain(payload);
    if (position < fieldBytes) return length;
    if (frame.isInterlaced && fieldIndex == 0) {
        BeginField(1);
    } else {
        isActive = false;
    }
    return length;
}

std::uint32_t PacketStream::NextPlain(std::uint8_t* payload) {
    const bool isFirst = position == 0;
    const auto offset = static_cast<std::uint32_t>(position & FrameOffsetMask);
    std::memset(payload, 0, PlainHeaderBytes);
    payload[PlainFlagsOffset] = isFirst ? PlainFlagFirst : 0;
    payload[PlainMarkOffset] = PlainMark;
    payload[PlainFrameNumberOffset] = frame.frameNumber;
    payload[PlainOffsetHighOffset] = static_cast<std::uint8_t>(offset >> 16);
    WriteBig16(payload + PlainOffsetLowOffset, offset);

    auto length = static_cast<std::uint32_t>(PlainHeaderBytes);
    if (isFirst) {
        WriteFrameHeader(payload + length, 0);
        length += static_cast<std::uint32_t>(FrameHeaderBytes);
    }
    const auto room = static_cast<std::uint32_t>(payloadBytes - length - TailMarkBytes);
    length += TakeImageBytes(payload + length, room);
    std::memset(payload + length, TailMarkByte, TailMarkBytes);
    return static_cast<std::uint32_t>(length + TailMarkBytes);
}

std::uint32_t PacketStream::NextCip(std::uint8_t* payload) {
    const bool isFirst = position == 0;
    const std::uint32_t sourcePacketBytes = blockBytes << blocksShift;
    const auto room = static_cast<std::uint32_t>(sourcePacketBytes - SourcePacketHeaderBytes);
    WriteCipHeader(payload);
    blockCount = static_cast<std::uint8_t>(blockCount + (1U << blocksShift));

    std::uint8_t* sourcePacket = payload + CipHeaderBytes;
    std::memset(sourcePacket, 0, SourcePacketHeaderBytes);
    WriteBig16(sourcePacket, SourcePacketMark | (isFirst ? SourcePacketStartBit : 0U));
    if (isFirst) WriteFrameHeader(sourcePacket + 2, static_cast<std::uint16_t>(room));
    std::uint8_t* image = sourcePacket + SourcePacketHeaderBytes;
    const std::uint32_t taken = TakeImageBytes(image, room);
    std::memset(image + taken, 0, room - taken);
    return static_cast<std::uint32_t>(CipHeaderBytes + sourcePacketBytes);
}

std::uint32_t PacketStream::Idle(std::uint8_t* payload) const {
    if (payloadBytes < PayloadBytesMin) return 0;
    if (version == 0) {
        WriteCipHeader(payload);
        return static_cast<std::uint32_t>(CipHeaderBytes);
    }
    std::memset(payload, 0, IdlePlainBytes);
    payload[PlainFlagsOffset] = PlainFlagIgnore;
    payload[PlainMarkOffset] = PlainMark;
    payload[PlainFrameNumberOffset] = frame.frameNumber;
    std::memset(payload + IdlePlainBytes - TailMarkBytes, TailMarkByte, TailMarkBytes);
    return IdlePlainBytes;
}

void PacketStream::WriteCipHeader(std::uint8_t* payload) const {
    const bool isBlockSizeZero = blockBytes == CipBlockBytesForDbsZero;
    const std::uint32_t dataBlockSize = isBlockSizeZero ? 0 : blockBytes / QuadletBytes;
    WriteBig32(payload, dataBlockSize << CipDbsShift | blocksShift << CipFnShift | blockCount);
    WriteBig32(payload + QuadletBytes, CipFormatQuadlet);
}

void PacketStream::WriteFrameHeader(std::uint8_t* header, std::uint16_t blockPayload) const {
    WriteBig16(header + HeaderRollingNumberOffset, frame.rollingFrameNumber);
    header[HeaderPsnOffset] = frame.psn;
    header[HeaderPlaneOffset] = frame.plane & 0x0F;
    WriteBig32(header + HeaderTimestampOffset, frame.timestamp);
    header[HeaderSampleBitsOffset] = frame.sampleBits & 0x0F;
    // A camera without fields sends the value of a first field.
    header[HeaderFieldOffset] = fieldIndex == 0 ? FieldFirst : FieldLast;
    WriteBig16(header + HeaderBlockPayloadOffset, blockPayload);
}

std::uint32_t PacketStream::TakeImageBytes(std::uint8_t* target, std::uint32_t room) {
    const std::uint64_t count = std::min<std::uint64_t>(room, fieldBytes - position);
    std::uint64_t written = 0;
    while (written < count) {
        std::uint64_t source = position;
        std::uint64_t run = count - written;
        if (frame.isInterlaced) {
            const std::uint64_t row = position / frame.rowBytes;
            const std::uint64_t column = position % frame.rowBytes;
            source = (2 * row + fieldIndex) * frame.rowBytes + column;
            run = std::min(run, frame.rowBytes - column);
        }
        std::memcpy(target + written, frame.pixels.data() + source, run);
        written += run;
        position += run;
    }
    return static_cast<std::uint32_t>(count);
}

}  // namespace ZV::Simulation
