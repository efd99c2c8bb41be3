#pragma once

#include <cstddef>

namespace ZV {

/// A block of memory that all processes of the machine, on Windows those of one session, see under
/// one name, zeroed when it is new.
struct SharedMemory;

/// Opens or makes the block, read-write. Null when the system refuses; on POSIX also for a block
/// that neither this user nor the administrator has made.
SharedMemory* OpenSharedMemory(const char* name, std::size_t bytes);

/// The block in this process, for the life of `memory`.
void* GetSharedMemoryAddress(SharedMemory* memory);

/// Unmaps the block; null is ignored.
void CloseSharedMemory(SharedMemory* memory);

}  // namespace ZV
