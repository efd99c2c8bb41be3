#include "hal/stream_copy.h"

#include <algorithm>
#include <array>
#include <cassert>
#include <cstring>

#include "hal/frame_info.h"
#include "hal/stream_format.h"

// A frame of streaming version 2 is turned by half a turn while it is copied, so that each byte is
// written once: `turnedBytes` is the length of the image that is turned so. Positions count in the
// image as it comes; only PutBytes knows where a byte ends up. A frame that is given up is turned
// back.

namespace ZV {
namespace {

constexpr std::uint8_t SampleBitsMaxOfByte = 7;
constexpr std::uint8_t StreamingVersionTurned = 2;

struct ScatterLayout {
    std::int32_t fieldIndex;
    std::uint32_t stride;
    std::array<std::uint8_t, 4> placeOfPlane;
};

constexpr std::array ScatterLayouts{
    ScatterLayout{2, 4, {1, 2, 0, 3}},
    ScatterLayout{3, 3, {2, 1, 0, 0}},
    ScatterLayout{4, 4, {2, 1, 0, 0}},
    ScatterLayout{5, 3, {0, 1, 0, 2}},
};

bool Is16BitFrame(const StreamAssembler& assembler) {
    return assembler.sampleBits > SampleBitsMaxOfByte;
}

bool IsByRows(const tStFrameInfo& frame) {
    return frame.fieldIndex == LayoutSamplesInSequence && frame.interlaced;
}

std::uint32_t GetPosition(const StreamAssembler& assembler) {
    return static_cast<std::uint32_t>(assembler.writePointer - assembler.current->buffer);
}

void Advance(StreamAssembler& assembler, std::uint32_t bytes) {
    assembler.writePointer += bytes;
    assembler.capacity -= bytes;
}

constexpr std::uint32_t BlockBytes = 16;
using ReverseBlock = void (*)(std::uint8_t* to, const std::uint8_t* from);

void ReverseBlockOfBytes(std::uint8_t* to, const std::uint8_t* from) {
    std::uint64_t halves[2];
    std::memcpy(halves, from, BlockBytes);
    const std::uint64_t reversed[2] = {__builtin_bswap64(halves[1]), __builtin_bswap64(halves[0])};
    std::memcpy(to, reversed, BlockBytes);
}

// Compilers make a few vector shuffles of this.
void ReverseBlockOfWords(std::uint8_t* to, const std::uint8_t* from) {
    constexpr std::size_t Words = BlockBytes / sizeof(std::uint16_t);
    std::array<std::uint16_t, Words> words;
    std::array<std::uint16_t, Words> reversed;
    std::memcpy(words.data(), from, BlockBytes);
    for (std::size_t word = 0; word < Words; ++word) reversed[word] = words[Words - 1 - word];
    std::memcpy(to, reversed.data(), BlockBytes);
}

// Copies samples of `SampleBytes` in reversed order; `bytes` is a multiple of it.
template <std::uint32_t SampleBytes, ReverseBlock Reverse>
void CopyReversed(std::uint8_t* to, const std::uint8_t* from, std::uint32_t bytes) {
    const std::uint8_t* const end = from + bytes;
    to += bytes;
    for (; end - from >= std::ptrdiff_t{2 * BlockBytes}; from += 2 * BlockBytes) {
        to -= 2 * BlockBytes;
        Reverse(to + BlockBytes, from);
        Reverse(to, from + BlockBytes);
    }
    for (; from < end; from += SampleBytes) {
        to -= SampleBytes;
        std::memcpy(to, from, SampleBytes);
    }
}

// Swaps samples from both ends inwards.
template <std::uint32_t SampleBytes, ReverseBlock Reverse>
void ReverseInPlace(std::uint8_t* samples, std::uint32_t bytes) {
    std::uint8_t* front = samples;
    std::uint8_t* back = samples + bytes;
    for (; back - front >= std::ptrdiff_t{2 * BlockBytes}; front += BlockBytes) {
        back -= BlockBytes;
        std::uint8_t frontBlock[BlockBytes];
        std::memcpy(frontBlock, front, BlockBytes);
        Reverse(front, back);
        Reverse(back, frontBlock);
    }
    for (; back - front >= std::ptrdiff_t{2 * SampleBytes}; front += SampleBytes) {
        back -= SampleBytes;
        std::swap_ranges(front, front + SampleBytes, back);
    }
}

void PutPlain(std::uint8_t* to, const std::uint8_t* source, std::uint32_t count) {
    if (source != nullptr) {
        std::memcpy(to, source, count);
    } else {
        std::memset(to, 0, count);
    }
}

void PutTurned8(std::uint8_t* image, std::uint32_t imageBytes, std::uint32_t position,
                const std::uint8_t* source, std::uint32_t count) {
    std::uint8_t* to = image + (imageBytes - position - count);
    if (source == nullptr) return PutPlain(to, nullptr, count);
    CopyReversed<1, ReverseBlockOfBytes>(to, source, count);
}

// Where one byte of an image of 16-bit samples goes: the bytes of a sample keep their order.
std::uint32_t GetTurnedPlace16(std::uint32_t evenBytes, std::uint32_t position) {
    if (position >= evenBytes) return position;
    return evenBytes - (position % 2 != 0 ? position : position + 2);
}

void PutTurned16(std::uint8_t* image, std::uint32_t imageBytes, std::uint32_t position,
                 const std::uint8_t* source, std::uint32_t count) {
    const std::uint32_t evenBytes = imageBytes & ~1U;
    const auto putByte = [&](std::uint32_t offset) {
        const std::uint32_t place = GetTurnedPlace16(evenBytes, position + offset);
        image[place] = source != nullptr ? source[offset] : std::uint8_t{0};
    };
    const std::uint32_t head = std::min(position % 2, count);
    const std::uint32_t body = (count - head) & ~1U;
    if (head != 0) putByte(0);
    if (body != 0) {
        std::uint8_t* to = image + (evenBytes - position - head - body);
        if (source == nullptr) {
            PutPlain(to, nullptr, body);
        } else {
            CopyReversed<2, ReverseBlockOfWords>(to, source + head, body);
        }
    }
    if (head + body < count) putByte(count - 1);
}

void PutBytes(const StreamAssembler& assembler, std::uint32_t position, const std::uint8_t* source,
              std::uint32_t count) {
    std::uint8_t* image = assembler.current->buffer;
    const std::uint32_t turnedBytes = assembler.turnedBytes;
    if (turnedBytes == 0) return PutPlain(image + position, source, count);
    assert(std::uint64_t{position} + count <= turnedBytes);
    if (Is16BitFrame(assembler)) return PutTurned16(image, turnedBytes, position, source, count);
    PutTurned8(image, turnedBytes, position, source, count);
}

void ClearBytes(const StreamAssembler& assembler, std::uint64_t begin, std::uint64_t end) {
    const std::uint64_t turnedEnd =
        std::min<std::uint64_t>(end, std::max<std::uint64_t>(begin, assembler.turnedBytes));
    if (begin < turnedEnd) {
        PutBytes(assembler, static_cast<std::uint32_t>(begin), nullptr,
                 static_cast<std::uint32_t>(turnedEnd - begin));
    }
    if (turnedEnd < end) {
        std::memset(assembler.current->buffer + turnedEnd, 0, end - turnedEnd);
    }
}

std::uint32_t CopyInSequence(StreamAssembler& assembler, const std::uint8_t* source,
                             std::uint32_t count) {
    if (count > assembler.capacity) return FrameOverran;
    PutBytes(assembler, GetPosition(assembler), source, count);
    Advance(assembler, count);
    assembler.writtenEnd = GetPosition(assembler);
    return FrameComplete;
}

// Place in the frame of the byte with number `index` in its field: field 0 takes the odd rows.
std::uint64_t GetRowPlace(const StreamAssembler& assembler, std::uint64_t index) {
    const std::uint64_t rowBytes = assembler.current->rowBytes;
    const std::uint64_t row = 2 * (index / rowBytes) + (assembler.field == FieldLast ? 1 : 0);
    return row * rowBytes + index % rowBytes;
}

std::uint32_t CopyByRows(StreamAssembler& assembler, const std::uint8_t* source,
                         std::uint32_t count) {
    if (count == 0) return FrameComplete;
    const std::uint32_t rowBytes = assembler.current->rowBytes;
    if (rowBytes == 0) return FrameOverran;
    std::uint32_t& written = assembler.rowsWritten[assembler.field == FieldLast ? 1 : 0];
    // The row that is skipped behind a full one counts only when another byte follows.
    const std::uint64_t end = GetRowPlace(assembler, std::uint64_t{written} + count - 1) + 1;
    const std::uint64_t used = end - GetPosition(assembler);
    if (used > assembler.capacity) return FrameOverran;
    std::uint32_t left = count;
    while (left != 0) {
        const std::uint32_t piece = std::min(left, rowBytes - written % rowBytes);
        PutBytes(assembler, static_cast<std::uint32_t>(GetRowPlace(assembler, written)), source,
                 piece);
        if (source != nullptr) source += piece;
        written += piece;
        left -= piece;
    }
    assembler.rowPosition = static_cast<std::uint16_t>(written % rowBytes);
    Advance(assembler, static_cast<std::uint32_t>(used));
    return FrameComplete;
}

// Bytes between the planes' samples are cleared when the image first reaches them.
void ExtendWritten(StreamAssembler& assembler, std::uint64_t clearedTo, std::uint64_t end) {
    if (clearedTo > assembler.writtenEnd) ClearBytes(assembler, assembler.writtenEnd, clearedTo);
    assembler.writtenEnd =
        static_cast<std::uint32_t>(std::max<std::uint64_t>(assembler.writtenEnd, end));
}

std::uint32_t CopyToPlane(StreamAssembler& assembler, const std::uint8_t* source,
                          std::uint32_t count) {
    const std::uint64_t planesBefore = assembler.plane == 1 ? 1 : assembler.plane == 3 ? 2 : 0;
    const std::uint64_t offset = planesBefore * assembler.current->bytesExpected;
    if (offset + count > assembler.capacity) return FrameOverran;
    const std::uint64_t position = GetPosition(assembler) + offset;
    ExtendWritten(assembler, position, position + count);
    PutBytes(assembler, static_cast<std::uint32_t>(position), source, count);
    Advance(assembler, count);
    return FrameComplete;
}

std::uint32_t CopyScattered(StreamAssembler& assembler, const ScatterLayout& layout,
                            const std::uint8_t* source, std::uint32_t count) {
    if (assembler.plane >= layout.placeOfPlane.size()) return FrameCutShort;
    const std::uint64_t used = std::uint64_t{layout.stride} * count;
    if (used > assembler.capacity) return FrameOverran;
    const std::uint64_t position = GetPosition(assembler);
    ExtendWritten(assembler, position + used, position + used);
    const std::uint32_t sampleBytes = Is16BitFrame(assembler) ? 2 : 1;
    std::uint8_t* to = assembler.writePointer + layout.placeOfPlane[assembler.plane] * sampleBytes;
    for (std::uint32_t done = 0; done + sampleBytes <= count; done += sampleBytes) {
        PutPlain(to, source != nullptr ? source + done : nullptr, sampleBytes);
        to += layout.stride * sampleBytes;
    }
    Advance(assembler, static_cast<std::uint32_t>(used));
    return FrameComplete;
}

// Bytes that a half turn of the whole image moves; both fields of a frame that comes in two.
std::uint32_t GetImageBytes(const tStFrameInfo& frame) {
    const std::uint64_t bytes = std::uint64_t{frame.bytesExpected} * (IsByRows(frame) ? 2 : 1);
    return static_cast<std::uint32_t>(std::min<std::uint64_t>(bytes, frame.bufferSize));
}

// An image of another shape is turned when it is complete.
bool CanTurnWhileCopying(const tStFrameInfo& frame) {
    if (frame.fieldIndex != LayoutSamplesInSequence || frame.buffer == nullptr) return false;
    if (!frame.interlaced) return frame.bytesExpected <= frame.bufferSize;
    return frame.rowBytes != 0 && frame.bytesExpected % frame.rowBytes == 0 &&
           std::uint64_t{frame.bytesExpected} * 2 <= frame.bufferSize;
}

void ClearUnwrittenRows(const StreamAssembler& assembler) {
    const tStFrameInfo& frame = *assembler.current;
    const std::uint64_t rowBytes = frame.rowBytes;
    const std::uint64_t fullEvenRows = assembler.rowsWritten[0] / rowBytes;
    const std::uint64_t fullOddRows = assembler.rowsWritten[1] / rowBytes;
    std::uint64_t row = std::min(2 * fullEvenRows, 2 * fullOddRows + 1);
    for (; row * rowBytes < frame.bufferSize; ++row) {
        const std::uint64_t written = assembler.rowsWritten[row % 2];
        const std::uint64_t before = row / 2 * rowBytes;
        const std::uint64_t kept = std::min(written - std::min(written, before), rowBytes);
        const std::uint64_t end = std::min<std::uint64_t>((row + 1) * rowBytes, frame.bufferSize);
        ClearBytes(assembler, std::min(row * rowBytes + kept, end), end);
    }
}

void ClearUnwritten(const StreamAssembler& assembler) {
    const tStFrameInfo& frame = *assembler.current;
    if (IsByRows(frame) && frame.rowBytes != 0) return ClearUnwrittenRows(assembler);
    if (assembler.writtenEnd < frame.bufferSize) {
        ClearBytes(assembler, assembler.writtenEnd, frame.bufferSize);
    }
}

}  // namespace

void BeginFrameBuffer(StreamAssembler& assembler) {
    const tStFrameInfo& frame = *assembler.current;
    RewindFrameBuffer(assembler);
    assembler.writtenEnd = 0;
    assembler.rowsWritten[0] = 0;
    assembler.rowsWritten[1] = 0;
    const bool isTurned =
        assembler.streamingVersion == StreamingVersionTurned && CanTurnWhileCopying(frame);
    assembler.turnedBytes = isTurned ? GetImageBytes(frame) : 0;
}

void RewindFrameBuffer(StreamAssembler& assembler) {
    assembler.writePointer = assembler.current->buffer;
    assembler.capacity = assembler.current->bufferSize;
    assembler.rowPosition = 0;
}

std::uint32_t CopyToFrame(StreamAssembler& assembler, const std::uint8_t* source,
                          std::uint32_t count) {
    const tStFrameInfo& frame = *assembler.current;
    if (frame.buffer == nullptr || frame.bytesExpected == 0) return FrameComplete;
    if (frame.fieldIndex == LayoutSamplesInSequence) {
        return frame.interlaced ? CopyByRows(assembler, source, count)
                                : CopyInSequence(assembler, source, count);
    }
    if (frame.fieldIndex == LayoutPlanesInSequence) return CopyToPlane(assembler, source, count);
    for (const ScatterLayout& layout : ScatterLayouts) {
        if (layout.fieldIndex == frame.fieldIndex) {
            return CopyScattered(assembler, layout, source, count);
        }
    }
    return FrameCutShort;
}

void FinishFrameBuffer(StreamAssembler& assembler, bool isTurned) {
    const tStFrameInfo& frame = *assembler.current;
    if (frame.buffer == nullptr) return;
    ClearUnwritten(assembler);
    if (isTurned != (assembler.turnedBytes != 0)) {
        TurnSamples(frame.buffer, GetImageBytes(frame), Is16BitFrame(assembler));
    }
}

void TurnSamples(std::uint8_t* samples, std::uint32_t bytes, bool is16Bit) {
    if (is16Bit) return ReverseInPlace<2, ReverseBlockOfWords>(samples, bytes & ~1U);
    ReverseInPlace<1, ReverseBlockOfBytes>(samples, bytes);
}

}  // namespace ZV
