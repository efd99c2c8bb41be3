#include <windows.h>

#include "support/sparse_memory.h"

namespace ZV::Test {
namespace {

std::uint8_t* Reserve(std::size_t bytes, DWORD kind, DWORD access) {
    return static_cast<std::uint8_t*>(VirtualAlloc(nullptr, bytes, kind, access));
}

void UnmapViews(std::uint8_t* begin, const std::uint8_t* end) {
    while (begin < end) {
        MEMORY_BASIC_INFORMATION view{};
        if (VirtualQuery(begin, &view, sizeof view) == 0 || view.RegionSize == 0) return;
        UnmapViewOfFile(begin);
        begin += view.RegionSize;
    }
}

}  // namespace

SparseMemory::SparseMemory(std::size_t bytes)
    : mappedBytes(bytes), memory(Reserve(bytes, MEM_RESERVE | MEM_COMMIT, PAGE_READWRITE)) {}

SparseMemory::~SparseMemory() {
    if (memory != nullptr) VirtualFree(memory, 0, MEM_RELEASE);
}

// A stretch that is free is found by reserving it; until the views lie there it may be lost to
// another thread, which the test takes for a refusal.
RepeatedMemory::RepeatedMemory(std::size_t blockBytes, std::size_t bytes)
    : mappedBytes((bytes + blockBytes - 1) / blockBytes * blockBytes) {
    std::uint8_t* const place = Reserve(mappedBytes, MEM_RESERVE, PAGE_NOACCESS);
    if (place == nullptr) return;
    VirtualFree(place, 0, MEM_RELEASE);
    if (MapBlocks(place, blockBytes)) memory = place;
}

RepeatedMemory::~RepeatedMemory() {
    if (memory != nullptr) UnmapViews(memory, memory + mappedBytes);
}

bool RepeatedMemory::MapBlocks(std::uint8_t* place, std::size_t blockBytes) const {
    const HANDLE block = CreateFileMappingA(INVALID_HANDLE_VALUE, nullptr, PAGE_READWRITE, 0,
                                            static_cast<DWORD>(blockBytes), nullptr);
    if (block == nullptr) return false;
    std::size_t offset = 0;
    while (offset < mappedBytes && MapViewOfFileEx(block, FILE_MAP_ALL_ACCESS, 0, 0, blockBytes,
                                                   place + offset) != nullptr) {
        offset += blockBytes;
    }
    CloseHandle(block);  // The views stay.
    if (offset < mappedBytes) UnmapViews(place, place + offset);
    return offset >= mappedBytes;
}

}  // namespace ZV::Test
