#pragma once

#include <windows.h>

#include <cstdint>

namespace ZV {

/// What one wait of the system can hold; the next value up would be a wait without limit.
inline constexpr std::uint64_t WaitSliceMsMax = INFINITE - 1;

/// Waits for one of `count` handles, the first that is signalled in their order, at most
/// `timeoutMs` milliseconds of the wait clock, in slices of at most `sliceMsMax` real ones. Returns
/// what WaitForMultipleObjects returns.
DWORD WaitForHandles(DWORD count, const HANDLE* handles, std::uint64_t timeoutMs,
                     std::uint64_t sliceMsMax = WaitSliceMsMax);

/// The event that says that the calling thread is to end, or null for a thread that StartThread did
/// not start.
HANDLE GetOwnEndEvent();

}  // namespace ZV
