#pragma once

#include <cstdint>

#include "hal/stream_assembler.h"

namespace ZV {

/// Layouts of `tStFrameInfo::fieldIndex` that take their planes one after another. 1 is among them
/// for a frame start, though the copy step knows no such layout.
inline constexpr std::int32_t LayoutSamplesInSequence = 0;
inline constexpr std::int32_t LayoutPlanesFirst = 1;
inline constexpr std::int32_t LayoutPlanesInSequence = 6;
inline constexpr std::int32_t LayoutPlanesLast = 6;

/// Points the assembler at the start of the buffer of `current`, for a new frame.
void BeginFrameBuffer(StreamAssembler& assembler);

/// Points it there again, for the next field or plane of the same frame.
void RewindFrameBuffer(StreamAssembler& assembler);

/// The copy step: puts the next `count` bytes at `source`, or zeros for null, into the frame, at
/// most `remaining`. Returns `FrameComplete`, or, before anything is written, `FrameOverran` when
/// they do not fit and `FrameCutShort` for a layout or plane that is not supported.
[[nodiscard]] std::uint32_t CopyToFrame(StreamAssembler& assembler, const std::uint8_t* source,
                                        std::uint32_t count);

/// Clears what the packets have left unwritten. The frame in hand then holds its image as it came
/// (`isTurned` false) or turned by half a turn.
void FinishFrameBuffer(StreamAssembler& assembler, bool isTurned);

/// Reverses the order of the samples of one or two bytes. An odd last byte of two-byte samples
/// stays.
void TurnSamples(std::uint8_t* samples, std::uint32_t bytes, bool is16Bit);

}  // namespace ZV
