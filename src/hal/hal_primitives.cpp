#include <cstdlib>
#include <exception>
#include <new>

#include "hal/hal.h"
#include "hal/platform/event.h"
#include "hal/platform/last_error.h"
#include "hal/platform/semaphore.h"
#include "hal/platform/simulation_module.h"
#include "hal/platform/thread.h"

namespace ZV {

struct HALThread {
    std::uint32_t id;
    PlatformThread* handle;  // null when the thread could not be made
};

struct HALSemaphore {
    PlatformSemaphore* handle;
};

struct HALCondition {
    PlatformEvent* handle;
};

namespace {

constexpr std::size_t ErrorTextBytes = 2048;
constexpr std::uint64_t MicrosecondsPerMillisecond = 1000;

struct StartBlock {
    HALThreadEntry entry;
    void* argument;
};

/// The shell of a thread: what the standard library throws ends the thread, not the process.
void RunEntry(const StartBlock& start) {
    try {
        (void)start.entry(start.argument);  // the entry's result has no reader
    } catch (const std::exception&) {
    }
}

void RunStartBlock(void* argument) {
    auto* start = static_cast<StartBlock*>(argument);
    RunEntry(*start);
    delete start;
}

/// Null when the thread cannot be made, and for an entry that is none.
PlatformThread* StartEntry(HALThreadEntry entry, void* argument) {
    if (entry == nullptr) return nullptr;
    auto* start = new (std::nothrow) StartBlock{entry, argument};
    if (start == nullptr) return nullptr;
    PlatformThread* handle = StartThread(RunStartBlock, start);
    if (handle == nullptr) delete start;
    return handle;
}

HALStatus ConvertConditionOutcome(WaitOutcome outcome) {
    return outcome == WaitOutcome::Signalled ? HALOk : HALConditionFailed;
}

}  // namespace

extern "C" {

HALStatus HAL_Open(void) {
    return HALOk;
}

HALStatus HAL_Close(void) {
    EndSimulation();
    return HALOk;
}

HALStatus HAL_MemoryFree(void* memory) {
    std::free(memory);
    return HALOk;
}

HALStatus HAL_AdapterOpen(std::uint32_t, void*) {
    return HALOk;
}

const char* HAL_ErrorMessage(HALStatus) {
    // Kept: the text is that of the thread's last platform error, whatever status a caller hands
    // in. The error is read before anything else, since a thread's first touch of the text may
    // allocate.
    const std::uint32_t error = GetLastPlatformError();
    static thread_local char text[ErrorTextBytes];
    return GetPlatformErrorText(error, text, sizeof text) ? text : "";
}

HALStatus HAL_ThreadCreate(HALThreadEntry entry, void* argument, HALThread** thread) {
    if (thread == nullptr) return HALOk;
    // Kept: a thread that could not be made is reported as made; its record holds no handle.
    *thread = new (std::nothrow) HALThread{0, nullptr};
    if (*thread == nullptr) return HALOk;
    (*thread)->handle = StartEntry(entry, argument);
    (*thread)->id = GetThreadId((*thread)->handle);
    return HALOk;
}

HALStatus HAL_ThreadCleanup(HALThread* thread, std::uint64_t timeoutMs) {
    if (thread == nullptr) return HALOk;
    // Kept: the record goes whatever the wait gave; a thread that still runs goes on by itself.
    (void)WaitForThread(thread->handle, timeoutMs);
    CloseThread(thread->handle);
    delete thread;
    return HALOk;
}

HALStatus HAL_ThreadTerminate(HALThread* thread) {
    if (!IsHALThreadStarted(thread)) {
        delete thread;
        return HALOk;
    }
    if (!EndThread(thread->handle)) return HALThreadNotTerminated;
    CloseThread(thread->handle);
    delete thread;
    return HALOk;
}

HALStatus HAL_SemaphoreCreate(HALSemaphore** semaphore) {
    if (semaphore == nullptr) return HALOk;
    *semaphore = new (std::nothrow) HALSemaphore{MakeSemaphore()};
    return HALOk;
}

HALStatus HAL_SemaphoreWait(HALSemaphore* semaphore) {
    if (semaphore == nullptr) return HALSemaphoreFailed;
    const WaitOutcome outcome = TakeSemaphore(semaphore->handle);
    return outcome == WaitOutcome::Signalled ? HALOk : HALSemaphoreFailed;
}

HALStatus HAL_SemaphoreSignal(HALSemaphore* semaphore) {
    // Kept: also a signal at the maximum, which changes nothing, is a success.
    if (semaphore != nullptr) GiveSemaphore(semaphore->handle);
    return HALOk;
}

HALStatus HAL_SemaphoreDestroy(HALSemaphore** semaphore) {
    if (semaphore == nullptr) return HALOk;
    if (*semaphore != nullptr) DestroySemaphore((*semaphore)->handle);
    delete *semaphore;
    *semaphore = nullptr;
    return HALOk;
}

HALStatus HAL_ConditionCreate(HALCondition** condition) {
    if (condition == nullptr) return HALOk;
    *condition = new (std::nothrow) HALCondition{MakeEvent(EventReset::Automatic)};
    return HALOk;
}

HALStatus HAL_ConditionWait(HALCondition* condition) {
    if (condition == nullptr) return HALConditionFailed;
    return ConvertConditionOutcome(WaitForEvent(condition->handle, WaitForEver));
}

HALStatus HAL_ConditionTimedWait(HALCondition* condition, std::uint64_t timeoutMicroseconds) {
    if (condition == nullptr) return HALConditionFailed;
    // Kept: microseconds here, milliseconds in HAL_ThreadCleanup; below 1000 it polls.
    const std::uint64_t timeoutMs = timeoutMicroseconds / MicrosecondsPerMillisecond;
    return ConvertConditionOutcome(WaitForEvent(condition->handle, timeoutMs));
}

HALStatus HAL_ConditionReset(HALCondition* condition) {
    if (condition != nullptr) ClearEvent(condition->handle);
    return HALOk;
}

HALStatus HAL_ConditionSignal(HALCondition* condition) {
    if (condition == nullptr) return HALConditionFailed;
    return SignalEvent(condition->handle) ? HALOk : HALConditionFailed;
}

HALStatus HAL_ConditionDestroy(HALCondition** condition) {
    if (condition == nullptr) return HALOk;
    if (*condition != nullptr && !DestroyEvent((*condition)->handle)) return HALConditionFailed;
    delete *condition;
    *condition = nullptr;
    return HALOk;
}

}  // extern "C"

bool IsHALThreadStarted(const HALThread* thread) {
    return thread != nullptr && thread->handle != nullptr;
}

bool IsHALSemaphoreMade(const HALSemaphore* semaphore) {
    return semaphore != nullptr && semaphore->handle != nullptr;
}

bool IsHALConditionMade(const HALCondition* condition) {
    return condition != nullptr && condition->handle != nullptr;
}

}  // namespace ZV
