#include "memory/failing_allocator.h"

#include <dlfcn.h>
#include <fcntl.h>
#include <pthread.h>
#include <sys/mman.h>
#include <sys/types.h>

#include <array>
#include <atomic>
#include <cerrno>
#include <cstdarg>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <new>
#include <thread>

#include "support/rounds.h"

// The linker's --wrap option sends the suite's references to an allocator here, those of the
// library among them, and gives the allocator itself the name that begins with __real.

namespace ZV::Test {
namespace {

std::atomic<bool> isCounting{false};
std::atomic<std::int64_t> allocationsLeft{0};  // 0 from the refused one on
std::atomic<std::int64_t> refusals{0};
std::atomic<std::thread::id> refusedThread{};

thread_local int uncountedDepth = 0;

bool MayAllocate() {
    if (!isCounting.load() || uncountedDepth != 0) return true;
    if (allocationsLeft.fetch_sub(1) != 1) return true;
    refusedThread = std::this_thread::get_id();
    return false;
}

/// Addresses of what is there, in a table of open addresses: it must not allocate. It ends the
/// process before one is forgotten.
class LiveTable {
  public:
    void Insert(const void* address) {
        const std::lock_guard hold(mutex);
        if (count > slots.size() / 2) {
            (void)std::fputs("too many live allocations to look for lost ones\n", stderr);
            std::abort();
        }
        std::size_t i = GetHome(address);
        while (slots[i] != nullptr) i = (i + 1) % slots.size();
        slots[i] = address;
        ++count;
    }
    void Erase(const void* address) {
        const std::lock_guard hold(mutex);
        std::size_t i = GetHome(address);
        while (slots[i] != nullptr && slots[i] != address) i = (i + 1) % slots.size();
        if (slots[i] == nullptr) return;
        --count;
        CloseGap(i);
    }
    std::size_t GetCount() {
        const std::lock_guard hold(mutex);
        return count;
    }

  private:
    std::size_t GetHome(const void* address) const {
        return (reinterpret_cast<std::uintptr_t>(address) >> 4) * 0x9E3779B1U % slots.size();
    }
    /// What comes behind and would not be found any more moves up.
    void CloseGap(std::size_t gap) {
        for (std::size_t i = (gap + 1) % slots.size(); slots[i] != nullptr;
             i = (i + 1) % slots.size()) {
            const std::size_t fromHome = (i + slots.size() - GetHome(slots[i])) % slots.size();
            if (fromHome < (i + slots.size() - gap) % slots.size()) continue;
            slots[gap] = slots[i];
            gap = i;
        }
        slots[gap] = nullptr;
    }

    std::mutex mutex;
    std::array<const void*, std::size_t{1} << 16> slots{};
    std::size_t count = 0;
};
constinit LiveTable liveTable;
constinit LiveTable liveMappings;  // of files

template <typename Memory>
Memory* Note(Memory* memory) {
    if (!IsSanitized && memory != nullptr && uncountedDepth == 0) liveTable.Insert(memory);
    return memory;
}

void Forget(const void* memory) {
    if (!IsSanitized && memory != nullptr) liveTable.Erase(memory);
}

}  // namespace

std::size_t CountLiveAllocations() {
    return liveTable.GetCount();
}

std::size_t CountLiveMappings() {
    return liveMappings.GetCount();
}

void BeginAllocations(std::int64_t failing) {
    allocationsLeft = failing;
    refusedThread = std::thread::id();
    isCounting = true;
}

bool EndAllocations() {
    isCounting = false;
    if (HasRefusedAllocation()) ++refusals;
    return HasRefusedAllocation();
}

void PrintRefusals() {
    std::printf("%lld refusals\n", static_cast<long long>(refusals.exchange(0)));
}

bool HasRefusedAllocation() {
    return allocationsLeft.load() <= 0;
}

std::thread::id GetRefusedThread() {
    return refusedThread;
}

std::int64_t CountAllocationsLeft() {
    return allocationsLeft;
}

UncountedAllocations::UncountedAllocations() {
    ++uncountedDepth;
}

UncountedAllocations::~UncountedAllocations() {
    --uncountedDepth;
}

}  // namespace ZV::Test

using ZV::Test::Forget;
using ZV::Test::liveMappings;
using ZV::Test::MayAllocate;
using ZV::Test::Note;

// A sanitizer's runtime refers to the wrapped names too.
#pragma GCC visibility push(default)

