#pragma once

#include <windows.h>

#include <cstdint>

namespace ZV {

/// Waits for one of `count` handles, the first that is signalled in their order, at most
/// `timeoutMs` milliseconds of the wait clock, in slices of what one wait of the system can hold.
/// Returns what WaitForMultipleObjects returns.
DWORD WaitForHandles(DWORD count, const HANDLE* handles, std::uint64_t timeoutMs);

/// The event that says that the calling thread is to end, or null for a thread that StartThread did
/// not start.
HANDLE GetOwnEndEvent();

}  // namespace ZV
