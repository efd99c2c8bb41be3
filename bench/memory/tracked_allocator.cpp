#include "memory/tracked_allocator.h"

#include <cstddef>
#include <mutex>
#include <new>

// The linker's --wrap option sends the program's references to an allocator here, those of the
// library among them, and gives the allocator itself the name that begins with __real.

extern "C" {
void* __real_malloc(std::size_t bytes);
void* __real_calloc(std::size_t count, std::size_t bytes);
void* __real_realloc(void* memory, std::size_t bytes);
void __real_free(void* memory);
}

namespace ZV::Bench {
namespace {

/// Blocks by address, in slots of their own: a block that another module took and this one frees
/// must not be subtracted.
class BlockTable {
  public:
    void Add(void* memory, std::size_t bytes) {
        if (memory == nullptr) return;
        const std::lock_guard hold(leafMutex);
        ++count;
        for (std::size_t probe = 0; probe < Slots; ++probe) {
            Slot& slot = slots[(Hash(memory) + probe) % Slots];
            if (slot.memory != nullptr && slot.memory != Removed()) continue;
            slot = {memory, bytes};
            held += bytes;
            return;
        }
    }
    void Remove(void* memory) {
        if (memory == nullptr) return;
        const std::lock_guard hold(leafMutex);
        for (std::size_t probe = 0; probe < Slots; ++probe) {
            Slot& slot = slots[(Hash(memory) + probe) % Slots];
            if (slot.memory == nullptr) return;
            if (slot.memory != memory) continue;
            held -= slot.bytes;
            slot = {Removed(), 0};
            return;
        }
    }
    Allocations Get() {
        const std::lock_guard hold(leafMutex);
        return {held, count};
    }

  private:
    static constexpr std::size_t Slots = std::size_t{1} << 17;
    struct Slot {
        void* memory;
        std::size_t bytes;
    };
    static std::size_t Hash(const void* memory) {
        return (reinterpret_cast<std::uintptr_t>(memory) >> 4) * 0x9E3779B97F4A7C15ULL >> 40;
    }
    void* Removed() { return this; }

    std::mutex leafMutex;
    std::uint64_t held = 0;
    std::uint64_t count = 0;
    Slot slots[Slots] = {};
};

BlockTable& GetTable() {
    static BlockTable table;
    return table;
}

void* Track(void* memory, std::size_t bytes) {
    GetTable().Add(memory, bytes);
    return memory;
}

void* Allocate(std::size_t bytes) {
    return Track(__real_malloc(bytes != 0 ? bytes : 1), bytes);
}

void* AllocateOrThrow(std::size_t bytes) {
    void* const memory = Allocate(bytes);
    if (memory == nullptr) throw std::bad_alloc();
    return memory;
}

void Free(void* memory) {
    GetTable().Remove(memory);
    __real_free(memory);
}

}  // namespace

Allocations GetAllocations() {
    return GetTable().Get();
}

}  // namespace ZV::Bench

extern "C" {

void* __wrap_malloc(std::size_t bytes) {
    return ZV::Bench::Track(__real_malloc(bytes), bytes);
}

void* __wrap_calloc(std::size_t count, std::size_t bytes) {
    return ZV::Bench::Track(__real_calloc(count, bytes), count * bytes);
}

void* __wrap_realloc(void* memory, std::size_t bytes) {
    ZV::Bench::GetTable().Remove(memory);
    return ZV::Bench::Track(__real_realloc(memory, bytes), bytes);
}

void __wrap_free(void* memory) {
    ZV::Bench::Free(memory);
}

void* __wrap__Znwm(std::size_t bytes) {
    return ZV::Bench::AllocateOrThrow(bytes);
}
void* __wrap__Znam(std::size_t bytes) {
    return ZV::Bench::AllocateOrThrow(bytes);
}
void* __wrap__ZnwmRKSt9nothrow_t(std::size_t bytes, const std::nothrow_t&) noexcept {
    return ZV::Bench::Allocate(bytes);
}
void* __wrap__ZnamRKSt9nothrow_t(std::size_t bytes, const std::nothrow_t&) noexcept {
    return ZV::Bench::Allocate(bytes);
}
void __wrap__ZdlPv(void* memory) {
    ZV::Bench::Free(memory);
}
void __wrap__ZdaPv(void* memory) {
    ZV::Bench::Free(memory);
}
void __wrap__ZdlPvm(void* memory, std::size_t) {
    ZV::Bench::Free(memory);
}
void __wrap__ZdaPvm(void* memory, std::size_t) {
    ZV::Bench::Free(memory);
}

}  // extern "C"
