#include "hal/platform/shared_memory.h"

#include <windows.h>

#include <cstdint>
#include <new>

namespace ZV {

struct SharedMemory {
    HANDLE mapping;
    void* address;
};

namespace {

HANDLE OpenMapping(const char* name, std::size_t bytes) {
    const std::uint64_t size = bytes;
    return CreateFileMappingA(INVALID_HANDLE_VALUE, nullptr, PAGE_READWRITE,
                              static_cast<DWORD>(size >> 32), static_cast<DWORD>(size), name);
}

}  // namespace

SharedMemory* OpenSharedMemory(const char* name, std::size_t bytes) {
    auto* memory = new (std::nothrow) SharedMemory{};
    if (memory == nullptr) {
        SetLastError(ERROR_NOT_ENOUGH_MEMORY);
        return nullptr;
    }
    memory->mapping = OpenMapping(name, bytes);
    if (memory->mapping != nullptr) {
        memory->address = MapViewOfFile(memory->mapping, FILE_MAP_ALL_ACCESS, 0, 0, bytes);
    }
    if (memory->address != nullptr) return memory;
    const DWORD error = GetLastError();
    if (memory->mapping != nullptr) CloseHandle(memory->mapping);
    delete memory;
    SetLastError(error);
    return nullptr;
}

void* GetSharedMemoryAddress(SharedMemory* memory) {
    return memory->address;
}

void CloseSharedMemory(SharedMemory* memory) {
    if (memory == nullptr) return;
    UnmapViewOfFile(memory->address);
    CloseHandle(memory->mapping);
    delete memory;
}

}  // namespace ZV
