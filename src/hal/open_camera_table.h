#pragma once

#include <cstddef>
#include <cstdint>

#include "hal/platform/shared_memory.h"

/// The system-wide table of the cameras open at the moment: a named shared memory block of 63
/// entries. All processes that see the name read and write it without a lock; an entry changes as a
/// whole.
namespace ZV {

// Kept: the name has no prefix that makes it global, so that on Windows each session has a table.
inline constexpr char OpenCameraTableName[] = "404B602C-4181-4d11-A184-AB30190B8DCD";
inline constexpr std::size_t OpenCameraTableEntries = 63;
inline constexpr std::size_t OpenCameraTableBytes = 504;

/// An entry as it lies in the block: the adapter's index plus 1, then the node number.
struct OpenCameraEntry {
    std::uint32_t adapterPlusOne;  ///< 0 marks a free entry.
    std::uint32_t node;            ///< The low 6 bits of the node id.
};
static_assert(sizeof(OpenCameraEntry) * OpenCameraTableEntries == OpenCameraTableBytes);

/// Entry of the camera `nodeId` on adapter `adapterIndex`.
OpenCameraEntry MakeOpenCameraEntry(std::uint32_t adapterIndex, std::uint32_t nodeId);

/// The table mapped into this process. Opens at construction; a table that cannot be reached is
/// empty and takes nothing in.
class OpenCameraTable {
  public:
    OpenCameraTable();
    ~OpenCameraTable();
    OpenCameraTable(const OpenCameraTable&) = delete;
    OpenCameraTable& operator=(const OpenCameraTable&) = delete;

    bool IsReachable() const { return memory != nullptr; }
    std::size_t CountUsed() const;
    bool Contains(const OpenCameraEntry& entry) const;
    /// Takes the first free entry. False when none is free: the camera is then not recorded.
    bool Add(const OpenCameraEntry& entry);
    void Remove(const OpenCameraEntry& entry);

  private:
    SharedMemory* const memory;
};

}  // namespace ZV
