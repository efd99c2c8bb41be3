#pragma once

#include <atomic>
#include <cstdint>

namespace ZV {

/// `frameStatus` values that the stream layer writes.
inline constexpr std::uint32_t FrameComplete = 0;
inline constexpr std::uint32_t FrameMissingData = 1;  ///< Bytes were missing and became zeros.
inline constexpr std::uint32_t FrameCutShort =
    2;  ///< The next frame began first, or a layout is unknown.
inline constexpr std::uint32_t FrameOverran = 3;  ///< The frame overran its buffer.
inline constexpr std::uint32_t FrameIncomplete = 4;
inline constexpr std::uint32_t FrameRefused = 5;  ///< The frame start did not fit.

/// One frame in flight. The camera makes it, the stream layer fills it, the camera's run loop
/// serves it.
struct tStFrameInfo {
    std::uint8_t* buffer = nullptr;   ///< Pixels; from the C allocator, or the client's.
    std::uint32_t bufferSize = 0;     ///< Width times height times bytes per pixel.
    std::uint32_t bytesExpected = 0;  ///< `bufferSize`, or half of it for two fields.
    std::uint8_t psn = 0;             ///< Parameter set number when the frame was made.
    std::int32_t fieldIndex = 0;  ///< The stream layer reads it as the layout; the camera sets 0.
    bool interlaced = false;
    std::uint16_t rowBytes = 0;  ///< Cut to 16 bits.
    std::uint16_t rollingFrameNumber = 0;
    std::uint32_t timestamp = 0;
    std::uint32_t colourPattern = 0;
    std::atomic<std::uint32_t> frameStatus{FrameComplete};
    std::uint32_t binning = 0;
    std::uint32_t width = 0;
    std::uint32_t height = 0;
    std::uint32_t bitDepth = 0;
    std::uint64_t exposure = 0;  ///< Nanoseconds.
    double gain = 0;
    std::uint16_t startColour = 0;
    std::atomic<bool> valid{true};
    /// Set by the camera while it hands the record to the assembler, cleared by the assembler when
    /// it lets go of it (done, refused, overrun, stopped). A held record is never popped or freed.
    std::atomic<bool> isHeld{false};
};

}  // namespace ZV
