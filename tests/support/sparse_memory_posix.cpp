#include "support/sparse_memory.h"

#include <sys/mman.h>
#include <unistd.h>

namespace ZV::Test {
namespace {

std::uint8_t* MapSparsely(std::size_t bytes) {
    void* const mapped = mmap(nullptr, bytes, PROT_READ | PROT_WRITE,
                              MAP_PRIVATE | MAP_ANONYMOUS | MAP_NORESERVE, -1, 0);
    return mapped == MAP_FAILED ? nullptr : static_cast<std::uint8_t*>(mapped);
}

}  // namespace

SparseMemory::SparseMemory(std::size_t bytes) : mappedBytes(bytes), memory(MapSparsely(bytes)) {}

SparseMemory::~SparseMemory() {
    if (memory != nullptr) munmap(memory, mappedBytes);
}

RepeatedMemory::RepeatedMemory(std::size_t blockBytes, std::size_t bytes)
    : mappedBytes((bytes + blockBytes - 1) / blockBytes * blockBytes) {
    std::uint8_t* const place = MapSparsely(mappedBytes);
    if (place == nullptr) return;
    if (MapBlocks(place, blockBytes))
        memory = place;
    else
        munmap(place, mappedBytes);
}

RepeatedMemory::~RepeatedMemory() {
    if (memory != nullptr) munmap(memory, mappedBytes);
}

bool RepeatedMemory::MapBlocks(std::uint8_t* place, std::size_t blockBytes) const {
    const int block = memfd_create("block", 0);
    if (block < 0) return false;
    bool isMapped = ftruncate(block, static_cast<off_t>(blockBytes)) == 0;
    for (std::size_t offset = 0; isMapped && offset < mappedBytes; offset += blockBytes)
        isMapped = mmap(place + offset, blockBytes, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_FIXED,
                        block, 0) != MAP_FAILED;
    (void)close(block);  // The mappings stay.
    return isMapped;
}

}  // namespace ZV::Test
