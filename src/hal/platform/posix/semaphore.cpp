#include "hal/platform/semaphore.h"

#include <condition_variable>
#include <cstdint>
#include <mutex>
#include <new>

#include "hal/platform/last_error.h"

namespace ZV {
namespace {

constexpr std::uint32_t CountInitial = 1;
constexpr std::uint32_t CountMax = 100;

}  // namespace

struct PlatformSemaphore {
    std::mutex mutex;
    std::condition_variable raised;
    std::uint32_t count = CountInitial;  // guarded by mutex
};

PlatformSemaphore* MakeSemaphore() {
    auto* semaphore = new (std::nothrow) PlatformSemaphore;
    if (semaphore == nullptr) SetLastPlatformError(PlatformErrorNotEnoughMemory);
    return semaphore;
}

WaitOutcome TakeSemaphore(PlatformSemaphore* semaphore) {
    if (semaphore == nullptr) {
        SetLastPlatformError(PlatformErrorInvalidHandle);
        return WaitOutcome::Failed;
    }
    std::unique_lock lock(semaphore->mutex);
    semaphore->raised.wait(lock, [semaphore] { return semaphore->count > 0; });
    --semaphore->count;
    return WaitOutcome::Signalled;
}

void GiveSemaphore(PlatformSemaphore* semaphore) {
    if (semaphore == nullptr) return;
    // Notified under the mutex: whoever takes the unit may destroy the semaphore at once.
    const std::lock_guard guard(semaphore->mutex);
    if (semaphore->count == CountMax) return;
    ++semaphore->count;
    semaphore->raised.notify_one();
}

void DestroySemaphore(PlatformSemaphore* semaphore) {
    delete semaphore;
}

}  // namespace ZV
