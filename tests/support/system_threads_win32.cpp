#include <windows.h>

#include <tlhelp32.h>

#include "support/system_threads.h"

namespace ZV::Test {
namespace {

struct Place {
    DWORD64 instruction = 0;
    DWORD64 stack = 0;
    bool operator==(const Place&) const = default;
};

/// Where a thread stands; zeros when it cannot be seen.
Place Look(HANDLE thread) {
    CONTEXT context{};
    context.ContextFlags = CONTEXT_CONTROL;
    if (SuspendThread(thread) == static_cast<DWORD>(-1)) return {};
    const bool isRead = GetThreadContext(thread, &context) != FALSE;
    ResumeThread(thread);
    return isRead ? Place{context.Rip, context.Rsp} : Place{};
}

}  // namespace

// The system does not tell that a thread waits: one that stands still is taken for asleep.
bool IsAsleep(std::uint32_t id) {
    constexpr int Looks = 5;
    HANDLE thread = OpenThread(THREAD_SUSPEND_RESUME | THREAD_GET_CONTEXT | SYNCHRONIZE, FALSE, id);
    if (thread == nullptr) return false;
    const Place first = Look(thread);
    bool isStill = first.instruction != 0;
    for (int i = 0; isStill && i < Looks; ++i) {
        isStill = WaitForSingleObject(thread, 1) == WAIT_TIMEOUT && Look(thread) == first;
    }
    CloseHandle(thread);
    return isStill;
}

std::size_t CountThreads() {
    HANDLE snapshot = CreateToolhelp32Snapshot(TH32CS_SNAPTHREAD, 0);
    if (snapshot == INVALID_HANDLE_VALUE) return 0;
    THREADENTRY32 entry{};
    entry.dwSize = sizeof entry;
    std::size_t count = 0;
    for (BOOL isThere = Thread32First(snapshot, &entry); isThere;
         isThere = Thread32Next(snapshot, &entry)) {
        if (entry.th32OwnerProcessID == GetCurrentProcessId()) ++count;
    }
    CloseHandle(snapshot);
    return count;
}

}  // namespace ZV::Test
