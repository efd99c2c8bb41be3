#include "stress/delaying_seam.h"

#include <pthread.h>

#include <array>
#include <atomic>
#include <chrono>
#include <cstddef>
#include <iterator>
#include <thread>

#include "hal/platform/device.h"
#include "hal/platform/event.h"
#include "hal/platform/mutex.h"
#include "hal/platform/semaphore.h"
#include "hal/platform/thread.h"
#include "stress/split_mix.h"
#include "support/wait_until.h"

// The linker's --wrap option sends the library's calls of the seam, and those of its leaf mutexes,
// here, and gives the functions themselves the names that begin with __real. Nothing of it is in
// the library that is shipped.

namespace ZV::Test {
namespace {

constexpr std::uint64_t DelayEvery = 32;
constexpr std::uint64_t SleepEvery = 4;  // of the delays; the others yield
constexpr std::uint64_t SleepMaxUs = 250;

enum SeamCall : std::size_t {
    SeamTakeSemaphore,
    SeamGiveSemaphore,
    SeamTakeMutex,
    SeamGiveMutex,
    SeamSignalEvent,
    SeamClearEvent,
    SeamWaitForEvent,
    SeamControlOverlapped,
    SeamWaitForCompletion,
    SeamClearOverlapped,
    SeamWaitForThread,
    SeamLockLeafMutex,
};
constexpr const char* SeamCallNames[] = {
    "TakeSemaphore",     "GiveSemaphore",   "TakeMutex",     "GiveMutex",
    "SignalEvent",       "ClearEvent",      "WaitForEvent",  "ControlDeviceOverlapped",
    "WaitForCompletion", "ClearOverlapped", "WaitForThread", "pthread_mutex_lock"};

std::atomic<std::uint64_t> currentSeed{0}, threadsSeen{0}, delays{0};
std::array<std::atomic<std::uint64_t>, std::size(SeamCallNames)> calls{};

struct Generator {
    std::uint64_t seed = 0;
    SplitMix numbers;
};
thread_local Generator generator;

void Delay() {
    const std::uint64_t seed = currentSeed.load(std::memory_order_relaxed);
    if (seed == 0) return;
    if (generator.seed != seed) {
        generator.seed = seed;
        generator.numbers = SplitMix(seed + threadsSeen.fetch_add(1, std::memory_order_relaxed));
    }
    const std::uint64_t drawn = generator.numbers.Draw();
    if (drawn % DelayEvery != 0) return;
    delays.fetch_add(1, std::memory_order_relaxed);
    if (drawn / DelayEvery % SleepEvery != 0) return std::this_thread::yield();
    Disturb(std::chrono::microseconds((drawn >> 16) % SleepMaxUs));
}

/// Delays at its beginning and at its end.
struct Delayed {
    explicit Delayed(SeamCall call) {
        calls[call].fetch_add(1, std::memory_order_relaxed);
        Delay();
    }
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

std::vector<std::string> ListSeamCallsNotMet() {
    std::vector<std::string> names;
    for (std::size_t i = 0; i < calls.size(); ++i) {
        if (calls[i] == 0) names.emplace_back(SeamCallNames[i]);
    }
    return names;
}

}  // namespace ZV::Test

using ZV::CompletionOutcome;
using ZV::ControlOutcome;
using ZV::ControlRequest;
using ZV::PlatformDevice;
using ZV::PlatformEvent;
using ZV::PlatformMutex;
using ZV::PlatformOverlapped;
using ZV::PlatformSemaphore;
using ZV::PlatformThread;
using ZV::WaitOutcome;
using namespace ZV::Test;

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
ControlOutcome
__real__ZN2ZV23ControlDeviceOverlappedEPNS_14PlatformDeviceERKNS_14ControlRequestEPNS_18PlatformOverlappedE(
    PlatformDevice* device, const ControlRequest& request, PlatformOverlapped* overlapped);
CompletionOutcome __real__ZN2ZV17WaitForCompletionEPNS_14PlatformDeviceEPNS_18PlatformOverlappedEm(
    PlatformDevice* device, PlatformOverlapped* overlapped, std::uint64_t timeoutMs);
void __real__ZN2ZV15ClearOverlappedEPNS_18PlatformOverlappedE(PlatformOverlapped* overlapped);
WaitOutcome __real__ZN2ZV13WaitForThreadEPNS_14PlatformThreadEm(PlatformThread* thread,
                                                                std::uint64_t timeoutMs);
int __real_pthread_mutex_lock(pthread_mutex_t* mutex);

WaitOutcome __wrap__ZN2ZV13TakeSemaphoreEPNS_17PlatformSemaphoreE(PlatformSemaphore* semaphore) {
    const Delayed delayed(SeamTakeSemaphore);
    return __real__ZN2ZV13TakeSemaphoreEPNS_17PlatformSemaphoreE(semaphore);
}

void __wrap__ZN2ZV13GiveSemaphoreEPNS_17PlatformSemaphoreE(PlatformSemaphore* semaphore) {
    const Delayed delayed(SeamGiveSemaphore);
    __real__ZN2ZV13GiveSemaphoreEPNS_17PlatformSemaphoreE(semaphore);
}

WaitOutcome __wrap__ZN2ZV9TakeMutexEPNS_13PlatformMutexE(PlatformMutex* mutex) {
    const Delayed delayed(SeamTakeMutex);
    return __real__ZN2ZV9TakeMutexEPNS_13PlatformMutexE(mutex);
}

bool __wrap__ZN2ZV9GiveMutexEPNS_13PlatformMutexE(PlatformMutex* mutex) {
    const Delayed delayed(SeamGiveMutex);
    return __real__ZN2ZV9GiveMutexEPNS_13PlatformMutexE(mutex);
}

bool __wrap__ZN2ZV11SignalEventEPNS_13PlatformEventE(PlatformEvent* event) {
    const Delayed delayed(SeamSignalEvent);
    return __real__ZN2ZV11SignalEventEPNS_13PlatformEventE(event);
}

void __wrap__ZN2ZV10ClearEventEPNS_13PlatformEventE(PlatformEvent* event) {
    const Delayed delayed(SeamClearEvent);
    __real__ZN2ZV10ClearEventEPNS_13PlatformEventE(event);
}

WaitOutcome __wrap__ZN2ZV12WaitForEventEPNS_13PlatformEventEm(PlatformEvent* event,
                                                              std::uint64_t timeoutMs) {
    const Delayed delayed(SeamWaitForEvent);
    return __real__ZN2ZV12WaitForEventEPNS_13PlatformEventEm(event, timeoutMs);
}

ControlOutcome
__wrap__ZN2ZV23ControlDeviceOverlappedEPNS_14PlatformDeviceERKNS_14ControlRequestEPNS_18PlatformOverlappedE(
    PlatformDevice* device, const ControlRequest& request, PlatformOverlapped* overlapped) {
    const Delayed delayed(SeamControlOverlapped);
    return __real__ZN2ZV23ControlDeviceOverlappedEPNS_14PlatformDeviceERKNS_14ControlRequestEPNS_18PlatformOverlappedE(
        device, request, overlapped);
}

CompletionOutcome __wrap__ZN2ZV17WaitForCompletionEPNS_14PlatformDeviceEPNS_18PlatformOverlappedEm(
    PlatformDevice* device, PlatformOverlapped* overlapped, std::uint64_t timeoutMs) {
    const Delayed delayed(SeamWaitForCompletion);
    return __real__ZN2ZV17WaitForCompletionEPNS_14PlatformDeviceEPNS_18PlatformOverlappedEm(
        device, overlapped, timeoutMs);
}

void __wrap__ZN2ZV15ClearOverlappedEPNS_18PlatformOverlappedE(PlatformOverlapped* overlapped) {
    const Delayed delayed(SeamClearOverlapped);
    __real__ZN2ZV15ClearOverlappedEPNS_18PlatformOverlappedE(overlapped);
}

WaitOutcome __wrap__ZN2ZV13WaitForThreadEPNS_14PlatformThreadEm(PlatformThread* thread,
                                                                std::uint64_t timeoutMs) {
    const Delayed delayed(SeamWaitForThread);
    return __real__ZN2ZV13WaitForThreadEPNS_14PlatformThreadEm(thread, timeoutMs);
}

// Leaf mutexes too: a step between two of them is where an order is easily taken for granted.
int __wrap_pthread_mutex_lock(pthread_mutex_t* mutex) {
    const Delayed delayed(SeamLockLeafMutex);
    return __real_pthread_mutex_lock(mutex);
}

}  // extern "C"

#pragma GCC visibility pop
