#pragma once

#include <cstddef>
#include <cstdint>

namespace ZV {

/// Error numbers of the system as the seam reports them, the same on every platform: those of the
/// Windows system error table.
inline constexpr std::uint32_t PlatformErrorNone = 0;
inline constexpr std::uint32_t PlatformErrorFileNotFound = 2;
inline constexpr std::uint32_t PlatformErrorAccessDenied = 5;
inline constexpr std::uint32_t PlatformErrorInvalidHandle = 6;
inline constexpr std::uint32_t PlatformErrorNotEnoughMemory = 8;
inline constexpr std::uint32_t PlatformErrorBadLength = 24;
inline constexpr std::uint32_t PlatformErrorGeneralFailure = 31;
inline constexpr std::uint32_t PlatformErrorInvalidParameter = 87;
inline constexpr std::uint32_t PlatformErrorInsufficientBuffer = 122;
inline constexpr std::uint32_t PlatformErrorBusy = 170;
inline constexpr std::uint32_t PlatformErrorNoMoreItems = 259;
inline constexpr std::uint32_t PlatformErrorNotOwner = 288;
inline constexpr std::uint32_t PlatformErrorOperationAborted = 995;
inline constexpr std::uint32_t PlatformErrorIoPending = 997;
inline constexpr std::uint32_t PlatformErrorDeviceNotConnected = 1167;
inline constexpr std::uint32_t PlatformErrorNoSystemResources = 1450;

/// Last error of the calling thread, set by every operation of the seam that fails.
std::uint32_t GetLastPlatformError();
void SetLastPlatformError(std::uint32_t error);

/// Writes the system's text for `error`, with whatever line end the system gives it, to `text`, cut
/// to `capacity` - 1 bytes and always terminated. False, and an empty text, if the system has none.
/// The last error stays as it was or becomes `error`, whatever the answer.
bool GetPlatformErrorText(std::uint32_t error, char* text, std::size_t capacity);

}  // namespace ZV
