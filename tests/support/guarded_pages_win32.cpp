#include <windows.h>

#include <cstdlib>

#include "support/guarded_pages.h"

namespace ZV::Test {
namespace {

std::size_t GetPageBytes() {
    SYSTEM_INFO information;
    GetSystemInfo(&information);
    return information.dwPageSize;
}

}  // namespace

GuardedPages::GuardedPages(std::size_t count, std::size_t bytes)
    : pageBytes(GetPageBytes()),
      stretchBytes(RoundUp(bytes)),
      mappedBytes(pageBytes + count * GetDistance()),
      memory(static_cast<std::uint8_t*>(
          VirtualAlloc(nullptr, mappedBytes, MEM_RESERVE, PAGE_NOACCESS))) {
    if (memory == nullptr) std::abort();
    for (std::size_t i = 0; i < count; ++i) {
        if (VirtualAlloc(GetBegin(i), stretchBytes, MEM_COMMIT, PAGE_READWRITE) == nullptr) {
            std::abort();
        }
    }
}

GuardedPages::~GuardedPages() {
    VirtualFree(memory, 0, MEM_RELEASE);
}

bool GuardedPages::IsFor(std::size_t count, std::size_t bytes) const {
    return stretchBytes == RoundUp(bytes) && mappedBytes == pageBytes + count * GetDistance();
}

std::uint8_t* GuardedPages::GetBegin(std::size_t index) const {
    return memory + pageBytes + index * GetDistance();
}

std::uint8_t* GuardedPages::GetEnd(std::size_t index) const {
    return GetBegin(index) + stretchBytes;
}

}  // namespace ZV::Test
