#include "hal/platform/mutex.h"

#include <pthread.h>

#include <atomic>
#include <cerrno>
#include <new>

#include "hal/platform/last_error.h"
#include "hal/platform/posix/system_error.h"

namespace ZV {
namespace {

/// Its address stands for the calling thread.
thread_local char ownMark;

}  // namespace

struct PlatformMutex {
    pthread_mutex_t mutex;
    std::atomic<const char*> owner{
        nullptr};             // equal to a thread's own mark only while it holds the mutex
    std::uint32_t depth = 0;  // guarded by mutex
};

PlatformMutex* MakeMutex() {
    auto* mutex = new (std::nothrow) PlatformMutex;
    if (mutex == nullptr) {
        SetLastPlatformError(PlatformErrorNotEnoughMemory);
        return nullptr;
    }
    pthread_mutexattr_t attributes;
    pthread_mutexattr_init(&attributes);
    pthread_mutexattr_settype(&attributes, PTHREAD_MUTEX_RECURSIVE);
    // A mutex whose owner has ended without a release goes to the next taker.
    pthread_mutexattr_setrobust(&attributes, PTHREAD_MUTEX_ROBUST);
    const int error = pthread_mutex_init(&mutex->mutex, &attributes);
    pthread_mutexattr_destroy(&attributes);
    if (error == 0) return mutex;
    SetLastPlatformErrorFromErrno(error);
    delete mutex;
    return nullptr;
}

WaitOutcome TakeMutex(PlatformMutex* mutex) {
    if (mutex == nullptr) {
        SetLastPlatformError(PlatformErrorInvalidHandle);
        return WaitOutcome::Failed;
    }
    const int error = pthread_mutex_lock(&mutex->mutex);
    if (error == EOWNERDEAD) {
        pthread_mutex_consistent(&mutex->mutex);
        mutex->depth = 0;
    } else if (error != 0) {
        SetLastPlatformErrorFromErrno(error);
        return WaitOutcome::Failed;
    }
    ++mutex->depth;
    mutex->owner.store(&ownMark, std::memory_order_relaxed);
    return WaitOutcome::Signalled;
}

bool GiveMutex(PlatformMutex* mutex) {
    if (mutex == nullptr) {
        SetLastPlatformError(PlatformErrorInvalidHandle);
        return false;
    }
    if (mutex->owner.load(std::memory_order_relaxed) != &ownMark) {
        SetLastPlatformError(PlatformErrorNotOwner);
        return false;
    }
    if (--mutex->depth == 0) mutex->owner.store(nullptr, std::memory_order_relaxed);
    pthread_mutex_unlock(&mutex->mutex);
    return true;
}

void DestroyMutex(PlatformMutex* mutex) {
    if (mutex == nullptr) return;
    pthread_mutex_destroy(&mutex->mutex);
    delete mutex;
}

}  // namespace ZV
