#include <windows.h>

#include "hal/table_lock.h"

namespace ZV::Test {

TableLock::TableLock() {
    HANDLE mutex = CreateMutexA(nullptr, FALSE, "zentara-open-camera-table-of-the-tests");
    if (mutex != nullptr) (void)WaitForSingleObject(mutex, INFINITE);
    file = reinterpret_cast<std::intptr_t>(mutex);
}

TableLock::~TableLock() {
    auto* const mutex = reinterpret_cast<HANDLE>(file);
    if (mutex == nullptr) return;
    ReleaseMutex(mutex);
    CloseHandle(mutex);
}

}  // namespace ZV::Test
