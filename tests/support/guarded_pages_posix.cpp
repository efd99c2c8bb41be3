#include "support/guarded_pages.h"

#include <sys/mman.h>
#include <unistd.h>

#include <cstdlib>

namespace ZV::Test {

GuardedPages::GuardedPages(std::size_t count, std::size_t bytes)
    : pageBytes(static_cast<std::size_t>(sysconf(_SC_PAGESIZE))),
      stretchBytes(RoundUp(bytes)),
      mappedBytes(pageBytes + count * GetDistance()) {
    void* const mapped = mmap(nullptr, mappedBytes, PROT_NONE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (mapped == MAP_FAILED) std::abort();
    memory = static_cast<std::uint8_t*>(mapped);
    for (std::size_t i = 0; i < count; ++i)
        if (mprotect(GetBegin(i), stretchBytes, PROT_READ | PROT_WRITE) != 0) std::abort();
}

GuardedPages::~GuardedPages() {
    munmap(memory, mappedBytes);
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
