#pragma once

#include <cstdint>

namespace ZV {

/// Result of a camera operation. The flat interface maps it to its own codes.
using CameraResult = std::int16_t;

inline constexpr CameraResult CameraOk = 0;  ///< Also a setter that found its value in place.
inline constexpr CameraResult CameraRefused =
    1;  ///< In use, bad selector or checksum, no tweak registers.
inline constexpr CameraResult CameraGainSetupFailed = 2;
inline constexpr CameraResult CameraBadValue = 3;
inline constexpr CameraResult CameraBandwidthFault = 7;
inline constexpr CameraResult CameraBadBackEnd = 8;
inline constexpr CameraResult CameraHalFault = 9;
inline constexpr CameraResult CameraNotSupported = 15;  ///< Feature absent; success to clients.
inline constexpr CameraResult CameraNotStreaming = 17;
inline constexpr CameraResult CameraNoImage = 21;
inline constexpr CameraResult CameraNotSoftwareTriggered = 22;
inline constexpr CameraResult CameraGainModelDeferred = 23;
inline constexpr CameraResult CameraAlreadyInitialized = 24;
inline constexpr CameraResult CameraUnknownFault = 25;

/// Frame status codes, in the image callback's record and in ZExImage::GetErrorCode.
inline constexpr std::uint16_t FrameStatusGood = 0;
inline constexpr std::uint16_t FrameStatusMissingData = 18;
inline constexpr std::uint16_t FrameStatusOutOfSync = 19;
inline constexpr std::uint16_t FrameStatusBufferTooSmall = 20;
inline constexpr std::uint16_t FrameStatusIncomplete = 21;
inline constexpr std::uint16_t FrameStatusTimedOut = 26;

/// The one translation of a nonzero HAL status.
CameraResult TranslateHalStatus(std::uint32_t status);

/// Prints HAL_ErrorMessage of `status` on standard output as it is and translates the status.
CameraResult ReportHalStatus(std::uint32_t status);

}  // namespace ZV
