#pragma once

#include <cstddef>
#include <cstdint>

/// Layout of request buffers and isochronous packets. Library, simulation, tests and fuzz targets
/// all read it here. Multi-byte fields are big-endian on the bus unless told otherwise.
namespace ZV {

/// Ring of requests in the driver's hands.
inline constexpr std::size_t StreamRequestCount = 60;
inline constexpr std::size_t PacketsPerRequest = 30;
/// Buffers announced to the driver: one more than the ring holds.
inline constexpr std::uint32_t AnnouncedBufferCount = 61;

/// Packet slot of a request buffer: `packetStride` = payload + 12 bytes.
inline constexpr std::size_t PacketSlotExtraBytes = 12;
inline constexpr std::size_t PacketLengthOffset = 6;  ///< `dataLength`, 16 bits, little-endian.
inline constexpr std::size_t PacketPayloadOffset =
    8;  ///< `dataLength` bytes as they came over the bus.
/// A slot whose `dataLength` is less carries nothing for the assembler.
inline constexpr std::uint32_t PacketLengthMin = 13;

/// Largest stride for which resources at S400 are granted.
inline constexpr std::uint32_t PacketStrideMaxS400 = 4900;

/// Streaming versions 1 and 2: byte offsets in a payload, in bus order.
inline constexpr std::size_t PlainFlagsOffset = 0;
inline constexpr std::size_t PlainMarkOffset = 1;
inline constexpr std::size_t PlainFrameNumberOffset = 3;
inline constexpr std::size_t PlainOffsetHighOffset =
    5;  ///< Byte offset in the frame, bits 16 to 23.
inline constexpr std::size_t PlainOffsetLowOffset = 6;  ///< Bits 0 to 15, big-endian.
inline constexpr std::size_t PlainHeaderBytes = 8;
inline constexpr std::size_t FrameHeaderBytes = 12;
inline constexpr std::size_t TailMarkBytes = 4;

inline constexpr std::uint8_t PlainFlagIgnore = 0x01;
inline constexpr std::uint8_t PlainFlagFirst = 0x02;
inline constexpr std::uint8_t PlainMark = 1;
inline constexpr std::uint8_t TailMarkByte = 0xAA;  ///< Four of them end each packet.
inline constexpr std::uint32_t FrameOffsetMask = 0x00FFFFFF;

/// Frame header: six big-endian words W0 to W5, by byte offset.
inline constexpr std::size_t HeaderRollingNumberOffset = 0;  ///< W0.
inline constexpr std::size_t HeaderPsnOffset = 2;    ///< W1, high byte: parameter set number.
inline constexpr std::size_t HeaderPlaneOffset = 3;  ///< W1, low nibble: plane and colour pattern.
inline constexpr std::size_t HeaderTimestampOffset = 4;      ///< W2, W3.
inline constexpr std::size_t HeaderSampleBitsOffset = 8;     ///< W4, high byte, low nibble.
inline constexpr std::size_t HeaderFieldOffset = 9;          ///< W4, low byte, low nibble: field.
inline constexpr std::size_t HeaderBlockPayloadOffset = 10;  ///< W5, version 0 only.

/// Streaming version 0: two header quadlets of IEC 61883-1, then data blocks.
inline constexpr std::size_t CipHeaderBytes = 8;
inline constexpr std::uint32_t CipDbsShift =
    16;  ///< First quadlet, 8 bits: block size in quadlets.
inline constexpr std::uint32_t CipFnShift =
    14;  ///< First quadlet, 2 bits: blocks per source packet.
inline constexpr std::uint32_t CipDbcMask = 0xFF;  ///< First quadlet, low byte: data block count.
inline constexpr std::size_t CipBlockBytesForDbsZero = 1024;
inline constexpr std::size_t SourcePacketHeaderBytes = 14;
inline constexpr std::uint16_t SourcePacketStartBit = 0x8000;
inline constexpr std::uint8_t SourcePacketMark = 1;

/// Field numbers: the first field of a frame is any but 0, the last one is 0.
inline constexpr std::uint8_t FieldFirst = 1;
inline constexpr std::uint8_t FieldLast = 0;

}  // namespace ZV
