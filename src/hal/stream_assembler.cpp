#include "hal/stream_assembler.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "hal/frame_info.h"
#include "hal/stream_copy.h"
#include "hal/stream_format.h"

namespace ZV {
namespace {

constexpr std::uint8_t StreamingVersionBlocks = 0;
constexpr std::uint8_t StreamingVersionPlain = 1;
constexpr std::uint8_t StreamingVersionPlainTurned = 2;
constexpr std::uint8_t LowNibble = 0x0F;

// Where a frame stands among the colour planes of a layout that has some.
constexpr std::uint8_t PlaneFirst = 0;
constexpr std::uint8_t PlaneSecond = 1;
constexpr std::uint8_t PlaneLast = 3;

// A camera that turns its image sends a mosaic whose phase changes with it.
constexpr std::uint32_t MosaicFirst = 5;
constexpr std::uint32_t MosaicLast = 8;

struct FrameHeader {
    std::uint16_t rollingFrameNumber;
    std::uint8_t psn;
    std::uint8_t plane;
    std::uint32_t timestamp;
    std::uint8_t sampleBits;
    std::uint8_t reservedNibble;
    std::uint8_t field;
    std::uint16_t blockPayload;
};

std::uint16_t ReadWord(const std::uint8_t* bytes) {
    return static_cast<std::uint16_t>(bytes[0] << 8 | bytes[1]);
}

void ReverseWords(std::uint8_t* bytes, std::size_t count) {
    for (std::size_t word = 0; word < count; ++word)
        std::swap(bytes[2 * word], bytes[2 * word + 1]);
}

// Reads the header in bus order and reverses its words in place.
FrameHeader TakeFrameHeader(std::uint8_t* bytes) {
    FrameHeader header{};
    header.rollingFrameNumber = ReadWord(bytes + HeaderRollingNumberOffset);
    header.psn = bytes[HeaderPsnOffset];
    header.plane = bytes[HeaderPlaneOffset] & LowNibble;
    header.timestamp = std::uint32_t{ReadWord(bytes + HeaderTimestampOffset)} << 16 |
                       ReadWord(bytes + HeaderTimestampOffset + 2);
    header.sampleBits = bytes[HeaderSampleBitsOffset] & LowNibble;
    header.reservedNibble = static_cast<std::uint8_t>(bytes[HeaderFieldOffset] >> 4);
    header.field = bytes[HeaderFieldOffset] & LowNibble;
    header.blockPayload = ReadWord(bytes + HeaderBlockPayloadOffset);
    ReverseWords(bytes, FrameHeaderBytes / 2);
    return header;
}

bool HasPlanes(const tStFrameInfo& frame) {
    return frame.fieldIndex >= LayoutPlanesFirst && frame.fieldIndex <= LayoutPlanesLast;
}

void SetFrameStatus(tStFrameInfo& frame, std::uint32_t status) {
    frame.frameStatus.store(status, std::memory_order_relaxed);
}

void LetGo(tStFrameInfo& frame) {
    frame.isHeld.store(false, std::memory_order_release);
}

void ReportImageDone(StreamAssembler& assembler) {
    LetGo(*std::exchange(assembler.current, nullptr));
    if (assembler.imageDone != nullptr) assembler.imageDone(assembler.context);
}

// Kept: a frame that is given up is not turned, and keeps the pattern that it came with.
void GiveUpFrame(StreamAssembler& assembler, std::uint32_t status) {
    SetFrameStatus(*assembler.current, status);
    FinishFrameBuffer(assembler, false);
    ReportImageDone(assembler);
}

void CompleteFrame(StreamAssembler& assembler) {
    tStFrameInfo& frame = *assembler.current;
    const bool isTurned = assembler.streamingVersion == StreamingVersionPlainTurned;
    FinishFrameBuffer(assembler, isTurned);
    if (isTurned && frame.colourPattern >= MosaicFirst && frame.colourPattern <= MosaicLast) {
        frame.colourPattern = MosaicFirst + MosaicLast - frame.colourPattern;
    }
    ReportImageDone(assembler);
}

void CheckCompletion(StreamAssembler& assembler) {
    if (assembler.current == nullptr || assembler.remaining != 0) return;
    const tStFrameInfo& frame = *assembler.current;
    // Kept: a first field of any number but 1 completes its frame alone.
    if (frame.interlaced && assembler.field == FieldFirst) return;
    if (HasPlanes(frame) && assembler.plane != PlaneLast) return;
    CompleteFrame(assembler);
}

// `count` is at most `remaining`; null stands for zeros.
void PutData(StreamAssembler& assembler, const std::uint8_t* source, std::uint32_t count) {
    const std::uint32_t status = CopyToFrame(assembler, source, count);
    if (status != FrameComplete) GiveUpFrame(assembler, status);
    assembler.remaining -= count;
    CheckCompletion(assembler);
}

// Returns the bytes filled. Kept: the frame counts as damaged even when nothing was missing.
std::uint32_t FillZeros(StreamAssembler& assembler, std::uint32_t amount) {
    SetFrameStatus(*assembler.current, FrameMissingData);
    const std::uint32_t count = std::min(amount, assembler.remaining);
    if (count != 0) {
        PutData(assembler, nullptr, count);
    } else {
        CheckCompletion(assembler);
    }
    return count;
}

// Returns how many of the bytes the frame in hand is still due, whether or not there is one.
std::uint32_t TakeData(StreamAssembler& assembler, const std::uint8_t* source,
                       std::uint32_t available) {
    const std::uint32_t count = std::min(available, assembler.remaining);
    if (assembler.current != nullptr && assembler.remaining != 0) {
        PutData(assembler, source, count);
    }
    return count;
}

bool IsNextPlane(const StreamAssembler& assembler, const FrameHeader& header) {
    if (!HasPlanes(*assembler.current)) return false;
    return (assembler.plane == PlaneFirst && header.plane == PlaneSecond) ||
           (assembler.plane == PlaneSecond && header.plane == PlaneLast);
}

bool IsNextField(const StreamAssembler& assembler, const FrameHeader& header) {
    return assembler.current->interlaced && assembler.field == FieldFirst &&
           header.field == FieldLast;
}

// Kept: the parameter set number is not looked at again, and number, time and pattern stay those of
// the first part.
bool ContinueFrame(StreamAssembler& assembler, const FrameHeader& header) {
    const bool isNextPlane = IsNextPlane(assembler, header);
    const bool isNextField = IsNextField(assembler, header);
    if (!isNextPlane && !isNextField) return false;
    if (assembler.remaining != 0) SetFrameStatus(*assembler.current, FrameMissingData);
    RewindFrameBuffer(assembler);
    if (isNextPlane) assembler.plane = header.plane;
    if (isNextField) assembler.field = header.field;
    assembler.remaining = assembler.current->bytesExpected;
    return true;
}

bool IsFrameBeginning(const tStFrameInfo& frame, const FrameHeader& header) {
    if (header.field == FieldLast) return false;
    return !HasPlanes(frame) || (header.plane != PlaneSecond && header.plane != PlaneLast);
}

// Its buffer is left as it is: few cameras deliver such a record, and those clear it before.
void RefuseRecord(tStFrameInfo& record) {
    SetFrameStatus(record, FrameRefused);
    LetGo(record);
}

void AcceptFrame(StreamAssembler& assembler, const FrameHeader& header) {
    tStFrameInfo& frame = *assembler.current;
    SetFrameStatus(frame, FrameComplete);
    assembler.sampleBits = header.sampleBits;
    assembler.plane = header.plane;
    assembler.field = header.field;
    assembler.reservedNibble = header.reservedNibble;
    frame.timestamp = header.timestamp;
    frame.rollingFrameNumber = header.rollingFrameNumber;
    frame.colourPattern = header.plane;
    assembler.remaining = frame.bytesExpected;
    BeginFrameBuffer(assembler);
}

void TakeRecord(StreamAssembler& assembler, tStFrameInfo& record, const FrameHeader& header) {
    if (assembler.getNewFrame != nullptr) {
        assembler.current = assembler.getNewFrame(assembler.context);
    }
    if (assembler.current != &record) LetGo(record);
    if (assembler.current != nullptr) AcceptFrame(assembler, header);
}

void StartFrame(StreamAssembler& assembler, const FrameHeader& header) {
    if (assembler.current != nullptr) {
        if (ContinueFrame(assembler, header)) return;
        GiveUpFrame(assembler, FrameCutShort);
    }
    if (assembler.peekNewFrame == nullptr) return;
    tStFrameInfo* record = assembler.peekNewFrame(assembler.context);
    if (record == nullptr) return;
    if (!IsFrameBeginning(*record, header)) return RefuseRecord(*record);
    if (header.psn != record->psn) {
        assembler.writePointer = nullptr;
        return RefuseRecord(*record);
    }
    TakeRecord(assembler, *record, header);
}

// Offsets on the bus have 24 bits, frames may be longer: the difference is what counts. One that
// points backwards is a very large gap and ends the frame.
void FillGapBefore(StreamAssembler& assembler, std::uint32_t offset, std::uint8_t frameNumber) {
    if (assembler.current == nullptr || assembler.remaining == 0) return;
    const bool isSameFrame = frameNumber == assembler.frameNumber;
    const std::uint32_t gap = (offset - assembler.expectedOffset) & FrameOffsetMask;
    if (isSameFrame && gap == 0) return;
    assembler.expectedOffset += FillZeros(assembler, isSameFrame ? gap : assembler.remaining);
}

bool HasTailMark(const std::uint8_t* tail) {
    constexpr std::uint8_t Mark[TailMarkBytes] = {TailMarkByte, TailMarkByte, TailMarkByte,
                                                  TailMarkByte};
    return std::memcmp(tail, Mark, TailMarkBytes) == 0;
}

void ParsePlain(StreamAssembler& assembler, std::uint8_t* payload, std::uint32_t dataLength) {
    if (dataLength < PlainHeaderBytes) return;
    const std::uint8_t flags = payload[PlainFlagsOffset];
    const std::uint8_t mark = payload[PlainMarkOffset];
    const std::uint8_t frameNumber = payload[PlainFrameNumberOffset];
    const std::uint32_t offset = std::uint32_t{payload[PlainOffsetHighOffset]} << 16 |
                                 ReadWord(payload + PlainOffsetLowOffset);
    ReverseWords(payload, PlainHeaderBytes / 2);
    if (mark != PlainMark || (flags & PlainFlagIgnore) != 0) return;

    // Kept: the gap is filled from the header of a packet that may still be dropped for its tail.
    FillGapBefore(assembler, offset, frameNumber);
    const bool isFirst = (flags & PlainFlagFirst) != 0;
    const std::size_t dataStart = PlainHeaderBytes + (isFirst ? FrameHeaderBytes : 0);
    if (dataLength < dataStart + TailMarkBytes) return;
    std::uint8_t* tail = payload + dataLength - TailMarkBytes;
    if (!HasTailMark(tail)) return;
    if (isFirst) {
        std::memset(tail, 0, TailMarkBytes);
        StartFrame(assembler, TakeFrameHeader(payload + PlainHeaderBytes));
        assembler.expectedOffset = 0;
        assembler.frameNumber = frameNumber;
    }
    const auto dataBytes = static_cast<std::uint32_t>(dataLength - dataStart - TailMarkBytes);
    assembler.expectedOffset += TakeData(assembler, payload + dataStart, dataBytes);
}

// Reads the header of a source packet, of which `block` is the first block. False when the block is
// ignored.
bool TakeSourcePacketHeader(StreamAssembler& assembler, std::uint8_t* block,
                            std::uint32_t blockBytes) {
    if (blockBytes < SourcePacketHeaderBytes) return false;
    const std::uint16_t word = ReadWord(block);
    ReverseWords(block, 1);
    // Kept: the counter has moved on and `blockLeft` stays, so blocks behind this one may still be
    // taken.
    if ((word & 0xFF) != SourcePacketMark) return false;
    if ((word & SourcePacketStartBit) != 0) {
        const FrameHeader header = TakeFrameHeader(block + 2);
        StartFrame(assembler, header);
        assembler.blockPayload = header.blockPayload;
    }
    assembler.blockLeft = assembler.blockPayload;
    return true;
}

void FillMissingBlocks(StreamAssembler& assembler, std::uint8_t count, std::uint32_t blocksShift) {
    const auto missing = static_cast<std::uint8_t>(count - assembler.blockCounter);
    const std::uint32_t sourcePackets = std::uint32_t{missing} >> blocksShift;
    const std::uint32_t amount = sourcePackets * assembler.blockPayload + assembler.blockLeft;
    (void)FillZeros(assembler, amount);
    assembler.blockLeft = 0;
}

void ParseBlock(StreamAssembler& assembler, std::uint8_t* block, std::uint32_t blockBytes,
                std::uint8_t count, std::uint32_t blocksShift) {
    const bool isStart = (count & ((1U << blocksShift) - 1)) == 0;
    const bool isExpected = count == assembler.blockCounter;
    if (!isExpected && !isStart) return;
    if (!isExpected && assembler.current != nullptr) {
        FillMissingBlocks(assembler, count, blocksShift);
    }
    assembler.blockCounter = static_cast<std::uint8_t>(count + 1);
    if (isStart) {
        if (!TakeSourcePacketHeader(assembler, block, blockBytes)) return;
        block += SourcePacketHeaderBytes;
        blockBytes -= static_cast<std::uint32_t>(SourcePacketHeaderBytes);
    }
    const std::uint32_t available = std::min<std::uint32_t>(blockBytes, assembler.blockLeft);
    const std::uint32_t taken = TakeData(assembler, block, available);
    assembler.blockLeft = static_cast<std::uint16_t>(assembler.blockLeft - taken);
}

// A frame that was being filled from overwritten packets is never taken for a complete one.
void ReportOverrun(StreamAssembler& assembler) {
    if (assembler.current != nullptr) {
        SetFrameStatus(*assembler.current, FrameMissingData);
        FinishFrameBuffer(assembler, false);
        LetGo(*std::exchange(assembler.current, nullptr));
    }
    if (assembler.overrun != nullptr) assembler.overrun(assembler.context);
}

// The driver may overwrite the packet under our hands.
std::uint8_t ReadAgain(const std::uint8_t* byte) {
    return *static_cast<const volatile std::uint8_t*>(byte);
}

void ReverseQuadlet(std::uint8_t* bytes) {
    std::reverse(bytes, bytes + 4);
}

void ParseBlocks(StreamAssembler& assembler, std::uint8_t* payload, std::uint32_t dataLength) {
    // Bytes of the first quadlet after the reversal.
    constexpr std::size_t CountOffset = 0;
    constexpr std::size_t BlocksShiftOffset = 1;
    constexpr std::size_t BlockQuadletsOffset = 2;

    if (dataLength < CipHeaderBytes) return;
    ReverseQuadlet(payload);
    ReverseQuadlet(payload + 4);
    const std::uint8_t firstCount = payload[CountOffset];
    if (dataLength == CipHeaderBytes) return;
    const std::uint32_t quadlets = payload[BlockQuadletsOffset];
    const auto blockBytes =
        static_cast<std::uint32_t>(quadlets != 0 ? quadlets * 4 : CipBlockBytesForDbsZero);
    const auto blocks = static_cast<std::uint32_t>((dataLength - CipHeaderBytes) / blockBytes);
    std::uint8_t* block = payload + CipHeaderBytes;
    for (std::uint32_t index = 0; index < blocks; ++index, block += blockBytes) {
        const auto blocksShift =
            static_cast<std::uint32_t>(ReadAgain(payload + BlocksShiftOffset)) >> 6;
        ParseBlock(assembler, block, blockBytes, static_cast<std::uint8_t>(firstCount + index),
                   blocksShift);
    }
    if (ReadAgain(payload + CountOffset) != firstCount) ReportOverrun(assembler);
}

}  // namespace

void StreamAssembler::SetCallbacks(HALFrameCallback newGetNewFrame,
                                   HALFrameCallback newPeekNewFrame, HALEventCallback newImageDone,
                                   HALEventCallback newOverrun, void* newContext) {
    getNewFrame = newGetNewFrame;
    peekNewFrame = newPeekNewFrame;
    imageDone = newImageDone;
    overrun = newOverrun;
    context = newContext;
}

void StreamAssembler::StartStream(std::uint8_t version) {
    streamingVersion = version;
    blockCounter = 0;
}

void StreamAssembler::ParsePacket(std::uint8_t* payload, std::uint32_t dataLength) {
    switch (streamingVersion) {
        case StreamingVersionBlocks:
            return ParseBlocks(*this, payload, dataLength);
        case StreamingVersionPlain:
        case StreamingVersionPlainTurned:
            return ParsePlain(*this, payload, dataLength);
        default:
            return;
    }
}

void StreamAssembler::AbandonFrame() {
    if (current == nullptr) return;
    current->bufferSize = 0;  // Nobody takes such a frame for an image, whatever its buffer holds.
    LetGo(*std::exchange(current, nullptr));
}

}  // namespace ZV