extern "C" {

void* __real_malloc(std::size_t bytes);
void* __real_calloc(std::size_t count, std::size_t bytes);
void* __real_realloc(void* memory, std::size_t bytes);
void __real_free(void* memory);
void* __real__Znwm(std::size_t bytes);
void* __real__ZnwmRKSt9nothrow_t(std::size_t bytes, const std::nothrow_t& tag) noexcept;
void* __real__Znam(std::size_t bytes);
void* __real__ZnamRKSt9nothrow_t(std::size_t bytes, const std::nothrow_t& tag) noexcept;

int __real_pthread_create(pthread_t* thread, const pthread_attr_t* attributes,
                          void* (*entry)(void*), void* argument);
int __real_pthread_mutex_init(pthread_mutex_t* mutex, const pthread_mutexattr_t* attributes);
int __real_open(const char* path, int flags, ...);
std::FILE* __real_fopen(const char* path, const char* mode);
void* __real_dlopen(const char* path, int mode);
int __real_ftruncate(int file, off_t bytes);
int __real_shm_open(const char* name, int flags, mode_t mode);
void* __real_mmap(void* address, std::size_t bytes, int protection, int flags, int file,
                  off_t offset);
int __real_munmap(void* address, std::size_t bytes);

void* __wrap_malloc(std::size_t bytes) {
    return MayAllocate() ? Note(__real_malloc(bytes)) : nullptr;
}

void* __wrap_calloc(std::size_t count, std::size_t bytes) {
    return MayAllocate() ? Note(__real_calloc(count, bytes)) : nullptr;
}

void* __wrap_realloc(void* memory, std::size_t bytes) {
    if (!MayAllocate()) return nullptr;
    void* const moved = __real_realloc(memory, bytes);
    if (moved != nullptr) Forget(memory);
    return Note(moved);
}

void __wrap_free(void* memory) {
    Forget(memory);
    __real_free(memory);
}

void* __wrap__Znwm(std::size_t bytes) {
    if (!MayAllocate()) throw std::bad_alloc();
    return Note(__real__Znwm(bytes));
}

void* __wrap__ZnwmRKSt9nothrow_t(std::size_t bytes, const std::nothrow_t& tag) noexcept {
    return MayAllocate() ? Note(__real__ZnwmRKSt9nothrow_t(bytes, tag)) : nullptr;
}

void* __wrap__Znam(std::size_t bytes) {
    if (!MayAllocate()) throw std::bad_alloc();
    return Note(__real__Znam(bytes));
}

void* __wrap__ZnamRKSt9nothrow_t(std::size_t bytes, const std::nothrow_t& tag) noexcept {
    return MayAllocate() ? Note(__real__ZnamRKSt9nothrow_t(bytes, tag)) : nullptr;
}

int __wrap_pthread_create(pthread_t* thread, const pthread_attr_t* attributes,
                          void* (*entry)(void*), void* argument) {
    if (!MayAllocate()) return EAGAIN;
    return __real_pthread_create(thread, attributes, entry, argument);
}

int __wrap_pthread_mutex_init(pthread_mutex_t* mutex, const pthread_mutexattr_t* attributes) {
    if (!MayAllocate()) return ENOMEM;
    return __real_pthread_mutex_init(mutex, attributes);
}

int __wrap_open(const char* path, int flags, ...) {
    mode_t mode = 0;
    // O_TMPFILE is of two bits, of which O_DIRECTORY is one.
    if ((flags & O_CREAT) != 0 || (flags & O_TMPFILE) == O_TMPFILE) {
        va_list arguments;
        va_start(arguments, flags);
        mode = va_arg(arguments, mode_t);
        va_end(arguments);
    }
    if (MayAllocate()) return __real_open(path, flags, mode);
    errno = EMFILE;
    return -1;
}

std::FILE* __wrap_fopen(const char* path, const char* mode) {
    if (MayAllocate()) return __real_fopen(path, mode);
    errno = EMFILE;
    return nullptr;
}

void* __wrap_dlopen(const char* path, int mode) {
    return MayAllocate() ? __real_dlopen(path, mode) : nullptr;
}

int __wrap_ftruncate(int file, off_t bytes) {
    if (MayAllocate()) return __real_ftruncate(file, bytes);
    errno = ENOSPC;
    return -1;
}

int __wrap_shm_open(const char* name, int flags, mode_t mode) {
    if (MayAllocate()) return __real_shm_open(name, flags, mode);
    errno = EMFILE;
    return -1;
}

void* __wrap_mmap(void* address, std::size_t bytes, int protection, int flags, int file,
                  off_t offset) {
    if (!MayAllocate()) {
        errno = ENOMEM;
        return MAP_FAILED;
    }
    void* const mapped = __real_mmap(address, bytes, protection, flags, file, offset);
    if (file >= 0 && mapped != MAP_FAILED) liveMappings.Insert(mapped);
    return mapped;
}

int __wrap_munmap(void* address, std::size_t bytes) {
    liveMappings.Erase(address);
    return __real_munmap(address, bytes);
}

}  // extern "C"

// The standard library deletes here, too, what inline code of the suite has made. A sanitizer has
// operators of its own.
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
void operator delete(void* memory) noexcept {
    Forget(memory);
    __real_free(memory);
}
void operator delete[](void* memory) noexcept {
    operator delete(memory);
}
void operator delete(void* memory, std::size_t) noexcept {
    operator delete(memory);
}
void operator delete[](void* memory, std::size_t) noexcept {
    operator delete(memory);
}
#endif

#pragma GCC visibility pop
