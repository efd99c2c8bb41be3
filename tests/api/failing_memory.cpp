#include "api/failing_memory.h"

#include <cstdlib>
#include <new>
#include <utility>

// Every `new` of this suite's program goes through here.

namespace {

/// The allocation that is to fail, counted from 1; 0 for none.
thread_local std::uint32_t failingAllocation = 0;

void* Allocate(std::size_t bytes) {
    if (failingAllocation != 0 && --failingAllocation == 0) return nullptr;
    return std::malloc(bytes != 0 ? bytes : 1);
}

}  // namespace

void* operator new(std::size_t bytes) {
    void* const memory = Allocate(bytes);
    if (memory == nullptr) throw std::bad_alloc();
    return memory;
}
void* operator new(std::size_t bytes, const std::nothrow_t&) noexcept {
    return Allocate(bytes);
}
void operator delete(void* memory) noexcept {
    std::free(memory);
}
void operator delete(void* memory, std::size_t) noexcept {
    std::free(memory);
}
void operator delete(void* memory, const std::nothrow_t&) noexcept {
    std::free(memory);
}

namespace ZV::Test {

void FailAllocation(std::uint32_t allocation) {
    failingAllocation = allocation;
}

std::uint32_t EndFailingAllocation() {
    return std::exchange(failingAllocation, 0);
}

}  // namespace ZV::Test
