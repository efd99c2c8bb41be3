#include "hal/platform/thread.h"

#include <process.h>
#include <windows.h>

#include <atomic>
#include <new>

#include "hal/platform/thread_end.h"
#include "hal/platform/win32/handle_wait.h"

// A thread's record belongs to two: to the caller until CloseThread, and to the thread until it has
// returned from its entry or was killed; the last to let go frees it.

namespace ZV {

struct PlatformThread {
    PlatformThread(PlatformThreadEntry threadEntry, void* threadArgument)
        : entry(threadEntry), argument(threadArgument) {}

    const PlatformThreadEntry entry;
    void* const argument;
    std::atomic<int> ownerCount{2};
    std::atomic<bool> hasThreadLetGo{false};
    ThreadEnd end;
    HANDLE endEvent = nullptr;
    HANDLE handle = nullptr;
    unsigned int id = 0;
};

namespace {

constexpr DWORD GraceMs = 1000;

thread_local PlatformThread* ownThread = nullptr;

void DeleteRecord(PlatformThread* thread) {
    if (thread->endEvent != nullptr) CloseHandle(thread->endEvent);
    if (thread->handle != nullptr) CloseHandle(thread->handle);
    delete thread;
}

void ReleaseRecord(PlatformThread* thread) {
    if (thread->ownerCount.fetch_sub(1, std::memory_order_acq_rel) == 1) DeleteRecord(thread);
}

void ReleaseThreadsShare(PlatformThread* thread) {
    if (!thread->hasThreadLetGo.exchange(true)) ReleaseRecord(thread);
}

unsigned int __stdcall RunThread(void* argument) {
    auto* thread = static_cast<PlatformThread*>(argument);
    ownThread = thread;
    thread->entry(thread->argument);
    ownThread = nullptr;
    ReleaseThreadsShare(thread);
    return 0;
}

/// Started only when the record is complete.
HANDLE StartSuspended(PlatformThread* thread) {
    const auto handle =
        _beginthreadex(nullptr, 0, RunThread, thread, CREATE_SUSPENDED, &thread->id);
    return reinterpret_cast<HANDLE>(handle);
}

bool KillThread(PlatformThread* thread) {
    const auto lock = thread->end.LockUnlessHeld();
    if (!lock) {
        SetLastError(ERROR_BUSY);
        return false;
    }
    // Refused where the thread has just returned by itself.
    (void)TerminateThread(thread->handle, 0);
    if (WaitForSingleObject(thread->handle, GraceMs) != WAIT_OBJECT_0) return false;
    ReleaseThreadsShare(thread);
    return true;
}

}  // namespace

PlatformThread* StartThread(PlatformThreadEntry entry, void* argument) {
    auto* thread = new (std::nothrow) PlatformThread(entry, argument);
    if (thread == nullptr) {
        SetLastError(ERROR_NOT_ENOUGH_MEMORY);
        return nullptr;
    }
    thread->endEvent = CreateEventA(nullptr, TRUE, FALSE, nullptr);
    if (thread->endEvent != nullptr) thread->handle = StartSuspended(thread);
    if (thread->handle == nullptr) {
        const DWORD error = GetLastError();
        DeleteRecord(thread);
        SetLastError(error);
        return nullptr;
    }
    ResumeThread(thread->handle);
    return thread;
}

std::uint32_t GetThreadId(const PlatformThread* thread) {
    return thread != nullptr ? thread->id : 0;
}

WaitOutcome WaitForThread(PlatformThread* thread, std::uint64_t timeoutMs) {
    if (thread == nullptr) {
        SetLastError(ERROR_INVALID_HANDLE);
        return WaitOutcome::Failed;
    }
    const DWORD result = WaitForHandles(1, &thread->handle, timeoutMs);
    if (result == WAIT_OBJECT_0) return WaitOutcome::Signalled;
    return result == WAIT_TIMEOUT ? WaitOutcome::TimedOut : WaitOutcome::Failed;
}

bool EndThread(PlatformThread* thread) {
    if (thread == nullptr || thread == ownThread) {
        SetLastError(ERROR_INVALID_HANDLE);
        return false;
    }
    thread->end.Request();
    SetEvent(thread->endEvent);
    if (WaitForSingleObject(thread->handle, GraceMs) == WAIT_OBJECT_0) return true;
    return KillThread(thread);
}

void CloseThread(PlatformThread* thread) {
    if (thread != nullptr) ReleaseRecord(thread);
}

void RaiseOwnThreadPriority(bool servesRealDevice) {
    if (servesRealDevice) SetThreadPriority(GetCurrentThread(), THREAD_PRIORITY_TIME_CRITICAL);
}

void RaiseProcessPriority(bool servesRealDevice) {
    if (servesRealDevice) SetPriorityClass(GetCurrentProcess(), REALTIME_PRIORITY_CLASS);
}

void LowerProcessPriority(bool servesRealDevice) {
    if (servesRealDevice) SetPriorityClass(GetCurrentProcess(), NORMAL_PRIORITY_CLASS);
}

ThreadEnd* GetOwnThreadEnd() {
    return ownThread != nullptr ? &ownThread->end : nullptr;
}

HANDLE GetOwnEndEvent() {
    return ownThread != nullptr ? ownThread->endEvent : nullptr;
}

}  // namespace ZV
