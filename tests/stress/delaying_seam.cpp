#include "stress/delaying_seam.h"

#include <pthread.h>

#include <atomic>
#include <chrono>
#include <thread>

#include "hal/platform/event.h"
#include "hal/platform/mutex.h"
#include "hal/platform/semaphore.h"
#include "support/wait_until.h"

// The linker's --wrap option sends the library's calls of the seam, and those of its leaf mutexes,
// here, and gives the functions themselves the names that begin with __real. Nothing of it is in
// the library that is shipped.

namespace ZV::Test {
namespace {

constexpr std::uint64_t DelayEvery = 32;
constexpr std::uint64_t SleepEvery = 4;  // of the delays; the others yield
constexpr std::uint64_t SleepMaxUs = 250;

std::atomic<std::uint64_t> currentSeed{0}, threadsSeen{0}, delays{0};

struct Generator {
    std::uint64_t seed = 0, state = 0;
};
thread_local Generator generator;

/// The splitmix generator of 64 bits.
std::uint64_t Draw() {
    std::uint64_t z = generator.state += 0x9E3779B97F4A7C15U;
    z = (z ^ (z >> 30)) * 0xBF58476D1CE4E5B9U;
    z = (z ^ (z >> 27)) * 0x94D049BB133111EBU;
    return z ^ (z >> 31);
}

void Delay() {
    const std::uint64_t seed = currentSeed.load(std::memory_order_relaxed);
    if (seed == 0) return;
    if (generator.seed != seed) {
        generator.seed = seed;
        generator.state = seed + threadsSeen.fetch_add(1, std::memory_order_relaxed);
    }
    const std::uint64_t drawn = Draw();
    if (drawn % DelayEvery != 0) return;
    delays.fetch_add(1, std::memory_order_relaxed);
    if (drawn / DelayEvery % SleepEvery != 0) return std::this_thread::yield();
    Disturb(std::chrono::microseconds((drawn >> 16) % SleepMaxUs));
}

/// Delays at its beginning and at its end.
struct Delayed {
    Delayed() { Delay(); }
    ~Delayed() { Delay(); }
    Delayed(const Delayed&) = delete;
    Delayed& operator=(const Delayed&) = delete;
};

}  // namespace

void DelaySeam(std::uint64_t seed) {
    if (seed != 0) {
        delays = 0;
        threadsSeen = 0;
    }
    currentSeed = seed;
}

std::uint64_t CountSeamDelays() {
    return delays;
}

}  // namespace ZV::Test

using ZV::PlatformEvent;
using ZV::PlatformMutex;
using ZV::PlatformSemaphore;
using ZV::WaitOutcome;
using ZV::Test::Delayed;

#pragma GCC visibility push(default)

extern "C" {

WaitOutcome __real__ZN2ZV13TakeSemaphoreEPNS_17PlatformSemaphoreE(PlatformSemaphore* semaphore);
void __real__ZN2ZV13GiveSemaphoreEPNS_17PlatformSemaphoreE(PlatformSemaphore* semaphore);
WaitOutcome __real__ZN2ZV9TakeMutexEPNS_13PlatformMutexE(PlatformMutex* mutex);
bool __real__ZN2ZV9GiveMutexEPNS_13PlatformMutexE(PlatformMutex* mutex);
bool __real__ZN2ZV11SignalEventEPNS_13PlatformEventE(PlatformEvent* event);
void __real__ZN2ZV10ClearEventEPNS_13PlatformEventE(PlatformEvent* event);
WaitOutcome __real__ZN2ZV12WaitForEventEPNS_13PlatformEventEm(PlatformEvent* event,
                                                              std::uint64_t timeoutMs);
int __real_pthread_mutex_lock(pthread_mutex_t* mutex);

WaitOutcome __wrap__ZN2ZV13TakeSemaphoreEPNS_17PlatformSemaphoreE(PlatformSemaphore* semaphore) {
    const Delayed delayed;
    return __real__ZN2ZV13TakeSemaphoreEPNS_17PlatformSemaphoreE(semaphore);
}

void __wrap__ZN2ZV13GiveSemaphoreEPNS_17PlatformSemaphoreE(PlatformSemaphore* semaphore) {
    const Delayed delayed;
    __real__ZN2ZV13GiveSemaphoreEPNS_17PlatformSemaphoreE(semaphore);
}

WaitOutcome __wrap__ZN2ZV9TakeMutexEPNS_13PlatformMutexE(PlatformMutex* mutex) {
    const Delayed delayed;
    return __real__ZN2ZV9TakeMutexEPNS_13PlatformMutexE(mutex);
}

bool __wrap__ZN2ZV9GiveMutexEPNS_13PlatformMutexE(PlatformMutex* mutex) {
    const Delayed delayed;
    return __real__ZN2ZV9GiveMutexEPNS_13PlatformMutexE(mutex);
}

bool __wrap__ZN2ZV11SignalEventEPNS_13PlatformEventE(PlatformEvent* event) {
    const Delayed delayed;
    return __real__ZN2ZV11SignalEventEPNS_13PlatformEventE(event);
}

void __wrap__ZN2ZV10ClearEventEPNS_13PlatformEventE(PlatformEvent* event) {
    const Delayed delayed;
    __real__ZN2ZV10ClearEventEPNS_13PlatformEventE(event);
}

WaitOutcome __wrap__ZN2ZV12WaitForEventEPNS_13PlatformEventEm(PlatformEvent* event,
                                                              std::uint64_t timeoutMs) {
    const Delayed delayed;
    return __real__ZN2ZV12WaitForEventEPNS_13PlatformEventEm(event, timeoutMs);
}

// Leaf mutexes too: a step between two of them is where an order is easily taken for granted.
int __wrap_pthread_mutex_lock(pthread_mutex_t* mutex) {
    const Delayed delayed;
    return __real_pthread_mutex_lock(mutex);
}

}  // extern "C"

#pragma GCC visibility pop
