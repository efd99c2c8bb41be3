#pragma once

#include <windows.h>

namespace ZV::Test {

/// Repeats `create`, which calls CreateProcess, while the system loses the process in its start, as
/// Wine does now and then.
template <typename Create>
[[nodiscard]] bool StartProcessDespiteLosses(Create create) {
    constexpr int Tries = 3;
    for (int i = 0; i < Tries; ++i) {
        if (create()) return true;
        if (GetLastError() != ERROR_INTERNAL_ERROR) return false;
    }
    return false;
}

}  // namespace ZV::Test
