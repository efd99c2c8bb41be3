#include "hal/platform/shared_memory.h"

#include <fcntl.h>
#include <sched.h>
#include <sys/file.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <new>

#include "hal/platform/last_error.h"
#include "hal/platform/posix/system_error.h"

// A block lives as long as some process has it open: each opener holds a shared lock on the file,
// which the system drops with the process. Who gets the lock alone is the first, and finds or makes
// the block zeroed; or the last, and removes its name. A block that a crash left behind is so begun
// anew.

namespace ZV {
namespace {

constexpr std::size_t NameBytesMax = 128;
constexpr int OpenAttempts = 1000;

/// "System-wide" between users is the administrator's choice: theirs alone is the block that others
/// take, and their umask decides who may write to it.
constexpr mode_t FileMode = 0666;

}  // namespace

struct SharedMemory {
    char name[NameBytesMax];
    int file;
    std::size_t bytes;
    void* address;
};

namespace {

/// Opens an existing block without O_CREAT, which the system may refuse for another user's file.
int OpenOrMakeFile(const char* name) {
    const int existing = shm_open(name, O_RDWR, 0);
    if (existing >= 0 || errno != ENOENT) return existing;
    return shm_open(name, O_RDWR | O_CREAT | O_EXCL, FileMode);
}

bool IsRemoved(const struct stat& status) {
    return status.st_nlink == 0;
}

/// The owner of a block may cut it under those that read it, whatever its mode says.
bool IsTrusted(const struct stat& status) {
    return status.st_uid == geteuid() || status.st_uid == 0;
}

/// Takes part in the block behind `file`, zeroed for the first and at least `bytes` long. False
/// with errno; EAGAIN when the block is just being begun or removed, EACCES when it is a
/// stranger's.
bool JoinBlock(int file, std::size_t bytes) {
    struct stat status {};
    if (fstat(file, &status) != 0) return false;
    if (!IsTrusted(status)) {
        errno = EACCES;
        return false;
    }
    if (flock(file, LOCK_EX | LOCK_NB) == 0 && ftruncate(file, 0) != 0) return false;
    if (flock(file, LOCK_SH | LOCK_NB) != 0) return false;
    if (fstat(file, &status) != 0) return false;
    if (IsRemoved(status)) {
        errno = EAGAIN;
        return false;
    }
    if (static_cast<std::size_t>(status.st_size) >= bytes) return true;
    return ftruncate(file, static_cast<off_t>(bytes)) == 0;
}

int OpenFile(const char* name, std::size_t bytes) {
    for (int attempt = 0; attempt < OpenAttempts; ++attempt) {
        const int file = OpenOrMakeFile(name);
        if (file >= 0 && JoinBlock(file, bytes)) return file;
        const int error = errno;
        if (file >= 0) close(file);
        errno = error;
        if (error != EAGAIN && error != EEXIST && error != EINTR) return -1;
        sched_yield();
    }
    return -1;
}

void LeaveBlock(const SharedMemory& memory) {
    struct stat status {};
    const bool isLast = flock(memory.file, LOCK_EX | LOCK_NB) == 0;
    if (isLast && fstat(memory.file, &status) == 0 && !IsRemoved(status)) shm_unlink(memory.name);
    close(memory.file);
}

}  // namespace

SharedMemory* OpenSharedMemory(const char* name, std::size_t bytes) {
    auto* memory = new (std::nothrow) SharedMemory{};
    if (memory == nullptr) {
        SetLastPlatformError(PlatformErrorNotEnoughMemory);
        return nullptr;
    }
    std::snprintf(memory->name, sizeof memory->name, "/%s", name);
    memory->bytes = bytes;
    memory->file = OpenFile(memory->name, bytes);
    if (memory->file < 0) {
        SetLastPlatformErrorFromErrno(errno);
        delete memory;
        return nullptr;
    }
    memory->address = mmap(nullptr, bytes, PROT_READ | PROT_WRITE, MAP_SHARED, memory->file, 0);
    if (memory->address == MAP_FAILED) {
        SetLastPlatformErrorFromErrno(errno);
        LeaveBlock(*memory);
        delete memory;
        return nullptr;
    }
    return memory;
}

void* GetSharedMemoryAddress(SharedMemory* memory) {
    return memory->address;
}

void CloseSharedMemory(SharedMemory* memory) {
    if (memory == nullptr) return;
    munmap(memory->address, memory->bytes);
    LeaveBlock(*memory);
    delete memory;
}

}  // namespace ZV
